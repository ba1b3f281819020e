// The kernel's records in the log: what the condition tests pick goes to the application as a
// condition (a warning that leaves the exit status alone), the rest keeps its weight; with no
// application left a condition is a plain warning. Devices arriving and leaving are logged too.
#include "ClientFramework/Application.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Log/KernelLog.h"
#include "Kernel/Implementation/Root/Root.h"

#include "tests/common/LogTestUtil.h"
#include "tests/common/RootTestSupport.h"
#include "tests/common/ScratchHome.h"

#include <QApplication>
#include <QRegularExpression>
#include <QSignalSpy>
#include <gtest/gtest.h>

#include <memory>

using Framework::ApplicationLog;
using Framework::LogEntry;

namespace {

// A failed open of a device, and its text in the log.
_event_platform failedOpen(const QString &device, uint32_t error)
{
    return _event_platform{.operation = 1, .name = device, .position = 0, .block = 0, .error = error};
}

QString textOf(const _event_platform &r)
{
    return Framework::KernelLog::platformText(r);
}

// Conditions of this test: a platform record about "/dev/quiet", a message starting with "quiet".
bool quietPlatform(const _event_platform &r)
{
    return r.name == QLatin1String("/dev/quiet");
}

bool quietInternal(const _event_internal &r)
{
    return r.text.startsWith(QLatin1String("quiet"));
}

// The attributes of the entries a spy on the log saw, by text.
QHash<QString, uint32_t> byText(const QSignalSpy &added)
{
    QHash<QString, uint32_t> entries;
    for (const QList<QVariant> &args : added)
        entries.insert(args[0].toString(), args[1].toUInt());
    return entries;
}

} // namespace

TEST(KernelLogConditions, WithoutTestsEveryRecordKeepsItsWeight)
{
    ScratchHome home;
    Framework::Application app(qApp);
    CRoot root;
    Framework::KernelLog::connect(&root, &app);
    QSignalSpy added(&ApplicationLog::instance(), &ApplicationLog::entryAdded);

    emit root.kernelPlatform(failedOpen("/dev/quiet", 13));
    emit root.kernelInternal(_event_internal{"quiet misuse"});
    emit root.kernelDebug(_event_debug{.file = {}, .line = 0, .level = 1, .text = "a failed step"});
    emit root.kernelDebug(_event_debug{.file = {}, .line = 0, .level = 3, .text = "an opening trace"});
    // Queued to the log's thread: nothing is there before the events run.
    EXPECT_TRUE(byText(added).isEmpty());
    QCoreApplication::processEvents();

    ASSERT_EQ(byText(added).size(), 4);
    const QString platform = textOf(failedOpen("/dev/quiet", 13));
    EXPECT_TRUE(byText(added).value(platform) & LogEntry::Error);
    EXPECT_TRUE(byText(added).value("quiet misuse") & LogEntry::Warning);
    EXPECT_TRUE(byText(added).value("a failed step") & LogEntry::Error);
    EXPECT_TRUE(byText(added).value("an opening trace") & LogEntry::Hidden);
    EXPECT_FALSE(byText(added).value("an opening trace") & (LogEntry::Error | LogEntry::Warning));
    EXPECT_EQ(app.conditionCount(), 0);
    EXPECT_EQ(app.exitCode(), 1);
}

TEST(KernelLogConditions, TestedRecordsAreConditionsOfTheApplication)
{
    ScratchHome home;
    auto app = std::make_unique<Framework::Application>(qApp);
    CRoot root;
    Framework::KernelLog::connect(&root, app.get(), {&quietPlatform, &quietInternal});
    QSignalSpy added(&ApplicationLog::instance(), &ApplicationLog::entryAdded);

    emit root.kernelPlatform(failedOpen("/dev/quiet", 13));
    emit root.kernelInternal(_event_internal{"quiet: not ready"});
    QCoreApplication::processEvents();
    EXPECT_EQ(app->conditionCount(), 2);
    EXPECT_EQ(app->exitCode(), 0);
    const QString quiet = textOf(failedOpen("/dev/quiet", 13));
    EXPECT_TRUE(byText(added).value(quiet) & LogEntry::Warning);
    EXPECT_TRUE(byText(added).value("quiet: not ready") & LogEntry::Warning);

    // What the tests do not pick keeps its weight.
    emit root.kernelInternal(_event_internal{"loud misuse"});
    QCoreApplication::processEvents();
    EXPECT_EQ(app->conditionCount(), 2);
    EXPECT_EQ(app->exitCode(), 2);
    emit root.kernelPlatform(failedOpen("/dev/loud", 13));
    QCoreApplication::processEvents();
    EXPECT_EQ(app->exitCode(), 1);

    // Records still on their way when the application goes are plain warnings, not lost.
    emit root.kernelPlatform(failedOpen("/dev/quiet", 5));
    app.reset();
    QCoreApplication::processEvents();
    const QString late = textOf(failedOpen("/dev/quiet", 5));
    ASSERT_TRUE(byText(added).contains(late));
    EXPECT_TRUE(byText(added).value(late) & LogEntry::Warning);
    EXPECT_FALSE(byText(added).value(late) & LogEntry::Error);
}

TEST(KernelLogStorage, DevicesArrivingAndLeavingAreLogged)
{
    ScratchHome home;
    ScriptedBackend backend;
    RootTest::FakeSource source;
    RootTest::AnswerGeometry(backend);
    backend.AddFile("/dev/sdx", RootTest::Disk(1 << 20, true));
    backend.AddFile("/dev/sdy", RootTest::Disk(1 << 20, true));
    source.Set({RootTest::Candidate("/dev/sdx", 0), RootTest::Candidate("/dev/sdy", 1)});
    CRoot root(&backend, &source);
    Framework::KernelLog::connect(&root);
    LogWatch log;

    ASSERT_TRUE(root.RefreshAndWait());
    ASSERT_EQ(root.GetDeviceCount(), 2u);
    source.Set({RootTest::Candidate("/dev/sdy", 1)}); // sdx is unplugged
    ASSERT_TRUE(root.RefreshAndWait());
    QCoreApplication::processEvents();

    // (Other records of the scripted machine may come between.)
    static const QRegularExpression storageLine("^(Accessing|Data storage|Storage removed|Local devices) ");
    const QStringList storage = log.texts().filter(storageLine);
    EXPECT_EQ(storage, QStringList({"Accessing local devices...", "Data storage detected Disk sdx",
                                    "Data storage detected Disk sdy", "Local devices enumeration completed",
                                    "Accessing local devices...", "Storage removed Disk sdx",
                                    "Local devices enumeration completed"}));
}
