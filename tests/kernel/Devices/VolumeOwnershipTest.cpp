// Volumes made with their device: every partition owns its volume (a BSD container's slices
// included), a device without partitions owns one over all of it, the root announces them after the
// device and withdraws them before it, and building them reads only.
#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QElapsedTimer>
#include <QFile>
#include <QProcess>
#include <QTemporaryDir>
#include <QThread>

#include <memory>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/VolumeCreate.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/common/RootTestSupport.h"
#include "tests/common/TestUtil.h"
#include "tests/kernel/FS/VolumeTestImages.h"

namespace {

constexpr qint64 Mib = 1 << 20;

bool Sfdisk(const QString &image, const QByteArray &script)
{
    QProcess p;
    p.start("sfdisk", {"-q", image});
    if (!p.waitForStarted())
        return false;
    p.write(script);
    p.closeWriteChannel();
    return p.waitForFinished() && p.exitCode() == 0;
}

// A 48 MiB disk: FAT16 "OWNFAT" at 2048, ext4 "OWNEXT" at 36864, a 16-sector partition, and an
// extended partition holding one empty logical partition.
QByteArray FourPartitionDisk(QString &why)
{
    for (const char *t : {"sfdisk", "mkfs.vfat", "mke2fs"})
        if (!TestUtil::haveTool(t)) {
            why = QStringLiteral("%1 is needed").arg(t);
            return {};
        }
    static QTemporaryDir dir;
    const QString disk = dir.filePath("four.img"), fat = dir.filePath("fat.img");
    QFile f(disk), ff(fat);
    if (!f.open(QIODevice::WriteOnly) || !f.resize(48 * Mib) || !ff.open(QIODevice::WriteOnly) ||
        !ff.resize(32768 * 512))
        return {};
    f.close();
    ff.close();
    if (!Sfdisk(disk, "label: dos\nstart=2048,size=32768,type=6\nstart=36864,size=40960,type=83\n"
                      "start=80000,size=16,type=83\nstart=81920,size=8192,type=5\nstart=83968,size=4096,"
                      "type=7\n") ||
        TestUtil::run("mkfs.vfat", {"-F", "16", "-n", "OWNFAT", "-i", "0BADF00D", fat}).exitCode != 0 ||
        TestUtil::run("mke2fs", {"-q", "-F", "-t", "ext4", "-L", "OWNEXT", "-E",
                                 QStringLiteral("offset=%1").arg(36864ll * 512), disk, "20480"})
                .exitCode != 0)
        return {};
    QFile in(fat), out(disk);
    if (!in.open(QIODevice::ReadOnly) || !out.open(QIODevice::ReadOnly))
        return {};
    QByteArray bytes = out.readAll();
    bytes.replace(2048 * 512, 32768 * 512, in.readAll());
    return bytes;
}

struct Recorded
{
    bool volume; // kernelVolume, else kernelStorage
    uint32_t code;
    CDevice *device;
    CPartition *partition;
    CVolume *volume_;
    QString text; // read on delivery: the object must still exist then
    bool onRootThread;
};

struct Machine
{
    ScriptedBackend backend;
    RootTest::FakeSource source;
    std::unique_ptr<CRoot> root;
    QList<Recorded> events;

    explicit Machine(const QByteArray &disk)
    {
        RootTest::AnswerGeometry(backend, 512, DeviceControl::PARTITION_STYLE_MBR, quint64(disk.size()));
        backend.AddFile("/dev/sdx", disk);
        source.Set({RootTest::Candidate("/dev/sdx", 3, EnumSource::PhysicalDrive, quint64(disk.size()))});
        root = std::make_unique<CRoot>(&backend, &source);
        QObject::connect(root.get(), &cRoot::kernelStorage, root.get(), [this](const _event_storage &e) {
            if (e.device)
                events.append({false, e.code, e.device, nullptr, nullptr, e.device->GetDisplayName(),
                               QThread::currentThread() == root->thread()});
        });
        QObject::connect(root.get(), &cRoot::kernelVolume, root.get(), [this](const _event_volume &e) {
            events.append({true, e.code, e.device, e.partition, e.volume, e.volume->GetLabel(),
                           QThread::currentThread() == root->thread()});
        });
    }

    // "device 1", "volume 1 LABEL", ... for failure messages.
    std::string Trace() const
    {
        QStringList out;
        for (const Recorded &r : events)
            out << QStringLiteral("%1 %2 %3").arg(r.volume ? "volume" : "device").arg(r.code).arg(r.text);
        return out.join(", ").toStdString();
    }

    CDevice *Refresh()
    {
        if (!root->RefreshAndWait())
            return nullptr;
        QCoreApplication::processEvents();
        return root->GetDeviceCount() ? root->GetDevice(0) : nullptr;
    }
};

} // namespace

