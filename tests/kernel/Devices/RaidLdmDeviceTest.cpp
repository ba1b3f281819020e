// Two dynamic disks of one disk group, built sector by sector on a scripted machine, enumerated by
// the kernel root: the refresh assembles their spanned volume as a virtual device, keeps it across
// refreshes, and takes it out before a member disk that leaves.
#include <gtest/gtest.h>

#include <QCoreApplication>
#include <QThread>

#include <memory>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/LdmAssembly.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/kernel/Devices/LdmTestDisks.h"

using namespace LdmTestDisks;

namespace {

struct Event
{
    uint32_t code;
    CDevice *device;
    QString model; // read on delivery: the device must still exist then
    bool volume;   // a kernelVolume event
};

struct LdmMachine
{
    ScriptedBackend backend;
    RootTest::FakeSource source;
    std::unique_ptr<CRoot> root;
    QList<Event> events;

    LdmMachine()
    {
        RootTest::AnswerGeometry(backend, 512, DeviceControl::PARTITION_STYLE_MBR, Total * 512);
        backend.AddFile("/dev/sda", DynamicDisk(1));
        backend.AddFile("/dev/sdb", DynamicDisk(2));
        source.Set({Disk(0), Disk(1)});
        root = std::make_unique<CRoot>(&backend, &source);
        QObject::connect(root.get(), &cRoot::kernelStorage, root.get(), [this](const _event_storage &e) {
            if (e.device)
                events.append({e.code, e.device, e.device->GetModel(), false});
        });
        QObject::connect(root.get(), &cRoot::kernelVolume, root.get(), [this](const _event_volume &e) {
            events.append({e.code, e.device, e.volume->GetDisplayName(), true});
        });
    }

    static EnumCandidate Disk(int n)
    {
        return RootTest::Candidate(n ? "/dev/sdb" : "/dev/sda", quint16(n), EnumSource::PhysicalDrive,
                                   Total * 512);
    }

    CDevice *Assembled()
    {
        for (CDevice *d : root->Devices())
            if (d->GetPartStyle() == PartStyle::VirtualManager)
                return d;
        return nullptr;
    }

    void Settle()
    {
        root->WaitForEnumeration();
        QCoreApplication::processEvents();
    }
};

} // namespace

TEST(RaidLdmDevice, RefreshAssemblesTheSpannedVolumeOnce)
{
    LdmMachine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    ASSERT_EQ(m.root->GetDeviceCount(), 3u);
    CDevice *volume = m.Assembled();
    ASSERT_TRUE(volume);
    // Listed after the disks it is made of.
    EXPECT_EQ(m.root->GetDevice(2), volume);
    const DeviceInfo &info = volume->GetDescriptor();
    EXPECT_EQ(info.number, CRoot::DynamicVolumeFirstNumber);
    EXPECT_EQ(info.source, EnumSource::PhysicalDrive);
    EXPECT_EQ(info.sub, 0);
    EXPECT_EQ(volume->GetMediaType(), MediaType::RaidAssembly);
    EXPECT_EQ(volume->GetTotalSectors(), 200u);
    EXPECT_EQ(volume->Members().size(), 2);
    EXPECT_TRUE(volume->GetAttributes() & DeviceAttribute::Raid);
    EXPECT_TRUE(volume->GetModel().contains("Volume1")) << volume->GetModel().toStdString();
    EXPECT_TRUE(m.root->IsAnnounced(volume));
    // A device without partitions: one volume over all of it, made once its sectors could be read.
    ASSERT_TRUE(volume->Volume());
    EXPECT_TRUE(volume->Volume()->IsReady());
    QByteArray all(200 * 512, '\0');
    std::uint32_t error = 0;
    EXPECT_TRUE(volume->ReadSectors(0, 200, all.data(), error));
    EXPECT_EQ(all, RaidTest::ExpectedSectors(0, 200));

    // Refreshes keep the device as it is and announce nothing again.
    m.events.clear();
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    EXPECT_EQ(m.root->GetDeviceCount(), 3u);
    EXPECT_EQ(m.Assembled(), volume);
    EXPECT_TRUE(m.events.isEmpty());
    // Nothing was written to either disk.
    EXPECT_EQ(m.backend.CallCount("write"), 0);
}

TEST(RaidLdmDevice, AMemberThatLeavesTakesTheAssemblyFirst)
{
    LdmMachine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    CDevice *volume = m.Assembled();
    ASSERT_TRUE(volume);
    CDevice *second = m.root->GetDevice(1);
    ASSERT_TRUE(volume->Members().contains(second));

    m.events.clear();
    m.source.Set({LdmMachine::Disk(0)});
    m.backend.Vanish("/dev/sdb");
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    // A spanned volume does not assemble with one disk: only the first disk is left.
    ASSERT_EQ(m.root->GetDeviceCount(), 1u);
    EXPECT_FALSE(m.Assembled());
    // The assembly's volume and the assembly leave first, then the member's volumes and the member,
    // each delivered while it still existed.
    ASSERT_GE(m.events.size(), 3);
    EXPECT_TRUE(m.events[0].volume);
    EXPECT_EQ(m.events[0].device, volume);
    QList<CDevice *> devices;
    for (const Event &e : m.events) {
        EXPECT_EQ(e.code, 4u);
        if (!e.volume)
            devices << e.device;
    }
    EXPECT_EQ(devices, (QList<CDevice *>{volume, second}));

    // The disk comes back (under another name): the volume is assembled again, same number.
    m.events.clear();
    m.backend.AddFile("/dev/sdc", DynamicDisk(2));
    m.source.Set(
        {LdmMachine::Disk(0), RootTest::Candidate("/dev/sdc", 1, EnumSource::PhysicalDrive, Total * 512)});
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    ASSERT_EQ(m.root->GetDeviceCount(), 3u);
    ASSERT_TRUE(m.Assembled());
    EXPECT_EQ(m.Assembled()->GetDescriptor().number, CRoot::DynamicVolumeFirstNumber);
}

TEST(RaidLdmDevice, RemovingAMemberByHandRemovesTheAssemblyToo)
{
    LdmMachine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    ASSERT_TRUE(m.Assembled());
    CDevice *first = m.root->GetDevice(0);
    EXPECT_TRUE(m.root->RemoveDevice(first));
    QCoreApplication::processEvents();
    EXPECT_EQ(m.root->GetDeviceCount(), 1u);
    EXPECT_FALSE(m.Assembled());
}

TEST(RaidLdmDevice, AssembleDevicesSkipsListedNumbers)
{
    LdmMachine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    m.Settle();
    QList<CDevice *> disks;
    for (CDevice *d : m.root->Devices())
        if (d->GetPartStyle() != PartStyle::VirtualManager)
            disks << d;
    QStringList messages;
    const auto note = [&](const QString &t) { messages << t; };
    QList<CDevice *> made = LdmAssembly::AssembleDevices(m.root.get(), disks, 100, note);
    ASSERT_EQ(made.size(), 1) << messages.join('\n').toStdString();
    std::unique_ptr<CDevice> again(made.first());
    EXPECT_EQ(again->GetDescriptor().number, 100);
    EXPECT_TRUE(LdmAssembly::AssembleDevices(m.root.get(), disks, 100, note, [](std::uint16_t n) {
                    return n == 100;
                }).isEmpty());
}
