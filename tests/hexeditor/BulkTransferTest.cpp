// Block transfers: save an area to a file (with the source's unsaved edits), insert a file,
// copy within one storage over an overlap, refusals, and a stop half-way.
#include <gtest/gtest.h>

#include <QFile>
#include <QSignalSpy>
#include <QTemporaryDir>

#include "hexeditor/BulkTransfer.h"
#include "hexeditor/Storage.h"
#include "tests/common/TestUtil.h"
#include "tests/hexeditor/StorageTestMedium.h"

using namespace HexEditor;
using HexEditor::BulkTransfer::Thread;

namespace {

bool runToEnd(Thread *t)
{
    t->start();
    return t->wait(60000);
}

} // namespace

TEST(BulkTransfer, SaveSelectionToFileWithUnsavedEdits)
{
    QTemporaryDir dir;
    const QByteArray data = patternBytes(3000 * 512, 5);
    MemoryMedium medium(data);
    Storage s(&medium);
    s.write(2000 * 512 + 7, QByteArray("EDITED"));
    const QString path = dir.filePath("out.bin");
    std::unique_ptr<Thread> t(Thread::saveToFile(&s, DiskArea{1000, 2500 * 512}, path));
    EXPECT_EQ(t->prepare(), QString());
    EXPECT_TRUE(t->log().contains(QStringLiteral("Store to file: %1").arg(path)));
    ASSERT_TRUE(runToEnd(t.get()));
    EXPECT_TRUE(t->succeeded()) << t->result().toStdString();
    QByteArray expected = data.mid(1000, 2500 * 512);
    expected.replace(2000 * 512 + 7 - 1000, 6, "EDITED");
    EXPECT_EQ(TestUtil::readFile(path), expected);
    EXPECT_EQ(medium.writes, 0);
    EXPECT_FALSE(QFile::exists(path + ".part"));
}

TEST(BulkTransfer, RefusesBadRequests)
{
    QTemporaryDir dir;
    MemoryMedium medium(patternBytes(64 * 512));
    Storage s(&medium);
    std::unique_ptr<Thread> a(Thread::saveToFile(&s, DiskArea{0, 512}, dir.filePath("no/such/folder/x.bin")));
    EXPECT_EQ(a->prepare(), QStringLiteral("Unrecognized target location."));
    std::unique_ptr<Thread> b(Thread::insertFromFile(dir.filePath("missing.bin"), &s, 0));
    EXPECT_EQ(b->prepare(), QStringLiteral("Invalid source file"));
    TestUtil::writeFile(dir.filePath("in.bin"), QByteArray(10, 'x'));
    std::unique_ptr<Thread> c(Thread::insertFromFile(dir.filePath("in.bin"), &s, 64 * 512));
    EXPECT_EQ(c->prepare(), QStringLiteral("Invalid offset on target storage"));
    std::unique_ptr<Thread> d(Thread::copy(nullptr, DiskArea{0, 1}, &s, 0));
    EXPECT_EQ(d->prepare(), QStringLiteral("Invalid data source!"));
    std::unique_ptr<Thread> e(Thread::copy(&s, DiskArea{0, 1}, nullptr, 0));
    EXPECT_EQ(e->prepare(), QStringLiteral("Invalid target storage!"));
    std::unique_ptr<Thread> f(Thread::copy(&s, DiskArea{0, 0}, &s, 0));
    EXPECT_EQ(f->prepare(), QStringLiteral("No selection provided for source data storage!"));
    // An unprepared thread does nothing.
    std::unique_ptr<Thread> g(Thread::copy(&s, DiskArea{0, 512}, &s, 1024));
    ASSERT_TRUE(runToEnd(g.get()));
    EXPECT_FALSE(g->succeeded());
    EXPECT_EQ(medium.writes, 0);
}

