// The platform handle on this machine: ordinary files, and loop devices attached to images made here,
// checked against dd, blockdev and sysfs; and the Linux listing over a recorded /sys/block of mapped,
// RAID and network block devices, read through a loop device standing in for each.
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/Linux/SysfsEnumerate.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/PlatformOps.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/common/TestRoot.h"
#include "tests/common/TestUtil.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <cstring>

namespace {

using namespace DeviceControl;

using TestUtil::LoopDevice;

// Makes the kernel's partitions of a loop device appear (partition scanning is not always done at
// attach time): partx adds what the table holds.
void ensurePartitions(const QString &device)
{
    const QString name = QFileInfo(device).fileName();
    if (!QDir("/sys/class/block/" + name).entryList({name + "p*"}, QDir::Dirs).isEmpty())
        return;
    TestUtil::run("partx", {"-a", device});
    TestUtil::run("udevadm", {"settle", "--timeout=10"});
}

QByteArray pattern(int size)
{
    QByteArray data(size, '\0');
    for (int i = 0; i < size; ++i)
        data[i] = char((i * 131 + i / 512) & 0xFF);
    return data;
}

TEST(PlatformLinuxFileTest, CreateWriteReadAppendResize)
{
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());
    TestRoot root;
    const QString path = dir.filePath("data.bin");
    CPlatformFile file(&root, path, PlatformKind::File);
    ASSERT_TRUE(file.Create());
    const QByteArray data = pattern(8192);
    ASSERT_TRUE(file.Write(0, 8192, data.constData()));
    QByteArray back(4096, '\0');
    ASSERT_TRUE(file.Read(2048, 4096, back.data()));
    EXPECT_EQ(back, data.mid(2048, 4096));
    ASSERT_TRUE(file.Write(CPlatformFile::CurrentPosition, 5, "tail!"));
    uint64_t size = 0;
    ASSERT_TRUE(file.GetSize(size));
    EXPECT_EQ(size, 8197u);
    ASSERT_TRUE(file.Read(100, 4, back.data()));
    ASSERT_TRUE(file.Read(CPlatformFile::CurrentPosition, 8, back.data()));
    EXPECT_EQ(back.left(8), data.mid(104, 8));

    // Reading past the end is a short transfer.
    EXPECT_FALSE(file.Read(8192, 512, back.data()));
    EXPECT_EQ(file.GetError(), SystemError::HandleEof);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::ReadFile));

    ASSERT_TRUE(file.Resize(1 << 20));
    ASSERT_TRUE(file.GetSize(size));
    EXPECT_EQ(size, uint64_t(1) << 20);
    ASSERT_TRUE(file.Resize(100));
    ASSERT_TRUE(file.Close(false));
    EXPECT_EQ(QFileInfo(path).size(), 100);
    EXPECT_EQ(TestUtil::readFile(path), data.left(100));

    ASSERT_TRUE(file.Reopen(true));
    EXPECT_TRUE(file.IsWritable());
    ASSERT_TRUE(file.Close(true));
    EXPECT_FALSE(QFileInfo::exists(path));
}

TEST(PlatformLinuxFileTest, MissingAndReadOnlyFiles)
{
    QTemporaryDir dir;
    TestRoot root;
    CPlatformFile missing(&root, dir.filePath("none"), PlatformKind::File);
    uint64_t size = 0;
    EXPECT_FALSE(missing.GetSize(size));
    EXPECT_EQ(missing.GetError(), SystemError::FileNotFound);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::CreateFileOpen));
    EXPECT_EQ(SystemErrorText(&root, root.platform[0].error), QString::fromLocal8Bit(strerror(ENOENT)));

    // A directory is no file.
    CPlatformFile folder(&root, dir.path(), PlatformKind::File);
    EXPECT_FALSE(folder.Reopen(false));
    EXPECT_EQ(folder.GetError(), SystemError::AccessDenied);

    if (geteuid() != 0) {
        const QString ro = dir.filePath("ro");
        ASSERT_TRUE(TestUtil::writeFile(ro, "abc"));
        QFile::setPermissions(ro, QFile::ReadOwner);
        CPlatformFile file(&root, ro, PlatformKind::File);
        ASSERT_TRUE(file.Reopen(true));
        EXPECT_FALSE(file.IsWritable());
        EXPECT_TRUE(file.Close());
    }
}

