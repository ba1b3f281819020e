// The main window's toolbar and the commands that act on the node views: the toolbar built from the
// registry with its icons and kept with the window state, the first-start size, "SMART Info" and
// "Open in File Explorer" following the selection, "Reload" of a folder and of a disk, "Stop" and
// "Stop All" of folder populations (with the process rules of the registry), "Select All", and
// "Save Hardware Info as..." over the listed disks.
#include "app/Commander.h"
#include "app/KernelHost.h"
#include "app/MainView.h"
#include "app/NodeCommands.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/SmartPane.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WindowManager.h"
#include "Kernel/Implementation/Root/Root.h"

#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "Kernel/Implementation/Devices/Device.h"

#include "tests/app/TestMainWindow.h"
#include "tests/common/MemoryVolume.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/RootTestSupport.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include <QAction>
#include <QApplication>
#include <QDir>
#include <QDockWidget>
#include <QDomDocument>
#include <QLabel>
#include <QMenu>
#include <QScreen>
#include <QSignalSpy>
#include <QTest>
#include <QToolBar>
#include <QTreeView>
#include <QUrl>
#include <gtest/gtest.h>

#include <functional>
#include <memory>

namespace {

constexpr int ManyFiles = 20000;
constexpr int FewFiles = 7;

bool haveTools()
{
    for (const char *tool : {"truncate", "sfdisk", "mkfs.vfat", "mcopy", "mdir", "dd"})
        if (!TestUtil::haveTool(tool))
            return false;
    return true;
}

// An MBR disk of 16 MiB with one FAT partition holding a folder of seven files.
QString makeImage(const QString &dir)
{
    const QString source = dir + "/few";
    QDir().mkpath(source);
    for (int i = 0; i < FewFiles; ++i)
        TestUtil::writeFile(source + QString("/file%1.txt").arg(i), QByteArray("some text\n"));
    const QString disk = dir + "/disk.img";
    const QString part = dir + "/fat.part";
    if (TestUtil::run("truncate", {"-s", "16M", disk}).exitCode != 0)
        return {};
    if (TestUtil::run("sh", {"-c", "printf 'label: dos\\nstart=2048,type=6\\n' | sfdisk -q " + disk})
            .exitCode != 0)
        return {};
    if (TestUtil::run("mkfs.vfat", {"-C", part, "8192"}).exitCode != 0 ||
        TestUtil::run("mcopy", {"-s", "-i", part, source, "::"}).exitCode != 0)
        return {};
    if (TestUtil::run("dd", {"if=" + part, "of=" + disk, "bs=512", "seek=2048", "conv=notrunc"}).exitCode !=
        0)
        return {};
    return disk;
}

// A ready volume in memory: "few" with seven files, "many" and "more" with twenty thousand each.
class FolderVolume : public TestVolumes::MemoryVolume
{
public:
    FolderVolume()
    {
        auto root = newRoot();
        CEntry *few = add(root.get(), "few", CEntry::AttrFolder, 10);
        for (int i = 0; i < FewFiles; ++i)
            add(few, QString("file%1.txt").arg(i), 0x20, 10);
        CEntry *many = add(root.get(), "many", CEntry::AttrFolder, 10);
        for (int i = 0; i < ManyFiles; ++i)
            add(many, QString("f%1").arg(i), 0x20, 10);
        CEntry *more = add(root.get(), "more", CEntry::AttrFolder, 10);
        for (int i = 0; i < ManyFiles; ++i)
            add(more, QString("g%1").arg(i), 0x20, 10);
        SetRootEntry(std::move(root));
    }
};

// The main window with the Disk Explorer open and ways to find and populate its nodes.
struct Window : TestMainWindow
{
    explicit Window(const QDomElement &state = QDomElement()) : TestMainWindow(state)
    {
        windows()->openView(Framework::DiskExplorerView::ViewId);
    }
    bool mount(const QString &image)
    {
        prompts.files << image;
        action("cmdDI_Mount")->trigger();
        return waitForDevices(1);
    }
    NodeCore *ofKind(NodeKind kind) const
    {
        return find([kind](NodeCore *n) { return n->kind() == kind; });
    }
    NodeCore *named(const QString &name) const
    {
        return find(
            [&](NodeCore *n) { return n->kind() == NodeKind::Folder && n->text(NodeAttr::Name) == name; });
    }
    // Populates a folder at once through the explorer's model.
    void populateNow(NodeCore *folder)
    {
        DiskBrowserModel *m = explorer()->model();
        m->setSynchronous(true);
        m->fetchMore(m->indexOf(folder));
        m->setSynchronous(false);
    }
    // A volume node over a volume in memory below the computer, its root folder listed.
    NodeCore *addFolders(FolderVolume &volume)
    {
        NodeCore *root = addDrive(volume)->rootFolder();
        if (root && !root->isPopulated())
            populateNow(root);
        return root;
    }
};

QStringList toolBarIds(QToolBar *bar)
{
    QStringList ids;
    for (QAction *a : bar->actions())
        ids << (a->isSeparator() ? QString("|") : a->objectName());
    return ids;
}

QStringList childNames(NodeCore *folder)
{
    QStringList names;
    for (NodeCore *c : folder->children())
        names << c->text(NodeAttr::Name);
    names.sort();
    return names;
}

// Tests over the image of seven files, made in a folder of their own before each test.
class MainWindowCommandsOnImage : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!haveTools())
            GTEST_SKIP() << "needs truncate, sfdisk, mkfs.vfat, mtools and dd";
        image = makeImage(dir.path());
        ASSERT_FALSE(image.isEmpty());
    }

    QTemporaryDir dir;
    QString image;
};

} // namespace

