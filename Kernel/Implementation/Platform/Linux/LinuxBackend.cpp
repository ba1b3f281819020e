#include "Kernel/Implementation/Platform/Linux/LinuxBackend.h"

#include "Kernel/Implementation/Platform/Linux/LinuxDeviceControl.h"

#include "Kernel/Implementation/Common/SystemError.h"

#include <QFile>
#include <QMutexLocker>

#include <cerrno>
#include <fcntl.h>
#include <sys/reboot.h>
#include <sys/stat.h>
#include <sys/statvfs.h>
#include <sys/sysmacros.h>
#include <sys/utsname.h>
#include <unistd.h>

namespace {

int fdOf(PlatformHandle handle)
{
    return handle >= 0 && handle <= INT32_MAX ? int(handle) : -1;
}

QByteArray pathBytes(const QString &path)
{
    return QFile::encodeName(path);
}

// Value of a key of /etc/os-release (quotes removed), or nothing.
QString osRelease(const char *key)
{
    for (const char *file : {"/etc/os-release", "/usr/lib/os-release"}) {
        QFile f(QString::fromLatin1(file));
        if (!f.open(QIODevice::ReadOnly))
            continue;
        const QByteArray prefix = QByteArray(key) + '=';
        while (!f.atEnd()) {
            QByteArray line = f.readLine(4096).trimmed();
            if (!line.startsWith(prefix))
                continue;
            QByteArray value = line.mid(prefix.size());
            if (value.size() >= 2 && (value.front() == '"' || value.front() == '\'') &&
                value.back() == value.front())
                value = value.mid(1, value.size() - 2);
            return QString::fromUtf8(value);
        }
        return {};
    }
    return {};
}

QString kernelRelease()
{
    struct utsname u
    {
    };
    if (uname(&u) != 0)
        return {};
    return QString::fromLocal8Bit(u.release);
}

// The directory a block device is mounted at, from the mount table of the process.
QString mountPointOf(dev_t device)
{
    QFile f(QStringLiteral("/proc/self/mountinfo"));
    if (!f.open(QIODevice::ReadOnly))
        return {};
    const QByteArray id = QByteArray::number(major(device)) + ':' + QByteArray::number(minor(device));
    while (!f.atEnd()) {
        const QList<QByteArray> fields = f.readLine(65536).split(' ');
        if (fields.size() > 4 && fields.at(2) == id) {
            // Octal escapes of the mount table (\040 for a space) stand for their characters.
            QByteArray raw = fields.at(4), path;
            for (int i = 0; i < raw.size(); ++i) {
                if (raw.at(i) == '\\' && i + 3 < raw.size() + 0 && i + 3 <= raw.size() - 1 + 1) {
                    bool ok = false;
                    const int c = raw.mid(i + 1, 3).toInt(&ok, 8);
                    if (ok) {
                        path += char(c);
                        i += 3;
                        continue;
                    }
                }
                path += raw.at(i);
            }
            return QFile::decodeName(path);
        }
    }
    return {};
}

// The error of a failed transfer: an I/O error of a block device that has left the system means the
// device is gone.
uint32_t transferError(int fd, int err)
{
    if (err == EIO) {
        struct stat st
        {
        };
        if (fstat(fd, &st) == 0 && S_ISBLK(st.st_mode) &&
            ::access(QStringLiteral("/sys/dev/block/%1:%2")
                         .arg(major(st.st_rdev))
                         .arg(minor(st.st_rdev))
                         .toLatin1()
                         .constData(),
                     F_OK) != 0)
            return SystemError::DevNotExist;
    }
    return errnoToTransferError(err);
}

// Whether the handle can be positioned at the offset, as a seek before a transfer would have. A block
// device refuses a position past its end, where a positioned transfer merely finds nothing; the
// check runs only after a transfer that moved no byte, so the common path costs one call.
bool reachable(int fd, uint64_t position, uint32_t &error)
{
    if (::lseek(fd, off_t(position), SEEK_SET) >= 0)
        return true;
    error = errnoToSystemError(errno);
    return false;
}

IPlatformBackend::TransferResult failedTransfer(int fd, uint64_t position, uint32_t done, int err,
                                                uint32_t &error)
{
    if (done == 0 && !reachable(fd, position, error))
        return IPlatformBackend::TransferResult::PositionFailed;
    error = transferError(fd, err);
    return IPlatformBackend::TransferResult::TransferFailed;
}

// Transfers at a position until done, the end or a failure; an interrupted call is repeated. An empty
// transfer is checked by a seek, so a position past a device's end fails as positioning, as a seek would.
template <typename Transfer>
IPlatformBackend::TransferResult transferAt(int fd, uint64_t position, uint32_t size, uint32_t &done,
                                            uint32_t &error, Transfer transfer)
{
    done = 0;
    while (done < size) {
        const ssize_t n = transfer(done, size - done, off_t(position + done));
        if (n < 0) {
            if (errno == EINTR)
                continue;
            return failedTransfer(fd, position, done, errno, error);
        }
        if (n == 0)
            break;
        done += uint32_t(n);
    }
    if (done == 0 && size != 0 && !reachable(fd, position, error))
        return IPlatformBackend::TransferResult::PositionFailed;
    return IPlatformBackend::TransferResult::Done;
}

} // namespace

