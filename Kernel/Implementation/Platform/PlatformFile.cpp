#include "Kernel/Implementation/Platform/PlatformFile.h"

#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/PlatformOps.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cRoot.h"

#include <QMutexLocker>

#include <algorithm>
#include <cstring>
#include <map>
#include <memory>

namespace {

const char *const kOperationTexts[] = {
    "GetVersionEx",
    "DeviceIoControl(IOCTL_DISK_GET_DRIVE_GEOMETRY)",
    "DeviceIoControl(IOCTL_STORAGE_GET_DEVICE_NUMBER)",
    "DeviceIoControl(IOCTL_DISK_GET_PARTITION_INFO)",
    "DeviceIoControl(IOCTL_VOLUME_GET_VOLUME_DISK_EXTENTS)",
    "DeviceIoControl(IOCTL_DISK_UPDATE_PROPERTIES)",
    "DeviceIoControl(IOCTL_DISK_GET_DRIVE_LAYOUT_EX)",
    "FindFirstVolume",
    "FindNextVolume",
    "FindVolumeClose",
    "GetVolumeInformation",
    "DeviceIoControl(FSCTL_LOCK_VOLUME)",
    "DeviceIoControl(FSCTL_DISMOUNT_VOLUME)",
    "DeviceIoControl(FSCTL_UNLOCK_VOLUME)",
    "DeleteVolumeMountPoint",
    "SetVolumeMountPoint",
    "SetVolumeLabel",
    "CreateFile",
    "CreateFile",
    "GetFileSizeEx",
    "SetFilePointerEx",
    "ReadFile",
    "WriteFile",
    "SetEndOfFile",
    "CloseHandle",
    "SetFileTime",
    "SetFileAttributes",
    "DeleteFile",
    "MoveFile",
    "CreateDirectory",
};

constexpr uint32_t kLayoutHeader = sizeof(DeviceControl::DRIVE_LAYOUT_INFORMATION_EX);
constexpr uint32_t kLayoutEntry = sizeof(DeviceControl::PARTITION_INFORMATION_EX);
constexpr uint32_t kLayoutSizes = 128;

} // namespace

QString PlatformOperationText(uint32_t operation)
{
    if (operation < std::size(kOperationTexts))
        return QString::fromLatin1(kOperationTexts[operation]);
    return QStringLiteral("Unknown 0x%1").arg(operation, 8, 16, QLatin1Char('0'));
}

CPlatformFile::CPlatformFile(cRoot *owner, const QString &name, PlatformKind kind)
    : m_owner(owner), m_kind(kind), m_name(name)
{
}

CPlatformFile::~CPlatformFile()
{
    QMutexLocker guard(&m_lock);
    if (m_handle == NullPlatformHandle)
        return;
    Internal(QStringLiteral("Not closed handle %1").arg(m_name));
    // A locked volume is left unlocked rather than leaking its handle.
    uint32_t error = 0;
    if (m_locked) {
        uint32_t returned = 0;
        Backend().DeviceControl(m_handle, DeviceControl::FSCTL_UNLOCK_VOLUME, nullptr, 0, nullptr, 0,
                                returned, error);
        m_locked = 0;
    }
    if (!Backend().Close(m_handle, error))
        Record(PlatformOperation::CloseHandle, 0, 0, error);
    m_handle = NullPlatformHandle;
}

IPlatformBackend &CPlatformFile::Backend() const
{
    return m_owner ? m_owner->Backend() : DefaultPlatformBackend();
}

void CPlatformFile::Internal(const QString &text) const
{
    if (m_owner)
        m_owner->EmitInternal(text);
}

void CPlatformFile::Debug(uint32_t line, uint32_t level, const QString &text) const
{
    if (m_owner)
        m_owner->EmitDebug(QStringLiteral(__FILE__), line, level, text);
}

void CPlatformFile::Record(PlatformOperation op, uint64_t position, uint64_t block, uint32_t error) const
{
    if (m_owner)
        m_owner->EmitPlatform(static_cast<uint32_t>(op), m_name, position, block, error);
}

bool CPlatformFile::EnsureOpen()
{
    if (m_handle != NullPlatformHandle)
        return true;
    return Reopen(true);
}