TEST(MainWindowToolbar, BuiltFromTheRegistryWithIconsAndKeptWithTheWindowState)
{
    QDomDocument doc;
    QDomElement saved = doc.createElement("main-view");
    doc.appendChild(saved);
    {
        Window w;
        QToolBar *bar = w.view.mainToolBar();
        ASSERT_NE(bar, nullptr);
        EXPECT_EQ(bar->objectName(), "mainToolBar");
        EXPECT_EQ(toolBarIds(bar), QStringList({"cmdDI_Mount", "cmdRefresh", "cmdUpdate", "|",
                                                "cmdOpen_Explorer", "cmdHex_File", "|", "cmdProperties",
                                                "cmdSmartInfo", "|", "cmdNode_Stop", "cmdNode_StopAll"}));
        // The toolbar shares the registry's actions: one state for menus, toolbar and shortcuts.
        EXPECT_EQ(bar->actions().first(), w.action("cmdDI_Mount"));
        for (QAction *a : bar->actions()) {
            if (a->isSeparator())
                continue;
            const QList<QSize> sizes = a->icon().availableSizes();
            EXPECT_TRUE(sizes.contains(QSize(16, 16)) && sizes.contains(QSize(32, 32)))
                << a->objectName().toStdString();
        }
        // Nothing runs and nothing is selected: only the commands that need neither are enabled.
        EXPECT_TRUE(w.action("cmdDI_Mount")->isEnabled());
        EXPECT_TRUE(w.action("cmdRefresh")->isEnabled());
        EXPECT_FALSE(w.action("cmdUpdate")->isEnabled());
        EXPECT_FALSE(w.action("cmdSmartInfo")->isEnabled());
        EXPECT_FALSE(w.action("cmdNode_Stop")->isEnabled());
        EXPECT_FALSE(w.action("cmdNode_StopAll")->isEnabled());

        // Hidden by the user: the window state keeps it so.
        bar->hide();
        w.view.save(saved);
    }
    Window again(saved);
    EXPECT_TRUE(again.view.mainToolBar()->isHidden());
    EXPECT_EQ(toolBarIds(again.view.mainToolBar()).size(), 12);
}

