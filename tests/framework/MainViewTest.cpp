// The main window skeleton: menus from the command registry and the log view.
#include "ClientFramework/Views/MainView.h"
#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Views/LogView.h"
#include "ClientFramework/Views/WindowManager.h"

#include <QAction>
#include <QMenu>
#include <QMenuBar>
#include <QTreeView>
#include <gtest/gtest.h>

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

    QStringList file;
    for (QAction *a : view.menu("&File")->actions())
        if (!a->isSeparator())
            file << a->text();
    EXPECT_EQ(file, QStringList({"Save Hardware Info as...", "Save Log as...", "Map Network Share...",
                                 "Mount Disk Image...", "Recent Disk &Images", "Exit"}));
    QStringList help;
    for (QAction *a : view.menu("&Help")->actions())
        help << a->text();
    EXPECT_EQ(help, QStringList({"Help", "Brindle On-Line", "Submit Request", "About"}));
}

TEST(MainView, LogViewOpensOnceAndIsListedInWindows)
{
    Core::Commander commander;
    Framework::MainView view(&commander);
    view.build();
    auto *wm = view.windowManager();
    ASSERT_EQ(wm->views().size(), 1);
    auto *log = qobject_cast<Framework::LogView *>(wm->view("view-log"));
    ASSERT_NE(log, nullptr);
    EXPECT_EQ(log->title(), "Application Log");
    EXPECT_EQ(log->tree()->model()->headerData(0, Qt::Horizontal).toString(), "Event");
    // Tools > Application Log activates the same view.
    commander.action("cmdOpenLogView")->trigger();
    EXPECT_EQ(wm->views().size(), 1);
    EXPECT_EQ(wm->openView("no-such-view"), nullptr);
    ASSERT_EQ(view.menu("&Windows")->actions().size(), 1);
    EXPECT_EQ(view.menu("&Windows")->actions()[0]->text(), "&1.Application Log");
}

TEST(Commander, LookupAndReplacement)
{
    Core::Commander commander;
    EXPECT_EQ(commander.action("cmdNoSuchThing"), nullptr);
    QAction *exit = commander.action("cmdExitApp");
    ASSERT_NE(exit, nullptr);
    EXPECT_EQ(exit->shortcut(), QKeySequence("Ctrl+Q"));
    EXPECT_EQ(exit->statusTip(), "Exit Brindle.");
    commander.registerCommand({"cmdExitApp", {}, {}, {}, {}, "Quit", "Leave %1."});
    EXPECT_EQ(commander.action("cmdExitApp"), exit); // replaced in place
    EXPECT_EQ(exit->text(), "Quit");
    EXPECT_EQ(exit->statusTip(), "Leave Brindle.");
}
