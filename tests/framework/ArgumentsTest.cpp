// The framework's command line: prefixing, parse-and-validate messages, reading helpers, "preserve".
#include "ClientFramework/CLI/Arguments.h"
#include "ClientFramework/Processing/ErrorHandling.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QDomDocument>
#include <gtest/gtest.h>

using Framework::CLI::Arguments;

namespace {

QStringList argv(std::initializer_list<const char *> rest)
{
    QStringList l{QStringLiteral("/usr/bin/brindle")};
    for (const char *a : rest)
        l << QString::fromLatin1(a);
    return l;
}

} // namespace

TEST(CliArguments, NoArgumentsIsNotParsedAndHasNoError)
{
    Arguments a(argv({}));
    EXPECT_TRUE(a.commandLineError.isEmpty());
    EXPECT_EQ(Arguments::instance(), &a);
    EXPECT_FALSE(Arguments::isOptionSet("help"));
    EXPECT_EQ(Arguments::intValue("retryattempts", 2), 2);
    EXPECT_FALSE(a.hasRequest());
}

TEST(CliArguments, HelpersReturnDefaultsWithoutArgumentObject)
{
    ASSERT_EQ(Arguments::instance(), nullptr);
    EXPECT_FALSE(Arguments::isOptionSet("help"));
    EXPECT_TRUE(Arguments::flagValue("nohidpi", true));
    EXPECT_EQ(Arguments::intValue("retryattempts", 7), 7);
    EXPECT_EQ(Arguments::offsetValue("x", 9u), 9u);
}

TEST(CliArguments, RetryBounds)
{
    {
        Arguments a(argv({"-retryattempts=100"}));
        EXPECT_TRUE(a.commandLineError.isEmpty()) << a.commandLineError.toStdString();
        EXPECT_EQ(Arguments::intValue("retryattempts", 2), 100);
    }
    {
        Arguments a(argv({"-ra=101"}));
        EXPECT_EQ(a.commandLineError, "Wrong number of retry attempts: 101");
    }
    {
        Arguments a(argv({"--retryattempts=-1"}));
        EXPECT_EQ(a.commandLineError, "Wrong number of retry attempts: -1");
    }
    {
        Arguments a(argv({"-retryattempts=many"}));
        EXPECT_TRUE(a.commandLineError.isEmpty());
        EXPECT_EQ(Arguments::intValue("retryattempts", 2), 2);
    }
    {
        Arguments a(argv({"-ra=0"}));
        EXPECT_TRUE(a.commandLineError.isEmpty());
        EXPECT_EQ(Arguments::intValue("ra", 2), 0);
    }
}

TEST(CliArguments, ErrorLimit)
{
    {
        Arguments a(argv({"-stopaftererrors=-3"}));
        EXPECT_EQ(a.commandLineError, "Wrong number of error count: -3");
    }
    {
        Arguments a(argv({"-er=0"}));
        EXPECT_TRUE(a.commandLineError.isEmpty());
    }
}

TEST(CliArguments, TestAndHelpStandAlone)
{
    const QString msg = "Parameters -test and -help cannot be used with other parameters.";
    EXPECT_EQ(Arguments(argv({"-help", "-nohidpi"})).commandLineError, msg);
    EXPECT_EQ(Arguments(argv({"-test=hw.xml", "-nohidpi"})).commandLineError, msg);
    EXPECT_EQ(Arguments(argv({"-test=hw.xml", "-?"})).commandLineError, msg);
    EXPECT_TRUE(Arguments(argv({"-help"})).commandLineError.isEmpty());
    EXPECT_TRUE(Arguments(argv({"-h"})).commandLineError.isEmpty());
    EXPECT_TRUE(Arguments(argv({"-test=hw.xml"})).commandLineError.isEmpty());
    // The same option twice is still one option.
    EXPECT_TRUE(Arguments(argv({"-help", "--help"})).commandLineError.isEmpty());
}

TEST(CliArguments, BareWordsGetADash)
{
    Arguments a(argv({"nohidpi", "retryattempts=5"}));
    EXPECT_EQ(a.arguments, argv({"-nohidpi", "-retryattempts=5"}));
    EXPECT_TRUE(a.commandLineError.isEmpty());
    EXPECT_TRUE(Arguments::flagValue("nohidpi", false));
    EXPECT_EQ(Arguments::intValue("retryattempts", 2), 5);
}

TEST(CliArguments, ParserErrorsBecomeTheError)
{
    EXPECT_FALSE(Arguments(argv({"-nosuchoption"})).commandLineError.isEmpty());
    // A value option at the end without its value.
    EXPECT_FALSE(Arguments(argv({"-logpath"})).commandLineError.isEmpty());
    // A flag does not take a value.
    EXPECT_FALSE(Arguments(argv({"-nohidpi=1"})).commandLineError.isEmpty());
    // An empty argument becomes a lone "-": no option at all.
    EXPECT_EQ(Arguments(argv({""})).commandLineError, "No valid (empty) parameters list");
}

