// The logical disk manager's database, built sector by sector from its published layout on a
// boot-record disk with an LDM entry.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Partitions/LdmReader.h"
#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "tests/kernel/Devices/LdmTestDisks.h"
#include "tests/kernel/Partitions/PartitionTestSupport.h"

using namespace PartitionTest;

namespace {

using LdmTestDisks::GroupGuid;
using LdmTestDisks::Num;
using LdmTestDisks::Txt;

const QByteArray DiskGuid = "9f8e7d6c-aaaa-bbbb-cccc-ddddeeeeffff";

struct LdmDisk
{
    static constexpr std::uint64_t Total = 65536;
    static constexpr std::uint64_t ConfigStart = Total - 2048;
    static constexpr std::uint64_t DbStart = ConfigStart + 17;
    QByteArray head = QByteArray(1 << 20, '\0');
    QByteArray tail = QByteArray(1 << 20, '\0');
    std::uint32_t lastSequence = 0;
    QList<QByteArray> records; // one 128-byte slot each, from slot 4 on

    void put(std::uint64_t sector, const QByteArray &bytes)
    {
        const std::uint64_t tailStart = Total * 512 - std::uint64_t(tail.size());
        if (sector * 512 >= tailStart)
            tail.replace(qsizetype(sector * 512 - tailStart), bytes.size(), bytes);
        else
            head.replace(qsizetype(sector * 512), bytes.size(), bytes);
    }

    // A record of one fragment: header, type, body.
    void record(std::uint32_t group, std::uint8_t type, const QByteArray &body, std::uint8_t flags = 0)
    {
        records << LdmTestDisks::Vblk(4 + std::uint32_t(records.size()), group, type, body, flags);
    }

    void standardRecords()
    {
        record(1, 0x35, Num(0x101) + Txt("Dsk1Dg0") + Txt(GroupGuid));
        record(2, 0x34, Num(0x102) + Txt("Disk1") + Txt(DiskGuid));
        record(3, 0x51, Num(0x103) + Txt("Volume1") + Txt("gen") + Txt("") + Txt("ACTIVE"));
        record(4, 0x32,
               Num(0x104) + Txt("Volume1-01") + Txt("ACTIVE") + char(2) + QByteArray(4, '\0') + Num(1) +
                   QByteArray(16, '\0') + Num(0x103) + QByteArray(1, '\0'));
        record(5, 0x33, Num(0x105) + Txt("Disk1-01"));
    }

