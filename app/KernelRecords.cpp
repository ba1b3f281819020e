#include "KernelRecords.h"

#include "ClientFramework/Application.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Log/KernelLog.h"

#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/SystemError.h"
#include "Kernel/Implementation/cRoot.h"

#include <QPointer>
#include <QRegularExpression>

namespace Solution::KernelRecords {

using Framework::ApplicationLog;
using Framework::LogEntry;

bool isUnopenableDevice(const _event_platform &record)
{
    if (record.operation != uint32_t(PlatformOperation::CreateFileOpen))
        return false;
    switch (record.error) {
    case SystemError::AccessDenied:
    case SystemError::SharingViolation:
    case SystemError::NotReady:
        return true;
    default:
        return false;
    }
}

bool isNotReadyDevice(const _event_internal &record)
{
    // The enumerator's words for a device it lists as not ready, and for a device that is not
    // ready while its volume is.
    static const QRegularExpression notReady(QStringLiteral("^Device=.*, Not Ready: "));
    static const QRegularExpression mismatch(
        QStringLiteral("^Device=.*\\(not\\), Volume=.*\\((not|ready)\\)$"));
    return notReady.match(record.text).hasMatch() || mismatch.match(record.text).hasMatch();
}

namespace {

void logCondition(const QPointer<Framework::Application> &application, const QString &text)
{
    if (application)
        application->logCondition(text);
    else
        ApplicationLog::instance().add(text, LogEntry::Warning);
}

} // namespace

void connect(cRoot *root, Framework::Application *application)
{
    if (!root)
        return;
    auto &log = ApplicationLog::instance();
    const QPointer<Framework::Application> app(application);
    QObject::connect(
        root, &cRoot::kernelPlatform, &log,
        [app](const _event_platform &r) {
            const QString text = Framework::KernelLog::platformText(r);
            if (isUnopenableDevice(r))
                logCondition(app, text);
            else
                ApplicationLog::instance().add(text, LogEntry::Error);
        },
        Qt::QueuedConnection);
    QObject::connect(
        root, &cRoot::kernelInternal, &log,
        [app](const _event_internal &r) {
            if (isNotReadyDevice(r))
                logCondition(app, r.text);
            else
                ApplicationLog::instance().add(r.text, LogEntry::Warning);
        },
        Qt::QueuedConnection);
    QObject::connect(
        root, &cRoot::kernelDebug, &log,
        [](const _event_debug &r) {
            // Level 1 is an error; opening, closing and verbose traces are kept for the detailed log.
            if (r.level <= 1)
                ApplicationLog::instance().add(r.text, LogEntry::Error);
            else
                ApplicationLog::instance().add(r.text, LogEntry::None, LogEntry::Hidden);
        },
        Qt::QueuedConnection);
}

} // namespace Solution::KernelRecords
