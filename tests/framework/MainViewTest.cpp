// The main window: menus from the command registry, views as tabs and panes, the view menus of the
// active view, recent image files and the window state in the settings.
#include "ClientFramework/Views/MainView.h"
#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/LogView.h"
#include "ClientFramework/Views/RecentFiles.h"
#include "ClientFramework/Views/WindowManager.h"

#include "tests/common/ScratchHome.h"

#include <QAction>
#include <QDockWidget>
#include <QMenu>
#include <QMenuBar>
#include <QSignalSpy>
#include <QTreeView>
#include <gtest/gtest.h>

namespace {

QStringList texts(QMenu *menu)
{
    QStringList list;
    for (QAction *a : menu->actions())
        if (!a->isSeparator())
            list << a->text();
    return list;
}

// A tab view with its own "&Edit" actions and a setting of its own.
class EditingView : public Framework::GenericView
{
public:
    EditingView() : GenericView(QStringLiteral("editing"), QStringLiteral("Editing"))
    {
        m_undo = new QAction(QStringLiteral("Undo"), this);
    }
    QList<QAction *> widgetActions(Menu menu) const override
    {
        return menu == EditMenu ? QList<QAction *>{m_undo} : QList<QAction *>{};
    }
    void save(QDomElement &e, bool) override { e.setAttribute("zoom", zoom); }
    void load(const QDomElement &e) override { zoom = e.attribute("zoom", "100").toInt(); }
    int zoom = 100;

private:
    QAction *m_undo;
};

class TestMainView : public Framework::MainView
{
public:
    using Framework::MainView::MainView;

protected:
    void registerViews() override
    {
        Framework::MainView::registerViews();
        windowManager()->registerView("editing", [] { return new EditingView; });
    }
    QStringList defaultViews() const override { return {"editing", Framework::LogView::ViewId}; }
};

} // namespace

TEST(MainView, MenusInOrder)
{
    Core::Commander commander;
    Framework::MainView view(&commander);
    view.build();
    QStringList titles;
    for (QAction *a : view.menuBar()->actions())
        titles << a->text();
    EXPECT_EQ(titles, QStringList({"&File", "&Actions", "&Edit", "&View", "&Windows", "&Organize", "&Tools",
                                   "&Help"}));
    EXPECT_EQ(view.windowTitle(), Framework::Identity::FullName);
    EXPECT_EQ(texts(view.menu("&File")),
              QStringList({"Save Hardware Info as...", "Save Log as...", "Map Network Share...",
                           "Mount Disk Image...", "Recent Disk &Images", "Exit"}));
    EXPECT_EQ(texts(view.menu("&Organize")), QStringList({"Properties"}));
    EXPECT_EQ(texts(view.menu("&Tools")), QStringList({"Application Log", "Preferences..."}));
    EXPECT_EQ(texts(view.menu("&Help")), QStringList({"Help", "Brindle On-Line", "Submit Request", "About"}));
    // Commands without a handler are disabled; the window's own are not.
    EXPECT_FALSE(commander.action("cmdMapNetShare")->isEnabled());
    EXPECT_TRUE(commander.action("cmdExitApp")->isEnabled());
    EXPECT_TRUE(commander.action("cmdOpenLogView")->isEnabled());
    EXPECT_FALSE(view.recentMenu()->isEnabled());
}

TEST(MainView, LogPaneOpensOnceAndIsListedInWindows)
{
    ScratchHome home;
    Core::Commander commander;
    Framework::MainView view(&commander);
    view.build();
    view.load(QDomElement()); // no settings: the default views
    auto *wm = view.windowManager();
    ASSERT_EQ(wm->views().size(), 1);
    auto *log = qobject_cast<Framework::LogView *>(wm->view("view-log"));
    ASSERT_NE(log, nullptr);
    ASSERT_NE(wm->dock("view-log"), nullptr);
    EXPECT_EQ(view.dockWidgetArea(wm->dock("view-log")), Qt::BottomDockWidgetArea);
    EXPECT_EQ(log->title(), "Application Log");
    EXPECT_EQ(log->tree()->model()->headerData(0, Qt::Horizontal).toString(), "Event");
    // Closing the pane hides it; Tools > Application Log shows the same pane again.
    EXPECT_TRUE(wm->closeView("view-log"));
    EXPECT_FALSE(wm->isShown(log));
    commander.action("cmdOpenLogView")->trigger();
    EXPECT_TRUE(wm->isShown(log));
    EXPECT_EQ(wm->views().size(), 1);
    EXPECT_EQ(wm->openView("no-such-view"), nullptr);
    ASSERT_EQ(view.menu("&Windows")->actions().size(), 1);
    EXPECT_EQ(view.menu("&Windows")->actions()[0]->text(), "&1.Application Log");
}

