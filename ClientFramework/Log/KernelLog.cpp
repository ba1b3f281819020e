#include "KernelLog.h"

#include "Log/ApplicationLog.h"

#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/SystemError.h"
#include "Kernel/Implementation/cRoot.h"

#include <QCoreApplication>

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

void connect(cRoot *root)
{
    if (!root)
        return;
    auto &log = ApplicationLog::instance();
    QObject::connect(
        root, &cRoot::kernelPlatform, &log,
        [](const _event_platform &r) { ApplicationLog::instance().add(platformText(r), LogEntry::Error); },
        Qt::QueuedConnection);
    QObject::connect(
        root, &cRoot::kernelInternal, &log,
        [](const _event_internal &r) { ApplicationLog::instance().add(r.text, LogEntry::Warning); },
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

} // namespace Framework::KernelLog
