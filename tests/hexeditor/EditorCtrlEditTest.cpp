#include <QDomDocument>

#include "hexeditor/FillBlockDlg.h"
#include "tests/hexeditor/EditorCtrlFixture.h"

#include <QDialogButtonBox>
#include <QLabel>
#include <QLineEdit>
#include <QPushButton>

using HexEditor::DiskArea;
using HexEditor::EditorCtrl;
using HexEditor::FillBlockDlg;
using HexEditor::Metrics;

using EditorCtrlEdit = EditorCtrlFixture;

TEST_F(EditorCtrlEdit, HexDigitsReplaceTheCaretsNibble)
{
    poke(0x100, QByteArray::fromHex("1212"));
    QSignalSpy changed(ctrl.get(), &EditorCtrl::dataChanged);
    ctrl->setCaretOffset(0x100);
    type("A");
    EXPECT_EQ(byteAt(0x100), 0xA2);
    EXPECT_EQ(ctrl->caret().nibble, 1); // the caret moved right
    ctrl->setCaretOffset(0x101);
    key(Qt::Key_Right); // low nibble
    type("a");
    EXPECT_EQ(byteAt(0x101), 0x1A);
    EXPECT_EQ(ctrl->caretOffset(), 0x102u);
    type("g"); // not a digit
    EXPECT_EQ(ctrl->caretOffset(), 0x102u);
    EXPECT_EQ(changed.size(), 2);
    EXPECT_EQ(changed.first().at(0).value<DiskArea>(), (DiskArea{0x100, 1}));
    EXPECT_TRUE(storage->isModified({0x100, 2}));
    EXPECT_FALSE(storage->isModified({0x102, 1}));
    EXPECT_EQ(disk->bytes(0x100, 2), QByteArray::fromHex("1212")); // nothing reached the disk
}

TEST_F(EditorCtrlEdit, ReadOnlyIgnoresTyping)
{
    open(64 * 1024, 512, true);
    type("FF");
    EXPECT_EQ(byteAt(0), 0x00);
    EXPECT_FALSE(ctrl->canUndo());
    EXPECT_FALSE(ctrl->applyEdit(0, "x"));
    ctrl->setEditable(true);
    type("F");
    EXPECT_EQ(byteAt(0), 0xF0);
}

TEST_F(EditorCtrlEdit, AsciiUnicodeAndBackspace)
{
    ctrl->setColumns(Metrics::PaneOffset | Metrics::PaneAscii | Metrics::PaneUnicode);
    ctrl->setCaretPane(Metrics::PaneAscii);
    ctrl->setCaretOffset(0x40);
    type("Z");
    EXPECT_EQ(byteAt(0x40), 'Z');
    EXPECT_EQ(ctrl->caretOffset(), 0x41u);
    key(Qt::Key_Backspace);
    EXPECT_EQ(byteAt(0x40), 0);
    EXPECT_EQ(ctrl->caretOffset(), 0x40u); // Backspace moves left and stays there

    ctrl->setCaretPane(Metrics::PaneUnicode);
    ctrl->setCaretOffset(0x50);
    typeChar(QChar(0x0416));
    EXPECT_EQ(storage->read({0x50, 2}), QByteArray::fromHex("1604"));
    EXPECT_EQ(ctrl->caretOffset(), 0x52u);

    ctrl->setCaretPane(Metrics::PaneHex);
    poke(0x60, QByteArray::fromHex("FFFF"));
    ctrl->setCaretOffset(0x61);
    key(Qt::Key_Backspace); // to the low nibble of 0x60, writing 0 there
    EXPECT_EQ(byteAt(0x60), 0xF0);
    EXPECT_EQ(ctrl->caretOffset(), 0x60u);
    EXPECT_EQ(ctrl->caret().nibble, 1);
}