QString CPlatformFile::OpenPath() const
{
    return m_kind == PlatformKind::File ? NativePath(m_name, Backend().Paths()) : m_name;
}

bool CPlatformFile::EnsureWriteAccess()
{
    if (m_writeOpen)
        return true;
    if (!m_writable) {
        m_error = SystemError::AccessDenied;
        Internal(QStringLiteral("Attempt to write read-only handle %1").arg(m_name));
        return false;
    }
    IPlatformBackend &backend = Backend();
    uint32_t error = 0;
    const PlatformHandle h = backend.Open(OpenPath(), false, false, error);
    if (h == NullPlatformHandle) {
        m_error = error;
        Record(PlatformOperation::CreateFileOpen, 0, 0, error);
        return false;
    }
    if (m_handle != NullPlatformHandle) {
        // A file's reads at the current position go on where the read-only handle stood.
        uint64_t position = 0, reached = 0;
        const bool carry = m_kind == PlatformKind::File && SyncPosition(error) &&
                           backend.SetPosition(m_handle, 0, SeekOrigin::Current, position, error);
        if (!backend.Close(m_handle, error))
            Record(PlatformOperation::CloseHandle, 0, 0, error);
        if (carry)
            backend.SetPosition(h, int64_t(position), SeekOrigin::Begin, reached, error);
    }
    m_positionPending = false;
    Adopt(h, true);
    return true;
}

void CPlatformFile::Adopt(PlatformHandle handle, bool writeOpen)
{
    m_handle = handle;
    m_writeOpen = writeOpen;
    // A volume is read and written to its last sector, past what its file system covers.
    if (m_kind == PlatformKind::Volume) {
        uint32_t returned = 0, ignored = 0;
        Backend().DeviceControl(handle, DeviceControl::FSCTL_ALLOW_EXTENDED_DASD_IO, nullptr, 0, nullptr, 0,
                                returned, ignored);
    }
    Debug(__LINE__, 2, QStringLiteral("Open: ") + m_name);
}

QString CPlatformFile::GetName()
{
    QMutexLocker guard(&m_lock);
    return m_name;
}

bool CPlatformFile::IsWritable()
{
    QMutexLocker guard(&m_lock);
    if (!m_writable)
        return false;
    // Whether a write open would be let through, asked without making one.
    if (!m_writeOpen) {
        uint32_t error = 0;
        if (!Backend().CanOpenForWriting(OpenPath(), error))
            return false;
    }
    if (m_kind != PlatformKind::Device && m_kind != PlatformKind::Volume)
        return true;
    if (!DIOC(DeviceControl::IOCTL_DISK_IS_WRITABLE, nullptr, 0, nullptr, 0))
        return m_error != SystemError::WriteProtect;
    return true;
}

bool CPlatformFile::IsOpened()
{
    QMutexLocker guard(&m_lock);
    return m_handle != NullPlatformHandle;
}

bool CPlatformFile::IsLocked()
{
    QMutexLocker guard(&m_lock);
    return m_locked != 0;
}

bool CPlatformFile::Rename(const QString &newName)
{
    QMutexLocker guard(&m_lock);
    if (m_handle != NullPlatformHandle) {
        Internal(QStringLiteral("Attempt to rename non closed file %1").arg(m_name));
        return false;
    }
    m_name = newName;
    return true;
}

bool CPlatformFile::SetWritable(bool writable)
{
    QMutexLocker guard(&m_lock);
    m_writable = writable ? 1 : 0;
    return writable;
}

bool CPlatformFile::Create()
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::File) {
        Internal(QStringLiteral("Attempt to create storage file %1").arg(m_name));
        return false;
    }
    if (m_handle != NullPlatformHandle) {
        Internal(QStringLiteral("Attempt to create non closed file %1").arg(m_name));
        return false;
    }
    m_writable = 1;
    uint32_t error = 0;
    PlatformHandle h = Backend().Open(NativePath(m_name, Backend().Paths()), false, true, error);
    if (h == NullPlatformHandle) {
        m_error = error;
        Record(PlatformOperation::CreateFileCreate, 0, 0, error);
        return false;
    }
    m_handle = h;
    m_writeOpen = true;
    Debug(__LINE__, 2, QStringLiteral("Create: ") + m_name);
    return true;
}

