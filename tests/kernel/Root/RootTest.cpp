// The kernel root: device order, refresh (what stays, leaves and joins), storage events with the
// announced flag, AddDevice, and the refusal rules of the kernel-wide settings.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"
#include "Kernel/Implementation/Root/ThreadInit.h"
#include "tests/common/RootTestSupport.h"

#include <QCoreApplication>
#include <QThread>

#include <memory>

using namespace RootTest;

namespace {

struct Recorded
{
    uint32_t code;
    CDevice *device;
    QString name; // read when delivered: the device must still exist then
    bool onRootThread;
};

struct RootFixture
{
    ScriptedBackend backend;
    FakeSource source;
    std::unique_ptr<CRoot> root;
    QList<Recorded> events;

    RootFixture()
    {
        AnswerGeometry(backend);
        root = std::make_unique<CRoot>(&backend, &source);
        QObject::connect(root.get(), &cRoot::kernelStorage, root.get(), [this](const _event_storage &e) {
            events.append({e.code, e.device, e.device ? e.device->GetDisplayName() : QString(),
                           QThread::currentThread() == root->thread()});
        });
    }

    void AddDisk(const QString &path, quint64 bytes = 1 << 20) { backend.AddFile(path, Disk(bytes, true)); }

    QList<uint32_t> Codes() const
    {
        QList<uint32_t> codes;
        for (const Recorded &r : events)
            codes << r.code;
        return codes;
    }

    QStringList Paths()
    {
        QStringList paths;
        for (CDevice *d : root->Devices())
            paths << (d->GetHandle() ? d->GetHandle()->GetName() : QString());
        return paths;
    }
};

// A device of an image-like kind, for ordering: no platform handle at all.
CDevice *Bare(CRoot *root, quint16 number, EnumSource source, quint8 sub, MediaType media)
{
    DeviceInfo info;
    info.number = number;
    info.source = source;
    info.sub = sub;
    info.mediaType = media;
    info.ready = 1;
    info.totalSectors = 8;
    info.model = QStringLiteral("n%1 s%2 u%3 m%4").arg(number).arg(int(source)).arg(sub).arg(int(media));
    return new CDevice(root, info);
}

} // namespace

TEST(Root, DeviceOrderFollowsTheKeyAndKeepsArrivalOrderOfEqualKeys)
{
    RootFixture f;
    CDevice *image = Bare(f.root.get(), 0, EnumSource::PhysicalDrive, 1, MediaType::Fixed);
    CDevice *disk1 = Bare(f.root.get(), 1, EnumSource::PhysicalDrive, 0, MediaType::Fixed);
    CDevice *cd0 = Bare(f.root.get(), 0, EnumSource::OpticalDrive, 0, MediaType::CdRom);
    CDevice *disk0 = Bare(f.root.get(), 0, EnumSource::PhysicalDrive, 0, MediaType::Fixed);
    CDevice *loop0 = Bare(f.root.get(), 0, EnumSource::VolumeBacked, 0, MediaType::Fixed);
    CDevice *twin = Bare(f.root.get(), 1, EnumSource::PhysicalDrive, 0, MediaType::Fixed);
    for (CDevice *d : {image, disk1, cd0, disk0, loop0, twin})
        ASSERT_TRUE(f.root->AddImageDevice(d));
    EXPECT_FALSE(f.root->AddImageDevice(disk0));
    EXPECT_FALSE(f.root->AddImageDevice(nullptr));

    QList<CDevice *> expected = {disk0, disk1, twin, loop0, image, cd0};
    EXPECT_EQ(f.root->Devices(), expected);
    EXPECT_EQ(f.root->GetDevice(1), disk1);
    EXPECT_EQ(f.root->GetDevice(6), nullptr);
    EXPECT_EQ(f.root->FindDevice(0, EnumSource::VolumeBacked, 0), loop0);
    EXPECT_EQ(CRoot::SortKey(0x1234, EnumSource::VolumeBacked, 2, 4, 1), 0x0000000502031234ull);

    // Removal announces and destroys the device after the announcement was delivered.
    f.events.clear();
    EXPECT_TRUE(f.root->RemoveDevice(cd0));
    EXPECT_FALSE(f.root->RemoveDevice(cd0));
    QCoreApplication::processEvents();
    ASSERT_EQ(f.events.size(), 1);
    EXPECT_EQ(f.events[0].code, 4u);
    EXPECT_EQ(f.root->GetDeviceCount(), 5u);
}

