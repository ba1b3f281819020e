// The File Browser in the product's main window: opening it through its commands, its models under
// the model tester, a mounted MBR image with a FAT partition (disks, partitions and volumes against
// sfdisk and blkid; the folders against mtools where the kernel reads the FAT directories), the
// folder level over a volume in memory (walking, default commands, the property pane and the
// commands following the selection, the system-entry switch), "Open in File Browser" from an
// explorer selection, a disk going away under an open folder, the switches kept, and two views
// populating the same folder.
#include "app/Commander.h"
#include "app/MainView.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/DiskBrowserView.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/PropertyPane.h"
#include "ClientFramework/Views/WindowManager.h"
#include "Kernel/Implementation/Root/Root.h"

#include "tests/app/TestMainWindow.h"
#include "tests/common/LogTestUtil.h"
#include "tests/common/MemoryVolume.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include <QAbstractItemModelTester>
#include <QAction>
#include <QApplication>
#include <QDomDocument>
#include <QElapsedTimer>
#include <QLabel>
#include <QMenu>
#include <QPointer>
#include <QSignalSpy>
#include <QSortFilterProxyModel>
#include <QTest>
#include <QTreeView>
#include <QTreeWidget>
#include <gtest/gtest.h>

#include <iostream>
#include <memory>

namespace {

bool haveTools()
{
    for (const char *tool : {"truncate", "sfdisk", "mkfs.vfat", "mmd", "mcopy", "mdir", "dd"})
        if (!TestUtil::haveTool(tool))
            return false;
    return true;
}

// An MBR disk of 16 MiB with one FAT partition holding:
//   DOCS/  DOCS/DEEP/  DOCS/DEEP/A.BIN  DOCS/Long File Name.txt  HELLO.TXT  EMPTY.TXT (zero bytes)
struct FatImage
{
    QString disk;
    QString fat;

    explicit FatImage(const QString &dir)
    {
        const QString d = dir + "/browse.img";
        fat = dir + "/browse.fat";
        const QString hello = dir + "/hello";
        const QString empty = dir + "/empty";
        if (!TestUtil::writeFile(hello, "hello, browser\n") || !TestUtil::writeFile(empty, {}))
            return;
        if (TestUtil::run("truncate", {"-s", "16M", d}).exitCode != 0 ||
            TestUtil::run("sh",
                          {"-c", "printf 'label: dos\\nstart=2048,size=16384,type=6\\n' | sfdisk -q " + d})
                    .exitCode != 0 ||
            TestUtil::run("mkfs.vfat", {"-n", "BROWSE", "-C", fat, "8192"}).exitCode != 0)
            return;
        const QList<QStringList> steps = {
            {"mmd", "-i", fat, "::/DOCS", "::/DOCS/DEEP"},
            {"mcopy", "-i", fat, hello, "::/HELLO.TXT"},
            {"mcopy", "-i", fat, empty, "::/EMPTY.TXT"},
            {"mcopy", "-i", fat, hello, "::/DOCS/Long File Name.txt"},
            {"mcopy", "-i", fat, hello, "::/DOCS/DEEP/A.BIN"},
        };
        for (const QStringList &s : steps)
            if (TestUtil::run(s.first(), s.mid(1)).exitCode != 0)
                return;
        if (TestUtil::run("dd", {"if=" + fat, "of=" + d, "bs=512", "seek=2048", "conv=notrunc"}).exitCode !=
            0)
            return;
        disk = d;
    }