TEST_F(EditorCtrlEdit, UndoRestoresDigitsOneAtATimeAndANewEditDropsRedo)
{
    poke(0, QByteArray::fromHex("000000"));
    type("123");
    EXPECT_EQ(storage->read({0, 2}), QByteArray::fromHex("1230"));
    ctrl->undo();
    EXPECT_EQ(storage->read({0, 2}), QByteArray::fromHex("1200"));
    EXPECT_FALSE(storage->isModified({1, 1}));
    EXPECT_TRUE(storage->isModified({0, 1}));
    ctrl->undo();
    EXPECT_EQ(byteAt(0), 0x10);
    ctrl->undo();
    EXPECT_EQ(byteAt(0), 0x00);
    EXPECT_FALSE(storage->isModified());
    EXPECT_FALSE(ctrl->canUndo());
    ctrl->redo();
    EXPECT_EQ(byteAt(0), 0x10);
    EXPECT_TRUE(storage->isModified({0, 1}));
    EXPECT_TRUE(ctrl->canRedo());
    ASSERT_TRUE(ctrl->applyEdit(8, "ab"));
    EXPECT_FALSE(ctrl->canRedo());
    EXPECT_EQ(ctrl->undoStack().count(), 2);
    EXPECT_EQ(ctrl->caretOffset(), 9u); // the last byte of the edit
}

TEST_F(EditorCtrlEdit, OverlappingUndoKeepsMarksOfAppliedEdits)
{
    ASSERT_TRUE(ctrl->applyEdit(10, "AAAA"));
    ASSERT_TRUE(ctrl->applyEdit(12, "BBBB"));
    ctrl->undo();
    EXPECT_EQ(storage->read({10, 6}), QByteArray("AAAA") + disk->bytes(14, 2));
    EXPECT_TRUE(storage->isModified({12, 2})); // still covered by the first edit
    EXPECT_FALSE(storage->isModified({14, 2}));
}

TEST_F(EditorCtrlEdit, DeleteZeroFillsTheSelection)
{
    ctrl->setSelection({100, 20});
    key(Qt::Key_Delete);
    EXPECT_EQ(storage->read({100, 20}), QByteArray(20, '\0'));
    EXPECT_EQ(ctrl->caretOffset(), 119u);
    EXPECT_EQ(ctrl->selection().length, 0u);
    EXPECT_TRUE(ctrl->canUndo());
}

TEST_F(EditorCtrlEdit, FillRepeatsThePatternAndRefusesMoreThanOneMiB)
{
    ctrl->setSelection({200, 10});
    ASSERT_TRUE(ctrl->fillBlock("xyz"));
    EXPECT_EQ(storage->read({200, 10}), QByteArray("xyzxyzxyzx"));
    EXPECT_EQ(FillBlockDlg::fillBytes("ab", 5), QByteArray("ababa"));

    open(4 << 20);
    ctrl->setSelection({0, 1 << 20});
    ASSERT_TRUE(ctrl->fillBlock(QByteArray(1, '\x5A')));
    EXPECT_EQ(byteAt((1 << 20) - 1), 0x5A);
    EXPECT_EQ(byteAt(1 << 20), 0x00);
    EXPECT_TRUE(dialogs.calls.isEmpty());

    ctrl->setSelection({0, (1 << 20) + 1});
    EXPECT_FALSE(ctrl->fillBlock(QByteArray(1, '\x11')));
    EXPECT_FALSE(ctrl->deleteSelection());
    ASSERT_EQ(dialogs.calls.size(), 2);
    EXPECT_EQ(dialogs.calls[0].title, QStringLiteral("Selection is too big"));
    EXPECT_EQ(dialogs.calls[0].text,
              QStringLiteral(
                  "Selection block size is too big to be supported by Undo buffer. Please select less than "
                  "%1 bytes")
                  .arg(QLocale().toString(1048576)));
    EXPECT_EQ(byteAt(0), 0x5A);
}

