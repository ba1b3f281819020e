#include "ClientFramework/Settings/PathMacros.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>
#include <QStandardPaths>

namespace Framework::PathMacros {

QString applicationFolder()
{
    if (QCoreApplication::instance())
        return QCoreApplication::applicationDirPath();
    return QFileInfo(QStringLiteral("/proc/self/exe")).canonicalFilePath().section(QLatin1Char('/'), 0, -2);
}

QString applicationDataFolder()
{
    return QStandardPaths::writableLocation(QStandardPaths::AppDataLocation);
}

QString resolve(const QString &path)
{
    QString r = path;
    r.replace(QStringLiteral("%TEMP%"), QDir::tempPath());
    r.replace(QStringLiteral("%USER%"), QDir::homePath());
    r.replace(QStringLiteral("%CURRENT%"), QDir::currentPath());
    r.replace(QStringLiteral("%APP%"), applicationFolder());
    r.replace(QStringLiteral("%APPDATA%"), applicationDataFolder());
    return QDir::toNativeSeparators(r);
}

} // namespace Framework::PathMacros