TEST(VolumeOwnership, PartitionsOwnTheirVolumesAndTheRootAnnouncesThem)
{
    QString why;
    const QByteArray disk = FourPartitionDisk(why);
    if (disk.isEmpty())
        GTEST_SKIP() << why.toStdString();
    Machine m(disk);
    CDevice *device = m.Refresh();
    ASSERT_TRUE(device);
    EXPECT_FALSE(device->Volume()); // it has partitions

    QList<CPartition *> withVolume;
    device->ForEachVolume([&](CPartition *p, CVolume *v) {
        ASSERT_TRUE(p);
        EXPECT_EQ(p->Volume(), v);
        EXPECT_EQ(v->GetMedium(), p);
        withVolume << p;
    });
    // FAT, ext4, the short one and the logical one; gaps and the extended partition hold none.
    ASSERT_EQ(withVolume.size(), 4);
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i) {
        CPartition *p = device->GetPartition(i);
        const auto kind = static_cast<FileSystemKind>(p->GetKind());
        if (kind == FileSystemKind::Unallocated || kind == FileSystemKind::Extended) {
            EXPECT_FALSE(p->Volume()) << i;
        }
    }
    CVolume *fat = withVolume[0]->Volume();
    EXPECT_EQ(withVolume[0]->GetStart(), 2048u);
    EXPECT_EQ(fat->GetKind(), 7u);
    EXPECT_EQ(fat->GetLabel(), "OWNFAT");
    EXPECT_EQ(fat->GetSerialNumber(), 0x0BADF00Du);
    EXPECT_EQ(withVolume[1]->Volume()->GetKind(), 16u);
    EXPECT_EQ(withVolume[1]->Volume()->GetLabel(), "OWNEXT");
    // Fewer than 32 sectors: never probed, kind 24, still a volume of its own.
    EXPECT_EQ(withVolume[2]->GetLength(), 16u);
    EXPECT_EQ(withVolume[2]->Volume()->GetKind(), 24u);
    EXPECT_EQ(withVolume[2]->GetKind(), 24u);
    EXPECT_TRUE(withVolume[3]->GetParent());
    // Reading a volume reads the partition's sectors.
    QByteArray boot(512, '\0');
    std::uint32_t error = 0;
    ASSERT_TRUE(fat->ReadSectors(0, 1, boot.data(), error));
    EXPECT_EQ(boot, disk.mid(2048 * 512, 512));

    // Building the device and its volumes wrote nothing.
    EXPECT_EQ(m.backend.CallCount("write"), 0);
    EXPECT_EQ(m.backend.FileData("/dev/sdx"), disk);

    // The device, then its four volumes in table order, all on the root's thread.
    ASSERT_EQ(m.events.size(), 5) << m.Trace();
    EXPECT_FALSE(m.events[0].volume);
    EXPECT_EQ(m.events[0].code, 1u);
    for (int i = 1; i < 5; ++i) {
        EXPECT_TRUE(m.events[i].volume);
        EXPECT_EQ(m.events[i].code, 1u);
        EXPECT_EQ(m.events[i].device, device);
        EXPECT_EQ(m.events[i].partition, withVolume[i - 1]);
        EXPECT_TRUE(m.events[i].onRootThread);
    }
    EXPECT_EQ(m.events[1].text, "OWNFAT");

    // A second refresh keeps the device and announces nothing.
    m.events.clear();
    EXPECT_EQ(m.Refresh(), device);
    EXPECT_TRUE(m.events.isEmpty());

    // The disk goes: its volumes are withdrawn first, each still readable when delivered.
    m.source.Set({});
    m.backend.Vanish("/dev/sdx");
    ASSERT_TRUE(m.root->RefreshAndWait());
    QCoreApplication::processEvents();
    ASSERT_EQ(m.events.size(), 5) << m.Trace();
    for (int i = 0; i < 4; ++i) {
        EXPECT_TRUE(m.events[i].volume);
        EXPECT_EQ(m.events[i].code, 4u);
    }
    EXPECT_EQ(m.events[0].text, "OWNFAT");
    EXPECT_FALSE(m.events[4].volume);
    EXPECT_EQ(m.events[4].code, 4u);
}

