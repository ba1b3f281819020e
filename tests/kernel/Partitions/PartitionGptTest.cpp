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
    std::unique_ptr<PartScan::MemoryStorage> build()
    {
        head.replace(0, 512, mbrSector({mbrEntry(0, 0xEE, 1, 0xFFFF)}));
        head.replace(1024, entries.size(), entries);
        QByteArray h(512, '\0');
        h.replace(0, 8, "EFI PART");
        auto put32 = [&h](int o, std::uint32_t v) { std::memcpy(h.data() + o, &v, 4); };
        auto put64 = [&h](int o, std::uint64_t v) { std::memcpy(h.data() + o, &v, 8); };
        put32(8, 0x10000);
        put32(12, 92);
        put64(24, 1);
        put64(32, total - 1);
        put64(40, 34);
        put64(48, total - 34);
        put64(72, 2);
        put32(80, entryCount);
        put32(84, 128);
        put32(88, Gpt::crc32(entries.constData(), std::size_t(entries.size())));
        put32(16, Gpt::crc32(h.constData(), 92));
        head.replace(512, 512, h);
        return std::make_unique<PartScan::MemoryStorage>(512, total, head);
    }
};

const Gpt::Guid Linux = Gpt::guidFromText("0FC63DAF-8483-4772-8E79-3D69D8477DE4");

TEST(GptScan, OverlappingEntriesSetBitSevenAndAreStillListed)
{
    HandGpt g;
    g.entry(0, Linux, 1, 2048, 4095);
    g.entry(1, Linux, 2, 4000, 8191);
    auto disk = g.build();
    Scanned s = scan(*disk);
    EXPECT_TRUE(s.messages.contains("GPT on a device Test Disk has overlapped partitions"));
    EXPECT_EQ(s.made, 2);
    Gpt::ReadResult r = Gpt::read(*disk);
    EXPECT_EQ(r.code, Gpt::EntriesInconsistent);
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

TEST(GptScan, EntryPastTheDeviceCannotBePlaced)
{
    HandGpt g;
    g.entry(0, Linux, 1, 2048, 4095);
    g.entry(1, Linux, 2, 60000, 70000);
    auto disk = g.build();
    Scanned s = scan(*disk);
    EXPECT_TRUE(s.messages.contains("Invalid partition definition in GPT on device Test Disk"));
    EXPECT_EQ(s.made, 1);
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
    const std::uint64_t total = 1 << 16;
    QByteArray entries(128 * 128, '\0');
    std::memcpy(entries.data(), Linux.data(), 16);
    for (int b = 0; b < 16; ++b)
        entries[16 + b] = char(b + 1);
    const std::uint64_t first = 2048, last = 4095;
    std::memcpy(entries.data() + 32, &first, 8);
    std::memcpy(entries.data() + 40, &last, 8);
    QByteArray h(512, '\0');
    h.replace(0, 8, "EFI PART");
    auto put32 = [&h](int o, std::uint32_t v) { std::memcpy(h.data() + o, &v, 4); };
    auto put64 = [&h](int o, std::uint64_t v) { std::memcpy(h.data() + o, &v, 8); };
    put32(12, 92);
    put64(24, total - 1);
    put64(32, 5);
    put64(40, 34);
    put64(48, total - 34);
    put64(72, total - 33);
    put32(80, 128);
    put32(84, 128);
    put32(88, Gpt::crc32(entries.constData(), std::size_t(entries.size())));
    put32(16, Gpt::crc32(h.constData(), 92));
    QByteArray head(1 << 20, '\0');
    head.replace(0, 512, mbrSector({mbrEntry(0, 0xEE, 1, 0xFFFF)}));
    const QByteArray tail = entries + h;
    PartScan::MemoryStorage disk(512, total, head, tail);
    Scanned s = scan(disk);
    EXPECT_EQ(s.messages, (QStringList{"Error (6) in GPT header on a device Test Disk",
                                       "Copy of GPT header on a device Test Disk not found",
                                       "GPT header on a device Test Disk not in first sector",
                                       "Copy of GPT entries on a device Test Disk not found"}));
    EXPECT_EQ(s.made, 1);
}

} // namespace
