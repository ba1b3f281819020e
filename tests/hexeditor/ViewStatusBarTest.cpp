// The status bar's texts for the caret, the selection, the offset format and the editing mode.
#include "hexeditor/StatusCtrl.h"

#include <QLabel>
#include <QProgressBar>
#include <QSignalSpy>
#include <QToolButton>
#include <gtest/gtest.h>

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