    // The names in a folder of the FAT volume as mtools lists them ("" is the root).
    QStringList names(const QString &folder) const
    {
        const TestUtil::ToolResult r = TestUtil::run("mdir", {"-i", fat, "-b", "::/" + folder});
        QStringList list;
        for (QString line : QString::fromUtf8(r.out).split('\n', Qt::SkipEmptyParts)) {
            if (line.endsWith('/'))
                line.chop(1);
            list << line.section('/', -1);
        }
        list.sort();
        return list;
    }
};

// A ready volume in memory holding
//   DOCS/  DOCS/DEEP/  DOCS/DEEP/A.BIN  DOCS/Long File Name.txt  HELLO.TXT  EMPTY.TXT (zero bytes)
//   SYSTEM.DAT (a system entry)
class FolderVolume : public TestVolumes::MemoryVolume
{
public:
    // `extra` more files in a folder BULK ("F00000.BIN", ...).
    explicit FolderVolume(int extra = 0)
    {
        m_label = QStringLiteral("MEMORY");
        auto root = newRoot();
        CEntry *docs = add(root.get(), "DOCS", CEntry::AttrFolder, 0);
        CEntry *deep = add(docs, "DEEP", CEntry::AttrFolder, 0);
        add(deep, "A.BIN", 0x20, 4096);
        add(docs, "Long File Name.txt", 0x20, 1000);
        add(root.get(), "HELLO.TXT", 0x20, 15);
        add(root.get(), "EMPTY.TXT", 0x20, 0);
        add(root.get(), "SYSTEM.DAT", 0x20 | 0x04, 512);
        if (extra > 0) {
            CEntry *bulk = add(root.get(), "BULK", CEntry::AttrFolder, 0);
            for (int i = 0; i < extra; ++i)
                add(bulk, QStringLiteral("F%1.BIN").arg(extra - 1 - i, 5, 10, QChar('0')), 0x20, 512);
        }
        SetRootEntry(std::move(root));
    }
};

// The main window with the File Browser's ways to a volume node.
struct Window : TestMainWindow
{
    Framework::DiskBrowserView *browser() const
    {
        return qobject_cast<Framework::DiskBrowserView *>(windows()->view("browser"));
    }
    // "cmdOpen_Browser": the File Browser made or activated.
    Framework::DiskBrowserView *openBrowser()
    {
        commander.action("cmdOpen_Browser")->trigger();
        return browser();
    }
    // The window shown, so the rows have their places for the mouse.
    bool show(int width, int height)
    {
        view.resize(width, height);
        view.show();
        return QTest::qWaitForWindowExposed(&view);
    }
    bool mount(const QString &image) { return view.mountImage(image) && waitForDevices(1); }
    // The volume node of the mounted image.
    NodeDrive *drive() const
    {
        return dynamic_cast<NodeDrive *>(find([&](NodeCore *n) {
            auto *d = dynamic_cast<NodeDrive *>(n);
            return d && d->parent() != view.nodeRoot()->computer();
        }));
    }
};

QStringList namesOf(const QList<NodeCore *> &nodes)
{
    QStringList list;
    for (const NodeCore *n : nodes)
        list << n->text(NodeAttr::Name);
    list.sort();
    return list;
}

// The nodes the list shows (the children of its root index).
QList<NodeCore *> listed(Framework::DiskBrowserView *b)
{
    QList<NodeCore *> nodes;
    QAbstractItemModel *m = b->fileList()->model();
    const QModelIndex root = b->fileList()->rootIndex();
    for (int row = 0; row < m->rowCount(root); ++row)
        nodes << b->model()->nodeOf(b->filterModel()->mapToSource(m->index(row, 0, root)));
    return nodes;
}

NodeCore *listedByName(Framework::DiskBrowserView *b, const QString &name)
{
    for (NodeCore *n : listed(b))
        if (n && n->text(NodeAttr::Name) == name)
            return n;
    return nullptr;
}

QModelIndex listIndexOf(Framework::DiskBrowserView *b, const NodeCore *node)
{
    return b->filterModel()->mapFromSource(b->model()->indexOf(node));
}

QList<NodeCore *> treeNodes(Framework::DiskBrowserView *b, const QModelIndex &parent = {})
{
    QList<NodeCore *> all;
    QSortFilterProxyModel *m = b->folderModel();
    for (int row = 0; row < m->rowCount(parent); ++row) {
        const QModelIndex i = m->index(row, 0, parent);
        all << b->model()->nodeOf(b->filterModel()->mapToSource(m->mapToSource(i))) << treeNodes(b, i);
    }
    return all;
}

QStringList menuIds(QMenu &menu)
{
    QStringList ids;
    for (QAction *a : menu.actions())
        if (!a->isSeparator())
            ids << a->objectName();
    return ids;
}

QStringList paneGroups(Framework::PropertyPane *pane)
{
    QStringList titles;
    for (int i = 0; i < pane->tree()->topLevelItemCount(); ++i)
        titles << pane->tree()->topLevelItem(i)->text(0);
    return titles;
}

// Waits until the list shows the children of a populated folder.
bool waitListed(Framework::DiskBrowserView *b, NodeCore *folder)
{
    b->model()->waitForPopulations();
    return QTest::qWaitFor([&] { return folder->isPopulated() && listed(b).size() == folder->childCount(); },
                           5000);
}

// Browses to a volume node and waits until the list shows its root folder.
bool browseListed(Framework::DiskBrowserView *b, NodeDrive *drive)
{
    return b->browseTo(drive) && waitListed(b, drive->rootFolder());
}

// The browser's source, filter and folder models under the model tester, fatal at the first fault.
struct BrowserModelTesters
{
    explicit BrowserModelTesters(Framework::DiskBrowserView *b)
        : source(b->model(), Fatal), filter(b->filterModel(), Fatal), folder(b->folderModel(), Fatal)
    {
    }
    static constexpr auto Fatal = QAbstractItemModelTester::FailureReportingMode::Fatal;
    QAbstractItemModelTester source;
    QAbstractItemModelTester filter;
    QAbstractItemModelTester folder;
};

// Tests over the FAT image above, made in a folder of their own before each test.
class DiskBrowserOnImage : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!haveTools())
            GTEST_SKIP() << "needs truncate, sfdisk, mkfs.vfat, mtools and dd";
        ASSERT_FALSE(image.disk.isEmpty());
    }

    QTemporaryDir dir;
    FatImage image{dir.path()};
};

} // namespace

