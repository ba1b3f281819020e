// The storage's range arithmetic, its bounded cache, modified marks, edits, undo, revert and save,
// over an in-memory medium whose sectors can be made to fail.
#include <gtest/gtest.h>

#include <QSignalSpy>

#include "Kernel/Implementation/Common/SystemError.h"
#include "hexeditor/FillPattern.h"
#include "hexeditor/Storage.h"
#include "hexeditor/UndoStack.h"
#include "tests/hexeditor/StorageTestMedium.h"

using namespace HexEditor;

TEST(StorageRange, PiecesAcrossSectorsTheLastPartialSectorAndBeyondTheEnd)
{
    const QByteArray data = patternBytes(4 * 512 + 100); // a last sector of 100 bytes
    MemoryMedium medium(data);
    Storage s(&medium);
    EXPECT_EQ(s.size(), std::uint64_t(data.size()));
    EXPECT_EQ(s.sectorCount(), 5u);

    EXPECT_EQ(s.read(DiskArea{500, 30}), data.mid(500, 30)); // middle of one sector to the next
    EXPECT_EQ(s.read(DiskArea{0, 512}), data.left(512));     // one whole sector
    EXPECT_EQ(s.read(DiskArea{100, 1500}), data.mid(100, 1500));
    EXPECT_EQ(s.read(DiskArea{2048, 100}), data.mid(2048, 100)); // the partial last sector
    EXPECT_EQ(s.read(DiskArea{2100, 500}), data.mid(2100));      // cut at the end
    EXPECT_TRUE(s.read(DiskArea{std::uint64_t(data.size()), 10}).isEmpty());
    EXPECT_TRUE(s.read(DiskArea{~0ull - 5, 100}).isEmpty());

    const ReadResult r = s.readDetailed(DiskArea{510, 520});
    EXPECT_EQ(r.firstSector, 0u);
    EXPECT_EQ(r.sectorOk.size(), 3); // sectors 0, 1 and 2
    EXPECT_EQ(r.modified.count(true), 0);

    // A write at the end is cut there and never grows the medium.
    EXPECT_EQ(s.write(std::uint64_t(data.size()) - 4, QByteArray(10, 'x')), 4u);
    EXPECT_EQ(s.write(std::uint64_t(data.size()), QByteArray(1, 'x')), 0u);
}

TEST(StorageRange, ReadsAndWritesStopAtOneMebibyte)
{
    MemoryMedium medium(QByteArray(3 << 20, '\0'));
    Storage s(&medium);
    EXPECT_EQ(s.read(DiskArea{7, 2 << 20}).size(), 1048576);
    EXPECT_EQ(s.read(DiskArea{7, 2 << 20}, false).size(), 1048576);
    EXPECT_EQ(s.write(3, QByteArray(1048577, 'a')), 1048576u);
    EXPECT_EQ(s.modifiedRanges(), (QList<DiskArea>{DiskArea{3, 1048576}}));
}

TEST(StorageCache, UnreadableSectorIsZerosReportedOnceAndKept)
{
    MemoryMedium medium(patternBytes(64 * 512));
    medium.badReads = {3};
    Storage s(&medium);
    s.setCacheBound(4 * 512);
    QSignalSpy failed(&s, &Storage::readFailed);

    const ReadResult r = s.readDetailed(DiskArea{3 * 512 - 4, 8});
    EXPECT_EQ(r.bytes.mid(4), QByteArray(4, '\0'));
    EXPECT_EQ(r.sectorOk, (QList<bool>{true, false}));
    EXPECT_FALSE(r.byteReadOk(3 * 512 - 4, 512, 5));
    EXPECT_TRUE(r.byteReadOk(3 * 512 - 4, 512, 0));
    ASSERT_EQ(failed.size(), 1);
    EXPECT_EQ(failed[0][0].toString(), QStringLiteral("Failed to read sector 3 from Memory. Error code 23."));

    // Page through everything else: the unreadable sector stays, so its message is not repeated.
    for (std::uint64_t off = 0; off < 64 * 512; off += 512)
        s.read(DiskArea{off, 512});
    EXPECT_EQ(failed.size(), 1);
    EXPECT_FALSE(s.sector(3)->readOk);

    s.clearCache();
    s.read(DiskArea{3 * 512, 1});
    EXPECT_EQ(failed.size(), 2);
}

