// The command line's requests carried out over the kernel, the node tree and the hex editor: a
// mounted image found by its number or path, a volume by its start offset, a plain file, each
// opened in a view with the caret at the offset and the template requested where asked.
#include "app/CliArguments.h"
#include "app/KernelHost.h"
#include "app/ProcessingAction.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/Commander.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/View.h"

#include <QSignalSpy>
#include <QTemporaryDir>
#include <gtest/gtest.h>

#include <memory>

namespace {

constexpr uint64_t DiskBytes = 8ull << 20;
constexpr uint64_t PartStart = 2048;
constexpr uint64_t PartSectors = 8192;

QString makeDisk(const QTemporaryDir &dir)
{
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("mkfs.fat"))
        return {};
    const QString disk = dir.filePath("cmdline.img");
    const QString part = dir.filePath("part.img");
    if (!TestUtil::writeFile(disk, QByteArray(DiskBytes, '\0')) ||
        !TestUtil::writeFile(part, QByteArray(PartSectors * 512, '\0')))
        return {};
    const auto r = TestUtil::run("sh", {"-c", QString("echo 'start=%1, size=%2, type=6' | sfdisk -q '%3'")
                                                  .arg(PartStart)
                                                  .arg(PartSectors)
                                                  .arg(disk)});
    if (r.exitCode != 0 || TestUtil::run("mkfs.fat", {"-F", "16", "-s", "1", part}).exitCode != 0 ||
        TestUtil::run("dd", {"if=" + part, "of=" + disk, "bs=512", QString("seek=%1").arg(PartStart),
                             "conv=notrunc", "status=none"})
                .exitCode != 0)
        return {};
    return disk;
}

struct CommandLineRig
{
    QTemporaryDir dir;
    QString image;
    CRoot root;
    CLI::KernelHost host{root};
    HexEditor::Commander hex;
    QList<HexEditor::View *> views;
    QList<int> templates;
    QList<quint64> templateOffsets;

    bool start()
    {
        image = makeDisk(dir);
        if (image.isEmpty() || !host.mountImage(image))
            return false;
        hex.setKernelRoot(&root);
        hex.setViewHost([this](HexEditor::View *v) { views.append(v); });
        QObject::connect(&hex, &HexEditor::Commander::viewOpened, &hex, [this](HexEditor::View *v) {
            QObject::connect(v->editor(), &HexEditor::EditorCtrl::templateRequest, v,
                             [this](int type) { templates.append(type); });
            QObject::connect(v->editor(), &HexEditor::EditorCtrl::templateOffsetChanged, v,
                             [this](quint64 offset, bool) { templateOffsets.append(offset); });
        });
        host.setHexEditor(&hex);
        return true;
    }
    ~CommandLineRig() { qDeleteAll(views); }

    int run(const QStringList &args)
    {
        CLI::Arguments arguments(QStringList{"brindle"} + args);
        CLI::ProcessingAction action(host);
        action.run();
        return int(action.resultCode());
    }
};

} // namespace

TEST(HexEditorCommandLine, MountedImageIsListedAsAVirtualDiskWithItsPath)
{
    CommandLineRig s;
    if (!s.start())
        GTEST_SKIP() << "sfdisk/mkfs.fat missing or the image could not be mounted";
    const QList<CLI::ContextDevice> devices = s.host.devices();
    int virtualDisks = 0;
    const CLI::ContextDevice *image = nullptr;
    for (const CLI::ContextDevice &d : devices) {
        ASSERT_NE(d.node, nullptr);
        if (d.prefix == 3)
            ++virtualDisks;
        if (d.imagePath == s.image)
            image = &d;
    }
    ASSERT_NE(image, nullptr) << "the mounted image is among the devices after enumeration";
    EXPECT_EQ(image->prefix, 3);
    auto *node = dynamic_cast<NodeDevice *>(image->node);
    ASSERT_NE(node, nullptr);
    EXPECT_EQ(node->device()->GetSize(), DiskBytes);

    // The partition's start offset finds its volume; an offset where no partition starts finds nothing.
    NodeCore *volume = s.host.volumeAt(image->node, PartStart * 512);
    ASSERT_NE(volume, nullptr);
    EXPECT_TRUE(volume->kind() == NodeKind::Drive || volume->kind() == NodeKind::Partition);
    EXPECT_EQ(s.host.volumeAt(image->node, 512), nullptr);
    EXPECT_EQ(s.host.volumeAt(nullptr, 0), nullptr);
}

