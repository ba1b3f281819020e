// GUID partition tables made with sgdisk, checked against mmls and sgdisk, and damaged copies for
// the reader's codes and messages.
#include <gtest/gtest.h>

#include <QRegularExpression>
#include <QTemporaryDir>

#include "Kernel/Implementation/Partitions/GptReader.h"
#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "tests/kernel/Partitions/PartitionTestSupport.h"

using namespace PartitionTest;

namespace {

class GptDisk : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!TestUtil::haveTool("sgdisk") || !TestUtil::haveTool("mmls"))
            GTEST_SKIP() << "sgdisk and mmls are needed";
        ASSERT_TRUE(dir.isValid());
        image = dir.filePath("gpt.img");
        ASSERT_TRUE(makeImage(image, 64));
        ASSERT_TRUE(
            sgdisk(image, {"-n", "1:2048:+8M", "-t", "1:8300", "-c", "1:root",      "-n", "2:20480:+4M",
                           "-t", "2:0700",     "-c", "2:data", "-n", "3:40960:+1M", "-t", "3:0c01",
                           "-n", "4:0:+16M",   "-t", "4:8200", "-c", "4:swap space"}));
    }
    Scanned scanImage()
    {
        FileStorage disk(image);
        return scan(disk);
    }
    QTemporaryDir dir;
    QString image;
};

TEST_F(GptDisk, EntriesMatchMmlsAndSgdisk)
{
    Scanned s = scanImage();
    EXPECT_EQ(s.result.partStyle, PartStyle::Gpt);
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    EXPECT_EQ(leaves(s.result.partitions), merged(mmlsRows(image)));
    EXPECT_EQ(s.made, 4);

    // sgdisk -i N gives each entry's GUIDs and name.
    int n = 0;
    for (const auto &p : s.result.partitions) {
        if (p->GetKind() == 0)
            continue;
        ++n;
        const QString info =
            QString::fromUtf8(TestUtil::run("sgdisk", {"-i", QString::number(n), image}).out);
        ASSERT_TRUE(p->IsGptEntry());
        EXPECT_TRUE(info.contains("Partition GUID code: " + Gpt::guidText(p->GetGpt().typeGuid)))
            << info.toStdString();
        EXPECT_TRUE(info.contains("Partition unique GUID: " + Gpt::guidText(p->GetGpt().uniqueGuid)));
        EXPECT_TRUE(info.contains(QStringLiteral("First sector: %1 ").arg(p->GetStart())));
        EXPECT_TRUE(info.contains(QStringLiteral("Partition name: '%1'").arg(p->GetGpt().name)));
    }
    EXPECT_EQ(n, 4);
    for (const auto &p : s.result.partitions) {
        if (p->GetStart() == 40960) {
            EXPECT_EQ(p->GetKind(), 4u) << "0c01 is the Microsoft reserved type";
        }
    }
}

TEST_F(GptDisk, HybridBootRecordStillReadsAsGpt)
{
    // A hybrid boot record mirrors two entries beside the protective one.
    ASSERT_TRUE(sgdisk(image, {"-h", "1:2"}));
    Scanned s = scanImage();
    EXPECT_EQ(s.result.partStyle, PartStyle::Gpt);
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    EXPECT_EQ(leaves(s.result.partitions), merged(mmlsRows(image)));
    EXPECT_EQ(s.made, 4);
}

TEST_F(GptDisk, DamagedPrimaryHeaderFallsBackToTheBackup)
{
    // Flip a byte of the primary header's disk GUID: its CRC no longer matches.
    QByteArray b = readAt(image, 512 + 60, 1);
    b[0] = char(b[0] ^ 0x5A);
    ASSERT_TRUE(patch(image, 512 + 60, b));
    Scanned s = scanImage();
    EXPECT_TRUE(s.messages.contains("Error (8) in GPT header on a device Test Disk"))
        << s.messages.join('\n').toStdString();
    int used = 0;
    for (const auto &p : s.result.partitions)
        used += p->GetKind() != 0;
    EXPECT_EQ(used, 4);
}