LinuxBackend::LinuxBackend() = default;
LinuxBackend::~LinuxBackend() = default;

PlatformHandle LinuxBackend::Open(const QString &path, bool readOnly, bool create, uint32_t &error)
{
    int flags = (readOnly ? O_RDONLY : O_RDWR) | O_CLOEXEC;
    if (create)
        flags |= O_CREAT | O_TRUNC;
    int fd;
    do {
        fd = ::open(pathBytes(path).constData(), flags, 0666);
    } while (fd < 0 && errno == EINTR);
    if (fd < 0) {
        error = errnoToSystemError(errno);
        return NullPlatformHandle;
    }
    struct stat st
    {
    };
    if (fstat(fd, &st) == 0 && S_ISDIR(st.st_mode)) {
        ::close(fd);
        error = SystemError::AccessDenied;
        return NullPlatformHandle;
    }
    error = 0;
    return fd;
}

bool LinuxBackend::Close(PlatformHandle handle, uint32_t &error)
{
    const int fd = fdOf(handle);
    {
        QMutexLocker guard(&m_locksMutex);
        auto it = m_locks.find(handle);
        if (it != m_locks.end()) {
            ::close(it->second);
            m_locks.erase(it);
        }
    }
    if (fd < 0 || ::close(fd) != 0) {
        // A close interrupted by a signal has still released the descriptor on Linux.
        if (fd >= 0 && errno == EINTR)
            return true;
        error = fd < 0 ? SystemError::InvalidHandle : errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::SetPosition(PlatformHandle handle, int64_t offset, SeekOrigin origin, uint64_t &position,
                               uint32_t &error)
{
    const int whence = origin == SeekOrigin::Begin     ? SEEK_SET
                       : origin == SeekOrigin::Current ? SEEK_CUR
                                                       : SEEK_END;
    const off_t result = ::lseek(fdOf(handle), off_t(offset), whence);
    if (result < 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    position = uint64_t(result);
    return true;
}

bool LinuxBackend::Read(PlatformHandle handle, void *buffer, uint32_t size, uint32_t &done, uint32_t &error)
{
    done = 0;
    auto *bytes = static_cast<uint8_t *>(buffer);
    while (done < size) {
        const ssize_t n = ::read(fdOf(handle), bytes + done, size - done);
        if (n < 0) {
            if (errno == EINTR)
                continue;
            error = transferError(fdOf(handle), errno);
            return false;
        }
        if (n == 0)
            break;
        done += uint32_t(n);
    }
    return true;
}

bool LinuxBackend::Write(PlatformHandle handle, const void *buffer, uint32_t size, uint32_t &done,
                         uint32_t &error)
{
    done = 0;
    const auto *bytes = static_cast<const uint8_t *>(buffer);
    while (done < size) {
        const ssize_t n = ::write(fdOf(handle), bytes + done, size - done);
        if (n < 0) {
            if (errno == EINTR)
                continue;
            error = transferError(fdOf(handle), errno);
            return false;
        }
        if (n == 0)
            break;
        done += uint32_t(n);
    }
    return true;
}

IPlatformBackend::TransferResult LinuxBackend::ReadAt(PlatformHandle handle, uint64_t position, void *buffer,
                                                      uint32_t size, uint32_t &done, uint32_t &error)
{
    const int fd = fdOf(handle);
    auto *bytes = static_cast<uint8_t *>(buffer);
    return transferAt(fd, position, size, done, error,
                      [fd, bytes](uint32_t at, uint32_t count, off_t offset) {
                          return ::pread(fd, bytes + at, count, offset);
                      });
}

IPlatformBackend::TransferResult LinuxBackend::WriteAt(PlatformHandle handle, uint64_t position,
                                                       const void *buffer, uint32_t size, uint32_t &done,
                                                       uint32_t &error)
{
    const int fd = fdOf(handle);
    const auto *bytes = static_cast<const uint8_t *>(buffer);
    return transferAt(fd, position, size, done, error,
                      [fd, bytes](uint32_t at, uint32_t count, off_t offset) {
                          return ::pwrite(fd, bytes + at, count, offset);
                      });
}

bool LinuxBackend::GetFileSize(PlatformHandle handle, uint64_t &size, uint32_t &error)
{
    struct stat st
    {
    };
    if (fstat(fdOf(handle), &st) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    if (S_ISBLK(st.st_mode)) {
        // A block device's size is its length.
        const off_t end = ::lseek(fdOf(handle), 0, SEEK_CUR);
        const off_t length = ::lseek(fdOf(handle), 0, SEEK_END);
        if (end >= 0)
            ::lseek(fdOf(handle), end, SEEK_SET);
        if (length < 0) {
            error = errnoToSystemError(errno);
            return false;
        }
        size = uint64_t(length);
        return true;
    }
    size = uint64_t(st.st_size);
    return true;
}

bool LinuxBackend::SetEndOfFile(PlatformHandle handle, uint32_t &error)
{
    const off_t position = ::lseek(fdOf(handle), 0, SEEK_CUR);
    if (position < 0 || ::ftruncate(fdOf(handle), position) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::Flush(PlatformHandle handle, uint32_t &error)
{
    // Only the data and what is needed to read it back: the medium's own contents are what counts.
    int result;
    do {
        result = ::fdatasync(fdOf(handle));
    } while (result != 0 && errno == EINTR);
    if (result != 0) {
        error = errnoToFlushError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::CanOpenForWriting(const QString &path, uint32_t &error)
{
    // The rights of the effective user, and a read-only mount, as an open would meet them.
    if (::faccessat(AT_FDCWD, pathBytes(path).constData(), W_OK, AT_EACCESS) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::DeviceControl(PlatformHandle handle, uint32_t code, const void *in, uint32_t inSize,
                                 void *out, uint32_t outSize, uint32_t &returned, uint32_t &error)
{
    LinuxDeviceControl control(*this, fdOf(handle), handle);
    return control.Run(code, in, inSize, out, outSize, returned, error);
}

bool LinuxBackend::GetFreeSpace(const QString &path, uint64_t &freeBytes, uint32_t &error)
{
    QString target = path;
    while (target.size() > 1 && target.endsWith(QLatin1Char('/')))
        target.chop(1);
    struct stat st
    {
    };
    if (::stat(pathBytes(target).constData(), &st) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    if (S_ISBLK(st.st_mode)) {
        // A volume named by its block device answers for the file system mounted from it.
        target = mountPointOf(st.st_rdev);
        if (target.isEmpty()) {
            error = SystemError::UnrecognizedVolume;
            return false;
        }
    }
    struct statvfs vfs
    {
    };
    if (::statvfs(pathBytes(target).constData(), &vfs) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    freeBytes = uint64_t(vfs.f_bavail) * uint64_t(vfs.f_frsize);
    return true;
}

bool LinuxBackend::ClearAttributes(const QString &path, uint32_t &error)
{
    // Linux has no attributes that keep a file from being deleted by its owner; the file must exist.
    struct stat st
    {
    };
    if (::lstat(pathBytes(path).constData(), &st) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::DeleteFile(const QString &path, uint32_t &error)
{
    if (::unlink(pathBytes(path).constData()) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::MoveFile(const QString &from, const QString &to, uint32_t &error)
{
    if (::rename(pathBytes(from).constData(), pathBytes(to).constData()) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}

bool LinuxBackend::SetMountPoint(const QString &, const QString &, uint32_t &error)
{
    // Drive letters have no meaning here.
    error = SystemError::NotSupported;
    return false;
}

bool LinuxBackend::DeleteMountPoint(const QString &, uint32_t &error)
{
    error = SystemError::NotSupported;
    return false;
}

QString LinuxBackend::ErrorText(uint32_t code)
{
    return systemErrorText(code);
}

QString LinuxBackend::ProductName()
{
    QString name = osRelease("PRETTY_NAME");
    if (name.isEmpty())
        name = osRelease("NAME");
    if (name.isEmpty())
        name = QStringLiteral("Linux");
    return name;
}

QString LinuxBackend::ProductVersion()
{
    for (const char *key : {"VERSION_ID", "VERSION", "BUILD_ID"}) {
        const QString value = osRelease(key);
        if (!value.isEmpty())
            return value;
    }
    const QString release = kernelRelease();
    return release.isEmpty() ? QStringLiteral("unknown") : release;
}

bool LinuxBackend::RestartWithPrivilege(uint32_t, uint32_t &error)
{
    ::sync();
    if (::reboot(RB_AUTOBOOT) != 0) {
        error = errnoToSystemError(errno);
        return false;
    }
    return true;
}