TEST(PlatformLinuxFileTest, TextFilesAndSystemVersion)
{
    QTemporaryDir dir;
    TestRoot root;
    const QString path = dir.filePath("t.txt");
    ASSERT_TRUE(WriteTextFile(&root, path, {"a", "b c"}));
    EXPECT_EQ(TestUtil::readFile(path), QByteArray("a\r\nb c\r\n"));
    EXPECT_EQ(ReadTextFile(&root, path), "a\r\nb c\r\n");
    EXPECT_TRUE(ReadTextFile(&root, dir.filePath("none")).isEmpty());
    ASSERT_TRUE(PlatformDeleteFile(&root, path));
    EXPECT_FALSE(QFileInfo::exists(path));

    const QString version = SystemVersionText(&root);
    EXPECT_FALSE(version.isEmpty());
    QFile osRelease("/etc/os-release");
    if (osRelease.open(QIODevice::ReadOnly)) {
        const QByteArray text = osRelease.readAll();
        const int at = text.indexOf("PRETTY_NAME=");
        if (at >= 0) {
            EXPECT_TRUE(text.mid(at).contains(version.toUtf8())) << version.toStdString();
        }
    }
}

TEST(PlatformLinuxFileTest, FreeSpaceOfAMountedDirectory)
{
    TestRoot root;
    CPlatformFile volume(&root, QDir::tempPath(), PlatformKind::Volume);
    uint64_t freeBytes = 0;
    ASSERT_TRUE(volume.GetFreeSpace(freeBytes));
    EXPECT_GT(freeBytes, 0u);
    const auto df = TestUtil::run("df", {"-B1", "--output=avail", QDir::tempPath()});
    if (df.exitCode == 0) {
        const uint64_t avail = df.out.split('\n').value(1).trimmed().toULongLong();
        // Other processes write meanwhile: the two answers agree within 64 MiB.
        EXPECT_LT(std::max(avail, freeBytes) - std::min(avail, freeBytes), uint64_t(64) << 20);
    }
}

class PlatformLoopTest : public ::testing::Test
{
protected:
    QTemporaryDir dir;
    QString image;
    QByteArray content;

    void SetUp() override
    {
        if (!TestUtil::canAttachLoop())
            GTEST_SKIP() << "loop devices cannot be attached (needs root and losetup)";
        image = dir.filePath("disk.img");
        content = pattern(8 << 20);
        ASSERT_TRUE(TestUtil::writeFile(image, content));
    }
};

