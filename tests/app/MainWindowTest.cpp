// The product's main window over a kernel root with mounted test images: the Disk Explorer's tree
// and device map, context menus per node kind, the property pane, mounting through the menu and
// "Recent Disk &Images", removing an image, and the time until ten mounted images are shown.
#include "app/Commander.h"
#include "app/MainView.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/DeviceMap.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/PropertyPane.h"
#include "ClientFramework/Views/RecentFiles.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WelcomeView.h"
#include "ClientFramework/Views/WindowManager.h"

#include "tests/app/TestMainWindow.h"
#include "tests/common/TestUtil.h"

#include <QAbstractItemModelTester>
#include <QAction>
#include <QApplication>
#include <QCheckBox>
#include <QElapsedTimer>
#include <QLabel>
#include <QMenu>
#include <QTest>
#include <QTreeView>
#include <QTreeWidget>
#include <gtest/gtest.h>

#include <iostream>

namespace {

// An MBR disk of 32 MiB: a FAT partition, an ext4 partition and free space at the end.
QString makeMbrImage(const QString &dir)
{
    const QString disk = dir + "/mbr.img";
    const QString fat = dir + "/fat.part";
    const QString ext = dir + "/ext.part";
    if (TestUtil::run("truncate", {"-s", "32M", disk}).exitCode != 0)
        return {};
    TestUtil::ToolResult r = TestUtil::run("sh", {"-c", "printf 'label: dos\\nstart=2048,size=16384,type=6\\n"
                                                        "start=18432,size=24576,type=83\\n' | sfdisk -q " +
                                                            disk});
    if (r.exitCode != 0)
        return {};
    if (TestUtil::run("mkfs.vfat", {"-C", fat, "8192"}).exitCode != 0 ||
        TestUtil::run("mkfs.ext4", {"-q", "-F", ext, "12M"}).exitCode != 0)
        return {};
    if (TestUtil::run("dd", {"if=" + fat, "of=" + disk, "bs=512", "seek=2048", "conv=notrunc,sparse"})
                .exitCode != 0 ||
        TestUtil::run("dd", {"if=" + ext, "of=" + disk, "bs=512", "seek=18432", "conv=notrunc,sparse"})
                .exitCode != 0)
        return {};
    return disk;
}

// A GPT disk of 64 MiB: a FAT data partition and an ext4 partition.
QString makeGptImage(const QString &dir)
{
    const QString disk = dir + "/gpt.img";
    const QString fat = dir + "/gfat.part";
    const QString ext = dir + "/gext.part";
    if (TestUtil::run("truncate", {"-s", "64M", disk}).exitCode != 0 ||
        TestUtil::run("sgdisk", {"-n", "1:2048:+16M", "-t", "1:0700", "-c", "1:data", "-n", "2:0:+24M", "-t",
                                 "2:8300", "-c", "2:linux", disk})
                .exitCode != 0)
        return {};
    if (TestUtil::run("mkfs.vfat", {"-C", fat, "16384"}).exitCode != 0 ||
        TestUtil::run("mkfs.ext4", {"-q", "-F", ext, "24M"}).exitCode != 0)
        return {};
    if (TestUtil::run("dd", {"if=" + fat, "of=" + disk, "bs=512", "seek=2048", "conv=notrunc"}).exitCode !=
            0 ||
        TestUtil::run("dd", {"if=" + ext, "of=" + disk, "bs=512", "seek=34816", "conv=notrunc"}).exitCode !=
            0)
        return {};
    return disk;
}

bool haveImageTools()
{
    for (const char *tool : {"truncate", "sfdisk", "mkfs.vfat", "mkfs.ext4", "dd"})
        if (!TestUtil::haveTool(tool))
            return false;
    return true;
}

using Window = TestMainWindow;

QList<QModelIndex> walk(QAbstractItemModel *model, const QModelIndex &parent = {})
{
    QList<QModelIndex> all;
    for (int row = 0; row < model->rowCount(parent); ++row) {
        const QModelIndex i = model->index(row, 0, parent);
        all << i << walk(model, i);
    }
    return all;
}

QStringList menuIds(QMenu &menu)
{
    QStringList ids;
    for (QAction *a : menu.actions())
        ids << (a->isSeparator() ? QString("|") : a->objectName());
    return ids;
}

} // namespace