TEST(StorageCache, StaysWithinItsBoundButKeepsEveryEdit)
{
    const QByteArray data = patternBytes(8 << 20, 7);
    MemoryMedium medium(data);
    Storage s(&medium);
    s.setCacheBound(256 * 1024);

    // Edits in sectors 1 and 9000 before paging through 8 MiB.
    s.write(600, QByteArray("edit"));
    s.write(9000 * 512 + 10, QByteArray("more"));
    for (std::uint64_t off = 0; off < std::uint64_t(data.size()); off += 65536)
        EXPECT_EQ(s.read(DiskArea{off, 65536}).size(), 65536);
    EXPECT_LE(s.cachedBytes(), 256u * 1024 + 2 * 512);
    EXPECT_EQ(s.read(DiskArea{600, 4}), QByteArray("edit"));
    EXPECT_EQ(s.read(DiskArea{9000 * 512 + 10, 4}), QByteArray("more"));
    EXPECT_EQ(s.modifiedSectors(), (QList<std::uint64_t>{1, 9000}));

    // A sector whose marks are cleared may be evicted again; its content is still what the cache had.
    s.setModified(DiskArea{600, 4}, false);
    for (std::uint64_t off = 0; off < 1 << 20; off += 65536)
        s.read(DiskArea{off, 65536});
    EXPECT_EQ(s.modifiedSectors(), (QList<std::uint64_t>{9000}));
    EXPECT_EQ(s.read(DiskArea{600, 4}), data.mid(600, 4)); // evicted and read again from the medium
}

TEST(StorageCache, UncachedReadsSeeEditsButCacheNothingNew)
{
    MemoryMedium medium(patternBytes(16 * 512));
    Storage s(&medium);
    s.write(5, QByteArray("AB"));
    const std::uint64_t before = s.cachedSectorCount();
    const ReadResult r = s.readDetailed(DiskArea{0, 16 * 512}, false);
    EXPECT_EQ(r.bytes.mid(5, 2), QByteArray("AB"));
    EXPECT_TRUE(r.modified.testBit(5));
    EXPECT_FALSE(r.modified.testBit(7));
    EXPECT_EQ(s.cachedSectorCount(), before);
}

TEST(StorageEdit, UndoRedoAndTheModifiedMarks)
{
    const QByteArray data = patternBytes(8 * 512, 3);
    MemoryMedium medium(data);
    Storage s(&medium);
    UndoStack undo(&s);

    // Three one-byte edits, undone one at a time.
    undo.apply(10, QByteArray(1, 'a'));
    undo.apply(11, QByteArray(1, 'b'));
    undo.apply(12, QByteArray(1, 'c'));
    EXPECT_EQ(s.read(DiskArea{10, 3}), QByteArray("abc"));
    EXPECT_EQ(undo.undo(), (DiskArea{12, 1}));
    EXPECT_EQ(s.read(DiskArea{10, 3}), QByteArray("ab") + data.mid(12, 1));
    EXPECT_FALSE(s.isModified(DiskArea{12, 1}));
    EXPECT_TRUE(s.isModified(DiskArea{11, 1}));
    undo.undo();
    undo.undo();
    EXPECT_EQ(s.read(DiskArea{10, 3}), data.mid(10, 3));
    EXPECT_FALSE(s.isModified());
    EXPECT_FALSE(undo.canUndo());
    EXPECT_EQ(undo.redo(), (DiskArea{10, 1}));
    EXPECT_EQ(s.read(DiskArea{10, 1}), QByteArray("a"));
    EXPECT_TRUE(s.isModified(DiskArea{10, 1}));

    // A new edit after an undo discards the redo entries.
    undo.apply(100, QByteArray("xyz"));
    EXPECT_FALSE(undo.canRedo());
    EXPECT_EQ(undo.count(), 2);

    // Overlapping edits: undoing the later one leaves the earlier one's bytes marked.
    undo.apply(99, QByteArray("12345"));
    undo.undo();
    EXPECT_EQ(s.read(DiskArea{99, 5}), data.mid(99, 1) + QByteArray("xyz") + data.mid(103, 1));
    EXPECT_EQ(s.modifiedRanges(), (QList<DiskArea>{DiskArea{10, 1}, DiskArea{100, 3}}));

    // Revert brings back the medium's bytes and empties the stack.
    undo.revert();
    EXPECT_EQ(s.read(DiskArea{0, 8 * 512}), data);
    EXPECT_FALSE(s.isModified());
    EXPECT_EQ(undo.count(), 0);
    EXPECT_EQ(medium.writes, 0);
}

