// The status bar's texts for the caret, the selection, the offset format and the editing mode, and
// a block transfer of the view: its progress and stop button, and its result reaching the user.
#include "hexeditor/StatusCtrl.h"

#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/View.h"
#include "tests/common/LogTestUtil.h"
#include "tests/common/RecordingDialogs.h"
#include "tests/common/TestUtil.h"
#include "tests/hexeditor/StorageTestMedium.h"

#include <QLabel>
#include <QProgressBar>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>
#include <QToolButton>
#include <gtest/gtest.h>

#include <memory>

using HexEditor::EditorCtrl;
using HexEditor::StatusCtrl;

namespace {

struct EnglishLocale
{
    QLocale previous;
    EnglishLocale() { QLocale::setDefault(QLocale(QLocale::English, QLocale::UnitedStates)); }
    ~EnglishLocale() { QLocale::setDefault(previous); }
};

} // namespace

TEST(StatusBar, CaretAndSelectionTexts)
{
    EnglishLocale english;
    StatusCtrl status;
    EXPECT_EQ(status.objectName(), "StatusCtrl");
    for (const char *name :
         {"lblSelection", "lblSector", "lblOffset", "lblLine", "lblCol", "lblOffsetFormat", "lblEditable"})
        EXPECT_NE(status.label(name), nullptr) << name;
    EXPECT_NE(status.findChild<QToolButton *>("btnStop"), nullptr);

    status.setCaret(70000, 136, 4375, 0);
    EXPECT_EQ(status.label("lblSector")->text(), "Sector: <b>136 (0x88)</b>");
    EXPECT_EQ(status.label("lblOffset")->text(), "Offset: <b>70,000 (0x11170)</b>");
    EXPECT_EQ(status.label("lblLine")->text(), "Ln: <b>4,375</b>");
    EXPECT_EQ(status.label("lblCol")->text(), "Col: <b>0</b>");

    status.onStateChanged(false, true, false);
    status.onSelectionChanged({1024, 512}, 512);
    EXPECT_EQ(
        status.label("lblSelection")->text(),
        QString("Selection: <b style='color: %1;'>1,024 - 1,535 [512]</b>").arg(StatusCtrl::AlignedColor));
    EXPECT_EQ(status.label("lblSelection")->toolTip(), "Selection is aligned to sectors boundaries");

    status.onStateChanged(true, true, false);
    EXPECT_EQ(status.label("lblSelection")->text(),
              QString("Selection: <b style='color: %1;'>1,024 (0x400) - 1,535 (0x5FF) [512]</b>")
                  .arg(StatusCtrl::AlignedColor));
    status.onSelectionChanged({1000, 30}, 512);
    EXPECT_TRUE(status.label("lblSelection")->text().contains(StatusCtrl::UnalignedColor));
    EXPECT_EQ(status.label("lblSelection")->toolTip(),
              "Selection is <b>not</b> aligned to sectors boundaries");
    status.onSelectionChanged({}, 512);
    EXPECT_TRUE(status.label("lblSelection")->text().isEmpty());
}

TEST(StatusBar, FormatEditingModeAndProgress)
{
    StatusCtrl status;
    status.onStateChanged(true, false, true);
    EXPECT_EQ(status.label("lblOffsetFormat")->text(), "<b><b>HEX</b></b>, Big Endian");
    EXPECT_EQ(status.label("lblOffsetFormat")->toolTip(), "Hexadecimal offset and addressing");
    EXPECT_EQ(status.label("lblEditable")->text(), " <b style='color: red;'>Read/Write</b> ");
    EXPECT_TRUE(status.label("lblEditable")->toolTip().startsWith("<b>Editing Allowed</b><br/>"));
    status.onStateChanged(false, true, false);
    EXPECT_EQ(status.label("lblOffsetFormat")->text(), "<b><b>DEC</b></b>, Little Endian");
    EXPECT_EQ(status.label("lblOffsetFormat")->toolTip(), "Decimal offset and addressing");
    EXPECT_EQ(status.label("lblEditable")->text(), " <b style='color: green;'>Read Only</b> ");
    EXPECT_TRUE(status.label("lblEditable")->toolTip().contains("<b>Ctrl+Alt+E</b>"));

    QSignalSpy stop(&status, &StatusCtrl::stopProcess);
    status.onThreadProgress(40);
    EXPECT_FALSE(status.progressBar()->isHidden());
    EXPECT_EQ(status.progressBar()->value(), 40);
    status.stopButton()->click();
    EXPECT_EQ(stop.count(), 1);
    status.onThreadFinished(0, "done");
    EXPECT_TRUE(status.progressBar()->isHidden());
}

