#include "ClientFramework/Views/MainView.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/Help/HelpDocument.h"
#include "ClientFramework/Preferences/PreferencesCommand.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/LogView.h"
#include "ClientFramework/Views/RecentFiles.h"
#include "ClientFramework/Views/WindowManager.h"

#include <QAction>
#include <QApplication>
#include <QDir>
#include <QDockWidget>
#include <QLabel>
#include <QMenuBar>
#include <QProgressBar>
#include <QScreen>
#include <QStatusBar>
#include <QTimer>
#include <QToolBar>

namespace Framework {

namespace {
const QString VisibleAttribute = QStringLiteral("visible");
} // namespace

MainView::MainView(Core::Commander *commander, QWidget *parent)
    : QMainWindow(parent), m_commander(commander), m_windows(new WindowManager(this, this)),
      m_recent(new RecentFiles(this)), m_stateTimer(new QTimer(this)), m_progressText(new QLabel(this)),
      m_progress(new QProgressBar(this))
{
    setObjectName(QStringLiteral("MainView"));
    setWindowTitle(Identity::FullName);
    setCentralWidget(m_windows);
    setDockNestingEnabled(true);
    m_progressText->setObjectName(QStringLiteral("progressText"));
    m_progress->setObjectName(QStringLiteral("progress"));
    m_progress->setMaximumWidth(160);
    m_progress->setMaximumHeight(16);
    m_progress->setTextVisible(false);
    statusBar()->addPermanentWidget(m_progressText);
    statusBar()->addPermanentWidget(m_progress);
    m_progressText->hide();
    m_progress->hide();

    m_stateTimer->setSingleShot(true);
    m_stateTimer->setInterval(StateSaveDelayMs);
    connect(m_stateTimer, &QTimer::timeout, this, &MainView::saveWindowState);

    connect(m_windows, &WindowManager::viewsChanged, this, &MainView::updateWindowsMenu);
    connect(m_windows, &WindowManager::viewsChanged, m_stateTimer, qOverload<>(&QTimer::start));
    connect(m_windows, &WindowManager::viewCreated, this, &MainView::loadViewSettings);
    connect(m_windows, &WindowManager::activeViewChanged, this, &MainView::updateViewMenus);
    connect(m_recent, &RecentFiles::changed, this, &MainView::updateRecentMenu);
    resize(1024, 720);
}

MainView::~MainView()
{
    // The window manager and the docks go after this object's members: they must not call back.
    disconnect(m_windows, nullptr, this, nullptr);
    for (QDockWidget *d : findChildren<QDockWidget *>())
        disconnect(d, nullptr, this, nullptr);
    m_stateTimer->stop();
}

QMenu *MainView::menu(const QString &title) const
{
    for (QAction *a : menuBar()->actions())
        if (a->menu() && a->text() == title)
            return a->menu();
    return nullptr;
}

void MainView::build()
{
    registerViews();
    buildMenus();
    buildToolBars();
    connectCommands();
    for (IFeatureCommander *f : m_commander->features())
        f->registerViews(*m_windows);
}

void MainView::addFeature(IFeatureCommander *feature)
{
    if (!feature || m_commander->features().contains(feature))
        return;
    m_commander->addFeature(feature);
    if (menuBar()->actions().size() > 0) // built already
        feature->registerViews(*m_windows);
}

void MainView::registerViews()
{
    m_windows->registerView(
        LogView::ViewId, [] { return new LogView; }, WindowManager::Placement::DockBottom);
}

QStringList MainView::defaultViews() const
{
    return {LogView::ViewId};
}

QMenu *MainView::addCommandMenu(const QString &title, const QStringList &ids)
{
    QMenu *m = menuBar()->addMenu(title);
    m_commander->addActions(m, ids);
    return m;
}

void MainView::buildMenus()
{
    QMenu *file =
        addCommandMenu(tr("&File"), {QStringLiteral("cmdHddInfo"), QStringLiteral("cmdLogSave"),
                                     QStringLiteral("cmdMapNetShare"), QStringLiteral("cmdDI_Mount")});
    m_recentMenu = file->addMenu(tr("Recent Disk &Images"));
    m_recentMenu->setObjectName(RecentFiles::SettingsElement);
    file->addSeparator();
    if (QAction *exit = m_commander->action(QStringLiteral("cmdExitApp")))
        file->addAction(exit);
    // Filled by the active view.
    m_viewMenus[IWidgetActions::ActionsMenu] = menuBar()->addMenu(tr("&Actions"));
    m_viewMenus[IWidgetActions::EditMenu] = menuBar()->addMenu(tr("&Edit"));
    m_viewMenus[IWidgetActions::ViewMenu] = menuBar()->addMenu(tr("&View"));
    m_windowsMenu = menuBar()->addMenu(tr("&Windows"));
    addCommandMenu(tr("&Organize"), {QStringLiteral("cmdProperties")});
    addCommandMenu(tr("&Tools"), {QStringLiteral("cmdOpenLogView"), QStringLiteral("cmdSettings")});
    addCommandMenu(tr("&Help"), {QStringLiteral("cmdHelp"), QStringLiteral("cmdWebHome"),
                                 QStringLiteral("cmdWebRequest"), QStringLiteral("cmdAbout")});
    updateRecentMenu();
    updateWindowsMenu();
    updateViewMenus();
}

void MainView::connectCommands()
{
    m_commander->setHandler(QStringLiteral("cmdExitApp"), [this] { close(); });
    m_commander->setHandler(QStringLiteral("cmdOpenLogView"),
                            [this] { m_windows->openView(LogView::ViewId); });
    Preferences::installCommand(*m_commander, this);
    Help::installCommands(*m_commander);
    // "Help Contents" is in no menu; its shortcut works window-wide.
    if (QAction *contents = m_commander->action(QStringLiteral("cmdHelpContents")))
        addAction(contents);
    m_commander->setHandler(QStringLiteral("cmdAbout"), [] {
        DialogSeam::current().message(QMessageBox::Information, tr("About %1").arg(Identity::ShortName),
                                      tr("<h2>%1</h2><p>Version: <b>%2 (%3)</b></p>")
                                          .arg(Identity::FullName, Identity::Version, Identity::FileVersion),
                                      QMessageBox::Ok, QMessageBox::Ok);
    });
    connect(m_windows, &WindowManager::selectionChanged, m_commander,
            [this](INodeSource *, const QList<NodeCore *> &nodes) { m_commander->setSelection(nodes); });
}

void MainView::buildToolBars()
{
    if (!m_toolBar) {
        m_toolBar = addToolBar(tr("Main Toolbar"));
        // The name keys the toolbar in the saved window state.
        m_toolBar->setObjectName(QStringLiteral("mainToolBar"));
        m_toolBar->setToolButtonStyle(Qt::ToolButtonTextBesideIcon);
        m_toolBar->setIconSize(QSize(24, 24));
    }
    m_toolBar->clear();
    bool separatorDue = false;
    for (const QString &id : toolBarCommands()) {
        if (id.isEmpty()) {
            separatorDue = true;
            continue;
        }
        QAction *a = m_commander->action(id);
        if (!a)
            continue;
        if (separatorDue && !m_toolBar->actions().isEmpty() &&
            !m_toolBar->actions().constLast()->isSeparator())
            m_toolBar->addSeparator();
        separatorDue = false;
        m_toolBar->addAction(a);
    }
    m_toolBar->setVisible(!m_toolBar->actions().isEmpty());
}

void MainView::updateWindowsMenu()
{
    if (!m_windowsMenu)
        return;
    m_windowsMenu->clear();
    const QList<GenericView *> views = m_windows->views();
    for (int i = 0; i < views.size(); ++i) {
        GenericView *v = views[i];
        QAction *a = m_windowsMenu->addAction(tr("&%1.%2").arg(i + 1).arg(v->title()));
        connect(a, &QAction::triggered, this, [this, id = v->viewId()] { m_windows->openView(id); });
    }
}

void MainView::updateRecentMenu()
{
    if (!m_recentMenu)
        return;
    m_recentMenu->clear();
    const QStringList files = m_recent->files();
    for (int i = 0; i < files.size(); ++i) {
        QAction *a = m_recentMenu->addAction(tr("&%1 %2").arg(i + 1).arg(QDir::toNativeSeparators(files[i])));
        a->setData(files[i]);
        connect(a, &QAction::triggered, this, [this, path = files[i]] { emit recentFileChosen(path); });
    }
    m_recentMenu->setEnabled(!files.isEmpty());
}

void MainView::updateViewMenus()
{
    GenericView *active = m_windows->activeView();
    for (int which = 0; which < 3; ++which) {
        QMenu *m = m_viewMenus[which];
        if (!m)
            continue;
        m->clear();
        if (active)
            for (QAction *a : active->widgetActions(static_cast<IWidgetActions::Menu>(which))) {
                if (a)
                    m->addAction(a);
                else
                    m->addSeparator();
            }
        m->menuAction()->setEnabled(!m->isEmpty());
    }
}

void MainView::showProgress(const QString &text, int percent)
{
    m_progressText->setText(text);
    m_progressText->show();
    if (percent < 0) {
        m_progress->setRange(0, 0);
    } else {
        m_progress->setRange(0, 100);
        m_progress->setValue(qBound(0, percent, 100));
    }
    m_progress->show();
}

void MainView::clearProgress()
{
    m_progressText->clear();
    m_progressText->hide();
    m_progress->hide();
}

void MainView::loadViewSettings(GenericView *view)
{
    if (!view)
        return;
    connect(view, &GenericView::widgetActionsChanged, this, [this, view] {
        if (m_windows->activeView() == view)
            updateViewMenus();
    });
    QDomElement views =
        SettingsDocument::child(SettingsDocument::instance().element(SettingsElement), ViewsElement);
    view->load(SettingsDocument::child(views, view->viewId()));
}

void MainView::save(QDomElement &element, bool flush)
{
    element.setAttribute(QStringLiteral("geometry"), QString::fromLatin1(saveGeometry().toBase64()));
    element.setAttribute(QStringLiteral("state"), QString::fromLatin1(saveState().toBase64()));
    QDomElement views = SettingsDocument::child(element, ViewsElement);
    QStringList ids = m_windows->registeredIds();
    for (GenericView *v : m_windows->views())
        if (!ids.contains(v->viewId()))
            ids << v->viewId();
    for (const QString &id : ids) {
        QDomElement e = SettingsDocument::child(views, id);
        GenericView *v = m_windows->view(id);
        e.setAttribute(VisibleAttribute, m_windows->isShown(v) ? 1 : 0);
        if (v)
            v->save(e, false);
    }
    if (flush)
        SettingsDocument::instance().save();
}

void MainView::load(const QDomElement &element)
{
    const QDomElement views = element.firstChildElement(ViewsElement);
    QStringList open;
    if (views.isNull()) {
        open = defaultViews();
    } else {
        for (const QString &id : m_windows->registeredIds()) {
            const QDomElement e = views.firstChildElement(id);
            if (!e.isNull() && e.attribute(VisibleAttribute) == QLatin1String("1") && restoresView(id))
                open << id;
        }
    }
    for (const QString &id : std::as_const(open))
        m_windows->openView(id);
    const QByteArray geometry =
        QByteArray::fromBase64(element.attribute(QStringLiteral("geometry")).toLatin1());
    if (geometry.isEmpty() || !restoreGeometry(geometry)) {
        QScreen *where = screen() ? screen() : QGuiApplication::primaryScreen();
        if (where)
            setGeometry(firstStartGeometry(where->availableGeometry()));
    }
    const QByteArray state = QByteArray::fromBase64(element.attribute(QStringLiteral("state")).toLatin1());
    if (!state.isEmpty())
        restoreState(state);
    // A pane that the settings mark hidden stays hidden even when the dock state says otherwise.
    if (!views.isNull())
        for (GenericView *v : m_windows->views())
            if (QDockWidget *d = m_windows->dock(v->viewId()))
                if (views.firstChildElement(v->viewId()).attribute(VisibleAttribute) == QLatin1String("0"))
                    d->hide();
    const QString first = initialView();
    if (!first.isEmpty())
        m_windows->openView(first);
    m_loaded = true;
}

QRect MainView::firstStartGeometry(const QRect &available)
{
    if (!available.isValid())
        return QRect(0, 0, 1024, 720);
    const QSize size(qMax(1, int(available.width() * FirstStartShare)),
                     qMax(1, int(available.height() * FirstStartShare)));
    QRect r(QPoint(0, 0), size);
    r.moveCenter(available.center());
    return r;
}

void MainView::saveWindowState()
{
    if (!m_loaded)
        return;
    QDomElement e = SettingsDocument::instance().element(SettingsElement);
    save(e, false);
}

void MainView::moveEvent(QMoveEvent *event)
{
    QMainWindow::moveEvent(event);
    if (m_loaded)
        m_stateTimer->start();
}

void MainView::resizeEvent(QResizeEvent *event)
{
    QMainWindow::resizeEvent(event);
    if (m_loaded)
        m_stateTimer->start();
}

} // namespace Framework