TEST(Root, StorageEventsFollowTheAnnouncedFlag)
{
    RootFixture f;
    std::unique_ptr<CDevice> d(Bare(f.root.get(), 0, EnumSource::PhysicalDrive, 0, MediaType::Fixed));
    CRoot &r = *f.root;
    r.StorageEvent(d.get(), 2); // not announced: dropped
    r.StorageEvent(d.get(), 4); // not announced: dropped
    r.StorageEvent(d.get(), 1);
    r.StorageEvent(d.get(), 1); // already announced: dropped
    EXPECT_TRUE(r.IsAnnounced(d.get()));
    r.StorageEvent(d.get(), 2);
    r.StorageEvent(d.get(), 3);
    r.StorageEvent(d.get(), 4);
    r.StorageEvent(d.get(), 3); // removed: dropped
    EXPECT_FALSE(r.IsAnnounced(d.get()));
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{1, 2, 3, 4}));

    // A cleared category bit drops the events, but the flag still follows them.
    f.events.clear();
    r.SetCategoryMask(0);
    r.StorageEvent(nullptr, 0);
    r.StorageEvent(d.get(), 1);
    EXPECT_TRUE(f.events.isEmpty());
    EXPECT_TRUE(r.IsAnnounced(d.get()));
    r.SetCategoryMask(1);
    r.StorageEvent(d.get(), 4);
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{4}));
}

TEST(Root, EventsFromOtherThreadsArriveQueuedOnTheRootsThread)
{
    RootFixture f;
    QThread *t = QThread::create([&] { f.root->StorageEvent(nullptr, 0); });
    t->start();
    t->wait();
    delete t;
    EXPECT_TRUE(f.events.isEmpty());
    QCoreApplication::processEvents();
    ASSERT_EQ(f.events.size(), 1);
    EXPECT_TRUE(f.events[0].onRootThread);
}

TEST(Root, RefreshAddsKeepsAndRemoves)
{
    RootFixture f;
    f.AddDisk("/dev/sda");
    f.AddDisk("/dev/sdb");
    EnumCandidate a = Candidate("/dev/sda", 0), b = Candidate("/dev/sdb", 1);
    b.diskSequence = 7;
    f.source.Set({b, a});

    ASSERT_TRUE(f.root->RefreshAndWait());
    EXPECT_TRUE(f.root->HasRefreshed());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 1, 1, 5}));
    EXPECT_EQ(f.Paths(), (QStringList{"/dev/sda", "/dev/sdb"}));
    for (const Recorded &r : f.events)
        EXPECT_TRUE(r.onRootThread);
    const QList<CDevice *> first = f.root->Devices();

    // Nothing changed: only the start and end of the enumeration.
    f.events.clear();
    ASSERT_TRUE(f.root->RefreshAndWait());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 5}));
    EXPECT_EQ(f.root->Devices(), first);

    // sdb now holds another medium (new sequence number): it leaves and comes back as a new device.
    f.events.clear();
    b.diskSequence = 8;
    f.source.Set({b, a});
    ASSERT_TRUE(f.root->RefreshAndWait());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 4, 1, 5}));
    ASSERT_EQ(f.events.size(), 4);
    EXPECT_EQ(f.events[1].device, first[1]);
    EXPECT_FALSE(f.events[1].name.isEmpty());
    EXPECT_EQ(f.root->GetDevice(0), first[0]);

    // sda vanished.
    f.events.clear();
    f.source.Set({b});
    ASSERT_TRUE(f.root->RefreshAndWait());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 4, 5}));
    EXPECT_EQ(f.Paths(), (QStringList{"/dev/sdb"}));

    // A full refresh keeps no physical drive: each is built anew.
    f.events.clear();
    CDevice *before = f.root->GetDevice(0);
    ASSERT_TRUE(f.root->RefreshAndWait(true));
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 4, 1, 5}));
    EXPECT_NE(f.root->GetDevice(0), before);

    // Fixed disks excluded: they leave and are not added.
    f.events.clear();
    RefreshKinds noFixed;
    noFixed.fixed = false;
    ASSERT_TRUE(f.root->RefreshAndWait(false, noFixed));
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 4, 5}));
    EXPECT_EQ(f.root->GetDeviceCount(), 0u);
}

