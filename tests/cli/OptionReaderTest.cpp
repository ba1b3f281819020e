// The sub-commands' argument reader, and the usage problems brindle-cli prints through it.
#include <gtest/gtest.h>

#include <QTemporaryDir>

#include "cli/OptionReader.h"
#include "tests/common/TestUtil.h"

namespace {

struct Parsed
{
    bool ok = false;
    QString source, problem, text;
    std::uint64_t number = 0;
    bool haveNumber = false, haveText = false, on = false;
    int flagCalls = 0;
};

Parsed parse(const QStringList &args)
{
    Parsed p;
    Cli::OptionReader r;
    r.flag(QStringLiteral("--on"), p.on);
    r.flag(QStringLiteral("--count"), [&p] { ++p.flagCalls; });
    r.number(QStringLiteral("--n"), p.number, p.haveNumber, QStringLiteral("'%1' is not a number"));
    r.text(QStringLiteral("--t"), p.text, p.haveText);
    p.ok = r.read(args, p.source, p.problem);
    return p;
}

} // namespace

TEST(CliOptionReader, ReadsSourceSwitchesAndValuesInAnyOrder)
{
    const Parsed p = parse({"--n", "0x1F", "img", "--on", "--t", "--on", "--count", "--count"});
    ASSERT_TRUE(p.ok) << p.problem.toStdString();
    EXPECT_EQ(p.source, "img");
    EXPECT_EQ(p.number, 31u);
    EXPECT_TRUE(p.haveNumber);
    // A value is taken as it stands, even when it looks like an option.
    EXPECT_EQ(p.text, "--on");
    EXPECT_TRUE(p.haveText);
    EXPECT_TRUE(p.on);
    EXPECT_EQ(p.flagCalls, 2);

    const Parsed none = parse({});
    EXPECT_TRUE(none.ok);
    EXPECT_TRUE(none.source.isEmpty());
    EXPECT_FALSE(none.haveNumber);
    EXPECT_FALSE(none.on);

    // A later value replaces an earlier one.
    EXPECT_EQ(parse({"--n", "5", "--n", "7"}).number, 7u);
}

TEST(CliOptionReader, TheFirstWrongArgumentIsTheProblem)
{
    Parsed p = parse({"img", "--n"});
    EXPECT_FALSE(p.ok);
    EXPECT_EQ(p.problem, "--n needs a value");

    p = parse({"img", "--n", "12x", "--bogus"});
    EXPECT_FALSE(p.ok);
    EXPECT_EQ(p.problem, "'12x' is not a number");
    EXPECT_FALSE(p.haveNumber);
    EXPECT_EQ(p.number, 0u);

    p = parse({"--bogus", "img", "other"});
    EXPECT_FALSE(p.ok);
    EXPECT_EQ(p.problem, "unknown option '--bogus'");

    p = parse({"img", "other", "--bogus"});
    EXPECT_FALSE(p.ok);
    EXPECT_EQ(p.problem, "more than one source given");
    EXPECT_EQ(p.source, "img");

    // Switches before the problem have taken effect; nothing after it is read.
    p = parse({"--on", "--n", "-1", "--count"});
    EXPECT_FALSE(p.ok);
    EXPECT_TRUE(p.on);
    EXPECT_EQ(p.flagCalls, 0);
}

TEST(CliOptionReader, SubCommandsPrintTheirUsageProblems)
{
    const QString cli = TestUtil::builtProgram("brindle-cli");
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    ASSERT_TRUE(TestUtil::writeFile(image, QByteArray(64 * 1024, '\0')));
    struct Case
    {
        QStringList args;
        const char *problem;
    };
    const Case cases[] = {
        {{"read", image, "--offset"}, "brindle-cli read: --offset needs a value"},
        {{"read", image, "--offset", "0", "--length", "ten"}, "brindle-cli read: 'ten' is not a byte count"},
        {{"read", image, image}, "brindle-cli read: more than one source given"},
        {{"read", "--raw", image, "--offset", "0"}, "brindle-cli read: --offset and --length are required"},
        {{"write", image, "--offset", "0x", "--hex", "AA"}, "brindle-cli write: '0x' is not a byte offset"},
        {{"write", image, "--bytes", "AA"}, "brindle-cli write: unknown option '--bytes'"},
        {{"write", image, "--offset", "0", "--hex", "AA", "--file", "x", "--yes"},
         "brindle-cli write: give exactly one of --hex and --file"},
        {{"template", image, "--type", "no-such-kind", "--offset", "0"},
         "brindle-cli template: 'no-such-kind' is no template kind"},
        {{"template", image, "--type"}, "brindle-cli template: --type needs a value"},
        {{"template", image, "--auto", "--copy-offset", "-3"},
         "brindle-cli template: '-3' is not a byte offset"},
        {{"template", "--json", image}, "brindle-cli template: --type or --auto is required"},
    };
    for (const Case &c : cases) {
        const TestUtil::ToolResult r = TestUtil::run(cli, c.args);
        EXPECT_EQ(r.exitCode, 2) << c.problem;
        EXPECT_TRUE(r.err.startsWith(QByteArray(c.problem) + "\n")) << r.err.toStdString();
    }
}
