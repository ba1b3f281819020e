// The replaceable platform back end: every operating-system call of the kernel goes through it.
// Errors are reported as system error codes (SystemError.h), whatever the platform.
#pragma once

#include <QString>

#include <cstdint>

// An open handle of the back end; NullPlatformHandle while closed.
using PlatformHandle = std::intptr_t;
inline constexpr PlatformHandle NullPlatformHandle = -1;

enum class SeekOrigin : uint32_t { Begin = 0, Current = 1, End = 2 };

// How NativePath treats a path on this platform.
enum class PathStyle : uint32_t { Windows = 0, Posix = 1 };

class IPlatformBackend
{
public:
    virtual ~IPlatformBackend();

    // Opens a file, device or volume: read access, plus write unless readOnly; sharing read and write;
    // create replaces or makes the file, otherwise it must exist. Returns NullPlatformHandle and the
    // system error on failure.
    virtual PlatformHandle Open(const QString &path, bool readOnly, bool create, uint32_t &error) = 0;
    virtual bool Close(PlatformHandle handle, uint32_t &error) = 0;

    // Sets the position (absolute or relative) and gives the resulting position from the start.
    virtual bool SetPosition(PlatformHandle handle, int64_t offset, SeekOrigin origin, uint64_t &position,
                             uint32_t &error) = 0;

    // Transfer at the current position: done is the count transferred (possibly short).
    virtual bool Read(PlatformHandle handle, void *buffer, uint32_t size, uint32_t &done,
                      uint32_t &error) = 0;
    virtual bool Write(PlatformHandle handle, const void *buffer, uint32_t size, uint32_t &done,
                       uint32_t &error) = 0;

    // Transfer at an absolute position (at most INT64_MAX). PositionFailed: the position could not be
    // reached and nothing was transferred; TransferFailed: the transfer itself failed after done bytes.
    // A back end whose TransfersKeepPosition() is true leaves the handle's position where it was;
    // otherwise the position ends after the bytes transferred. The default positions the handle and
    // transfers at the current position.
    enum class TransferResult : uint32_t { Done = 0, PositionFailed = 1, TransferFailed = 2 };
    virtual TransferResult ReadAt(PlatformHandle handle, uint64_t position, void *buffer, uint32_t size,
                                  uint32_t &done, uint32_t &error);
    virtual TransferResult WriteAt(PlatformHandle handle, uint64_t position, const void *buffer,
                                   uint32_t size, uint32_t &done, uint32_t &error);
    virtual bool TransfersKeepPosition() const { return false; }

    virtual bool GetFileSize(PlatformHandle handle, uint64_t &size, uint32_t &error) = 0;
    // Cuts or extends the file at the current position.
    virtual bool SetEndOfFile(PlatformHandle handle, uint32_t &error) = 0;
    // Sends what was written through the handle to the medium and waits for it: a write that the
    // system kept in its cache and could not place fails here.
    virtual bool Flush(PlatformHandle handle, uint32_t &error) = 0;

    // Whether the process would be let open path for writing, asked without opening it (a
    // write-protected medium, a read-only mount or missing rights answer with the system error).
    virtual bool CanOpenForWriting(const QString &path, uint32_t &error) = 0;

    // A device control (DeviceControl.h codes and layouts); returned is the byte count of the answer,
    // also given on failure.
    virtual bool DeviceControl(PlatformHandle handle, uint32_t code, const void *in, uint32_t inSize,
                               void *out, uint32_t outSize, uint32_t &returned, uint32_t &error) = 0;

    // Free bytes available to the caller on the volume of path.
    virtual bool GetFreeSpace(const QString &path, uint64_t &freeBytes, uint32_t &error) = 0;

    virtual bool ClearAttributes(const QString &path, uint32_t &error) = 0;
    virtual bool DeleteFile(const QString &path, uint32_t &error) = 0;
    // Gives a file another name, replacing a file of that name.
    virtual bool MoveFile(const QString &from, const QString &to, uint32_t &error) = 0;

    // Mounts the volume at a mount point ("%1:\" for a drive letter) and removes a mount point.
    virtual bool SetMountPoint(const QString &mountPoint, const QString &volumeName, uint32_t &error) = 0;
    virtual bool DeleteMountPoint(const QString &mountPoint, uint32_t &error) = 0;

    // The system's text for a system error code, trimmed.
    virtual QString ErrorText(uint32_t code) = 0;

    // The pretty product name of the system and its version ("unknown" when not known).
    virtual QString ProductName() = 0;
    virtual QString ProductVersion() = 0;

    // Obtains the privilege to shut the system down and restarts it at once, forced, with the reason.
    virtual bool RestartWithPrivilege(uint32_t reason, uint32_t &error) = 0;

    // The path conventions of the platform.
    virtual PathStyle Paths() const = 0;
};

// The back end of the platform the program runs on (the Linux back end on Linux).
IPlatformBackend &DefaultPlatformBackend();