TEST(BulkTransfer, InsertFromFileWritesTheMediumAndDropsCachedCopies)
{
    QTemporaryDir dir;
    const QByteArray data = patternBytes(4096 * 512, 6);
    MemoryMedium medium(data);
    Storage s(&medium);
    s.read(DiskArea{0, 1 << 20}); // cached copies of the first 2048 sectors
    const QByteArray file = patternBytes(1500 * 512 + 77, 8);
    TestUtil::writeFile(dir.filePath("in.bin"), file);
    std::unique_ptr<Thread> t(Thread::insertFromFile(dir.filePath("in.bin"), &s, 333));
    ASSERT_EQ(t->prepare(), QString());
    EXPECT_FALSE(t->exceedsRoom());
    ASSERT_TRUE(runToEnd(t.get()));
    EXPECT_TRUE(t->succeeded()) << t->result().toStdString();
    QCoreApplication::processEvents(); // the queued drops of cached copies
    QByteArray expected = data;
    expected.replace(333, file.size(), file);
    EXPECT_EQ(medium.data(), expected);
    EXPECT_EQ(s.read(DiskArea{333, 1 << 20}), expected.mid(333, 1 << 20));
    // Whole sectors in steps of at most 1024 sectors, partial ends read first.
    EXPECT_LE(medium.writes, 6);
    EXPECT_EQ(medium.flushes, 1);

    // A transfer whose data does not reach the medium has failed.
    medium.flushError = 29;
    std::unique_ptr<Thread> again(Thread::insertFromFile(dir.filePath("in.bin"), &s, 333));
    ASSERT_EQ(again->prepare(), QString());
    ASSERT_TRUE(runToEnd(again.get()));
    EXPECT_FALSE(again->succeeded());
    EXPECT_TRUE(again->result().startsWith("The data did not reach Memory (Error [29]: "))
        << again->result().toStdString();
}

TEST(BulkTransfer, FileLargerThanTheRoomWritesWhatFits)
{
    QTemporaryDir dir;
    const QByteArray data = patternBytes(16 * 512, 6);
    MemoryMedium medium(data);
    Storage s(&medium);
    TestUtil::writeFile(dir.filePath("in.bin"), QByteArray(4096, 'q'));
    std::unique_ptr<Thread> t(Thread::insertFromFile(dir.filePath("in.bin"), &s, 15 * 512 + 12));
    ASSERT_EQ(t->prepare(), QString());
    EXPECT_TRUE(t->exceedsRoom());
    EXPECT_EQ(t->room(), 500u);
    ASSERT_TRUE(runToEnd(t.get()));
    EXPECT_TRUE(t->succeeded());
    EXPECT_EQ(medium.data(), data.left(15 * 512 + 12) + QByteArray(500, 'q'));
}

TEST(BulkTransfer, CopyWithinOneStorageOverAForwardOverlap)
{
    const QByteArray data = patternBytes(5000 * 512, 11);
    MemoryMedium medium(data);
    Storage s(&medium);
    const DiskArea from{100, 3000 * 512};
    const std::uint64_t to = 100 + 700 * 512 + 3; // overlaps the source, further on
    std::unique_ptr<Thread> t(Thread::copy(&s, from, &s, to));
    ASSERT_EQ(t->prepare(), QString());
    EXPECT_TRUE(t->sameStorage());
    EXPECT_TRUE(t->log().contains(QStringLiteral("Data transfer within same storage!")));
    ASSERT_TRUE(runToEnd(t.get()));
    EXPECT_TRUE(t->succeeded()) << t->result().toStdString();
    QByteArray expected = data;
    expected.replace(qsizetype(to), qsizetype(from.length),
                     data.mid(qsizetype(from.offset), qsizetype(from.length)));
    EXPECT_EQ(medium.data(), expected);
}

TEST(BulkTransfer, StopHalfWayKeepsTheStepsWritten)
{
    const QByteArray data = patternBytes(20 * 1024 * 512, 12);
    MemoryMedium source(data);
    MemoryMedium target(QByteArray(data.size(), '\0'));
    target.writeDelayMs = 30;
    Storage from(&source), to(&target);
    std::unique_ptr<Thread> t(Thread::copy(&from, DiskArea{0, std::uint64_t(data.size())}, &to, 0));
    ASSERT_EQ(t->prepare(), QString());
    QSignalSpy progress(t.get(), &Thread::progress);
    t->start();
    while (t->bytesDone() < 3u * 1024 * 512 && !t->isFinished())
        QThread::msleep(2);
    t->cancel();
    ASSERT_TRUE(t->wait(60000));
    EXPECT_FALSE(t->succeeded());
    EXPECT_EQ(t->result(), QStringLiteral("Transfer data between storages canceled by user"));
    const std::uint64_t done = t->bytesDone();
    EXPECT_GE(done, 3u * 1024 * 512);
    EXPECT_LT(done, std::uint64_t(data.size()));
    EXPECT_EQ(done % (1024 * 512), 0u);
    const QByteArray written = target.data();
    EXPECT_EQ(written.left(qsizetype(done)), data.left(qsizetype(done)));
    EXPECT_EQ(written.mid(qsizetype(done)), QByteArray(data.size() - qsizetype(done), '\0'));
}