TEST(DiskBrowser, OpensThroughItsCommandsOnce)
{
    Window w;
    QAction *open = w.commander.action("cmdOpen_Browser");
    ASSERT_NE(open, nullptr);
    EXPECT_TRUE(open->isEnabled());
    EXPECT_EQ(w.browser(), nullptr); // made on first request
    open->trigger();
    Framework::DiskBrowserView *browser = w.browser();
    ASSERT_NE(browser, nullptr);
    EXPECT_EQ(browser->title(), "File Browser");
    EXPECT_EQ(w.windows()->activeView(), browser);
    // Nothing chosen yet: the list shows the top level.
    EXPECT_EQ(browser->currentFolder(), nullptr);
    EXPECT_EQ(browser->locationLabel()->text(), w.view.nodeRoot()->text(NodeAttr::Name));
    EXPECT_TRUE(listed(browser).contains(w.view.nodeRoot()->computer()));
    // Its filter switches and "Up" fill the "&View" menu while it is the active view.
    QStringList viewMenu;
    for (QAction *a : w.view.menu("&View")->actions())
        viewMenu << a->objectName();
    EXPECT_TRUE(viewMenu.contains("browserUp"));
    EXPECT_TRUE(viewMenu.contains("bmfPartitions"));
    EXPECT_TRUE(viewMenu.contains("bmfSysEntries"));
    QStringList editMenu;
    for (QAction *a : w.view.menu("&Edit")->actions())
        editMenu << a->objectName();
    EXPECT_EQ(editMenu, QStringList({"cmdNode_SelectAll"}));
    // A second request activates the same view.
    w.windows()->openView("explorer");
    open->trigger();
    EXPECT_EQ(w.browser(), browser);
    EXPECT_EQ(w.windows()->activeView(), browser);
    // "Open in File Browser" with nothing selected just shows the view; Ctrl+B reaches it from the
    // window.
    w.windows()->openView("explorer");
    QAction *browse = w.commander.action("cmdNode_Browse");
    ASSERT_NE(browse, nullptr);
    EXPECT_TRUE(w.view.actions().contains(browse));
    browse->trigger();
    EXPECT_EQ(w.windows()->activeView(), browser);
}