TEST(CliArguments, SingleDashIsALongOption)
{
    Arguments a(argv({"-clearlog"}));
    EXPECT_TRUE(a.commandLineError.isEmpty());
    EXPECT_TRUE(Arguments::isOptionSet("clearlog"));
    EXPECT_TRUE(Arguments::isOptionSet("cl"));
    EXPECT_FALSE(Arguments::isOptionSet("c"));
}

TEST(CliArguments, HasRequest)
{
    EXPECT_FALSE(Arguments(argv({"-nohidpi"})).hasRequest());
    EXPECT_TRUE(Arguments(argv({"-version"})).hasRequest());
    EXPECT_TRUE(Arguments(argv({"-mdi=/tmp/x.img"})).hasRequest());
}

TEST(CliArguments, PreserveWritesTheGivenOptions)
{
    QDomDocument doc;
    QDomElement root = doc.createElement("settings");
    doc.appendChild(root);
    Arguments a(argv({"-clearlog", "-logpath=/var/tmp/logs/run.log", "-shutdown", "-ra=7", "-ie", "-er=0"}));
    ASSERT_TRUE(a.commandLineError.isEmpty());
    a.save(root, false);
    const QDomElement log = root.firstChildElement("log");
    EXPECT_EQ(log.attribute("attr"), "33"); // default 1 with 0x20
    EXPECT_EQ(log.attribute("file"), "run.log");
    EXPECT_EQ(log.attribute("path"), "/var/tmp/logs");
    EXPECT_EQ(root.firstChildElement("general").firstChildElement("triggers").attribute("final-action"), "3");
    const QDomElement eh = root.firstChildElement("processing").firstChildElement("error-handling");
    EXPECT_EQ(eh.attribute("retries"), "7");
    EXPECT_EQ(eh.attribute("limit"), "0");
    EXPECT_EQ(eh.attribute("abort"), "2");
    const QDomElement ignore = eh.firstChildElement("ignore");
    EXPECT_EQ(ignore.attribute("lock"), "true");
    EXPECT_EQ(ignore.attribute("read"), "true");
    EXPECT_EQ(ignore.attribute("write"), "true");
}

TEST(CliArguments, PreserveLeavesAbsentOptionsAlone)
{
    QDomDocument doc;
    QDomElement root = doc.createElement("settings");
    doc.appendChild(root);
    QDomElement log = doc.createElement("log");
    log.setAttribute("attr", 0x21);
    log.setAttribute("file", "keep.log");
    root.appendChild(log);
    Arguments a(argv({"-er=4"}));
    a.save(root, false);
    EXPECT_EQ(log.attribute("attr"), "1"); // clear-log bit follows the command line
    EXPECT_EQ(log.attribute("file"), "keep.log");
    EXPECT_TRUE(root.firstChildElement("general").isNull());
    const QDomElement eh = root.firstChildElement("processing").firstChildElement("error-handling");
    EXPECT_EQ(eh.attribute("limit"), "4");
    EXPECT_FALSE(eh.hasAttribute("abort"));
    EXPECT_FALSE(eh.hasAttribute("retries"));
}

// The stored error handling with the command line over it decides how often the kernel tries a
// failing sector: counted in reads of the back end.
TEST(CliArguments, RetryAttemptsReachTheKernelFromTheCommandLineElseTheSettings)
{
    struct Case
    {
        std::initializer_list<const char *> args;
        const char *stored; // "retries" of the settings, or null
        int attempts;
        bool ignore;
        int limit;
    };
    const Case cases[] = {
        {{}, nullptr, 2, false, 0},          {{}, "4", 4, false, 0},
        {{"-ra=5"}, "4", 5, false, 0},       {{"-ra=0"}, nullptr, 1, false, 0},
        {{"-ie", "-er=3"}, "6", 6, true, 3},
    };
    for (const Case &c : cases) {
        Arguments a(argv(c.args));
        ASSERT_TRUE(a.commandLineError.isEmpty());
        QDomDocument doc;
        QDomElement root = doc.createElement("settings");
        doc.appendChild(root);
        if (c.stored)
            Framework::SettingsDocument::child(Framework::SettingsDocument::child(root, "processing"),
                                               "error-handling")
                .setAttribute("retries", c.stored);
        Framework::Processing::ErrorHandling handling = Framework::Processing::ErrorHandling::stored(root);
        handling.applyCommandLine();
        EXPECT_EQ(handling.ignoreRead && handling.ignoreWrite && handling.ignoreLock, c.ignore);
        EXPECT_EQ(handling.limit, c.limit);

        ScriptedBackend backend;
        backend.AddFile("/dev/disk0", QByteArray(8192, '\0'));
        CRoot kernel(&backend, nullptr);
        kernel.RetryCount(handling.transferAttempts());
        CPlatformFile disk(&kernel, "/dev/disk0", PlatformKind::Device);
        for (int i = 0; i < 10; ++i)
            backend.ScriptRead({SystemError::Crc, -1});
        QByteArray sector(512, '\0');
        EXPECT_FALSE(disk.Read(512, 512, sector.data()));
        EXPECT_EQ(backend.CallCount("read"), c.attempts) << (c.stored ? c.stored : "no setting");
        disk.Close();
    }
}