TEST_F(PlatformLoopTest, DeviceReadsEqualDdAndGeometryEqualsBlockdev)
{
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    TestRoot root;
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    QByteArray buffer(4096, '\0');
    ASSERT_TRUE(disk.Read(3 * 512, 4096, buffer.data()));
    const auto dd =
        TestUtil::run("dd", {"if=" + loop.Device(), "bs=512", "skip=3", "count=8", "status=none"});
    ASSERT_EQ(dd.exitCode, 0);
    EXPECT_EQ(buffer, dd.out);
    EXPECT_EQ(buffer, content.mid(1536, 4096));
    EXPECT_TRUE(disk.IsWritable());

    DISK_GEOMETRY g{};
    uint32_t returned = 0;
    ASSERT_TRUE(disk.DIOC(IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, &g, sizeof g, &returned));
    EXPECT_EQ(returned, 24u);
    const auto ssz = TestUtil::run("blockdev", {"--getss", loop.Device()});
    EXPECT_EQ(g.BytesPerSector, ssz.out.trimmed().toUInt());
    EXPECT_EQ(g.MediaType, FixedMedia);
    EXPECT_EQ(uint64_t(g.Cylinders) * g.TracksPerCylinder * g.SectorsPerTrack * g.BytesPerSector,
              (uint64_t(8 << 20) / (255 * 63 * 512)) * 255 * 63 * 512);

    DISK_GEOMETRY_EX gx{};
    ASSERT_TRUE(disk.DIOC(IOCTL_DISK_GET_DRIVE_GEOMETRY_EX, nullptr, 0, &gx, sizeof gx, &returned));
    const auto size = TestUtil::run("blockdev", {"--getsize64", loop.Device()});
    EXPECT_EQ(uint64_t(gx.DiskSize), size.out.trimmed().toULongLong());
    EXPECT_FALSE(disk.DIOC(IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, &g, 10, &returned));
    EXPECT_EQ(disk.GetError(), SystemError::InsufficientBuffer);

    STORAGE_PROPERTY_QUERY query{};
    query.PropertyId = StorageAccessAlignmentProperty;
    STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR alignment{};
    ASSERT_TRUE(disk.DIOC(IOCTL_STORAGE_QUERY_PROPERTY, &query, sizeof query, &alignment, sizeof alignment,
                          &returned));
    EXPECT_EQ(returned, 28u);
    const auto pbsz = TestUtil::run("blockdev", {"--getpbsz", loop.Device()});
    EXPECT_EQ(alignment.BytesPerPhysicalSector, pbsz.out.trimmed().toUInt());
    EXPECT_EQ(alignment.BytesPerLogicalSector, g.BytesPerSector);

    query.PropertyId = StorageDeviceProperty;
    QByteArray descriptor(512, '\0');
    ASSERT_TRUE(
        disk.DIOC(IOCTL_STORAGE_QUERY_PROPERTY, &query, sizeof query, descriptor.data(), 512, &returned));
    EXPECT_GE(returned, 40u);
    STORAGE_DEVICE_DESCRIPTOR d{};
    std::memcpy(&d, descriptor.constData(), sizeof d);
    EXPECT_EQ(d.Size, returned);
    EXPECT_EQ(d.BusType, BusTypeFileBackedVirtual);

    // Writes go to the image.
    const QByteArray sector(512, char(0x5A));
    ASSERT_TRUE(disk.Write(512 * 100, 512, sector.constData()));
    EXPECT_TRUE(disk.Close());
    TestUtil::run("sync", {});
    QFile f(image);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    f.seek(512 * 100);
    EXPECT_EQ(f.read(512), sector);
}

TEST_F(PlatformLoopTest, ReadOnlyLoopIsNotWritable)
{
    LoopDevice loop(image, {"-r"});
    ASSERT_FALSE(loop.Device().isEmpty());
    TestRoot root;
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    ASSERT_TRUE(disk.Reopen(true));
    EXPECT_FALSE(disk.IsWritable());
    QByteArray buffer(512, '\0');
    EXPECT_TRUE(disk.Read(0, 512, buffer.data()));
    EXPECT_EQ(buffer, content.left(512));
    EXPECT_TRUE(disk.Close());

    // Asking the device itself: the query answers "write protected".
    CPlatformFile again(&root, loop.Device(), PlatformKind::Device);
    EXPECT_FALSE(again.DIOC(IOCTL_DISK_IS_WRITABLE, nullptr, 0, nullptr, 0));
    EXPECT_EQ(again.GetError(), SystemError::WriteProtect);
    EXPECT_TRUE(again.Close());
}