TEST_F(DiskBrowserOnImage, ShowsTheDisksOfAMountedImageAndOpensThemFromTheExplorer)
{
    Window w;
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_NE(b, nullptr);
    const BrowserModelTesters testers(b);
    ASSERT_TRUE(w.mount(image.disk));
    NodeDrive *drive = w.drive();
    ASSERT_NE(drive, nullptr);
    NodeCore *partition = drive->parent();
    NodeCore *device = partition->parent();
    ASSERT_EQ(partition->kind(), NodeKind::Partition);
    ASSERT_EQ(device->kind(), NodeKind::Device);

    // The disk arrives opened down to its volume.
    ASSERT_TRUE(QTest::qWaitFor([&] { return treeNodes(b).contains(drive); }, 5000));
    EXPECT_TRUE(b->folderTree()->isExpanded(b->folderModel()->mapFromSource(listIndexOf(b, device))));
    EXPECT_TRUE(b->folderTree()->isExpanded(b->folderModel()->mapFromSource(listIndexOf(b, partition))));
    // The partition where sfdisk put it; the volume with the label blkid reads.
    const QString table = QString::fromUtf8(TestUtil::run("sfdisk", {"-d", image.disk}).out);
    EXPECT_TRUE(table.contains("start=        2048, size=       16384")) << table.toStdString();
    EXPECT_EQ(partition->text(NodeAttr::FirstSector), "2048");
    const QString label =
        QString::fromUtf8(TestUtil::run("blkid", {"-p", "-s", "LABEL", "-o", "value", image.fat}).out)
            .trimmed();
    EXPECT_EQ(label, "BROWSE");
    EXPECT_TRUE(drive->text(NodeAttr::Name).contains(label)) << drive->text(NodeAttr::Name).toStdString();

    // Enter on the device in the list of the computer opens it in place; the partition lists the
    // volume.
    ASSERT_TRUE(b->openFolder(w.view.nodeRoot()->computer()));
    EXPECT_EQ(b->currentFolder(), w.view.nodeRoot()->computer());
    b->fileList()->setFocus();
    b->fileList()->setCurrentIndex(listIndexOf(b, device));
    QTest::keyClick(b->fileList(), Qt::Key_Return);
    EXPECT_EQ(b->treeNode(), device);
    EXPECT_TRUE(listed(b).contains(partition));
    EXPECT_EQ(b->locationLabel()->text(), device->text(NodeAttr::Location));
    ASSERT_TRUE(b->openFolder(partition));
    EXPECT_EQ(listed(b), QList<NodeCore *>({drive}));

    // Where the kernel reads the FAT directories, the volume lists what mtools lists.
    if (drive->rootFolder()) {
        ASSERT_TRUE(b->openFolder(drive));
        ASSERT_TRUE(waitListed(b, drive->rootFolder()));
        EXPECT_EQ(namesOf(listed(b)), image.names(""));
    } else {
        std::cout << "[ note ] the kernel gives this FAT volume no root entry: no folders to compare"
                  << std::endl;
    }

    // "Open in File Browser" from the explorer: the volume's menu has it, it lands on the volume.
    Framework::DiskExplorerView *explorer = w.explorer();
    ASSERT_NE(explorer, nullptr);
    w.windows()->openView("explorer");
    ASSERT_TRUE(explorer->selectNode(drive));
    ASSERT_EQ(w.commander.selection(), QList<NodeCore *>({drive}));
    QMenu menu;
    explorer->fillContextMenu(&menu);
    EXPECT_TRUE(menuIds(menu).contains("cmdNode_Browse"));
    QAction *browse = w.commander.action("cmdNode_Browse");
    // Not on a busy node.
    drive->setFlags(NodeState::Busy);
    w.commander.setSelection({drive});
    EXPECT_FALSE(browse->isEnabled());
    drive->setFlags(NodeState::Busy, false);
    w.commander.setSelection({drive});
    ASSERT_TRUE(browse->isEnabled());
    LogWatch log;
    browse->trigger();
    EXPECT_EQ(w.windows()->activeView(), b);
    EXPECT_TRUE(log.texts().contains("Opening in File Browser: " + drive->text(NodeAttr::Name)))
        << log.texts().join(" | ").toStdString();
    EXPECT_EQ(b->treeNode(), drive);
    EXPECT_EQ(b->selectedNodes(), QList<NodeCore *>({drive}));
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({drive}));
    // The partition: selected in the tree, its volume in the list.
    w.windows()->openView("explorer");
    ASSERT_TRUE(explorer->selectNode(partition));
    browse->trigger();
    EXPECT_EQ(b->selectedNodes(), QList<NodeCore *>({partition}));
    EXPECT_EQ(listed(b), QList<NodeCore *>({drive}));
}

