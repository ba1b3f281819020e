#include "ClientFramework/Log/KernelLog.h"

#include "ClientFramework/Application.h"
#include "ClientFramework/Log/ApplicationLog.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/RootStatus.h"

#include <QCoreApplication>
#include <QPointer>

namespace Framework::KernelLog {

QString platformText(const _event_platform &r)
{
    return QCoreApplication::translate("KernelLog",
                                       "Platform Message - %1; File Name: %2; Position: %3; Block: %4; "
                                       "System Error: %5 (%6)")
        .arg(PlatformOperationText(r.operation), r.name)
        .arg(r.position)
        .arg(r.block)
        .arg(r.error)
        .arg(systemErrorText(r.error));
}

namespace {

void logCondition(const QPointer<Application> &application, const QString &text)
{
    if (application)
        application->logCondition(text);
    else
        ApplicationLog::instance().add(text, LogEntry::Warning);
}

} // namespace

void connect(cRoot *root, Application *application, ConditionTests conditions)
{
    if (!root)
        return;
    auto &log = ApplicationLog::instance();
    const QPointer<Application> app(application);
    QObject::connect(
        root, &cRoot::kernelPlatform, &log,
        [app, isCondition = conditions.platform](const _event_platform &r) {
            const QString text = platformText(r);
            if (isCondition && isCondition(r))
                logCondition(app, text);
            else
                ApplicationLog::instance().add(text, LogEntry::Error);
        },
        Qt::QueuedConnection);
    QObject::connect(
        root, &cRoot::kernelInternal, &log,
        [app, isCondition = conditions.internal](const _event_internal &r) {
            if (isCondition && isCondition(r))
                logCondition(app, r.text);
            else
                ApplicationLog::instance().add(r.text, LogEntry::Warning);
        },
        Qt::QueuedConnection);
    // Devices arriving and leaving, and the enumeration around them. The root delivers these on
    // its own thread while the device still exists (a removed one is destroyed after its removal
    // has been delivered), so its name is read right there, not in a queued call.
    QObject::connect(
        root, &cRoot::kernelStorage, &log,
        [](const _event_storage &e) {
            const QString text = StorageEventText(e.code, e.device ? e.device->GetDisplayName() : QString());
            if (!text.isEmpty())
                ApplicationLog::instance().add(text);
        },
        Qt::DirectConnection);
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

} // namespace Framework::KernelLog
