// brindle-cli write: without --yes nothing is written; with it the image file differs from the
// original exactly at the written bytes (partial sectors keep their other bytes); ranges past
// the end and bad input are refused.
#include <gtest/gtest.h>

#include <QBuffer>
#include <QTemporaryDir>
#include <QTextStream>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Write.h"
#include "tests/common/TestUtil.h"

namespace {

// An image file of noise and the command line program that writes to it.
class CliWrite : public ::testing::Test
{
protected:
    void makeImage(int size, unsigned seed)
    {
        original = TestUtil::randomBytes(size, seed);
        ASSERT_TRUE(TestUtil::writeFile(image, original));
    }
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    QByteArray original;
    const QString cli = TestUtil::builtProgram("brindle-cli");
};

} // namespace

TEST_F(CliWrite, RefusesWithoutYesAndOnBadInput)
{
    ASSERT_NO_FATAL_FAILURE(makeImage(64 * 1024, 3));

    const TestUtil::ToolResult noYes =
        TestUtil::run(cli, {"write", image, "--offset", "10", "--hex", "AABB"});
    EXPECT_NE(noYes.exitCode, 0);
    EXPECT_TRUE(noYes.err.contains("--yes")) << noYes.err.toStdString();
    EXPECT_EQ(TestUtil::run(cli, {"write", image, "--hex", "AA", "--yes"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(cli, {"write", image, "--offset", "0", "--hex", "ABC", "--yes"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(cli, {"write", image, "--offset", "0", "--hex", "AA", "--file", image, "--yes"})
                  .exitCode,
              2);
    EXPECT_EQ(TestUtil::run(cli, {"write", image, "--offset", "65535", "--hex", "AABB", "--yes"}).exitCode,
              1);
    EXPECT_EQ(TestUtil::readFile(image), original);
}

TEST_F(CliWrite, WritesExactlyTheGivenBytes)
{
    ASSERT_NO_FATAL_FAILURE(makeImage(1024 * 1024, 5));

    const TestUtil::ToolResult hex =
        TestUtil::run(cli, {"write", image, "--offset", "0x1FE", "--hex", "de ad be ef", "--yes"});
    ASSERT_EQ(hex.exitCode, 0) << hex.err.toStdString();
    QByteArray expected = original;
    expected.replace(0x1FE, 4, QByteArray("\xde\xad\xbe\xef", 4));
    EXPECT_EQ(TestUtil::readFile(image), expected);

    const QByteArray block = TestUtil::randomBytes(5000, 9);
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("block.bin"), block));
    const TestUtil::ToolResult file = TestUtil::run(
        cli, {"write", image, "--offset", "3333", "--file", dir.filePath("block.bin"), "--yes"});
    ASSERT_EQ(file.exitCode, 0) << file.err.toStdString();
    expected.replace(3333, block.size(), block);
    EXPECT_EQ(TestUtil::readFile(image), expected);
    // cmp lists exactly the bytes that differ from the original.
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("original.img"), original));
    const TestUtil::ToolResult cmp = TestUtil::run("cmp", {"-l", dir.filePath("original.img"), image});
    int differing = 0;
    for (int i = 0; i < original.size(); ++i)
        differing += original[i] != expected[i];
    EXPECT_EQ(cmp.out.count('\n'), differing);
}

// The write is done when it is on the medium: a failed flush, or a medium the system will not open
// for writing, makes the command fail; the image is opened for writing once, only to write.
TEST_F(CliWrite, FailedFlushOrRefusedWriteOpenFailsTheCommand)
{
    struct Case
    {
        std::uint32_t flushError;
        std::uint32_t writeOpenError;
        int exit;
        const char *message;
    };
    const Case cases[] = {
        {0, 0, Cli::Ok, "wrote 2 bytes at offset 1000"},
        {SystemError::WriteFault, 0, Cli::Failed,
         "the written data did not reach the medium (system error 29"},
        {0, SystemError::AccessDenied, Cli::Failed, "cannot be opened for writing (system error 5"},
    };
    for (const Case &c : cases) {
        ScriptedBackend backend;
        backend.AddFile("/img/disk.img", TestUtil::randomBytes(64 * 1024, 7));
        if (c.writeOpenError)
            backend.SetWriteOpenError("/img/disk.img", c.writeOpenError);
        if (c.flushError)
            backend.ScriptFlush(c.flushError);
        CRoot root(&backend, nullptr);
        QString out, err;
        QTextStream o(&out), e(&err);
        QBuffer raw;
        raw.open(QIODevice::WriteOnly);
        Cli::Io io{o, e, raw};
        EXPECT_EQ(Cli::runWrite({"/img/disk.img", "--offset", "1000", "--hex", "ABCD", "--yes"}, io, root),
                  c.exit);
        o.flush();
        e.flush();
        EXPECT_TRUE((out + err).contains(c.message)) << (out + err).toStdString();
        // A medium the system would not let write is not even tried.
        EXPECT_EQ(backend.CallCount("open rw /img/disk.img"), c.writeOpenError ? 0 : 1);
        EXPECT_EQ(backend.CallCount("flush"), c.writeOpenError ? 0 : 1);
        EXPECT_EQ(backend.FileData("/img/disk.img").mid(1000, 2) == QByteArray("\xAB\xCD", 2),
                  !c.writeOpenError);
    }
}