TEST_F(PlatformLoopTest, LayoutOfPartitionedLoopEqualsSysfs)
{
    if (!TestUtil::haveTool("sfdisk"))
        GTEST_SKIP() << "sfdisk is missing";
    // Two primaries, an extended partition and two logical ones.
    const QString script = "label: dos\nlabel-id: 0x1234abcd\n"
                           "start=2048, size=2048, type=83\n"
                           "start=4096, size=2048, type=7, bootable\n"
                           "start=6144, size=10240, type=5\n"
                           "start=8192, size=2048, type=83\n"
                           "start=12288, size=2048, type=c\n";
    const QString scriptPath = dir.filePath("layout.sfdisk");
    ASSERT_TRUE(TestUtil::writeFile(scriptPath, script.toUtf8()));
    const auto r = TestUtil::run("sh", {"-c", "sfdisk -q '" + image + "' < '" + scriptPath + "'"});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();

    LoopDevice loop(image, {"-P"});
    ASSERT_FALSE(loop.Device().isEmpty());
    ensurePartitions(loop.Device());
    const QString name = QFileInfo(loop.Device()).fileName();

    // The kernel's partitions, from sysfs, in number order; the extended container is no partition here.
    QMap<int, uint64_t> sysfs;
    for (const QString &entry :
         QDir("/sys/class/block/" + name).entryList(QDir::Dirs | QDir::NoDotAndDotDot)) {
        const QString base = "/sys/class/block/" + name + "/" + entry;
        const QByteArray number = TestUtil::readFile(base + "/partition").trimmed();
        if (number.isEmpty())
            continue;
        const uint64_t size = TestUtil::readFile(base + "/size").trimmed().toULongLong();
        if (number.toInt() == 3) {
            EXPECT_EQ(size, 2u); // the kernel shows the container as a two-sector partition
            continue;
        }
        sysfs[number.toInt()] = TestUtil::readFile(base + "/start").trimmed().toULongLong() * 512;
    }
    ASSERT_EQ(sysfs.size(), 4);

    TestRoot root;
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    QList<uint64_t> offsets;
    ASSERT_TRUE(disk.GetLayoutInfo(offsets));
    EXPECT_EQ(offsets, QList<uint64_t>(sysfs.begin(), sysfs.end()));
    EXPECT_EQ(offsets, (QList<uint64_t>{2048 * 512, 4096 * 512, 8192 * 512, 12288 * 512}));
    EXPECT_TRUE(root.platform.isEmpty());

    // The full answer carries the table's details.
    QByteArray layout(48 + 5 * 144, '\0');
    uint32_t returned = 0;
    ASSERT_TRUE(
        disk.DIOC(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, nullptr, 0, layout.data(), layout.size(), &returned));
    ASSERT_EQ(returned, 48u + 5 * 144);
    DRIVE_LAYOUT_INFORMATION_EX header{};
    std::memcpy(&header, layout.constData(), sizeof header);
    EXPECT_EQ(header.PartitionStyle, PARTITION_STYLE_MBR);
    EXPECT_EQ(header.PartitionCount, 5u);
    EXPECT_EQ(header.Mbr.Signature, 0x1234abcdu);
    PARTITION_INFORMATION_EX second{}, container{};
    std::memcpy(&second, layout.constData() + 48 + 144, sizeof second);
    std::memcpy(&container, layout.constData() + 48 + 2 * 144, sizeof container);
    EXPECT_EQ(second.PartitionNumber, 2u);
    EXPECT_EQ(second.Mbr.PartitionType, 7);
    EXPECT_EQ(second.Mbr.BootIndicator, 1);
    EXPECT_EQ(container.PartitionNumber, 0u);
    EXPECT_EQ(container.Mbr.PartitionType, 5);
    EXPECT_EQ(uint64_t(container.PartitionLength), 10240u * 512);
    EXPECT_FALSE(
        disk.DIOC(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, nullptr, 0, layout.data(), 48 + 4 * 144, &returned));
    EXPECT_EQ(disk.GetError(), SystemError::InsufficientBuffer);

    PARTITION_INFORMATION_EX whole{};
    ASSERT_TRUE(disk.DIOC(IOCTL_DISK_GET_PARTITION_INFO_EX, nullptr, 0, &whole, sizeof whole, &returned));
    EXPECT_EQ(whole.PartitionStyle, PARTITION_STYLE_MBR);
    EXPECT_EQ(uint64_t(whole.PartitionLength), uint64_t(content.size()));
    EXPECT_TRUE(disk.Close());

    // A partition answers for itself.
    CPlatformFile part(&root, loop.Device() + "p5", PlatformKind::Volume);
    PARTITION_INFORMATION_EX info{};
    ASSERT_TRUE(part.DIOC(IOCTL_DISK_GET_PARTITION_INFO_EX, nullptr, 0, &info, sizeof info, &returned));
    EXPECT_EQ(info.PartitionNumber, 5u); // the first logical partition
    EXPECT_EQ(uint64_t(info.StartingOffset), sysfs[5]);
    EXPECT_EQ(uint64_t(info.PartitionLength), 2048u * 512);
    EXPECT_EQ(info.Mbr.PartitionType, 0x83);
    QByteArray buffer(512, '\0');
    ASSERT_TRUE(part.Read(0, 512, buffer.data()));
    EXPECT_EQ(buffer, content.mid(8192 * 512, 512));
    EXPECT_TRUE(part.Close());
}