TEST(HexEditorCommandLine, DiskNumberAndOffsetOpenTheImageAtTheOffset)
{
    CommandLineRig s;
    if (!s.start())
        GTEST_SKIP() << "sfdisk/mkfs.fat missing or the image could not be mounted";
    // The mounted image is the only virtual disk this test made; find its number among prefix 3.
    int number = -1, n = 0;
    for (const CLI::ContextDevice &d : s.host.devices())
        if (d.prefix == 3) {
            if (d.imagePath == s.image)
                number = n;
            ++n;
        }
    ASSERT_GE(number, 0);
    EXPECT_EQ(s.run({QString("-disk=%1").arg(number), "-diskprefix=3", "-offset=1536", "-template=1",
                     "-templateoffset=0"}),
              CLI::ProcessingAction::Success);
    ASSERT_EQ(s.views.size(), 1);
    HexEditor::View *view = s.views[0];
    EXPECT_EQ(view->storage()->size(), DiskBytes);
    EXPECT_EQ(view->editor()->caretOffset(), 1536u);
    EXPECT_TRUE(view->editor()->isReadOnly()) << "the command line opens read-only";
    EXPECT_EQ(s.templates, QList<int>{1});
    EXPECT_EQ(s.templateOffsets, QList<quint64>{0});
}

TEST(HexEditorCommandLine, ImagePathAndVolumeOffsetOpenThePartition)
{
    CommandLineRig s;
    if (!s.start())
        GTEST_SKIP() << "sfdisk/mkfs.fat missing or the image could not be mounted";
    EXPECT_EQ(s.run({"-mountdi=" + s.image, QString("-volumeoffset=%1").arg(PartStart * 512), "-offset=54"}),
              CLI::ProcessingAction::Success);
    ASSERT_EQ(s.views.size(), 1);
    HexEditor::View *view = s.views[0];
    EXPECT_EQ(view->storage()->size(), PartSectors * 512);
    EXPECT_EQ(view->storage()->read({54, 5}), "FAT16");
    EXPECT_EQ(view->editor()->caretOffset(), 54u);
    EXPECT_TRUE(s.templates.isEmpty()) << "automatic: the template pane chooses";
}

TEST(HexEditorCommandLine, FileOptionOpensAPlainFile)
{
    CommandLineRig s;
    if (!s.start())
        GTEST_SKIP() << "sfdisk/mkfs.fat missing or the image could not be mounted";
    const QString file = s.dir.filePath("data.bin");
    QByteArray bytes(5000, 'x');
    bytes.replace(4000, 4, "MARK");
    ASSERT_TRUE(TestUtil::writeFile(file, bytes));
    EXPECT_EQ(s.run({"-file=" + file, "-offset=4000"}), CLI::ProcessingAction::Success);
    ASSERT_EQ(s.views.size(), 1);
    EXPECT_EQ(s.views[0]->node() == nullptr || s.views[0]->node()->kind() == NodeKind::Other, true);
    EXPECT_EQ(s.views[0]->storage()->size(), 5000u);
    EXPECT_EQ(s.views[0]->editor()->caretOffset(), 4000u);
    EXPECT_EQ(s.views[0]->storage()->read({4000, 4}), "MARK");

    RecordingDialogs dialogs;
    EXPECT_EQ(s.run({"-file=" + s.dir.filePath("missing.bin")}), CLI::ProcessingAction::Failed);
    EXPECT_EQ(s.views.size(), 1);
}