bool CPlatformFile::Reopen(bool report)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_handle != NullPlatformHandle) {
        Internal(QStringLiteral("Attempt to reopen non closed file %1").arg(m_name));
        return false;
    }
    // Reading needs no more: a write opens the handle again for writing when it comes.
    IPlatformBackend &backend = Backend();
    uint32_t error = 0;
    const PlatformHandle h = backend.Open(OpenPath(), true, false, error);
    if (h == NullPlatformHandle) {
        m_error = error;
        if (report)
            Record(PlatformOperation::CreateFileOpen, 0, 0, error);
        return false;
    }
    Adopt(h, false);
    return true;
}

bool CPlatformFile::GetSize(uint64_t &size)
{
    QMutexLocker guard(&m_lock);
    size = 0;
    m_error = 0;
    if (m_kind != PlatformKind::File) {
        Internal(QStringLiteral("Attempt to get size of storage file %1").arg(m_name));
        return false;
    }
    if (!EnsureOpen())
        return false;
    uint32_t error = 0;
    uint64_t value = 0;
    if (!Backend().GetFileSize(m_handle, value, error)) {
        m_error = error;
        Record(PlatformOperation::GetFileSizeEx, 0, 0, error);
        return false;
    }
    size = value;
    return true;
}

bool CPlatformFile::Resize(uint64_t newSize)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::File) {
        Internal(QStringLiteral("Attempt to resize storage file %1").arg(m_name));
        return false;
    }
    // Resizing writes the file.
    if (!EnsureWriteAccess())
        return false;
    uint32_t error = 0;
    uint64_t position = 0;
    m_positionPending = false;
    if (newSize > uint64_t(INT64_MAX) ||
        !Backend().SetPosition(m_handle, int64_t(newSize), SeekOrigin::Begin, position, error)) {
        m_error = error ? error : SystemError::InvalidParameter;
        Record(PlatformOperation::SetFilePointerEx, newSize, 0, m_error);
        return false;
    }
    if (!Backend().SetEndOfFile(m_handle, error)) {
        m_error = error;
        Record(PlatformOperation::SetEndOfFile, newSize, 0, error);
        return false;
    }
    return true;
}

bool CPlatformFile::GetPosition(uint64_t &position)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_lost) {
        m_error = m_lost;
        return false;
    }
    if (!EnsureOpen())
        return false;
    uint32_t error = 0;
    if (!SyncPosition(error) || !Backend().SetPosition(m_handle, 0, SeekOrigin::Current, position, error)) {
        m_error = error;
        Record(PlatformOperation::SetFilePointerEx, 0, 0, error);
        return false;
    }
    return true;
}

// Read and Write hand over to ReadWrite, which holds the lock for the whole transfer.
bool CPlatformFile::Read(uint64_t pos, uint32_t size, void *buffer)
{
    return ReadWrite(true, pos, size, buffer);
}

bool CPlatformFile::Write(uint64_t pos, uint32_t size, const void *buffer)
{
    return ReadWrite(false, pos, size, const_cast<void *>(buffer));
}

bool CPlatformFile::SyncPosition(uint32_t &error)
{
    if (!m_positionPending)
        return true;
    m_positionPending = false;
    uint64_t reached = 0;
    return Backend().SetPosition(m_handle, int64_t(m_position), SeekOrigin::Begin, reached, error);
}