TEST_F(EditorCtrlEdit, FillDialogKeepsTextAndHexInStep)
{
    FillBlockDlg dlg({16, 10});
    QPushButton *ok = dlg.buttons()->button(QDialogButtonBox::Ok);
    EXPECT_FALSE(ok->isEnabled());
    QTest::keyClicks(dlg.textEdit(), "AB");
    EXPECT_EQ(dlg.hexEdit()->text(), QStringLiteral("41 42"));
    EXPECT_TRUE(ok->isEnabled());
    dlg.hexEdit()->clear();
    QTest::keyClicks(dlg.hexEdit(), "30313");
    EXPECT_EQ(dlg.pattern(), QByteArray("01"));
    EXPECT_EQ(dlg.textEdit()->text(), QStringLiteral("01"));
    EXPECT_TRUE(dlg.findChildren<QLabel *>().size() >= 2);
}

TEST_F(EditorCtrlEdit, SaveAsksAndWritesModifiedSectors)
{
    ASSERT_TRUE(ctrl->applyEdit(1020, "hello"));
    dialogs.answers = {QMessageBox::No};
    EXPECT_FALSE(ctrl->onSave());
    EXPECT_NE(disk->bytes(1020, 5), QByteArray("hello"));
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].icon, QMessageBox::Warning);
    EXPECT_EQ(dialogs.calls[0].text,
              QStringLiteral(
                  "You are going to write data to Fake Disk. Please note that this operation can seriously "
                  "damage file system. Proceed only if absolutely sure.\nDo you want to save your changes?"));

    dialogs.answers = {QMessageBox::Yes};
    const int writesBefore = disk->writeRequests;
    EXPECT_TRUE(ctrl->onSave());
    EXPECT_EQ(disk->bytes(1020, 5), QByteArray("hello"));
    EXPECT_EQ(disk->writeRequests - writesBefore, 2); // bytes 1020..1024 span sectors 1 and 2
    EXPECT_FALSE(storage->isModified());
    EXPECT_FALSE(ctrl->canUndo());
    EXPECT_FALSE(ctrl->onSave()); // nothing left to save: no question
    EXPECT_EQ(dialogs.calls.size(), 2);
}

TEST_F(EditorCtrlEdit, FailedSectorWriteKeepsItsEdits)
{
    disk->badWrites.insert(3);
    ASSERT_TRUE(ctrl->applyEdit(3 * 512 + 7, "x"));
    ASSERT_TRUE(ctrl->applyEdit(5 * 512, "y"));
    dialogs.answers = {QMessageBox::Yes};
    QSignalSpy failed(storage.get(), &HexEditor::Storage::writeFailed);
    EXPECT_FALSE(ctrl->onSave());
    EXPECT_EQ(failed.size(), 1);
    EXPECT_EQ(disk->bytes(5 * 512, 1), QByteArray("y"));
    EXPECT_TRUE(storage->isModified({3 * 512 + 7, 1}));
    EXPECT_FALSE(storage->isModified({5 * 512, 1}));
    EXPECT_TRUE(ctrl->hasAppliedEdits()); // Save stays possible
    // The user is told.
    ASSERT_EQ(dialogs.calls.size(), 2);
    EXPECT_EQ(dialogs.calls[1].icon, QMessageBox::Critical);
    EXPECT_EQ(dialogs.calls[1].text,
              QStringLiteral("The changes to Fake Disk were not saved.\nFailed to write "
                             "sector 3 to Fake Disk. Error code 29."));

    // Edits that were written but did not reach the medium are not saved either.
    disk->badWrites.clear();
    disk->flushError = 29;
    dialogs.answers = {QMessageBox::Yes};
    EXPECT_FALSE(ctrl->onSave());
    EXPECT_TRUE(storage->isModified({3 * 512 + 7, 1}));
    EXPECT_TRUE(ctrl->hasAppliedEdits());
    EXPECT_EQ(dialogs.calls.last().icon, QMessageBox::Critical);
    EXPECT_TRUE(dialogs.calls.last().text.contains("did not reach Fake Disk"))
        << dialogs.calls.last().text.toStdString();
    disk->flushError = 0;
    dialogs.answers = {QMessageBox::Yes};
    EXPECT_TRUE(ctrl->onSave());
    EXPECT_FALSE(storage->isModified());
}