TEST(MainWindow, DiskExplorerShowsAMountedImageAndWalksTheTree)
{
    if (!haveImageTools())
        GTEST_SKIP() << "needs truncate, sfdisk, mkfs.vfat, mkfs.ext4 and dd";
    QTemporaryDir dir;
    const QString image = makeMbrImage(dir.path());
    ASSERT_FALSE(image.isEmpty());
    Window w;
    auto *explorer = w.explorer();
    ASSERT_NE(explorer, nullptr);
    w.view.windowManager()->openView("explorer"); // behind the welcome view at start
    QAbstractItemModelTester sourceTester(explorer->model(),
                                          QAbstractItemModelTester::FailureReportingMode::Fatal);
    QAbstractItemModelTester proxyTester(explorer->filterModel(),
                                         QAbstractItemModelTester::FailureReportingMode::Fatal);
    EXPECT_EQ(explorer->title(), "Disk Explorer");
    ASSERT_NE(w.view.windowManager()->view("properties"), nullptr);
    ASSERT_NE(w.view.windowManager()->view("view-log"), nullptr);

    // "Open Disk Image..." through the file chooser; remembered in "Recent Disk &Images".
    w.prompts.files << image;
    w.commander.action("cmdDI_Mount")->trigger();
    ASSERT_EQ(w.view.recentFiles()->files(), QStringList({QFileInfo(image).absoluteFilePath()}));
    EXPECT_TRUE(w.view.recentMenu()->isEnabled());
    ASSERT_TRUE(w.waitForDevices(1));

    // Walk the tree: the computer, the image disk, two partitions, the gap and the volumes.
    QTreeView *tree = explorer->tree();
    QStringList kinds;
    NodeCore *device = nullptr;
    NodeCore *partition = nullptr;
    for (const QModelIndex &i : walk(tree->model())) {
        NodeCore *n = explorer->model()->nodeOf(explorer->filterModel()->mapToSource(i));
        ASSERT_NE(n, nullptr);
        kinds << n->text(NodeAttr::TypeKey);
        if (n->kind() == NodeKind::Device)
            device = n;
        if (n->kind() == NodeKind::Partition && !partition)
            partition = n;
        tree->scrollTo(i);
    }
    ASSERT_NE(device, nullptr);
    ASSERT_NE(partition, nullptr);
    EXPECT_EQ(kinds.count("computer"), 1);
    EXPECT_GE(kinds.count("partition"), 3) << kinds.join(",").toStdString(); // two and the free space
    EXPECT_TRUE(device->text(NodeAttr::Key).startsWith("di-")) << device->text(NodeAttr::Key).toStdString();

    // The device map draws the disk with its partitions to scale, with file-system names.
    Framework::DeviceMap *map = explorer->deviceMap();
    map->resize(800, 200);
    QApplication::processEvents();
    QList<Framework::DeviceMap::Segment> pieces;
    for (const auto &s : map->segments())
        if (s.node != device)
            pieces << s;
    QStringList labels;
    for (const auto &s : pieces)
        labels << s.label;
    // The free space before the first partition, the two partitions and the free space after them.
    ASSERT_EQ(pieces.size(), 4) << labels.join(" / ").toStdString();
    EXPECT_TRUE(pieces[1].label.contains("FAT", Qt::CaseInsensitive)) << pieces[1].label.toStdString();
    EXPECT_TRUE(pieces[2].label.contains("ext", Qt::CaseInsensitive)) << pieces[2].label.toStdString();
    // 8 MiB and 12 MiB: widths in the same proportion (within rounding); segments touch in order.
    EXPECT_NEAR(double(pieces[2].rect.width()) / pieces[1].rect.width(), 1.5, 0.1);
    for (int i = 1; i < pieces.size(); ++i)
        EXPECT_EQ(pieces[i].rect.left(), pieces[i - 1].rect.right() + 1);

    // Selecting in the map selects in the tree; the property pane follows.
    emit map->nodeClicked(device);
    EXPECT_EQ(explorer->selectedNodes(), QList<NodeCore *>({device}));
    EXPECT_EQ(w.commander.selection(), QList<NodeCore *>({device}));
    auto *pane = qobject_cast<Framework::PropertyPane *>(w.view.windowManager()->view("properties"));
    ASSERT_NE(pane, nullptr);
    EXPECT_GT(pane->tree()->topLevelItemCount(), 0);

    // Context menus per node kind: an image disk can be removed, a partition cannot.
    QMenu deviceMenu;
    explorer->fillContextMenu(&deviceMenu);
    const QStringList deviceIds = menuIds(deviceMenu);
    EXPECT_TRUE(deviceIds.contains("cmdRemove")) << deviceIds.join(",").toStdString();
    EXPECT_EQ(deviceIds.last(), "cmdProperties");
    explorer->selectNode(partition);
    QMenu partitionMenu;
    explorer->fillContextMenu(&partitionMenu);
    const QStringList partitionIds = menuIds(partitionMenu);
    EXPECT_FALSE(partitionIds.contains("cmdRemove"));
    EXPECT_EQ(partitionIds.last(), "cmdProperties");
    EXPECT_NE(partitionIds.first(), "|");

    // "Remove" takes the image out of the tree again.
    explorer->selectNode(device);
    w.commander.action("cmdRemove")->trigger();
    ASSERT_TRUE(w.waitForDevices(0));
    EXPECT_TRUE(w.commander.selection().isEmpty());
    EXPECT_TRUE(map->segments().isEmpty() || map->segments().size() == 0);

    // Choosing the image from "Recent Disk &Images" mounts it again.
    ASSERT_EQ(w.view.recentMenu()->actions().size(), 1);
    w.view.recentMenu()->actions().first()->trigger();
    EXPECT_TRUE(w.waitForDevices(1));
}

