// The exit status a run ends with: 1 after an error, else 2 after a warning, else 0; warnings about
// normal conditions of the machine leave it alone, and only what was logged since the application
// object was made counts.
#include "ClientFramework/Application.h"
#include "ClientFramework/Log/ApplicationLog.h"

#include "tests/common/ScratchHome.h"

#include <QApplication>
#include <gtest/gtest.h>

using Framework::ApplicationLog;
using Framework::LogEntry;

TEST(ApplicationExitCode, ConditionsWarningsAndErrors)
{
    ScratchHome home;
    auto &log = ApplicationLog::instance();
    // Entries of an earlier run in this process do not count.
    log.add(QStringLiteral("before the application"), LogEntry::Error);
    {
        Framework::Application app(qApp);
        EXPECT_EQ(app.exitCode(), 0);
        log.add(QStringLiteral("informational"));
        log.add(QStringLiteral("it worked"), LogEntry::Successful);
        EXPECT_EQ(app.exitCode(), 0);

        const int warnings = log.warningCount();
        app.logCondition(QStringLiteral("Device=/dev/vda, Not Ready: Error [5]: Permission denied"));
        app.logCondition(QStringLiteral("another disk one may not open"));
        // Shown as warnings, but the run is still sound.
        EXPECT_EQ(log.warningCount(), warnings + 2);
        EXPECT_EQ(app.conditionCount(), 2);
        EXPECT_EQ(app.exitCode(), 0);

        log.add(QStringLiteral("Attempt to close non opened file x"), LogEntry::Warning);
        EXPECT_EQ(app.exitCode(), 2);
        log.add(QStringLiteral("Unable to open disk image 'x'"), LogEntry::Error);
        EXPECT_EQ(app.exitCode(), 1);
        // A condition after an error does not hide it.
        app.logCondition(QStringLiteral("late condition"));
        EXPECT_EQ(app.exitCode(), 1);
    }
    {
        // A new application starts from a clean slate; its conditions are its own.
        Framework::Application app(qApp);
        EXPECT_EQ(app.exitCode(), 0);
        EXPECT_EQ(app.conditionCount(), 0);
        log.add(QStringLiteral("a warning of this run"), LogEntry::Warning);
        app.logCondition(QStringLiteral("a condition"));
        EXPECT_EQ(app.exitCode(), 2);
    }
}
