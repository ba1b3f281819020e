#include "app/MainView.h"

#include "app/Commander.h"
#include "app/DeviceChangeSink.h"
#include "app/NodeCommands.h"

#include "ClientFramework/DeviceChange/DeviceChangeHandler.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Views/DiskBrowserView.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/PropertyPane.h"
#include "ClientFramework/Views/SmartPane.h"
#include "Kernel/Implementation/Platform/Linux/UdevMonitor.h"
#include "Kernel/Implementation/Root/Root.h"

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
#include <QMenu>
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

const QStringList MainView::ToolBar = {QStringLiteral("cmdDI_Mount"),
                                       QStringLiteral("cmdRefresh"),
                                       QStringLiteral("cmdUpdate"),
                                       QString(),
                                       QStringLiteral("cmdOpen_Explorer"),
                                       QStringLiteral("cmdHex_File"),
                                       QString(),
                                       QStringLiteral("cmdProperties"),
                                       QStringLiteral("cmdSmartInfo"),
                                       QString(),
                                       QStringLiteral("cmdNode_Stop"),
                                       QStringLiteral("cmdNode_StopAll")};

MainView::MainView(Commander *commander, QWidget *parent) : Framework::MainView(commander, parent)
{
    connect(this, &Framework::MainView::recentFileChosen, this,
            [this](const QString &path) { mountImage(path); });
    NodeCore::setCommander(commander);
    NodeCore::setFeatureHook([commander](const NodeCore &node, QMenu *menu) {
        commander->addFeatureCommands(menu, {const_cast<NodeCore *>(&node)});
    });
    commander->setStateReader([](NodeCore *node) { return node ? node->state() : 0u; });
}

MainView::~MainView()
{
    // The node commands go first: nothing of the views' teardown reaches them.
    delete m_nodeCommands;
    m_nodeCommands = nullptr;
    // The views go before the tree they show.
    m_monitor.reset();
    m_deviceChange.reset();
    commander()->setSelection({});
    qDeleteAll(windowManager()->views());
    if (NodeCore::commander() == commander())
        NodeCore::setCommander(nullptr);
}

void MainView::setKernel(CRoot *kernel)
{
    m_kernel = kernel;
    if (!kernel)
        return;
    m_nodes = std::make_unique<NodeRoot>(kernel);
    connect(m_nodes.get(), &NodeRoot::notReadyTip, this, [this](const QString &tip) {
        m_notReadyTip = tip;
        if (auto *explorer = qobject_cast<Framework::DiskExplorerView *>(
                windowManager()->view(Framework::DiskExplorerView::ViewId)))
            explorer->showTip(tip);
    });
    m_sink = std::make_unique<DeviceChangeSink>(*kernel, *m_nodes);
    m_deviceChange = std::make_unique<Framework::DeviceChange::Handler>(*m_sink);
    m_monitor = CreateBlockDeviceMonitor();
    if (m_monitor)
        connect(m_monitor.get(), &IBlockDeviceMonitor::blockEvent, m_deviceChange.get(),
                &Framework::DeviceChange::Handler::blockEvent);
}

void MainView::removeSelectedImages()
{
    if (!m_kernel)
        return;
    QList<CDevice *> images;
    for (NodeCore *n : commander()->selection())
        if (auto *d = dynamic_cast<NodeDevice *>(n); d && d->device() && (d->state() & NodeState::Image))
            images << d->device();
    commander()->setSelection({});
    for (CDevice *device : std::as_const(images))
        m_kernel->RemoveDevice(device);
}

