// Texts of the kernel's status codes and of the storage events, as the user sees them.
#pragma once

#include <QString>

#include <cstdint>

class IPlatformBackend;

namespace KernelStatus {

enum Code : uint32_t {
    Valid = 0,
    InvalidParameter = 1,
    FileOpenReadError = 2,
    FileCreateWriteError = 3,
    InvalidFileFormat = 4,
    FileDeviceMismatch = 5,
    DeviceReadError = 6,
    DeviceWriteError = 7,
    DeviceUpdateError = 8,
    DeviceLocked = 9,
    NotForDynamicDevices = 10,
    DeviceNotReady = 11,
    DeviceNotInitialized = 12,
    NotForPartitionStyle = 13,
    NotForDeviceType = 14,
    SignatureMissing = 15,
    PartitionExceedsDevice = 16,
    UnknownFileSystem = 17,
    PartitionAtSectorZero = 18,
    InvalidTableRecords = 19,
    SecondExtendedPartition = 20,
    MbrLimitExceeded = 21,
    OutsideGptArea = 22,
    GptDamaged = 23,
    OverlappedPartition = 24,
    PartitionExists = 25,
    TableFull = 26,
    PartitionNotFound = 27,
    PartitionNotFoundAfterCreate = 28,
};

// The text of a status; %1 of the texts that carry one is systemText with its line breaks removed.
QString Text(uint32_t status, uint32_t systemError, const QString &systemText);
// The same with the system text taken from the back end.
QString Text(uint32_t status, uint32_t systemError, IPlatformBackend &backend);

} // namespace KernelStatus

// The line the application prints for a storage event, or nothing for codes 2 and 3 and others.
QString StorageEventText(uint32_t code, const QString &deviceName);