TEST(MainWindowToolbar, UnknownIdsAreSkippedAndSeparatorsNeverLeadOrRepeat)
{
    ScratchHome home;
    class Bare : public Framework::MainView
    {
    public:
        using Framework::MainView::MainView;

    protected:
        QStringList toolBarCommands() const override
        {
            return {"", "cmdAbout", "cmdNoSuchCommand", "", "", "cmdNoSuchEither", "", "cmdExitApp", ""};
        }
    };
    Core::Commander commander;
    Bare view(&commander);
    view.build();
    EXPECT_EQ(toolBarIds(view.mainToolBar()), QStringList({"cmdAbout", "|", "cmdExitApp"}));
}

TEST(MainWindowFirstStart, TakesAShareOfTheScreenOnceAndRestoresAfterwards)
{
    using Framework::MainView;
    EXPECT_EQ(MainView::firstStartGeometry(QRect(0, 0, 1600, 1000)), QRect(160, 100, 1280, 800));
    // A screen beside another, with a panel taking the top: centred in what is available.
    EXPECT_EQ(MainView::firstStartGeometry(QRect(1920, 30, 1280, 994)), QRect(2048, 129, 1024, 795));
    EXPECT_EQ(MainView::firstStartGeometry(QRect()).size(), QSize(1024, 720));

    QDomDocument doc;
    QDomElement saved = doc.createElement("main-view");
    doc.appendChild(saved);
    {
        Window w; // no geometry saved yet
        QScreen *screen = w.view.screen() ? w.view.screen() : QGuiApplication::primaryScreen();
        ASSERT_NE(screen, nullptr);
        EXPECT_EQ(w.view.geometry(), MainView::firstStartGeometry(screen->availableGeometry()));
        w.view.setGeometry(40, 50, 700, 500);
        w.view.save(saved);
    }
    // The size and place the user left it in come back.
    Window again(saved);
    EXPECT_EQ(again.view.size(), QSize(700, 500));
    EXPECT_EQ(again.view.geometry().topLeft(), QPoint(40, 50));
}

TEST_F(MainWindowCommandsOnImage, SmartInfoAndOpenInFileExplorerFollowTheSelection)
{
    Window w;
    ASSERT_TRUE(w.mount(image));
    QAction *smart = w.action("cmdSmartInfo");
    QAction *os = w.action("cmdOpenInOSBrowser");
    EXPECT_FALSE(smart->isEnabled());
    EXPECT_FALSE(os->isEnabled());

    NodeCore *device = w.ofKind(NodeKind::Device);
    NodeCore *partition = w.ofKind(NodeKind::Partition);
    ASSERT_NE(device, nullptr);
    ASSERT_NE(partition, nullptr);
    ASSERT_TRUE(w.explorer()->selectNode(device));
    EXPECT_TRUE(smart->isEnabled());
    // The image's folder is what the desktop's file manager opens.
    EXPECT_TRUE(os->isEnabled());
    os->trigger();
    EXPECT_EQ(w.prompts.urls,
              QStringList({QUrl::fromLocalFile(QFileInfo(dir.path()).canonicalFilePath()).toString()}));

    // "SMART Info" shows the pane on the selected disk; a mounted image gives no SMART data.
    EXPECT_EQ(w.view.windowManager()->view("smart"), nullptr);
    smart->trigger();
    auto *pane = qobject_cast<Framework::SmartPane *>(w.view.windowManager()->view("smart"));
    ASSERT_NE(pane, nullptr);
    EXPECT_EQ(w.view.windowManager()->placement("smart"), Framework::WindowManager::Placement::DockRight);
    EXPECT_TRUE(w.view.windowManager()->isShown(pane));
    EXPECT_EQ(pane->device(), device);
    EXPECT_FALSE(pane->parametersMissingLabel()->isHidden());
    EXPECT_FALSE(pane->attributesMissingLabel()->isHidden());

    // A partition that no system mounted: neither command applies; the pane asks for a disk.
    ASSERT_TRUE(w.explorer()->selectNode(partition));
    EXPECT_FALSE(smart->isEnabled());
    EXPECT_FALSE(os->isEnabled());
    EXPECT_EQ(pane->device(), nullptr);
    EXPECT_FALSE(pane->hintLabel()->isHidden());
    EXPECT_EQ(Solution::NodeCommands::osBrowserPath(partition), QString());

    // The disk going away leaves nothing to act on.
    ASSERT_TRUE(w.explorer()->selectNode(device));
    EXPECT_EQ(pane->device(), device);
    w.action("cmdRemove")->trigger();
    ASSERT_TRUE(w.waitForDevices(0));
    EXPECT_FALSE(smart->isEnabled());
    EXPECT_FALSE(os->isEnabled());
    EXPECT_EQ(pane->device(), nullptr);
}

