// The template pane next to the editor control over disks made with sfdisk and sgdisk, rendered to
// PNG files when BRINDLE_SCREENSHOT_DIR names a folder (run under a display to look at them).
#include <gtest/gtest.h>

#include <QDir>
#include <QFile>
#include <QSplitter>
#include <QTemporaryDir>
#include <QTest>

#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/TemplateTreeCtrl.h"
#include "hexeditor/templates/View.h"
#include "tests/common/TestUtil.h"

namespace {

namespace T = HexEditor::Templates;

struct Disk
{
    QString tool;
    QStringList args;
    int type;
    std::uint64_t offset;
    QString file;
};

TEST(TemplatePaneLook, MbrAndGptDisksWithColouring)
{
    const QString out = qEnvironmentVariable("BRINDLE_SCREENSHOT_DIR");
    if (out.isEmpty())
        GTEST_SKIP() << "set BRINDLE_SCREENSHOT_DIR to render the pane";
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "sfdisk or sgdisk is not installed";
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    const Disk disks[] = {
        {"sh",
         {"-c",
          QStringLiteral(
              "printf 'label: dos\\nstart=2048, size=8192, type=83, bootable\\nstart=10240, type=7\\n' | "
              "sfdisk '%1'")
              .arg(image)},
         T::MasterBootRecord,
         0,
         "templates-mbr.png"},
        {"sgdisk",
         {"-n1:2048:+8M", "-t1:EF00", "-c1:EFI system", "-n2:0:+16M", "-t2:0700", "-c2:Data", image},
         T::GuidPartitionTable,
         512,
         "templates-gpt.png"},
    };
    for (const Disk &d : disks) {
        QFile::remove(image);
        QFile f(image);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly));
        ASSERT_TRUE(f.resize(32 << 20));
        f.close();
        ASSERT_EQ(TestUtil::run(d.tool, d.args).exitCode, 0);
        const QByteArray bytes = TestUtil::readFile(image);
        PartScan::MemoryStorage memory(512, 65536, bytes.left(1 << 20));
        HexEditor::Storage storage(&memory);
        QSplitter window;
        auto *editor = new HexEditor::EditorCtrl(&storage, false, &window);
        auto *pane = new T::View(editor, &storage, &window);
        window.addWidget(editor);
        window.addWidget(pane);
        window.resize(1400, 800);
        window.setSizes({800, 600});
        window.show();
        pane->selector()->selectTemplate(d.type);
        pane->onTemplateOffsetChanged(d.offset, true);
        T::Model *model = pane->currentModel();
        // Select a field so its outline shows.
        pane->tree()->setCurrentIndex(model->index(d.type == T::MasterBootRecord ? 1 : 0, 2));
        editor->setCaretOffset(d.offset + 446);
        QTest::qWait(200);
        ASSERT_TRUE(window.grab().save(QDir(out).filePath(d.file)));
    }
}

} // namespace