TEST(VolumeOwnership, DeviceWithoutPartitionsOwnsOneVolume)
{
    if (!TestUtil::haveTool("mkfs.vfat"))
        GTEST_SKIP() << "mkfs.vfat is needed";
    QTemporaryDir dir;
    const QString path = dir.filePath("whole.img");
    ASSERT_EQ(TestUtil::run("mkfs.vfat", {"-n", "WHOLEDISK", "-i", "12345678", "-C", path, "8192"}).exitCode,
              0);
    QFile f(path);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    Machine m(f.readAll());
    CDevice *device = m.Refresh();
    ASSERT_TRUE(device);
    // A file system over the whole disk: the device is one volume (style 1) through one partition.
    EXPECT_EQ(device->GetPartStyle(), PartStyle::DeviceAsVolume);
    ASSERT_EQ(device->GetPartitionCount(), 1u);
    EXPECT_FALSE(device->Volume());
    ASSERT_TRUE(device->GetPartition(0)->Volume());
    EXPECT_EQ(device->GetPartition(0)->Volume()->GetLabel(), "WHOLEDISK");
    EXPECT_EQ(device->GetPartition(0)->Volume()->GetSize(), device->GetSize());

    // A disk without any table or file system: one volume of unknown kind owned by the device.
    Machine blank(QByteArray(4 * Mib, '\0'));
    CDevice *empty = blank.Refresh();
    ASSERT_TRUE(empty);
    EXPECT_EQ(empty->GetPartitionCount(), 0u);
    ASSERT_TRUE(empty->Volume());
    EXPECT_EQ(empty->Volume()->GetMedium(), empty);
    EXPECT_EQ(empty->Volume()->GetKind(), 24u);
    int seen = 0;
    empty->ForEachVolume([&](CPartition *p, CVolume *v) {
        EXPECT_FALSE(p);
        EXPECT_EQ(v, empty->Volume());
        ++seen;
    });
    EXPECT_EQ(seen, 1);
    ASSERT_EQ(blank.events.size(), 2) << blank.Trace();
    EXPECT_TRUE(blank.events[1].volume);
    EXPECT_FALSE(blank.events[1].partition);
    EXPECT_EQ(blank.events[1].volume_, empty->Volume());
    EXPECT_EQ(blank.backend.CallCount("write"), 0);
}
TEST(VolumeOwnership, BsdContainerSlicesGetTheirOwnVolumes)
{
    const VolumeImages::Made ufs = VolumeImages::Get("ufs1");
    if (ufs.path.isEmpty())
        GTEST_SKIP() << ufs.why.toStdString();
    if (!TestUtil::haveTool("sfdisk"))
        GTEST_SKIP() << "sfdisk is needed";
    QFile f(ufs.path);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    QByteArray part = f.readAll();
    const auto sectors = static_cast<std::uint32_t>(part.size() / 512);
    part.replace(512, 512, VolumeImages::BsdLabel(sectors));
    QTemporaryDir dir;
    const QString image = dir.filePath("bsd.img");
    QFile d(image);
    ASSERT_TRUE(d.open(QIODevice::WriteOnly) && d.resize(qint64(2048 + sectors + 2048) * 512));
    d.close();
    ASSERT_TRUE(
        Sfdisk(image, QStringLiteral("label: dos\nstart=2048,size=%1,type=a5\n").arg(sectors).toUtf8()));
    ASSERT_TRUE(d.open(QIODevice::ReadOnly));
    QByteArray disk = d.readAll();
    disk.replace(2048 * 512, part.size(), part);

    Machine m(disk);
    CDevice *device = m.Refresh();
    ASSERT_TRUE(device);
    CPartition *container = nullptr;
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
        if (device->GetPartition(i)->GetStart() == 2048)
            container = device->GetPartition(i);
    ASSERT_TRUE(container);
    EXPECT_EQ(FileSystemKindName(container->GetKind()), "Partition BSD");
    EXPECT_FALSE(container->Volume());
    ASSERT_EQ(container->GetChildCount(), 2u);
    CPartition *a = container->GetChildPartition(0);
    ASSERT_TRUE(a->Volume());
    EXPECT_EQ(a->Volume()->GetKind(), 17u);
    EXPECT_EQ(a->GetStart(), 2048u);
    ASSERT_TRUE(container->GetChildPartition(1)->Volume());
    int announced = 0;
    for (const Recorded &r : m.events)
        announced += r.volume && (r.partition == a || r.partition == container->GetChildPartition(1));
    EXPECT_EQ(announced, 2) << m.Trace();
    EXPECT_EQ(m.backend.CallCount("write"), 0);
}

// Device construction with its volumes over a disk of four partitions: only the probe reads.
TEST(VolumeOwnership, ConstructionReadsOnlyTheProbes)
{
    QString why;
    const QByteArray disk = FourPartitionDisk(why);
    if (disk.isEmpty())
        GTEST_SKIP() << why.toStdString();
    Machine m(disk);
    QElapsedTimer timer;
    timer.start();
    CDevice *device = m.root->AddDevice("/dev/sdx");
    const qint64 withVolumes = timer.nsecsElapsed();
    ASSERT_TRUE(device);
    qint64 bytes = 0;
    for (const QString &call : m.backend.Calls())
        if (call.startsWith("read "))
            bytes += call.mid(5).toLongLong();
    // The probes of four volumes (a 256 KiB, a 64 KiB and a dozen small reads each) and the table.
    EXPECT_LT(bytes, 4 * 1536 * 1024) << bytes;

    // Making the same four volumes again alone: the share of construction they take.
    timer.restart();
    int made = 0;
    device->ForEachVolume([&](CPartition *p, CVolume *) {
        VolumeCreate::Options options;
        made += VolumeCreate::CreateVolume(*p, options) != nullptr;
    });
    const qint64 volumesAlone = timer.nsecsElapsed();
    EXPECT_EQ(made, 4);
    std::printf("[ timing ] device with 4 volumes: %.2f ms (%lld bytes read); the 4 volumes again: %.2f ms\n",
                double(withVolumes) / 1e6, static_cast<long long>(bytes), double(volumesAlone) / 1e6);
}