TEST_F(MainWindowCommandsOnImage, ReloadReadsAFolderAndADiskAgain)
{
    Window w;
    FolderVolume volume;
    ASSERT_NE(w.addFolders(volume), nullptr);
    NodeCore *few = w.named("few");
    ASSERT_NE(few, nullptr);
    w.populateNow(few);
    ASSERT_TRUE(few->isPopulated());
    QStringList expected;
    for (int i = 0; i < FewFiles; ++i)
        expected << QString("file%1.txt").arg(i);
    expected.sort();
    EXPECT_EQ(childNames(few), expected);
    const NodeCore *firstChild = few->child(0);

    // "Reload" on a file reads its folder again: new nodes, the same entries.
    ASSERT_TRUE(w.explorer()->selectNode(few->child(2)));
    QAction *reload = w.action("cmdUpdate");
    ASSERT_TRUE(reload->isEnabled());
    w.explorer()->model()->setSynchronous(true);
    reload->trigger();
    EXPECT_TRUE(few->isPopulated());
    EXPECT_EQ(childNames(few), expected);
    EXPECT_NE(few->child(0), firstChild);
    // The selected file went with its folder: nothing is left selected to act on.
    EXPECT_TRUE(w.commander.selection().isEmpty());
    EXPECT_FALSE(reload->isEnabled());

    // A folder and a file inside it: the folder is read once.
    ASSERT_TRUE(w.explorer()->selectNode(few));
    Solution::NodeCommands *commands = w.view.nodeCommands();
    ASSERT_NE(commands, nullptr);
    commands->reload({few, few->child(0), few->child(1)});
    EXPECT_EQ(childNames(few), expected);
    w.explorer()->model()->setSynchronous(false);

    // On a disk: its tables are read again; a layout that did not change keeps its nodes.
    ASSERT_TRUE(w.mount(image));
    NodeCore *device = w.ofKind(NodeKind::Device);
    ASSERT_NE(device, nullptr);
    ASSERT_TRUE(w.explorer()->selectNode(device));
    const NodeCore *partitionBefore = device->child(0);
    const int partitions = device->childCount();
    ASSERT_GT(partitions, 0);
    ASSERT_TRUE(reload->isEnabled());
    reload->trigger();
    ASSERT_TRUE(QTest::qWaitFor([&] { return w.ofKind(NodeKind::Device) != nullptr; }, 5000));
    device = w.ofKind(NodeKind::Device);
    EXPECT_EQ(device->childCount(), partitions);
    EXPECT_EQ(device->child(0), partitionBefore);
}

