// RAID assemblies without parity: construction rules, single member, concatenation, striping and
// mirroring, each read and written against member data laid out by the tests.
#include <gtest/gtest.h>

#include <QTemporaryDir>

#include <memory>
#include <vector>

#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Raid/RaidHandle.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

using namespace RaidTest;
#include "tests/common/TestUtil.h"

namespace {

constexpr std::uint64_t All = cStorage::NoSector;

QByteArray ReadAll(CRaidHandle &raid, std::uint64_t first, std::uint32_t count, bool *ok = nullptr)
{
    QByteArray out(static_cast<qsizetype>(std::uint64_t(count) * raid.GetBytesPerSector()), '\x55');
    std::uint32_t error = 0;
    const bool r = raid.ReadSectors(first, count, out.data(), error);
    if (ok)
        *ok = r;
    return out;
}

} // namespace

TEST(RaidConstruction, RefusesWhatCannotBeAssembled)
{
    MemStorage a(100), b(100), c(64), big(100, 4096);
    std::uint64_t total = 1;
    // A member named twice.
    CRaidHandle dup(0, 0, 2, {&a, &a}, {0, 0}, {All, All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    EXPECT_FALSE(dup.IsValid());
    // A start at the member's end.
    CRaidHandle start(0, 0, 2, {&a, &b}, {0, 100}, {All, All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    // Striping and mirroring need two members, all present; parity three, one missing at most.
    CRaidHandle stripeOne(0, 0, 3, {&a}, {0}, {All}, 512, 8, total);
    EXPECT_EQ(total, 0u);
    CRaidHandle mirrorMissing(0, 0, 4, {&a, nullptr}, {0, 0}, {All, All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    CRaidHandle parityTwoMissing(0, 0, 5, {&a, nullptr, nullptr}, {0, 0, 0}, {All, 100, 100}, 512, 8, total);
    EXPECT_EQ(total, 0u);
    // Striped layouts need a stripe; members with other sector sizes do not fit.
    CRaidHandle noStripe(0, 0, 3, {&a, &b}, {0, 0}, {All, All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    CRaidHandle mixed(0, 0, 2, {&a, &big}, {0, 0}, {All, All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    CRaidHandle none(0, 0, 0, {&a}, {0}, {All}, 512, 0, total);
    EXPECT_EQ(total, 0u);
    std::uint32_t error = 0;
    char buf[512];
    EXPECT_FALSE(none.ReadSectors(0, 1, buf, error));
    EXPECT_EQ(error, SystemError::InvalidFunction);

    // Totals: the common length is the smallest usable length rounded down to whole stripes.
    CRaidHandle striped(7, 9, 3, {&a, &b, &c}, {0, 10, 0}, {All, All, All}, 512, 16, total);
    EXPECT_EQ(total, 3u * 64); // min(100, 90, 64) = 64, four stripes of 16
    EXPECT_EQ(striped.GetMemberLength(1), 64u);
    EXPECT_EQ(striped.GetOwner(0), 7u);
    EXPECT_EQ(striped.GetOwner(1), 9u);
    CRaidHandle stripedOdd(0, 0, 3, {&a, &b}, {0, 0}, {All, All}, 512, 30, total);
    EXPECT_EQ(total, 2u * 90);
    CRaidHandle mirror(0, 0, 4, {&a, &b, &c}, {0, 0, 0}, {All, 50, All}, 512, 0, total);
    EXPECT_EQ(total, 50u);
    CRaidHandle parity(0, 0, 6, {&a, &b, nullptr}, {0, 0, 0}, {All, All, 60}, 512, 16, total);
    EXPECT_EQ(total, 2u * 48);
    CRaidHandle concat(0, 0, 2, {&a, &b}, {0, 30}, {All, 20}, 512, 0, total);
    EXPECT_EQ(total, 120u);
}

TEST(RaidConcatenation, MembersFollowEachOtherAcrossFilesAndPartitions)
{
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());
    // Two file-backed members of 100 and 50 sectors holding the assembly's sectors in order.
    QByteArray first = ExpectedSectors(0, 100), second = ExpectedSectors(100, 50);
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("a.img"), first));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("b.img"), QByteArray(8 * 512, '\xEE') + second));
    FileStorage a(dir.filePath("a.img")), b(dir.filePath("b.img"));
    ASSERT_EQ(a.GetTotalSectors(), 100u);
    std::uint64_t total = 0;
    CRaidHandle raid(0, 0, 2, {&a, &b}, {0, 8}, {All, All}, 512, 0, total);
    ASSERT_EQ(total, 150u);
    EXPECT_EQ(raid.GetSize(), 150u * 512);

    a.reads = b.reads = 0;
    bool ok = false;
    EXPECT_EQ(ReadAll(raid, 99, 1, &ok), ExpectedSectors(99, 1));
    EXPECT_TRUE(ok);
    EXPECT_EQ(a.reads, 1);
    EXPECT_EQ(b.reads, 0);
    EXPECT_EQ(ReadAll(raid, 100, 1, &ok), ExpectedSectors(100, 1));
    EXPECT_EQ(b.reads, 1);
    EXPECT_EQ(ReadAll(raid, 0, 150, &ok), ExpectedSectors(0, 150));
    EXPECT_TRUE(ok);

    // A write across the boundary lands on both members.
    QByteArray data(4 * 512, '\xA5');
    std::uint32_t error = 0;
    EXPECT_TRUE(raid.WriteSectors(98, 4, data.constData(), error));
    const QByteArray af = TestUtil::readFile(dir.filePath("a.img")),
                     bf = TestUtil::readFile(dir.filePath("b.img"));
    EXPECT_EQ(af.mid(98 * 512), QByteArray(2 * 512, '\xA5'));
    EXPECT_EQ(bf.mid(8 * 512, 2 * 512), QByteArray(2 * 512, '\xA5'));
    EXPECT_EQ(bf.left(8 * 512), QByteArray(8 * 512, '\xEE'));

    // Past the end: the sectors inside are read, the rest is zeros, and the request fails.
    QByteArray tail = ReadAll(raid, 148, 4, &ok);
    EXPECT_FALSE(ok);
    EXPECT_EQ(tail.left(2 * 512), ExpectedSectors(148, 2));
    EXPECT_EQ(tail.mid(2 * 512), QByteArray(2 * 512, '\0'));

    // Partitions of one disk are members like any other storage.
    MemStorage disk(200);
    std::memcpy(disk.Sector(20), second.constData(), second.size());
    std::memcpy(disk.Sector(120), first.constData(), 80 * 512);
    CPartition p1(nullptr, &disk, nullptr, 7, 120, 80), p2(nullptr, &disk, nullptr, 7, 20, 50);
    CRaidHandle parts(0, 0, 2, {&p1, &p2}, {0, 0}, {100, All}, 512, 0, total);
    ASSERT_EQ(total, 130u); // the first partition holds only 80 sectors
    EXPECT_EQ(ReadAll(parts, 0, 80), ExpectedSectors(0, 80));
    EXPECT_EQ(ReadAll(parts, 80, 50), ExpectedSectors(100, 50));
}

TEST(RaidStriping, ChunksRotateOverMembers)
{
    constexpr std::uint32_t N = 3, Stripe = 8, Start = 4;
    std::vector<std::unique_ptr<MemStorage>> members;
    QList<cStorage *> list;
    for (std::uint32_t i = 0; i < N; ++i) {
        members.push_back(std::make_unique<MemStorage>(Start + 40));
        list.append(members.back().get());
    }
    // Chunk c goes to member c mod N, row c / N.
    const std::uint64_t rows = 40 / Stripe;
    for (std::uint64_t s = 0; s < N * rows * Stripe; ++s) {
        const std::uint64_t chunk = s / Stripe;
        FillSector(members[chunk % N]->Sector(Start + (chunk / N) * Stripe + s % Stripe), s);
    }
    std::uint64_t total = 0;
    CRaidHandle raid(0, 0, 3, list, {Start, Start, Start}, {All, All, All}, 512, Stripe, total);
    ASSERT_EQ(total, N * 40);
    bool ok = false;
    EXPECT_EQ(ReadAll(raid, 0, total, &ok), ExpectedSectors(0, total));
    EXPECT_TRUE(ok);
    for (std::uint64_t first : {0u, 5u, 7u, 8u, 23u, 61u})
        for (std::uint32_t count : {1u, 2u, 9u, 17u})
            EXPECT_EQ(ReadAll(raid, first, count), ExpectedSectors(first, count)) << first << "+" << count;

    // Bytes across a chunk boundary, and a write that lands in two members.
    QByteArray bytes(100, '\0');
    std::uint32_t error = 0;
    EXPECT_TRUE(raid.ReadBytes(8 * 512 - 50, 100, bytes.data(), error));
    EXPECT_EQ(bytes, ExpectedSectors(7, 2).mid(512 - 50, 100));
    EXPECT_TRUE(raid.WriteBytes(8 * 512 - 2, 4, "WXYZ", error));
    EXPECT_EQ(QByteArray(reinterpret_cast<char *>(members[0]->Sector(Start + 7)) + 510, 2), "WX");
    EXPECT_EQ(QByteArray(reinterpret_cast<char *>(members[1]->Sector(Start)), 2), "YZ");
    QByteArray back(4, '\0');
    EXPECT_TRUE(raid.ReadBytes(8 * 512 - 2, 4, back.data(), error));
    EXPECT_EQ(back, "WXYZ");

    // A failing member fails the request, with its error, while the other chunks are still read.
    members[1]->failReads = true;
    QByteArray part = ReadAll(raid, 0, 24, &ok);
    EXPECT_FALSE(ok);
    EXPECT_EQ(part.mid(16 * 512), ExpectedSectors(16, 8));
}

TEST(RaidMirroring, ReadsTakeTurnsAndSurviveAFailingCopy)
{
    MemStorage a(64), b(64), c(64);
    for (std::uint64_t s = 0; s < 64; ++s) {
        FillSector(a.Sector(s), s);
        FillSector(b.Sector(s), s);
        FillSector(c.Sector(s), s);
    }
    std::uint64_t total = 0;
    CRaidHandle two(0, 0, 4, {&a, &b}, {0, 0}, {All, All}, 512, 0, total);
    ASSERT_EQ(total, 64u);
    // The turn starts after the last member: member 0 serves the first read, then member 1.
    EXPECT_EQ(ReadAll(two, 3, 1), ExpectedSectors(3, 1));
    EXPECT_EQ(a.reads, 1);
    EXPECT_EQ(b.reads, 0);
    EXPECT_EQ(ReadAll(two, 4, 2), ExpectedSectors(4, 2));
    EXPECT_EQ(b.reads, 1);
    for (int i = 0; i < 10; ++i)
        ReadAll(two, i, 1);
    EXPECT_EQ(a.reads, 6);
    EXPECT_EQ(b.reads, 6);

    // The member whose turn it is fails: the other copy serves the read.
    b.failReads = true;
    bool ok = false;
    EXPECT_EQ(ReadAll(two, 10, 3, &ok), ExpectedSectors(10, 3));
    EXPECT_TRUE(ok);
    EXPECT_EQ(ReadAll(two, 11, 3, &ok), ExpectedSectors(11, 3));
    EXPECT_TRUE(ok);
    a.failReads = true;
    ReadAll(two, 0, 1, &ok);
    EXPECT_FALSE(ok);
    a.failReads = b.failReads = false;

    // Writes go to every copy; one failing copy fails the write, the others still receive it.
    CRaidHandle three(0, 0, 4, {&a, &b, &c}, {0, 0, 0}, {All, All, All}, 512, 0, total);
    QByteArray data(2 * 512, '\x3C');
    std::uint32_t error = 0;
    EXPECT_TRUE(three.WriteSectors(20, 2, data.constData(), error));
    for (MemStorage *m : {&a, &b, &c})
        EXPECT_EQ(m->Data().mid(20 * 512, 2 * 512), data);
    b.failWrites = true;
    QByteArray other(512, '\x11');
    EXPECT_FALSE(three.WriteSectors(30, 1, other.constData(), error));
    EXPECT_EQ(error, SystemError::WriteFault);
    EXPECT_EQ(a.Data().mid(30 * 512, 512), other);
    EXPECT_EQ(c.Data().mid(30 * 512, 512), other);
}

TEST(RaidSingleMember, BlocksAndByteOffset)
{
    MemStorage disk(100);
    for (std::uint64_t s = 0; s < 100; ++s)
        FillSector(disk.Sector(s), s);
    std::uint64_t total = 0;
    // Blocks of 4096 bytes from member sector 2.
    CRaidHandle blocks(0, 0, 1, {&disk}, {2}, {All}, 512, 4096, total);
    ASSERT_EQ(total, 98u);
    disk.reads = 0;
    EXPECT_EQ(ReadAll(blocks, 1, 2), ExpectedSectors(3, 2));
    EXPECT_EQ(ReadAll(blocks, 3, 4), ExpectedSectors(5, 4)); // same block, no new read
    EXPECT_EQ(disk.reads, 1);
    EXPECT_EQ(ReadAll(blocks, 6, 12), ExpectedSectors(8, 12)); // across two more blocks
    EXPECT_EQ(disk.reads, 3);
    // The last block is shorter than a block: it reads what the member has.
    EXPECT_EQ(ReadAll(blocks, 96, 2), ExpectedSectors(98, 2));
    std::uint32_t error = 0;
    QByteArray data(512, '\0');
    EXPECT_FALSE(blocks.WriteSectors(0, 1, data.constData(), error));
    EXPECT_EQ(error, SystemError::AccessDenied);
    // A failed refill forgets the block.
    disk.failReads = true;
    bool ok = true;
    ReadAll(blocks, 0, 1, &ok);
    EXPECT_FALSE(ok);
    disk.failReads = false;
    EXPECT_EQ(ReadAll(blocks, 7, 1), ExpectedSectors(9, 1));

    // By byte position: sectors of the assembly start 100 bytes into the member.
    CRaidHandle bytes(0, 0, 1, {&disk}, {0}, {All}, 512, 0, total, 100);
    ASSERT_EQ(total, (100u * 512 - 100) / 512);
    EXPECT_EQ(ReadAll(bytes, 10, 3), disk.Data().mid(100 + 10 * 512, 3 * 512));
}
