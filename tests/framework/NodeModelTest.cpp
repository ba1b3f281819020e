// The three models over the node tree checked by QAbstractItemModelTester while devices arrive
// and leave and folders are populated; the filter switches and their persistence; folder
// population on the worker thread with cancellation.
#include "tests/framework/NodeTestSupport.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeModel.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"
#include "ClientFramework/Threads/NodeTagged.h"

#include <QAbstractItemModelTester>
#include <QCoreApplication>
#include <QDomDocument>
#include <QElapsedTimer>
#include <QSignalSpy>

#include <gtest/gtest.h>

using namespace NodeTest;

namespace {

int countRows(const QAbstractItemModel &model, const QModelIndex &parent = QModelIndex())
{
    int n = model.rowCount(parent);
    int total = n;
    for (int r = 0; r < n; ++r)
        total += countRows(model, model.index(r, 0, parent));
    return total;
}

int countNodes(const NodeCore *node)
{
    int n = node->childCount();
    for (const NodeCore *c : node->children())
        n += countNodes(c);
    return n;
}

} // namespace

TEST(NodeModels, FollowDevicesArrivingAndLeaving)
{
    if (!haveImageTools())
        GTEST_SKIP() << "sfdisk, sgdisk, mkfs.vfat and mke2fs are needed";
    QTemporaryDir dir;
    QDir d(dir.path());
    const QString mbr = makeMbrImage(d);
    const QString gpt = makeGptImage(d);
    ASSERT_FALSE(mbr.isEmpty());
    ASSERT_FALSE(gpt.isEmpty());

    CRoot root;
    NodeRoot tree(&root);
    NodeModel model(&tree);
    DiskBrowserModel browser(&tree);
    NodeSortFilterModel proxy;
    proxy.setSourceModel(&model);
    proxy.sort(0);
    QAbstractItemModelTester t1(&model, QAbstractItemModelTester::FailureReportingMode::Fatal);
    QAbstractItemModelTester t2(&browser, QAbstractItemModelTester::FailureReportingMode::Fatal);
    QAbstractItemModelTester t3(&proxy, QAbstractItemModelTester::FailureReportingMode::Fatal);
    EXPECT_EQ(model.rowCount(), 1); // the computer

    CDevice *m = open(root, mbr);
    CDevice *g = open(root, gpt);
    ASSERT_NE(m, nullptr);
    ASSERT_NE(g, nullptr);
    QCoreApplication::processEvents();
    ASSERT_EQ(model.rowCount(), 3);
    EXPECT_EQ(countRows(model), countNodes(&tree));
    const QModelIndex devIndex = model.indexOf(tree.deviceNode(m));
    ASSERT_TRUE(devIndex.isValid());
    EXPECT_EQ(model.nodeOf(devIndex), tree.deviceNode(m));
    EXPECT_EQ(devIndex.data(NodeModel::KeyRole).toString(), tree.deviceNode(m)->text(NodeAttr::Key));
    EXPECT_EQ(model.index(devIndex.row(), 2).data(Qt::ForegroundRole).value<QColor>(),
              tree.deviceNode(m)->statusColor());
    EXPECT_EQ(model.headerData(0, Qt::Horizontal).toString(), "Name");

    // Partitions switched off: device rows keep no children in the proxy.
    proxy.setFilter(NodeSortFilterModel::Partitions, false);
    const QModelIndex proxDev = proxy.mapFromSource(devIndex);
    ASSERT_TRUE(proxDev.isValid());
    EXPECT_EQ(proxy.rowCount(proxDev), 0);
    proxy.setFilter(NodeSortFilterModel::Partitions, true);
    EXPECT_GT(proxy.rowCount(proxy.mapFromSource(devIndex)), 0);
    proxy.setFilter(NodeSortFilterModel::MyComputer, false);
    EXPECT_EQ(proxy.rowCount(), 2);
    proxy.setFilter(NodeSortFilterModel::VirtualDevices, false); // images are virtual devices
    EXPECT_EQ(proxy.rowCount(), 0);
    proxy.setFilters(NodeSortFilterModel::All);
    proxy.setFilter(NodeSortFilterModel::Unallocated, false);
    for (int r = 0; r < proxy.rowCount(proxy.mapFromSource(devIndex)); ++r)
        EXPECT_NE(proxy.index(r, 1, proxy.mapFromSource(devIndex)).data().toString(), "Unallocated");
    proxy.setFilters(NodeSortFilterModel::All);

    // A device identified again is rebuilt under the live models, with the same keys.
    const int before = countRows(model);
    const QString firstKey = tree.deviceNode(m)->child(0)->text(NodeAttr::Key);
    tree.onKernelStorage(_event_storage{m, _event_storage::ChangeCompleted, 0});
    EXPECT_EQ(countRows(model), before);
    EXPECT_EQ(tree.deviceNode(m)->child(0)->text(NodeAttr::Key), firstKey);

    // A device leaves while all three models are live.
    QPersistentModelIndex keep(model.indexOf(tree.deviceNode(g)));
    ASSERT_TRUE(root.RemoveDevice(m));
    QCoreApplication::processEvents();
    EXPECT_EQ(model.rowCount(), 2);
    EXPECT_EQ(browser.rowCount(), 2);
    EXPECT_TRUE(keep.isValid());
    EXPECT_EQ(model.nodeOf(keep), tree.deviceNode(g));
    ASSERT_TRUE(root.RemoveDevice(g));
    QCoreApplication::processEvents();
    EXPECT_EQ(model.rowCount(), 1);
    EXPECT_EQ(proxy.rowCount(), 1);
}

