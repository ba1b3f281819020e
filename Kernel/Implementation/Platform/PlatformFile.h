// A handle on a physical drive, an optical drive, a mounted volume or an ordinary file: the kernel's
// only door to the operating system's storage. Every operation takes the handle's recursive lock.
// A handle opens for reading only; the first write (or the lock of a volume that may be written)
// opens it again for writing, so nothing that only reads ever holds a medium writable.
#pragma once

#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <QList>
#include <QRecursiveMutex>
#include <QString>

#include <cstdint>
#include <vector>

class cRoot;

enum class PlatformKind : uint32_t {
    Device = 0, // physical or optical drive
    Volume = 2, // mounted volume
    File = 3,   // ordinary file
};

// Operation codes of platform records.
enum class PlatformOperation : uint32_t {
    GetVersionEx = 0,
    DiskGetDriveGeometry = 1,
    StorageGetDeviceNumber = 2,
    DiskGetPartitionInfo = 3,
    VolumeGetVolumeDiskExtents = 4,
    DiskUpdateProperties = 5,
    DiskGetDriveLayoutEx = 6,
    FindFirstVolume = 7,
    FindNextVolume = 8,
    FindVolumeClose = 9,
    GetVolumeInformation = 10,
    LockVolume = 11,
    DismountVolume = 12,
    UnlockVolume = 13,
    DeleteVolumeMountPoint = 14,
    SetVolumeMountPoint = 15,
    SetVolumeLabel = 16,
    CreateFileCreate = 17,
    CreateFileOpen = 18,
    GetFileSizeEx = 19,
    SetFilePointerEx = 20,
    ReadFile = 21,
    WriteFile = 22,
    SetEndOfFile = 23,
    CloseHandle = 24,
    SetFileTime = 25,
    SetFileAttributes = 26,
    DeleteFile = 27,
    MoveFile = 28,
    CreateDirectory = 29,
};

// The text a platform record prints for an operation code ("Unknown 0x%1" for any other code).
QString PlatformOperationText(uint32_t operation);

class CPlatformFile
{
public:
    // The position that means "current position" for reads and "end of file" for writes of a File.
    static constexpr uint64_t CurrentPosition = 0xFFFFFFFFFFFFFFFFull;

    // Opens nothing. A null owner reports nowhere and uses the default back end.
    CPlatformFile(cRoot *owner, const QString &name, PlatformKind kind);
    virtual ~CPlatformFile();

    CPlatformFile(const CPlatformFile &) = delete;
    CPlatformFile &operator=(const CPlatformFile &) = delete;

    virtual QString GetName();
    virtual bool IsWritable();
    virtual bool IsOpened();
    virtual bool IsLocked();
    virtual bool Rename(const QString &newName);
    virtual bool SetWritable(bool writable);
    virtual bool Create();
    virtual bool Reopen(bool report);
    virtual bool GetSize(uint64_t &size);
    virtual bool Resize(uint64_t newSize);
    virtual bool GetPosition(uint64_t &position);
    virtual bool Read(uint64_t pos, uint32_t size, void *buffer);
    virtual bool Write(uint64_t pos, uint32_t size, const void *buffer);
    virtual bool ReadWrite(bool read, uint64_t pos, uint32_t size, void *buffer);
    virtual bool Flush(uint32_t &error);
    virtual bool Lock();
    virtual bool Dismount(bool force);
    virtual bool Unlock();
    virtual bool GetFreeSpace(uint64_t &freeBytes);
    virtual bool Update();
    virtual bool GetLayoutInfo(QList<uint64_t> &offsets);
    virtual bool Close(bool deleteFile = false);
    virtual uint32_t GetError();
    virtual bool IsLost();
    virtual PlatformHandle GetHandle();
    virtual bool DIOC(uint32_t code, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                      uint32_t *returned = nullptr);

    PlatformKind GetKind() const { return m_kind; }
    cRoot *GetOwner() const { return m_owner; }

protected:
    IPlatformBackend &Backend() const;
    bool EnsureOpen();
    // Exchanges a read-only handle for one that may write (opening it when closed); false with the
    // error, the read-only handle kept, when writing is not allowed or the system refuses.
    bool EnsureWriteAccess();
    // The path the back end opens.
    QString OpenPath() const;
    void Internal(const QString &text) const;
    void Debug(uint32_t line, uint32_t level, const QString &text) const;
    void Record(PlatformOperation op, uint64_t position, uint64_t block, uint32_t error) const;
    IPlatformBackend::TransferResult Attempt(IPlatformBackend &backend, bool read, uint64_t pos,
                                             uint32_t size, void *buffer, uint32_t &done);
    // Moves the handle to the position a transfer left it at, where the back end did not move it.
    bool SyncPosition(uint32_t &error);

    QRecursiveMutex m_lock;
    cRoot *m_owner = nullptr;
    PlatformKind m_kind = PlatformKind::File;
    QString m_name;
    PlatformHandle m_handle = NullPlatformHandle;
    uint32_t m_error = 0;
    // 1: writes are allowed (the first one opens the handle for writing); 0: the handle only reads.
    uint8_t m_writable = 1;
    uint8_t m_locked = 0;
    // The open handle has write access.
    bool m_writeOpen = false;
    uint32_t m_lost = 0;

private:
    // Takes an open handle as the handle of this file (opened for writing or for reading only).
    void Adopt(PlatformHandle handle, bool writeOpen);
    // Where the handle stands after the last transfer when the back end transfers without moving it;
    // the handle is moved there before anything reads or uses its position.
    uint64_t m_position = 0;
    bool m_positionPending = false;
    // The temporary buffer of transfers from and to unaligned buffers, kept between transfers.
    std::vector<uint8_t> m_bounce;
};
