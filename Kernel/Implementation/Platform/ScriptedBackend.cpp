#include "Kernel/Implementation/Platform/ScriptedBackend.h"

#include "Kernel/Implementation/Common/SystemError.h"

#include <QMutexLocker>

#include <cstring>

ScriptedBackend::ScriptedBackend() = default;
ScriptedBackend::~ScriptedBackend() = default;

void ScriptedBackend::log(const QString &call)
{
    m_calls.append(call);
}

uint32_t ScriptedBackend::vanishedError(const OpenFile &open) const
{
    auto it = m_files.find(open.path);
    return it == m_files.end() ? SystemError::FileNotFound : it->second.vanished;
}

void ScriptedBackend::AddFile(const QString &path, const QByteArray &data)
{
    QMutexLocker guard(&m_mutex);
    m_files[path].data = data;
}

QByteArray ScriptedBackend::FileData(const QString &path) const
{
    QMutexLocker guard(&m_mutex);
    auto it = m_files.find(path);
    return it == m_files.end() ? QByteArray() : it->second.data;
}

bool ScriptedBackend::HasFile(const QString &path) const
{
    QMutexLocker guard(&m_mutex);
    return m_files.count(path) != 0;
}

void ScriptedBackend::SetWriteOpenError(const QString &path, uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_files[path].writeOpenError = error;
}

void ScriptedBackend::Vanish(const QString &path, uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_files[path].vanished = error;
}

void ScriptedBackend::ScriptOpen(uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_openScript.push_back(error);
}

void ScriptedBackend::ScriptRead(const Transfer &step)
{
    QMutexLocker guard(&m_mutex);
    m_readScript.push_back(step);
}

void ScriptedBackend::ScriptWrite(const Transfer &step)
{
    QMutexLocker guard(&m_mutex);
    m_writeScript.push_back(step);
}

void ScriptedBackend::ScriptSeek(uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_seekScript.push_back(error);
}

void ScriptedBackend::ScriptClose(uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_closeScript.push_back(error);
}

void ScriptedBackend::ScriptFlush(uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_flushScript.push_back(error);
}

void ScriptedBackend::ScriptControl(uint32_t code, const Control &answer)
{
    QMutexLocker guard(&m_mutex);
    m_controlScript[code].push_back(answer);
}

void ScriptedBackend::SetControlHandler(uint32_t code, ControlHandler handler)
{
    QMutexLocker guard(&m_mutex);
    m_controlHandlers[code] = std::move(handler);
}

void ScriptedBackend::SetFreeSpace(const QString &path, uint64_t bytes, uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_freeSpace[path] = {bytes, error};
}

void ScriptedBackend::SetProduct(const QString &name, const QString &version)
{
    QMutexLocker guard(&m_mutex);
    m_productName = name;
    m_productVersion = version;
}

void ScriptedBackend::SetDeleteError(uint32_t error)
{
    QMutexLocker guard(&m_mutex);
    m_deleteError = error;
}

QStringList ScriptedBackend::Calls() const
{
    QMutexLocker guard(&m_mutex);
    return m_calls;
}

int ScriptedBackend::CallCount(const QString &prefix) const
{
    QMutexLocker guard(&m_mutex);
    int n = 0;
    for (const QString &c : m_calls)
        n += c.startsWith(prefix) ? 1 : 0;
    return n;
}

void ScriptedBackend::ClearCalls()
{
    QMutexLocker guard(&m_mutex);
    m_calls.clear();
}

int ScriptedBackend::OpenHandles() const
{
    QMutexLocker guard(&m_mutex);
    return int(m_open.size());
}

PlatformHandle ScriptedBackend::Open(const QString &path, bool readOnly, bool create, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("%1 %2").arg(create     ? QStringLiteral("create")
                                    : readOnly ? QStringLiteral("open ro")
                                               : QStringLiteral("open rw"),
                                    path));
    if (!m_openScript.empty()) {
        const uint32_t scripted = m_openScript.front();
        m_openScript.pop_front();
        if (scripted) {
            error = scripted;
            return NullPlatformHandle;
        }
    }
    auto it = m_files.find(path);
    if (create) {
        Entry &entry = m_files[path];
        if (entry.vanished) {
            error = entry.vanished;
            return NullPlatformHandle;
        }
        entry.data.clear();
    } else {
        if (it == m_files.end()) {
            error = SystemError::FileNotFound;
            return NullPlatformHandle;
        }
        if (it->second.vanished) {
            error = SystemError::FileNotFound;
            return NullPlatformHandle;
        }
        if (!readOnly && it->second.writeOpenError) {
            error = it->second.writeOpenError;
            return NullPlatformHandle;
        }
    }
    const PlatformHandle handle = m_next++;
    m_open[handle] = OpenFile{path, 0, readOnly};
    return handle;
}