TEST(DiskBrowser, WalksTheFoldersOfAVolume)
{
    FolderVolume volume;
    Window w;
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_NE(b, nullptr);
    const BrowserModelTesters testers(b);
    QSignalSpy started(b, &Framework::DiskBrowserView::populationStarted);
    NodeDrive *drive = w.addDrive(volume);
    ASSERT_NE(drive->rootFolder(), nullptr);
    ASSERT_TRUE(treeNodes(b).contains(drive));

    // A volume lists its root folder; folders come first, then files by name.
    ASSERT_TRUE(b->openFolder(drive));
    EXPECT_EQ(b->treeNode(), drive);
    ASSERT_TRUE(waitListed(b, drive->rootFolder()));
    EXPECT_EQ(b->currentFolder(), drive->rootFolder());
    QStringList order;
    for (NodeCore *n : listed(b))
        order << n->text(NodeAttr::Name);
    EXPECT_EQ(order, QStringList({"DOCS", "EMPTY.TXT", "HELLO.TXT", "SYSTEM.DAT"}));
    ASSERT_GE(started.size(), 1);
    EXPECT_EQ(started.first().first().toString(), "Populating \\");
    // The progress text went to the main window's status bar and is gone again.
    EXPECT_FALSE(w.view.progressLabel()->isVisible());
    EXPECT_TRUE(w.view.progressLabel()->text().isEmpty());

    // Enter on a folder in the list opens it: tree and list move there.
    NodeCore *docs = listedByName(b, "DOCS");
    ASSERT_NE(docs, nullptr);
    b->fileList()->setCurrentIndex(listIndexOf(b, docs));
    QTest::keyClick(b->fileList(), Qt::Key_Return);
    EXPECT_EQ(b->treeNode(), docs);
    ASSERT_TRUE(waitListed(b, docs));
    EXPECT_EQ(namesOf(listed(b)), QStringList({"DEEP", "Long File Name.txt"}));
    EXPECT_TRUE(b->locationLabel()->text().endsWith("DOCS")) << b->locationLabel()->text().toStdString();
    NodeCore *deep = listedByName(b, "DEEP");
    ASSERT_NE(deep, nullptr);
    ASSERT_TRUE(b->openFolder(deep));
    ASSERT_TRUE(waitListed(b, deep));
    EXPECT_EQ(namesOf(listed(b)), QStringList({"A.BIN"}));

    // The tree holds containers only: no file of the volume shows up there, and a folder of files
    // only has nothing to expand.
    for (NodeCore *n : treeNodes(b)) {
        ASSERT_NE(n, nullptr);
        EXPECT_NE(n->kind(), NodeKind::File) << n->text(NodeAttr::Name).toStdString();
    }
    EXPECT_TRUE(treeNodes(b).contains(deep));
    EXPECT_FALSE(b->folderModel()->hasChildren(b->folderModel()->mapFromSource(listIndexOf(b, deep))));

    // Two populations at once: the status bar keeps its text until both have ended.
    FolderVolume second, third;
    QSignalSpy finished(b, &Framework::DiskBrowserView::populationFinished);
    started.clear();
    for (FolderVolume *v : {&second, &third})
        b->model()->fetchMore(b->model()->indexOf(w.addDrive(*v)->rootFolder()));
    EXPECT_EQ(started.size(), 2);
    ASSERT_TRUE(b->model()->waitForPopulations());
    EXPECT_EQ(finished.size(), 1);
    EXPECT_FALSE(w.view.progressLabel()->isVisible());

    // Backspace and "Up" climb again; from the root folder the step skips the volume's own row.
    QTest::keyClick(b->fileList(), Qt::Key_Backspace);
    EXPECT_EQ(b->treeNode(), docs);
    b->upAction()->trigger();
    EXPECT_EQ(b->currentFolder(), drive->rootFolder());
    b->upAction()->trigger();
    EXPECT_EQ(b->treeNode(), w.view.nodeRoot()->computer());
    EXPECT_TRUE(listed(b).contains(drive));

    // The system entry goes with "Show System Entries" switched off, and comes back.
    ASSERT_TRUE(b->openFolder(drive));
    QAction *system = nullptr;
    for (QAction *a : b->widgetActions(IWidgetActions::ViewMenu))
        if (a && a->objectName() == "bmfSysEntries")
            system = a;
    ASSERT_NE(system, nullptr);
    system->setChecked(false);
    EXPECT_EQ(listedByName(b, "SYSTEM.DAT"), nullptr);
    EXPECT_NE(listedByName(b, "HELLO.TXT"), nullptr);
    system->setChecked(true);
    EXPECT_NE(listedByName(b, "SYSTEM.DAT"), nullptr);
}

