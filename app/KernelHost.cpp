#include "KernelHost.h"

#include <QCoreApplication>
#include <QDir>

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "Kernel/Implementation/Images/ImageOpen.h"
#include "Kernel/Implementation/Root.h"

namespace CLI {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("KernelHost", text);
}

} // namespace

bool KernelHost::saveHardwareInfo(const QString &fileName)
{
    auto &log = Framework::ApplicationLog::instance();
    m_root.RefreshAndWait(true);
    const QString application =
        QStringLiteral("%1 %2").arg(Framework::Identity::FullName, Framework::Identity::FileVersion);
    if (!m_root.WriteHardwareInfo(fileName, QString(), application, QStringList())) {
        log.add(tr("Unable to save hardware information to '%1'").arg(QDir::toNativeSeparators(fileName)),
                Framework::LogEntry::Error);
        return false;
    }
    log.add(tr("Hardware information saved to '%1'").arg(QDir::toNativeSeparators(fileName)),
            Framework::LogEntry::Successful);
    return true;
}

bool KernelHost::mountImage(const QString &path)
{
    auto &log = Framework::ApplicationLog::instance();
    QString problem;
    if (!ImageOpen::OpenImage(&m_root, path, problem)) {
        log.add(tr("Unable to open disk image '%1': %2").arg(QDir::toNativeSeparators(path), problem),
                Framework::LogEntry::Error);
        return false;
    }
    log.add(tr("Disk Image has been opened successfully."), Framework::LogEntry::Successful);
    return true;
}

} // namespace CLI