bool ScriptedBackend::Close(PlatformHandle handle, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    auto it = m_open.find(handle);
    log(QStringLiteral("close %1").arg(it == m_open.end() ? QString() : it->second.path));
    if (!m_closeScript.empty()) {
        const uint32_t scripted = m_closeScript.front();
        m_closeScript.pop_front();
        if (scripted) {
            error = scripted;
            return false;
        }
    }
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    m_open.erase(it);
    return true;
}

bool ScriptedBackend::SetPosition(PlatformHandle handle, int64_t offset, SeekOrigin origin,
                                  uint64_t &position, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    auto it = m_open.find(handle);
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    OpenFile &open = it->second;
    int64_t base = 0;
    if (origin == SeekOrigin::Current)
        base = int64_t(open.position);
    else if (origin == SeekOrigin::End)
        base = int64_t(m_files[open.path].data.size());
    const int64_t target = base + offset;
    log(QStringLiteral("seek %1").arg(target));
    if (!m_seekScript.empty()) {
        const uint32_t scripted = m_seekScript.front();
        m_seekScript.pop_front();
        if (scripted) {
            error = scripted;
            return false;
        }
    }
    if (const uint32_t gone = vanishedError(open)) {
        error = gone;
        return false;
    }
    if (target < 0) {
        error = SystemError::NegativeSeek;
        return false;
    }
    open.position = uint64_t(target);
    position = open.position;
    return true;
}

bool ScriptedBackend::Read(PlatformHandle handle, void *buffer, uint32_t size, uint32_t &done,
                           uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    done = 0;
    log(QStringLiteral("read %1").arg(size));
    auto it = m_open.find(handle);
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    Transfer step;
    if (!m_readScript.empty()) {
        step = m_readScript.front();
        m_readScript.pop_front();
    }
    if (const uint32_t gone = vanishedError(it->second)) {
        error = gone;
        return false;
    }
    if (step.error) {
        error = step.error;
        return false;
    }
    const QByteArray &data = m_files[it->second.path].data;
    uint64_t available =
        it->second.position < uint64_t(data.size()) ? uint64_t(data.size()) - it->second.position : 0;
    const uint64_t count = std::min<uint64_t>(size, available);
    if (count)
        std::memcpy(buffer, data.constData() + it->second.position, size_t(count));
    uint64_t reported = count;
    if (step.count >= 0) {
        reported = std::min<uint64_t>(uint64_t(step.count), size);
        // A scripted count beyond the data reads as zeros (a device larger than its content).
        if (reported > count)
            std::memset(static_cast<uint8_t *>(buffer) + count, 0, size_t(reported - count));
    }
    done = uint32_t(reported);
    it->second.position += reported;
    return true;
}

bool ScriptedBackend::Write(PlatformHandle handle, const void *buffer, uint32_t size, uint32_t &done,
                            uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    done = 0;
    log(QStringLiteral("write %1").arg(size));
    auto it = m_open.find(handle);
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    Transfer step;
    if (!m_writeScript.empty()) {
        step = m_writeScript.front();
        m_writeScript.pop_front();
    }
    if (const uint32_t gone = vanishedError(it->second)) {
        error = gone;
        return false;
    }
    if (step.error) {
        error = step.error;
        return false;
    }
    if (it->second.readOnly) {
        error = SystemError::AccessDenied;
        return false;
    }
    uint64_t count = size;
    if (step.count >= 0)
        count = std::min<uint64_t>(count, uint64_t(step.count));
    QByteArray &data = m_files[it->second.path].data;
    const uint64_t end = it->second.position + count;
    if (end > uint64_t(INT32_MAX)) {
        error = SystemError::DiskFull;
        return false;
    }
    if (end > uint64_t(data.size()))
        data.resize(qsizetype(end), '\0');
    if (count)
        std::memcpy(data.data() + it->second.position, buffer, size_t(count));
    done = uint32_t(count);
    it->second.position = end;
    return true;
}

bool ScriptedBackend::GetFileSize(PlatformHandle handle, uint64_t &size, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("size"));
    auto it = m_open.find(handle);
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    if (const uint32_t gone = vanishedError(it->second)) {
        error = gone;
        return false;
    }
    size = uint64_t(m_files[it->second.path].data.size());
    return true;
}

bool ScriptedBackend::SetEndOfFile(PlatformHandle handle, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("eof"));
    auto it = m_open.find(handle);
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    if (it->second.readOnly) {
        error = SystemError::AccessDenied;
        return false;
    }
    if (it->second.position > uint64_t(INT32_MAX)) {
        error = SystemError::DiskFull;
        return false;
    }
    m_files[it->second.path].data.resize(qsizetype(it->second.position), '\0');
    return true;
}

