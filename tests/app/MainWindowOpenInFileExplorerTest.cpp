// "Open in File Explorer" on a volume the system has mounted: a loop device over an ext4 image,
// mounted in a scratch folder, listed by the kernel with this machine's disks; the command opens
// the mount folder. Needs root (loop devices and mount); skipped otherwise.
#include "app/Commander.h"
#include "app/MainView.h"
#include "app/NodeCommands.h"

#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Views/DiskExplorerView.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WindowManager.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include <QAction>
#include <QDir>
#include <QTemporaryDir>
#include <QTest>
#include <QUrl>
#include <gtest/gtest.h>

namespace {

// Unmounts the folder when the test ends, however it ends.
class MountGuard
{
public:
    MountGuard(const QString &device, const QString &folder) : m_folder(folder)
    {
        m_mounted = TestUtil::run("mount", {device, folder}).exitCode == 0;
    }
    ~MountGuard()
    {
        if (m_mounted)
            TestUtil::run("umount", {m_folder});
    }
    MountGuard(const MountGuard &) = delete;
    MountGuard &operator=(const MountGuard &) = delete;
    bool mounted() const { return m_mounted; }

private:
    QString m_folder;
    bool m_mounted = false;
};

QString platformPath(NodeDevice *node)
{
    CDevice *d = node ? node->device() : nullptr;
    CPlatformFile *h = d ? d->GetHandle() : nullptr;
    return h ? h->GetName() : QString();
}

} // namespace

TEST(MainWindowOpenInFileExplorer, OpensTheFolderAVolumeIsMountedAt)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "attaching loop devices needs root and /dev/loop-control";
    if (!TestUtil::haveTool("mkfs.ext4") || !TestUtil::haveTool("mount"))
        GTEST_SKIP() << "needs mkfs.ext4 and mount";
    QTemporaryDir dir;
    const QString image = dir.filePath("volume.ext4");
    ASSERT_EQ(TestUtil::run("mkfs.ext4", {"-q", "-F", image, "8M"}).exitCode, 0);
    TestUtil::LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    const QString folder = dir.filePath("mnt");
    ASSERT_TRUE(QDir().mkpath(folder));
    MountGuard mount(loop.Device(), folder);
    if (!mount.mounted())
        GTEST_SKIP() << "this system does not mount ext4 here";

    ScratchHome home;
    RecordingDialogs dialogs;
    Framework::ScriptedPrompts prompts;
    CRoot root;
    Solution::Commander commander;
    Solution::MainView view(&commander);
    view.setKernel(&root);
    view.build();
    view.load(QDomElement());
    view.windowManager()->openView(Framework::DiskExplorerView::ViewId);
    auto *explorer = qobject_cast<Framework::DiskExplorerView *>(view.windowManager()->view("explorer"));
    ASSERT_NE(explorer, nullptr);
    ASSERT_TRUE(root.RefreshAndWait(false, RefreshKinds(), 30000));

    NodeDevice *device = nullptr;
    ASSERT_TRUE(QTest::qWaitFor(
        [&] {
            for (NodeDevice *d : view.nodeRoot()->deviceNodes())
                if (platformPath(d) == loop.Device())
                    device = d;
            return device != nullptr && device->childCount() > 0;
        },
        10000))
        << "the kernel did not list " << loop.Device().toStdString();

    // The device is one volume as a whole: its volume node opens the mount folder.
    NodeCore *volume = nullptr;
    std::function<void(NodeCore *)> find = [&](NodeCore *n) {
        if (!volume && n->kind() == NodeKind::Drive)
            volume = n;
        for (NodeCore *c : n->children())
            find(c);
    };
    find(device);
    ASSERT_NE(volume, nullptr);
    const QString expected = QFileInfo(folder).absoluteFilePath();
    EXPECT_EQ(Solution::NodeCommands::osBrowserPath(volume), expected);
    ASSERT_TRUE(explorer->selectNode(volume));
    QAction *open = commander.action("cmdOpenInOSBrowser");
    ASSERT_TRUE(open->isEnabled());
    open->trigger();
    EXPECT_EQ(prompts.urls, QStringList({QUrl::fromLocalFile(expected).toString()}));

    // The disk itself is no image file: nothing to open for it.
    ASSERT_TRUE(explorer->selectNode(device));
    EXPECT_FALSE(open->isEnabled());
}
