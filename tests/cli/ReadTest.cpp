// brindle-cli read: the bytes of a loop device equal what dd reads at the same place, in raw
// and hex form, and a range past the end prints what exists, then fails.
#include <gtest/gtest.h>

#include <QTemporaryDir>
#include <random>

#include "tests/common/TestUtil.h"

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

// The opens of a command, as strace sees them: each "openat(..., \"PATH\", FLAGS...)" line.
QStringList tracedOpens(const QString &cli, const QStringList &args, const QString &log)
{
    // The leak checker does not work under a tracer.
    const TestUtil::ToolResult r =
        TestUtil::run("strace", QStringList{"-f", "-E", "ASAN_OPTIONS=detect_leaks=0", "-e",
                                            "trace=open,openat", "-o", log, cli} +
                                    args);
    EXPECT_EQ(r.exitCode, 0) << args.join(' ').toStdString() << ": " << r.err.toStdString();
    QStringList opens;
    for (const QString &line : QString::fromUtf8(TestUtil::readFile(log)).split('\n'))
        if (line.contains("open(") || line.contains("openat("))
            opens << line;
    return opens;
}

// Reading commands open the medium they read, and every other disk, for reading only: evidence is
// never opened writable, and no writable close makes the system announce a change of the device.
TEST(CliRead, ReadingCommandsNeverOpenTheMediumForWriting)
{
    if (!TestUtil::haveTool("strace") || !TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("mkfs.fat"))
        GTEST_SKIP() << "strace, sfdisk or mkfs.fat is not installed";
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    ASSERT_TRUE(TestUtil::writeFile(image, QByteArray(8 << 20, 0)));
    const QString script = dir.filePath("table");
    ASSERT_TRUE(TestUtil::writeFile(script, "label: dos\nstart=2048, size=12288, type=6\n"));
    ASSERT_EQ(TestUtil::run("sh", {"-c", "sfdisk -q '" + image + "' < '" + script + "'"}).exitCode, 0);
    ASSERT_EQ(TestUtil::run("mkfs.fat", {"-F", "16", "-s", "1", "--offset=2048", image, "6144"}).exitCode, 0);
    const QString cli = TestUtil::builtProgram("brindle-cli");

    auto check = [&](const QString &source) {
        for (const QStringList &command : {QStringList{"read", source, "--offset", "0", "--length", "1024"},
                                           QStringList{"partitions", source}, QStringList{"volumes", source},
                                           QStringList{"template", source, "--type", "1", "--offset", "0"}}) {
            const QStringList opens = tracedOpens(cli, command, dir.filePath("trace.log"));
            bool readsSource = false;
            for (const QString &line : opens) {
                const int quote = line.indexOf('"');
                const QString path = line.mid(quote + 1, line.indexOf('"', quote + 1) - quote - 1);
                const bool medium =
                    path == source || (path.startsWith("/dev/") && !path.startsWith("/dev/pts/") &&
                                       !path.startsWith("/dev/tty") && !path.startsWith("/dev/shm/") &&
                                       path != "/dev/null" && path != "/dev/urandom");
                if (!medium)
                    continue;
                readsSource = readsSource || (path == source && line.contains("O_RDONLY"));
                EXPECT_FALSE(line.contains("O_RDWR") || line.contains("O_WRONLY"))
                    << command.join(' ').toStdString() << ": " << line.toStdString();
            }
            EXPECT_TRUE(readsSource) << command.join(' ').toStdString() << ": "
                                     << opens.join('\n').toStdString();
        }
    };
    check(image);
    if (TestUtil::canAttachLoop()) {
        TestUtil::LoopDevice loop(image);
        ASSERT_FALSE(loop.Device().isEmpty());
        check(loop.Device());
    }
}

} // namespace
