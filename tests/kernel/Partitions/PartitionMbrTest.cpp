// Boot-record tables and extended chains: disks made with sfdisk, checked against mmls, and
// hand-made damaged tables for the scan's messages.
#include <gtest/gtest.h>

#include <QTemporaryDir>

#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "tests/kernel/Partitions/PartitionTestSupport.h"

using namespace PartitionTest;

namespace {

class MbrDisk : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("mmls"))
            GTEST_SKIP() << "sfdisk and mmls are needed";
        ASSERT_TRUE(dir.isValid());
        image = dir.filePath("disk.img");
    }
    QTemporaryDir dir;
    QString image;
};

TEST_F(MbrDisk, PrimariesMatchMmlsWithGaps)
{
    ASSERT_TRUE(makeImage(image, 64));
    ASSERT_TRUE(sfdisk(image,
                       "label: dos\nstart=2048,size=20480,type=83,bootable\nstart=30720,size=10240,type=7\n"
                       "start=61440,size=40960,type=c\n"));
    FileStorage disk(image);
    Scanned s = scan(disk);
    EXPECT_EQ(s.result.partStyle, PartStyle::Mbr);
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    EXPECT_EQ(merged(leaves(s.result.partitions)), mmlsRows(image));
    EXPECT_EQ(s.made, 3);
    // Partitions and gaps in device order; the active flag is bit 7 of the boot indicator.
    ASSERT_EQ(s.result.partitions.size(), 7u);
    EXPECT_EQ(s.result.partitions[0]->GetKind(), 0u);
    EXPECT_EQ(s.result.partitions[1]->GetActive(), 0x80);
    EXPECT_EQ(s.result.partitions[1]->GetEntryType(), 0x83);
    EXPECT_EQ(s.result.partitions[3]->GetActive(), 0);
    EXPECT_EQ(s.result.partitions[6]->GetStart(), 102400u);
    EXPECT_EQ(s.result.partitions[6]->GetLength(), 131072u - 102400u);
}

TEST_F(MbrDisk, ExtendedChainNestsLogicalsAndMatchesMmls)
{
    ASSERT_TRUE(makeImage(image, 64));
    ASSERT_TRUE(sfdisk(image, "label: dos\nstart=2048,size=8192,type=83\nstart=12288,size=100000,type=5\n"
                              "start=14336,size=8192,type=83\nstart=24576,size=16384,type=82\n"
                              "start=43008,size=4096,type=b\n"));
    FileStorage disk(image);
    Scanned s = scan(disk);
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    EXPECT_EQ(merged(leaves(s.result.partitions)), mmlsRows(image));
    const CPartition *ext = nullptr;
    for (const auto &p : s.result.partitions)
        if (p->GetKind() == 1)
            ext = p.get();
    ASSERT_NE(ext, nullptr);
    EXPECT_EQ(ext->GetStart(), 12288u);
    std::vector<const CPartition *> logicals;
    for (std::uint32_t i = 0; i < ext->GetChildCount(); ++i)
        if (ext->GetChildPartition(i)->GetKind() != 0)
            logicals.push_back(ext->GetChildPartition(i));
    ASSERT_EQ(logicals.size(), 3u);
    // A logical partition in a later extended boot record starts at that record's sector plus
    // its relative start; the record's sector is its table sector.
    EXPECT_EQ(logicals[0]->GetTableSector(), 12288u);
    EXPECT_EQ(logicals[1]->GetStart(), 24576u);
    EXPECT_EQ(logicals[1]->GetTableSector(),
              24576u - (logicals[1]->GetEntry()[8] | logicals[1]->GetEntry()[9] << 8));
    EXPECT_EQ(logicals[1]->GetParent(), ext);
    EXPECT_EQ(s.made, 5);
}

// Memory disks for the hand-made cases.
struct Memory
{
    explicit Memory(std::uint64_t total = 65536) : head(1 << 20, '\0'), total(total) {}
    void put(std::uint64_t sector, const QByteArray &bytes)
    {
        head.replace(qsizetype(sector * 512), bytes.size(), bytes);
    }
    Scanned run()
    {
        storage = std::make_unique<PartScan::MemoryStorage>(512, total, head);
        return scan(*storage);
    }
    QByteArray head;
    std::uint64_t total;
    std::unique_ptr<PartScan::MemoryStorage> storage;
};

