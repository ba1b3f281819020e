#include "MainView.h"

#include "AppIdentity.h"
#include "Commands/Commander.h"
#include "DialogSeam.h"
#include "Views/LogView.h"
#include "Views/WindowManager.h"

#include <QAction>
#include <QApplication>
#include <QMenuBar>
#include <QStatusBar>

namespace Framework {

MainView::MainView(Core::Commander *commander, QWidget *parent)
    : QMainWindow(parent), m_commander(commander), m_windows(new WindowManager(this))
{
    setObjectName(QStringLiteral("MainView"));
    setWindowTitle(Identity::FullName);
    setCentralWidget(m_windows);
    statusBar();
    m_windows->registerView(LogView::ViewId, [] { return new LogView; });
    connect(m_windows, &WindowManager::viewsChanged, this, &MainView::updateWindowsMenu);
    resize(1024, 720);
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
    buildMenus();
    connectCommands();
    m_windows->openView(LogView::ViewId);
}

QMenu *MainView::addCommandMenu(const QString &title, const QStringList &ids)
{
    QMenu *m = menuBar()->addMenu(title);
    for (const QString &id : ids) {
        if (id.isEmpty())
            m->addSeparator();
        else if (QAction *a = m_commander->action(id))
            m->addAction(a);
    }
    return m;
}

void MainView::buildMenus()
{
    QMenu *file =
        addCommandMenu(tr("&File"), {QStringLiteral("cmdHddInfo"), QStringLiteral("cmdLogSave"),
                                     QStringLiteral("cmdMapNetShare"), QStringLiteral("cmdDI_Mount")});
    QMenu *recent = file->addMenu(tr("Recent Disk &Images"));
    recent->setObjectName(QStringLiteral("recent-files"));
    recent->setEnabled(!recent->isEmpty());
    file->addSeparator();
    if (QAction *exit = m_commander->action(QStringLiteral("cmdExitApp")))
        file->addAction(exit);
    // Filled by the active view.
    menuBar()->addMenu(tr("&Actions"));
    menuBar()->addMenu(tr("&Edit"));
    menuBar()->addMenu(tr("&View"));
    m_windowsMenu = menuBar()->addMenu(tr("&Windows"));
    addCommandMenu(tr("&Organize"), {QStringLiteral("cmdProperties")});
    addCommandMenu(tr("&Tools"), {QStringLiteral("cmdOpenLogView"), QStringLiteral("cmdSettings")});
    addCommandMenu(tr("&Help"), {QStringLiteral("cmdHelp"), QStringLiteral("cmdWebHome"),
                                 QStringLiteral("cmdWebRequest"), QStringLiteral("cmdAbout")});
    updateWindowsMenu();
}

void MainView::connectCommands()
{
    // Commands whose handlers are not part of this window yet stay disabled.
    const QStringList handled = {QStringLiteral("cmdExitApp"), QStringLiteral("cmdOpenLogView"),
                                 QStringLiteral("cmdAbout")};
    for (QAction *a : m_commander->findChildren<QAction *>())
        a->setEnabled(handled.contains(a->objectName()));
    connect(m_commander->action(QStringLiteral("cmdExitApp")), &QAction::triggered, this, &QWidget::close);
    connect(m_commander->action(QStringLiteral("cmdOpenLogView")), &QAction::triggered, this,
            [this] { m_windows->openView(LogView::ViewId); });
    connect(m_commander->action(QStringLiteral("cmdAbout")), &QAction::triggered, this, [] {
        DialogSeam::current().message(QMessageBox::Information, tr("About %1").arg(Identity::ShortName),
                                      tr("<h2>%1</h2><p>Version: <b>%2 (%3)</b></p>")
                                          .arg(Identity::FullName, Identity::Version, Identity::FileVersion),
                                      QMessageBox::Ok, QMessageBox::Ok);
    });
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

void MainView::save(QDomElement &element, bool)
{
    element.setAttribute(QStringLiteral("geometry"), QString::fromLatin1(saveGeometry().toBase64()));
    element.setAttribute(QStringLiteral("state"), QString::fromLatin1(saveState().toBase64()));
}

void MainView::load(const QDomElement &element)
{
    const QByteArray geometry =
        QByteArray::fromBase64(element.attribute(QStringLiteral("geometry")).toLatin1());
    if (!geometry.isEmpty())
        restoreGeometry(geometry);
    const QByteArray state = QByteArray::fromBase64(element.attribute(QStringLiteral("state")).toLatin1());
    if (!state.isEmpty())
        restoreState(state);
}

} // namespace Framework
