#include "Commander.h"

#include "AppIdentity.h"

#include <QAction>
#include <QCoreApplication>
#include <QIcon>

namespace Core {

Commander::Commander(QObject *parent) : QObject(parent)
{
    for (const CommandRecord &r : frameworkCommands())
        registerCommand(r);
}

QAction *Commander::action(const QString &id) const
{
    return m_actions.value(id, nullptr);
}

void Commander::registerCommand(const CommandRecord &r)
{
    QAction *a = m_actions.value(r.id, nullptr);
    if (!a) {
        a = new QAction(this);
        a->setObjectName(r.id);
        m_actions.insert(r.id, a);
    }
    auto tr = [](const QString &s) {
        QString t = QCoreApplication::translate("Core::Commander", s.toUtf8().constData());
        return t.contains(QLatin1String("%1")) ? t.arg(Framework::Identity::ShortName) : t;
    };
    a->setText(tr(r.text));
    a->setStatusTip(tr(r.tip));
    a->setToolTip(tr(r.tip));
    a->setShortcut(r.shortcut.isEmpty() ? QKeySequence() : QKeySequence(r.shortcut));
    QIcon icon;
    for (const QString &path : {r.icon16, r.icon32, r.icon48})
        if (!path.isEmpty())
            icon.addFile(path);
    a->setIcon(icon);
}

const QList<CommandRecord> &Commander::frameworkCommands()
{
    auto rec = [](const char *id, const char *shortcut, const char *text, const char *tip) {
        return CommandRecord{
            QString::fromLatin1(id), {}, {}, {}, QString::fromLatin1(shortcut), QString::fromLatin1(text),
            QString::fromLatin1(tip)};
    };
    static const QList<CommandRecord> records = {
        rec("cmdAbout", "", "About", "About %1."),
        rec("cmdExitApp", "Ctrl+Q", "Exit", "Exit %1."),
        rec("cmdSuspend", "", "Suspend", "Keep programs and suspend computer."),
        rec("cmdReboot", "", "Reboot", "Closes all opened programs, shutdown and start computer again."),
        rec("cmdShutdown", "", "Shutdown", "Closes all opened programs, shutdown and turn of the computer."),
        rec("cmdNode_SelectAll", "Ctrl+A", "Select All", "Select all items."),
        rec("cmdProperties", "", "Properties", "View item Properties."),
        rec("cmdSmartInfo", "", "SMART Info", "Physical Disk S.M.A.R.T. Properties."),
        rec("cmdRefresh", "", "Refresh", "Reload Disks and Volumes (Logical Drives)."),
        rec("cmdSettings", "", "Preferences...", "Global Application Options."),
        rec("cmdHddInfo", "", "Save Hardware Info as...", "Create a Disk Diagnostic File."),
        rec("cmdOpenInOSBrowser", "", "Open in File Explorer",
            "Open selected item in OS default File Explorer."),
        rec("cmdHelp", "", "Help", "Open application help."),
        rec("cmdHelpContents", "Ctrl+F1", "Help Contents", "Open application help contents."),
        rec("cmdWebHome", "", "%1 On-Line", "Browse %1 Home Page."),
        rec("cmdWebRequest", "", "Submit Request",
            "Submit assistance request - create a ticket to Technical Support."),
        rec("cmdWebHelp", "Alt+F1", "Help On-Line", "Browse On-Line help and Technical support pages."),
        rec("cmdRemove", "", "Remove", "Remove virtual node from Devices List."),
        rec("cmdOpenLogView", "", "Application Log", "Open application log View."),
        rec("cmdLogSave", "", "Save Log as...", "Save application log at new location."),
        rec("cmdUpdate", "", "Reload", "Reload selected item(s) content."),
        rec("cmdNode_Browse", "Ctrl+B", "Open in File Browser", "Open disk in File Browser view."),
        rec("cmdOpen_Browser", "", "File Browser", "Browse Local Computer in separate view."),
        rec("cmdMapNetShare", "", "Map Network Share...", "Map Network Share."),
        rec("cmdMapDisconnect", "", "Disconnect", "Disconnect Map Network Share."),
        rec("cmdDI_Create", "", "Create Disk Image...",
            "Create Disk Image of selected item (disk, partition or volume)."),
        rec("cmdDI_Mount", "", "Mount Disk Image...", "Mount Disk Image file as virtual disk."),
        rec("cmdDI_Open", "", "Open Disk Image...",
            "Open Disk Image as a virtual disk using advanced configuration features."),
        rec("cmdDI_Verify", "", "Verify Disk Image...", "Verify stored Disk Image file(s)."),
        rec("cmdNode_Pause", "", "Pause", "Pause ongoing process on selected items."),
        rec("cmdNode_Stop", "", "Stop", "Stop ongoing process on selected items."),
        rec("cmdNode_StopAll", "", "Stop All", "Stop all ongoing process."),
        rec("cmdPreview", "", "File Preview", "Preview selected file."),
    };
    return records;
}

} // namespace Core
