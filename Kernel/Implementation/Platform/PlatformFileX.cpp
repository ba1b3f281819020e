#include "Kernel/Implementation/Platform/PlatformFileX.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cStorage.h"

CPlatformFileX::CPlatformFileX(cRoot *owner, const QString &name, cStorage *source)
    : CPlatformFile(owner, name, PlatformKind::File), m_source(source)
{
    m_writable = 0;
}

CPlatformFileX::~CPlatformFileX()
{
    // Nothing of the platform was opened: the base must not report an unclosed handle.
    m_open = false;
}

bool CPlatformFileX::IsWritable()
{
    return false;
}

bool CPlatformFileX::IsOpened()
{
    QMutexLocker locker(&m_lock);
    return m_open;
}

bool CPlatformFileX::SetWritable(bool)
{
    return false;
}

bool CPlatformFileX::Create()
{
    QMutexLocker locker(&m_lock);
    m_error = SystemError::InvalidFunction;
    Internal(QStringLiteral("Attempt to create storage file %1").arg(m_name));
    return false;
}

bool CPlatformFileX::Reopen(bool)
{
    QMutexLocker locker(&m_lock);
    m_error = 0;
    if (m_open) {
        Internal(QStringLiteral("Attempt to reopen non closed file %1").arg(m_name));
        return false;
    }
    if (!m_source) {
        m_error = SystemError::FileNotFound;
        return false;
    }
    m_open = true;
    m_position = 0;
    return true;
}

bool CPlatformFileX::GetSize(uint64_t &size)
{
    QMutexLocker locker(&m_lock);
    m_error = 0;
    size = 0;
    if (!m_source) {
        m_error = SystemError::FileNotFound;
        return false;
    }
    size = m_source->GetSize();
    return true;
}

bool CPlatformFileX::Resize(uint64_t)
{
    QMutexLocker locker(&m_lock);
    m_error = SystemError::InvalidFunction;
    return false;
}

bool CPlatformFileX::GetPosition(uint64_t &position)
{
    QMutexLocker locker(&m_lock);
    m_error = 0;
    position = m_position;
    return true;
}

bool CPlatformFileX::ReadWrite(bool read, uint64_t pos, uint32_t size, void *buffer)
{
    QMutexLocker locker(&m_lock);
    m_error = 0;
    if (!read) {
        m_error = SystemError::InvalidFunction;
        return false;
    }
    if (!m_open && !Reopen(true))
        return false;
    if (pos == CurrentPosition)
        pos = m_position;
    uint32_t error = 0;
    if (!m_source->ReadBytes(pos, size, buffer, error)) {
        m_error = error ? error : SystemError::ReadFault;
        Record(PlatformOperation::ReadFile, pos, size, m_error);
        return false;
    }
    m_position = pos + size;
    return true;
}

bool CPlatformFileX::Close(bool)
{
    QMutexLocker locker(&m_lock);
    m_error = 0;
    if (!m_open) {
        Internal(QStringLiteral("Attempt to close non opened file %1").arg(m_name));
        return false;
    }
    m_open = false;
    return true;
}