TEST(MbrScan, EntriesStoredOutOfOrderComeOutByStart)
{
    Memory m;
    m.put(0, mbrSector({mbrEntry(0, 0x83, 30000, 1000), mbrEntry(0, 0x83, 2048, 1000),
                        mbrEntry(0, 0x83, 10000, 1000)}));
    Scanned s = m.run();
    EXPECT_TRUE(s.messages.isEmpty()) << s.messages.join('\n').toStdString();
    std::vector<std::uint64_t> starts;
    for (const auto &p : s.result.partitions)
        if (p->GetKind() != 0)
            starts.push_back(p->GetStart());
    EXPECT_EQ(starts, (std::vector<std::uint64_t>{2048, 10000, 30000}));
}

TEST(MbrScan, DoubtfulEntriesAreReported)
{
    const struct
    {
        std::uint64_t total;
        QByteArray sector;
        QString message;
        int made; // -1: another message may come too, the partitions are not counted
    } cases[] = {
        // A start of zero with a type is invalid and makes no partition.
        {65536, mbrSector({mbrEntry(0, 0x83, 2048, 1000), mbrEntry(0, 0x07, 0, 0)}),
         "Invalid description for the partition in the partition table, sector 0 on a device Test Disk", 1},
        // An overlap is reported once per table.
        {65536,
         mbrSector(
             {mbrEntry(0, 0x83, 2048, 5000), mbrEntry(0, 0x83, 4096, 5000), mbrEntry(0, 0x83, 8000, 100)}),
         "Partition table in sector 0 on a device Test Disk has overlapped partitions", 3},
        {0x1'0000'0000ull, mbrSector({mbrEntry(0, 0x83, 0x8000'0000u, 0x9000'0000u)}),
         "Very big partition defined in sector 0 on a device Test Disk", -1},
    };
    for (const auto &c : cases) {
        Memory m(c.total);
        m.put(0, c.sector);
        Scanned s = m.run();
        if (c.made < 0) {
            EXPECT_TRUE(s.messages.contains(c.message)) << s.messages.join('\n').toStdString();
            continue;
        }
        EXPECT_EQ(s.messages, QStringList{c.message});
        EXPECT_EQ(s.made, c.made);
    }
}

TEST(MbrScan, ExtendedChainThatLoopsIsReportedOnceAndEnds)
{
    Memory m;
    m.put(0, mbrSector({mbrEntry(0, 0x83, 2048, 2048), mbrEntry(0, 0x05, 8192, 40000)}));
    // Record 1 at 8192 links to record 2 at 8192+10000, whose link names itself again.
    m.put(8192, mbrSector({mbrEntry(0, 0x83, 2048, 4000), mbrEntry(0, 0x05, 10000, 12000)}));
    m.put(18192, mbrSector({mbrEntry(0, 0x83, 2048, 4000), mbrEntry(0, 0x0F, 10000, 12000)}));
    Scanned s = m.run();
    EXPECT_EQ(
        s.messages.count("Invalid description for the partition in the partition table, sector 18192 on a "
                         "device Test Disk"),
        1);
    const CPartition *ext = s.result.partitions[3].get();
    ASSERT_EQ(ext->GetKind(), 1u);
    int logicals = 0;
    for (std::uint32_t i = 0; i < ext->GetChildCount(); ++i)
        logicals += ext->GetChildPartition(i)->GetKind() != 0;
    EXPECT_EQ(logicals, 2);
}

TEST(MbrScan, LogicalIsActiveOnlyWithItsExtendedPartition)
{
    Memory m;
    m.put(0, mbrSector({mbrEntry(0, 0x05, 8192, 40000)}));
    m.put(8192, mbrSector({mbrEntry(0x80, 0x83, 2048, 4000)}));
    Scanned s = m.run();
    const CPartition *ext = s.result.partitions[1].get();
    ASSERT_EQ(ext->GetKind(), 1u);
    EXPECT_EQ(ext->GetChildPartition(1)->GetStart(), 8192u + 2048u);
    EXPECT_EQ(ext->GetChildPartition(1)->GetActive(), 0);
}