TEST_F(PlatformLoopTest, GptLayoutCarriesTypesAndNames)
{
    if (!TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "sgdisk is missing";
    const auto r = TestUtil::run("sgdisk", {"-n", "1:2048:+1M", "-t", "1:8300", "-c", "1:alpha", "-n",
                                            "2:6144:+1M", "-t", "2:0700", "-c", "2:beta", image});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();
    LoopDevice loop(image, {"-P"});
    ASSERT_FALSE(loop.Device().isEmpty());
    ensurePartitions(loop.Device());
    TestRoot root;
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    QList<uint64_t> offsets;
    ASSERT_TRUE(disk.GetLayoutInfo(offsets));
    EXPECT_EQ(offsets, (QList<uint64_t>{2048 * 512, 6144 * 512}));
    QByteArray layout(48 + 2 * 144, '\0');
    uint32_t returned = 0;
    ASSERT_TRUE(
        disk.DIOC(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, nullptr, 0, layout.data(), layout.size(), &returned));
    DRIVE_LAYOUT_INFORMATION_EX header{};
    std::memcpy(&header, layout.constData(), sizeof header);
    EXPECT_EQ(header.PartitionStyle, PARTITION_STYLE_GPT);
    PARTITION_INFORMATION_EX first{};
    std::memcpy(&first, layout.constData() + 48, sizeof first);
    EXPECT_EQ(QString::fromUtf16(first.Gpt.Name), "alpha");
    // Linux file system data: 0FC63DAF-8483-4772-8E79-3D69D8477DE4, stored mixed-endian.
    EXPECT_EQ(first.Gpt.PartitionType.data1, 0x0FC63DAFu);
    EXPECT_EQ(first.Gpt.PartitionType.data2, 0x8483);
    EXPECT_EQ(first.Gpt.PartitionType.data4[0], 0x8E);
    EXPECT_TRUE(disk.Close());
}

TEST_F(PlatformLoopTest, LockIsAnExclusiveOpenAndDismountIsNotSupported)
{
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    TestRoot root;
    CPlatformFile volume(&root, loop.Device(), PlatformKind::Volume);
    ASSERT_TRUE(volume.Lock());
    // A second exclusive opener is refused while the lock is held.
    CPlatformFile other(&root, loop.Device(), PlatformKind::Volume);
    EXPECT_FALSE(other.Lock());
    EXPECT_EQ(other.GetError(), SystemError::AccessDenied);
    EXPECT_TRUE(other.Close());
    EXPECT_FALSE(volume.Dismount(false));
    EXPECT_EQ(volume.GetError(), SystemError::NotSupported);
    ASSERT_TRUE(volume.Unlock());
    ASSERT_TRUE(other.Lock());
    ASSERT_TRUE(other.Unlock());
}

TEST_F(PlatformLoopTest, AtaPassThroughOnLoopFailsQuietly)
{
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    TestRoot root;
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    QByteArray request(48 + 512, '\0');
    ATA_PASS_THROUGH_EX header{};
    header.Length = 48;
    header.AtaFlags = ATA_FLAGS_DATA_IN | ATA_FLAGS_DRDY_REQUIRED;
    header.DataTransferLength = 512;
    header.TimeOutValue = 15;
    header.DataBufferOffset = 48;
    header.CurrentTaskFile[1] = 1;
    header.CurrentTaskFile[5] = 0x40;
    header.CurrentTaskFile[6] = 0xEC; // IDENTIFY DEVICE
    std::memcpy(request.data(), &header, sizeof header);
    QByteArray answer(request.size(), '\0');
    uint32_t returned = 7;
    EXPECT_FALSE(disk.DIOC(IOCTL_ATA_PASS_THROUGH, request.constData(), request.size(), answer.data(),
                           answer.size(), &returned));
    EXPECT_EQ(returned, 0u);
    EXPECT_NE(disk.GetError(), 0u);
    EXPECT_FALSE(disk.IsLost());
    EXPECT_TRUE(root.platform.isEmpty());
    EXPECT_TRUE(root.internal.isEmpty());

    // The SMART interface and the SCSI pass-through fail the same way.
    GETVERSIONINPARAMS version{};
    EXPECT_FALSE(disk.DIOC(SMART_GET_VERSION, nullptr, 0, &version, sizeof version, &returned));
    SENDCMDINPARAMS smart{};
    smart.irDriveRegs.bCommandReg = 0xEC;
    QByteArray smartAnswer(16 + 512, '\0');
    EXPECT_FALSE(disk.DIOC(SMART_RCV_DRIVE_DATA, &smart, sizeof smart, smartAnswer.data(), smartAnswer.size(),
                           &returned));
    QByteArray scsi(56 + 32 + 512, '\0');
    SCSI_PASS_THROUGH spt{};
    spt.Length = 56;
    spt.CdbLength = 6;
    spt.SenseInfoLength = 32;
    spt.DataIn = SCSI_IOCTL_DATA_IN;
    spt.DataTransferLength = 96;
    spt.TimeOutValue = 5;
    spt.SenseInfoOffset = 56;
    spt.DataBufferOffset = 88;
    spt.Cdb[0] = 0x12; // INQUIRY
    spt.Cdb[4] = 96;
    std::memcpy(scsi.data(), &spt, sizeof spt);
    EXPECT_FALSE(disk.DIOC(IOCTL_SCSI_PASS_THROUGH, scsi.constData(), scsi.size(), scsi.data(), scsi.size(),
                           &returned));
    EXPECT_FALSE(disk.IsLost());
    EXPECT_TRUE(root.platform.isEmpty());

    // A malformed request never reaches the device.
    header.DataBufferOffset = 4000;
    std::memcpy(request.data(), &header, sizeof header);
    EXPECT_FALSE(disk.DIOC(IOCTL_ATA_PASS_THROUGH, request.constData(), request.size(), answer.data(),
                           answer.size(), &returned));
    EXPECT_EQ(disk.GetError(), SystemError::InvalidParameter);
    EXPECT_TRUE(disk.Close());
}

TEST(PlatformLinuxFileTest, FileHandlesAnswerNoDeviceControls)
{
    QTemporaryDir dir;
    const QString path = dir.filePath("x");
    ASSERT_TRUE(TestUtil::writeFile(path, QByteArray(4096, 'x')));
    TestRoot root;
    // A file opened as a device (an image given as a device path) answers like a device without controls.
    CPlatformFile disk(&root, path, PlatformKind::Device);
    DISK_GEOMETRY g{};
    EXPECT_FALSE(disk.DIOC(IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, &g, sizeof g));
    EXPECT_EQ(disk.GetError(), SystemError::InvalidFunction);
    EXPECT_TRUE(disk.IsWritable()); // the query is not supported: writable
    QList<uint64_t> offsets;
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    EXPECT_TRUE(disk.Close());
}

// One block device of a recorded /sys/block and how the listing is to show it. Lists of names are
// separated by blanks.
struct StackRow
{
    QString name;   // kernel name
    QString dmName; // dm/name (device mapper only)
    QString dmUuid; // dm/uuid (device mapper only)
    QString level;  // md/level (software RAID only)
    quint64 sectors = 0;
    quint32 sectorSize = 512;
    QString slaves, holders; // kernel names
    // Expected: the path below the /dev folder (empty: not listed), kind, detail, number, and the
    // members and holders below the /dev folder.
    QString path;
    BackingKind kind = BackingKind::None;
    QString detail;
    int number = -1;
    QString members, above;
};

// A root on LVM inside LUKS, a multipath disk, a plain mapping and one with nothing mapped, a mirror, a
// connected and an idle network block device, one path of the multipath disk and a loop device without
// an image.
QList<StackRow> StackRows()
{
    using K = BackingKind;
    const QString lvm = "LVM-Yx3nQ8cW0x3nQ8cWqP1kM2nB3vC4xZ5aS6dF7gH8jK9lL0Yx3nQ8cW0x3nQ8cW";
    const QString luks = "CRYPT-LUKS2-3f2a8c1d4e5b46a7b8c9d0e1f2a3b4c5-luks-3f2a";
    const QString mpath = "mpath-3600a0b800012345600000000deadbeef";
    return {
        {"dm-0", "vg-root", lvm, "", 16384, 512, "sda2", "dm-1", "mapper/vg-root", K::LogicalVolume, "",
         0x4000, "sda2", "mapper/luks-3f2a"},
        {"dm-1", "luks-3f2a", luks, "", 16000, 4096, "dm-0", "", "mapper/luks-3f2a", K::EncryptedVolume,
         "LUKS2", 0x4001, "mapper/vg-root", ""},
        {"dm-2", "mpatha", mpath, "", 8192, 512, "sdc sdb", "", "mapper/mpatha", K::Multipath, "", 0x4002,
         "sdb sdc", ""},
        {"dm-3", "scratch", "", "", 4096, 512, "sdd3", "", "mapper/scratch", K::DeviceMapper, "", 0x4003,
         "sdd3", ""},
        {"dm-4", "vg-empty", "LVM-unmapped", "", 0, 512, "", "", "", K::None, "", -1, "", ""},
        {"md0", "", "", "raid1", 20480, 512, "sde1 sdd1", "", "md0", K::SoftwareRaid, "raid1", 0x8000,
         "sdd1 sde1", ""},
        {"nbd0", "", "", "", 8192, 512, "", "", "nbd0", K::NetworkBlock, "", 0xC000, "", ""},
        {"nbd1", "", "", "", 0, 512, "", "", "", K::None, "", -1, "", ""},
        {"sdb", "", "", "", 8192, 512, "", "dm-2", "sdb", K::None, "", 0, "", "mapper/mpatha"},
        {"loop0", "", "", "", 0, 512, "", "", "", K::None, "", -1, "", ""},
    };
}

// Lays the rows out as /sys/block does: attribute files and the slaves and holders links.
void MakeSysBlock(const QString &root, const QList<StackRow> &rows)
{
    QDir dir;
    auto put = [](const QString &path, const QString &text) {
        QDir().mkpath(QFileInfo(path).path());
        ASSERT_TRUE(TestUtil::writeFile(path, (text + "\n").toUtf8()));
    };
    for (const StackRow &r : rows) {
        const QString base = root + "/" + r.name;
        put(base + "/size", QString::number(r.sectors));
        put(base + "/queue/logical_block_size", QString::number(r.sectorSize));
        put(base + "/queue/physical_block_size", QString::number(r.sectorSize));
        if (!r.dmName.isEmpty()) {
            put(base + "/dm/name", r.dmName);
            put(base + "/dm/uuid", r.dmUuid);
        }
        if (!r.level.isEmpty())
            put(base + "/md/level", r.level);
        ASSERT_TRUE(dir.mkpath(base + "/slaves"));
        ASSERT_TRUE(dir.mkpath(base + "/holders"));
        // Links point where the kernel's point; partitions of disks that are not recorded dangle.
        for (const QString &s : r.slaves.split(' ', Qt::SkipEmptyParts))
            ASSERT_TRUE(QFile::link("../../" + s, base + "/slaves/" + s));
        for (const QString &h : r.holders.split(' ', Qt::SkipEmptyParts))
            ASSERT_TRUE(QFile::link("../../" + h, base + "/holders/" + h));
    }
}

QStringList Below(const QString &devRoot, const QString &names)
{
    QStringList out;
    for (const QString &n : names.split(' ', Qt::SkipEmptyParts))
        out << devRoot + "/" + n;
    return out;
}

// Listed from the recorded tree; then, where loop devices can be attached, each device's node stands in
// by one loop device over an ext4 image, and the devices are identified and read through the kernel.
TEST(PlatformLinuxListing, MappedRaidAndNetworkDevicesAreVolumeBacked)
{
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());
    const QString sysBlock = dir.filePath("sys/block"), devRoot = dir.filePath("dev");
    const QList<StackRow> rows = StackRows();
    MakeSysBlock(sysBlock, rows);
    CSysfsEnumerationSource source(sysBlock, devRoot);
    const QList<EnumCandidate> candidates = source.Candidates();
    for (const StackRow &r : rows) {
        SCOPED_TRACE(r.name.toStdString());
        const EnumCandidate *c = nullptr;
        for (const EnumCandidate &each : candidates)
            c = each.kernelName == r.name ? &each : c;
        if (r.path.isEmpty()) {
            EXPECT_EQ(c, nullptr);
            continue;
        }
        ASSERT_NE(c, nullptr);
        EXPECT_EQ(c->path, devRoot + "/" + r.path);
        EXPECT_EQ(c->number, r.number);
        EXPECT_EQ(c->stack.kind, r.kind);
        EXPECT_EQ(c->stack.detail, r.detail);
        EXPECT_EQ(c->stack.mappedName, r.dmName);
        EXPECT_EQ(c->stack.members, Below(devRoot, r.members));
        EXPECT_EQ(c->stack.holders, Below(devRoot, r.above));
        EXPECT_EQ(c->sizeBytes, r.sectors * 512);
        EXPECT_EQ(c->logicalSectorSize, r.sectorSize);
        const bool stacked = r.kind != BackingKind::None;
        EXPECT_EQ(c->source, stacked ? EnumSource::VolumeBacked : EnumSource::PhysicalDrive);
        // What other programs assemble over the user's data is only opened for reading.
        EXPECT_EQ(c->readOnly, stacked);
        EnumCandidate resolved;
        ASSERT_TRUE(source.Resolve(devRoot + "/" + r.path, resolved));
        EXPECT_EQ(resolved.kernelName, r.name);
    }

    if (!TestUtil::canAttachLoop() || !TestUtil::haveTool("mke2fs"))
        GTEST_SKIP() << "reading the devices needs root, losetup and mke2fs";
    const QString image = dir.filePath("lv.img");
    const auto mk = TestUtil::run("mke2fs", {"-q", "-F", "-t", "ext4", "-L", "MAPPED", image, "8M"});
    ASSERT_EQ(mk.exitCode, 0) << mk.err.toStdString();
    TestUtil::LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    ASSERT_TRUE(QDir().mkpath(devRoot + "/mapper"));
    for (const StackRow &r : rows) {
        if (r.kind != BackingKind::None) {
            ASSERT_TRUE(QFile::link(loop.Device(), devRoot + "/" + r.path));
        }
    }
    CRoot root(nullptr, &source);
    ASSERT_TRUE(root.RefreshAndWait());
    const QByteArray head = TestUtil::readFile(image).left(4096);
    for (const StackRow &r : rows) {
        SCOPED_TRACE(r.name.toStdString());
        CDevice *d = root.FindDeviceByPath(devRoot + "/" + r.path);
        // The disk whose node is not there is not listed.
        if (r.kind == BackingKind::None) {
            EXPECT_EQ(d, nullptr);
            continue;
        }
        ASSERT_NE(d, nullptr);
        ASSERT_TRUE(d->IsReady());
        QByteArray buffer(4096, '\0');
        uint32_t error = 0;
        ASSERT_TRUE(d->ReadBytes(0, 4096, buffer.data(), error)) << error;
        EXPECT_EQ(buffer, head);
        const DeviceInfo &info = d->GetDescriptor();
        EXPECT_EQ(info.stack.kind, r.kind);
        // The file system on the whole device is its one volume.
        ASSERT_EQ(info.volumes.size(), 1);
        EXPECT_EQ(info.volumes[0].path, devRoot + "/" + r.path);
        EXPECT_EQ(info.volumes[0].label, "MAPPED");
        EXPECT_EQ(d->GetPartStyle(), PartStyle::DeviceAsVolume);
    }
}

} // namespace
