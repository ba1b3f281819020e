// Entries: compact names, the compare order, children produced on first use, data through runs.
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "tests/kernel/FS/VolumeTestStorage.h"

#include <gtest/gtest.h>

#include <utility>
#include <vector>

namespace {

class CountingEntry : public CEntry
{
public:
    using CEntry::CEntry;
    int loads = 0;

protected:
    void LoadChildren() override
    {
        ++loads;
        AddChild(std::make_unique<CEntry>(GetVolume(), this, "child", 9, 0));
    }
};

TEST(VolumeEntry, NamesAreStoredCompactly)
{
    CEntry narrow(nullptr, nullptr, QString::fromUtf8("Caf\xc3\xa9.txt"), 0, 0);
    const QByteArray n = narrow.GetCompactName();
    ASSERT_EQ(n.size(), 2 + 8);
    EXPECT_EQ(static_cast<std::uint8_t>(n[0]), 8);
    EXPECT_EQ(static_cast<std::uint8_t>(n[1]), 0); // one byte per character
    EXPECT_EQ(static_cast<std::uint8_t>(n[5]), 0xE9);
    EXPECT_EQ(narrow.GetName(), QString::fromUtf8("Caf\xc3\xa9.txt"));
    CEntry wide(nullptr, nullptr,
                QString::fromUtf8("\xe6\x96\x87"
                                  "a"),
                0, 0);
    const QByteArray w = wide.GetCompactName();
    ASSERT_EQ(w.size(), 2 + 4);
    EXPECT_EQ(static_cast<std::uint8_t>(w[1]), 0x80);
    EXPECT_EQ(static_cast<std::uint8_t>(w[0]), 2);
    EXPECT_EQ(wide.GetName(), QString::fromUtf8("\xe6\x96\x87"
                                                "a"));
    // A name of 40,000 characters keeps them all; the header keeps the low 15 bits.
    CEntry longName(nullptr, nullptr, QString(40000, QChar('x')), 0, 0);
    EXPECT_EQ(longName.GetName().size(), 40000);
    EXPECT_EQ(static_cast<std::uint8_t>(longName.GetCompactName()[1]) & 0x7F, (40000 >> 8) & 0x7F);
}

TEST(VolumeEntry, CompareOrder)
{
    CEntry folder(nullptr, nullptr, "zeta", 5, CEntry::AttrFolder);
    CEntry file(nullptr, nullptr, "alpha", 1, 0);
    CEntry prefix(nullptr, nullptr, "alp", 9, 0);
    CEntry upper(nullptr, nullptr, "Alpha", 9, 0);
    CEntry same(nullptr, nullptr, "alpha", 3, 0);
    EXPECT_EQ(folder.Compare(file), -1);
    EXPECT_EQ(file.Compare(folder), 1);
    EXPECT_EQ(prefix.Compare(file), -1);
    EXPECT_EQ(upper.Compare(file), -1); // case-sensitive, by code unit
    EXPECT_EQ(file.Compare(same), -1);  // lower position first
    EXPECT_EQ(same.Compare(file), 1);
    EXPECT_EQ(file.Compare(file), 0);
}

TEST(VolumeEntry, ChildrenAreMadeOnFirstUseOfFoldersOnly)
{
    CountingEntry folder(nullptr, nullptr, "dir", 0, CEntry::AttrFolder);
    EXPECT_EQ(folder.loads, 0);
    EXPECT_EQ(folder.GetChildCount(), 1u);
    EXPECT_EQ(folder.GetChildCount(), 1u);
    EXPECT_EQ(folder.loads, 1);
    ASSERT_TRUE(folder.GetChild(0));
    EXPECT_EQ(static_cast<CEntry *>(folder.GetChild(0))->GetParent(), &folder);
    EXPECT_FALSE(folder.GetChild(1));
    CountingEntry file(nullptr, nullptr, "f", 0, 0);
    EXPECT_EQ(file.GetChildCount(), 0u);
    EXPECT_EQ(file.loads, 0);
}

TEST(VolumeEntry, DataReadsThroughTheRunsOfTheVolume)
{
    QByteArray bytes(64 * 512, 0);
    for (int i = 0; i < bytes.size(); ++i)
        bytes[i] = static_cast<char>(i / 512);
    MemoryStorage medium(bytes);
    VolumeDescription d;
    d.size = bytes.size();
    CVolume volume(&medium, d);
    CEntry e(&volume, nullptr, "file", 10, 0);
    e.GetHandle().SetUnitShift(9);
    e.GetHandle().AddRun(10, 2);
    e.GetHandle().AddRun(CEntryHandle::Sparse, 1);
    e.SetSize(2 * 512 + 100);
    EXPECT_EQ(e.GetSize(), 1124u);
    EXPECT_EQ(e.GetTotalSectors(), 3u);
    QByteArray out(600, 'x');
    std::uint32_t error = 0;
    ASSERT_TRUE(e.ReadBytes(600, 524, out.data(), error));
    EXPECT_EQ(out[0], char(11));
    EXPECT_EQ(out[423], char(11));
    EXPECT_EQ(out[424], char(0)); // the hole
    // Reading past the last sector fills with zeros and fails.
    EXPECT_FALSE(e.ReadBytes(1400, 200, out.data(), error));
    EXPECT_EQ(out[199], char(0));
}

// Every sector of a file reads, the last one with zeros after the size (not what lies after it in
// its cluster), and writing it changes only the file's bytes; past the last sector nothing reads.
TEST(VolumeEntry, LastPartialSectorReadsTheFileThenZerosAndWritesOnlyTheFile)
{
    struct Case
    {
        std::uint64_t size;
        std::vector<std::pair<std::uint64_t, std::uint64_t>> runs; // (cluster or sparse, clusters)
    };
    const Case cases[] = {
        {0, {}},          {1, {{10, 1}}},   {511, {{10, 1}}},
        {512, {{10, 1}}}, {513, {{10, 1}}}, {2500, {{10, 1}, {CEntryHandle::Sparse, 1}, {20, 1}}},
    };
    for (const Case &c : cases) {
        SCOPED_TRACE(c.size);
        QByteArray bytes(64 * 512, 0);
        for (int i = 0; i < bytes.size(); ++i)
            bytes[i] = static_cast<char>(i % 251 + 1);
        MemoryStorage medium(bytes);
        VolumeDescription d;
        d.size = bytes.size();
        CVolume volume(&medium, d);
        CEntry e(&volume, nullptr, "file", 10, 0);
        e.GetHandle().SetUnitShift(10); // clusters of two sectors: a file ends inside one
        for (const auto &run : c.runs)
            e.GetHandle().AddRun(run.first, run.second);
        e.SetSize(c.size);
        // The file's byte at an offset as the runs place it on the medium.
        auto fileByte = [&](std::uint64_t offset, const QByteArray &on) {
            std::uint64_t at = 0;
            for (const auto &run : c.runs) {
                if (offset < at + run.second * 1024)
                    return run.first == CEntryHandle::Sparse ? char(0)
                                                             : on[int(run.first * 1024 + offset - at)];
                at += run.second * 1024;
            }
            return char(0);
        };
        const std::uint64_t sectors = (c.size + 511) / 512;
        ASSERT_EQ(e.GetTotalSectors(), sectors);
        QByteArray all(int(sectors * 512), 'x');
        std::uint32_t error = 0;
        EXPECT_TRUE(e.ReadSectors(0, std::uint32_t(sectors), all.data(), error));
        for (std::uint64_t i = 0; i < sectors * 512; ++i)
            ASSERT_EQ(all[int(i)], i < c.size ? fileByte(i, bytes) : char(0)) << "byte " << i;
        QByteArray past(512, 'x');
        EXPECT_FALSE(e.ReadSectors(sectors, 1, past.data(), error));
        EXPECT_EQ(past, QByteArray(512, 0));
        if (!sectors)
            continue;

        // The last sector written whole: the file's bytes change, the rest of its cluster does not.
        const QByteArray sector(512, char(0xEE));
        ASSERT_TRUE(e.WriteSectors(sectors - 1, 1, sector.constData(), error));
        for (std::uint64_t i = (sectors - 1) * 512; i < c.runs.size() * 1024; ++i) {
            const char expected = i < c.size ? char(0xEE) : fileByte(i, bytes);
            ASSERT_EQ(fileByte(i, medium.Bytes()), expected) << "byte " << i;
        }
        EXPECT_FALSE(e.WriteSectors(sectors, 1, sector.constData(), error));
    }
}

} // namespace
