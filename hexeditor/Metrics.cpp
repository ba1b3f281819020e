#include "hexeditor/Metrics.h"

#include <QFontDatabase>
#include <QFontInfo>
#include <QFontMetrics>
#include <QFontMetricsF>

#include <algorithm>
#include <cmath>

namespace HexEditor {

namespace {

// Cells of padding before the first glyph of a column, and after the last one (the hexadecimal
// column's last byte brings its own trailing blank).
constexpr int LeadCells = 1;

int digitsOf(uint64_t value, unsigned base)
{
    int n = 1;
    while (value >= base) {
        value /= base;
        ++n;
    }
    return n;
}

} // namespace

Metrics::Metrics() : m_fontFamily(defaultFontFamily())
{
    static const int registered = qRegisterMetaType<Caret>("HexEditor::Metrics::Caret");
    Q_UNUSED(registered);
    m_font = resolveFont(m_fontFamily, m_fontSize);
    relayout();
}

QFont Metrics::resolveFont(const QString &family, int pointSize)
{
    if (pointSize <= 0)
        pointSize = DefaultFontSize;
    QFont font;
    if (!family.isEmpty() && QFontDatabase::families().contains(family) &&
        QFontDatabase::isFixedPitch(family)) {
        font = QFont(family, pointSize);
    } else {
        font = QFontDatabase::systemFont(QFontDatabase::FixedFont);
        font.setPointSize(pointSize);
    }
    font.setStyleHint(QFont::TypeWriter);
    font.setKerning(false);
    font.setHintingPreference(QFont::PreferFullHinting);
    // Every glyph advances by a whole number of pixels, so a line of text can be drawn in one call
    // and its characters still stand exactly on their cells.
    const qreal advance = QFontMetricsF(font).horizontalAdvance(QLatin1Char('0'));
    const qreal cell = std::max<qreal>(1.0, std::ceil(advance - 0.01));
    if (cell - advance > 0.001)
        font.setLetterSpacing(QFont::AbsoluteSpacing, cell - advance);
    return font;
}

void Metrics::setMetricsFont(const QString &family, int pointSize)
{
    m_fontFamily = family.isEmpty() ? defaultFontFamily() : family;
    m_fontSize = pointSize > 0 ? pointSize : DefaultFontSize;
    m_font = resolveFont(m_fontFamily, m_fontSize);
    relayout();
}

void Metrics::setMetricsBytesPerLine(uint32_t n)
{
    if (!isAllowedBytesPerLine(n))
        n = DefaultBytesPerLine;
    if (n == m_bytesPerLine)
        return;
    // Keep the byte at the top of the view where it was.
    const uint64_t topOffset = m_topLine * m_bytesPerLine;
    m_bytesPerLine = n;
    m_topLine = topOffset / n;
    relayout();
    setTopLine(m_topLine);
}

void Metrics::setMetricsColumns(uint32_t mask)
{
    m_columns = (mask & (PaneAscii | PaneUnicode | PaneOffset)) | PaneHex;
    relayout();
}

void Metrics::setMetricsGroup(uint32_t n)
{
    m_group = isAllowedGroup(n) ? n : DefaultGroup;
    relayout();
}

void Metrics::setMetricsHexOffset(bool on)
{
    m_hexOffset = on;
}

void Metrics::setDataSize(uint64_t size, uint32_t sectorSize)
{
    m_size = size;
    m_sectorSize = sectorSize ? sectorSize : 512;
    m_offsetDigits = offsetDigitsFor(size);
    relayout();
    setTopLine(m_topLine);
}

int Metrics::offsetDigitsFor(uint64_t size)
{
    return std::max({8, digitsOf(size, 10), digitsOf(size, 16)});
}

QString Metrics::formatOffset(uint64_t offset) const
{
    if (m_hexOffset)
        return QStringLiteral("%1").arg(offset, m_offsetDigits, 16, QLatin1Char('0')).toUpper();
    return QStringLiteral("%1").arg(offset, m_offsetDigits, 10, QLatin1Char('0'));
}

uint64_t Metrics::lineCount() const
{
    return m_size / m_bytesPerLine + (m_size % m_bytesPerLine ? 1 : 0);
}

void Metrics::relayout()
{
    const QFontMetrics fm(m_font);
    m_cellWidth = std::max(1, fm.horizontalAdvance(QLatin1Char('0')));
    m_ascent = fm.ascent();
    m_rowHeight = fm.ascent() + fm.descent() + LineSpacing;

    m_layout.clear();
    int x = 0;
    auto add = [&](Pane pane, int cells) {
        m_layout.append({pane, x, cells * m_cellWidth});
        x += cells * m_cellWidth + 1; // the separator line
    };
    if (m_columns & PaneOffset)
        add(PaneOffset, LeadCells + m_offsetDigits + 1);
    add(PaneHex, LeadCells + hexCell(m_bytesPerLine - 1, 0) + 3);
    if (m_columns & PaneAscii)
        add(PaneAscii, LeadCells + int(m_bytesPerLine) + 1);
    if (m_columns & PaneUnicode)
        add(PaneUnicode, LeadCells + int(m_bytesPerLine) + 1);
    setViewportHeight(m_viewportHeight);
    layoutChanged();
}

const Metrics::Column *Metrics::column(Pane pane) const
{
    for (const Column &c : m_layout)
        if (c.pane == pane)
            return &c;
    return nullptr;
}

bool Metrics::isShown(Pane pane) const
{
    return column(pane) != nullptr;
}

int Metrics::totalWidth() const
{
    return m_layout.isEmpty() ? 0 : m_layout.last().x + m_layout.last().width + 1;
}

int Metrics::hexCell(uint32_t byteIndex, int nibble) const
{
    const int gaps = m_group ? 2 * int(byteIndex / m_group) : 0;
    return 3 * int(byteIndex) + gaps + (nibble ? 1 : 0);
}

int Metrics::byteX(Pane pane, uint32_t byteIndex, int nibble) const
{
    const Column *c = column(pane);
    if (!c)
        return -1;
    const int base = c->x + LeadCells * m_cellWidth;
    switch (pane) {
    case PaneHex:
        return base + hexCell(byteIndex, nibble) * m_cellWidth;
    case PaneAscii:
        return base + int(byteIndex) * m_cellWidth;
    case PaneUnicode:
        return base + int(byteIndex & ~1u) * m_cellWidth;
    default:
        return -1;
    }
}

int Metrics::byteLeft(Pane pane, uint32_t byteIndex) const
{
    const int x = byteX(pane, byteIndex, 0);
    return pane == PaneHex ? x - 2 : x;
}

int Metrics::byteRight(Pane pane, uint32_t byteIndex) const
{
    switch (pane) {
    case PaneHex:
        return byteX(pane, byteIndex, 1) + m_cellWidth + 2;
    case PaneUnicode:
        return byteX(pane, byteIndex, 0) + 2 * m_cellWidth;
    default:
        return byteX(pane, byteIndex, 0) + m_cellWidth;
    }
}

int Metrics::lineY(uint64_t line) const
{
    const int64_t rel = int64_t(line) - int64_t(m_topLine);
    return headerHeight() + int(rel) * m_rowHeight;
}

void Metrics::setViewportHeight(int pixels)
{
    m_viewportHeight = std::max(0, pixels);
    const int data = m_viewportHeight - headerHeight();
    m_visibleLines = data > 0 ? (data + m_rowHeight - 1) / m_rowHeight : 0;
}

int Metrics::fullyVisibleLines() const
{
    const int data = m_viewportHeight - headerHeight();
    return std::max(1, data / m_rowHeight);
}

uint64_t Metrics::maxTopLine() const
{
    const uint64_t lines = lineCount();
    const uint64_t visible = uint64_t(fullyVisibleLines());
    return lines > visible ? lines - visible : 0;
}

bool Metrics::setTopLine(uint64_t line)
{
    line = std::min(line, maxTopLine());
    if (line == m_topLine)
        return false;
    m_topLine = line;
    return true;
}

bool Metrics::scrollBy(int64_t lines)
{
    if (lines < 0) {
        const uint64_t back = uint64_t(-(lines + 1)) + 1;
        return setTopLine(back > m_topLine ? 0 : m_topLine - back);
    }
    const uint64_t fwd = uint64_t(lines);
    return setTopLine(fwd > UINT64_MAX - m_topLine ? UINT64_MAX : m_topLine + fwd);
}

bool Metrics::scrollIntoView(uint64_t line)
{
    if (line < m_topLine)
        return setTopLine(line);
    const uint64_t visible = uint64_t(fullyVisibleLines());
    if (line >= m_topLine + visible)
        return setTopLine(line - visible + 1);
    return false;
}

double Metrics::scrollScale() const
{
    const uint64_t top = maxTopLine();
    if (top <= uint64_t(ScrollRange))
        return 1.0;
    return double(top) / double(ScrollRange);
}

int Metrics::scrollMaximum() const
{
    const uint64_t top = maxTopLine();
    return top <= uint64_t(ScrollRange) ? int(top) : ScrollRange;
}

int Metrics::scrollValue() const
{
    const uint64_t top = maxTopLine();
    if (top <= uint64_t(ScrollRange))
        return int(m_topLine);
    if (m_topLine >= top)
        return ScrollRange;
    const double v = double(m_topLine) / scrollScale();
    return std::clamp(int(std::llround(v)), 0, ScrollRange);
}

uint64_t Metrics::topLineForScrollValue(int value) const
{
    const uint64_t top = maxTopLine();
    if (value <= 0)
        return 0;
    if (top <= uint64_t(ScrollRange))
        return std::min<uint64_t>(uint64_t(value), top);
    if (value >= ScrollRange)
        return top;
    const double line = double(value) * scrollScale();
    return std::min<uint64_t>(uint64_t(std::llround(line)), top);
}

Metrics::Hit Metrics::hitTest(int x, int y) const
{
    Hit hit;
    if (y < headerHeight()) {
        hit.header = true;
        return hit;
    }
    const uint64_t rel = uint64_t((y - headerHeight()) / m_rowHeight);
    hit.line = m_topLine + rel;
    for (const Column &c : m_layout) {
        if (x < c.x || x > c.x + c.width)
            continue;
        hit.pane = c.pane;
        hit.valid = true;
        if (c.pane == PaneOffset)
            return hit;
        const int cell = (x - c.x) / m_cellWidth - LeadCells;
        if (c.pane == PaneHex) {
            uint32_t index = 0;
            for (uint32_t i = 0; i < m_bytesPerLine; ++i) {
                if (hexCell(i, 0) <= cell)
                    index = i;
                else
                    break;
            }
            hit.column = uint8_t(index);
            hit.nibble = cell - hexCell(index, 0) >= 1 ? 1 : 0;
        } else {
            const int index = std::clamp(cell, 0, int(m_bytesPerLine) - 1);
            hit.column = uint8_t(c.pane == PaneUnicode ? index & ~1 : index);
        }
        return hit;
    }
    return hit;
}

Metrics::Caret Metrics::caretAt(uint64_t offset, int32_t pane, int32_t nibble) const
{
    Caret c;
    c.bytesPerLine = m_bytesPerLine;
    c.sectorSize = m_sectorSize;
    c.line = offset / m_bytesPerLine;
    c.column = uint8_t(offset % m_bytesPerLine);
    if (pane == PaneUnicode)
        c.column &= uint8_t(~1u);
    c.pane = pane;
    c.nibble = pane == PaneHex ? nibble : 0;
    return c;
}

} // namespace HexEditor
