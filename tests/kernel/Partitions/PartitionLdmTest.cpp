// The logical disk manager's database, built sector by sector from its published layout on a
// boot-record disk with an LDM entry.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Partitions/LdmReader.h"
#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "tests/kernel/Partitions/PartitionTestSupport.h"

using namespace PartitionTest;

namespace {

void be(QByteArray &b, int offset, std::uint64_t v, int bytes)
{
    for (int i = bytes - 1; i >= 0; --i, v >>= 8)
        b[offset + i] = char(v & 0xFF);
}

void sealChecksum(QByteArray &b, int length)
{
    be(b, 8, Ldm::checksum(b, length), 4);
}

QByteArray varNumber(std::uint64_t v)
{
    QByteArray digits;
    while (v) {
        digits.prepend(char(v & 0xFF));
        v >>= 8;
    }
    return char(digits.size()) + digits;
}

QByteArray varText(const QByteArray &t)
{
    return char(t.size()) + t;
}

const char *GroupGuid = "1a2b3c4d-1111-2222-3333-444455556666";
const char *DiskGuid = "9f8e7d6c-aaaa-bbbb-cccc-ddddeeeeffff";

struct LdmDisk
{
    static constexpr std::uint64_t Total = 65536;
    static constexpr std::uint64_t ConfigStart = Total - 2048;
    static constexpr std::uint64_t DbStart = ConfigStart + 17;
    QByteArray head = QByteArray(1 << 20, '\0');
    QByteArray tail = QByteArray(1 << 20, '\0');
    std::uint32_t lastSequence = 0;
    std::vector<QByteArray> records; // one 128-byte slot each, from slot 4 on

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
        QByteArray r(128, '\0');
        const std::uint32_t slot = 4 + std::uint32_t(records.size());
        r.replace(0, 4, "VBLK");
        be(r, 4, slot, 4);
        be(r, 8, group, 4);
        be(r, 12, 0, 2);
        be(r, 14, 1, 2);
        r[0x12] = char(flags);
        r[0x13] = char(type);
        be(r, 0x14, std::uint32_t(body.size()), 4);
        r.replace(0x18, body.size(), body);
        records.push_back(r);
    }

    void standardRecords()
    {
        record(1, 0x35, varNumber(0x101) + varText("Dsk1Dg0") + varText(GroupGuid));
        record(2, 0x34, varNumber(0x102) + varText("Disk1") + varText(DiskGuid));
        record(3, 0x51,
               varNumber(0x103) + varText("Volume1") + varText("gen") + varText("") + varText("ACTIVE"));
        record(4, 0x32,
               varNumber(0x104) + varText("Volume1-01") + varText("ACTIVE") + char(2) + QByteArray(4, '\0') +
                   varNumber(1) + QByteArray(16, '\0') + varNumber(0x103) + QByteArray(1, '\0'));
        record(5, 0x33, varNumber(0x105) + varText("Disk1-01"));
    }

    std::unique_ptr<PartScan::MemoryStorage> build(bool tocOk = true, bool privOk = true)
    {
        put(0, mbrSector({mbrEntry(0, 0x42, 63, std::uint32_t(Total - 63))}));

        QByteArray ph(512, '\0');
        ph.replace(0, 8, "PRIVHEAD");
        be(ph, 12, 2, 2);
        be(ph, 14, 12, 2);
        ph.replace(0x30, 36, DiskGuid);
        ph.replace(0xB0, 36, GroupGuid);
        ph.replace(0xF0, 7, "Dsk1Dg0");
        be(ph, 0x11B, 63, 8);
        be(ph, 0x123, ConfigStart - 63, 8);
        be(ph, 0x12B, ConfigStart, 8);
        be(ph, 0x133, 2048, 8);
        sealChecksum(ph, Ldm::PrivHeadBytes);
        if (!privOk)
            ph[9] = char(ph[9] + 1);
        put(Total - 1, ph);

        QByteArray toc(512, '\0');
        toc.replace(0, 8, "TOCBLOCK");
        toc.replace(0x24, 6, "config");
        be(toc, 0x2E, 17, 8);
        be(toc, 0x36, 1000, 8);
        toc.replace(0x46, 3, "log");
        be(toc, 0x50, 1100, 8);
        be(toc, 0x58, 200, 8);
        sealChecksum(toc, Ldm::TocBlockBytes);
        if (!tocOk)
            toc[0x60] = 1;
        put(ConfigStart + 1, toc);

        QByteArray db(512 + 128 * int(records.size()), '\0');
        db.replace(0, 4, "VMDB");
        be(db, 4, lastSequence ? lastSequence : 4 + std::uint32_t(records.size()), 4);
        be(db, 8, 128, 4);
        be(db, 12, 512, 4);
        be(db, 0x10, 1, 2);
        be(db, 0x12, 4, 2);
        be(db, 0x14, 10, 2);
        db.replace(0x16, 7, "Dsk1Dg0");
        db.replace(0x35, 36, GroupGuid);
        for (std::size_t i = 0; i < records.size(); ++i)
            db.replace(512 + qsizetype(i) * 128, 128, records[i]);
        put(DbStart, db);
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
    d.record(6, 0x99, varNumber(0x106) + varText("odd"));
    d.record(7, 0x35, varNumber(0x107) + varText("Dsk1Dg0") + varText(GroupGuid));
    d.record(8, 0x51,
             varNumber(0x108) + varText("Volume2") + varText("raid5") + varText("") + varText("ACTIVE"));
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
    d.record(2, 0x34, varNumber(0x102) + varText("Disk1") + varText(DiskGuid));
    auto disk = d.build();
    Scanned s = scan(*disk);
    EXPECT_EQ(s.messages, QStringList{"Invalid LDM VBLK group configuration on device Test Disk"});
}

} // namespace