TEST(StorageEdit, OneEditIsAtMostOneMebibyte)
{
    MemoryMedium medium(QByteArray(3 << 20, '\0'));
    Storage s(&medium);
    UndoStack undo(&s);
    EXPECT_EQ(undo.apply(1, QByteArray(1048577, 'x')), DiskArea{});
    EXPECT_EQ(undo.count(), 0);
    EXPECT_FALSE(s.isModified());
    const QByteArray block = FillPattern::fill(QByteArray("\x01\x02\x03", 3), 1048576);
    ASSERT_EQ(block.size(), 1048576);
    EXPECT_EQ(undo.apply(1, block), (DiskArea{1, 1048576}));
    EXPECT_EQ(s.read(DiskArea{1, 6}), QByteArray("\x01\x02\x03\x01\x02\x03", 6));
    EXPECT_TRUE(FillPattern::fill(QByteArray("a"), 1048577).isEmpty());
}

TEST(StorageSave, WritesOnlyTheModifiedSectorsWholeAndKeepsFailedOnes)
{
    const QByteArray data = patternBytes(32 * 512, 9);
    MemoryMedium medium(data);
    medium.badWrites = {7};
    Storage s(&medium);
    UndoStack undo(&s);
    undo.apply(510, QByteArray("span")); // sectors 0 and 1
    undo.apply(7 * 512 + 3, QByteArray("bad"));
    undo.apply(20 * 512, QByteArray(512, 'z'));
    QByteArray expected = data;
    expected.replace(510, 4, "span");
    expected.replace(20 * 512, 512, QByteArray(512, 'z'));
    QSignalSpy failed(&s, &Storage::writeFailed);

    const QList<SaveFailure> failures = undo.save();
    ASSERT_EQ(failures.size(), 1);
    EXPECT_EQ(failures[0].sector, 7u);
    EXPECT_EQ(failures[0].message, QStringLiteral("Failed to write sector 7 to Memory. Error code 29."));
    EXPECT_EQ(failed.size(), 1);
    EXPECT_EQ(medium.writes, 4); // sectors 0, 1, 7 and 20, one request each
    EXPECT_EQ(medium.data(), expected);
    // The failed sector keeps its edit; the history stays for it.
    EXPECT_EQ(s.modifiedRanges(), (QList<DiskArea>{DiskArea{7 * 512 + 3, 3}}));
    EXPECT_EQ(undo.count(), 3);

    medium.badWrites.clear();
    EXPECT_TRUE(undo.save().isEmpty());
    expected.replace(7 * 512 + 3, 3, "bad");
    EXPECT_EQ(medium.data(), expected);
    EXPECT_FALSE(s.isModified());
    EXPECT_EQ(undo.count(), 0);
}

