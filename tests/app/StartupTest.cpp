// Start-up driven headless: boxes through the dialog seam, exit codes, the settings and log files.
#include "app/Startup.h"
#include "tests/common/LogTestUtil.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/Application.h"
#include "ClientFramework/SingleInstanceGuard.h"
#include "Kernel/Implementation/Common/KernelVersion.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QApplication>
#include <QDir>
#include <QFile>
#include <QSharedMemory>
#include <QTimer>
#include <QUuid>
#include <gtest/gtest.h>

namespace {

class StartupTest : public ::testing::Test
{
protected:
    int run(std::initializer_list<QByteArray> rest, bool loop = false)
    {
        QStringList args{QStringLiteral("brindle")};
        for (const QByteArray &a : rest)
            args << QString::fromLocal8Bit(a);
        Solution::Startup::Options o;
        o.application = qApp;
        o.instanceKey = key;
        o.runEventLoop = loop;
        o.kernelReady = [this](CRoot &root) { retries = root.RetryCount(); };
        Solution::Startup startup(o);
        int argc = 1;
        char arg0[] = "brindle";
        char *argv[] = {arg0, nullptr};
        return startup.run(args, argc, argv);
    }
    QString settingsPath() const { return home.path() + "/config/Orvane/Brindle/settings-brindle.xml"; }
    QString logPath() const { return home.path() + "/data/Orvane/Brindle/brindle.log"; }

    ScratchHome home;
    RecordingDialogs dialogs;
    int retries = -1; // the kernel's transfer attempts of the last run
    QString key = "brindle-test-" + QUuid::createUuid().toString(QUuid::WithoutBraces);
};

} // namespace

TEST_F(StartupTest, VersionShowsBoxAndEndsWithOne)
{
    LogWatch watch;
    EXPECT_EQ(run({"-version"}), 1);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].icon, QMessageBox::Information);
    EXPECT_EQ(dialogs.calls[0].title, "Orvane Brindle");
    EXPECT_TRUE(
        dialogs.calls[0].text.startsWith("<h2>Orvane Brindle</h2><p>Version: <b>24.0 (24.0.25)</b></p>"));
    EXPECT_EQ(dialogs.calls[0].buttons, QMessageBox::Ok);
    EXPECT_TRUE(watch.texts().contains("Done!"));
    EXPECT_EQ(watch.newErrors(), 0);
}

TEST_F(StartupTest, HelpShowsPopupAndEndsWithOne)
{
    EXPECT_EQ(run({"-?"}), 1);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_TRUE(dialogs.calls[0].help);
    EXPECT_EQ(dialogs.calls[0].title, "Command Line Interface");
    EXPECT_TRUE(dialogs.calls[0].text.contains("<td>2 - NTFS Boot Sector</td>"));
    EXPECT_EQ(dialogs.calls[0].footer,
              "Use <b>brindle -help</b> or <b>brindle -?</b> to show this help pop-up");
}

TEST_F(StartupTest, CommandLineErrorAbort)
{
    dialogs.answers = {QMessageBox::Abort};
    LogWatch watch;
    EXPECT_EQ(run({"-ra=101"}), 1);
    ASSERT_EQ(dialogs.calls.size(), 1);
    const RecordedDialog &box = dialogs.calls[0];
    EXPECT_EQ(box.icon, QMessageBox::Critical);
    EXPECT_EQ(box.title, "Command line processing error");
    EXPECT_EQ(box.text, "<p>Wrong number of retry attempts: 101<p>Command line:<br>'brindle -ra=101'");
    EXPECT_EQ(box.buttons, QMessageBox::Abort | QMessageBox::Ignore | QMessageBox::Help);
    EXPECT_EQ(box.defaultButton, QMessageBox::Abort);
    EXPECT_TRUE(watch.texts().contains("Command line attributes: brindle -ra=101"));
}

TEST_F(StartupTest, CommandLineErrorHelp)
{
    dialogs.answers = {QMessageBox::Help};
    EXPECT_EQ(run({"-bogus"}), 1);
    ASSERT_EQ(dialogs.calls.size(), 2);
    EXPECT_TRUE(dialogs.calls[1].help);
}

TEST_F(StartupTest, CommandLineErrorIgnoreGoesOn)
{
    dialogs.answers = {QMessageBox::Ignore};
    LogWatch watch;
    EXPECT_EQ(run({"-er=-3"}), 0);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_TRUE(dialogs.calls[0].text.startsWith("<p>Wrong number of error count: -3<p>"));
    EXPECT_TRUE(watch.texts().contains("Application initialization completed"));
}

