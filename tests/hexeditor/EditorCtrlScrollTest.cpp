#include <QScrollBar>

#include "tests/hexeditor/EditorCtrlFixture.h"

using HexEditor::Metrics;

// An editor narrower than its lines: the horizontal scroll bar follows the caret.
class EditorCtrlScroll : public EditorCtrlFixture
{
protected:
    void SetUp() override
    {
        EditorCtrlFixture::SetUp();
        ctrl->resize(260, 300);
        QCoreApplication::processEvents();
        ASSERT_GT(ctrl->horizontalScrollBar()->maximum(), 0) << "the line must be wider than the window";
    }
    int hValue() const { return ctrl->horizontalScrollBar()->value(); }
    // Whether the caret's byte box lies inside the viewport at the current horizontal scroll.
    bool caretVisible() const
    {
        const auto pane = Metrics::Pane(ctrl->caret().pane);
        const int left = ctrl->byteLeft(pane, ctrl->caret().column) - hValue();
        const int right = ctrl->byteRight(pane, ctrl->caret().column) - hValue();
        return left >= 0 && right <= ctrl->viewport()->width();
    }
};

TEST_F(EditorCtrlScroll, EndAndHomeScrollToTheCaretAndBack)
{
    EXPECT_EQ(hValue(), 0);
    key(Qt::Key_End);
    EXPECT_EQ(ctrl->caret().column, 15);
    EXPECT_GT(hValue(), 0);
    EXPECT_TRUE(caretVisible());
    key(Qt::Key_Home);
    EXPECT_EQ(ctrl->caret().column, 0);
    EXPECT_EQ(hValue(), 0) << "back at column 0 the offsets are shown again";
    EXPECT_TRUE(caretVisible());
}

TEST_F(EditorCtrlScroll, ArrowKeysKeepTheCaretVisibleAcrossTheLineAndTheWrap)
{
    for (int i = 0; i < 2 * 16 * 2; ++i) { // two lines, two nibbles per byte
        key(Qt::Key_Right);
        ASSERT_TRUE(caretVisible()) << "after " << i + 1 << " steps, column " << int(ctrl->caret().column);
        if (ctrl->caret().column == 0) {
            EXPECT_EQ(hValue(), 0) << "a wrap to the next line returns to the line's start";
        }
    }
    EXPECT_EQ(ctrl->caretOffset(), 32u);
    for (int i = 0; i < 18; ++i) {
        key(Qt::Key_Left);
        ASSERT_TRUE(caretVisible()) << "left step " << i + 1;
    }
    EXPECT_EQ(ctrl->caret().column, 7);
}

TEST_F(EditorCtrlScroll, GoToAndTextPanesScrollToo)
{
    ctrl->setCaretOffset(16 * 40 + 14);
    EXPECT_TRUE(caretVisible());
    const int atHex = hValue();
    EXPECT_GT(atHex, 0);

    // The text pane lies further right than the hexadecimal one.
    ctrl->setCaretPane(Metrics::PaneAscii);
    EXPECT_EQ(ctrl->caret().pane, Metrics::PaneAscii);
    EXPECT_TRUE(caretVisible());
    EXPECT_GT(hValue(), atHex);

    ctrl->setCaretPane(Metrics::PaneHex);
    EXPECT_TRUE(caretVisible());
    ctrl->setCaretOffset(0);
    EXPECT_EQ(hValue(), 0);

    // All four columns: the Unicode column is the rightmost.
    ctrl->setColumns(Metrics::PaneOffset | Metrics::PaneHex | Metrics::PaneAscii | Metrics::PaneUnicode);
    ctrl->setCaretPane(Metrics::PaneUnicode);
    ASSERT_EQ(ctrl->caret().pane, Metrics::PaneUnicode);
    key(Qt::Key_End);
    EXPECT_TRUE(caretVisible());
    EXPECT_GT(hValue(), ctrl->horizontalScrollBar()->maximum() - 2 * ctrl->cellWidth());
    ctrl->setCaretOffset(16 * 7 + 4);
    EXPECT_TRUE(caretVisible());
}

TEST_F(EditorCtrlScroll, ACaretAlreadyInSightDoesNotMoveTheView)
{
    ctrl->setCaretOffset(15);
    const int value = hValue();
    ASSERT_GT(value, 0);
    // A byte a little to the left is still inside the viewport: no scroll.
    ctrl->setCaretOffset(13);
    ASSERT_TRUE(caretVisible());
    EXPECT_EQ(hValue(), value);
}