TEST(NodeModels, BrowserPopulatesFoldersOnDemandOnAWorker)
{
    MemoryStorage medium(2048);
    TreeVolume volume(&medium, 30, 40);
    NodeDrive drive(&volume);
    DiskBrowserModel browser(&drive);
    QSignalSpy started(&browser, &DiskBrowserModel::populationStarted);
    QSignalSpy finished(&browser, &DiskBrowserModel::populationFinished);
    NodeSortFilterModel proxy;
    proxy.setSourceModel(&browser);
    QAbstractItemModelTester t1(&browser, QAbstractItemModelTester::FailureReportingMode::Fatal);
    QAbstractItemModelTester t2(&proxy, QAbstractItemModelTester::FailureReportingMode::Fatal);

    const QModelIndex rootFolder = browser.index(0, 0);
    ASSERT_TRUE(rootFolder.isValid());
    EXPECT_TRUE(browser.hasChildren(rootFolder));
    EXPECT_EQ(browser.rowCount(rootFolder), 0);
    // The model tester may have asked for the rows already.
    if (browser.canFetchMore(rootFolder))
        browser.fetchMore(rootFolder);
    EXPECT_FALSE(browser.canFetchMore(rootFolder)); // running
    EXPECT_TRUE(browser.isPopulating(browser.nodeOf(rootFolder)));
    ASSERT_TRUE(browser.waitForPopulations());
    QStringList texts;
    for (const auto &args : started)
        texts << args[1].toString();
    EXPECT_TRUE(texts.contains("Populating \\")) << texts.join(",").toStdString();
    ASSERT_GE(finished.size(), 1);
    EXPECT_FALSE(finished[0][1].toBool());
    EXPECT_EQ(browser.rowCount(rootFolder), 31);
    EXPECT_FALSE(browser.canFetchMore(rootFolder));

    // Sub-folders one after the other, through the proxy too.
    for (int r = 0; r < 3; ++r) {
        const QModelIndex sub = browser.index(r, 0, rootFolder);
        if (browser.canFetchMore(sub))
            browser.fetchMore(sub);
    }
    ASSERT_TRUE(browser.waitForPopulations());
    EXPECT_EQ(browser.rowCount(browser.index(0, 0, rootFolder)), 40);
    EXPECT_EQ(proxy.rowCount(proxy.mapFromSource(browser.index(2, 0, rootFolder))), 40);
    auto *folder = static_cast<NodeFolder *>(browser.nodeOf(rootFolder));
    EXPECT_EQ(folder->counters().folders, 30u);
    EXPECT_EQ(folder->counters().files, 1u);

    // A forced repopulation replaces the children while the models watch.
    ASSERT_TRUE(folder->populateNow(false, true));
    EXPECT_EQ(browser.rowCount(rootFolder), 31);
    EXPECT_EQ(browser.rowCount(browser.index(0, 0, rootFolder)), 0);
}

