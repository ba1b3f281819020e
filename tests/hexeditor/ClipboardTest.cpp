#include <QApplication>
#include <QClipboard>
#include <QMimeData>

#include "hexeditor/Clipboard.h"
#include "tests/hexeditor/EditorCtrlFixture.h"

using HexEditor::DiskArea;
using HexEditor::EditorCtrl;
using HexEditor::Metrics;
namespace Clipboard = HexEditor::Clipboard;

using ClipboardCtrl = EditorCtrlFixture;

TEST(ClipboardText, PaneForms)
{
    const QByteArray bytes = QByteArray::fromHex("0A1B41421F00");
    EXPECT_EQ(Clipboard::copyText(bytes, Metrics::PaneHex), QStringLiteral("0A1B41421F00"));
    EXPECT_EQ(Clipboard::copyText(bytes, Metrics::PaneAscii), QStringLiteral("..AB.."));
    EXPECT_EQ(Clipboard::copyText(QByteArray::fromHex("410016040A00"), Metrics::PaneUnicode),
              QString::fromUtf8("AЖ."));
    // From an odd offset the first byte is skipped to start on a pair.
    EXPECT_EQ(Clipboard::copyText(QByteArray::fromHex("FF41004200"), Metrics::PaneUnicode, 7),
              QStringLiteral("AB"));
}

TEST(ClipboardText, FormattedDump)
{
    QByteArray bytes;
    for (int i = 0; i < 20; ++i)
        bytes.append(char(0x40 + i));
    const QString text = Clipboard::formattedText(bytes, 12, 16, false, 8);
    const QStringList lines = text.split(QLatin1Char('\n'), Qt::SkipEmptyParts);
    ASSERT_EQ(lines.size(), 4);
    EXPECT_TRUE(lines[0].startsWith(QStringLiteral("-----")));
    EXPECT_EQ(lines[0].count(QLatin1Char('-')), lines[0].size());
    EXPECT_TRUE(lines[1].startsWith(QStringLiteral("00000000  ")));
    EXPECT_TRUE(lines[1].contains(QStringLiteral("40 41 42 43")));
    EXPECT_TRUE(lines[1].endsWith(QStringLiteral("@ABC")));
    EXPECT_TRUE(lines[2].startsWith(QStringLiteral("00000016  44 45")));
    EXPECT_EQ(lines[3], QStringLiteral("Copied 20 bytes from 00000012 to 00000031"));
    const QString hex = Clipboard::formattedText(bytes, 12, 16, true, 8);
    EXPECT_TRUE(hex.contains(QStringLiteral("Copied 20 bytes from 0000000C to 0000001F")));
    EXPECT_TRUE(hex.contains(QStringLiteral("\n00000010  44")));
}

TEST_F(ClipboardCtrl, CopyPutsBytesAndTextOfThePane)
{
    ctrl->setSelection({0x41, 4});
    ctrl->onCopy();
    const QMimeData *data = QApplication::clipboard()->mimeData();
    ASSERT_NE(data, nullptr);
    EXPECT_EQ(data->data(Clipboard::BinaryFormat), disk->bytes(0x41, 4));
    EXPECT_EQ(data->text(), QStringLiteral("41424344"));
    ctrl->setCaretPane(Metrics::PaneAscii);
    ctrl->onCopy();
    EXPECT_EQ(QApplication::clipboard()->text(), QStringLiteral("ABCD"));
    ctrl->onCopyFormatted();
    EXPECT_TRUE(QApplication::clipboard()->text().contains(QStringLiteral("Copied 4 bytes from")));
}

TEST_F(ClipboardCtrl, OneMiBCanBeCopiedOneByteMoreIsRefused)
{
    open(4 << 20);
    ctrl->setSelection({0, 1 << 20});
    ctrl->onCopy();
    EXPECT_EQ(QApplication::clipboard()->mimeData()->data(Clipboard::BinaryFormat).size(), 1 << 20);
    EXPECT_TRUE(dialogs.calls.isEmpty());
    ctrl->setSelection({0, (1 << 20) + 1});
    ctrl->onCopy();
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].title, QStringLiteral("Selection is too big to copy"));
    EXPECT_EQ(dialogs.calls[0].text,
              QStringLiteral("Selection block size is too big to be copied to the clipboard."));
    ctrl->onCopyFormatted();
    ASSERT_EQ(dialogs.calls.size(), 2);
    EXPECT_EQ(dialogs.calls[1].title, QStringLiteral("Selection is too big"));
}