// One transfer at pos; a buffer not aligned to 4 bytes goes through a temporary one. Sets the error of
// a failed positioning or transfer.
IPlatformBackend::TransferResult CPlatformFile::Attempt(IPlatformBackend &backend, bool read, uint64_t pos,
                                                        uint32_t size, void *buffer, uint32_t &done)
{
    using Result = IPlatformBackend::TransferResult;
    constexpr uint32_t kKeptBounce = 1u << 20;
    uint32_t error = 0;
    done = 0;
    Result result;
    if ((reinterpret_cast<std::uintptr_t>(buffer) & 3) == 0) {
        result = read ? backend.ReadAt(m_handle, pos, buffer, size, done, error)
                      : backend.WriteAt(m_handle, pos, buffer, size, done, error);
    } else {
        std::unique_ptr<uint8_t[]> large;
        uint8_t *temp;
        if (size <= kKeptBounce) {
            if (m_bounce.size() < std::max(size, 1u))
                m_bounce.resize(std::max(size, 1u));
            temp = m_bounce.data();
        } else {
            large.reset(new uint8_t[size]);
            temp = large.get();
        }
        if (read) {
            result = backend.ReadAt(m_handle, pos, temp, size, done, error);
            if (result == Result::Done)
                std::memcpy(buffer, temp, std::min(done, size));
        } else {
            if (size)
                std::memcpy(temp, buffer, size);
            result = backend.WriteAt(m_handle, pos, temp, size, done, error);
        }
    }
    if (result != Result::PositionFailed && backend.TransfersKeepPosition()) {
        // The handle would have stood after the bytes transferred.
        m_position = pos + std::min(done, size);
        m_positionPending = true;
    }
    if (result == Result::PositionFailed)
        m_error = error ? error : SystemError::NegativeSeek;
    else if (result == Result::TransferFailed)
        m_error = error ? error : SystemError::GenFailure;
    return result;
}

bool CPlatformFile::ReadWrite(bool read, uint64_t pos, uint32_t size, void *buffer)
{
    using Result = IPlatformBackend::TransferResult;
    QMutexLocker guard(&m_lock);
    m_error = 0;
    // A closed handle that is to write opens for writing straight away.
    if (m_handle == NullPlatformHandle && !(read || m_lost ? Reopen(true) : EnsureWriteAccess()))
        return false;
    if (m_kind == PlatformKind::File && pos == CurrentPosition) {
        if (!(read ? GetPosition(pos) : GetSize(pos)))
            return false;
        m_error = 0;
    }
    if (m_lost) {
        m_error = m_lost;
        return false;
    }
    const PlatformOperation op = read ? PlatformOperation::ReadFile : PlatformOperation::WriteFile;
    if (pos > uint64_t(INT64_MAX)) {
        m_error = SystemError::NegativeSeek;
        Record(PlatformOperation::SetFilePointerEx, pos, size, m_error);
        return false;
    }
    IPlatformBackend &backend = Backend();

    // Attempts are counted from the first failure on: a transfer that succeeds never asks.
    uint32_t attempts = 0;
    bool reopened = false;
    for (;;) {
        // A handle opened (or opened again after a media change) for reading gives way to one that
        // may write; a refusal fails the write with the system's answer.
        if (!read && !EnsureWriteAccess())
            return false;
        uint32_t done = 0;
        const Result result = Attempt(backend, read, pos, size, buffer, done);
        if (result == Result::PositionFailed) {
            Record(PlatformOperation::SetFilePointerEx, pos, size, m_error);
            return false;
        }
        if (result == Result::Done) {
            if (done == size)
                return true;
            m_error = SystemError::HandleEof;
            Record(op, pos, size, m_error);
            return false;
        }
        const uint32_t error = m_error;
        if (m_kind == PlatformKind::Volume && error == SystemError::MediaChanged && !reopened) {
            reopened = true;
            if (Close(false) && Reopen(true)) {
                m_error = 0;
                continue;
            }
            // The volume could not be opened again: the failure counts as an attempt.
            if (m_handle == NullPlatformHandle) {
                m_error = error;
                Record(op, pos, size, error);
                return false;
            }
            m_error = error;
        }
        if (!m_lost && ((m_kind == PlatformKind::Device &&
                         (error == SystemError::FileNotFound || error == SystemError::DevNotExist)) ||
                        (m_kind == PlatformKind::Volume && error == SystemError::FileInvalid))) {
            m_lost = error;
            return false;
        }
        if (attempts == 0) {
            attempts = 1;
            if (m_kind == PlatformKind::Device || m_kind == PlatformKind::Volume)
                attempts = m_owner ? m_owner->RetryCount(0) : 2;
            if (attempts == 0)
                attempts = 1;
        }
        if (--attempts == 0) {
            Record(op, pos, size, error);
            return false;
        }
    }
}