TEST(MainWindowCommands, StopAndStopAllCancelFolderPopulations)
{
    Window w;
    FolderVolume volume;
    ASSERT_NE(w.addFolders(volume), nullptr);
    NodeCore *many = w.named("many");
    ASSERT_NE(many, nullptr);
    DiskBrowserModel *model = w.explorer()->model();
    QSignalSpy finished(model, &DiskBrowserModel::populationFinished);
    QAction *stop = w.action("cmdNode_Stop");
    QAction *stopAll = w.action("cmdNode_StopAll");
    QAction *exitApp = w.action("cmdExitApp");
    QAction *refresh = w.action("cmdRefresh");
    ASSERT_TRUE(w.explorer()->selectNode(many));
    EXPECT_FALSE(stop->isEnabled());

    // The folder populates on a worker: it is Busy, a process runs, Stop applies to it.
    model->fetchMore(model->indexOf(many));
    ASSERT_TRUE(model->isPopulating(many));
    EXPECT_TRUE(many->state() & NodeState::Busy);
    EXPECT_TRUE(w.commander.isProcessRunning());
    EXPECT_FALSE(exitApp->isEnabled());
    EXPECT_FALSE(refresh->isEnabled());
    EXPECT_TRUE(stopAll->isEnabled());
    ASSERT_TRUE(stop->isEnabled());
    stop->trigger();
    ASSERT_TRUE(QTest::qWaitFor([&] { return finished.size() == 1; }, 30000));
    EXPECT_TRUE(finished[0][1].toBool()) << "the population ended before Stop reached it";
    EXPECT_FALSE(many->isPopulated());
    EXPECT_EQ(many->childCount(), 0);
    EXPECT_FALSE(many->state() & NodeState::Busy);
    EXPECT_FALSE(w.commander.isProcessRunning());
    EXPECT_TRUE(exitApp->isEnabled());
    EXPECT_TRUE(refresh->isEnabled());
    EXPECT_FALSE(stop->isEnabled());
    EXPECT_FALSE(stopAll->isEnabled());

    // Stop on another node leaves the population alone.
    NodeCore *few = w.named("few");
    ASSERT_NE(few, nullptr);
    model->fetchMore(model->indexOf(many));
    Solution::NodeCommands *commands = w.view.nodeCommands();
    ASSERT_NE(commands, nullptr);
    EXPECT_EQ(commands->stop({few}), 0);
    EXPECT_EQ(commands->stop({}), 0);

    // "Stop All" ends every population at once.
    ASSERT_TRUE(stopAll->isEnabled());
    stopAll->trigger();
    EXPECT_FALSE(model->isPopulating(many));
    EXPECT_FALSE(many->state() & NodeState::Busy);
    EXPECT_FALSE(commands->isPopulating());
    EXPECT_FALSE(w.commander.isProcessRunning());
    EXPECT_TRUE(exitApp->isEnabled());

    // Left alone, the population completes and lists every file.
    QSignalSpy again(model, &DiskBrowserModel::populationFinished);
    model->fetchMore(model->indexOf(many));
    ASSERT_TRUE(QTest::qWaitFor([&] { return again.size() == 1; }, 60000));
    EXPECT_FALSE(again[0][1].toBool());
    EXPECT_TRUE(many->isPopulated());
    EXPECT_EQ(many->childCount(), ManyFiles);
    EXPECT_FALSE(many->state() & NodeState::Busy);
    EXPECT_FALSE(w.commander.isProcessRunning());
}

TEST_F(MainWindowCommandsOnImage, SelectAllSelectsEveryRowOfTheActiveNodeView)
{
    Window w;
    ASSERT_TRUE(w.mount(image));
    QAction *selectAll = w.action("cmdNode_SelectAll");
    // It stands in the Edit menu while the Disk Explorer is active, so Ctrl+A reaches it there.
    QMenu *edit = w.view.menu("&Edit");
    ASSERT_NE(edit, nullptr);
    EXPECT_TRUE(edit->actions().contains(selectAll));
    ASSERT_TRUE(selectAll->isEnabled());
    selectAll->trigger();
    QTreeView *tree = w.explorer()->tree();
    int visible = 0;
    std::function<void(const QModelIndex &)> count = [&](const QModelIndex &parent) {
        for (int r = 0; r < tree->model()->rowCount(parent); ++r) {
            const QModelIndex i = tree->model()->index(r, 0, parent);
            ++visible;
            if (tree->isExpanded(i))
                count(i);
        }
    };
    count(QModelIndex());
    ASSERT_GT(visible, 3);
    EXPECT_EQ(w.explorer()->selectedNodes().size(), visible);
    EXPECT_EQ(w.commander.selection().size(), visible);

    // A view that lists no nodes has nothing to select.
    ASSERT_NE(w.view.windowManager()->openView("welcome"), nullptr);
    Framework::GenericView *active = w.view.windowManager()->activeView();
    ASSERT_NE(active, nullptr);
    ASSERT_EQ(dynamic_cast<INodeSource *>(active), nullptr);
    EXPECT_FALSE(selectAll->isEnabled());
    EXPECT_FALSE(edit->actions().contains(selectAll));
}

