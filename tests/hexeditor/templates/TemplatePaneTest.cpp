// The template model and pane over a storage held in memory, wired to a real editor control: field
// trees, editing through the editor's undo stack, links, stepping and the chooser.
#include <gtest/gtest.h>

#include <QAction>
#include <QApplication>
#include <QClipboard>
#include <QHeaderView>
#include <QSignalSpy>
#include <QTest>
#include <QTreeView>

#include "Kernel/Implementation/Partitions/PartScanMemory.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/templates/Delegate.h"
#include "hexeditor/templates/GptModel.h"
#include "hexeditor/templates/MbrModel.h"
#include "hexeditor/templates/OffsetEditCtrl.h"
#include "hexeditor/templates/TemplateTreeCtrl.h"
#include "hexeditor/templates/View.h"
#include "hexeditor/templates/core/Values.h"

namespace {

namespace T = HexEditor::Templates;

void putLe(QByteArray &b, int offset, std::uint64_t v, int size)
{
    for (int i = 0; i < size; ++i)
        b[offset + i] = char(v >> (8 * i) & 0xFF);
}

// A 4 MiB disk whose boot record has one NTFS-typed entry (2, at sector 2048, 4096 sectors) and a
// GPT header with one named entry.
QByteArray diskHead()
{
    QByteArray head(64 * 1024, '\0');
    const int e = 446 + 16;
    head[e] = char(0x80);
    head[e + 4] = char(0x07);
    putLe(head, e + 8, 2048, 4);
    putLe(head, e + 12, 4096, 4);
    head[510] = char(0x55);
    head[511] = char(0xAA);
    head.replace(512, 8, "EFI PART");
    putLe(head, 512 + 12, 92, 4);
    putLe(head, 512 + 24, 1, 8);
    putLe(head, 512 + 32, 8191, 8);
    putLe(head, 512 + 72, 2, 8);
    putLe(head, 512 + 80, 128, 4);
    putLe(head, 512 + 84, 128, 4);
    const int g = 1024;
    head.replace(g, 16, QByteArray::fromHex("A2A0D0EBE5B9334487C068B6B72699C7")); // basic data
    head.replace(g + 16, 16, QByteArray(16, '\x11'));
    putLe(head, g + 32, 2048, 8);
    putLe(head, g + 40, 6143, 8);
    const QString name = "data";
    for (int i = 0; i < name.size(); ++i)
        head[g + 56 + 2 * i] = name[i].toLatin1();
    return head;
}

class TemplatePane : public ::testing::Test
{
protected:
    void SetUp() override
    {
        memory = std::make_unique<PartScan::MemoryStorage>(512, 8192, diskHead());
        storage = std::make_unique<HexEditor::Storage>(memory.get());
    }
    std::unique_ptr<PartScan::MemoryStorage> memory;
    std::unique_ptr<HexEditor::Storage> storage;
};

QModelIndex child(const QAbstractItemModel &m, const QModelIndex &parent, const QString &name, int column = 0)
{
    for (int r = 0; r < m.rowCount(parent); ++r)
        if (m.index(r, 0, parent).data().toString() == name)
            return m.index(r, column, parent);
    ADD_FAILURE() << "no row " << name.toStdString();
    return {};
}

TEST_F(TemplatePane, MbrTreeNamesAndExpandsOnlyUsedEntries)
{
    T::MbrModel model(storage.get());
    model.setTemplateOffset(0, true);
    ASSERT_EQ(model.rowCount(), 8);
    EXPECT_EQ(model.columnCount(), 3);
    EXPECT_EQ(model.headerData(2, Qt::Horizontal).toString(), "Value");
    EXPECT_EQ(model.index(3, 0).data().toString(), "Partition 1 (Unused)");
    EXPECT_TRUE(model.index(4, 0).data().toString().startsWith("Partition 2 (NTFS, 2.00 MB"))
        << model.index(4, 0).data().toString().toStdString();
    EXPECT_EQ(model.index(5, 0).data().toString(), "Partition 3 (Unused)");
    EXPECT_EQ(model.index(6, 0).data().toString(), "Partition 4 (Unused)");
    EXPECT_EQ(model.expandRows(), (QList<QPair<int, int>>{{4, 0}}));
    const QModelIndex entry = model.index(4, 0);
    EXPECT_EQ(model.index(0, 2, entry).data().toString(), "0x80");
    EXPECT_EQ(model.index(0, 1, entry).data().toString(), "1CE");
    EXPECT_EQ(model.index(0, 1, entry).data(Qt::TextAlignmentRole).value<Qt::Alignment>(),
              Qt::AlignRight | Qt::AlignVCenter);
    const QModelIndex first = child(model, entry, "First sector", 2);
    EXPECT_EQ(first.data().toString(),
              "2,048" == first.data().toString() ? "2,048" : QLocale().toString(2048));
    EXPECT_EQ(first.data(Qt::ToolTipRole).toString(), "Use CTRL + Click to follow the link");
    EXPECT_TRUE(first.data(Qt::FontRole).value<QFont>().underline());
    EXPECT_EQ(first.data(T::Model::CursorRole).toInt(), int(Qt::PointingHandCursor));
    EXPECT_EQ(T::Model::nodeOf(first)->linkOffset, 2048u * 512);
    EXPECT_TRUE(model.index(4, 0).data(Qt::FontRole).value<QFont>().bold());
    EXPECT_EQ(model.index(7, 2).data().toString(), "55 AA");
    // A record beyond the storage gives an empty tree.
    model.setTemplateOffset(8192ull * 512 - 100, true);
    EXPECT_EQ(model.rowCount(), 0);
}

TEST_F(TemplatePane, HexOffsetSwitchRedrawsOnlyTheOffsetColumn)
{
    T::MbrModel model(storage.get());
    model.setTemplateOffset(0, true);
    QSignalSpy changed(&model, &QAbstractItemModel::dataChanged);
    model.setHexOffsets(false);
    ASSERT_GE(changed.size(), 1);
    for (const auto &args : changed) {
        EXPECT_EQ(args[0].toModelIndex().column(), 1);
        EXPECT_EQ(args[1].toModelIndex().column(), 1);
    }
    EXPECT_EQ(model.index(0, 1, model.index(4, 0)).data().toString(), "462");
}

TEST_F(TemplatePane, SetDataWritesExactlyTheFieldAndNothingWhenUnchanged)
{
    T::GptModel model(storage.get());
    model.setTemplateOffset(512, true);
    model.setEditable(true);
    QSignalSpy modified(&model, &T::Model::templateModified);
    const QModelIndex entry = model.index(1, 0);
    EXPECT_EQ(entry.data().toString().left(9), "Entry 1 (");
    const QModelIndex name = child(model, entry, "Partition name", 2);
    EXPECT_EQ(name.data().toString(), "data");
    EXPECT_TRUE(name.flags() & Qt::ItemIsEditable);
    EXPECT_FALSE(child(model, entry, "Partition type GUID", 2).flags() & Qt::ItemIsEditable);
    EXPECT_EQ(child(model, entry, "Partition type GUID", 2).data().toString(), "Basic Data Partition");
    // The same bytes: nothing.
    EXPECT_FALSE(T::Delegate::commitText(&model, name, "data"));
    EXPECT_EQ(modified.size(), 0);
    // A size that is not the field's: nothing.
    EXPECT_FALSE(model.setData(name, QByteArray("x"), Qt::EditRole));
    ASSERT_TRUE(T::Delegate::commitText(&model, name, "boot"));
    ASSERT_EQ(modified.size(), 1);
    const QVariantList changes = modified[0][0].toList();
    ASSERT_EQ(changes.size(), 2);
    EXPECT_EQ(changes[0].toULongLong(), 512u + 512 + 56);
    EXPECT_EQ(changes[1].toByteArray().size(), 72);
    EXPECT_EQ(changes[1].toByteArray().left(8), QByteArray("b\0o\0o\0t\0", 8));
    // Refused texts change nothing.
    EXPECT_FALSE(T::Delegate::commitText(&model, child(model, entry, "First LBA", 2), "-5"));
    EXPECT_FALSE(T::Delegate::commitText(&model, child(model, entry, "Attribute flags", 2), "0102"));
    EXPECT_EQ(modified.size(), 1);
}

TEST_F(TemplatePane, EditThroughThePaneGoesThroughTheUndoStack)
{
    HexEditor::EditorCtrl editor(storage.get(), false);
    T::View pane(&editor, storage.get());
    pane.selector()->selectTemplate(T::MasterBootRecord);
    pane.onTemplateOffsetChanged(0, true);
    T::Model *model = pane.currentModel();
    ASSERT_TRUE(model);
    ASSERT_EQ(model->type(), T::MasterBootRecord);
    ASSERT_TRUE(model->editable());
    const QByteArray before = storage->read(HexEditor::DiskArea{0, 512});
    const QModelIndex total = child(*model, model->index(4, 0), "Total sectors", 2);
    ASSERT_TRUE(T::Delegate::commitText(model, total, "0x2000"));
    QCoreApplication::processEvents();
    const QByteArray after = storage->read(HexEditor::DiskArea{0, 512});
    QByteArray expected = before;
    putLe(expected, 446 + 16 + 12, 0x2000, 4);
    EXPECT_EQ(after, expected); // exactly the field's four bytes
    EXPECT_TRUE(editor.canUndo());
    // The tree was rebuilt from the edited bytes.
    EXPECT_EQ(
        child(*pane.currentModel(), pane.currentModel()->index(4, 0), "Total sectors", 2).data().toString(),
        QLocale().toString(qulonglong(8192)));
    editor.undo();
    QCoreApplication::processEvents();
    EXPECT_EQ(storage->read(HexEditor::DiskArea{0, 512}), before);
    EXPECT_EQ(
        child(*pane.currentModel(), pane.currentModel()->index(4, 0), "Total sectors", 2).data().toString(),
        QLocale().toString(qulonglong(4096)));
}

TEST_F(TemplatePane, CtrlClickOnALinkMovesTheCaretOrSwitchesTheTemplate)
{
    HexEditor::EditorCtrl editor(storage.get(), true);
    T::View pane(&editor, storage.get());
    pane.resize(800, 600);
    pane.show();
    pane.selector()->selectTemplate(T::MasterBootRecord);
    pane.onTemplateOffsetChanged(0, true);
    T::Model *model = pane.currentModel();
    QTreeView *tree = pane.tree();
    const QModelIndex first = child(*model, model->index(4, 0), "First sector", 2);
    tree->scrollTo(first);
    QSignalSpy activated(&pane, &T::View::nodeActivated);
    // Without Ctrl nothing follows.
    QTest::mouseClick(tree->viewport(), Qt::LeftButton, Qt::NoModifier, tree->visualRect(first).center());
    EXPECT_EQ(activated.size(), 0);
    QTest::mouseClick(tree->viewport(), Qt::LeftButton, Qt::ControlModifier,
                      tree->visualRect(first).center());
    ASSERT_EQ(activated.size(), 1);
    EXPECT_EQ(activated[0][0].toULongLong(), 2048u * 512);
    EXPECT_EQ(editor.caret().offset(), 2048u * 512);

    // The GPT header's "Current LBA" leads to the GUID partition table template there.
    pane.selector()->selectTemplate(T::GuidPartitionTable);
    pane.onTemplateOffsetChanged(512, true);
    model = pane.currentModel();
    const QModelIndex header = model->index(0, 0);
    tree->expand(header);
    const QModelIndex lba = child(*model, header, "Current LBA", 2);
    tree->scrollTo(lba);
    QTest::mouseClick(tree->viewport(), Qt::LeftButton, Qt::ControlModifier, tree->visualRect(lba).center());
    EXPECT_EQ(pane.currentModel()->type(), T::GuidPartitionTable);
    EXPECT_EQ(pane.currentModel()->primaryOffset(), 512u);
    EXPECT_EQ(pane.offsetEdit(true)->offset(), 512u);
    EXPECT_EQ(editor.caret().offset(), 512u);
    // The NTFS-typed entry names the NTFS boot sector; with no such template in the chooser the
    // Ctrl+click above was a plain move of the caret.
    pane.selector()->selectTemplate(T::MasterBootRecord);
    pane.onTemplateOffsetChanged(0, true);
    EXPECT_EQ(
        T::Model::nodeOf(child(*pane.currentModel(), pane.currentModel()->index(4, 0), "First sector", 2))
            ->linkTemplate,
        T::NtfsBootSector);
}

TEST_F(TemplatePane, SteppingAndPlacingAtTheCaret)
{
    HexEditor::EditorCtrl editor(storage.get(), true);
    T::View pane(&editor, storage.get());
    pane.selector()->selectTemplate(T::LdmVblkBlock);
    QSignalSpy moved(&pane, &T::View::templateOffsetChanged);
    pane.onTemplateOffsetChanged(0, true);
    EXPECT_FALSE(pane.action(T::View::MoveUp)->isEnabled());
    EXPECT_TRUE(pane.action(T::View::MoveDown)->isEnabled());
    pane.action(T::View::MoveDown)->trigger();
    EXPECT_EQ(pane.currentModel()->primaryOffset(), 128u);
    EXPECT_TRUE(pane.action(T::View::MoveUp)->isEnabled());
    // Every kind moves together.
    for (const auto &t : pane.selector()->templates()) {
        if (t.model->isTemplate()) {
            EXPECT_EQ(t.model->primaryOffset(), 128u);
        }
    }
    // The last record that fits: no step down beyond it.
    const std::uint64_t size = storage->size();
    pane.onTemplateOffsetChanged(size - 256, true);
    EXPECT_TRUE(pane.action(T::View::MoveDown)->isEnabled());
    pane.onTemplateOffsetChanged(size - 255, true);
    EXPECT_FALSE(pane.action(T::View::MoveDown)->isEnabled());
    editor.setCaretOffset(4096 + 7);
    pane.action(T::View::SetPrimary)->trigger();
    EXPECT_EQ(pane.currentModel()->primaryOffset(), 4096u + 7);
    EXPECT_EQ(moved.last()[0].toULongLong(), 4096u + 7);
    EXPECT_TRUE(moved.last()[1].toBool());
    // The copy offset only for kinds with a copy column.
    EXPECT_FALSE(pane.action(T::View::SetCopy)->isEnabled());
    pane.selector()->selectTemplate(T::LdmPrivateHeader);
    EXPECT_TRUE(pane.action(T::View::SetCopy)->isEnabled());
    EXPECT_EQ(pane.currentModel()->columnCount(), 4);
    editor.setCaretOffset(1024);
    pane.action(T::View::SetCopy)->trigger();
    EXPECT_EQ(pane.currentModel()->copyOffset(), 1024u);
    EXPECT_EQ(pane.currentModel()->primaryOffset(), 4096u + 7);
    EXPECT_FALSE(moved.last()[1].toBool());
}

TEST_F(TemplatePane, ChooserListsWhatWorksAndCopiesFieldsAsText)
{
    T::View pane(nullptr, storage.get());
    QStringList names;
    for (const auto &t : pane.selector()->templates())
        names.append(t.name);
    EXPECT_EQ(names.first(), "No template");
    EXPECT_TRUE(names.contains("GUID Partition Table"));
    EXPECT_FALSE(names.contains("NTFS Boot Sector"));
    EXPECT_FALSE(pane.selector()->selectTemplate(T::NtfsBootSector)); // no entry: nothing changes
    ASSERT_TRUE(pane.selector()->selectTemplate(T::MasterBootRecord));
    pane.onTemplateOffsetChanged(0, true);
    EXPECT_EQ(pane.selector()->currentText(), "Master Boot Record");
    const QString all = pane.fieldText(nullptr);
    const QStringList lines = all.split('\n');
    EXPECT_EQ(lines[0], "Master Boot Record");
    EXPECT_EQ(lines[2], QString("    Disk serial number (1B8)").leftJustified(60, '.') + "00 00 00 00");
    EXPECT_TRUE(lines.contains("    Partition 1 (Unused) (1BE)"));
    EXPECT_TRUE(lines.contains(QString("        Start head (1BF)").leftJustified(60, '.') + "0"));
    const T::Node *sig = T::Model::nodeOf(pane.currentModel()->index(7, 0));
    EXPECT_EQ(pane.fieldText(sig), QString("Signature (55 AA) (1FE)").leftJustified(60, '.') + "55 AA");
    pane.tree()->setCurrentIndex(pane.currentModel()->index(7, 0));
    pane.action(T::View::CopyValue)->trigger();
    EXPECT_EQ(QApplication::clipboard()->text(), "55 AA");
}

TEST_F(TemplatePane, AutoloadOffShowsNoTemplateAtZero)
{
    T::View pane(nullptr, nullptr);
    pane.setAutoload(false);
    pane.setStorage(storage.get());
    EXPECT_EQ(pane.selector()->current().id, T::None);
    EXPECT_EQ(pane.offsetEdit(true)->offset(), 0u);
    EXPECT_EQ(pane.offsetEdit(false)->offset(), 0u);
    EXPECT_FALSE(pane.action(T::View::MoveDown)->isEnabled());
    // Without a storage only "No template" is offered.
    T::View empty(nullptr, nullptr);
    EXPECT_EQ(empty.selector()->templates().size(), 1);
}

TEST_F(TemplatePane, SelectedFieldIsOutlinedAndColouringFollowsTheToggle)
{
    HexEditor::EditorCtrl editor(storage.get(), true);
    T::View pane(&editor, storage.get());
    pane.selector()->selectTemplate(T::MasterBootRecord);
    pane.onTemplateOffsetChanged(0, true);
    const QModelIndex serial = pane.currentModel()->index(1, 2);
    pane.tree()->setCurrentIndex(serial);
    EXPECT_EQ(editor.templateOutline(), (HexEditor::DiskArea{440, 4}));
    EXPECT_TRUE(editor.templateColoringEnabled());
    pane.action(T::View::Coloring)->trigger();
    EXPECT_FALSE(editor.templateColoringEnabled());
    // A field clicked in the hex view selects its row.
    pane.selectField(int(T::Model::nodeOf(pane.currentModel()->index(7, 0))->id));
    EXPECT_EQ(pane.tree()->currentIndex().row(), 7);
}

} // namespace