TEST_F(EditorCtrlEdit, RevertRestoresEverything)
{
    const QByteArray before = disk->bytes(0, 64);
    ASSERT_TRUE(ctrl->applyEdit(0, "1234"));
    ASSERT_TRUE(ctrl->applyEdit(30, "5678"));
    dialogs.answers = {QMessageBox::No};
    ctrl->revert();
    EXPECT_EQ(storage->read({0, 4}), QByteArray("1234"));
    dialogs.answers = {QMessageBox::Yes};
    QSignalSpy changed(ctrl.get(), &EditorCtrl::dataChanged);
    ctrl->revert();
    EXPECT_EQ(dialogs.calls.last().text,
              QStringLiteral("All changes not saved to the disk will be lost. Do you want to proceed?"));
    EXPECT_EQ(storage->read({0, 64}), before);
    EXPECT_FALSE(storage->isModified());
    EXPECT_FALSE(ctrl->canUndo());
    EXPECT_EQ(changed.size(), 2);
}

TEST_F(EditorCtrlEdit, CloseCheckAsksWithThreeButtons)
{
    EXPECT_TRUE(ctrl->queryClose()); // nothing edited: no question
    EXPECT_TRUE(dialogs.calls.isEmpty());
    ASSERT_TRUE(ctrl->applyEdit(0, "Q"));
    dialogs.answers = {QMessageBox::Cancel};
    EXPECT_FALSE(ctrl->queryClose());
    EXPECT_EQ(dialogs.calls.last().buttons, QMessageBox::Yes | QMessageBox::No | QMessageBox::Cancel);
    EXPECT_TRUE(
        dialogs.calls.last().text.startsWith(QStringLiteral("Content of Fake Disk has been modified.")));
    dialogs.answers = {QMessageBox::No};
    EXPECT_TRUE(ctrl->queryClose());
    EXPECT_NE(disk->bytes(0, 1), QByteArray("Q"));
    ASSERT_TRUE(ctrl->applyEdit(0, "R"));
    dialogs.answers = {QMessageBox::Yes};
    EXPECT_TRUE(ctrl->queryClose());
    EXPECT_EQ(disk->bytes(0, 1), QByteArray("R"));

    // A failed write keeps the view open.
    disk->badWrites.insert(0);
    ASSERT_TRUE(ctrl->applyEdit(0, "S"));
    dialogs.answers = {QMessageBox::Yes};
    EXPECT_FALSE(ctrl->queryClose());

    ctrl->setTransferRunning(true);
    dialogs.answers = {QMessageBox::No};
    EXPECT_FALSE(ctrl->queryClose());
    EXPECT_TRUE(dialogs.calls.last().text.startsWith(
        QStringLiteral("This view cannot be closed while data transfer is in progress.")));
}

TEST_F(EditorCtrlEdit, TemplateChangesApplyAsEdits)
{
    QVariantList changes;
    changes << QVariant::fromValue<quint64>(0x1BE) << QByteArray::fromHex("80")
            << QVariant::fromValue<quint64>(0x1FE) << QByteArray::fromHex("55AA");
    ctrl->onTemplateModified(changes);
    EXPECT_EQ(byteAt(0x1BE), 0x80);
    EXPECT_EQ(storage->read({0x1FE, 2}), QByteArray::fromHex("55AA"));
    EXPECT_EQ(ctrl->undoStack().count(), 2);
    ctrl->undo();
    EXPECT_EQ(storage->read({0x1FE, 2}), disk->bytes(0x1FE, 2));
}

TEST_F(EditorCtrlEdit, EditsRefusedBeyondTheData)
{
    EXPECT_FALSE(ctrl->applyEdit(disk->GetSize(), "x"));
    ASSERT_TRUE(ctrl->applyEdit(disk->GetSize() - 2, "wxyz")); // cut at the end
    EXPECT_EQ(ctrl->undoStack().entries().last().newBytes, QByteArray("wx"));
    EXPECT_FALSE(ctrl->applyEdit(0, QByteArray()));
}