// Saved means on the medium: a failed flush keeps every edit written before it, and a medium that
// cannot be opened for writing is tried once and keeps every edit; either way the edits can be saved
// again later.
TEST(StorageSave, FailedFlushOrRefusedWriteOpenKeepsEveryEdit)
{
    struct Case
    {
        std::uint32_t flushError;
        std::uint32_t writeError; // of sector 0, the first written
        int writes;
        QString message;
    };
    const Case cases[] = {
        {29, 0, 3,
         "The changes did not reach Memory (Error [29]: The system cannot write to the specified device). "
         "They "
         "are kept as not saved."},
        {0, 19, 1,
         "Memory cannot be opened for writing (Error [19]: " + systemErrorText(19) +
             "). Nothing was written; the changes are kept."},
    };
    for (const Case &c : cases) {
        const QByteArray data = patternBytes(32 * 512, 9);
        MemoryMedium medium(data);
        Storage s(&medium);
        UndoStack undo(&s);
        undo.apply(510, QByteArray("span")); // sectors 0 and 1
        undo.apply(20 * 512, QByteArray(512, 'z'));
        const QList<DiskArea> edits = s.modifiedRanges();
        medium.flushError = c.flushError;
        if (c.writeError) {
            medium.badWrites = {0};
            medium.writeError = c.writeError;
        }
        QSignalSpy failed(&s, &Storage::writeFailed);
        const QList<SaveFailure> failures = undo.save();
        ASSERT_EQ(failures.size(), 3);
        for (const SaveFailure &f : failures)
            EXPECT_EQ(f.message, c.message);
        EXPECT_EQ(failed.size(), 1);
        EXPECT_EQ(medium.writes, c.writes);
        EXPECT_EQ(s.modifiedRanges(), edits);
        EXPECT_EQ(undo.count(), 2);

        medium.flushError = 0;
        medium.badWrites.clear();
        EXPECT_TRUE(undo.save().isEmpty());
        EXPECT_FALSE(s.isModified());
        EXPECT_EQ(medium.flushes, c.flushError ? 2 : 1);
    }
}

TEST(StorageSave, DirectWriteGoesPastTheCacheAndDropsItsCopy)
{
    const QByteArray data = patternBytes(8 * 512, 4);
    MemoryMedium medium(data);
    Storage s(&medium);
    s.read(DiskArea{0, 8 * 512});
    EXPECT_EQ(s.write(1000, QByteArray("direct"), false), 6u);
    QByteArray expected = data;
    expected.replace(1000, 6, "direct");
    EXPECT_EQ(medium.data(), expected);
    EXPECT_FALSE(s.isModified());
    EXPECT_EQ(s.read(DiskArea{1000, 6}), QByteArray("direct"));

    // A partial sector that cannot be read is not written with zeros around the new bytes.
    medium.badReads = {5};
    s.clearCache();
    QSignalSpy failed(&s, &Storage::writeFailed);
    EXPECT_EQ(s.write(5 * 512 + 1, QByteArray("x"), false), 0u);
    EXPECT_EQ(failed.size(), 1);
    EXPECT_EQ(medium.data(), expected);
}

TEST(FillPattern, RepeatsThePatternAndKeepsItsLimits)
{
    EXPECT_EQ(FillPattern::fill(QByteArray("abc"), 10), QByteArray("abcabcabca"));
    EXPECT_TRUE(FillPattern::fill(QByteArray(), 10).isEmpty());
    EXPECT_TRUE(FillPattern::fill(QByteArray(33, 'x'), 10).isEmpty());
    EXPECT_EQ(FillPattern::fill(QByteArray(32, 'x'), 64), QByteArray(64, 'x'));
    bool ok = false;
    EXPECT_EQ(FillPattern::fromHex(QStringLiteral("de AD 0f"), &ok), QByteArray("\xde\xad\x0f", 3));
    EXPECT_TRUE(ok);
    FillPattern::fromHex(QStringLiteral("abc"), &ok);
    EXPECT_FALSE(ok);
    FillPattern::fromHex(QStringLiteral("zz"), &ok);
    EXPECT_FALSE(ok);
    EXPECT_EQ(FillPattern::toHex(QByteArray("\x01\xff", 2)), QStringLiteral("01 FF"));
    EXPECT_EQ(FillPattern::fromText(QStringLiteral("h\u00e9"), &ok), QByteArray("h\xe9"));
    EXPECT_TRUE(ok);
    FillPattern::fromText(QStringLiteral("\u20ac"), &ok);
    EXPECT_FALSE(ok);
}