TEST(Root, RefreshKeepsImageDevices)
{
    RootFixture f;
    f.source.Set({});
    ASSERT_TRUE(
        f.root->AddImageDevice(Bare(f.root.get(), 0, EnumSource::PhysicalDrive, 1, MediaType::Fixed)));
    f.events.clear();
    ASSERT_TRUE(f.root->RefreshAndWait());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{0, 5}));
    RefreshKinds removeImages;
    removeImages.removeImages = true;
    ASSERT_TRUE(f.root->RefreshAndWait(false, removeImages));
    EXPECT_EQ(f.root->GetDeviceCount(), 0u);
}

TEST(Root, AddDevice)
{
    RootFixture f;
    f.AddDisk("/dev/sdc", 2 << 20);
    f.backend.AddFile("/dev/empty", QByteArray());
    f.source.Set({Candidate("/dev/sdc", 2), Candidate("/dev/empty", 3, EnumSource::PhysicalDrive, 0)});

    CDevice *d = f.root->AddDevice("/dev/sdc");
    ASSERT_NE(d, nullptr);
    EXPECT_EQ(f.root->GetDeviceCount(), 1u);
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{1}));
    // The same path again, in another case, or in the portable form: nothing.
    EXPECT_EQ(f.root->AddDevice("/dev/sdc"), nullptr);
    EXPECT_EQ(f.root->AddDevice("/DEV/SDC"), nullptr);
    EXPECT_EQ(f.root->AddDevice("\\\\.\\PhysicalDrive2"), nullptr);
    // Unknown paths are refused; a device without sectors is not added.
    EXPECT_EQ(f.root->AddDevice("/dev/nothing"), nullptr);
    f.backend.ScriptOpen(SystemError::AccessDenied);
    EXPECT_EQ(f.root->AddDevice("/dev/empty"), nullptr);
    EXPECT_EQ(f.root->GetDeviceCount(), 1u);
    EXPECT_EQ(f.root->FindDeviceByPath("/dev/SDC"), d);

    // The same through the enumeration thread's queue.
    f.AddDisk("/dev/sdd");
    EnumCandidate sddCandidate = Candidate("/dev/sdd", 4);
    sddCandidate.diskSequence = 5;
    f.source.Set({Candidate("/dev/sdc", 2), sddCandidate});
    f.events.clear();
    ASSERT_TRUE(f.root->RequestAdd("/dev/sdd"));
    ASSERT_TRUE(f.root->WaitForEnumeration());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{1}));
    EXPECT_EQ(f.Paths(), (QStringList{"/dev/sdc", "/dev/sdd"}));

    // Looking at one device again: unchanged, it stays; with another medium it is replaced.
    CDevice *sdd = f.root->GetDevice(1);
    f.events.clear();
    ASSERT_TRUE(f.root->RequestDeviceRefresh(sdd));
    ASSERT_TRUE(f.root->WaitForEnumeration());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{2, 3}));
    EXPECT_EQ(f.root->GetDevice(1), sdd);
    EnumCandidate changed = Candidate("/dev/sdd", 4);
    changed.diskSequence = 99;
    f.source.Set({Candidate("/dev/sdc", 2), changed});
    f.events.clear();
    ASSERT_TRUE(f.root->RequestDeviceRefresh(sdd));
    ASSERT_TRUE(f.root->WaitForEnumeration());
    EXPECT_EQ(f.Codes(), (QList<uint32_t>{2, 3, 4, 1}));
    EXPECT_EQ(f.root->GetDeviceCount(), 2u);
    EXPECT_EQ(f.root->GetDevice(1)->GetDescriptor().diskSequence, 99u);
}

