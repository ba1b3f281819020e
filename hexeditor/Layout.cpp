#include "hexeditor/Layout.h"

#include <algorithm>

namespace HexEditor::Layout {

QPolygon rangeOutline(const Metrics &m, Metrics::Pane pane, const DiskArea &area)
{
    if (area.length == 0 || !m.isShown(pane))
        return {};
    const uint32_t bpl = m.bytesPerLine();
    const uint64_t last = area.end() - 1;
    uint64_t firstLine = area.offset / bpl;
    uint64_t lastLine = last / bpl;
    uint32_t firstCol = uint32_t(area.offset % bpl);
    uint32_t lastCol = uint32_t(last % bpl);
    if (pane == Metrics::PaneUnicode) {
        firstCol &= ~1u;
        lastCol |= 1u;
        lastCol = std::min(lastCol, bpl - 1);
    }

    // Cut to one line above and below the view, so the coordinates stay small.
    const uint64_t top = m.topLine();
    const uint64_t viewFirst = top > 0 ? top - 1 : 0;
    const uint64_t viewLast = top + uint64_t(m.visibleLines()) + 1;
    if (lastLine < viewFirst || firstLine > viewLast)
        return {};
    if (firstLine < viewFirst) {
        firstLine = viewFirst;
        firstCol = 0;
    }
    if (lastLine > viewLast) {
        lastLine = viewLast;
        lastCol = bpl - 1;
    }

    const int left = m.byteLeft(pane, 0);
    const int right = m.byteRight(pane, bpl - 1);
    const int startX = m.byteLeft(pane, firstCol);
    const int endX = m.byteRight(pane, lastCol);
    const int t1 = m.lineY(firstLine);
    const int b1 = t1 + m.rowHeight();
    const int b2 = m.lineY(lastLine) + m.rowHeight();

    QPolygon poly;
    if (firstLine == lastLine) {
        poly << QPoint(startX, t1) << QPoint(endX, t1) << QPoint(endX, b2) << QPoint(startX, b2);
        return poly;
    }
    const int bEnd = b2 - m.rowHeight(); // top of the last line
    poly << QPoint(startX, t1) << QPoint(right, t1) << QPoint(right, bEnd) << QPoint(endX, bEnd)
         << QPoint(endX, b2) << QPoint(left, b2) << QPoint(left, b1) << QPoint(startX, b1);
    return poly;
}

QPainterPath rangePath(const Metrics &m, Metrics::Pane pane, const DiskArea &area)
{
    QPainterPath path;
    const QPolygon poly = rangeOutline(m, pane, area);
    if (!poly.isEmpty()) {
        path.addPolygon(poly);
        path.closeSubpath();
    }
    return path;
}

QString hexHeader(const Metrics &m)
{
    const uint32_t bpl = m.bytesPerLine();
    QString s(m.hexCell(bpl - 1, 0) + 3, QLatin1Char(' '));
    for (uint32_t i = 0; i < bpl; ++i) {
        const QString idx = m.hexOffset() ? QStringLiteral("%1").arg(i, 2, 16, QLatin1Char('0')).toUpper()
                                          : QStringLiteral("%1").arg(i, 2, 10, QLatin1Char('0'));
        const int at = m.hexCell(i, 0);
        for (int k = 0; k < idx.size() && at + k < s.size(); ++k)
            s[at + k] = idx[k];
    }
    return s;
}

QString hexLine(const Metrics &m, const QByteArray &bytes)
{
    static const char digits[] = "0123456789ABCDEF";
    const uint32_t bpl = m.bytesPerLine();
    QString s(m.hexCell(bpl - 1, 0) + 2, QLatin1Char(' '));
    const int n = std::min<int>(bytes.size(), int(bpl));
    for (int i = 0; i < n; ++i) {
        const uint8_t b = uint8_t(bytes[i]);
        const int at = m.hexCell(uint32_t(i), 0);
        s[at] = QLatin1Char(digits[b >> 4]);
        s[at + 1] = QLatin1Char(digits[b & 15]);
    }
    return s;
}

QChar asciiChar(uint8_t byte)
{
    if (byte < 32 || (byte >= 0x7F && byte < 0xA0) || byte == 0xAD)
        return QLatin1Char('.');
    return QChar(char16_t(byte));
}

QChar unicodeChar(uint16_t unit)
{
    const QChar ch(unit);
    if (unit < 32 || ch.isSurrogate() || !ch.isPrint())
        return QLatin1Char('.');
    return ch;
}

QString asciiLine(const QByteArray &bytes)
{
    QString s(bytes.size(), QLatin1Char(' '));
    for (int i = 0; i < bytes.size(); ++i)
        s[i] = asciiChar(uint8_t(bytes[i]));
    return s;
}

QString unicodeLine(const QByteArray &bytes)
{
    QString s;
    s.reserve(bytes.size());
    for (int i = 0; i + 1 < bytes.size(); i += 2) {
        const uint16_t unit = uint16_t(uint8_t(bytes[i]) | (uint8_t(bytes[i + 1]) << 8));
        // Each code unit takes two cells: the character and a blank.
        s += unicodeChar(unit);
        s += QLatin1Char(' ');
    }
    return s;
}

} // namespace HexEditor::Layout
