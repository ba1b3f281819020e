// The headless tool's fixed answers: version, help and refusal of unknown commands.
#include <gtest/gtest.h>

#include <QBuffer>
#include <QTextStream>

#include "cli/CliCommand.h"
#include "tests/common/TestUtil.h"

namespace {

struct Captured {
    QString out, err;
    QByteArray raw;
    int code = -1;
};

Captured runCli(const QStringList &args)
{
    Captured c;
    QTextStream out(&c.out), err(&c.err);
    QBuffer raw(&c.raw);
    raw.open(QIODevice::WriteOnly);
    Cli::Io io{out, err, raw};
    c.code = Cli::run(args, io);
    out.flush();
    err.flush();
    return c;
}

} // namespace

TEST(CliBasics, VersionHelpAndUnknown)
{
    Captured v = runCli({"--version"});
    EXPECT_EQ(v.code, 0);
    EXPECT_TRUE(v.out.startsWith("brindle-cli 24.0.25")) << v.out.toStdString();

    Captured h = runCli({"--help"});
    EXPECT_EQ(h.code, 0);
    EXPECT_TRUE(h.out.contains("Usage: brindle-cli")) << h.out.toStdString();
    for (const Cli::Command &c : Cli::commands())
        EXPECT_TRUE(h.out.contains(QLatin1String(c.name)));

    Captured none = runCli({});
    EXPECT_EQ(none.code, 2);
    Captured bad = runCli({"frobnicate"});
    EXPECT_EQ(bad.code, 2);
    EXPECT_TRUE(bad.err.contains("unknown command 'frobnicate'"));
}

TEST(CliBasics, BuiltProgramAnswersVersion)
{
    QString exe = TestUtil::builtProgram("brindle-cli");
    ASSERT_FALSE(exe.isEmpty());
    TestUtil::ToolResult r = TestUtil::run(exe, {"--version"});
    EXPECT_EQ(r.exitCode, 0);
    EXPECT_TRUE(r.out.startsWith("brindle-cli 24.0.25"));
}