TEST(DiskBrowser, SelectionDrivesThePropertyPaneAndTheCommands)
{
    FolderVolume volume;
    Window w;
    // The hex editor's commands stand in here: record what they are run for.
    QList<QPair<QString, QList<NodeCore *>>> ran;
    for (const char *id : {"cmdHex_NodeOpen", "cmdHex_FileRecord"}) {
        const QString name = QString::fromLatin1(id);
        w.commander.registerCommand({name, {}, {}, {}, {}, name, name});
        w.commander.setHandler(name, [&ran, &w, name] { ran.append({name, w.commander.selection()}); });
    }
    NodeDrive *drive = w.addDrive(volume);
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_NE(b, nullptr);
    auto *pane = qobject_cast<Framework::PropertyPane *>(w.windows()->view("properties"));
    ASSERT_NE(pane, nullptr);
    // Shown, so the rows have their places for the mouse.
    ASSERT_TRUE(w.show(1000, 700));
    ASSERT_TRUE(browseListed(b, drive));
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({drive}));
    const QStringList driveGroups = paneGroups(pane);
    EXPECT_FALSE(driveGroups.isEmpty());

    // A file picked in the list: its properties, the commands act on it.
    NodeCore *hello = listedByName(b, "HELLO.TXT");
    NodeCore *empty = listedByName(b, "EMPTY.TXT");
    NodeCore *docs = listedByName(b, "DOCS");
    ASSERT_TRUE(hello && empty && docs);
    const QRect helloRect = b->fileList()->visualRect(listIndexOf(b, hello));
    QTest::mouseClick(b->fileList()->viewport(), Qt::LeftButton, {}, helloRect.center());
    EXPECT_EQ(b->selectedNodes(), QList<NodeCore *>({hello}));
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({hello}));
    EXPECT_TRUE(paneGroups(pane).contains("Advanced Properties")) << paneGroups(pane).join(",").toStdString();
    QMenu fileMenu;
    b->fillContextMenu(&fileMenu);
    EXPECT_TRUE(menuIds(fileMenu).contains("cmdHex_NodeOpen"));
    EXPECT_EQ(menuIds(fileMenu).last(), "cmdProperties");

    // Two files: the commands act on both.
    b->fileList()->selectionModel()->select(listIndexOf(b, empty),
                                            QItemSelectionModel::Select | QItemSelectionModel::Rows);
    EXPECT_EQ(namesOf(w.commander.selection()), QStringList({"EMPTY.TXT", "HELLO.TXT"}));

    // Nothing picked in the list: the tree's node is the selection again.
    b->fileList()->selectionModel()->clearSelection();
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({drive}));
    EXPECT_EQ(paneGroups(pane), driveGroups);

    // Double-click or Enter: a file with data opens its data, an empty one its file record; a
    // folder opens in place and runs nothing.
    QTest::mouseDClick(b->fileList()->viewport(), Qt::LeftButton, {}, helloRect.center());
    b->fileList()->setCurrentIndex(listIndexOf(b, empty));
    QTest::keyClick(b->fileList(), Qt::Key_Return);
    ASSERT_EQ(ran.size(), 2);
    EXPECT_EQ(ran[0].first, "cmdHex_NodeOpen");
    EXPECT_EQ(ran[0].second, QList<NodeCore *>({hello}));
    EXPECT_EQ(ran[1].first, "cmdHex_FileRecord");
    EXPECT_EQ(ran[1].second, QList<NodeCore *>({empty}));
    b->fileList()->setCurrentIndex(listIndexOf(b, docs));
    QTest::keyClick(b->fileList(), Qt::Key_Enter);
    EXPECT_EQ(ran.size(), 2);
    EXPECT_EQ(b->treeNode(), docs);
    // Enter on the volume in the tree runs its default command, as in the explorer.
    ASSERT_TRUE(b->openFolder(drive));
    QTest::keyClick(b->folderTree(), Qt::Key_Return);
    ASSERT_EQ(ran.size(), 3);
    EXPECT_EQ(ran[2].first, "cmdHex_NodeOpen");
    EXPECT_EQ(ran[2].second, QList<NodeCore *>({drive}));

    // A file chosen in the explorer opens selected in the list of its folder.
    Framework::DiskExplorerView *explorer = w.explorer();
    w.windows()->openView("explorer");
    ASSERT_TRUE(explorer->selectNode(hello));
    w.commander.action("cmdNode_Browse")->trigger();
    EXPECT_EQ(w.windows()->activeView(), b);
    EXPECT_EQ(b->currentFolder(), drive->rootFolder());
    EXPECT_EQ(b->selectedNodes(), QList<NodeCore *>({hello}));
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({hello}));
    EXPECT_TRUE(paneGroups(pane).contains("Advanced Properties"));
}

TEST_F(DiskBrowserOnImage, ADiskLeavingUnderAnOpenFolderEmptiesTheView)
{
    Window w;
    ASSERT_TRUE(w.mount(image.disk));
    NodeDrive *drive = w.drive();
    ASSERT_NE(drive, nullptr);
    NodeCore *partition = drive->parent();
    NodeCore *device = partition->parent();
    Framework::DiskBrowserView *b = w.openBrowser();
    QAbstractItemModelTester filterTester(b->filterModel(),
                                          QAbstractItemModelTester::FailureReportingMode::Fatal);
    QAbstractItemModelTester folderTester(b->folderModel(),
                                          QAbstractItemModelTester::FailureReportingMode::Fatal);
    // The list shows the partition while the device is the selection: the disk goes with both.
    ASSERT_TRUE(b->browseTo(partition));
    b->folderTree()->selectionModel()->select(b->folderModel()->mapFromSource(listIndexOf(b, device)),
                                              QItemSelectionModel::ClearAndSelect |
                                                  QItemSelectionModel::Rows);
    ASSERT_EQ(w.commander.selection(), QList<NodeCore *>({device}));
    ASSERT_EQ(b->currentFolder(), partition);
    w.commander.action("cmdRemove")->trigger();
    ASSERT_TRUE(w.waitForDevices(0));
    QApplication::processEvents();
    for (NodeCore *n : b->selectedNodes())
        EXPECT_EQ(n, w.view.nodeRoot()->computer());
    for (NodeCore *n : w.commander.selection())
        EXPECT_EQ(n, w.view.nodeRoot()->computer());
    NodeCore *folder = b->currentFolder();
    EXPECT_TRUE(folder == nullptr || folder == w.view.nodeRoot()->computer());
    for (NodeCore *n : listed(b)) {
        ASSERT_NE(n, nullptr);
        EXPECT_NE(n->kind(), NodeKind::Partition);
    }
    QMenu menu;
    b->fillContextMenu(&menu); // nothing of the disk is left to ask
    b->upAction()->trigger();
    // The disk comes back: browsing works again.
    ASSERT_TRUE(w.mount(image.disk));
    ASSERT_NE(w.drive(), nullptr);
    ASSERT_TRUE(QTest::qWaitFor([&] { return treeNodes(b).contains(w.drive()); }, 5000));
    ASSERT_TRUE(b->browseTo(w.drive()->parent()));
    EXPECT_EQ(listed(b), QList<NodeCore *>({w.drive()}));
}