TEST(MainView, ViewMenusFollowTheActiveView)
{
    ScratchHome home;
    Core::Commander commander;
    TestMainView view(&commander);
    view.build();
    view.load(QDomElement());
    EXPECT_EQ(view.windowManager()->activeView()->viewId(), "editing");
    EXPECT_EQ(texts(view.menu("&Edit")), QStringList({"Undo"}));
    EXPECT_TRUE(view.menu("&Edit")->menuAction()->isEnabled());
    EXPECT_FALSE(view.menu("&Actions")->menuAction()->isEnabled());
    view.windowManager()->closeView("editing");
    EXPECT_TRUE(view.menu("&Edit")->isEmpty());
    EXPECT_FALSE(view.menu("&Edit")->menuAction()->isEnabled());
}

TEST(MainView, WindowStateAndViewsRoundTrip)
{
    ScratchHome home;
    QDomDocument doc;
    QDomElement element = doc.createElement("main-view");
    doc.appendChild(element);
    {
        Core::Commander commander;
        TestMainView view(&commander);
        view.build();
        view.load(QDomElement());
        static_cast<EditingView *>(view.windowManager()->view("editing"))->zoom = 150;
        view.windowManager()->closeView("view-log"); // a hidden pane
        view.save(element);
    }
    const QDomElement views = element.firstChildElement("views");
    ASSERT_FALSE(views.isNull());
    EXPECT_EQ(views.firstChildElement("editing").attribute("visible"), "1");
    EXPECT_EQ(views.firstChildElement("editing").attribute("zoom"), "150");
    EXPECT_EQ(views.firstChildElement("view-log").attribute("visible"), "0");
    EXPECT_FALSE(element.attribute("geometry").isEmpty());
    EXPECT_FALSE(element.attribute("state").isEmpty());

    // The settings of a view are read when it is made, from the main view's element.
    QDomElement stored = Framework::SettingsDocument::instance().element("main-view");
    stored.parentNode().replaceChild(element.cloneNode(true), stored);
    Core::Commander commander;
    TestMainView view(&commander);
    view.build();
    view.load(Framework::SettingsDocument::instance().element("main-view"));
    auto *editing = static_cast<EditingView *>(view.windowManager()->view("editing"));
    ASSERT_NE(editing, nullptr);
    EXPECT_EQ(editing->zoom, 150);
    // The log pane is not opened: it was hidden.
    auto *log = view.windowManager()->view("view-log");
    EXPECT_TRUE(!log || !view.windowManager()->isShown(log));
}

TEST(MainView, RecentImagesMenu)
{
    ScratchHome home;
    Core::Commander commander;
    Framework::MainView view(&commander);
    view.build();
    QSignalSpy chosen(&view, &Framework::MainView::recentFileChosen);
    view.recentFiles()->add("/images/a.img");
    view.recentFiles()->add("/images/b.vhd");
    view.recentFiles()->add("/images/./a.img"); // the same file moves to the top
    ASSERT_TRUE(view.recentMenu()->isEnabled());
    ASSERT_EQ(view.recentMenu()->actions().size(), 2);
    EXPECT_EQ(view.recentMenu()->actions()[0]->text(), "&1 /images/a.img");
    EXPECT_EQ(view.recentMenu()->actions()[1]->text(), "&2 /images/b.vhd");
    view.recentMenu()->actions()[1]->trigger();
    ASSERT_EQ(chosen.size(), 1);
    EXPECT_EQ(chosen[0][0].toString(), "/images/b.vhd");
}

TEST(RecentFiles, BoundedAndKeptInSettings)
{
    Framework::RecentFiles recent;
    for (int i = 0; i < 14; ++i)
        recent.add(QString("/i/%1.img").arg(i));
    ASSERT_EQ(recent.files().size(), Framework::RecentFiles::MaxFiles);
    EXPECT_EQ(recent.files().first(), "/i/13.img");
    EXPECT_EQ(recent.files().last(), "/i/4.img");

    QDomDocument doc;
    QDomElement e = doc.createElement("recent-files");
    doc.appendChild(e);
    recent.save(e);
    recent.save(e); // saving twice does not duplicate
    EXPECT_EQ(e.elementsByTagName("file").size(), Framework::RecentFiles::MaxFiles);
    Framework::RecentFiles again;
    again.load(e);
    EXPECT_EQ(again.files(), recent.files());

    // Damaged settings: empty names and duplicates are dropped.
    QDomDocument bad;
    bad.setContent(
        QByteArray("<recent-files><file>/x.img</file><file></file><file>/x.img</file></recent-files>"));
    again.load(bad.documentElement());
    EXPECT_EQ(again.files(), QStringList({"/x.img"}));
}
