// High-DPI decision, the single-instance guard and error reporting.
#include "tests/common/LogTestUtil.h"
#include "tests/common/RecordingDialogs.h"

#include "ClientFramework/GenericError.h"
#include "ClientFramework/HighDpi.h"
#include "ClientFramework/Privileges.h"
#include "ClientFramework/SingleInstanceGuard.h"

#include <QUuid>
#include <gtest/gtest.h>

#include <sys/wait.h>
#include <unistd.h>

using namespace Framework;

TEST(HighDpi, Decision)
{
    EXPECT_TRUE(decideHighDpi(std::nullopt, false));
    EXPECT_TRUE(decideHighDpi(96.0, false));
    EXPECT_TRUE(decideHighDpi(192.0, false));
    EXPECT_TRUE(decideHighDpi(143.9, false));
    // Exactly one and a half times 96 turns scaling off without the option.
    EXPECT_FALSE(decideHighDpi(144.0, false));
    EXPECT_FALSE(decideHighDpi(96.0, true));
    EXPECT_FALSE(decideHighDpi(std::nullopt, true));
}

TEST(HighDpi, ForcedFontDpiIsTheScreenDpi)
{
    qputenv("QT_FONT_DPI", "144");
    const auto dpi = primaryScreenDpi();
    qunsetenv("QT_FONT_DPI");
    ASSERT_TRUE(dpi.has_value());
    EXPECT_EQ(*dpi, 144.0);
}

namespace {
QString uniqueKey()
{
    return "brindle-test-" + QUuid::createUuid().toString(QUuid::WithoutBraces);
}
} // namespace

TEST(SingleInstanceGuard, SecondInstanceIsRefused)
{
    const QString key = uniqueKey();
    SingleInstanceGuard first(key);
    ASSERT_TRUE(first.acquire());
    SingleInstanceGuard second(key);
    EXPECT_FALSE(second.acquire());
    first.release();
    EXPECT_TRUE(second.acquire());
}

TEST(SingleInstanceGuard, OneInstancePerConfigurationFolder)
{
    const QString base = uniqueKey();
    auto environment = [](const QString &home, const QString &config) {
        QProcessEnvironment e;
        if (!home.isNull())
            e.insert("HOME", home);
        if (!config.isNull())
            e.insert("XDG_CONFIG_HOME", config);
        return e;
    };
    const struct
    {
        QProcessEnvironment first, second;
        bool secondRuns;
    } cases[] = {
        {environment("/home/a", "/tmp/x/config"), environment("/home/a", "/tmp/y/config"), true},
        {environment("/home/a", {}), environment("/home/b", {}), true},
        {environment("/home/a", "/tmp/x/config"), environment("/home/b", "/tmp/x/config"), false},
        {environment("/home/a", {}), environment("/home/a", "/home/a/.config"), false},
        {environment("/home/a", {}), environment("/home/a", {}), false},
    };
    for (const auto &c : cases) {
        SingleInstanceGuard first(SingleInstanceGuard::userKey(base, c.first));
        ASSERT_TRUE(first.acquire());
        SingleInstanceGuard second(SingleInstanceGuard::userKey(base, c.second));
        EXPECT_EQ(second.acquire(), c.secondRuns)
            << SingleInstanceGuard::userKey(base, c.second).toStdString();
    }
}

TEST(SingleInstanceGuard, SegmentOfACrashedProcessDoesNotBlock)
{
    const QString key = uniqueKey();
    const pid_t pid = fork();
    ASSERT_GE(pid, 0);
    if (pid == 0) {
        // The child makes the segment and dies without releasing it.
        auto *m = new QSharedMemory(key);
        _exit(m->create(SingleInstanceGuard::SegmentSize) ? 0 : 3);
    }
    int status = 0;
    ASSERT_EQ(waitpid(pid, &status, 0), pid);
    ASSERT_TRUE(WIFEXITED(status));
    ASSERT_EQ(WEXITSTATUS(status), 0);
    SingleInstanceGuard guard(key);
    EXPECT_TRUE(guard.acquire());
}

TEST(GenericError, SeverityDecidesBoxAndLogLevel)
{
    RecordingDialogs dialogs;
    LogWatch watch;
    GenericError("Done!", GenericError::Information).report();
    EXPECT_TRUE(dialogs.calls.isEmpty());
    EXPECT_EQ(watch.newErrors(), 0);
    GenericError("No context device found!", GenericError::Silent).report();
    EXPECT_TRUE(dialogs.calls.isEmpty());
    EXPECT_EQ(watch.newErrors(), 1);
    GenericError("Brindle is already running", GenericError::Warning).report();
    GenericError("notice", GenericError::Notice).report();
    GenericError("broken", GenericError::Critical).report();
    ASSERT_EQ(dialogs.calls.size(), 3);
    EXPECT_EQ(dialogs.calls[0].icon, QMessageBox::Warning);
    EXPECT_EQ(dialogs.calls[0].title, "Warning");
    EXPECT_EQ(dialogs.calls[1].title, "Warning");
    EXPECT_EQ(dialogs.calls[2].icon, QMessageBox::Critical);
    EXPECT_EQ(dialogs.calls[2].title, "Error");
    EXPECT_EQ(watch.texts().size(), 5);
    EXPECT_STREQ(GenericError("text", 0).what(), "text");
}

TEST(Privileges, RootHasAdministratorRights)
{
    if (geteuid() != 0)
        GTEST_SKIP() << "not running as root";
    EXPECT_TRUE(hasAdministratorRights());
}
