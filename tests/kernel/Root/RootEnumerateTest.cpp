// Identification of candidate devices through a scripted back end: geometry, table style, the
// not-ready listing, identity texts and the claiming of volumes.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "Kernel/Implementation/Root/RootEnumerate.h"
#include "tests/common/RootTestSupport.h"

#include <cstring>
#include <memory>

using namespace RootTest;
using namespace DeviceControl;

namespace {

struct Fixture
{
    ScriptedBackend backend;
    FakeSource source;
    std::unique_ptr<CRoot> root;
    QStringList internal;
    QList<_event_platform> records;

    Fixture()
    {
        root = std::make_unique<CRoot>(&backend, &source);
        QObject::connect(root.get(), &cRoot::kernelInternal,
                         [this](const _event_internal &e) { internal << e.text; });
        QObject::connect(root.get(), &cRoot::kernelPlatform,
                         [this](const _event_platform &e) { records << e; });
    }

    // Identifies one candidate; the descriptor's handle is released by the fixture.
    bool Identify(const EnumCandidate &c, DeviceInfo &info)
    {
        CEnumerator e(root.get(), source);
        bool ok = e.Identify(c, info);
        handles.emplace_back(info.handle);
        return ok;
    }
    std::vector<std::unique_ptr<CPlatformFile>> handles;
};

} // namespace

TEST(RootEnumerate, TableStyleNeedsTheBootSignature)
{
    Fixture f;
    AnswerGeometry(f.backend);
    f.backend.AddFile("/dev/sda", Disk(1 << 20, false));
    f.backend.AddFile("/dev/sdb", Disk(1 << 20, true));

    DeviceInfo raw, mbr;
    ASSERT_TRUE(f.Identify(Candidate("/dev/sda", 0), raw));
    ASSERT_TRUE(f.Identify(Candidate("/dev/sdb", 1), mbr));
    EXPECT_EQ(raw.ready, 1);
    EXPECT_EQ(raw.partStyle, PartStyle::Raw);
    EXPECT_EQ(PartStyleName(raw.partStyle), QStringLiteral("Raw (not partitioned)"));
    EXPECT_EQ(mbr.partStyle, PartStyle::Mbr);
    EXPECT_EQ(mbr.totalSectors, 2048u);
    EXPECT_EQ(mbr.sectorShift, 9);
    EXPECT_EQ(mbr.sectorsPerTrack, 1024u);
    // Identification leaves no handle open.
    EXPECT_EQ(f.backend.OpenHandles(), 0);

    // An optical drive has the style of a volume whatever its first sector holds.
    f.backend.AddFile("/dev/sr0", Disk(1 << 20, true));
    DeviceInfo cd;
    ASSERT_TRUE(f.Identify(Candidate("/dev/sr0", 0, EnumSource::OpticalDrive), cd));
    EXPECT_EQ(cd.partStyle, PartStyle::DeviceAsVolume);
    EXPECT_EQ(cd.mediaType, MediaType::CdRom);
}

TEST(RootEnumerate, GuidTableStyleAndLengthFromPartitionInformation)
{
    Fixture f;
    AnswerGeometry(f.backend, 512, PARTITION_STYLE_GPT, 3u << 20);
    f.backend.AddFile("/dev/nvme0n1", Disk(3 << 20, true));
    DeviceInfo info;
    ASSERT_TRUE(f.Identify(Candidate("/dev/nvme0n1", 0), info));
    EXPECT_EQ(info.partStyle, PartStyle::Gpt);
    // The partition length is exact where cylinders x heads x sectors round down.
    EXPECT_EQ(info.totalSectors, 6144u);
}

TEST(RootEnumerate, DeviceThatCannotBeOpenedIsListedNotReady)
{
    Fixture f;
    f.backend.AddFile("/dev/sda", Disk(1 << 20, true));
    // The open (for reading only) is refused.
    f.backend.ScriptOpen(SystemError::AccessDenied);
    EnumCandidate c = Candidate("/dev/sda", 0, EnumSource::PhysicalDrive, 8u << 20);
    c.logicalSectorSize = 4096;
    c.physicalSectorSize = 4096;
    c.model = QStringLiteral("Listed Model");
    c.rotational = 0;
    DeviceInfo info;
    ASSERT_TRUE(f.Identify(c, info));
    EXPECT_EQ(info.ready, 0);
    EXPECT_TRUE(info.notReadyReason.startsWith(QStringLiteral("Error [5]: ")))
        << info.notReadyReason.toStdString();
    EXPECT_EQ(info.sectorShift, 12);
    EXPECT_EQ(info.totalSectors, 2048u);
    EXPECT_EQ(info.model, QStringLiteral("Listed Model"));
    EXPECT_EQ(info.rotation, 0);
    ASSERT_EQ(f.internal.size(), 1);
    EXPECT_TRUE(f.internal[0].startsWith(QStringLiteral("Device=/dev/sda, Not Ready: Error [5]")));
    EXPECT_EQ(CRoot::BaseAttributes(info, info.partStyle) & DeviceAttribute::NotReady,
              DeviceAttribute::NotReady);

    // A candidate that is gone by the time it is opened is dropped without a word.
    f.internal.clear();
    DeviceInfo gone;
    EXPECT_FALSE(f.Identify(Candidate("/dev/sdz", 3), gone));
    EXPECT_EQ(gone.handle, nullptr);
    EXPECT_TRUE(f.internal.isEmpty());
}

