// Log entries, labels, line format, banners, the log file and the model.
#include "tests/common/LogTestUtil.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Log/KernelLog.h"

#include <QDomDocument>
#include <QRegularExpression>
#include <QThread>
#include <QtTest/QSignalSpy>
#include <gtest/gtest.h>

using Framework::ApplicationLog;
using Framework::LogEntry;

TEST(LogEntry, LabelsAndCodes)
{
    EXPECT_EQ(LogEntry::labels(0), "");
    EXPECT_EQ(LogEntry::codes(LogEntry::Error), "ERR");
    EXPECT_EQ(LogEntry::labels(LogEntry::Warning), "Warning");
    // One outcome: Successful before Error before Warning.
    EXPECT_EQ(LogEntry::codes(LogEntry::Successful | LogEntry::Error | LogEntry::Warning), "OK");
    EXPECT_EQ(LogEntry::codes(LogEntry::Error | LogEntry::Warning), "ERR");
    // Query, Network, Authentication and Hidden (same bit), child blank, outcome.
    EXPECT_EQ(LogEntry::codes(LogEntry::Error | LogEntry::Query | LogEntry::Network), "QRY NET ERR");
    EXPECT_EQ(LogEntry::labels(LogEntry::Authentication), "Authentication Hidden");
    EXPECT_EQ(LogEntry::codes(LogEntry::Authentication | LogEntry::Successful), "AUTH H OK");
    EXPECT_EQ(LogEntry::codes(LogEntry::Child | LogEntry::Warning), " WRN");
    EXPECT_EQ(LogEntry::codes(LogEntry::Child), "");
}

TEST(LogEntry, LineFormat)
{
    LogEntry e("Disk Image has been opened successfully.", LogEntry::Successful);
    const QString line = e.line();
    EXPECT_TRUE(QRegularExpression("^\\d\\d:\\d\\d:\\d\\d OK     Disk Image has been opened successfully\\.$")
                    .match(line)
                    .hasMatch())
        << line.toStdString();
    // Codes longer than six characters are kept whole.
    LogEntry q("x", LogEntry::Query | LogEntry::Error);
    EXPECT_EQ(q.line().mid(9), "QRY ERR x");

    LogEntry parent("Version: 24.0.25", 0);
    LogEntry *child = new LogEntry("Edition: 24.0 x64", LogEntry::Child, &parent);
    EXPECT_EQ(child->line(), QString(16, ' ') + "Edition: 24.0 x64");
    // The message column lines up with the parent's.
    EXPECT_EQ(child->line().indexOf("Edition"), parent.line().indexOf("Version"));
    delete child;
}

TEST(ApplicationLog, Banners)
{
    const QString start = ApplicationLog::startBanner("DATE");
    EXPECT_EQ(start.size(), 104);
    EXPECT_TRUE(start.startsWith(QString(74, '-') + "  Application Log Started DATE"));
    const QString close = ApplicationLog::closeBanner();
    EXPECT_EQ(close.size(), 100);
    EXPECT_EQ(close, QString(76, '-') + "  Application Log Closed");
}

TEST(ApplicationLog, FileGetsBannerEarlierEntriesAndChildren)
{
    ScratchHome home;
    auto &log = ApplicationLog::instance();
    log.close();
    const QString path = home.file("logs/first.log");
    log.setFile(path);
    ASSERT_TRUE(log.isFileOpen());
    LogEntry *v = log.add("Version: 24.0.25");
    log.addChild(v, "Edition: 24.0 x64");
    log.add("bad thing", LogEntry::Error);
    log.close();
    const QStringList lines = QString::fromUtf8(TestUtil::readFile(path)).split('\n');
    ASSERT_GE(lines.size(), 8);
    EXPECT_EQ(lines[0], "");
    EXPECT_TRUE(lines[1].startsWith(QString(74, '-') + "  Application Log Started "))
        << lines[1].toStdString();
    // Lines logged while no file was open come first, then the change of file.
    qsizetype i = 2;
    while (i < lines.size() && !lines[i].endsWith(QString("Log file has been set to '%1'").arg(path)))
        ++i;
    ASSERT_LT(i + 5, lines.size());
    EXPECT_TRUE(lines[i + 1].endsWith("        Version: 24.0.25"));
    EXPECT_EQ(lines[i + 2], QString(16, ' ') + "Edition: 24.0 x64");
    EXPECT_EQ(lines[i + 3].mid(8), " ERR    bad thing");
    EXPECT_EQ(lines[i + 4], "");
    EXPECT_EQ(lines[i + 5], ApplicationLog::closeBanner());

    // Appended on the next start unless a new file is asked for.
    log.setFile(path);
    log.close();
    EXPECT_EQ(QString::fromUtf8(TestUtil::readFile(path)).count("Application Log Started"), 2);
    log.overrideForRun(true, path);
    log.start();
    log.close();
    EXPECT_EQ(QString::fromUtf8(TestUtil::readFile(path)).count("Application Log Started"), 1);
    log.overrideForRun(false, {});
}

