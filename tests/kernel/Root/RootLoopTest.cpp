// Enumeration of this machine: loop devices attached to images made here appear with the sizes and
// sector sizes blockdev reports, and their partitions as volumes.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/Linux/SysfsEnumerate.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/common/TestUtil.h"

#include <QFileInfo>
#include <QProcess>
#include <QTemporaryDir>

namespace {

quint64 Blockdev(const QString &option, const QString &device)
{
    TestUtil::ToolResult r = TestUtil::run("blockdev", {option, device});
    return r.exitCode == 0 ? QString::fromUtf8(r.out).trimmed().toULongLong() : 0;
}

bool MakeImage(const QString &path, qint64 bytes)
{
    return TestUtil::run("truncate", {"-s", QString::number(bytes), path}).exitCode == 0;
}

} // namespace

TEST(RootLoop, LoopDevicesAppearWithBlockdevSizes)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("blockdev"))
        GTEST_SKIP() << "sfdisk and blockdev are needed";
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());

    // A 32 MiB disk with an MBR of two partitions, attached with partition scanning.
    const QString mbrImage = dir.filePath("mbr.img");
    ASSERT_TRUE(MakeImage(mbrImage, 32 << 20));
    {
        QProcess p;
        p.start("sfdisk", {"--no-reread", "--no-tell-kernel", "-q", mbrImage});
        ASSERT_TRUE(p.waitForStarted());
        p.write("label: dos\nstart=2048, size=20480, type=83\nstart=22528, size=20480, type=c\n");
        p.closeWriteChannel();
        ASSERT_TRUE(p.waitForFinished());
        ASSERT_EQ(p.exitCode(), 0) << p.readAllStandardError().toStdString();
    }
    TestUtil::LoopDevice mbr(mbrImage, {"-P"});
    ASSERT_FALSE(mbr.Device().isEmpty()) << mbr.Error().toStdString();
    // Some kernels leave the partition scan of a new loop device to user space.
    const QString firstPartition = "/sys/class/block/" + mbr.Device().mid(5) + "p1";
    if (!QFileInfo::exists(firstPartition) && TestUtil::haveTool("partx"))
        TestUtil::run("partx", {"-a", mbr.Device()});
    ASSERT_TRUE(QFileInfo::exists(firstPartition)) << "the partitions of the loop device did not appear";

    // A 16 MiB disk of 4096-byte sectors.
    const QString bigImage = dir.filePath("4k.img");
    ASSERT_TRUE(MakeImage(bigImage, 16 << 20));
    TestUtil::LoopDevice big(bigImage, {"-b", "4096"});
    ASSERT_FALSE(big.Device().isEmpty()) << big.Error().toStdString();

    CRoot root;
    QStringList internal;
    QObject::connect(&root, &cRoot::kernelInternal, [&](const _event_internal &e) { internal << e.text; });
    ASSERT_TRUE(root.RefreshAndWait());

    for (const TestUtil::LoopDevice *loop : {&mbr, &big}) {
        SCOPED_TRACE(loop->Device().toStdString());
        CDevice *d = root.FindDeviceByPath(loop->Device());
        ASSERT_NE(d, nullptr) << "internal messages: " << internal.join("; ").toStdString();
        EXPECT_TRUE(d->IsReady());
        EXPECT_EQ(d->GetSize(), Blockdev("--getsize64", loop->Device()));
        EXPECT_EQ(d->GetBytesPerSector(), Blockdev("--getss", loop->Device()));
        EXPECT_EQ(d->GetPhysicalBytesPerSector(), Blockdev("--getpbsz", loop->Device()));
        const DeviceInfo &info = d->GetDescriptor();
        EXPECT_EQ(info.source, EnumSource::VolumeBacked);
        EXPECT_EQ(QStringLiteral("/dev/loop%1").arg(info.number), loop->Device());
        EXPECT_TRUE(DeviceAttributeNames(d->GetAttributes()).contains("Virtual"));
    }
    CDevice *m = root.FindDeviceByPath(mbr.Device());
    CDevice *b = root.FindDeviceByPath(big.Device());
    ASSERT_TRUE(m && b);
    EXPECT_EQ(b->GetBytesPerSector(), 4096u);
    EXPECT_EQ(m->GetDescriptor().backingFile, mbrImage);
    EXPECT_EQ(m->GetPartStyle(), PartStyle::Mbr);
    // The two partitions are the volumes of the disk, at the offsets of the table.
    const QList<VolumeInfo> &volumes = m->GetDescriptor().volumes;
    ASSERT_EQ(volumes.size(), 2);
    EXPECT_EQ(volumes[0].path, mbr.Device() + "p1");
    ASSERT_EQ(volumes[0].extents.size(), 1);
    EXPECT_EQ(volumes[0].extents[0].offset, 2048u * 512);
    EXPECT_EQ(volumes[0].extents[0].length, 20480u * 512);
    EXPECT_EQ(volumes[1].extents[0].offset, 22528u * 512);
    // An empty disk has no table.
    EXPECT_EQ(b->GetPartStyle(), PartStyle::Raw);

    // Detached: the next refresh removes the device (another test may already reuse its number, so
    // it is looked for by its image).
    big.detach();
    ASSERT_TRUE(root.RefreshAndWait());
    bool stillThere = false;
    for (CDevice *d : root.Devices())
        stillThere = stillThere || d->GetDescriptor().backingFile == bigImage;
    EXPECT_FALSE(stillThere);
    EXPECT_NE(root.FindDeviceByPath(mbr.Device()), nullptr);
}