namespace {

// A view over a medium in memory with editing on, inserting `file` at `offset` when asked.
struct TransferView
{
    QTemporaryDir dir;
    MemoryMedium medium;
    HexEditor::View view;
    QString file;

    TransferView(std::uint64_t bytes, const QByteArray &fileBytes)
        : medium(QByteArray(qsizetype(bytes), '\0')),
          view(nullptr, std::make_unique<HexEditor::Storage>(&medium), false), file(dir.filePath("in.bin"))
    {
        TestUtil::writeFile(file, fileBytes);
        view.editor()->setFileNameProvider([this](EditorCtrl::FileRequest, const QString &, const QString &,
                                                  const QString &) { return file; });
    }
    bool statusShowsTransfer() const
    {
        return !view.statusCtrl()->stopButton()->isHidden() && !view.statusCtrl()->progressBar()->isHidden();
    }
    bool statusClear() const
    {
        return view.statusCtrl()->stopButton()->isHidden() && view.statusCtrl()->progressBar()->isHidden();
    }
};

} // namespace

TEST(ViewTransfer, FailedSectorWriteIsShownLoggedAndEndsTheProgress)
{
    RecordingDialogs dialogs;
    TransferView t(64 * 512, QByteArray(8 * 512, 'Q'));
    t.medium.badWrites.insert(4);
    LogWatch log;
    t.view.editor()->setCaretOffset(4 * 512);
    QSignalSpy finished(t.view.editor(), &EditorCtrl::transferFinished);
    t.view.editor()->onInsertData();
    EXPECT_TRUE(t.statusShowsTransfer());
    ASSERT_TRUE(finished.wait(20000));

    const QString failure = QStringLiteral("Failed to write sector 4 to Memory. Error code 29.");
    EXPECT_FALSE(finished[0].at(0).toBool());
    EXPECT_EQ(finished[0].at(1).toString(), failure);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_EQ(dialogs.calls[0].icon, QMessageBox::Critical);
    EXPECT_EQ(dialogs.calls[0].title, QStringLiteral("Insert data from file '%1'").arg(t.file));
    EXPECT_EQ(dialogs.calls[0].text, failure);
    EXPECT_TRUE(log.texts().contains(QStringLiteral("Loading from file: %1").arg(t.file)));
    EXPECT_EQ(log.texts().last(), failure);
    EXPECT_EQ(log.newErrors(), 1);
    EXPECT_TRUE(t.statusClear());
    EXPECT_EQ(t.view.statusCtrl()->progressBar()->toolTip(), failure);
    EXPECT_FALSE(t.view.editor()->isTransferRunning());
}

TEST(ViewTransfer, StopButtonCancelsTheTransfer)
{
    RecordingDialogs dialogs;
    const QByteArray payload(16 << 20, 'S');
    TransferView t(payload.size(), payload);
    t.medium.writeDelayMs = 50; // 32 steps of 1024 sectors: the stop lands half-way
    LogWatch log;
    QSignalSpy progress(t.view.editor(), &EditorCtrl::progress);
    QSignalSpy finished(t.view.editor(), &EditorCtrl::transferFinished);
    t.view.editor()->onInsertData();
    ASSERT_TRUE(QTest::qWaitFor([&] { return progress.size() > 1; }, 20000)) << "a first step landed";
    ASSERT_TRUE(t.statusShowsTransfer());
    t.view.statusCtrl()->stopButton()->click();
    ASSERT_TRUE(finished.size() > 0 || finished.wait(20000));

    const QString cancelled = QStringLiteral("Insert data from file '%1' canceled by user").arg(t.file);
    EXPECT_FALSE(finished[0].at(0).toBool());
    EXPECT_EQ(finished[0].at(1).toString(), cancelled);
    EXPECT_LT(t.medium.sectorsWritten.load(), std::uint64_t(payload.size() / 512));
    EXPECT_TRUE(dialogs.calls.isEmpty()) << "a stop the user asked for needs no box";
    EXPECT_EQ(log.texts().last(), cancelled);
    EXPECT_EQ(log.newErrors(), 0);
    EXPECT_TRUE(t.statusClear());
}