TEST_F(GptDisk, BothHeadersDestroyedYieldNoPartitions)
{
    ASSERT_TRUE(patch(image, 512, QByteArray(512, 'x')));
    const qint64 last = (64 << 20) - 512;
    ASSERT_TRUE(patch(image, last, QByteArray(512, 'x')));
    Scanned s = scanImage();
    EXPECT_EQ(s.messages, QStringList{"Error (6) in GPT header on a device Test Disk"});
    EXPECT_EQ(s.made, 0);
}

TEST_F(GptDisk, DestroyedEntryArrayIsReadFromTheCopy)
{
    ASSERT_TRUE(patch(image, 1024, QByteArray(512, '\x11')));
    Scanned s = scanImage();
    EXPECT_TRUE(s.messages.contains("GPT entries on a device Test Disk not found"))
        << s.messages.join('\n').toStdString();
    EXPECT_EQ(s.made, 4);
    FileStorage disk(image);
    Gpt::ReadResult r = Gpt::read(disk);
    EXPECT_FALSE(r.entriesFound);
    EXPECT_TRUE(r.entriesFromBackup);
}

TEST_F(GptDisk, EntryArrayCrcMismatchInBothCopiesGivesNoEntries)
{
    ASSERT_TRUE(patch(image, 1024 + 56, QByteArray("\x41", 1)));
    const qint64 backupArray = (64 << 20) - 33 * 512;
    ASSERT_TRUE(patch(image, backupArray + 56, QByteArray("\x41", 1)));
    Scanned s = scanImage();
    EXPECT_TRUE(s.messages.contains("GPT entries on a device Test Disk not found"));
    EXPECT_EQ(s.made, 0);
}

TEST_F(GptDisk, BackupNotInLastSectorIsReported)
{
    // Grow the image: the backup header stays where it was, no longer in the last sector.
    QFile f(image);
    ASSERT_TRUE(f.open(QIODevice::ReadWrite));
    ASSERT_TRUE(f.resize((64 << 20) + (1 << 20)));
    f.close();
    Scanned s = scanImage();
    EXPECT_TRUE(s.messages.contains("Copy of GPT header on a device Test Disk not in last sector"))
        << s.messages.join('\n').toStdString();
    EXPECT_EQ(s.made, 4);
}

// Hand-made tables: a protective boot record and a header with its entries.
struct HandGpt
{
    QByteArray head = QByteArray(1 << 20, '\0');
    std::uint64_t total = 1 << 16;
    QByteArray entries = QByteArray(128 * 128, '\0');
    std::uint32_t entryCount = 128;

    void entry(int i, const Gpt::Guid &type, std::uint8_t uniq, std::uint64_t first, std::uint64_t last)
    {
        char *e = entries.data() + i * 128;
        std::memcpy(e, type.data(), 16);
        for (int b = 0; b < 16; ++b)
            e[16 + b] = char(uniq + b + 1);
        std::memcpy(e + 32, &first, 8);
        std::memcpy(e + 40, &last, 8);
    }
    // A header at MY_LBA naming its copy at ALT_LBA and its entries at ENTRIES_LBA.
    QByteArray header(std::uint64_t myLba, std::uint64_t altLba, std::uint64_t entriesLba) const
    {
        QByteArray h(512, '\0');
        h.replace(0, 8, "EFI PART");
        auto put32 = [&h](int o, std::uint32_t v) { std::memcpy(h.data() + o, &v, 4); };
        auto put64 = [&h](int o, std::uint64_t v) { std::memcpy(h.data() + o, &v, 8); };
        put32(8, 0x10000);
        put32(12, 92);
        put64(24, myLba);
        put64(32, altLba);
        put64(40, 34);
        put64(48, total - 34);
        put64(72, entriesLba);
        put32(80, entryCount);
        put32(84, 128);
        put32(88, Gpt::crc32(entries.constData(), std::size_t(entries.size())));
        put32(16, Gpt::crc32(h.constData(), 92));
        return h;
    }
    std::unique_ptr<PartScan::MemoryStorage> build()
    {
        head.replace(0, 512, mbrSector({mbrEntry(0, 0xEE, 1, 0xFFFF)}));
        head.replace(1024, entries.size(), entries);
        head.replace(512, 512, header(1, total - 1, 2));
        return std::make_unique<PartScan::MemoryStorage>(512, total, head);
    }
};