    std::unique_ptr<PartScan::MemoryStorage> build(bool tocOk = true, bool privOk = true)
    {
        put(0, mbrSector({mbrEntry(0, 0x42, 63, std::uint32_t(Total - 63))}));

        QByteArray ph = LdmTestDisks::PrivHead(DiskGuid, ConfigStart);
        if (!privOk)
            ph[9] = char(ph[9] + 1);
        put(Total - 1, ph);
        QByteArray toc = LdmTestDisks::TocBlock();
        if (!tocOk)
            toc[0x60] = 1;
        put(ConfigStart + 1, toc);
        put(DbStart, LdmTestDisks::Vmdb(records, lastSequence));
        return std::make_unique<PartScan::MemoryStorage>(512, Total, head, tail);
    }
};

std::vector<std::pair<std::uint32_t, std::uint64_t>> kindsAndStarts(const Scanned &s)
{
    std::vector<std::pair<std::uint32_t, std::uint64_t>> out;
    for (const auto &p : s.result.partitions)
        if (p->GetKind() != 0)
            out.push_back({p->GetKind(), p->GetStart()});
    return out;
}

TEST(LdmScan, DatabaseAreasBecomeMetadataAndDataPartitions)
{
    LdmDisk d;
    d.standardRecords();
    auto disk = d.build();
    Scanned s = scan(*disk);
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    EXPECT_EQ(kindsAndStarts(s),
              (std::vector<std::pair<std::uint32_t, std::uint64_t>>{{3, 63}, {2, LdmDisk::ConfigStart}}));
    EXPECT_EQ(s.result.ldmSector, LdmDisk::Total - 1);

    Ldm::ReadResult r = Ldm::read(*disk, LdmDisk::Total - 1, std::nullopt, std::nullopt, "Test Disk", {});
    EXPECT_TRUE(r.databaseValid);
    EXPECT_EQ(r.diskGroupName, "Dsk1Dg0");
    ASSERT_EQ(r.records.size(), 5u);
    EXPECT_EQ(r.records[2].volumeType, "gen");
    EXPECT_FALSE(r.hasRaid5);
}

TEST(LdmScan, PrivateHeaderFoundInSectorSixWhenTheLastSectorIsBlank)
{
    LdmDisk d;
    d.standardRecords();
    auto good = d.build();
    QByteArray ph(512, '\0');
    std::uint32_t error = 0;
    ASSERT_TRUE(good->ReadSectors(LdmDisk::Total - 1, 1, ph.data(), error));
    d.put(6, ph);
    d.put(LdmDisk::Total - 1, QByteArray(512, '\0'));
    auto disk = std::make_unique<PartScan::MemoryStorage>(512, LdmDisk::Total, d.head, d.tail);
    Ldm::ReadResult r = Ldm::read(*disk, LdmDisk::Total - 1, std::nullopt, std::nullopt, "Test Disk", {});
    EXPECT_TRUE(r.found);
    EXPECT_EQ(r.privHeadSector, 6u);
}

TEST(LdmScan, DamagedPrivateHeaderKeepsTheBootRecordEntry)
{
    LdmDisk d;
    d.standardRecords();
    auto disk = d.build(true, false);
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages, QStringList{"Not valid LDM definition on device Test Disk"});
    ASSERT_EQ(kindsAndStarts(s).size(), 1u);
    EXPECT_EQ(kindsAndStarts(s)[0].second, 63u);
}

TEST(LdmScan, TocBlockChecksumIsChecked)
{
    LdmDisk d;
    d.standardRecords();
    auto disk = d.build(false);
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages,
              QStringList{QStringLiteral("Invalid LDM TOCBLOCK checksum in sector %1 on device Test Disk")
                              .arg(LdmDisk::ConfigStart + 1)});
}

TEST(LdmScan, RecordChecksNameTheRecord)
{
    LdmDisk d;
    d.standardRecords();
    d.record(6, 0x99, Num(0x106) + Txt("odd"));
    d.record(7, 0x35, Num(0x107) + Txt("Dsk1Dg0") + Txt(GroupGuid));
    d.record(8, 0x51, Num(0x108) + Txt("Volume2") + Txt("raid5") + Txt("") + Txt("ACTIVE"));
    auto disk = d.build();
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages,
              (QStringList{"Invalid LDM VBLK type 0x99 in record 9 on device Test Disk",
                           "LDM VBLK have two records per one group in record 10 on device Test Disk"}));
    Ldm::ReadResult r = Ldm::read(*disk, LdmDisk::Total - 1, std::nullopt, std::nullopt, "Test Disk", {});
    EXPECT_TRUE(r.hasRaid5);
}

TEST(LdmScan, RecordAreaLongerThanTheDatabaseIsRefused)
{
    LdmDisk d;
    d.standardRecords();
    d.lastSequence = 0xFFFFFFFF;
    auto disk = d.build();
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages, QStringList{"Invalid LDM VBLK length on device Test Disk"});
    // The header's areas are still used.
    EXPECT_EQ(kindsAndStarts(s).size(), 2u);
}

TEST(LdmScan, MissingDiskGroupIsAGroupConfigurationError)
{
    LdmDisk d;
    d.record(2, 0x34, Num(0x102) + Txt("Disk1") + Txt(DiskGuid));
    auto disk = d.build();
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages, QStringList{"Invalid LDM VBLK group configuration on device Test Disk"});
}

} // namespace