void MainView::registerViews()
{
    Framework::MainView::registerViews();
    windowManager()->registerView(Framework::WelcomeView::ViewId, [this] {
        return new Framework::WelcomeView(commander(), GettingStarted, Support);
    });
    if (!m_nodes)
        return;
    windowManager()->registerView(Framework::DiskExplorerView::ViewId, [this] {
        auto *view = new Framework::DiskExplorerView(m_nodes.get(), commander());
        view->showTip(m_notReadyTip);
        connect(view, &Framework::DiskExplorerView::populationStarted, this,
                [this](const QString &text) { showProgress(text); });
        connect(view, &Framework::DiskExplorerView::populationFinished, this, [this] { clearProgress(); });
        return view;
    });
    windowManager()->setNodeNamer(
        [](NodeCore *node) { return node ? node->text(NodeAttr::Name) : QString(); });
    windowManager()->registerView(Framework::DiskBrowserView::ViewId, [this] {
        auto *view = new Framework::DiskBrowserView(m_nodes.get(), commander());
        connect(view, &Framework::DiskBrowserView::populationStarted, this,
                [this](const QString &text) { showProgress(text); });
        connect(view, &Framework::DiskBrowserView::populationFinished, this, [this] { clearProgress(); });
        connect(windowManager(), &Framework::WindowManager::browseRequested, view,
                &Framework::DiskBrowserView::browseTo);
        return view;
    });
    windowManager()->registerView(
        Framework::PropertyPane::ViewId,
        [this] {
            auto *pane = new Framework::PropertyPane;
            pane->showNodes(commander()->selection());
            connect(windowManager(), &Framework::WindowManager::selectionChanged, pane,
                    [pane](INodeSource *, const QList<NodeCore *> &nodes) { pane->showNodes(nodes); });
            return pane;
        },
        Framework::WindowManager::Placement::DockRight);
    windowManager()->registerView(
        Framework::SmartPane::ViewId,
        [this] {
            auto *pane = new Framework::SmartPane;
            pane->showNodes(commander()->selection());
            connect(windowManager(), &Framework::WindowManager::selectionChanged, pane,
                    [pane](INodeSource *, const QList<NodeCore *> &nodes) { pane->showNodes(nodes); });
            return pane;
        },
        Framework::WindowManager::Placement::DockRight);
}

QStringList MainView::defaultViews() const
{
    if (m_nodes)
        return {Framework::DiskExplorerView::ViewId, Framework::PropertyPane::ViewId,
                Framework::LogView::ViewId};
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

void MainView::load(const QDomElement &element)
{
    Framework::MainView::load(element);
    // The Disk Explorer is always there at start (behind the welcome view when that shows).
    if (m_nodes && !windowManager()->view(Framework::DiskExplorerView::ViewId)) {
        Framework::GenericView *current = windowManager()->activeView();
        windowManager()->openView(Framework::DiskExplorerView::ViewId);
        if (current)
            windowManager()->setCurrentWidget(current);
    }
}

QString MainView::initialView() const
{
    if (welcomeAtStart())
        return Framework::WelcomeView::ViewId;
    return m_nodes ? Framework::DiskExplorerView::ViewId : QString();
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
    // "File Browser" waits for its view: until it is registered the command stays disabled.
    if (windowManager()->isRegistered(QStringLiteral("browser"))) {
        c->setHandler(QStringLiteral("cmdOpen_Browser"),
                      [this] { windowManager()->openView(QStringLiteral("browser")); });
        // "Open in File Browser" shows the first selected node there; Ctrl+B works window-wide.
        c->setHandler(QStringLiteral("cmdNode_Browse"), [this] {
            const QList<NodeCore *> nodes = commander()->selection();
            if (nodes.isEmpty() || !nodes.constFirst())
                windowManager()->openView(QStringLiteral("browser"));
            else
                windowManager()->openInBrowser(nodes.constFirst());
        });
        if (QAction *browse = c->action(QStringLiteral("cmdNode_Browse")))
            addAction(browse);
    }
    c->setHandler(QStringLiteral("cmdProperties"),
                  [this] { windowManager()->openView(Framework::PropertyPane::ViewId); });
    if (m_kernel) {
        c->setHandler(QStringLiteral("cmdRefresh"), [this] { m_kernel->Refresh(); });
        c->setHandler(QStringLiteral("cmdRemove"), [this] { removeSelectedImages(); });
    }
    m_nodeCommands = new NodeCommands(
        c, windowManager(),
        [this](NodeCore *node) {
            if (m_sink)
                m_sink->repopulate(node);
        },
        Framework::SmartPane::ViewId, this);
    c->setHandler(QStringLiteral("cmdWebHome"), [] { UserPrompts::current().openUrl(HomePage); });
    c->setHandler(QStringLiteral("cmdWebRequest"), [] { UserPrompts::current().openUrl(RequestPage); });
    c->setHandler(QStringLiteral("cmdWebHelp"), [] { UserPrompts::current().openUrl(HelpPage); });
}

} // namespace Solution
