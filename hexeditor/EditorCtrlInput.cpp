// Keyboard and mouse input of the editor control: caret moves, selections, auto-scroll and wheel.
#include "hexeditor/EditorCtrl.h"

#include <QKeyEvent>
#include <QMouseEvent>
#include <QScrollBar>
#include <QWheelEvent>

#include <algorithm>

#include "hexeditor/Paint.h"
#include "hexeditor/Storage.h"

namespace HexEditor {

void EditorCtrl::moveLeft()
{
    const uint64_t offset = caretOffset();
    if (m_caret.pane == PaneHex && m_caret.nibble == 1) {
        placeCaret(offset, PaneHex, 0);
        return;
    }
    const uint64_t step = m_caret.pane == PaneUnicode ? 2 : 1;
    if (offset == 0) {
        placeCaret(0, m_caret.pane, m_caret.pane == PaneHex ? 0 : 0);
        return;
    }
    const uint64_t target = offset >= step ? offset - step : 0;
    placeCaret(target, m_caret.pane, m_caret.pane == PaneHex ? 1 : 0);
}

void EditorCtrl::moveRight()
{
    const uint64_t offset = caretOffset();
    if (m_caret.pane == PaneHex && m_caret.nibble == 0) {
        placeCaret(offset, PaneHex, 1);
        return;
    }
    const uint64_t step = m_caret.pane == PaneUnicode ? 2 : 1;
    if (offset + step > lastOffset()) {
        // At the last byte of the data the caret stays.
        placeCaret(offset, m_caret.pane, m_caret.nibble);
        return;
    }
    placeCaret(offset + step, m_caret.pane, 0);
}

void EditorCtrl::moveLines(int64_t lines)
{
    const uint64_t lineCount = this->lineCount();
    if (lineCount == 0)
        return;
    uint64_t line = m_caret.line;
    if (lines < 0) {
        const uint64_t back = uint64_t(-(lines + 1)) + 1;
        line = back > line ? 0 : line - back;
    } else {
        const uint64_t fwd = uint64_t(lines);
        line = fwd > lineCount - 1 - std::min(line, lineCount - 1) ? lineCount - 1 : line + fwd;
    }
    uint64_t offset = line * bytesPerLine() + m_caret.column;
    placeCaret(std::min(offset, lastOffset()), m_caret.pane, m_caret.nibble);
}

bool EditorCtrl::moveKey(QKeyEvent *event)
{
    const bool ctrl = event->modifiers() & Qt::ControlModifier;
    const uint64_t bpl = bytesPerLine();
    switch (event->key()) {
    case Qt::Key_Left:
        moveLeft();
        return true;
    case Qt::Key_Right:
        moveRight();
        return true;
    case Qt::Key_Up:
    case Qt::Key_Down: {
        const int64_t dir = event->key() == Qt::Key_Up ? -1 : 1;
        if (ctrl) {
            if (scrollBy(dir)) {
                m_painter->invalidate();
                syncScrollBars();
                viewport()->update();
            }
            return true;
        }
        moveLines(dir);
        return true;
    }
    case Qt::Key_PageUp:
    case Qt::Key_PageDown: {
        const int64_t dir = event->key() == Qt::Key_PageUp ? -1 : 1;
        // The view scrolls one page; the caret moves by the pages setting.
        const int64_t page = std::max(1, fullyVisibleLines());
        if (scrollBy(dir * page))
            m_painter->invalidate();
        moveLines(dir * page * int64_t(pageCount()));
        syncScrollBars();
        return true;
    }
    case Qt::Key_Home:
        placeCaret(ctrl ? 0 : m_caret.line * bpl, m_caret.pane, 0);
        return true;
    case Qt::Key_End: {
        uint64_t target = ctrl ? lastOffset() : std::min(m_caret.line * bpl + bpl - 1, lastOffset());
        placeCaret(target, m_caret.pane, 0);
        return true;
    }
    default:
        return false;
    }
}

void EditorCtrl::keyPressEvent(QKeyEvent *event)
{
    if (event->key() == Qt::Key_Tab && (event->modifiers() & Qt::ControlModifier)) {
        event->ignore(); // Ctrl+Tab belongs to the parent
        return;
    }
    if (!m_storage || dataSize() == 0) {
        event->ignore();
        return;
    }
    const bool shift = event->modifiers() & Qt::ShiftModifier;
    const bool isMove = event->key() == Qt::Key_Left || event->key() == Qt::Key_Right ||
                        event->key() == Qt::Key_Up || event->key() == Qt::Key_Down ||
                        event->key() == Qt::Key_PageUp || event->key() == Qt::Key_PageDown ||
                        event->key() == Qt::Key_Home || event->key() == Qt::Key_End;
    if (isMove) {
        const bool scrollOnly = (event->modifiers() & Qt::ControlModifier) &&
                                (event->key() == Qt::Key_Up || event->key() == Qt::Key_Down);
        if (shift && !scrollOnly) {
            if (m_anchor == NoAnchor)
                m_anchor = caretOffset();
            // A Shift move in the hexadecimal column steps whole bytes: the nibble move first.
            if (m_caret.pane == PaneHex) {
                if (event->key() == Qt::Key_Left && m_caret.nibble == 1)
                    moveLeft();
                else if (event->key() == Qt::Key_Right && m_caret.nibble == 0)
                    moveRight();
            }
            moveKey(event);
            extendSelectionTo(caretOffset());
        } else {
            if (!scrollOnly)
                m_anchor = NoAnchor;
            moveKey(event);
        }
        event->accept();
        return;
    }
    if (event->key() == Qt::Key_Shift || event->key() == Qt::Key_Control || event->key() == Qt::Key_Alt ||
        event->key() == Qt::Key_Meta) {
        QAbstractScrollArea::keyPressEvent(event);
        return;
    }
    m_anchor = NoAnchor;
    if (event->key() == Qt::Key_Delete && event->modifiers() == Qt::NoModifier) {
        if (m_editable)
            deleteSelection();
        event->accept();
        return;
    }
    if (typeKey(event)) {
        event->accept();
        return;
    }
    QAbstractScrollArea::keyPressEvent(event);
}

// --- mouse -----------------------------------------------------------------------------------------------

EditorCtrl::Hit EditorCtrl::hitAt(const QPoint &pos) const
{
    Hit hit = hitTest(pos.x() + horizontalScrollBar()->value(), pos.y());
    if (hit.valid && hit.line >= lineCount())
        hit.valid = false;
    return hit;
}

uint64_t EditorCtrl::hitOffset(const Hit &hit) const
{
    const uint64_t offset = hit.line * bytesPerLine() + hit.column;
    return std::min(offset, lastOffset());
}

void EditorCtrl::mousePressEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton || !m_storage || dataSize() == 0) {
        QAbstractScrollArea::mousePressEvent(event);
        return;
    }
    setFocus(Qt::MouseFocusReason);
    const Hit hit = hitAt(event->position().toPoint());
    if (!hit.valid || hit.header)
        return;
    if (hit.pane == PaneOffset) {
        setHexOffset(!hexOffset());
        return;
    }
    const uint64_t offset = hitOffset(hit);
    const bool shift = event->modifiers() & Qt::ShiftModifier;
    // Set first: the caret placed under the pointer keeps the view where it is.
    m_mouseSelecting = true;
    if (shift) {
        if (m_anchor == NoAnchor)
            m_anchor = caretOffset();
        placeCaret(offset, hit.pane, hit.nibble);
        extendSelectionTo(offset);
    } else {
        m_anchor = offset;
        placeCaret(offset, hit.pane, hit.nibble);
    }
    for (const TemplateArea &t : m_coloring) {
        if (t.field >= 0 && t.area.contains(offset)) {
            emit templateFieldClicked(t.field, offset);
            break;
        }
    }
}