const Gpt::Guid Linux = Gpt::guidFromText("0FC63DAF-8483-4772-8E79-3D69D8477DE4");

TEST(GptScan, OverlappingEntriesAreListedAndOnesPastTheDeviceAreNot)
{
    struct Case
    {
        std::uint64_t secondFirst, secondLast;
        const char *message;
        int made;
        bool inconsistent; // the reader's code says so
    };
    for (const Case &c :
         {Case{4000, 8191, "GPT on a device Test Disk has overlapped partitions", 2, true},
          Case{60000, 70000, "Invalid partition definition in GPT on device Test Disk", 1, false}}) {
        HandGpt g;
        g.entry(0, Linux, 1, 2048, 4095);
        g.entry(1, Linux, 2, c.secondFirst, c.secondLast);
        auto disk = g.build();
        Scanned s = scan(*disk);
        EXPECT_TRUE(s.messages.contains(c.message)) << s.messages.join('\n').toStdString();
        EXPECT_EQ(s.made, c.made);
        if (c.inconsistent) {
            EXPECT_EQ(Gpt::read(*disk).code, Gpt::EntriesInconsistent);
        }
    }
}

TEST(GptScan, LdmEntriesGetTheirKindsAndDuplicatesAreReported)
{
    HandGpt g;
    g.entry(0, Gpt::LdmMetadata, 1, 34, 2047);
    g.entry(1, Gpt::LdmData, 2, 2048, 30000);
    g.entry(2, Gpt::LdmMetadata, 3, 30001, 30100);
    auto disk = g.build();
    Scanned s = scan(*disk);
    EXPECT_TRUE(s.messages.contains("Duplicate MetaData definition in GPT on device Test Disk"));
    std::vector<std::uint32_t> kinds;
    for (const auto &p : s.result.partitions)
        if (p->GetKind() != 0)
            kinds.push_back(p->GetKind());
    EXPECT_EQ(kinds, (std::vector<std::uint32_t>{2, 3}));
    EXPECT_EQ(s.result.ldmSector, 2047u);
}

TEST(GptScan, HugeEntryCountIsRefusedWithoutReadingIt)
{
    HandGpt g;
    g.entryCount = 0xFFFFFFFF;
    auto disk = g.build();
    Scanned s = scan(*disk);
    EXPECT_TRUE(s.messages.startsWith("Error (12) in GPT header on a device Test Disk"))
        << s.messages.join('\n').toStdString();
    EXPECT_LT(disk->ReadCount(), 20u);
}

TEST(GptScan, HeaderFromTheLastSectorThatDoesNotPointAtSectorOneIsReported)
{
    // Only a header in the last sector, whose other header would be in sector 5.
    HandGpt g;
    g.entry(0, Linux, 0, 2048, 4095);
    QByteArray head(1 << 20, '\0');
    head.replace(0, 512, mbrSector({mbrEntry(0, 0xEE, 1, 0xFFFF)}));
    PartScan::MemoryStorage disk(512, g.total, head, g.entries + g.header(g.total - 1, 5, g.total - 33));
    Scanned s = scan(disk);
    EXPECT_EQ(s.messages, (QStringList{"Error (6) in GPT header on a device Test Disk",
                                       "Copy of GPT header on a device Test Disk not found",
                                       "GPT header on a device Test Disk not in first sector",
                                       "Copy of GPT entries on a device Test Disk not found"}));
    EXPECT_EQ(s.made, 1);
}

} // namespace