// Listing a disk, scanning its table, detecting its volume, opening an image and reading them opens
// nothing for writing (a forensic medium stays untouched, and no writable close makes the system
// announce a change); the first write opens its medium for writing once, and flushes reach it.
TEST(Root, OnlyAWriteOpensTheMediumForWriting)
{
    RootFixture f;
    QByteArray disk = Disk(2 << 20, true);
    disk[0x1BE + 4] = char(0x83);
    disk[0x1BE + 8] = char(64);    // first sector 64
    disk[0x1BE + 13] = char(0x08); // 2048 sectors
    f.backend.AddFile("/dev/sdc", disk);
    f.backend.AddFile("/img/disk.img", Disk(1 << 20, false));
    f.source.Set({Candidate("/dev/sdc", 2, EnumSource::PhysicalDrive, 2 << 20)});

    CDevice *device = f.root->AddDevice("/dev/sdc");
    ASSERT_NE(device, nullptr);
    CPartition *partition = nullptr;
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
        if (device->GetPartition(i)->GetStart() == 64)
            partition = device->GetPartition(i);
    ASSERT_NE(partition, nullptr);
    ASSERT_NE(partition->Volume(), nullptr);
    QString problem;
    CDevice *image = ImageOpen::OpenImage(f.root.get(), "/img/disk.img", problem);
    ASSERT_NE(image, nullptr) << problem.toStdString();
    QByteArray sector(512, '\0');
    std::uint32_t error = 0;
    ASSERT_TRUE(partition->Volume()->ReadSectors(0, 1, sector.data(), error));
    for (CDevice *d : {device, image}) {
        ASSERT_TRUE(d->ReadSectors(1, 1, sector.data(), error));
        EXPECT_TRUE(d->IsWritable());
    }
    EXPECT_GT(f.backend.CallCount("open ro /dev/sdc"), 0);
    EXPECT_GT(f.backend.CallCount("open ro /img/disk.img"), 0);
    EXPECT_EQ(f.backend.CallCount("open rw"), 0) << f.backend.Calls().join('\n').toStdString();
    EXPECT_EQ(f.backend.CallCount("create"), 0);

    for (const QString &path : {QStringLiteral("/dev/sdc"), QStringLiteral("/img/disk.img")}) {
        CDevice *d = path == "/dev/sdc" ? device : image;
        const QByteArray data(512, char(0x5A));
        ASSERT_TRUE(d->WriteSectors(3, 1, data.constData(), error));
        ASSERT_TRUE(d->WriteSectors(4, 1, data.constData(), error));
        EXPECT_EQ(f.backend.CallCount("open rw " + path), 1);
        EXPECT_EQ(f.backend.FileData(path).mid(3 * 512, 512), data);
        EXPECT_TRUE(d->Flush(error));
        EXPECT_EQ(f.backend.CallCount("flush " + path), 1);
    }
}

TEST(Root, SettingsKeepTheirOldValueWhenRefused)
{
    ScriptedBackend backend;
    FakeSource source;
    CRoot r(&backend, &source);
    EXPECT_EQ(r.CategoryMask(), 1);
    EXPECT_EQ(r.Tuning(0), 100);
    EXPECT_EQ(r.Tuning(1), 5);
    EXPECT_EQ(r.Tuning(2), 100);
    EXPECT_EQ(r.Limit(0), 0xFFFFFFFFu);
    EXPECT_EQ(r.Limit(1), 0u);
    EXPECT_EQ(r.Flag(0), 0);
    EXPECT_EQ(r.Flag(1), 1);
    EXPECT_FALSE(r.PlatformText().isEmpty());

    EXPECT_EQ(r.RetryCount(0), 2);
    EXPECT_EQ(r.RetryCount(5), 2);
    EXPECT_EQ(r.RetryCount(), 5);

    EXPECT_EQ(r.Value64(0), 2048u);
    EXPECT_EQ(r.Value64(4096), 2048u);
    EXPECT_EQ(r.Value64(0), 4096u);

    EXPECT_EQ(r.FillCharacter(0x1F), '~');
    EXPECT_EQ(r.FillCharacter(0x7F), '~');
    EXPECT_EQ(r.FillCharacter(' '), '~');
    EXPECT_EQ(r.FillCharacter('.'), ' ');
    EXPECT_EQ(r.FillCharacter(0), '.');
}
