#include "app/KernelRecords.h"

#include "ClientFramework/Log/KernelLog.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <QRegularExpression>

namespace Solution::KernelRecords {

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

void connect(cRoot *root, Framework::Application *application)
{
    Framework::KernelLog::connect(root, application, {&isUnopenableDevice, &isNotReadyDevice});
}

} // namespace Solution::KernelRecords