TEST(MainWindow, WelcomeViewListsItsCommands)
{
    Window w;
    auto *welcome = qobject_cast<Framework::WelcomeView *>(w.view.windowManager()->view("welcome"));
    ASSERT_NE(welcome, nullptr);
    EXPECT_EQ(w.view.windowManager()->activeView(), welcome);
    EXPECT_EQ(welcome->gettingStarted(),
              QStringList({"cmdOpen_Explorer", "cmdHex_File", "cmdOpen_Browser", "cmdDI_Mount"}));
    EXPECT_EQ(welcome->support(),
              QStringList({"cmdHelp", "cmdWebHelp", "cmdWebRequest", "cmdHddInfo", "cmdSettings"}));
    EXPECT_TRUE(welcome->rightsLabel()->text().startsWith("Administrator Rights: "));
    EXPECT_TRUE(welcome->rightsLabel()->text().endsWith("</b>; <br />"));
    EXPECT_TRUE(welcome->startupBox()->isChecked());
    // "Open Disk" from the welcome view activates the Disk Explorer.
    auto *open = welcome->findChild<QWidget *>("cmdOpen_Explorer");
    ASSERT_NE(open, nullptr);
    QTest::mouseClick(open, Qt::LeftButton);
    EXPECT_EQ(w.view.windowManager()->activeView()->viewId(), "explorer");
    // The box is kept: the next start skips the view.
    welcome->startupBox()->setChecked(false);
    QDomElement element = Framework::SettingsDocument::instance().element("main-view");
    EXPECT_FALSE(Framework::WelcomeView::showOnStartup(
        element.firstChildElement("views").firstChildElement("welcome")));
    Solution::Commander commander;
    Solution::MainView again(&commander);
    again.build();
    again.load(element);
    EXPECT_EQ(again.windowManager()->view("welcome"), nullptr);
}

TEST(MainWindow, TenMountedImagesArePopulatedQuickly)
{
    if (!haveImageTools())
        GTEST_SKIP() << "needs truncate, sfdisk, mkfs.vfat, mkfs.ext4 and dd";
    QTemporaryDir dir;
    const QString first = makeMbrImage(dir.path());
    ASSERT_FALSE(first.isEmpty());
    QStringList images{first};
    for (int i = 1; i < 10; ++i) {
        const QString copy = dir.filePath(QString("copy%1.img").arg(i));
        ASSERT_TRUE(QFile::copy(first, copy));
        images << copy;
    }
    QElapsedTimer clock;
    clock.start();
    Window w;
    for (const QString &image : images)
        ASSERT_TRUE(w.view.mountImage(image));
    auto *explorer = w.explorer();
    ASSERT_TRUE(QTest::qWaitFor([&] { return explorer->model()->rowCount() == 11; }, 10000));
    explorer->tree()->expandAll();
    QApplication::processEvents();
    const qint64 ms = clock.elapsed();
    std::cout << "[ figure ] window with ten mounted images populated in " << ms << " ms" << std::endl;
    EXPECT_EQ(Framework::DeviceMap::devices(w.view.nodeRoot()).size(), 10);
    EXPECT_LT(ms, 10000);
}

// Pictures of the Disk Explorer and the property pane with an MBR and a GPT image mounted, written
// when BRINDLE_SCREENSHOT_DIR names a folder (run under a real display to look at them).
TEST(MainWindow, Screenshots)
{
    const QString out = qEnvironmentVariable("BRINDLE_SCREENSHOT_DIR");
    if (out.isEmpty())
        GTEST_SKIP() << "set BRINDLE_SCREENSHOT_DIR to write the pictures";
    if (!haveImageTools() || !TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "needs the image tools and sgdisk";
    QTemporaryDir dir;
    const QString mbr = makeMbrImage(dir.path());
    const QString gpt = makeGptImage(dir.path());
    ASSERT_FALSE(mbr.isEmpty());
    ASSERT_FALSE(gpt.isEmpty());
    Window w;
    ASSERT_TRUE(w.view.mountImage(mbr));
    ASSERT_TRUE(w.view.mountImage(gpt));
    w.view.windowManager()->openView("explorer");
    w.view.resize(1280, 820);
    w.view.show();
    QTest::qWait(300);
    auto *explorer = w.explorer();
    NodeCore *target = nullptr;
    for (const QModelIndex &i : walk(explorer->tree()->model())) {
        NodeCore *n = explorer->model()->nodeOf(explorer->filterModel()->mapToSource(i));
        if (n && n->kind() == NodeKind::Partition && n->text(NodeAttr::Kind) != "Unallocated") {
            target = n;
            break;
        }
    }
    ASSERT_NE(target, nullptr);
    explorer->selectNode(target);
    QTest::qWait(300);
    EXPECT_TRUE(w.view.grab().save(out + "/explorer.png"));
    EXPECT_TRUE(w.view.windowManager()->view("properties")->grab().save(out + "/properties.png"));
}