TEST_F(EditorCtrlScroll, ClicksAfterAScrollHitTheBytesShown)
{
    ctrl->setCaretOffset(16 * 3 + 15);
    ASSERT_GT(hValue(), 0);
    QPoint p = cellPoint(16 * 3 + 12);
    p.rx() -= hValue();
    ASSERT_GE(p.x(), 0);
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, Qt::NoModifier, p);
    EXPECT_EQ(ctrl->caretOffset(), 16u * 3 + 12);
    EXPECT_TRUE(caretVisible());
}

TEST_F(EditorCtrlScroll, AWideWindowNeverScrolls)
{
    ctrl->resize(1400, 300);
    QCoreApplication::processEvents();
    ctrl->setBytesPerLine(16);
    key(Qt::Key_End);
    EXPECT_EQ(ctrl->horizontalScrollBar()->maximum(), 0);
    EXPECT_EQ(hValue(), 0);

    // Wider lines than the window again: the last of 64 bytes is brought into sight.
    ctrl->setBytesPerLine(64);
    ctrl->resize(700, 300);
    QCoreApplication::processEvents();
    ctrl->setCaretOffset(63);
    EXPECT_EQ(ctrl->caret().column, 63);
    EXPECT_TRUE(caretVisible());
}

TEST_F(EditorCtrlScroll, ANewWindowSizeShowsTheLineStartWhenTheCaretFitsThere)
{
    // A caret near the line's start, placed while the window is tiny, scrolls a little...
    ctrl->resize(90, 300);
    QCoreApplication::processEvents();
    ctrl->setCaretOffset(2);
    ASSERT_TRUE(caretVisible());
    ASSERT_GT(hValue(), 0);
    // ...and the grown window shows the offsets again.
    ctrl->resize(700, 300);
    QCoreApplication::processEvents();
    EXPECT_EQ(hValue(), 0);
    EXPECT_TRUE(caretVisible());

    // A window that shrinks keeps a caret at the line's end in sight.
    ctrl->setCaretOffset(15);
    ctrl->resize(200, 300);
    QCoreApplication::processEvents();
    EXPECT_TRUE(caretVisible());
    EXPECT_GT(hValue(), 0);
}

TEST_F(EditorCtrlScroll, HomeShowsTheOffsetsAgainWhenTheLineIsOnlyABitWider)
{
    // The line is a little wider than the window: at its end the first byte stays in sight.
    const int frame = ctrl->width() - ctrl->viewport()->width();
    ctrl->resize(ctrl->byteRight(Metrics::PaneHex, 15) - 3 * ctrl->cellWidth() + frame, 300);
    QCoreApplication::processEvents();
    key(Qt::Key_End);
    ASSERT_GT(hValue(), 0);
    ASSERT_LT(hValue(), ctrl->byteLeft(Metrics::PaneHex, 0)) << "column 0 is still visible";
    key(Qt::Key_Home);
    EXPECT_EQ(hValue(), 0);
    // Stepping left from the end brings the start back once the caret fits beside it.
    key(Qt::Key_End);
    ASSERT_GT(hValue(), 0);
    for (int i = 0; i < 8 && hValue() > 0; ++i) {
        key(Qt::Key_Left);
        key(Qt::Key_Left);
    }
    EXPECT_EQ(hValue(), 0);
    EXPECT_TRUE(caretVisible());
}

TEST_F(EditorCtrlScroll, AClickNeverMovesTheBytesUnderThePointer)
{
    // Scrolled a little by hand: the first bytes are still in sight, the offsets are not.
    ctrl->horizontalScrollBar()->setValue(ctrl->byteLeft(Metrics::PaneHex, 0) - ctrl->cellWidth());
    const int value = hValue();
    ASSERT_GT(value, 0);
    QPoint p = cellPoint(16 * 2 + 1);
    p.rx() -= value;
    QTest::mousePress(ctrl->viewport(), Qt::LeftButton, Qt::NoModifier, p);
    EXPECT_EQ(ctrl->caretOffset(), 16u * 2 + 1);
    EXPECT_EQ(hValue(), value);
    QTest::mouseRelease(ctrl->viewport(), Qt::LeftButton, Qt::NoModifier, p);
    EXPECT_EQ(ctrl->caretOffset(), 16u * 2 + 1);
    EXPECT_EQ(hValue(), value);
    // The keyboard brings the line's start back.
    key(Qt::Key_Left);
    key(Qt::Key_Left);
    EXPECT_EQ(hValue(), 0);
}