TEST_F(ClipboardCtrl, PasteAppliesBinaryOrTextAtTheCaret)
{
    ctrl->setCaretOffset(300);
    auto *binary = new QMimeData;
    binary->setData(Clipboard::BinaryFormat, QByteArray::fromHex("DEADBEEF"));
    binary->setText(QStringLiteral("ignored"));
    QApplication::clipboard()->setMimeData(binary);
    ctrl->onPaste();
    EXPECT_EQ(storage->read({300, 4}), QByteArray::fromHex("DEADBEEF"));
    EXPECT_EQ(ctrl->caretOffset(), 303u);

    QApplication::clipboard()->setText(QStringLiteral("plain"));
    ctrl->setCaretOffset(400);
    ctrl->onPaste();
    EXPECT_EQ(storage->read({400, 5}), QByteArray("plain"));
    EXPECT_EQ(ctrl->undoStack().count(), 2);

    ctrl->setEditable(false);
    ctrl->setCaretOffset(500);
    ctrl->onPaste();
    EXPECT_EQ(ctrl->undoStack().count(), 2);
}

TEST_F(ClipboardCtrl, BulkReferenceStartsATransferWhileTheSourceLives)
{
    QList<EditorCtrl::BulkRequest> started;
    ctrl->setBulkStarter([&](const EditorCtrl::BulkRequest &r) {
        started.append(r);
        return true;
    });
    EditorCtrlFakeDisk otherDisk(8192);
    auto other = std::make_unique<HexEditor::Storage>(&otherDisk);
    Clipboard::registerStorage(other.get());
    QApplication::clipboard()->setMimeData(Clipboard::bulkData(other.get(), {512, 1024}));
    ctrl->setCaretOffset(2048);
    ctrl->onPaste();
    ASSERT_EQ(started.size(), 1);
    EXPECT_TRUE(started[0].copyBetweenStorages);
    EXPECT_EQ(started[0].source, other.get());
    EXPECT_EQ(started[0].sourceArea, (DiskArea{512, 1024}));
    EXPECT_EQ(started[0].target, storage.get());
    EXPECT_EQ(started[0].targetOffset, 2048u);
    EXPECT_EQ(ctrl->undoStack().count(), 0);

    // Once the source is gone the reference is no longer followed.
    Clipboard::unregisterStorage(other.get());
    other.reset();
    ctrl->onPaste();
    EXPECT_EQ(started.size(), 1);
    HexEditor::Clipboard::BulkReference ref;
    EXPECT_FALSE(Clipboard::bulkReference(QApplication::clipboard()->mimeData(), ref));
}

TEST_F(ClipboardCtrl, SaveAndInsertDataAskForAFileThroughTheSeam)
{
    QList<EditorCtrl::BulkRequest> started;
    ctrl->setBulkStarter([&](const EditorCtrl::BulkRequest &r) {
        started.append(r);
        return true;
    });
    QStringList asked;
    ctrl->setFileNameProvider(
        [&](EditorCtrl::FileRequest, const QString &title, const QString &filter, const QString &) {
            asked << title + QLatin1Char('|') + filter;
            return QStringLiteral("/tmp/block.bin");
        });
    ctrl->onSaveData(); // no selection: nothing
    EXPECT_TRUE(asked.isEmpty());
    ctrl->setSelection({1024, 512});
    ctrl->onSaveData();
    ASSERT_EQ(started.size(), 1);
    EXPECT_EQ(asked.last(), QStringLiteral("Save disk image|Raw data (*.bin)"));
    EXPECT_EQ(started[0].mode, EditorCtrl::FileRequest::SaveSelection);
    EXPECT_EQ(started[0].sourceArea, (DiskArea{1024, 512}));
    ctrl->setCaretOffset(77);
    ctrl->onInsertData();
    ASSERT_EQ(started.size(), 2);
    EXPECT_EQ(asked.last(), QStringLiteral("Import data from file|Raw data (*.bin);;All Files (*.*)"));
    EXPECT_EQ(started[1].target, storage.get());
    EXPECT_EQ(started[1].targetOffset, 77u);
    EXPECT_EQ(started[1].fileName, QStringLiteral("/tmp/block.bin"));
}