TEST(NodePopulation, RecursiveCountsAndCancellation)
{
    MemoryStorage medium(2048);
    TreeVolume volume(&medium, 20, 50);
    NodeDrive drive(&volume);
    NodeFolderRoot *root = drive.rootFolder();
    ASSERT_NE(root, nullptr);

    // A cancelled population leaves the folder unpopulated.
    {
        Threads::NodeTagged worker(root, true);
        QSignalSpy populated(&worker, &Threads::NodeTagged::populated);
        worker.cancel();
        worker.start();
        ASSERT_TRUE(worker.wait(30000));
        QCoreApplication::processEvents();
        ASSERT_EQ(populated.size(), 1);
        EXPECT_TRUE(populated[0][1].toBool());
        EXPECT_EQ(worker.tag().state(), Threads::Tag::State::Cancelled);
        EXPECT_FALSE(root->isPopulated());
        EXPECT_EQ(root->childCount(), 0);
    }
    // Including sub-folders: every level is built, counters summed over the children.
    {
        Threads::NodeTagged worker(root, true);
        worker.start();
        ASSERT_TRUE(worker.wait(30000));
        QCoreApplication::processEvents();
        EXPECT_EQ(worker.tag().state(), Threads::Tag::State::Finished);
        EXPECT_EQ(worker.tag().text(), "Populating \\");
        EXPECT_EQ(worker.tag().depth(), 0);
        EXPECT_TRUE(root->isPopulated());
        ASSERT_EQ(root->childCount(), 21);
        EXPECT_TRUE(root->child(0)->isPopulated());
        EXPECT_EQ(root->child(0)->childCount(), 50);
        EXPECT_EQ(root->counters().folders, 20u);
        EXPECT_EQ(root->counters().files, 20u * 50u + 1u);
        EXPECT_EQ(root->counters().size, 20u * 49u * 1000u);
        // The drive is the top of this tree: locations start below it.
        EXPECT_EQ(root->child(5)->text(NodeAttr::Location), "\\ > dir5");
    }
    // Populated and unchanged: nothing is rebuilt.
    NodeCore *first = root->child(0);
    EXPECT_TRUE(root->populateNow());
    EXPECT_EQ(root->child(0), first);
    // A cancel of a forced refresh leaves it unpopulated again, so the next expansion rebuilds.
    Threads::NodeTag tag(root, false, true);
    tag.cancel();
    EXPECT_FALSE(root->populate(&tag));
    root->applyPopulation();
    EXPECT_FALSE(root->isPopulated());
    EXPECT_TRUE(root->populateNow());
    EXPECT_EQ(root->childCount(), 21);
}

TEST(NodeFilters, SwitchesPersistUnderTheirKeys)
{
    NodeSortFilterModel a;
    a.setFilter(NodeSortFilterModel::SystemDevices, false);
    a.setFilter(NodeSortFilterModel::Unallocated, false);
    a.setFilter(NodeSortFilterModel::Network, false);
    QDomDocument doc;
    QDomElement e = doc.createElement("explorer");
    doc.appendChild(e);
    a.save(e);
    QStringList keys;
    for (auto f : NodeSortFilterModel::allFilters())
        keys << NodeSortFilterModel::filterKey(f);
    EXPECT_EQ(keys,
              QStringList({"bmfMyComp", "bmfSysDvc", "bmfDevices", "bmfRemovable", "bmfNotReady",
                           "bmfVirtDvc", "bmfPartitions", "bmfUnalloc", "bmfNetwork", "bmfSysEntries"}));
    for (const QString &k : keys)
        EXPECT_TRUE(e.hasAttribute(k)) << k.toStdString();
    EXPECT_EQ(e.attribute("bmfSysDvc"), "0");
    EXPECT_EQ(e.attribute("bmfDevices"), "1");
    EXPECT_EQ(NodeSortFilterModel::filterText(NodeSortFilterModel::NotReady), "Show Not Ready Devices");

    // Round trip through text.
    QDomDocument back;
    ASSERT_TRUE(back.setContent(doc.toString()));
    NodeSortFilterModel b;
    b.load(back.documentElement());
    EXPECT_EQ(b.filters(), a.filters());
    // Keys that are missing keep their value.
    QDomElement partial = back.createElement("x");
    partial.setAttribute("bmfSysDvc", "1");
    b.load(partial);
    EXPECT_TRUE(b.filter(NodeSortFilterModel::SystemDevices));
    EXPECT_FALSE(b.filter(NodeSortFilterModel::Unallocated));
}

TEST(NodeTiming, TreeOfTenImagesBuildsQuickly)
{
    if (!haveImageTools())
        GTEST_SKIP() << "sfdisk, sgdisk, mkfs.vfat and mke2fs are needed";
    QTemporaryDir dir;
    QDir d(dir.path());
    const QString mbr = makeMbrImage(d);
    ASSERT_FALSE(mbr.isEmpty());
    QStringList copies;
    for (int i = 0; i < 10; ++i) {
        copies << d.filePath(QString("copy%1.img").arg(i));
        ASSERT_TRUE(QFile::copy(mbr, copies.last()));
    }
    CRoot root;
    QElapsedTimer withKernel;
    withKernel.start();
    for (const QString &copy : copies)
        ASSERT_NE(open(root, copy), nullptr);
    QCoreApplication::processEvents();
    QElapsedTimer timer;
    timer.start();
    NodeRoot tree(&root);
    NodeModel model(&tree);
    const int rows = countRows(model);
    const double ms = double(timer.nsecsElapsed()) / 1e6;
    std::printf("[ timing ] node tree of 10 images (%d rows): %.2f ms; with opening the images: %lld ms\n",
                rows, ms, static_cast<long long>(withKernel.elapsed()));
    EXPECT_EQ(tree.deviceNodes().size(), 10);
    EXPECT_LT(ms, 5000.0); // generous under the sanitizers; the figure is printed above
}
