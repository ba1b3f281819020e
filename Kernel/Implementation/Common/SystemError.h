// System error codes of the kernel. The kernel speaks one set of numeric codes whatever the platform;
// a back end maps its own errors onto these meanings.
#pragma once

#include <QString>

#include <cstdint>

namespace SystemError {

inline constexpr uint32_t Success = 0;
inline constexpr uint32_t InvalidFunction = 1; // the function is not supported by the device
inline constexpr uint32_t FileNotFound = 2;    // not found (a device that vanished)
inline constexpr uint32_t PathNotFound = 3;
inline constexpr uint32_t TooManyOpenFiles = 4;
inline constexpr uint32_t AccessDenied = 5;
inline constexpr uint32_t InvalidHandle = 6;
inline constexpr uint32_t NotEnoughMemory = 8;
inline constexpr uint32_t WriteProtect = 19; // the medium is write protected
inline constexpr uint32_t NotReady = 21;     // no medium in the drive
inline constexpr uint32_t Crc = 23;          // data error (cyclic redundancy check)
inline constexpr uint32_t SeekError = 25;
inline constexpr uint32_t SectorNotFound = 27;
inline constexpr uint32_t WriteFault = 29;
inline constexpr uint32_t ReadFault = 30;
inline constexpr uint32_t GenFailure = 31;
inline constexpr uint32_t SharingViolation = 32; // in use by another process
inline constexpr uint32_t LockViolation = 33;
inline constexpr uint32_t HandleEof = 38;    // end of file: a short transfer
inline constexpr uint32_t NotSupported = 50; // the request is not supported
inline constexpr uint32_t DevNotExist = 55;  // the device is gone
inline constexpr uint32_t FileExists = 80;
inline constexpr uint32_t InvalidParameter = 87;
inline constexpr uint32_t BrokenPipe = 109;
inline constexpr uint32_t DiskFull = 112;
inline constexpr uint32_t CallNotImplemented = 120;
inline constexpr uint32_t InsufficientBuffer = 122; // the answer does not fit the buffer
inline constexpr uint32_t InvalidName = 123;
inline constexpr uint32_t NegativeSeek = 131;
inline constexpr uint32_t DirNotEmpty = 145;
inline constexpr uint32_t NotLocked = 158;
inline constexpr uint32_t Busy = 170;
inline constexpr uint32_t AlreadyExists = 183;
inline constexpr uint32_t FilenameTooLong = 206;
inline constexpr uint32_t MoreData = 234;
inline constexpr uint32_t NoMoreItems = 259;
inline constexpr uint32_t UnrecognizedVolume = 1005;
inline constexpr uint32_t FileInvalid = 1006; // the volume is no longer valid
inline constexpr uint32_t MediaChanged = 1110;
inline constexpr uint32_t NoMediaInDrive = 1112;
inline constexpr uint32_t IoDevice = 1117;
inline constexpr uint32_t PrivilegeNotHeld = 1314;
inline constexpr uint32_t Timeout = 1460;

// Codes with this bit carry a platform error number that has no meaning of its own above
// (the low 16 bits); their text is the platform's text for that number.
inline constexpr uint32_t PlatformErrnoFlag = 0x20000000;

} // namespace SystemError

// Maps an errno of open, close, position, size and control calls onto a system error code.
uint32_t errnoToSystemError(int err);

// Maps an errno of a read or write onto a system error code: a vanished device reads as "device gone"
// and a removed medium as "media changed".
uint32_t errnoToTransferError(int err);

// Maps an errno of a flush onto a system error code: an I/O error there is a write that failed
// after it had been taken into the system's cache.
uint32_t errnoToFlushError(int err);

// The platform's own text for a system error code (the text of the errno it came from where there is
// one), without trailing line breaks.
QString systemErrorText(uint32_t code);
