// How the kernel's records reach the log and the exit status: a disk the process may not open (no
// rights, in use, no medium) is a warning that leaves the status at 0; every other platform
// failure is an error, every misuse a warning that counts; and the run over this machine's disks.
#include "app/KernelRecords.h"

#include "ClientFramework/Application.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

#include "tests/common/ScratchHome.h"

#include <QApplication>
#include <QSignalSpy>
#include <QTest>
#include <gtest/gtest.h>

using Framework::ApplicationLog;
using Framework::LogEntry;

namespace {

_event_platform platformRecord(PlatformOperation op, uint32_t error, const QString &name = "/dev/vda")
{
    _event_platform r;
    r.operation = uint32_t(op);
    r.name = name;
    r.error = error;
    return r;
}

_event_internal internalRecord(const QString &text)
{
    _event_internal r;
    r.text = text;
    return r;
}

// The entries added to the log while it lives: (attributes, text).
struct LogRecorder
{
    LogRecorder()
    {
        connection = QObject::connect(&ApplicationLog::instance(), &ApplicationLog::entryAdded,
                                      [this](const QString &text, uint32_t attributes) {
                                          entries.append({attributes, text});
                                      });
    }
    ~LogRecorder() { QObject::disconnect(connection); }
    QList<QPair<uint32_t, QString>> entries;
    QMetaObject::Connection connection;
};

} // namespace

TEST(MainWindowExitStatus, WhichRecordsAreConditions)
{
    using namespace SystemError;
    EXPECT_TRUE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::CreateFileOpen, AccessDenied)));
    EXPECT_TRUE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::CreateFileOpen, SharingViolation)));
    EXPECT_TRUE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::CreateFileOpen, NotReady)));
    // A read that fails on an open disk is a real failure, so is creating a file.
    EXPECT_FALSE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::ReadFile, AccessDenied)));
    EXPECT_FALSE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::CreateFileCreate, AccessDenied)));
    EXPECT_FALSE(Solution::KernelRecords::isUnopenableDevice(
        platformRecord(PlatformOperation::CreateFileOpen, InvalidParameter)));

    EXPECT_TRUE(Solution::KernelRecords::isNotReadyDevice(
        internalRecord("Device=/dev/vda, Not Ready: Error [5]: Permission denied")));
    EXPECT_TRUE(Solution::KernelRecords::isNotReadyDevice(
        internalRecord("Device=/dev/vda(not), Volume=/dev/vda(ready)")));
    EXPECT_FALSE(
        Solution::KernelRecords::isNotReadyDevice(internalRecord("Attempt to close non opened file x")));
    EXPECT_FALSE(
        Solution::KernelRecords::isNotReadyDevice(internalRecord("Device=/dev/sda(2), Volume=/dev/sda1(3)")));
    EXPECT_FALSE(Solution::KernelRecords::isNotReadyDevice(internalRecord("Device=/dev/sda, Sector=8192")));
}

TEST(MainWindowExitStatus, RecordsReachTheLogWithTheirWeight)
{
    ScratchHome home;
    Framework::Application app(qApp);
    CRoot root; // never refreshed: only the records emitted here reach the log
    Solution::KernelRecords::connect(&root, &app);
    LogRecorder recorder;

    emit root.kernelInternal(internalRecord("Device=/dev/vda, Not Ready: Error [5]: Permission denied"));
    emit root.kernelPlatform(platformRecord(PlatformOperation::CreateFileOpen, SystemError::AccessDenied));
    QCoreApplication::processEvents();
    auto entries = recorder.entries;
    ASSERT_EQ(entries.size(), 2);
    for (const auto &[attributes, text] : entries) {
        EXPECT_TRUE(attributes & LogEntry::Warning) << text.toStdString();
        EXPECT_FALSE(attributes & LogEntry::Error) << text.toStdString();
    }
    EXPECT_EQ(entries[1].second, "Platform Message - CreateFile; File Name: /dev/vda; Position: 0; Block: 0; "
                                 "System Error: 5 (" +
                                     systemErrorText(SystemError::AccessDenied) + ")");
    EXPECT_EQ(app.exitCode(), 0);

    // Misuse still counts as a warning of the run, a failed read as an error.
    emit root.kernelInternal(internalRecord("Attempt to close non opened file /tmp/x"));
    QCoreApplication::processEvents();
    EXPECT_EQ(app.exitCode(), 2);
    emit root.kernelPlatform(platformRecord(PlatformOperation::ReadFile, SystemError::Crc, "/dev/sdb"));
    QCoreApplication::processEvents();
    EXPECT_EQ(app.exitCode(), 1);
    entries = recorder.entries;
    ASSERT_EQ(entries.size(), 4);
    EXPECT_TRUE(entries[3].first & LogEntry::Error);
}

TEST(MainWindowExitStatus, ThisMachinesDisksEndTheRunSoundly)
{
    ScratchHome home;
    Framework::Application app(qApp);
    CRoot root;
    Solution::KernelRecords::connect(&root, &app);
    LogRecorder recorder;
    root.RefreshAndWait(false, RefreshKinds(), 30000);
    QTest::qWait(100);
    QCoreApplication::processEvents();
    const auto entries = recorder.entries;
    bool metUnopenable = false;
    for (const auto &[attributes, text] : entries)
        if (text.contains("Not Ready: ")) {
            metUnopenable = true;
            EXPECT_TRUE(attributes & LogEntry::Warning) << text.toStdString();
        }
    if (!metUnopenable)
        GTEST_SKIP() << "every disk of this machine opens: nothing to weigh";
    // Listing disks one may not open is not a failure of the run.
    EXPECT_EQ(app.exitCode(), 0);
    EXPECT_GT(app.conditionCount(), 0);
}
