#include "Kernel/Implementation/Root/RootStatus.h"

#include "Kernel/Implementation/Platform/PlatformBackend.h"

namespace KernelStatus {

QString Text(uint32_t status, uint32_t systemError, const QString &systemText)
{
    QString text = systemText;
    text.remove(QLatin1Char('\r'));
    text.replace(QLatin1Char('\n'), QLatin1Char(' '));
    text = text.trimmed();
    static const char *const texts[] = {
        "Valid",
        "Parameter is not valid",
        "File opening or reading error (%1)",
        "File creating or writing error (%1)",
        "File format is invalid",
        "File information does not match selected device",
        "Error reading device (%1)",
        "Error writing device (%1)",
        "Error updating device (%1)",
        "Device is locked by other process",
        "Function is not supported for LDM/LVM/WSS devices",
        "Device is not ready",
        "Device is not initialized",
        "Function is not supported for the device partitioning schema",
        "Function is not supported for the device type",
        "Signature 0x55AA is missing in MBR/Partition Table",
        "Partition size exceeds device size",
        "Unknown File System",
        "Partition cannot start from zero sector",
        "MBR or Partition Table contains invalid records",
        "Unable to create the second extended partition",
        "Impossible to place partition having last sector larger than 0xFFFFFFFF on devices having MBR",
        "Impossible to place partition outside of target area on devices having GPT",
        "GPT is damaged",
        "Overlapped partition detected",
        "Partition already exists",
        "MBR or GPT is fully loaded and does not have empty records to store partition information",
        "Partition is not found",
        "Partition has been created, however for some reason still cannot be found on a device",
    };
    if (status < std::size(texts)) {
        QString t = QString::fromLatin1(texts[status]);
        return t.contains(QLatin1String("%1")) ? t.arg(text) : t;
    }
    if (systemError == 0)
        return QStringLiteral("Unknown status");
    return QStringLiteral("Unknown status (%1)").arg(text);
}

QString Text(uint32_t status, uint32_t systemError, IPlatformBackend &backend)
{
    return Text(status, systemError, systemError ? backend.ErrorText(systemError) : QString());
}

} // namespace KernelStatus

QString StorageEventText(uint32_t code, const QString &deviceName)
{
    switch (code) {
    case 0:
        return QStringLiteral("Accessing local devices...");
    case 1:
        return QStringLiteral("Data storage detected %1").arg(deviceName);
    case 4:
        return QStringLiteral("Storage removed %1").arg(deviceName);
    case 5:
        return QStringLiteral("Local devices enumeration completed");
    default:
        return {};
    }
}