TEST(RootLoop, FileSystemOnTheWholeDeviceIsItsVolume)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    if (!TestUtil::haveTool("mke2fs"))
        GTEST_SKIP() << "mke2fs is needed";
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());
    const QString image = dir.filePath("ext4.img");
    const QString uuid = "0b8c7f62-5d1e-4a3b-9c2d-8e7f6a5b4c3d";
    TestUtil::ToolResult mk =
        TestUtil::run("mke2fs", {"-q", "-F", "-t", "ext4", "-L", "BRINDLE_T", "-U", uuid, image, "8M"});
    ASSERT_EQ(mk.exitCode, 0) << mk.err.toStdString();
    TestUtil::LoopDevice loop(image, {});
    ASSERT_FALSE(loop.Device().isEmpty()) << loop.Error().toStdString();

    CRoot root;
    ASSERT_TRUE(root.RefreshAndWait());
    CDevice *d = root.FindDeviceByPath(loop.Device());
    ASSERT_NE(d, nullptr);
    const QList<VolumeInfo> &volumes = d->GetDescriptor().volumes;
    ASSERT_EQ(volumes.size(), 1);
    const VolumeInfo &v = volumes.first();
    EXPECT_EQ(v.path, loop.Device());
    EXPECT_EQ(v.label, "BRINDLE_T");
    EXPECT_EQ(v.serial, uuid);
    EXPECT_EQ(v.fileSystem, FileSystemKind::Ext4);
    EXPECT_EQ(v.partitionNumber, 0u);
    ASSERT_EQ(v.extents.size(), 1);
    EXPECT_EQ(v.extents[0].offset, 0u);
    EXPECT_EQ(v.extents[0].length, d->GetSize());
    EXPECT_EQ(d->GetPartStyle(), PartStyle::DeviceAsVolume);
}

TEST(RootLoop, PlatformListingNamesAndNumbers)
{
    using namespace Sysfs;
    EXPECT_EQ(Classify("sda"), Kind::Physical);
    EXPECT_EQ(Classify("nvme0n1"), Kind::Physical);
    EXPECT_EQ(Classify("mmcblk0"), Kind::Physical);
    EXPECT_EQ(Classify("vda"), Kind::Physical);
    EXPECT_EQ(Classify("xvdb"), Kind::Physical);
    EXPECT_EQ(Classify("sr0"), Kind::Optical);
    EXPECT_EQ(Classify("fd0"), Kind::Floppy);
    EXPECT_EQ(Classify("loop7"), Kind::Loop);
    EXPECT_EQ(Classify("zram0"), Kind::Skip);
    EXPECT_EQ(Classify("ram0"), Kind::Skip);
    EXPECT_EQ(Classify("dm-0"), Kind::DeviceMapper);
    EXPECT_EQ(Classify("md127"), Kind::SoftwareRaid);
    EXPECT_EQ(Classify("nbd15"), Kind::NetworkBlock);
    EXPECT_EQ(Classify("md_d0"), Kind::Skip);
    EXPECT_EQ(Classify("dm-"), Kind::Skip);
    // Each kind of volume-backed device numbers in its own range; loop devices keep theirs.
    EXPECT_EQ(VolumeBackedNumber(Kind::Loop, 3), 3);
    EXPECT_EQ(VolumeBackedNumber(Kind::NetworkBlock, 0x3FFF), 0xFFFF);
    EXPECT_EQ(VolumeBackedNumber(Kind::NetworkBlock, 0x4000), -1);
    EXPECT_EQ(TrailingNumber("loop12"), 12);
    EXPECT_EQ(TrailingNumber("sda"), -1);
    EXPECT_LT(NaturalKey("sdz"), NaturalKey("sdaa"));
    EXPECT_LT(NaturalKey("nvme2n1"), NaturalKey("nvme10n1"));

    QList<MountEntry> m = ParseMountInfo("27 1 254:0 / / rw,relatime - ext4 /dev/vda rw\n"
                                         "40 27 7:3 / /mnt/my\\040disk rw shared:5 - vfat /dev/loop3p1 rw\n"
                                         "broken line\n"
                                         "41 27 x:y / /mnt rw - ext4 /dev/sdb rw\n");
    ASSERT_EQ(m.size(), 2);
    EXPECT_EQ(m[0].major, 254u);
    EXPECT_EQ(m[0].mountPoint, "/");
    EXPECT_EQ(m[1].minor, 3u);
    EXPECT_EQ(m[1].mountPoint, "/mnt/my disk");
    EXPECT_EQ(m[1].fsType, "vfat");
    EXPECT_EQ(FileSystemKindFromName(m[1].fsType), FileSystemKind::Fat);
}
