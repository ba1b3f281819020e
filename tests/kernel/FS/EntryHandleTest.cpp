// The packed run list of an entry: its exact byte form, merging, mapping and transfers.
#include "Kernel/Implementation/FS/EntryHandle.h"
#include "tests/kernel/FS/VolumeTestStorage.h"

#include <gtest/gtest.h>

namespace {

QByteArray Bytes(std::initializer_list<int> values)
{
    QByteArray out;
    for (int v : values)
        out.append(static_cast<char>(v));
    return out;
}

TEST(EntryHandlePacked, ByteCountsFollowTheValues)
{
    CEntryHandle h(nullptr, 9);
    ASSERT_TRUE(h.AddRun(0, 1));                        // start 0 still takes one byte
    ASSERT_TRUE(h.AddRun(0x100, 0xFF));                 // not contiguous with the first
    ASSERT_TRUE(h.AddRun(CEntryHandle::Sparse, 0x100)); // sparse: no start bytes
    ASSERT_TRUE(h.AddRun(0x123456789Aull, 0x10000));
    EXPECT_EQ(h.GetRuns(), Bytes({0x11, 0x01, 0x00,       //
                                  0x21, 0xFF, 0x00, 0x01, //
                                  0x02, 0x00, 0x01,       //
                                  0x53, 0x00, 0x00, 0x01, 0x9A, 0x78, 0x56, 0x34, 0x12}));
    EXPECT_EQ(h.GetTotalBytes(), (1ull + 0xFF + 0x100 + 0x10000) << 9);
    EXPECT_EQ(h.GetRunCount(), 4);
}

TEST(EntryHandlePacked, ContiguousAndSparseRunsMerge)
{
    CEntryHandle h(nullptr, 0);
    ASSERT_TRUE(h.AddRun(10, 5));
    ASSERT_TRUE(h.AddRun(15, 250)); // contiguous: one run of 255
    EXPECT_EQ(h.GetRunCount(), 1);
    EXPECT_EQ(h.GetRuns(), Bytes({0x11, 0xFF, 0x0A}));
    ASSERT_TRUE(h.AddRun(265, 1)); // grows past one byte of length
    EXPECT_EQ(h.GetRuns(), Bytes({0x12, 0x00, 0x01, 0x0A}));
    ASSERT_TRUE(h.AddRun(CEntryHandle::Sparse, 3));
    ASSERT_TRUE(h.AddRun(CEntryHandle::Sparse, 4));
    EXPECT_EQ(h.GetRunCount(), 2);
    ASSERT_TRUE(h.AddRun(7, 1)); // after a hole: a new run even though 7 + ... is unrelated
    ASSERT_TRUE(h.AddRun(9, 1)); // a gap: no merge
    EXPECT_EQ(h.GetRunCount(), 4);
    std::uint64_t start = 0, length = 0;
    ASSERT_TRUE(h.GetRun(1, start, length));
    EXPECT_EQ(start, CEntryHandle::Sparse);
    EXPECT_EQ(length, 7u);
    EXPECT_EQ(h.GetTotalBytes(), 256u + 7 + 1 + 1);
}

TEST(EntryHandlePacked, RefusesEmptyAndOverflowingRuns)
{
    CEntryHandle h(nullptr, 12);
    EXPECT_FALSE(h.AddRun(1, 0));
    EXPECT_FALSE(h.AddRun(1, ~0ull >> 4)); // its bytes would not fit in 64 bits
    EXPECT_TRUE(h.GetRuns().isEmpty());
    EXPECT_TRUE(h.AddRun(1, 1ull << 40));
    EXPECT_FALSE(h.AddRun(CEntryHandle::Sparse, ~0ull >> 12));
    EXPECT_EQ(h.GetTotalBytes(), 1ull << 52);
}

TEST(EntryHandlePacked, StoredStringsAreCheckedWhenLoaded)
{
    CEntryHandle h(nullptr, 0);
    EXPECT_TRUE(h.SetRuns(Bytes({0x11, 0x04, 0x02, 0x01, 0x03, 0x00})));
    EXPECT_EQ(h.GetTotalBytes(), 7u);
    EXPECT_EQ(h.MapOffset(5), CEntryHandle::None); // in the hole
    EXPECT_FALSE(h.SetRuns(Bytes({0x19, 0x01})));  // length of nine bytes
    EXPECT_EQ(h.GetTotalBytes(), 0u);
    EXPECT_FALSE(h.SetRuns(Bytes({0x24, 0x01, 0x02}))); // cut short
    EXPECT_FALSE(h.SetRuns(Bytes({0x91, 0x01, 0, 0, 0, 0, 0, 0, 0, 0, 0})));
}

TEST(EntryHandleMap, OffsetsMapThroughRuns)
{
    CEntryHandle h(nullptr, 12); // 4 KiB units
    h.AddRun(100, 2);
    h.AddRun(CEntryHandle::Sparse, 1);
    h.AddRun(50, 1);
    EXPECT_EQ(h.MapOffset(0), 100u * 4096);
    EXPECT_EQ(h.MapOffset(8191), 100u * 4096 + 8191);
    EXPECT_EQ(h.MapOffset(8192), CEntryHandle::None);
    EXPECT_EQ(h.MapOffset(3 * 4096 + 5), 50u * 4096 + 5);
    EXPECT_EQ(h.MapOffset(4 * 4096), CEntryHandle::None);
}

TEST(EntryHandleMap, AppendNeedsTheSameUnit)
{
    CEntryHandle a(nullptr, 9), b(nullptr, 9), c(nullptr, 12);
    a.AddRun(10, 2);
    b.AddRun(12, 3); // continues a's last run
    b.AddRun(40, 1);
    c.AddRun(1, 1);
    EXPECT_TRUE(a.AppendRuns(b));
    EXPECT_EQ(a.GetRunCount(), 2);
    EXPECT_EQ(a.GetTotalBytes(), 6u * 512);
    EXPECT_FALSE(a.AppendRuns(c));
    EXPECT_EQ(a.GetTotalBytes(), 6u * 512);
}

TEST(EntryHandleTransfer, ReadsRunsAndHolesThroughTheCache)
{
    QByteArray disk(64 * 512, 0);
    for (int i = 0; i < disk.size(); ++i)
        disk[i] = static_cast<char>(i / 512 + 1);
    MemoryStorage storage(disk);
    CEntryHandle h(&storage, 9);
    h.AddRun(5, 2);
    h.AddRun(CEntryHandle::Sparse, 1);
    h.AddRun(1, 1);
    QByteArray out(4 * 512, 'x');
    std::uint32_t error = 0;
    ASSERT_TRUE(h.Read(0, out.size(), out.data(), error));
    EXPECT_EQ(out[0], char(6));
    EXPECT_EQ(out[1023], char(7));
    EXPECT_EQ(out[1024], char(0));
    EXPECT_EQ(out[1535], char(0));
    EXPECT_EQ(out[1536], char(2));
    // A second read inside the cached piece does not touch the storage.
    const int reads = storage.reads;
    char one = 0;
    ASSERT_TRUE(h.Read(600, 1, &one, error));
    EXPECT_EQ(one, char(7));
    EXPECT_EQ(storage.reads, reads);
    // Past the end fails.
    EXPECT_FALSE(h.Read(2047, 2, &one, error));
}

TEST(EntryHandleTransfer, CacheShiftIsClampedBeforeTransfers)
{
    MemoryStorage storage(QByteArray(1 << 16, 'a'));
    CEntryHandle h(&storage, 12);
    h.AddRun(0, 16);
    h.SetCacheShift(3);
    char c = 0;
    std::uint32_t error = 0;
    ASSERT_TRUE(h.Read(100, 1, &c, error));
    EXPECT_EQ(h.GetCacheShift(), 12);
    h.SetCacheShift(40);
    ASSERT_TRUE(h.Read(5000, 1, &c, error));
    EXPECT_EQ(h.GetCacheShift(), 31);
    EXPECT_EQ(c, 'a');
}

TEST(EntryHandleTransfer, WritesGoThroughAndRefuseHoles)
{
    MemoryStorage storage(QByteArray(16 * 512, 0));
    CEntryHandle h(&storage, 9);
    h.AddRun(3, 1);
    h.AddRun(CEntryHandle::Sparse, 1);
    std::uint32_t error = 0;
    char c = 0;
    ASSERT_TRUE(h.Read(0, 1, &c, error)); // fills the cache
    const QByteArray data(10, 'z');
    ASSERT_TRUE(h.Write(100, data.size(), data.constData(), error));
    EXPECT_EQ(storage.Bytes().mid(3 * 512 + 100, 10), data);
    ASSERT_TRUE(h.Read(100, 1, &c, error)); // the cache does not hide the write
    EXPECT_EQ(c, 'z');
    EXPECT_FALSE(h.Write(600, 1, data.constData(), error));
}

} // namespace
