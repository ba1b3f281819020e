// brindle-cli read: the bytes of a loop device equal what dd reads at the same place, in raw
// and hex form, and a range past the end prints what exists, then fails.
#include <gtest/gtest.h>

#include <QTemporaryDir>
#include <random>

#include "TestUtil.h"

namespace {

QByteArray ddRead(const QString &path, qint64 offset, qint64 length)
{
    auto r = TestUtil::run("dd", {"if=" + path, "bs=1", "skip=" + QString::number(offset),
                                  "count=" + QString::number(length), "status=none"});
    return r.out;
}

TEST(CliRead, UsageErrors)
{
    const QString cli = TestUtil::builtProgram("brindle-cli");
    EXPECT_EQ(TestUtil::run(cli, {"read"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(cli, {"read", "/dev/null", "--offset", "0"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(cli, {"read", "/dev/null", "--offset", "x", "--length", "1"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(cli, {"read", "/no/such/device", "--offset", "0", "--length", "1"}).exitCode, 1);
}

TEST(CliRead, BytesEqualDdAtAnyOffset)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    QByteArray data(256 * 1024, 0);
    std::mt19937 rng(42);
    for (auto &c : data)
        c = char(rng());
    data[510] = data[511] = 0;
    ASSERT_TRUE(TestUtil::writeFile(image, data));
    TestUtil::LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    const QString cli = TestUtil::builtProgram("brindle-cli");

    const qint64 size = data.size();
    const QList<QPair<qint64, qint64>> ranges = {{0, 512},     {510, 10},       {1, 1},
                                                 {4095, 4098}, {100000, 70000}, {size - 600, 600}};
    for (const auto &r : ranges) {
        auto out = TestUtil::run(cli, {"read", loop.Device(), "--offset", QString::number(r.first),
                                       "--length", QString::number(r.second), "--raw"});
        EXPECT_EQ(out.exitCode, 0) << out.err.toStdString();
        EXPECT_EQ(out.out, ddRead(loop.Device(), r.first, r.second)) << r.first << "+" << r.second;
    }

    // Hex form: offset, sixteen bytes, character column.
    auto hex = TestUtil::run(cli, {"read", loop.Device(), "--offset", "0x1F8", "--length", "20"});
    ASSERT_EQ(hex.exitCode, 0);
    const QStringList lines = QString::fromLatin1(hex.out).split('\n', Qt::SkipEmptyParts);
    ASSERT_EQ(lines.size(), 2);
    EXPECT_TRUE(lines[0].startsWith("000001F8   ")) << lines[0].toStdString();
    EXPECT_TRUE(lines[1].startsWith("00000208   ")) << lines[1].toStdString();
    QString firstByte = QStringLiteral(" %1").arg(quint8(data[0x1F8]), 2, 16, QChar('0')).toUpper();
    EXPECT_EQ(lines[0].mid(11, 3), firstByte);

    // Past the end: the bytes that exist, then an error.
    auto past = TestUtil::run(
        cli, {"read", loop.Device(), "--offset", QString::number(size - 100), "--length", "300", "--raw"});
    EXPECT_EQ(past.exitCode, 1);
    EXPECT_EQ(past.out, data.right(100));
    EXPECT_FALSE(past.err.isEmpty());
    auto beyond =
        TestUtil::run(cli, {"read", loop.Device(), "--offset", QString::number(size + 5), "--length", "3"});
    EXPECT_EQ(beyond.exitCode, 1);
    EXPECT_TRUE(beyond.out.isEmpty());
}

} // namespace

namespace {

TEST(CliRead, ImageFileSourceReadsTheVirtualDisk)
{
    if (!TestUtil::haveTool("qemu-img"))
        GTEST_SKIP() << "qemu-img is not installed";
    QTemporaryDir dir;
    QByteArray data(1 << 20, 0);
    std::mt19937 rng(9);
    for (auto &c : data)
        c = char(rng());
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("raw.bin"), data));
    auto conv = TestUtil::run("qemu-img", {"convert", "-O", "vpc", "-o", "subformat=dynamic",
                                           dir.filePath("raw.bin"), dir.filePath("disk.vhd")});
    ASSERT_EQ(conv.exitCode, 0) << conv.err.toStdString();
    auto out =
        TestUtil::run(TestUtil::builtProgram("brindle-cli"),
                      {"read", dir.filePath("disk.vhd"), "--offset", "1000", "--length", "3000", "--raw"});
    EXPECT_EQ(out.exitCode, 0) << out.err.toStdString();
    EXPECT_EQ(out.out, data.mid(1000, 3000));
}

} // namespace
