// The platform back end of Linux: files and block devices through POSIX calls, device controls answered
// from ioctls, sysfs, udev and libblkid.
#pragma once

#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <QMutex>
#include <QString>

#include <map>

class LinuxBackend : public IPlatformBackend
{
public:
    LinuxBackend();
    ~LinuxBackend() override;

    PlatformHandle Open(const QString &path, bool readOnly, bool create, uint32_t &error) override;
    bool Close(PlatformHandle handle, uint32_t &error) override;
    bool SetPosition(PlatformHandle handle, int64_t offset, SeekOrigin origin, uint64_t &position,
                     uint32_t &error) override;
    bool Read(PlatformHandle handle, void *buffer, uint32_t size, uint32_t &done, uint32_t &error) override;
    bool Write(PlatformHandle handle, const void *buffer, uint32_t size, uint32_t &done,
               uint32_t &error) override;
    TransferResult ReadAt(PlatformHandle handle, uint64_t position, void *buffer, uint32_t size,
                          uint32_t &done, uint32_t &error) override;
    TransferResult WriteAt(PlatformHandle handle, uint64_t position, const void *buffer, uint32_t size,
                           uint32_t &done, uint32_t &error) override;
    bool TransfersKeepPosition() const override { return true; }
    bool GetFileSize(PlatformHandle handle, uint64_t &size, uint32_t &error) override;
    bool SetEndOfFile(PlatformHandle handle, uint32_t &error) override;
    bool Flush(PlatformHandle handle, uint32_t &error) override;
    bool CanOpenForWriting(const QString &path, uint32_t &error) override;
    bool DeviceControl(PlatformHandle handle, uint32_t code, const void *in, uint32_t inSize, void *out,
                       uint32_t outSize, uint32_t &returned, uint32_t &error) override;
    bool GetFreeSpace(const QString &path, uint64_t &freeBytes, uint32_t &error) override;
    bool ClearAttributes(const QString &path, uint32_t &error) override;
    bool DeleteFile(const QString &path, uint32_t &error) override;
    bool MoveFile(const QString &from, const QString &to, uint32_t &error) override;
    bool SetMountPoint(const QString &mountPoint, const QString &volumeName, uint32_t &error) override;
    bool DeleteMountPoint(const QString &mountPoint, uint32_t &error) override;
    QString ErrorText(uint32_t code) override;
    QString ProductName() override;
    QString ProductVersion() override;
    bool RestartWithPrivilege(uint32_t reason, uint32_t &error) override;
    PathStyle Paths() const override { return PathStyle::Posix; }

private:
    // Exclusive descriptors that stand for the lock of a volume, by the handle they lock.
    QMutex m_locksMutex;
    std::map<PlatformHandle, int> m_locks;

    friend class LinuxDeviceControl;
};