TEST(DiskBrowser, KeepsItsFilterSwitchesAndPanes)
{
    Window w;
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_NE(b, nullptr);
    QAction *partitions = nullptr;
    for (QAction *a : b->widgetActions(IWidgetActions::ViewMenu))
        if (a && a->objectName() == "bmfPartitions")
            partitions = a;
    ASSERT_NE(partitions, nullptr);
    EXPECT_TRUE(partitions->isChecked());
    partitions->setChecked(false);
    EXPECT_FALSE(b->filterModel()->filter(NodeSortFilterModel::Partitions));

    QDomDocument doc;
    QDomElement element = doc.createElement("browser");
    b->save(element);
    EXPECT_EQ(element.attribute("bmfPartitions"), "0");
    EXPECT_EQ(element.attribute("bmfDevices"), "1");
    EXPECT_FALSE(element.attribute("splitter").isEmpty());

    Framework::DiskBrowserView again(w.view.nodeRoot(), &w.commander);
    again.load(element);
    EXPECT_FALSE(again.filterModel()->filter(NodeSortFilterModel::Partitions));
    EXPECT_TRUE(again.filterModel()->filter(NodeSortFilterModel::Devices));
    for (QAction *a : again.widgetActions(IWidgetActions::ViewMenu))
        if (a && a->objectName() == "bmfPartitions") {
            EXPECT_FALSE(a->isChecked());
        }
    // A damaged splitter state is ignored.
    element.setAttribute("splitter", "not base64 of anything");
    again.load(element);

    // Through the main window's settings: the next window opens the browser again with them.
    // (the process-wide settings document is put back afterwards for the tests that follow)
    QDomElement main = Framework::SettingsDocument::instance().element("main-view");
    const QDomNode before = main.cloneNode(true);
    w.view.save(main);
    Solution::Commander commander;
    CRoot root;
    Solution::MainView next(&commander);
    next.setKernel(&root);
    next.build();
    next.load(main);
    auto *restored = qobject_cast<Framework::DiskBrowserView *>(next.windowManager()->view("browser"));
    main.parentNode().replaceChild(before, main);
    ASSERT_NE(restored, nullptr);
    EXPECT_FALSE(restored->filterModel()->filter(NodeSortFilterModel::Partitions));
}

TEST(DiskBrowser, TwoViewsPopulateOneFolderOnce)
{
    FolderVolume volume;
    Window w;
    NodeDrive *drive = w.addDrive(volume);
    NodeCore *rootFolder = drive->rootFolder();
    Framework::DiskExplorerView *explorer = w.explorer();
    ASSERT_NE(explorer, nullptr);
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_NE(b, nullptr);

    // The explorer starts the root folder; the browser asks for it before that result arrived.
    const QModelIndex inExplorer = explorer->model()->indexOf(rootFolder);
    ASSERT_TRUE(explorer->model()->canFetchMore(inExplorer));
    explorer->model()->fetchMore(inExplorer);
    ASSERT_TRUE(explorer->model()->isPopulating(rootFolder));
    const QModelIndex inBrowser = b->model()->indexOf(rootFolder);
    EXPECT_FALSE(b->model()->canFetchMore(inBrowser));
    b->model()->fetchMore(inBrowser);
    EXPECT_FALSE(b->model()->isPopulating(rootFolder));

    // One population; both views see the same children once.
    ASSERT_TRUE(explorer->model()->waitForPopulations());
    ASSERT_TRUE(rootFolder->isPopulated());
    EXPECT_EQ(namesOf(rootFolder->children()), QStringList({"DOCS", "EMPTY.TXT", "HELLO.TXT", "SYSTEM.DAT"}));
    EXPECT_EQ(b->model()->rowCount(inBrowser), rootFolder->childCount());
    ASSERT_TRUE(b->browseTo(drive));
    EXPECT_EQ(namesOf(listed(b)), namesOf(rootFolder->children()));

    // Once the explorer is done, the browser populates a folder of its own.
    NodeCore *docs = listedByName(b, "DOCS");
    ASSERT_NE(docs, nullptr);
    EXPECT_TRUE(b->model()->canFetchMore(b->model()->indexOf(docs)));
    // The explorer's population is cancelled (its view closed mid-way): the browser, which asked
    // in between, takes the folder over. (Two other volumes keep the explorer's workers busy, so the
    // folder is still waiting in its queue when it is cancelled.)
    FolderVolume second, third;
    for (FolderVolume *v : {&second, &third})
        explorer->model()->fetchMore(explorer->model()->indexOf(w.addDrive(*v)->rootFolder()));
    explorer->model()->fetchMore(explorer->model()->indexOf(docs));
    ASSERT_TRUE(explorer->model()->isPopulating(docs));
    EXPECT_FALSE(b->model()->canFetchMore(b->model()->indexOf(docs)));
    ASSERT_TRUE(b->openFolder(docs));
    EXPECT_FALSE(b->model()->isPopulating(docs));
    explorer->model()->cancelAll();
    EXPECT_TRUE(b->model()->isPopulating(docs));
    ASSERT_TRUE(waitListed(b, docs));
    EXPECT_EQ(namesOf(listed(b)), QStringList({"DEEP", "Long File Name.txt"}));

    // The browser closed while it populates a folder: the worker stops, the folder is free again.
    NodeCore *deep = listedByName(b, "DEEP");
    ASSERT_NE(deep, nullptr);
    ASSERT_TRUE(b->openFolder(deep));
    ASSERT_TRUE(b->model()->isPopulating(deep));
    EXPECT_FALSE(explorer->model()->canFetchMore(explorer->model()->indexOf(deep)));
    QPointer<Framework::DiskBrowserView> closing(b);
    ASSERT_TRUE(w.windows()->closeView("browser"));
    QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    ASSERT_TRUE(closing.isNull());
    QApplication::processEvents();
    if (!deep->isPopulated()) {
        EXPECT_TRUE(explorer->model()->canFetchMore(explorer->model()->indexOf(deep)));
    }
}

