#include "MainView.h"

#include "Commander.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/CLI/Arguments.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/LogView.h"
#include "ClientFramework/Views/RecentFiles.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WelcomeView.h"
#include "ClientFramework/Views/WindowManager.h"

#include <QDir>
#include <QFileInfo>
#include <QStatusBar>

namespace Solution {

using Framework::ApplicationLog;
using Framework::LogEntry;
using Framework::UserPrompts;

namespace {
const QString HomePage = QStringLiteral("https://brindle.orvane.example/");
const QString RequestPage = QStringLiteral("https://brindle.orvane.example/support/request");
const QString HelpPage = QStringLiteral("https://brindle.orvane.example/help");
} // namespace

MainView::MainView(Commander *commander, QWidget *parent) : Framework::MainView(commander, parent)
{
    connect(this, &Framework::MainView::recentFileChosen, this,
            [this](const QString &path) { mountImage(path); });
}

void MainView::registerViews()
{
    Framework::MainView::registerViews();
    windowManager()->registerView(Framework::WelcomeView::ViewId, [this] {
        return new Framework::WelcomeView(commander(), GettingStarted, Support);
    });
}

QStringList MainView::defaultViews() const
{
    return {Framework::LogView::ViewId};
}

bool MainView::restoresView(const QString &viewId) const
{
    // The welcome view follows its own box and the command line.
    return viewId != Framework::WelcomeView::ViewId;
}

bool MainView::welcomeAtStart() const
{
    if (Framework::CLI::Arguments::flagValue(QStringLiteral("nowelcome"), false))
        return false;
    const QDomElement views = Framework::SettingsDocument::instance()
                                  .element(SettingsElement)
                                  .firstChildElement(ViewsElement)
                                  .firstChildElement(Framework::WelcomeView::ViewId);
    return Framework::WelcomeView::showOnStartup(views);
}

QString MainView::initialView() const
{
    return welcomeAtStart() ? Framework::WelcomeView::ViewId : QString();
}

bool MainView::mountImage(const QString &path)
{
    if (path.isEmpty() || !m_hooks.mountImage)
        return false;
    if (!m_hooks.mountImage(path)) {
        statusBar()->showMessage(tr("Unable to open disk image '%1'").arg(QDir::toNativeSeparators(path)),
                                 5000);
        return false;
    }
    recentFiles()->add(QFileInfo(path).absoluteFilePath());
    return true;
}

void MainView::connectCommands()
{
    Framework::MainView::connectCommands();
    Core::Commander *c = commander();
    c->setHandler(QStringLiteral("cmdDI_Mount"), [this] {
        const QStringList recent = recentFiles()->files();
        const QString folder = recent.isEmpty() ? QDir::homePath() : QFileInfo(recent.first()).absolutePath();
        const QString path =
            UserPrompts::current().openFileName(this, tr("Open Disk Image"), folder,
                                                tr("Disk Images (*.img *.ima *.dsk *.raw *.bin *.iso *.dd "
                                                   "*.001 *.vhd *.vmdk *.tdi);;All Files (*)"));
        mountImage(path);
    });
    c->setHandler(QStringLiteral("cmdHddInfo"), [this] {
        const QString path = UserPrompts::current().saveFileName(
            this, tr("Save Hardware Info as"),
            QDir::home().filePath(Framework::Identity::HardwareInfoFileName),
            tr("XML Files (*.xml);;All Files (*)"));
        if (!path.isEmpty() && m_hooks.saveHardwareInfo)
            m_hooks.saveHardwareInfo(path);
    });
    c->setHandler(QStringLiteral("cmdLogSave"), [this] {
        auto &log = ApplicationLog::instance();
        const QString current = log.filePath();
        const QString path = UserPrompts::current().saveFileName(
            this, tr("Save Log as"),
            current.isEmpty() ? QDir::home().filePath(Framework::Identity::LogFileName) : current,
            tr("Log Files (*.log);;All Files (*)"));
        if (path.isEmpty() || QFileInfo(path) == QFileInfo(current))
            return;
        // The entries so far are written to the new file, which the log continues in.
        if (!current.isEmpty() && QFile::exists(current)) {
            QFile::remove(path);
            if (!QFile::copy(current, path)) {
                log.add(tr("Unable to save log as '%1'").arg(QDir::toNativeSeparators(path)),
                        LogEntry::Error);
                return;
            }
        }
        log.setFile(path);
    });
    c->setHandler(QStringLiteral("cmdOpen_Explorer"),
                  [this] { windowManager()->openView(QStringLiteral("explorer")); });
    c->setHandler(QStringLiteral("cmdOpen_Browser"),
                  [this] { windowManager()->openView(QStringLiteral("browser")); });
    c->setHandler(QStringLiteral("cmdWebHome"), [] { UserPrompts::current().openUrl(HomePage); });
    c->setHandler(QStringLiteral("cmdWebRequest"), [] { UserPrompts::current().openUrl(RequestPage); });
    c->setHandler(QStringLiteral("cmdWebHelp"), [] { UserPrompts::current().openUrl(HelpPage); });
}

} // namespace Solution