bool ScriptedBackend::Flush(PlatformHandle handle, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    auto it = m_open.find(handle);
    log(QStringLiteral("flush %1").arg(it == m_open.end() ? QString() : it->second.path));
    if (it == m_open.end()) {
        error = SystemError::InvalidHandle;
        return false;
    }
    if (!m_flushScript.empty()) {
        const uint32_t scripted = m_flushScript.front();
        m_flushScript.pop_front();
        if (scripted) {
            error = scripted;
            return false;
        }
    }
    if (const uint32_t gone = vanishedError(it->second)) {
        error = gone;
        return false;
    }
    return true;
}

bool ScriptedBackend::CanOpenForWriting(const QString &path, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("may write %1").arg(path));
    auto it = m_files.find(path);
    if (it == m_files.end() || it->second.vanished) {
        error = SystemError::FileNotFound;
        return false;
    }
    if (it->second.writeOpenError) {
        error = it->second.writeOpenError;
        return false;
    }
    return true;
}

bool ScriptedBackend::DeviceControl(PlatformHandle handle, uint32_t code, const void *in, uint32_t inSize,
                                    void *out, uint32_t outSize, uint32_t &returned, uint32_t &error)
{
    ControlHandler handler;
    Control answer;
    bool scripted = false;
    {
        QMutexLocker guard(&m_mutex);
        returned = 0;
        log(QStringLiteral("control 0x%1").arg(code, 0, 16));
        auto it = m_open.find(handle);
        if (it == m_open.end()) {
            error = SystemError::InvalidHandle;
            return false;
        }
        if (const uint32_t gone = vanishedError(it->second)) {
            error = gone;
            return false;
        }
        auto script = m_controlScript.find(code);
        if (script != m_controlScript.end() && !script->second.empty()) {
            answer = script->second.front();
            script->second.pop_front();
            scripted = true;
        } else {
            auto h = m_controlHandlers.find(code);
            if (h != m_controlHandlers.end())
                handler = h->second;
        }
    }
    if (!scripted && !handler) {
        error = SystemError::InvalidFunction;
        return false;
    }
    if (!scripted) {
        QByteArray input(static_cast<const char *>(in), in ? qsizetype(inSize) : 0);
        QByteArray output(qsizetype(outSize), '\0');
        if (out && outSize)
            std::memcpy(output.data(), out, outSize);
        uint32_t count = 0;
        const uint32_t result = handler(input, output, count);
        if (out && outSize)
            std::memcpy(out, output.constData(), std::min<size_t>(outSize, size_t(output.size())));
        returned = count;
        if (result) {
            error = result;
            return false;
        }
        return true;
    }
    const uint32_t copied = std::min<uint32_t>(outSize, uint32_t(answer.data.size()));
    if (out && copied)
        std::memcpy(out, answer.data.constData(), copied);
    returned = answer.returned >= 0 ? uint32_t(answer.returned) : copied;
    if (answer.error) {
        error = answer.error;
        return false;
    }
    return true;
}

bool ScriptedBackend::GetFreeSpace(const QString &path, uint64_t &freeBytes, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("free %1").arg(path));
    auto it = m_freeSpace.find(path);
    if (it == m_freeSpace.end()) {
        error = SystemError::PathNotFound;
        return false;
    }
    if (it->second.second) {
        error = it->second.second;
        return false;
    }
    freeBytes = it->second.first;
    return true;
}

bool ScriptedBackend::ClearAttributes(const QString &path, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("attributes %1").arg(path));
    if (m_files.count(path) == 0) {
        error = SystemError::FileNotFound;
        return false;
    }
    return true;
}

bool ScriptedBackend::DeleteFile(const QString &path, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("delete %1").arg(path));
    if (m_deleteError) {
        error = m_deleteError;
        return false;
    }
    if (m_files.erase(path) == 0) {
        error = SystemError::FileNotFound;
        return false;
    }
    return true;
}

bool ScriptedBackend::MoveFile(const QString &from, const QString &to, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("move %1 %2").arg(from, to));
    auto it = m_files.find(from);
    if (it == m_files.end()) {
        error = SystemError::FileNotFound;
        return false;
    }
    Entry entry = it->second;
    m_files.erase(it);
    m_files[to] = entry;
    return true;
}

bool ScriptedBackend::SetMountPoint(const QString &mountPoint, const QString &volumeName, uint32_t &)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("mount %1 %2").arg(mountPoint, volumeName));
    return true;
}

bool ScriptedBackend::DeleteMountPoint(const QString &mountPoint, uint32_t &)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("unmount %1").arg(mountPoint));
    return true;
}

QString ScriptedBackend::ErrorText(uint32_t code)
{
    return systemErrorText(code);
}

QString ScriptedBackend::ProductName()
{
    QMutexLocker guard(&m_mutex);
    return m_productName;
}

QString ScriptedBackend::ProductVersion()
{
    QMutexLocker guard(&m_mutex);
    return m_productVersion;
}

bool ScriptedBackend::RestartWithPrivilege(uint32_t, uint32_t &error)
{
    QMutexLocker guard(&m_mutex);
    log(QStringLiteral("restart"));
    error = SystemError::PrivilegeNotHeld;
    return false;
}
