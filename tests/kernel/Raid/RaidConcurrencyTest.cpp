// Several threads reading one assembly at once: the shared mirror turn, block buffer and stripe
// buffer must not mix the data of different requests.
#include <gtest/gtest.h>

#include <QRandomGenerator>

#include <atomic>
#include <thread>
#include <vector>

#include "Kernel/Implementation/Raid/RaidHandle.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

using namespace RaidTest;

namespace {

constexpr std::uint64_t All = cStorage::NoSector;

void HammerReads(CRaidHandle &raid, int threads, int rounds)
{
    std::atomic<int> mismatches{0}, failures{0};
    std::vector<std::thread> pool;
    for (int t = 0; t < threads; ++t) {
        pool.emplace_back([&, t] {
            QRandomGenerator rng(100 + t);
            for (int i = 0; i < rounds; ++i) {
                const std::uint32_t count = 1 + rng.bounded(40);
                const std::uint64_t first = rng.bounded(static_cast<quint32>(raid.GetTotalSectors() - count));
                QByteArray buffer(static_cast<qsizetype>(count * 512), '\0');
                std::uint32_t error = 0;
                if (!raid.ReadSectors(first, count, buffer.data(), error))
                    ++failures;
                else if (buffer != ExpectedSectors(first, count))
                    ++mismatches;
            }
        });
    }
    for (auto &t : pool)
        t.join();
    EXPECT_EQ(failures.load(), 0);
    EXPECT_EQ(mismatches.load(), 0);
}

} // namespace

TEST(RaidConcurrency, ParityRebuildAndBlockBufferUnderParallelReaders)
{
    // Left-asymmetric parity over four members, stripe 8, member 2 missing: every third chunk is
    // rebuilt through the shared stripe buffer.
    constexpr std::uint32_t N = 4, Stripe = 8, Rows = 32;
    std::vector<std::unique_ptr<MemStorage>> members;
    for (std::uint32_t i = 0; i < N; ++i)
        members.push_back(std::make_unique<MemStorage>(Rows * Stripe));
    for (std::uint64_t row = 0; row < Rows; ++row) {
        const std::uint32_t parity = N - 1 - row % N;
        for (std::uint32_t d = 0; d < N - 1; ++d) {
            const std::uint32_t disk = d < parity ? d : d + 1;
            for (std::uint32_t o = 0; o < Stripe; ++o) {
                std::uint8_t *data = members[disk]->Sector(row * Stripe + o);
                FillSector(data, (row * (N - 1) + d) * Stripe + o);
                std::uint8_t *p = members[parity]->Sector(row * Stripe + o);
                for (int b = 0; b < 512; ++b)
                    p[b] ^= data[b];
            }
        }
    }
    std::uint64_t total = 0;
    CRaidHandle parity(0, 0, 5, {members[0].get(), members[1].get(), nullptr, members[3].get()}, {0, 0, 0, 0},
                       {All, All, Rows * Stripe, All}, 512, Stripe, total);
    ASSERT_EQ(total, std::uint64_t(Rows) * Stripe * (N - 1));
    HammerReads(parity, 4, 300);

    // One member read in blocks of 2048 bytes: every request refills the shared block buffer.
    MemStorage disk(1024);
    for (std::uint64_t s = 0; s < 1024; ++s)
        FillSector(disk.Sector(s), s);
    CRaidHandle blocks(0, 0, 1, {&disk}, {0}, {All}, 512, 2048, total);
    ASSERT_EQ(total, 1024u);
    HammerReads(blocks, 4, 300);

    // A mirror whose first copy fails every read: the turn moves on under all threads.
    MemStorage a(1024), b(1024);
    for (std::uint64_t s = 0; s < 1024; ++s) {
        FillSector(a.Sector(s), s);
        FillSector(b.Sector(s), s);
    }
    a.failReads = true;
    CRaidHandle mirror(0, 0, 4, {&a, &b}, {0, 0}, {All, All}, 512, 0, total);
    HammerReads(mirror, 4, 300);
}
