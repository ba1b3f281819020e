#include "Kernel/Implementation/Platform/PlatformOps.h"

#include "Kernel/Implementation/Platform/PlatformFile.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cRoot.h"

#include <QStringDecoder>
#include <QStringEncoder>

namespace {

IPlatformBackend &backendOf(cRoot *owner)
{
    return owner ? owner->Backend() : DefaultPlatformBackend();
}

void record(cRoot *owner, PlatformOperation op, const QString &name, uint32_t error)
{
    if (owner)
        owner->EmitPlatform(static_cast<uint32_t>(op), name, 0, 0, error);
}

bool isSeparator(QChar c)
{
    return c == QLatin1Char('\\') || c == QLatin1Char('/');
}

constexpr uint32_t kRestartReason = 0x80020003; // planned, operating system reconfiguration

} // namespace

QString NativePath(const QString &path, PathStyle style)
{
    // Paths of a system without drive letters and long-path prefixes are taken as they are.
    if (style == PathStyle::Posix)
        return path;
    QString native = path;
    native.replace(QLatin1Char('/'), QLatin1Char('\\'));
    if (native.size() >= 2 && native.at(0).toUpper() >= QLatin1Char('A') &&
        native.at(0).toUpper() <= QLatin1Char('Z') && native.at(1) == QLatin1Char(':'))
        return QStringLiteral("\\\\?\\") + native;
    if (native.size() > 4 && isSeparator(path.at(0)) && isSeparator(path.at(1)) &&
        native.at(2) != QLatin1Char('?') && native.at(2) != QLatin1Char('.') &&
        native.indexOf(QLatin1Char('\\'), 3) >= 0)
        return QStringLiteral("\\\\?\\UNC") + native.mid(1);
    return native;
}

QString NativePath(const QString &path)
{
    return NativePath(path, DefaultPlatformBackend().Paths());
}

bool PlatformDeleteFile(cRoot *owner, const QString &name)
{
    IPlatformBackend &backend = backendOf(owner);
    const QString path = NativePath(name, backend.Paths());
    uint32_t error = 0;
    if (!backend.ClearAttributes(path, error) || !backend.DeleteFile(path, error)) {
        record(owner, PlatformOperation::DeleteFile, name, error);
        return false;
    }
    return true;
}

bool PlatformMoveFile(cRoot *owner, const QString &from, const QString &to)
{
    IPlatformBackend &backend = backendOf(owner);
    uint32_t error = 0;
    if (!backend.MoveFile(NativePath(from, backend.Paths()), NativePath(to, backend.Paths()), error)) {
        record(owner, PlatformOperation::MoveFile, from, error);
        return false;
    }
    return true;
}

bool AssignDriveLetter(cRoot *owner, const QString &volumeName, uint32_t letterIndex)
{
    if (letterIndex >= 26)
        return false;
    IPlatformBackend &backend = backendOf(owner);
    const QString mountPoint = QStringLiteral("%1:\\").arg(QChar(char16_t(u'A' + letterIndex)));
    QString volume = volumeName;
    const QChar separator = backend.Paths() == PathStyle::Windows ? QLatin1Char('\\') : QLatin1Char('/');
    if (!volume.endsWith(separator))
        volume += separator;
    uint32_t error = 0;
    if (!backend.SetMountPoint(mountPoint, volume, error)) {
        record(owner, PlatformOperation::SetVolumeMountPoint, mountPoint, error);
        return false;
    }
    return true;
}

bool RemoveDriveLetter(cRoot *owner, uint32_t letterIndex)
{
    if (letterIndex >= 26)
        return false;
    IPlatformBackend &backend = backendOf(owner);
    const QString mountPoint = QStringLiteral("%1:\\").arg(QChar(char16_t(u'A' + letterIndex)));
    uint32_t error = 0;
    if (!backend.DeleteMountPoint(mountPoint, error)) {
        record(owner, PlatformOperation::DeleteVolumeMountPoint, mountPoint, error);
        return false;
    }
    return true;
}

QString ReadTextFile(cRoot *owner, const QString &path)
{
    CPlatformFile file(owner, path, PlatformKind::File);
    file.SetWritable(false);
    uint64_t size = 0;
    if (!file.GetSize(size)) {
        if (file.IsOpened())
            file.Close(false);
        return {};
    }
    QString text;
    if (size >= 1 && size <= 65535) {
        QByteArray data(int(size), '\0');
        if (file.Read(0, uint32_t(size), data.data())) {
            QStringDecoder decode(QStringDecoder::System);
            text = decode(data);
        }
    }
    file.Close(false);
    return text;
}

bool WriteTextFile(cRoot *owner, const QString &path, const QStringList &lines)
{
    QStringEncoder encode(QStringEncoder::System);
    const QByteArray data = encode(lines.join(QStringLiteral("\r\n")) + QStringLiteral("\r\n"));
    if (data.size() > int(UINT32_MAX / 2))
        return false;
    CPlatformFile file(owner, path, PlatformKind::File);
    if (!file.Create())
        return false;
    uint32_t flushError = 0;
    if (!file.Write(0, uint32_t(data.size()), data.constData()) || !file.Flush(flushError)) {
        file.Close(true);
        return false;
    }
    if (!file.Close(false)) {
        // The handle could not be closed: it is dropped by the destructor; the file goes.
        PlatformDeleteFile(owner, path);
        return false;
    }
    return true;
}

QString SystemVersionText(cRoot *owner)
{
    IPlatformBackend &backend = backendOf(owner);
    if (backend.ProductVersion() == QLatin1String("unknown")) {
        const QString text = QStringLiteral("Unknown Windows version");
        if (owner)
            owner->EmitInternal(text);
        return text;
    }
    return backend.ProductName();
}

QString SystemErrorText(cRoot *owner, uint32_t code)
{
    return backendOf(owner).ErrorText(code).trimmed();
}

bool RestartMachine(cRoot *owner)
{
    uint32_t error = 0;
    return backendOf(owner).RestartWithPrivilege(kRestartReason, error);
}