bool CPlatformFile::Flush(uint32_t &error)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_lost) {
        m_error = error = m_lost;
        return false;
    }
    error = 0;
    // A handle that never wrote has nothing on its way to the medium.
    if (m_handle == NullPlatformHandle || !m_writeOpen)
        return true;
    if (!Backend().Flush(m_handle, error)) {
        m_error = error;
        // What failed is writing: the data did not reach the medium.
        Record(PlatformOperation::WriteFile, 0, 0, error);
        return false;
    }
    return true;
}

bool CPlatformFile::Lock()
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::Volume) {
        Internal(QStringLiteral("Attempt to lock non volume handle %1").arg(m_name));
        return false;
    }
    if (m_locked) {
        Internal(QStringLiteral("Attempt to lock locked volume handle %1").arg(m_name));
        return false;
    }
    // The lock stays with the handle: one that will write is opened for writing first.
    if (m_writable ? !EnsureWriteAccess() : !EnsureOpen())
        return false;
    if (!DIOC(DeviceControl::FSCTL_LOCK_VOLUME, nullptr, 0, nullptr, 0))
        return false;
    m_locked = 1;
    return true;
}

bool CPlatformFile::Dismount(bool force)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::Volume) {
        Internal(QStringLiteral("Attempt to dismount non volume handle %1").arg(m_name));
        return false;
    }
    if (!force) {
        if (!m_locked) {
            Internal(QStringLiteral("Attempt to dismount non locked volume handle %1").arg(m_name));
            return false;
        }
        if (m_handle == NullPlatformHandle) {
            m_error = SystemError::InvalidHandle;
            return false;
        }
    } else if (!EnsureOpen()) {
        return false;
    }
    if (!DIOC(DeviceControl::FSCTL_DISMOUNT_VOLUME, nullptr, 0, nullptr, 0))
        return false;
    if (force) {
        // A forced dismount ends the lock with the handle.
        if (m_locked) {
            uint32_t returned = 0, error = 0;
            Backend().DeviceControl(m_handle, DeviceControl::FSCTL_UNLOCK_VOLUME, nullptr, 0, nullptr, 0,
                                    returned, error);
            m_locked = 0;
        }
        return Close(false);
    }
    return true;
}

bool CPlatformFile::Unlock()
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::Volume) {
        Internal(QStringLiteral("Attempt to unlock non volume handle %1").arg(m_name));
        return false;
    }
    if (!m_locked) {
        Internal(QStringLiteral("Attempt to unlock non locked volume handle %1").arg(m_name));
        return false;
    }
    if (m_handle == NullPlatformHandle) {
        m_error = SystemError::InvalidHandle;
        return false;
    }
    if (!DIOC(DeviceControl::FSCTL_UNLOCK_VOLUME, nullptr, 0, nullptr, 0))
        return false;
    m_locked = 0;
    return Close(false);
}

bool CPlatformFile::GetFreeSpace(uint64_t &freeBytes)
{
    QMutexLocker guard(&m_lock);
    freeBytes = 0;
    m_error = 0;
    if (m_kind != PlatformKind::Volume) {
        Internal(QStringLiteral("Attempt to get free space from non volume handle %1").arg(m_name));
        return false;
    }
    IPlatformBackend &backend = Backend();
    const QChar separator = backend.Paths() == PathStyle::Windows ? QLatin1Char('\\') : QLatin1Char('/');
    QString path = m_name;
    if (!path.endsWith(separator))
        path += separator;
    uint32_t error = 0;
    uint64_t value = 0;
    if (!backend.GetFreeSpace(NativePath(path, backend.Paths()), value, error)) {
        m_error = error;
        Record(PlatformOperation::GetFileSizeEx, 0, 0, error);
        return false;
    }
    freeBytes = value;
    return true;
}

bool CPlatformFile::Update()
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_kind != PlatformKind::Device) {
        Internal(QStringLiteral("Attempt to updating non device handle %1").arg(m_name));
        return false;
    }
    if (!EnsureOpen())
        return false;
    if (!DIOC(DeviceControl::IOCTL_DISK_UPDATE_PROPERTIES, nullptr, 0, nullptr, 0))
        return false;
    return Close(false);
}