TEST(RootEnumerate, GeometryFromTheListingWhereThePlatformHasNoControl)
{
    Fixture f;
    f.backend.AddFile("/dev/loop4", Disk(1 << 20, false));
    EnumCandidate c = Candidate("/dev/loop4", 4, EnumSource::VolumeBacked, 1 << 20);
    c.physicalSectorSize = 4096;
    DeviceInfo info;
    ASSERT_TRUE(f.Identify(c, info));
    EXPECT_EQ(info.ready, 1);
    EXPECT_EQ(info.totalSectors, 2048u);
    EXPECT_EQ(info.physicalSectorShift, 12);
    EXPECT_TRUE(f.records.isEmpty());

    // Without size in the listing either, the device is not ready and says why.
    f.backend.AddFile("/dev/loop5", Disk(1 << 20, false));
    DeviceInfo none;
    ASSERT_TRUE(f.Identify(Candidate("/dev/loop5", 5, EnumSource::VolumeBacked, 0), none));
    EXPECT_EQ(none.ready, 0);
    EXPECT_EQ(none.totalSectors, 0u);
    EXPECT_FALSE(none.notReadyReason.isEmpty());
}

TEST(RootEnumerate, BadSectorSizeIsReported)
{
    Fixture f;
    AnswerGeometry(f.backend, 520);
    f.backend.AddFile("/dev/sda", Disk(1 << 20, false));
    DeviceInfo info;
    ASSERT_TRUE(f.Identify(Candidate("/dev/sda", 0), info));
    EXPECT_TRUE(f.internal.contains(QStringLiteral("Device=/dev/sda, Sector=520")));
    EXPECT_EQ(info.sectorShift, 9);
}

TEST(RootEnumerate, IdentityFromDescriptorAlignmentIdentifyAndSeekPenalty)
{
    Fixture f;
    AnswerGeometry(f.backend);
    f.backend.AddFile("/dev/sda", Disk(1 << 20, true));
    f.backend.SetControlHandler(
        IOCTL_STORAGE_QUERY_PROPERTY, [](const QByteArray &in, QByteArray &out, uint32_t &returned) {
            uint32_t property = 0;
            std::memcpy(&property, in.constData(), 4);
            QByteArray answer;
            if (property == StorageDeviceProperty) {
                answer = Descriptor("ATA", "Some Disk", "FW1", "3132");
            } else if (property == StorageAccessAlignmentProperty) {
                STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR a{};
                a.Size = sizeof(a);
                a.BytesPerLogicalSector = 512;
                a.BytesPerPhysicalSector = 4096;
                a.BytesOffsetForSectorAlignment = 3584;
                answer = QByteArray(reinterpret_cast<const char *>(&a), sizeof(a));
            } else if (property == StorageDeviceSeekPenaltyProperty) {
                DEVICE_SEEK_PENALTY_DESCRIPTOR p{};
                p.Size = sizeof(p);
                p.IncursSeekPenalty = 0;
                answer = QByteArray(reinterpret_cast<const char *>(&p), sizeof(p));
            } else {
                return uint32_t(SystemError::InvalidFunction);
            }
            std::memcpy(out.data(), answer.constData(), size_t(qMin(answer.size(), out.size())));
            returned = uint32_t(qMin(answer.size(), out.size()));
            return 0u;
        });
    // IDENTIFY DEVICE answers with the strings the ATA way round; word 217 stays 0.
    f.backend.SetControlHandler(IOCTL_ATA_PASS_THROUGH,
                                [](const QByteArray &in, QByteArray &out, uint32_t &returned) {
                                    if (in.size() < 560 || uint8_t(in[40 + 6]) != 0xEC)
                                        return uint32_t(SystemError::InvalidFunction);
                                    out = in;
                                    out[40 + 6] = 0x50; // status: ready, no error
                                    char *data = out.data() + 48;
                                    std::memset(data, 0, 512);
                                    data[2] = 1, data[6] = 1, data[12] = 1; // words 1, 3, 6
                                    QByteArray model = QByteArray("QEMU HARDDISK").leftJustified(40, ' ');
                                    for (int i = 0; i < 40; i += 2)
                                        std::swap(model[i], model[i + 1]);
                                    std::memcpy(data + 54, model.constData(), 40);
                                    const QByteArray serial = QByteArray("MQ0010").leftJustified(20, ' ');
                                    std::memcpy(data + 20, serial.constData(), 20);
                                    returned = 560;
                                    return 0u;
                                });
    DeviceInfo info;
    ASSERT_TRUE(f.Identify(Candidate("/dev/sda", 0), info));
    EXPECT_EQ(info.model, QStringLiteral("QEMU HARDDISK"));
    EXPECT_EQ(info.firmware, QStringLiteral("FW1"));
    EXPECT_EQ(info.serialControl, QStringLiteral("12"));
    EXPECT_EQ(info.serialIdentify, QStringLiteral("QM0001"));
    EXPECT_EQ(info.physicalSectorShift, 12);
    EXPECT_EQ(info.alignmentOffset, 3584u);
    EXPECT_EQ(info.rotation, 0);
    EXPECT_TRUE(info.serial.isEmpty());
}

