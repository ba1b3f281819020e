// The sector cache on its own: the least recently used order across finds, removals and pins,
// and the reuse of an evicted sector's buffer.
#include <gtest/gtest.h>

#include <random>
#include <vector>

#include "hexeditor/SectorCache.h"

using namespace HexEditor;

namespace {

CachedSector sectorOf(std::uint64_t n, char fill = 'x', bool readOk = true)
{
    CachedSector s;
    s.number = n;
    s.readOk = readOk;
    s.data = QByteArray(512, fill);
    return s;
}

std::vector<std::uint64_t> cached(const SectorCache &c)
{
    std::vector<std::uint64_t> v;
    c.forEach([&](const CachedSector &s) { v.push_back(s.number); });
    std::sort(v.begin(), v.end());
    return v;
}

} // namespace

TEST(SectorCacheOrder, EvictsTheLeastRecentlyUsedAfterFindsAndRemovals)
{
    SectorCache c(3 * 512);
    for (std::uint64_t n = 1; n <= 3; ++n)
        c.insert(sectorOf(n));
    ASSERT_NE(c.find(1), nullptr); // 1 is now the newest: 2 is the oldest
    c.insert(sectorOf(4));
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{1, 3, 4}));

    // Removing the newest, the oldest and a middle entry keeps the order of the rest.
    c.insert(sectorOf(5)); // evicts 3
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{1, 4, 5}));
    c.remove(5); // newest
    c.remove(1); // oldest
    c.insert(sectorOf(6));
    c.insert(sectorOf(7));
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{4, 6, 7}));
    c.remove(6); // middle
    c.insert(sectorOf(8));
    c.insert(sectorOf(9)); // evicts 4, the oldest
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{7, 8, 9}));
    EXPECT_EQ(c.bytes(), 3u * 512);
    EXPECT_EQ(c.evictableBytes(), 3u * 512);

    // Peeking does not change the order; replacing a sector makes it the newest.
    ASSERT_NE(c.peek(7), nullptr);
    c.insert(sectorOf(8, 'y'));
    c.insert(sectorOf(10)); // evicts 7
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{8, 9, 10}));
    EXPECT_EQ(c.peek(8)->data, QByteArray(512, 'y'));

    c.clear();
    EXPECT_EQ(c.count(), 0u);
    c.insert(sectorOf(11));
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{11}));
}

TEST(SectorCacheOrder, PinnedSectorsLeaveTheOrderAndComeBack)
{
    SectorCache c(2 * 512);
    c.insert(sectorOf(1));
    c.insert(sectorOf(2, 'x', false)); // unreadable: pinned
    c.insert(sectorOf(3));
    CachedSector *one = c.find(1);
    ASSERT_TRUE(one);
    one->mark(0, 4, true);
    c.refresh(1); // pinned now
    EXPECT_EQ(c.pinnedCount(), 2u);
    for (std::uint64_t n = 4; n <= 9; ++n)
        c.insert(sectorOf(n));
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{1, 2, 8, 9}));
    EXPECT_EQ(c.modifiedSectors(), (std::vector<std::uint64_t>{1}));

    // Without its marks the sector is the newest evictable one; the bound applies at once.
    c.find(1)->mark(0, 4, false);
    c.refresh(1);
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{1, 2, 9}));
    c.insert(sectorOf(10));
    EXPECT_EQ(cached(c), (std::vector<std::uint64_t>{1, 2, 10}));
    EXPECT_EQ(c.evictableBytes(), 2u * 512);
}

TEST(SectorCacheOrder, MatchesASimpleModelUnderRandomUse)
{
    SectorCache c(16 * 512);
    std::vector<std::uint64_t> model; // front: newest
    std::mt19937 rng(7);
    for (int step = 0; step < 20000; ++step) {
        const std::uint64_t n = rng() % 40;
        const auto at = std::find(model.begin(), model.end(), n);
        switch (rng() % 3) {
        case 0: // find
            ASSERT_EQ(c.find(n) != nullptr, at != model.end()) << step;
            if (at != model.end()) {
                model.erase(at);
                model.insert(model.begin(), n);
            }
            break;
        case 1: // insert
            c.insert(sectorOf(n));
            if (at != model.end())
                model.erase(at);
            model.insert(model.begin(), n);
            if (model.size() > 16)
                model.pop_back();
            break;
        default: // remove
            c.remove(n);
            if (at != model.end())
                model.erase(at);
            break;
        }
        std::vector<std::uint64_t> sorted = model;
        std::sort(sorted.begin(), sorted.end());
        ASSERT_EQ(cached(c), sorted) << "step " << step;
    }
}

TEST(SectorCacheBuffer, AnEvictedBufferIsReusedZeroedUnlessSomeoneHoldsIt)
{
    SectorCache c(512);
    c.insert(sectorOf(1, 'a'));
    const char *first = c.peek(1)->data.constData();
    c.insert(sectorOf(2, 'b')); // evicts 1
    QByteArray reused = c.buffer(512);
    EXPECT_EQ(reused.constData(), first);
    EXPECT_EQ(reused, QByteArray(512, '\0'));
    // Only one spare: the next buffer is new.
    EXPECT_NE(c.buffer(512).constData(), first);

    // A buffer still shared elsewhere is left to its holder.
    const QByteArray held = c.peek(2)->data;
    c.insert(sectorOf(3, 'c')); // evicts 2
    const QByteArray fresh = c.buffer(512);
    EXPECT_NE(fresh.constData(), held.constData());
    EXPECT_EQ(held, QByteArray(512, 'b'));

    // A spare of another size is not handed out.
    c.insert(sectorOf(4, 'd')); // evicts 3
    EXPECT_EQ(c.buffer(4096), QByteArray(4096, '\0'));
}
