#include <QScrollBar>
#include <QWheelEvent>

#include "tests/hexeditor/EditorCtrlFixture.h"

using HexEditor::DiskArea;
using HexEditor::EditorCtrl;
using HexEditor::Metrics;

using EditorCtrlInput = EditorCtrlFixture;

TEST_F(EditorCtrlInput, LeftAndRightStepThroughNibblesAndLines)
{
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    key(Qt::Key_Left); // at offset 0 the caret stays
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    EXPECT_EQ(ctrl->caret().nibble, 0);
    key(Qt::Key_Right);
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    EXPECT_EQ(ctrl->caret().nibble, 1);
    key(Qt::Key_Right);
    EXPECT_EQ(ctrl->caretOffset(), 1u);
    EXPECT_EQ(ctrl->caret().nibble, 0);
    key(Qt::Key_Left);
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    EXPECT_EQ(ctrl->caret().nibble, 1);

    // From column 0 to the low nibble of the last byte of the previous line.
    ctrl->setCaretOffset(32);
    key(Qt::Key_Left);
    EXPECT_EQ(ctrl->caretOffset(), 31u);
    EXPECT_EQ(ctrl->caret().nibble, 1);
    EXPECT_EQ(ctrl->caret().line, 1u);
    EXPECT_EQ(ctrl->caret().column, 15);
    key(Qt::Key_Right); // from the low nibble to the next byte
    EXPECT_EQ(ctrl->caretOffset(), 32u);
    EXPECT_EQ(ctrl->caret().nibble, 0);

    // At the last byte of the data the caret stays.
    ctrl->setCaretOffset(disk->GetSize() + 100);
    EXPECT_EQ(ctrl->caretOffset(), disk->GetSize() - 1);
    key(Qt::Key_Right);
    key(Qt::Key_Right);
    EXPECT_EQ(ctrl->caretOffset(), disk->GetSize() - 1);
}

TEST_F(EditorCtrlInput, UnicodeColumnMovesByPairsOnEvenColumns)
{
    ctrl->setColumns(Metrics::PaneOffset | Metrics::PaneAscii | Metrics::PaneUnicode);
    ctrl->setCaretPane(Metrics::PaneUnicode);
    ctrl->setCaretOffset(5);
    EXPECT_EQ(ctrl->caret().column, 4);
    key(Qt::Key_Right);
    EXPECT_EQ(ctrl->caretOffset(), 6u);
    key(Qt::Key_Left);
    key(Qt::Key_Left);
    EXPECT_EQ(ctrl->caretOffset(), 2u);
    ctrl->setCaretOffset(16);
    key(Qt::Key_Left);
    EXPECT_EQ(ctrl->caretOffset(), 14u);
    // Shift selects one byte more in the Unicode column: both bytes of the last pair.
    key(Qt::Key_Right, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->selection(), (DiskArea{14, 4}));
}

TEST_F(EditorCtrlInput, HidingTheCaretsColumnMovesItToHex)
{
    ctrl->setCaretPane(Metrics::PaneAscii);
    EXPECT_EQ(ctrl->caret().pane, Metrics::PaneAscii);
    ctrl->setCaretOffset(40);
    ctrl->setColumns(Metrics::PaneOffset);
    EXPECT_EQ(ctrl->caret().pane, Metrics::PaneHex);
    EXPECT_EQ(ctrl->caretOffset(), 40u);
}

TEST_F(EditorCtrlInput, HomeEndAndCtrlVariants)
{
    ctrl->setCaretOffset(37);
    key(Qt::Key_Home);
    EXPECT_EQ(ctrl->caretOffset(), 32u);
    key(Qt::Key_End);
    EXPECT_EQ(ctrl->caretOffset(), 47u);
    key(Qt::Key_End, Qt::ControlModifier);
    EXPECT_EQ(ctrl->caretOffset(), disk->GetSize() - 1);
    EXPECT_EQ(ctrl->topLine(), ctrl->maxTopLine());
    key(Qt::Key_Home, Qt::ControlModifier);
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    EXPECT_EQ(ctrl->topLine(), 0u);
}

