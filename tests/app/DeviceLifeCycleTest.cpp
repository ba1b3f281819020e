// A disk's life under open hex editor views, on a loop device the test attaches: a device that
// leaves takes every view over it with it (the user is told, unsaved edits named as lost, nothing
// read afterwards); identified again with the same medium it keeps its device, its nodes and its
// views; a partition table written meanwhile replaces the partitions in place, closing only the
// views over the partitions that went.
#include "tests/common/LogTestUtil.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodePartition.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/Commander.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/View.h"

#include <QPointer>
#include <QTemporaryDir>
#include <QTest>
#include <gtest/gtest.h>

namespace {

constexpr qint64 DiskBytes = 8ll << 20;

struct LoopRig
{
    QTemporaryDir dir;
    std::unique_ptr<TestUtil::LoopDevice> loop;
    RecordingDialogs dialogs;
    CRoot root;
    NodeRoot nodes{&root};
    HexEditor::Commander hex;
    QList<QPointer<HexEditor::View>> views;
    CDevice *device = nullptr;

    // An MBR disk with one partition per start given (each 2048 sectors long), on a loop device.
    bool start(const QList<int> &starts)
    {
        if (!TestUtil::canAttachLoop() || !TestUtil::haveTool("sfdisk"))
            return false;
        const QString image = dir.filePath("disk.img");
        if (!TestUtil::writeFile(image, QByteArray(DiskBytes, '\0')) || !partition(image, starts))
            return false;
        loop = std::make_unique<TestUtil::LoopDevice>(image);
        if (loop->Device().isEmpty())
            return false;
        hex.setKernelRoot(&root);
        hex.setViewHost([this](HexEditor::View *v) { views.append(v); });
        device = root.AddDevice(loop->Device());
        return device && nodes.deviceNode(device);
    }
    ~LoopRig()
    {
        for (const auto &v : views)
            delete v.data();
    }
    static bool partition(const QString &target, const QList<int> &starts)
    {
        QString script = "label: dos\n";
        for (int s : starts)
            script += QString("start=%1, size=2048, type=83\n").arg(s);
        const auto r = TestUtil::run("sh", {"-c", QString("printf '%1' | sfdisk -q --no-reread '%2'")
                                                      .arg(script.replace("\n", "\\n"), target)});
        return r.exitCode == 0;
    }
    NodeDevice *deviceNode() const { return nodes.deviceNode(device); }
    NodeCore *partitionNode(int row) const { return deviceNode() ? deviceNode()->child(row) : nullptr; }
    // Identifies the device again on the enumeration thread and delivers what it announced.
    void refreshDevice()
    {
        ASSERT_TRUE(root.RequestDeviceRefresh(device));
        ASSERT_TRUE(root.WaitForEnumeration(60000));
        QCoreApplication::processEvents();
        QCoreApplication::sendPostedEvents(nullptr, QEvent::DeferredDelete);
    }
};

int firstDataRow(NodeCore *device)
{
    for (int i = 0; device && i < device->childCount(); ++i)
        if (auto *p = dynamic_cast<NodePartition *>(device->child(i)); p && !p->isUnallocated())
            return i;
    return -1;
}

} // namespace

TEST(DeviceLifeCycle, ViewsOverALeavingDiskLetGoAndCloseWithAMessage)
{
    LoopRig rig;
    if (!rig.start({2048}))
        GTEST_SKIP() << "attaching loop devices needs root, /dev/loop-control and sfdisk";
    const int row = firstDataRow(rig.deviceNode());
    ASSERT_GE(row, 0);
    QPointer<HexEditor::View> disk = rig.hex.open(rig.deviceNode());
    QPointer<HexEditor::View> part = rig.hex.open(rig.partitionNode(row));
    ASSERT_TRUE(disk && part);
    disk->editor()->setEditable(true);
    disk->storage()->write(0, QByteArray("\x33", 1));
    ASSERT_TRUE(disk->storage()->isModified());
    disk->show();

    LogWatch log;
    ASSERT_TRUE(rig.loop->detach());
    rig.refreshDevice();
    // The removal was delivered and the device destroyed; the views hold nothing of it and are gone.
    EXPECT_EQ(rig.nodes.deviceNodes().size(), 0);
    EXPECT_TRUE(disk.isNull());
    EXPECT_TRUE(part.isNull());

    bool lostNamed = false;
    for (const RecordedDialog &d : rig.dialogs.calls)
        lostNamed = lostNamed || (d.text.contains("was removed") && d.text.contains("Unsaved changes were lost"));
    EXPECT_TRUE(lostNamed) << "the unsaved edit of the disk view is named as lost";
    int removedLines = 0;
    for (const QString &line : log.texts())
        removedLines += line.contains("was removed; its hex editor view is closed.") ? 1 : 0;
    EXPECT_EQ(removedLines, 2) << log.texts().join("\n").toStdString();
}

TEST(DeviceLifeCycle, SameMediumKeepsTheDeviceAndANewTableReplacesOnlyThePartitions)
{
    LoopRig rig;
    if (!rig.start({2048}))
        GTEST_SKIP() << "attaching loop devices needs root, /dev/loop-control and sfdisk";
    const int row = firstDataRow(rig.deviceNode());
    ASSERT_GE(row, 0);
    NodeDevice *deviceNode = rig.deviceNode();
    NodeCore *partNode = rig.partitionNode(row);
    const QString partKey = partNode->text(NodeAttr::Key);
    QPointer<HexEditor::View> disk = rig.hex.open(deviceNode);
    QPointer<HexEditor::View> part = rig.hex.open(partNode);
    ASSERT_TRUE(disk && part);

    // Nothing changed: the device, its nodes and both views stay as they are.
    rig.refreshDevice();
    ASSERT_EQ(rig.root.Devices().size(), 1);
    EXPECT_EQ(rig.root.Devices().first(), rig.device);
    EXPECT_EQ(rig.deviceNode(), deviceNode);
    EXPECT_EQ(rig.partitionNode(row), partNode);
    EXPECT_TRUE(disk && part);

    // A table written behind the program's back: the old partition goes with its view, the disk's
    // view stays, and the partition that starts where the old one did keeps its key.
    ASSERT_TRUE(LoopRig::partition(rig.loop->Device(), {2048, 8192}));
    rig.refreshDevice();
    ASSERT_EQ(rig.root.Devices().size(), 1);
    EXPECT_EQ(rig.root.Devices().first(), rig.device);
    EXPECT_EQ(rig.deviceNode(), deviceNode);
    EXPECT_TRUE(disk);
    EXPECT_TRUE(part.isNull());
    int data = 0;
    bool keyKept = false;
    for (NodeCore *c : deviceNode->children())
        if (auto *p = dynamic_cast<NodePartition *>(c); p && !p->isUnallocated()) {
            ++data;
            keyKept = keyKept || p->text(NodeAttr::Key) == partKey;
        }
    EXPECT_EQ(data, 2);
    EXPECT_TRUE(keyKept);
    // The disk's view still reads the medium.
    ASSERT_NE(disk->storage(), nullptr);
    EXPECT_EQ(disk->storage()->read({510, 2}), QByteArray("\x55\xAA", 2));
}