TEST(ApplicationLog, SettingsRoundTrip)
{
    // "%APPDATA%" is the default folder: the executable's folder is not writable when installed.
    ApplicationLog &log = ApplicationLog::instance();
    QDomDocument doc;
    QDomElement e = doc.createElement("log");
    log.load(e);
    EXPECT_EQ(log.storedFolder(), "%APPDATA%");
    EXPECT_EQ(log.storedFileName(), "brindle.log");
    EXPECT_EQ(log.options(), ApplicationLog::DefaultOptions);
    e.setAttribute("attr", 0x21);
    e.setAttribute("file", "x.log");
    e.setAttribute("path", "%TEMP%/brindle-test");
    log.load(e);
    QDomElement saved = doc.createElement("log");
    log.save(saved);
    EXPECT_EQ(saved.attribute("attr"), "33");
    EXPECT_EQ(saved.attribute("file"), "x.log");
    EXPECT_EQ(saved.attribute("path"), "%TEMP%/brindle-test");
    log.load(doc.createElement("log"));
}

TEST(ApplicationLog, ModelShowsEntriesAndChildren)
{
    auto &log = ApplicationLog::instance();
    EXPECT_EQ(log.columnCount(), 2);
    EXPECT_EQ(log.headerData(0, Qt::Horizontal).toString(), "Event");
    EXPECT_EQ(log.headerData(1, Qt::Horizontal).toString(), "Message");
    const int before = log.rowCount();
    LogEntry *p = log.add("parent", LogEntry::Warning);
    log.addChild(p, "child one");
    log.addChild(p, "child two", LogEntry::Error);
    ASSERT_EQ(log.rowCount(), before + 1);
    const QModelIndex pi = log.index(before, 0);
    EXPECT_TRUE(pi.data().toString().endsWith("Warning"));
    EXPECT_EQ(log.rowCount(pi), 2);
    const QModelIndex c2 = log.index(1, 1, pi);
    EXPECT_EQ(c2.data().toString(), "child two");
    EXPECT_EQ(log.parent(c2), pi);
}

TEST(ApplicationLog, EntriesFromAnotherThreadReachTheModel)
{
    auto &log = ApplicationLog::instance();
    const int before = log.rowCount();
    QThread *t = QThread::create([&log] {
        for (int i = 0; i < 50; ++i)
            log.add(QString("worker %1").arg(i));
    });
    t->start();
    t->wait();
    delete t;
    // Announced to the model on this thread.
    QCoreApplication::processEvents();
    EXPECT_EQ(log.rowCount(), before + 50);
    EXPECT_EQ(log.index(before + 49, 1).data().toString(), "worker 49");
}

TEST(ApplicationLog, ErrorAndWarningCounters)
{
    auto &log = ApplicationLog::instance();
    const int e = log.errorCount();
    const int w = log.warningCount();
    log.add("a", LogEntry::Error);
    log.add("b", LogEntry::Warning);
    log.add("c", LogEntry::Successful);
    EXPECT_EQ(log.errorCount(), e + 1);
    EXPECT_EQ(log.warningCount(), w + 1);
}

TEST(KernelLog, PlatformRecordText)
{
    _event_platform r;
    r.operation = 21; // a read
    r.name = "/dev/sdz";
    r.position = 512;
    r.block = 4096;
    r.error = 23;
    const QString text = Framework::KernelLog::platformText(r);
    EXPECT_TRUE(text.startsWith("Platform Message - ")) << text.toStdString();
    EXPECT_TRUE(text.contains("; File Name: /dev/sdz; Position: 512; Block: 4096; System Error: 23 ("))
        << text.toStdString();
    EXPECT_TRUE(text.endsWith(")"));
}