TEST_F(EditorCtrlInput, ShiftEndOnTheFirstLineSelectsToTheEndOfTheLine)
{
    ctrl->setCaretOffset(3);
    key(Qt::Key_End, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->selection(), (DiskArea{3, 13}));
    // Continued Shift moves keep the anchor; a key without Shift clears it but keeps the selection.
    key(Qt::Key_Down, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->selection(), (DiskArea{3, 29}));
    key(Qt::Key_Left);
    EXPECT_EQ(ctrl->anchor(), EditorCtrl::NoAnchor);
    EXPECT_EQ(ctrl->selection(), (DiskArea{3, 29}));
}

TEST_F(EditorCtrlInput, ShiftInHexStepsWholeBytes)
{
    QSignalSpy spy(ctrl.get(), &EditorCtrl::selectionChanged);
    ctrl->setCaretOffset(10);
    key(Qt::Key_Right, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->caretOffset(), 11u);
    EXPECT_EQ(ctrl->selection(), (DiskArea{10, 2}));
    key(Qt::Key_Left, Qt::ShiftModifier);
    key(Qt::Key_Left, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->selection(), (DiskArea{9, 2}));
    ASSERT_FALSE(spy.isEmpty());
    EXPECT_EQ(spy.last().at(1).toUInt(), 512u);
}

TEST_F(EditorCtrlInput, PagesAndCtrlArrowsScroll)
{
    const uint64_t page = uint64_t(ctrl->fullyVisibleLines());
    key(Qt::Key_PageDown);
    EXPECT_EQ(ctrl->caret().line, page);
    EXPECT_EQ(ctrl->topLine(), page);
    ctrl->setPageCount(2);
    key(Qt::Key_PageDown);
    EXPECT_EQ(ctrl->caret().line, 3 * page);
    key(Qt::Key_PageUp);
    key(Qt::Key_PageUp);
    EXPECT_EQ(ctrl->caret().line, 0u);
    EXPECT_EQ(ctrl->topLine(), 0u);

    ctrl->setCaretOffset(16 * 5);
    key(Qt::Key_Down, Qt::ControlModifier);
    key(Qt::Key_Down, Qt::ControlModifier);
    EXPECT_EQ(ctrl->topLine(), 2u);
    EXPECT_EQ(ctrl->caretOffset(), 80u);
    key(Qt::Key_Down);
    EXPECT_EQ(ctrl->caretOffset(), 96u);
    key(Qt::Key_Up);
    key(Qt::Key_Up);
    EXPECT_EQ(ctrl->caretOffset(), 64u);
}

TEST_F(EditorCtrlInput, ClickPlacesCaretAndOffsetColumnTogglesHex)
{
    QSignalSpy state(ctrl.get(), &EditorCtrl::stateChanged);
    QSignalSpy moved(ctrl.get(), &EditorCtrl::cursorMoved);
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(16 * 3 + 5, Metrics::PaneHex, 1));
    EXPECT_EQ(ctrl->caretOffset(), 53u);
    EXPECT_EQ(ctrl->caret().nibble, 1);
    ASSERT_FALSE(moved.isEmpty());
    EXPECT_EQ(moved.last().at(0).value<Metrics::Caret>().offset(), 53u);
    EXPECT_EQ(moved.last().at(0).value<Metrics::Caret>().snapshot, disk->bytes(53, 8));

    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(16 + 2, Metrics::PaneAscii));
    EXPECT_EQ(ctrl->caretOffset(), 18u);
    EXPECT_EQ(ctrl->caret().pane, Metrics::PaneAscii);

    const QPoint inOffset(ctrl->column(Metrics::PaneOffset)->x + 10, ctrl->lineY(4) + 2);
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, {}, inOffset);
    EXPECT_TRUE(ctrl->hexOffset());
    EXPECT_EQ(ctrl->caretOffset(), 18u);
    ASSERT_FALSE(state.isEmpty());
    EXPECT_TRUE(state.last().at(0).toBool());

    // Shift+click extends from the caret.
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, Qt::ShiftModifier, cellPoint(40, Metrics::PaneAscii));
    EXPECT_EQ(ctrl->selection(), (DiskArea{18, 23}));
}

