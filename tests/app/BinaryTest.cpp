// The built program on the offscreen platform starts, writes the per-user settings and log files, and
// ends in order when asked to terminate.
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include <QProcess>
#include <QProcessEnvironment>
#include <QThread>
#include <gtest/gtest.h>

TEST(BrindleBinary, StartsAndWritesPerUserFiles)
{
    const QString program = TestUtil::builtProgram("brindle");
    if (program.isEmpty())
        GTEST_SKIP() << "brindle is not built";
    ScratchHome home;
    QProcessEnvironment env = QProcessEnvironment::systemEnvironment();
    env.insert("QT_QPA_PLATFORM", "offscreen");
    env.insert("XDG_CONFIG_HOME", home.path() + "/config");
    env.insert("XDG_DATA_HOME", home.path() + "/data");
    env.insert("ASAN_OPTIONS", "detect_leaks=0");
    QProcess p;
    p.setProcessEnvironment(env);
    p.start(program, {"-nowelcome"});
    ASSERT_TRUE(p.waitForStarted(10000));
    const QString log = home.path() + "/data/Orvane/Brindle/brindle.log";
    QString text;
    for (int i = 0; i < 100 && !text.contains("Application initialization completed"); ++i) {
        QThread::msleep(100);
        text = QString::fromUtf8(TestUtil::readFile(log));
    }
    if (text.contains("is already running")) {
        p.kill();
        p.waitForFinished(10000);
        GTEST_SKIP() << "another Brindle is running on this machine";
    }
    // A terminate request ends the run in order.
    p.terminate();
    ASSERT_TRUE(p.waitForFinished(20000));
    EXPECT_EQ(p.exitStatus(), QProcess::NormalExit);
    text = QString::fromUtf8(TestUtil::readFile(log));
    // The disks of this machine are listed at start: a disk the process may not open is a normal
    // condition (a warning), not a failure of the run.
    EXPECT_EQ(p.exitCode(), 0) << text.toStdString();
    EXPECT_FALSE(text.contains("Exiting with error code")) << text.toStdString();
    EXPECT_TRUE(text.contains("Application closed at ("));
    EXPECT_TRUE(text.trimmed().endsWith("  Application Log Closed")) << text.toStdString();
    EXPECT_TRUE(text.contains("  Application Log Started ")) << text.toStdString();
    EXPECT_TRUE(text.contains("Command line attributes: " + program + " -nowelcome"));
    EXPECT_TRUE(text.contains("Application settings file created: '" + home.path() +
                              "/config/Orvane/Brindle/settings-brindle.xml'"));
    EXPECT_TRUE(text.contains("Application initialization completed"));
    EXPECT_TRUE(TestUtil::readFile(home.path() + "/config/Orvane/Brindle/settings-brindle.xml")
                    .contains("<settings"));
}
