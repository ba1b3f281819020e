#include "ClientFramework/Commands/Commander.h"

#include "ClientFramework/AppIdentity.h"

#include <QAction>
#include <QCoreApplication>
#include <QIcon>
#include <QMenu>

namespace Core {

namespace {
Commander *theCurrent = nullptr;
}

Commander::Commander(QObject *parent) : QObject(parent)
{
    theCurrent = this;
    for (const CommandRecord &r : frameworkCommands())
        registerCommand(r);
}

Commander::~Commander()
{
    if (theCurrent == this)
        theCurrent = nullptr;
}

Commander *Commander::current()
{
    return theCurrent;
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
        a->setEnabled(false);
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
    if (m_registering) {
        m_handled.insert(r.id);
        a->setEnabled(ruleAllows(r.id));
    }
}

void Commander::setHandler(const QString &id, std::function<void()> handler)
{
    QAction *a = action(id);
    if (!a)
        return;
    if (m_connections.contains(id))
        disconnect(m_connections.take(id));
    if (!handler) {
        m_handled.remove(id);
        a->setEnabled(false);
        return;
    }
    m_connections.insert(
        id, connect(a, &QAction::triggered, this, [handler = std::move(handler)] { handler(); }));
    m_handled.insert(id);
    a->setEnabled(ruleAllows(id));
}

bool Commander::execute(const QString &id, const QList<NodeCore *> &nodes)
{
    if (nodes != m_selection)
        setSelection(nodes);
    if (m_features.execute(id, nodes))
        return true;
    QAction *a = action(id);
    if (!a || !a->isEnabled())
        return false;
    a->trigger();
    return true;
}

void Commander::setSelection(const QList<NodeCore *> &nodes)
{
    m_selection = nodes;
    QList<uint32_t> states;
    if (m_stateOf)
        for (NodeCore *n : nodes)
            states << (n ? m_stateOf(n) : 0u);
    m_selectionStates = states;
    updateEnabled();
    m_features.updateCommands(nodes);
    emit selectionChanged();
}

int Commander::addActions(QMenu *menu, const QStringList &ids) const
{
    if (!menu)
        return 0;
    int added = 0;
    bool separatorDue = false;
    for (const QString &id : ids) {
        if (id.isEmpty()) {
            separatorDue = true;
            continue;
        }
        QAction *a = action(id);
        if (!a)
            continue;
        if (separatorDue && !menu->isEmpty() && !menu->actions().constLast()->isSeparator())
            menu->addSeparator();
        separatorDue = false;
        menu->addAction(a);
        ++added;
    }
    return added;
}

int Commander::addFeatureCommands(QMenu *menu, const QList<NodeCore *> &nodes) const
{
    return addActions(menu, m_features.contextCommands(nodes));
}

void Commander::addFeature(IFeatureCommander *feature)
{
    if (!feature || m_features.contains(feature))
        return;
    m_features.append(feature);
    m_registering = feature;
    feature->registerCommands(*this);
    m_registering = nullptr;
    feature->updateCommands(m_selection);
}

void Commander::setProcessRunning(bool running)
{
    m_processRunning = running;
    updateEnabled();
}

void Commander::setSelectionStates(const QList<uint32_t> &states)
{
    m_selectionStates = states;
    updateEnabled();
}

bool Commander::ruleAllows(const QString &id) const
{
    static const QString refresh = QStringLiteral("cmdRefresh"), settings = QStringLiteral("cmdSettings"),
                         exitApp = QStringLiteral("cmdExitApp"), stop = QStringLiteral("cmdNode_Stop"),
                         stopAll = QStringLiteral("cmdNode_StopAll"),
                         browse = QStringLiteral("cmdNode_Browse");
    if (id == refresh || id == settings || id == exitApp)
        return !m_processRunning;
    if (id == stopAll)
        return m_processRunning;
    if (id == stop) {
        if (!m_processRunning)
            return false;
        for (uint32_t s : m_selectionStates)
            if (s & (StateBusy | StateWaiting))
                return true;
        return false;
    }
    if (id == browse) {
        for (uint32_t s : m_selectionStates)
            if (s & StateBusy)
                return false;
        return true;
    }
    return true;
}

void Commander::updateEnabled()
{
    for (auto it = m_actions.cbegin(); it != m_actions.cend(); ++it)
        it.value()->setEnabled(m_handled.contains(it.key()) && ruleAllows(it.key()));
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
