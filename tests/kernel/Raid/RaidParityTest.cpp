// Striping with rotating parity: members laid out by the tests in each of the four parity
// arrangements, read whole and in pieces, then with each member missing or unreadable in turn.
#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "Kernel/Implementation/Raid/RaidHandle.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

using namespace RaidTest;

namespace {

constexpr std::uint64_t All = cStorage::NoSector;

// Members of a parity assembly whose assembly sector s holds FillSector(s).
struct ParitySet
{
    std::vector<std::unique_ptr<MemStorage>> members;
    QList<cStorage *> list;
    QList<std::uint64_t> starts;
    QList<std::uint64_t> lengths;
    std::uint64_t dataSectors = 0;

    // Parity on the last member moving down (left) or on the first moving up (right); data either
    // in member order skipping the parity (asymmetric) or starting after it (symmetric).
    ParitySet(std::uint32_t layout, std::uint32_t n, std::uint32_t stripe, std::uint64_t rows,
              std::uint64_t start)
    {
        const bool left = layout == 5 || layout == 6;
        const bool symmetric = layout == 6 || layout == 8;
        for (std::uint32_t i = 0; i < n; ++i) {
            members.push_back(std::make_unique<MemStorage>(start + rows * stripe + 3));
            list.append(members.back().get());
            starts.append(start);
            lengths.append(All);
        }
        for (std::uint64_t row = 0; row < rows; ++row) {
            const std::uint32_t parity = left ? n - 1 - row % n : row % n;
            for (std::uint32_t d = 0; d < n - 1; ++d) {
                const std::uint32_t disk = symmetric ? (parity + 1 + d) % n : (d < parity ? d : d + 1);
                for (std::uint32_t o = 0; o < stripe; ++o) {
                    const std::uint64_t sector = (row * (n - 1) + d) * stripe + o;
                    std::uint8_t *data = members[disk]->Sector(start + row * stripe + o);
                    FillSector(data, sector);
                    std::uint8_t *p = members[parity]->Sector(start + row * stripe + o);
                    for (int b = 0; b < 512; ++b)
                        p[b] ^= data[b];
                }
            }
        }
        dataSectors = rows * (n - 1) * stripe;
    }
};

QByteArray Read(CRaidHandle &raid, std::uint64_t first, std::uint32_t count, bool &ok)
{
    QByteArray out(static_cast<qsizetype>(std::uint64_t(count) * 512), '\x55');
    std::uint32_t error = 0;
    ok = raid.ReadSectors(first, count, out.data(), error);
    return out;
}

void ExpectReadsEverything(CRaidHandle &raid, std::uint64_t total, const char *what)
{
    bool ok = false;
    EXPECT_EQ(Read(raid, 0, static_cast<std::uint32_t>(total), ok), ExpectedSectors(0, total)) << what;
    EXPECT_TRUE(ok) << what;
    for (std::uint64_t first : {1u, 15u, 16u, 31u, 47u, 100u})
        for (std::uint32_t count : {1u, 3u, 16u, 33u}) {
            if (first + count > total)
                continue;
            EXPECT_EQ(Read(raid, first, count, ok), ExpectedSectors(first, count))
                << what << " " << first << "+" << count;
            EXPECT_TRUE(ok);
        }
}

} // namespace

TEST(RaidParity, LeftSymmetricPlacesChunksAsDocumented)
{
    // Three members, stripe 128: sector 0 on member 0, 128 on member 1 (row 0 parity on member 2),
    // 256 on member 2 and 384 on member 0 (row 1 parity on member 1).
    const RaidPlace s0 = PlaceParity(6, 0, 3, 128), s128 = PlaceParity(6, 128, 3, 128);
    const RaidPlace s256 = PlaceParity(6, 256, 3, 128), s384 = PlaceParity(6, 384, 3, 128);
    EXPECT_EQ(s0.member, 0u);
    EXPECT_EQ(s128.member, 1u);
    EXPECT_EQ(s0.parity, 2u);
    EXPECT_EQ(s256.member, 2u);
    EXPECT_EQ(s384.member, 0u);
    EXPECT_EQ(s256.parity, 1u);
    EXPECT_EQ(s384.memberSector, 128u);
    EXPECT_EQ(PlaceParity(6, 130, 3, 128).leftInChunk, 126u);

    ParitySet set(6, 3, 128, 3, 0);
    std::uint64_t total = 0;
    CRaidHandle raid(0, 0, 6, set.list, set.starts, set.lengths, 512, 128, total);
    ASSERT_EQ(total, set.dataSectors);
    set.members[1]->reads = 0;
    bool ok = false;
    EXPECT_EQ(Read(raid, 128, 1, ok), ExpectedSectors(128, 1));
    EXPECT_EQ(set.members[1]->reads, 1);
}

TEST(RaidParity, EveryArrangementReadsAndRebuildsEachMissingMember)
{
    for (std::uint32_t layout = 5; layout <= 8; ++layout) {
        for (std::uint32_t n : {3u, 4u, 5u}) {
            const std::uint32_t stripe = 16;
            ParitySet set(layout, n, stripe, 2 * n + 1, 6);
            const std::string what = "layout " + std::to_string(layout) + " with " + std::to_string(n);
            std::uint64_t total = 0;
            CRaidHandle raid(0, 0, layout, set.list, set.starts, set.lengths, 512, stripe, total);
            ASSERT_EQ(total, set.dataSectors) << what;
            ExpectReadsEverything(raid, total, what.c_str());

            for (std::uint32_t gone = 0; gone < n; ++gone) {
                // Missing from the start: the member list names no storage there.
                QList<cStorage *> list = set.list;
                QList<std::uint64_t> lengths = set.lengths;
                list[gone] = nullptr;
                lengths[gone] = set.members[0]->GetTotalSectors() - 6;
                CRaidHandle degraded(0, 0, layout, list, set.starts, lengths, 512, stripe, total);
                ASSERT_EQ(total, set.dataSectors) << what << " missing " << gone;
                ExpectReadsEverything(degraded, total, (what + " missing " + std::to_string(gone)).c_str());

                // Present but unreadable.
                set.members[gone]->failReads = true;
                ExpectReadsEverything(raid, total, (what + " failing " + std::to_string(gone)).c_str());
                // A second failing member cannot be made up for.
                set.members[(gone + 1) % n]->failReads = true;
                bool ok = true;
                std::uint32_t error = 0;
                QByteArray buffer(static_cast<qsizetype>(total * 512), '\0');
                EXPECT_FALSE(raid.ReadSectors(0, static_cast<std::uint32_t>(total), buffer.data(), error));
                EXPECT_EQ(error, SystemError::Crc);
                (void)ok;
                set.members[gone]->failReads = false;
                set.members[(gone + 1) % n]->failReads = false;
            }
        }
    }
}

TEST(RaidParity, WritesAreRefusedAndDataIsUntouched)
{
    ParitySet set(5, 3, 8, 4, 0);
    std::uint64_t total = 0;
    CRaidHandle raid(0, 0, 5, set.list, set.starts, set.lengths, 512, 8, total);
    ASSERT_GT(total, 0u);
    const QByteArray before = set.members[0]->Data();
    QByteArray data(512, '\x77');
    std::uint32_t error = 0;
    EXPECT_FALSE(raid.WriteSectors(0, 1, data.constData(), error));
    EXPECT_EQ(error, SystemError::InvalidFunction);
    EXPECT_FALSE(raid.WriteBytes(10, 4, "abcd", error));
    EXPECT_EQ(set.members[0]->Data(), before);
    EXPECT_EQ(set.members[0]->writes, 0);
}