TEST_F(EditorCtrlInput, DragSelectsAndDoubleClickSelectsTheSector)
{
    QTest::mousePress(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(20));
    QMouseEvent move(QEvent::MouseMove, cellPoint(70), ctrl->viewport()->mapToGlobal(cellPoint(70)),
                     Qt::NoButton, Qt::LeftButton, Qt::NoModifier);
    QCoreApplication::sendEvent(ctrl->viewport(), &move);
    QTest::mouseRelease(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(70));
    EXPECT_EQ(ctrl->selection(), (DiskArea{20, 51}));
    EXPECT_EQ(ctrl->caretOffset(), 70u);
    EXPECT_EQ(ctrl->anchor(), EditorCtrl::NoAnchor);

    ctrl->setCaretOffset(600);
    QTest::mouseDClick(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(600));
    EXPECT_EQ(ctrl->selection(), (DiskArea{512, 512}));
}

TEST_F(EditorCtrlInput, DragBelowTheViewAutoScrolls)
{
    QTest::mousePress(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(4));
    const QPoint below(cellPoint(4).x(), ctrl->viewport()->height() + 25);
    QMouseEvent move(QEvent::MouseMove, below, ctrl->viewport()->mapToGlobal(below), Qt::NoButton,
                     Qt::LeftButton, Qt::NoModifier);
    QCoreApplication::sendEvent(ctrl->viewport(), &move);
    QTest::qWait(EditorCtrl::AutoScrollInterval * 4);
    // Each tick scrolls (25 + 9) / 10 = 3 lines.
    EXPECT_GE(ctrl->topLine(), 3u);
    EXPECT_EQ(ctrl->topLine() % 3, 0u);
    const DiskArea sel = ctrl->selection();
    EXPECT_EQ(sel.offset, 4u);
    EXPECT_GT(sel.end(), (ctrl->topLine() + uint64_t(ctrl->fullyVisibleLines()) - 1) * 16);
    QTest::mouseRelease(ctrl->viewport(), Qt::LeftButton, {}, below);
    const uint64_t top = ctrl->topLine();
    QTest::qWait(EditorCtrl::AutoScrollInterval * 2);
    EXPECT_EQ(ctrl->topLine(), top); // the timer stopped
    EXPECT_EQ(ctrl->caretOffset(), ctrl->selection().end() - 1);
}

TEST_F(EditorCtrlInput, WheelScrollsLinesStepsAndPages)
{
    auto wheel = [&](int delta, Qt::KeyboardModifiers mods) {
        const QPointF pos(50, 50);
        QWheelEvent e(pos, ctrl->viewport()->mapToGlobal(pos), QPoint(), QPoint(0, delta), Qt::NoButton, mods,
                      Qt::NoScrollPhase, false);
        QCoreApplication::sendEvent(ctrl->viewport(), &e);
    };
    wheel(-120, Qt::NoModifier);
    EXPECT_EQ(ctrl->topLine(), 3u);
    wheel(-120, Qt::ShiftModifier);
    EXPECT_EQ(ctrl->topLine(), 4u);
    wheel(-120, Qt::ControlModifier);
    EXPECT_EQ(ctrl->topLine(), 4u + uint64_t(ctrl->fullyVisibleLines()));
    wheel(240, Qt::NoModifier);
    EXPECT_EQ(ctrl->topLine(), uint64_t(ctrl->fullyVisibleLines()) - 2);
    EXPECT_EQ(ctrl->verticalScrollBar()->value(), int(ctrl->topLine()));
}

TEST_F(EditorCtrlInput, JumpsOf1025BytesOrMoreGoToTheHistory)
{
    open(); // a fresh control: the first report is recorded
    QSignalSpy jumps(ctrl.get(), &EditorCtrl::jumpRecorded);
    ctrl->setCaretOffset(1024);
    EXPECT_EQ(jumps.size(), 0);
    ctrl->setCaretOffset(1024 + 1025);
    ASSERT_EQ(jumps.size(), 1);
    EXPECT_EQ(jumps.last().at(0).toULongLong(), 2049u);
    EXPECT_EQ(jumps.last().at(1).toInt(), 0);
    key(Qt::Key_Right);
    EXPECT_EQ(jumps.size(), 1);
    ctrl->setCurrentTemplate(1, 8192);
    ctrl->setCaretOffset(8192);
    ASSERT_EQ(jumps.size(), 2);
    EXPECT_EQ(jumps.last().at(1).toInt(), 1);
}

TEST_F(EditorCtrlInput, NoStorageIgnoresInput)
{
    ctrl->setStorage(nullptr);
    key(Qt::Key_Right);
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, {}, QPoint(100, 100));
    EXPECT_EQ(ctrl->caretOffset(), 0u);
    EXPECT_FALSE(ctrl->grab().isNull());
}