bool CPlatformFile::GetLayoutInfo(QList<uint64_t> &offsets)
{
    QMutexLocker guard(&m_lock);
    offsets.clear();
    m_error = 0;
    if (m_kind != PlatformKind::Device) {
        Internal(QStringLiteral("Attempt to get layout info from non device handle %1").arg(m_name));
        return false;
    }
    if (!EnsureOpen())
        return false;
    QByteArray buffer;
    uint32_t returned = 0;
    bool ok = false;
    for (uint32_t n = 1; n <= kLayoutSizes; ++n) {
        const uint32_t bufferSize = kLayoutHeader + n * kLayoutEntry;
        buffer = QByteArray(int(bufferSize), '\0');
        if (DIOC(DeviceControl::IOCTL_DISK_GET_DRIVE_LAYOUT_EX, nullptr, 0, buffer.data(), bufferSize,
                 &returned)) {
            ok = true;
            break;
        }
        if (m_error != SystemError::InsufficientBuffer)
            break;
    }
    if (!ok) {
        Record(PlatformOperation::DiskGetDriveLayoutEx, 0, 0, m_error);
        return false;
    }
    const uint32_t bufferSize = uint32_t(buffer.size());
    DeviceControl::DRIVE_LAYOUT_INFORMATION_EX header;
    std::memcpy(&header, buffer.constData(), sizeof(header));
    if (returned != bufferSize || header.PartitionCount != (bufferSize - kLayoutHeader) / kLayoutEntry)
        return false;
    std::map<uint32_t, uint64_t> byNumber;
    for (uint32_t i = 0; i < header.PartitionCount; ++i) {
        DeviceControl::PARTITION_INFORMATION_EX entry;
        std::memcpy(&entry, buffer.constData() + kLayoutHeader + i * kLayoutEntry, sizeof(entry));
        if (entry.PartitionNumber == 0)
            continue;
        if (!byNumber.emplace(entry.PartitionNumber, uint64_t(entry.StartingOffset)).second)
            return false;
    }
    for (const auto &[number, offset] : byNumber)
        offsets.append(offset);
    return true;
}

bool CPlatformFile::Close(bool deleteFile)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (m_handle == NullPlatformHandle) {
        Internal(QStringLiteral("Attempt to close non opened file %1").arg(m_name));
        return false;
    }
    if (m_locked) {
        Internal(QStringLiteral("Attempt to close locked volume %1").arg(m_name));
        return false;
    }
    uint32_t error = 0;
    if (!Backend().Close(m_handle, error)) {
        m_error = error;
        Record(PlatformOperation::CloseHandle, 0, 0, error);
        return false;
    }
    m_handle = NullPlatformHandle;
    m_writeOpen = false;
    m_positionPending = false;
    Debug(__LINE__, 3, QStringLiteral("Close: ") + m_name);
    if (m_kind == PlatformKind::File && deleteFile) {
        IPlatformBackend &backend = Backend();
        if (!backend.DeleteFile(NativePath(m_name, backend.Paths()), error)) {
            m_error = error;
            Record(PlatformOperation::DeleteFile, 0, 0, error);
            return false;
        }
    }
    return true;
}

uint32_t CPlatformFile::GetError()
{
    QMutexLocker guard(&m_lock);
    return m_error;
}

bool CPlatformFile::IsLost()
{
    QMutexLocker guard(&m_lock);
    return m_lost != 0;
}

PlatformHandle CPlatformFile::GetHandle()
{
    QMutexLocker guard(&m_lock);
    // Whoever uses the handle itself finds it where the last transfer left it.
    uint32_t ignored = 0;
    if (m_handle != NullPlatformHandle)
        SyncPosition(ignored);
    return m_handle;
}

bool CPlatformFile::DIOC(uint32_t code, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                         uint32_t *returned)
{
    QMutexLocker guard(&m_lock);
    m_error = 0;
    if (returned)
        *returned = 0;
    if (m_kind == PlatformKind::File) {
        Internal(QStringLiteral("Attempt to DIOC for file %1").arg(m_name));
        return false;
    }
    if (m_lost) {
        m_error = m_lost;
        return false;
    }
    if (!EnsureOpen())
        return false;
    uint32_t count = 0, error = 0;
    const bool ok = Backend().DeviceControl(m_handle, code, in, inSize, out, outSize, count, error);
    if (returned)
        *returned = std::min(count, outSize);
    if (!ok) {
        m_error = error ? error : SystemError::GenFailure;
        return false;
    }
    return true;
}
