#include "Kernel/Implementation/Common/SystemError.h"

#include <cerrno>
#include <cstring>

namespace {

struct Mapping
{
    int err;
    uint32_t code;
};

// errno -> code; the first line of a code gives the errno whose text the code prints.
const Mapping kMappings[] = {
    {ENOSYS, SystemError::InvalidFunction},
    {ENOTTY, SystemError::InvalidFunction},
    {ENOENT, SystemError::FileNotFound},
    {ENXIO, SystemError::FileNotFound},
    {ENOTDIR, SystemError::PathNotFound},
    {EMFILE, SystemError::TooManyOpenFiles},
    {ENFILE, SystemError::TooManyOpenFiles},
    {EACCES, SystemError::AccessDenied},
    {EPERM, SystemError::AccessDenied},
    {EBADF, SystemError::InvalidHandle},
    {ENOMEM, SystemError::NotEnoughMemory},
    {EROFS, SystemError::WriteProtect},
    {ENOMEDIUM, SystemError::NotReady},
    {EIO, SystemError::Crc},
    {EBUSY, SystemError::SharingViolation},
    {ETXTBSY, SystemError::SharingViolation},
    {EOPNOTSUPP, SystemError::NotSupported},
    {ENODEV, SystemError::DevNotExist},
    {EEXIST, SystemError::FileExists},
    {EINVAL, SystemError::InvalidParameter},
    {EPIPE, SystemError::BrokenPipe},
    {ENOSPC, SystemError::DiskFull},
    {EDQUOT, SystemError::DiskFull},
    {ERANGE, SystemError::InsufficientBuffer},
    {EOVERFLOW, SystemError::InsufficientBuffer},
    {ENAMETOOLONG, SystemError::FilenameTooLong},
    {ENOTEMPTY, SystemError::DirNotEmpty},
    {ETIMEDOUT, SystemError::Timeout},
    {EISDIR, SystemError::AccessDenied},
    {ESPIPE, SystemError::SeekError},
};

// Codes that no errno stands for keep the platform-neutral text of their meaning.
struct Text
{
    uint32_t code;
    const char *text;
};
const Text kTexts[] = {
    {SystemError::Success, "Success"},
    {SystemError::HandleEof, "Reached the end of the file"},
    {SystemError::SectorNotFound, "The drive cannot find the sector requested"},
    {SystemError::WriteFault, "The system cannot write to the specified device"},
    {SystemError::ReadFault, "The system cannot read from the specified device"},
    {SystemError::GenFailure, "A device attached to the system is not functioning"},
    {SystemError::LockViolation, "The process cannot access the file because another process has locked a "
                                 "portion of the file"},
    {SystemError::CallNotImplemented, "This function is not supported on this system"},
    {SystemError::InsufficientBuffer, "The data area passed to a system call is too small"},
    {SystemError::InvalidName, "The filename, directory name, or volume label syntax is incorrect"},
    {SystemError::NegativeSeek,
     "An attempt was made to move the file pointer before the beginning of the file"},
    {SystemError::NotLocked, "The segment is already unlocked"},
    {SystemError::Busy, "The requested resource is in use"},
    {SystemError::AlreadyExists, "Cannot create a file when that file already exists"},
    {SystemError::MoreData, "More data is available"},
    {SystemError::NoMoreItems, "No more data is available"},
    {SystemError::UnrecognizedVolume, "The volume does not contain a recognized file system"},
    {SystemError::FileInvalid, "The volume for a file has been externally altered so that the opened file is "
                               "no longer valid"},
    {SystemError::MediaChanged, "The media in the drive may have changed"},
    {SystemError::NoMediaInDrive, "No media in drive"},
    {SystemError::IoDevice, "The request could not be performed because of an I/O device error"},
    {SystemError::PrivilegeNotHeld, "A required privilege is not held by the client"},
};

QString trimmed(const char *text)
{
    return QString::fromLocal8Bit(text).trimmed();
}

} // namespace

uint32_t errnoToSystemError(int err)
{
    if (err == 0)
        return SystemError::Success;
    for (const Mapping &m : kMappings)
        if (m.err == err)
            return m.code;
    return SystemError::PlatformErrnoFlag | (uint32_t(err) & 0xFFFF);
}

uint32_t errnoToTransferError(int err)
{
    switch (err) {
    case ENXIO:
    case ENODEV:
    case ENOENT:
        return SystemError::DevNotExist;
    case ENOMEDIUM:
        return SystemError::MediaChanged;
    default:
        return errnoToSystemError(err);
    }
}

uint32_t errnoToFlushError(int err)
{
    return err == EIO ? SystemError::WriteFault : errnoToSystemError(err);
}

QString systemErrorText(uint32_t code)
{
    if (code & SystemError::PlatformErrnoFlag)
        return trimmed(strerror(int(code & 0xFFFF)));
    for (const Text &t : kTexts)
        if (t.code == code)
            return QString::fromLatin1(t.text);
    for (const Mapping &m : kMappings)
        if (m.code == code)
            return trimmed(strerror(m.err));
    return QStringLiteral("Unknown error %1").arg(code);
}
