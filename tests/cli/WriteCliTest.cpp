// brindle-cli write: without --yes nothing is written; with it the image file differs from the
// original exactly at the written bytes (partial sectors keep their other bytes); ranges past
// the end and bad input are refused.
#include <gtest/gtest.h>

#include <QTemporaryDir>

#include "TestUtil.h"

namespace {

QByteArray randomBytes(int size, unsigned seed)
{
    QByteArray b(size, Qt::Uninitialized);
    std::uint32_t x = seed;
    for (auto &c : b) {
        x = x * 1103515245u + 12345u;
        c = char(x >> 16);
    }
    // No boot-record signature: the image is a plain table-less disk.
    b[510] = b[511] = 0;
    return b;
}

} // namespace

TEST(CliWrite, RefusesWithoutYesAndOnBadInput)
{
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    const QByteArray original = randomBytes(64 * 1024, 3);
    ASSERT_TRUE(TestUtil::writeFile(image, original));
    const QString cli = TestUtil::builtProgram("brindle-cli");

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

TEST(CliWrite, WritesExactlyTheGivenBytes)
{
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    const QByteArray original = randomBytes(1024 * 1024, 5);
    ASSERT_TRUE(TestUtil::writeFile(image, original));
    const QString cli = TestUtil::builtProgram("brindle-cli");

    const TestUtil::ToolResult hex =
        TestUtil::run(cli, {"write", image, "--offset", "0x1FE", "--hex", "de ad be ef", "--yes"});
    ASSERT_EQ(hex.exitCode, 0) << hex.err.toStdString();
    QByteArray expected = original;
    expected.replace(0x1FE, 4, QByteArray("\xde\xad\xbe\xef", 4));
    EXPECT_EQ(TestUtil::readFile(image), expected);

    const QByteArray block = randomBytes(5000, 9);
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