void EditorCtrl::mouseMoveEvent(QMouseEvent *event)
{
    if (!(event->buttons() & Qt::LeftButton) || m_anchor == NoAnchor || !m_storage) {
        QAbstractScrollArea::mouseMoveEvent(event);
        return;
    }
    m_lastMousePos = event->position().toPoint();
    const int y = m_lastMousePos.y();
    if (y < headerHeight() || y >= viewport()->height()) {
        if (!m_autoScrollTimer)
            m_autoScrollTimer = startTimer(AutoScrollInterval);
        return;
    }
    stopAutoScroll();
    const Hit hit = hitAt(m_lastMousePos);
    if (hit.valid && hit.pane != PaneOffset)
        extendSelectionTo(hitOffset(hit));
}

void EditorCtrl::autoScrollTick()
{
    if (!m_storage || m_anchor == NoAnchor) {
        stopAutoScroll();
        return;
    }
    const int y = m_lastMousePos.y();
    int64_t lines = 0;
    if (y < headerHeight())
        lines = -int64_t((headerHeight() - y + 9) / 10);
    else if (y >= viewport()->height())
        lines = int64_t((y - viewport()->height() + 9) / 10);
    if (lines && scrollBy(lines)) {
        m_painter->invalidate();
        syncScrollBars();
    }
    // Extend to the byte under the pointer, clamped into the visible lines.
    const int clampedY = std::clamp(y, headerHeight(), std::max(headerHeight(), viewport()->height() - 1));
    Hit hit = hitAt(QPoint(m_lastMousePos.x(), clampedY));
    if (!hit.valid || hit.pane == PaneOffset) {
        hit.line =
            std::min(topLine() + uint64_t(y < headerHeight() ? 0 : std::max(0, fullyVisibleLines() - 1)),
                     lineCount() ? lineCount() - 1 : 0);
        hit.column = uint8_t(y < headerHeight() ? 0 : bytesPerLine() - 1);
    }
    extendSelectionTo(hitOffset(hit));
    viewport()->update();
}