TEST_F(StartupTest, SecondInstanceIsRefused)
{
    // Another instance over the same configuration folder.
    QSharedMemory running(Framework::SingleInstanceGuard::userKey(key));
    ASSERT_TRUE(running.create(1024));
    LogWatch watch;
    EXPECT_EQ(run({}), 1);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].icon, QMessageBox::Warning);
    EXPECT_EQ(dialogs.calls[0].title, "Warning");
    EXPECT_EQ(dialogs.calls[0].text, "Orvane Brindle is already running");
    EXPECT_FALSE(watch.texts().contains("Application initialization completed"));
}

TEST_F(StartupTest, PreserveWritesSettingsFile)
{
    EXPECT_EQ(run({"-preserve", "-ra=5", "-sd"}), 0);
    EXPECT_TRUE(dialogs.calls.isEmpty());
    const QByteArray xml = TestUtil::readFile(settingsPath());
    EXPECT_TRUE(xml.contains("retries=\"5\"")) << xml.constData();
    EXPECT_TRUE(xml.contains("final-action=\"3\"")) << xml.constData();
    EXPECT_EQ(retries, 5);

    // The kernel tries a failing sector as often as the command line says, else as stored.
    EXPECT_EQ(run({"-ra=7"}), 0);
    EXPECT_EQ(retries, 7);
    EXPECT_EQ(run({}), 0);
    EXPECT_EQ(retries, 5);
}

TEST_F(StartupTest, WithoutArgumentsNoAttributesEntry)
{
    LogWatch watch;
    EXPECT_EQ(run({}), 0);
    const QStringList texts = watch.texts();
    EXPECT_TRUE(texts.contains("Initializing..."));
    for (const QString &t : texts)
        EXPECT_FALSE(t.startsWith("Command line attributes")) << t.toStdString();
    EXPECT_TRUE(texts.contains("Version: 24.0.25"));
    EXPECT_TRUE(texts.contains(QString("Default working location set to '%1'").arg(QDir::currentPath())));
    EXPECT_EQ(texts.filter("Application settings file created: ").size(), 1);
}

TEST_F(StartupTest, RunWithDiskRequestEndsWithErrorCode)
{
    QTimer::singleShot(2500, qApp, [] { QCoreApplication::quit(); });
    LogWatch watch;
    // No machine has that many disks of one kind.
    EXPECT_EQ(run({"-disk=999"}, true), 1);
    const QStringList texts = watch.texts();
    EXPECT_TRUE(texts.contains("No context device found!")) << texts.join('\n').toStdString();
    EXPECT_TRUE(texts.contains("Exiting with error code: 1"));
    EXPECT_FALSE(texts.filter("Application closed at (").isEmpty());
    EXPECT_TRUE(dialogs.calls.isEmpty());

    // The per-user files with their content.
    const QString log = QString::fromUtf8(TestUtil::readFile(logPath()));
    EXPECT_TRUE(log.contains("  Application Log Started ")) << logPath().toStdString();
    EXPECT_TRUE(log.contains("Initializing..."));
    EXPECT_TRUE(log.contains(" ERR    No context device found!"));
    EXPECT_TRUE(log.contains("                Internal Kernel Version: " + Kernel::version()));
    EXPECT_TRUE(log.trimmed().endsWith("  Application Log Closed"));
    const QByteArray xml = TestUtil::readFile(settingsPath());
    EXPECT_TRUE(xml.contains("<main-view")) << xml.constData();
    EXPECT_TRUE(xml.contains("path=\"%APPDATA%\"")) << xml.constData();
    EXPECT_TRUE(xml.contains("file=\"brindle.log\"")) << xml.constData();
}

TEST_F(StartupTest, LogPathAndClearLogOverrideForTheRun)
{
    const QString own = home.file("elsewhere/run.log");
    EXPECT_EQ(run({"-logpath=" + own.toLocal8Bit()}), 0);
    EXPECT_TRUE(QString::fromUtf8(TestUtil::readFile(own)).contains("Initializing..."));
    EXPECT_FALSE(QFile::exists(logPath())); // the stored file is not used for this run
    // Not saved without "preserve".
    EXPECT_FALSE(TestUtil::readFile(settingsPath()).contains("run.log"));

    EXPECT_EQ(run({"-logpath=" + own.toLocal8Bit()}), 0);
    EXPECT_EQ(QString::fromUtf8(TestUtil::readFile(own)).count("Application Log Started"), 2);
    EXPECT_EQ(run({"-cl", "-lp=" + own.toLocal8Bit()}), 0);
    EXPECT_EQ(QString::fromUtf8(TestUtil::readFile(own)).count("Application Log Started"), 1);
}
