// The product's main window over a kernel root that holds only the images a test opens, with an
// isolated home, recorded dialogs and scripted file choosers.
#pragma once

#include "app/Commander.h"
#include "app/MainView.h"

#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WindowManager.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"

#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"

#include <QAction>
#include <QDomElement>
#include <QTest>

#include <functional>

struct TestMainWindow
{
    ScratchHome home;
    RecordingDialogs dialogs;
    Framework::ScriptedPrompts prompts;
    CRoot root; // never refreshed: no disk of this machine is listed
    Solution::Commander commander;
    Solution::MainView view{&commander};

    explicit TestMainWindow(const QDomElement &state = QDomElement())
    {
        view.setKernel(&root);
        view.setHooks({[this](const QString &path) {
                           QString problem;
                           return ImageOpen::OpenImage(&root, path, problem) != nullptr;
                       },
                       {}});
        view.build();
        view.load(state);
    }
    TestMainWindow(const TestMainWindow &) = delete;
    TestMainWindow &operator=(const TestMainWindow &) = delete;

    Framework::WindowManager *windows() const { return view.windowManager(); }
    Framework::DiskExplorerView *explorer() const
    {
        return qobject_cast<Framework::DiskExplorerView *>(windows()->view("explorer"));
    }
    QAction *action(const char *id) const { return commander.action(QString::fromLatin1(id)); }
    // Waits until the node tree shows `count` disks.
    bool waitForDevices(int count) const
    {
        return QTest::qWaitFor([&] { return view.nodeRoot()->deviceNodes().size() == count; }, 5000);
    }
    // The first node, depth first from `from` (the top of the tree when null), that `match` takes.
    NodeCore *find(const std::function<bool(NodeCore *)> &match, NodeCore *from = nullptr) const
    {
        if (!from)
            from = view.nodeRoot();
        if (match(from))
            return from;
        for (NodeCore *c : from->children())
            if (NodeCore *found = find(match, c))
                return found;
        return nullptr;
    }
    // A volume node over a volume in memory, below the computer (the tree owns the node).
    NodeDrive *addDrive(CVolume &volume)
    {
        auto *drive = new NodeDrive(&volume);
        view.nodeRoot()->computer()->appendChild(drive);
        return drive;
    }
};
