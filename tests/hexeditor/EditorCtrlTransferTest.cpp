#include <QFile>
#include <QTemporaryDir>

#include "tests/hexeditor/EditorCtrlFixture.h"

using HexEditor::DiskArea;
using HexEditor::EditorCtrl;

using EditorCtrlTransfer = EditorCtrlFixture;

namespace {

bool waitFinished(QSignalSpy &spy)
{
    return spy.size() > 0 || spy.wait(20000);
}

} // namespace

TEST_F(EditorCtrlTransfer, SelectionSavedToAFileOnTheWorker)
{
    QTemporaryDir dir;
    const QString file = dir.filePath(QStringLiteral("block.bin"));
    ctrl->setFileNameProvider(
        [&](EditorCtrl::FileRequest, const QString &, const QString &, const QString &) { return file; });
    ASSERT_TRUE(ctrl->applyEdit(1030, "edit")); // unsaved edits of the source go with the block
    ctrl->setSelection({1024, 3000});
    QSignalSpy finished(ctrl.get(), &EditorCtrl::transferFinished);
    ctrl->onSaveData();
    ASSERT_TRUE(waitFinished(finished));
    EXPECT_TRUE(finished[0].at(0).toBool()) << finished[0].at(1).toString().toStdString();
    QFile f(file);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    QByteArray expected = disk->bytes(1024, 3000);
    expected.replace(6, 4, "edit");
    EXPECT_EQ(f.readAll(), expected);
    EXPECT_FALSE(ctrl->isTransferRunning());
}

TEST_F(EditorCtrlTransfer, FileInsertedAtTheCaretAfterSavingEdits)
{
    QTemporaryDir dir;
    const QString file = dir.filePath(QStringLiteral("in.bin"));
    const QByteArray payload = QByteArray(5000, 'Q');
    {
        QFile f(file);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly));
        f.write(payload);
    }
    ctrl->setFileNameProvider(
        [&](EditorCtrl::FileRequest, const QString &, const QString &, const QString &) { return file; });
    ASSERT_TRUE(ctrl->applyEdit(10, "zz"));
    ctrl->setCaretOffset(2048);
    dialogs.answers = {QMessageBox::Yes}; // save the edits first
    QSignalSpy finished(ctrl.get(), &EditorCtrl::transferFinished);
    ctrl->onInsertData();
    ASSERT_TRUE(waitFinished(finished));
    EXPECT_TRUE(finished[0].at(0).toBool()) << finished[0].at(1).toString().toStdString();
    EXPECT_EQ(disk->bytes(2048, 5000), payload);
    EXPECT_EQ(disk->bytes(10, 2), QByteArray("zz"));
    EXPECT_FALSE(ctrl->canUndo());
    EXPECT_EQ(storage->read({2048, 4}), QByteArray("QQQQ")); // no stale cached copy
}

TEST_F(EditorCtrlTransfer, RefusedInsertChangesNothing)
{
    ctrl->setFileNameProvider([&](EditorCtrl::FileRequest, const QString &, const QString &,
                                  const QString &) { return QStringLiteral("/nonexistent/file.bin"); });
    const QByteArray before = disk->bytes(0, 64);
    ctrl->onInsertData();
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].text, QStringLiteral("Invalid source file"));
    EXPECT_EQ(disk->bytes(0, 64), before);
    EXPECT_FALSE(ctrl->isTransferRunning());
}