TEST(MainWindowCommands, OpenInFileExplorerStaysBelowTheMountPoint)
{
    QTemporaryDir dir;
    const QString mount = QFileInfo(dir.path()).absoluteFilePath();
    ASSERT_TRUE(QDir().mkpath(mount + "/DOCS/DEEP"));
    ASSERT_TRUE(QDir().mkpath(mount + "/../outside-" + QFileInfo(mount).fileName()));
    using Solution::NodeCommands;
    EXPECT_EQ(NodeCommands::folderBelow(mount, {}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS"}), mount + "/DOCS");
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS", "DEEP"}), mount + "/DOCS/DEEP");
    // A folder the system does not show (not there, or not yet synced): the volume's own folder.
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS", "GONE"}), mount);
    // Names read from the medium never lead out of the volume's folder.
    EXPECT_EQ(NodeCommands::folderBelow(mount, {".."}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"..", "outside-" + QFileInfo(mount).fileName()}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS", "..", ".."}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS/DEEP"}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS\\DEEP"}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"DOCS", ""}), mount);
    EXPECT_EQ(NodeCommands::folderBelow(mount, {"."}), mount);
    QDir(mount + "/../outside-" + QFileInfo(mount).fileName()).removeRecursively();
}

TEST(MainWindowCommands, StopReachesAFolderWaitingForAWorker)
{
    Window w;
    FolderVolume volume;
    ASSERT_NE(w.addFolders(volume), nullptr);
    NodeCore *many = w.named("many");
    NodeCore *more = w.named("more");
    NodeCore *few = w.named("few");
    ASSERT_TRUE(many && more && few);
    DiskBrowserModel *model = w.explorer()->model();
    Solution::NodeCommands *commands = w.view.nodeCommands();
    QList<QPair<NodeCore *, bool>> ended;
    QObject::connect(model, &DiskBrowserModel::populationFinished, [&](NodeCore *n, bool cancelled) {
        ended.append({n, cancelled});
    });

    // Two workers run at most: "few" waits behind "many" and "more".
    model->fetchMore(model->indexOf(many));
    model->fetchMore(model->indexOf(more));
    model->fetchMore(model->indexOf(few));
    ASSERT_TRUE(model->isPopulating(few));
    EXPECT_FALSE(few->state() & NodeState::Busy);
    EXPECT_EQ(commands->stop({few}), 1);
    EXPECT_EQ(commands->stop({few}), 0); // asked once is enough

    // "many" and "more" go on; "few" ends cancelled as soon as its turn comes.
    ASSERT_TRUE(QTest::qWaitFor([&] { return ended.size() == 3; }, 60000));
    for (const auto &[node, cancelled] : ended)
        EXPECT_EQ(cancelled, node == few) << node->text(NodeAttr::Name).toStdString();
    EXPECT_FALSE(few->isPopulated());
    EXPECT_TRUE(many->isPopulated());
    EXPECT_TRUE(more->isPopulated());
    EXPECT_FALSE(commands->isPopulating());
    EXPECT_FALSE(w.commander.isProcessRunning());

    // The stop was for that population only: the folder populates when asked again.
    ended.clear();
    model->fetchMore(model->indexOf(few));
    ASSERT_TRUE(QTest::qWaitFor([&] { return ended.size() == 1; }, 10000));
    EXPECT_FALSE(ended[0].second);
    EXPECT_EQ(few->childCount(), FewFiles);
}

TEST(MainWindowCommands, WindowClosesWhilePopulationsRun)
{
    ScratchHome home;
    RecordingDialogs dialogs;
    FolderVolume volume;
    CRoot root;
    Solution::Commander commander; // outlives the window, as at start-up
    auto view = std::make_unique<Solution::MainView>(&commander);
    view->setKernel(&root);
    view->build();
    view->load(QDomElement());
    auto *explorer = qobject_cast<Framework::DiskExplorerView *>(view->windowManager()->openView("explorer"));
    ASSERT_NE(explorer, nullptr);
    auto *drive = new NodeDrive(&volume);
    view->nodeRoot()->computer()->appendChild(drive);
    NodeCore *top = drive->rootFolder();
    ASSERT_NE(top, nullptr);
    DiskBrowserModel *model = explorer->model();
    model->setSynchronous(true);
    model->fetchMore(model->indexOf(top));
    model->setSynchronous(false);
    ASSERT_EQ(top->childCount(), 3);
    for (NodeCore *folder : top->children())
        model->fetchMore(model->indexOf(folder));
    ASSERT_TRUE(commander.isProcessRunning());
    ASSERT_TRUE(commander.hasHandler("cmdNode_StopAll"));

    // The populations end with their views; the window's handlers leave the registry.
    view.reset();
    EXPECT_FALSE(commander.hasHandler("cmdNode_Stop"));
    EXPECT_FALSE(commander.hasHandler("cmdNode_StopAll"));
    EXPECT_FALSE(commander.hasHandler("cmdUpdate"));
    EXPECT_FALSE(commander.action("cmdNode_StopAll")->isEnabled());
    commander.action("cmdNode_StopAll")->trigger(); // reaches nothing that is gone
}

TEST(MainWindowCommands, HardwareInfoReportsTheListedDisksWithTheLog)
{
    ScratchHome home;
    RecordingDialogs dialogs;
    Framework::ScriptedPrompts prompts;
    // A machine of two fixed disks, listed before the window shows.
    ScriptedBackend backend;
    RootTest::FakeSource source;
    RootTest::AnswerGeometry(backend);
    backend.AddFile("/dev/sdx", RootTest::Disk(1 << 20, true));
    backend.AddFile("/dev/sdy", RootTest::Disk(1 << 20, true));
    source.Set({RootTest::Candidate("/dev/sdx", 0), RootTest::Candidate("/dev/sdy", 1)});
    CRoot root(&backend, &source);
    ASSERT_TRUE(root.RefreshAndWait());
    CLI::KernelHost host(root); // outlives the window, as at start-up
    Solution::Commander commander;
    Solution::MainView view(&commander);
    view.setKernel(&root);
    view.setHooks({{}, [&host](const QString &path) { return host.saveHardwareInfo(path); }});
    view.build();
    const QList<NodeDevice *> nodes = view.nodeRoot()->deviceNodes();
    ASSERT_EQ(nodes.size(), 2);
    const QList<CDevice *> devices = root.Devices();
    QSignalSpy storage(&root, &cRoot::kernelStorage);
    Framework::ApplicationLog::instance().add("A line the report carries: <sdx>");

    const QString report = home.file("hddinfo.xml");
    prompts.files << report;
    commander.action("cmdHddInfo")->trigger();
    QCoreApplication::processEvents();

    // No refresh ran: the disks, their nodes and the views on them stay as they were.
    EXPECT_TRUE(storage.isEmpty());
    EXPECT_EQ(root.Devices(), devices);
    EXPECT_EQ(view.nodeRoot()->deviceNodes(), nodes);
    // The report lists both disks and ends with the log's lines, as the log file shows them.
    QDomDocument doc;
    ASSERT_TRUE(doc.setContent(backend.FileData(report))) << "the report was written";
    const QDomElement top = doc.documentElement();
    EXPECT_EQ(top.firstChildElement("devices").elementsByTagName("device").size(), 2);
    const QString logInfo = top.firstChildElement("log_info").text();
    EXPECT_FALSE(logInfo.contains("No log info"));
    const QStringList logLines = logInfo.split('\n');
    const QStringList carried = logLines.filter("A line the report carries: <sdx>");
    ASSERT_EQ(carried.size(), 1) << logLines.join('\n').toStdString();
    EXPECT_TRUE(carried.first().startsWith(">>"));
    EXPECT_TRUE(Framework::ApplicationLog::instance().lines().contains(carried.first().mid(2).trimmed()));
}