TEST(DiskBrowser, OutlivesTheTreeItShows)
{
    FolderVolume volume;
    CRoot kernel;
    auto nodes = std::make_unique<NodeRoot>(&kernel);
    auto *drive = new NodeDrive(&volume);
    nodes->computer()->appendChild(drive);
    Framework::DiskBrowserView view(nodes.get(), nullptr);
    ASSERT_TRUE(view.browseTo(drive));
    view.model()->waitForPopulations();
    QApplication::processEvents();
    ASSERT_FALSE(listed(&view).isEmpty());
    // A view still standing (closed, its deletion pending) when the tree goes.
    nodes.reset();
    EXPECT_EQ(view.currentFolder(), nullptr);
    EXPECT_TRUE(view.selectedNodes().isEmpty());
    EXPECT_TRUE(view.locationLabel()->text().isEmpty());
    EXPECT_FALSE(view.goUp());
    EXPECT_FALSE(view.browseTo(nullptr));
}

TEST(DiskBrowser, ListsAFolderOfTwentyThousandFilesQuickly)
{
    FolderVolume volume(20000);
    Window w;
    NodeDrive *drive = w.addDrive(volume);
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_TRUE(w.show(1100, 700));
    ASSERT_TRUE(browseListed(b, drive));
    NodeCore *bulk = listedByName(b, "BULK");
    ASSERT_NE(bulk, nullptr);
    QElapsedTimer clock;
    clock.start();
    ASSERT_TRUE(b->openFolder(bulk));
    ASSERT_TRUE(waitListed(b, bulk));
    QApplication::processEvents();
    const qint64 ms = clock.elapsed();
    std::cout << "[ figure ] folder of 20000 files listed (populated, sorted, shown) in " << ms << " ms"
              << std::endl;
    // Sorted by name although the volume gives them in reverse.
    const QList<NodeCore *> rows = listed(b);
    ASSERT_EQ(rows.size(), 20000);
    EXPECT_EQ(rows.first()->text(NodeAttr::Name), "F00000.BIN");
    EXPECT_EQ(rows.last()->text(NodeAttr::Name), "F19999.BIN");
    EXPECT_LT(ms, 20000);
}

// A picture of the browser inside a folder, written when BRINDLE_SCREENSHOT_DIR names a folder.
TEST(DiskBrowser, Screenshot)
{
    const QString out = qEnvironmentVariable("BRINDLE_SCREENSHOT_DIR");
    if (out.isEmpty())
        GTEST_SKIP() << "set BRINDLE_SCREENSHOT_DIR to write the picture";
    FolderVolume volume;
    Window w;
    NodeDrive *drive = w.addDrive(volume);
    Framework::DiskBrowserView *b = w.openBrowser();
    ASSERT_TRUE(w.show(1100, 700));
    ASSERT_TRUE(browseListed(b, drive));
    NodeCore *docs = listedByName(b, "DOCS");
    ASSERT_TRUE(b->openFolder(docs));
    ASSERT_TRUE(waitListed(b, docs));
    ASSERT_TRUE(b->openFolder(drive));
    ASSERT_TRUE(b->browseTo(listedByName(b, "HELLO.TXT")));
    QTest::qWait(200);
    EXPECT_TRUE(w.view.grab().save(out + "/browser.png"));
}