TEST(MbrScan, PartitionsAreMatchedToTheVolumeThatCoversThemExactly)
{
    Memory m;
    m.put(0, mbrSector({mbrEntry(0, 0x07, 2048, 4096), mbrEntry(0, 0x07, 8192, 4096)}));
    VolumeInfo near, exact;
    near.path = "/dev/near";
    near.extents = {VolumeExtent{0, EnumSource::PhysicalDrive, 0, 2048ull * 512, 4000ull * 512}};
    exact.path = "/dev/exact";
    exact.fileSystem = FileSystemKind::Ntfs;
    exact.extents = {VolumeExtent{0, EnumSource::PhysicalDrive, 0, 8192ull * 512, 4096ull * 512}};
    m.storage = std::make_unique<PartScan::MemoryStorage>(512, m.total, m.head);
    Scanned s = scan(*m.storage, {near, exact});
    ASSERT_EQ(s.result.partitions[1]->GetStart(), 2048u);
    EXPECT_EQ(s.result.partitions[1]->GetVolumeInfo(), nullptr);
    ASSERT_NE(s.result.partitions[3]->GetVolumeInfo(), nullptr);
    EXPECT_EQ(s.result.partitions[3]->GetVolumeInfo()->path, "/dev/exact");
    EXPECT_EQ(s.result.partitions[3]->GetKind(), 10u);
}

TEST(MbrScan, DeviceWithoutSignatureIsLvmZfsOrRaw)
{
    Memory lvm;
    QByteArray label(512, '\0');
    label.replace(0, 8, "LABELONE");
    label.replace(24, 8, "LVM2 001");
    lvm.put(1, label);
    Scanned s = lvm.run();
    EXPECT_EQ(s.result.partStyle, PartStyle::Lvm);
    EXPECT_TRUE(s.result.partitions.empty());

    Memory zfs;
    QByteArray uber(8, '\0');
    const std::uint64_t magic = 0x00bab10cull;
    std::memcpy(uber.data(), &magic, 8);
    zfs.head.replace(128 * 1024 + 3 * 1024, 8, uber);
    s = zfs.run();
    EXPECT_EQ(s.result.partStyle, PartStyle::ZfsComponent);

    Memory raw;
    s = raw.run();
    EXPECT_EQ(s.result.partStyle, PartStyle::Raw);
    EXPECT_TRUE(s.result.partitions.empty());
}

} // namespace

namespace {

TEST_F(MbrDisk, FileSystemsNameTheKindAndAWholeDeviceVolumeHasNoTable)
{
    if (!TestUtil::haveTool("mkfs.fat"))
        GTEST_SKIP() << "mkfs.fat is needed";
    ASSERT_TRUE(makeImage(image, 64));
    ASSERT_TRUE(sfdisk(image, "label: dos\nstart=2048,size=40960,type=6\nstart=43008,size=8192,type=83\n"));
    ASSERT_EQ(TestUtil::run("mkfs.fat", {"-F", "16", "--offset", "2048", image, "20480"}).exitCode, 0);
    FileStorage disk(image);
    Scanned s = scan(disk);
    EXPECT_EQ(s.result.partitions[1]->GetKind(), 7u);
    EXPECT_EQ(s.result.partitions[2]->GetKind(), 0xFFFFFFFFu) << "an empty partition has no file system";

    const QString whole = dir.filePath("whole.img");
    ASSERT_TRUE(makeImage(whole, 40));
    ASSERT_EQ(TestUtil::run("mkfs.fat", {"-F", "32", whole}).exitCode, 0);
    FileStorage volume(whole);
    s = scan(volume);
    EXPECT_EQ(s.result.partStyle, PartStyle::DeviceAsVolume);
    ASSERT_EQ(s.result.partitions.size(), 1u);
    EXPECT_EQ(s.result.partitions[0]->GetKind(), 8u);
    EXPECT_EQ(s.result.partitions[0]->GetLength(), 40u * 2048u);
    EXPECT_TRUE(s.messages.isEmpty());
}

} // namespace