TEST(RootEnumerate, VolumesAreClaimedByIdentityAndDifferencesReported)
{
    Fixture f;
    AnswerGeometry(f.backend);
    f.backend.AddFile("/dev/sda", Disk(1 << 20, false));
    f.backend.AddFile("/dev/sdb", Disk(1 << 20, true));

    auto volume = [](const QString &path, quint16 number, quint64 offset, quint8 shift, quint32 part) {
        VolumeInfo v;
        v.path = path;
        v.mediaType = MediaType::Fixed;
        v.ready = 1;
        v.fileSystem = FileSystemKind::Ext4;
        v.sectorShift = shift;
        v.sectorSize = shift ? 1u << shift : 0;
        v.partitionNumber = part;
        v.extents.append(VolumeExtent{number, EnumSource::PhysicalDrive, 0, offset, 1 << 20});
        return v;
    };
    // sda carries a file system on the whole device; sdb one partition with 4096-byte sectors.
    f.source.Set({Candidate("/dev/sda", 0), Candidate("/dev/sdb", 1)},
                 {volume("/dev/sda", 0, 0, 0, 0), volume("/dev/sdb1", 1, 1 << 20, 12, 1),
                  volume("/dev/sdc1", 2, 0, 9, 1)});
    CEnumerator e(f.root.get(), f.source);
    QList<DeviceInfo> list = e.Enumerate();
    ASSERT_EQ(list.size(), 2);
    for (const DeviceInfo &i : list)
        f.handles.emplace_back(i.handle);
    ASSERT_EQ(list[0].volumes.size(), 1);
    EXPECT_EQ(list[0].partStyle, PartStyle::DeviceAsVolume);
    // A volume of unknown sector size takes the device's.
    EXPECT_EQ(list[0].volumes[0].sectorShift, 9);
    ASSERT_EQ(list[1].volumes.size(), 1);
    EXPECT_EQ(list[1].volumes[0].path, QStringLiteral("/dev/sdb1"));
    EXPECT_EQ(list[1].partStyle, PartStyle::Mbr);
    EXPECT_TRUE(f.internal.contains(QStringLiteral("Device=/dev/sdb(9), Volume=/dev/sdb1(12)")));
}

TEST(RootEnumerate, AssembledDevicesAreOpenedOnlyForReading)
{
    struct Row
    {
        QString path;
        bool readOnly;
        BackingKind kind;
    };
    for (const Row &r : {Row{"/dev/loop2", false, BackingKind::Loop},
                         Row{"/dev/mapper/vg-root", true, BackingKind::LogicalVolume},
                         Row{"/dev/md0", true, BackingKind::SoftwareRaid}}) {
        SCOPED_TRACE(r.path.toStdString());
        Fixture f;
        f.backend.AddFile(r.path, Disk(1 << 20, false));
        EnumCandidate c = Candidate(r.path, 2, EnumSource::VolumeBacked);
        c.readOnly = r.readOnly;
        c.stack.kind = r.kind;
        c.stack.members = QStringList{"/dev/sda2", "/dev/sdb2"};
        c.stack.holders = QStringList{"/dev/mapper/luks-1"};
        DeviceInfo info;
        ASSERT_TRUE(f.Identify(c, info));
        EXPECT_EQ(info.ready, 1);
        // Identification only reads: a loop device too is opened for reading only.
        EXPECT_EQ(f.backend.CallCount("open rw"), 0);
        EXPECT_EQ(f.backend.CallCount("open ro"), 1);
        // What it is built from travels with the descriptor.
        EXPECT_EQ(info.stack.kind, r.kind);
        EXPECT_EQ(info.stack.members, c.stack.members);
        EXPECT_EQ(info.stack.holders, c.stack.holders);
    }
}