void EditorCtrl::stopAutoScroll()
{
    if (m_autoScrollTimer) {
        killTimer(m_autoScrollTimer);
        m_autoScrollTimer = 0;
    }
}

void EditorCtrl::timerEvent(QTimerEvent *event)
{
    if (event->timerId() == m_autoScrollTimer) {
        autoScrollTick();
        return;
    }
    QAbstractScrollArea::timerEvent(event);
}

void EditorCtrl::mouseReleaseEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton || !m_storage) {
        QAbstractScrollArea::mouseReleaseEvent(event);
        return;
    }
    stopAutoScroll();
    if (m_mouseSelecting && m_anchor != NoAnchor) {
        const Hit hit = hitAt(event->position().toPoint());
        const int y = event->position().toPoint().y();
        const bool inside =
            hit.valid && hit.pane != PaneOffset && y >= headerHeight() && y < viewport()->height();
        if (inside) {
            placeCaret(hitOffset(hit), hit.pane, hit.nibble);
        } else if (selection().length) {
            placeCaret(selection().end() - 1, m_caret.pane, 0);
        }
    }
    m_mouseSelecting = false;
    m_anchor = NoAnchor;
}

void EditorCtrl::mouseDoubleClickEvent(QMouseEvent *event)
{
    if (event->button() != Qt::LeftButton || !m_storage || dataSize() == 0)
        return;
    const Hit hit = hitAt(event->position().toPoint());
    if (!hit.valid || hit.header || hit.pane == PaneOffset)
        return;
    const uint64_t offset = hitOffset(hit);
    for (const TemplateArea &t : m_coloring) {
        if (t.field >= 0 && t.area.contains(offset)) {
            setSelection(t.area);
            return;
        }
    }
    if (m_outline.length && m_outline.contains(offset)) {
        setSelection(m_outline);
        return;
    }
    const uint64_t ss = sectorSize();
    setSelection({offset / ss * ss, ss});
}

void EditorCtrl::wheelEvent(QWheelEvent *event)
{
    const int delta = event->angleDelta().y();
    if (delta == 0 || !m_storage) {
        event->ignore();
        return;
    }
    const int steps = std::max(1, std::abs(delta) / 120);
    int64_t perStep = wheelLines();
    if (event->modifiers() & Qt::ShiftModifier)
        perStep = 1;
    else if (event->modifiers() & Qt::ControlModifier)
        perStep = std::max(1, fullyVisibleLines());
    const int64_t lines = (delta > 0 ? -1 : 1) * perStep * steps;
    if (scrollBy(lines)) {
        m_painter->invalidate();
        syncScrollBars();
        viewport()->update();
    }
    event->accept();
}

} // namespace HexEditor
