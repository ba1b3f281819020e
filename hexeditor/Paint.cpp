#include "hexeditor/Paint.h"

#include <QLinearGradient>
#include <QPainter>

#include <algorithm>
#include <vector>

#include "hexeditor/Layout.h"
#include "hexeditor/Storage.h"

namespace HexEditor {

namespace {

// Foreground classes of a byte, in rising priority.
enum Ink : uint8_t {
    InkText = 0,
    InkTemplate0 = 1,
    InkLink = 1 + 16,
    InkGhosted,
    InkSearched,
    InkModified,
    InkUnreadable
};

// Black or white, whichever stands out on the colour.
QColor contrastOn(const QColor &c)
{
    const int lum = (11 * c.red() + 16 * c.green() + 5 * c.blue()) / 32;
    return lum > 140 ? QColor(Qt::black) : QColor(Qt::white);
}

// Marks window bytes [from, to) of an area with a value that beats what is there.
void mark(std::vector<uint8_t> &ink, uint64_t windowStart, const DiskArea &area, uint8_t value)
{
    if (area.length == 0 || ink.empty())
        return;
    const uint64_t windowEnd = windowStart + ink.size();
    const uint64_t from = std::max(area.offset, windowStart);
    const uint64_t to = std::min(area.end(), windowEnd);
    for (uint64_t o = from; o < to; ++o) {
        uint8_t &v = ink[size_t(o - windowStart)];
        if (value > v)
            v = value;
    }
}

const Metrics::Pane DataPanes[] = {Metrics::PaneHex, Metrics::PaneAscii, Metrics::PaneUnicode};

} // namespace

QFont Painter::watermarkFont()
{
    QFont f(QStringLiteral("Arial"), 10);
    f.setWeight(QFont::Black);
    return f;
}

QPainterPath Painter::outline(const Metrics &m, Metrics::Pane pane, const DiskArea &area)
{
    const Key key{int(pane), area.offset, area.length, m.topLine()};
    auto it = m_paths.constFind(key);
    if (it != m_paths.constEnd())
        return it.value();
    if (m_paths.size() > 1024)
        m_paths.clear();
    QPainterPath path = Layout::rangePath(m, pane, area);
    m_paths.insert(key, path);
    return path;
}

void Painter::paint(QPainter &p, const PaintInput &in)
{
    const Metrics &m = *in.metrics;
    const PaintPalette &pal = in.palette;
    const int width = std::max(in.width, m.totalWidth());
    p.fillRect(0, 0, width, in.height, pal.background);
    if (!in.storage)
        return;

    p.setFont(m.metricsFont());
    const int rh = m.rowHeight();
    const int hh = m.headerHeight();
    const int cw = m.cellWidth();
    const int asc = m.ascent();
    const uint32_t bpl = m.bytesPerLine();
    const uint64_t size = m.dataSize();
    const uint32_t sectorSize = m.sectorSize();
    const uint64_t top = m.topLine();
    const uint64_t lineCount = m.lineCount();
    const uint64_t lines =
        top < lineCount ? std::min<uint64_t>(uint64_t(m.visibleLines()), lineCount - top) : 0;

    // Header row.
    p.setPen(pal.header);
    for (const Metrics::Column &c : m.columns()) {
        QString text;
        switch (c.pane) {
        case Metrics::PaneOffset:
            text = m.hexOffset() ? QStringLiteral("Offset (h)") : QStringLiteral("Offset");
            break;
        case Metrics::PaneHex:
            text = Layout::hexHeader(m);
            break;
        case Metrics::PaneAscii:
            text = QStringLiteral("ASCII");
            break;
        case Metrics::PaneUnicode:
            text = QStringLiteral("Unicode");
            break;
        default:
            break;
        }
        const int maxCells = c.width / cw - 1;
        if (text.size() > maxCells)
            text.truncate(std::max(0, maxCells));
        p.drawText(c.x + cw, 3 + asc, text);
    }

    const uint64_t windowStart = top * uint64_t(bpl);
    const uint64_t windowLength = lines ? std::min<uint64_t>(lines * bpl, size - windowStart) : 0;
    const DiskArea window{windowStart, windowLength};
    ReadResult data;
    if (windowLength)
        data = in.storage->readDetailed(window, true);
    const uint64_t have = uint64_t(data.bytes.size());

    // Foreground class of every visible byte.
    std::vector<uint8_t> ink(size_t(have), InkText);
    std::vector<bool> unreadableSector;
    const uint64_t firstSector = windowStart / sectorSize;
    const uint64_t lastSector = have ? (windowStart + have - 1) / sectorSize : firstSector;
    const auto sectorOk = [&](uint64_t s) {
        const uint64_t i = s - data.firstSector;
        return s < data.firstSector || i >= uint64_t(data.sectorOk.size()) || data.sectorOk[qsizetype(i)];
    };

    // Background layers, each in every data pane.
    auto fillArea = [&](const DiskArea &area, const QBrush &brush) {
        if (!area.intersects(window))
            return;
        for (Metrics::Pane pane : DataPanes)
            if (m.isShown(pane))
                p.fillPath(outline(m, pane, area), brush);
    };
    p.setRenderHint(QPainter::Antialiasing, false);

    if (in.isFileSector && have) {
        for (uint64_t s = firstSector; s <= lastSector; ++s) {
            if (in.isFileSector(s))
                continue;
            const DiskArea area{s * sectorSize, sectorSize};
            fillArea(area, pal.ghosted.background);
            mark(ink, windowStart, area, InkGhosted);
        }
    }
    if (in.coloringOn && !pal.templateItems.isEmpty()) {
        for (const EditorCtrl::TemplateArea &t : in.coloring) {
            if (!t.area.intersects(window))
                continue;
            const int idx = int(uint32_t(t.colorIndex) % uint32_t(pal.templateItems.size()));
            fillArea(t.area, pal.templateItems[idx].background);
            mark(ink, windowStart, t.area,
                 t.link ? uint8_t(InkLink) : uint8_t(InkTemplate0 + std::min(idx, 15)));
        }
    }
    for (const EditorCtrl::BookmarkMark &b : in.bookmarks) {
        if (!b.area.intersects(window))
            continue;
        for (Metrics::Pane pane : DataPanes) {
            if (!m.isShown(pane))
                continue;
            const QPainterPath path = outline(m, pane, b.area);
            const QRectF r = path.boundingRect();
            QLinearGradient g(r.topLeft(), r.bottomLeft());
            g.setColorAt(0, pal.bookmarkFrom);
            g.setColorAt(1, pal.bookmarkTo);
            p.fillPath(path, g);
            p.setPen(pal.bookmarkBorder);
            p.drawPath(path);
            // The folded corner at the first byte.
            if (window.contains(b.area.offset)) {
                const uint64_t line = b.area.offset / bpl;
                const int x = m.byteLeft(pane, uint32_t(b.area.offset % bpl));
                const int y = m.lineY(line);
                const int k = std::max(3, rh / 3);
                QPolygon tri;
                tri << QPoint(x, y) << QPoint(x + k, y) << QPoint(x, y + k);
                p.setBrush(pal.bookmarkCorner);
                p.setPen(Qt::NoPen);
                p.drawPolygon(tri);
                p.setBrush(Qt::NoBrush);
            }
        }
    }
    for (const DiskArea &hit : in.searchHits) {
        if (!hit.intersects(window))
            continue;
        fillArea(hit, pal.searched.background);
        mark(ink, windowStart, hit, InkSearched);
    }

    // Unreadable sectors and modified bytes.
    for (uint64_t s = firstSector; have && s <= lastSector; ++s)
        if (!sectorOk(s))
            mark(ink, windowStart, {s * sectorSize, sectorSize}, InkUnreadable);
    for (uint64_t i = 0; i < have; ++i) {
        if (i < uint64_t(data.modified.size()) && data.modified.testBit(qsizetype(i)) &&
            ink[size_t(i)] != InkUnreadable)
            ink[size_t(i)] = InkModified;
    }

    // Cell backgrounds of modified bytes (runs per line and pane).
    for (uint64_t li = 0; li < lines; ++li) {
        const uint64_t base = li * bpl;
        if (base >= have)
            break;
        const uint32_t count = uint32_t(std::min<uint64_t>(bpl, have - base));
        const int y = hh + int(li) * rh;
        for (uint32_t i = 0; i < count;) {
            if (ink[size_t(base + i)] != InkModified) {
                ++i;
                continue;
            }
            uint32_t j = i;
            while (j + 1 < count && ink[size_t(base + j + 1)] == InkModified)
                ++j;
            for (Metrics::Pane pane : DataPanes)
                if (m.isShown(pane)) {
                    const int x0 = pane == Metrics::PaneHex ? m.byteX(pane, i, 0) : m.byteLeft(pane, i);
                    const int x1 = pane == Metrics::PaneHex ? m.byteX(pane, j, 1) + cw : m.byteRight(pane, j);
                    p.fillRect(x0, y, x1 - x0, rh, pal.modified);
                }
            i = j + 1;
        }
    }

    // Selection.
    if (in.selection.length)
        fillArea(in.selection, pal.selected);

    // The caret mirrored in the panes it is not in.
    const uint64_t caretOffset = in.caret.offset();
    const bool caretVisible = in.showCaret && caretOffset < size && window.contains(caretOffset);
    const int caretY = caretVisible ? m.lineY(in.caret.line) : 0;
    if (caretVisible) {
        for (Metrics::Pane pane : DataPanes) {
            if (!m.isShown(pane) || pane == in.caret.pane)
                continue;
            const int x0 = m.byteX(pane, in.caret.column, 0);
            const int w = pane == Metrics::PaneHex ? 2 * cw : pane == Metrics::PaneUnicode ? 2 * cw : cw;
            p.fillRect(x0, caretY, w, rh, pal.cursorInactive);
        }
    }

    // Text: offsets, then the bytes in runs of one colour.
    QList<QColor> inkColor(InkUnreadable + 1, pal.text);
    for (int k = 0; k < 16; ++k)
        if (!pal.templateItems.isEmpty())
            inkColor[InkTemplate0 + k] = pal.templateItems[k % pal.templateItems.size()].foreground;
    inkColor[InkLink] = pal.link;
    inkColor[InkGhosted] = pal.ghosted.foreground;
    inkColor[InkSearched] = pal.searched.foreground;
    inkColor[InkModified] = contrastOn(pal.modified);
    inkColor[InkUnreadable] = pal.disabled;

    const Metrics::Column *offsetColumn = m.column(Metrics::PaneOffset);
    for (uint64_t li = 0; li < lines; ++li) {
        const uint64_t base = li * bpl;
        if (base >= have)
            break;
        const uint32_t count = uint32_t(std::min<uint64_t>(bpl, have - base));
        const int y = hh + int(li) * rh;
        const int baseline = y + asc + Metrics::LineSpacing / 2;
        if (offsetColumn) {
            p.setPen(pal.text);
            p.drawText(offsetColumn->x + cw, baseline, m.formatOffset(windowStart + base));
        }
        const QByteArray bytes = data.bytes.mid(qsizetype(base), qsizetype(count));
        const QString hex = Layout::hexLine(m, bytes);
        const QString ascii = Layout::asciiLine(bytes);
        for (uint32_t i = 0; i < count;) {
            const uint8_t k = ink[size_t(base + i)];
            uint32_t j = i;
            while (j + 1 < count && ink[size_t(base + j + 1)] == k)
                ++j;
            p.setPen(inkColor[k]);
            const int from = m.hexCell(i, 0);
            const int to = m.hexCell(j, 1) + 1;
            p.drawText(m.byteX(Metrics::PaneHex, i, 0), baseline, hex.mid(from, to - from));
            if (m.isShown(Metrics::PaneAscii))
                p.drawText(m.byteX(Metrics::PaneAscii, i, 0), baseline, ascii.mid(i, j - i + 1));
            if (m.isShown(Metrics::PaneUnicode)) {
                for (uint32_t u = i & ~1u; u <= j && u + 1 < count; u += 2) {
                    const uint16_t unit = uint16_t(uint8_t(bytes[u]) | (uint8_t(bytes[u + 1]) << 8));
                    p.drawText(m.byteX(Metrics::PaneUnicode, u, 0), baseline,
                               QString(Layout::unicodeChar(unit)));
                }
            }
            i = j + 1;
        }
    }

    // The caret cell in its own pane.
    if (caretVisible && m.isShown(Metrics::Pane(in.caret.pane)) && in.caret.pane != Metrics::PaneOffset) {
        const uint64_t idx = caretOffset - windowStart;
        const uint8_t b = idx < have ? uint8_t(data.bytes[qsizetype(idx)]) : 0;
        const int baseline = caretY + asc + Metrics::LineSpacing / 2;
        const Metrics::Pane pane = Metrics::Pane(in.caret.pane);
        QString glyph;
        int x = m.byteX(pane, in.caret.column, in.caret.nibble);
        int w = cw;
        if (pane == Metrics::PaneHex) {
            static const char digits[] = "0123456789ABCDEF";
            glyph = QString(QLatin1Char(digits[in.caret.nibble ? (b & 15) : (b >> 4)]));
        } else if (pane == Metrics::PaneAscii) {
            glyph = QString(Layout::asciiChar(b));
        } else {
            const uint8_t hi = idx + 1 < have ? uint8_t(data.bytes[qsizetype(idx + 1)]) : 0;
            glyph = QString(Layout::unicodeChar(uint16_t(b | (hi << 8))));
            w = 2 * cw;
        }
        p.fillRect(x, caretY, w, rh, pal.cursor.background);
        p.setPen(pal.cursor.foreground);
        p.drawText(x, baseline, glyph);
    }

    // The selected template field.
    if (in.outline.length && in.outline.intersects(window)) {
        p.setRenderHint(QPainter::Antialiasing, true);
        p.setPen(QPen(pal.templateItem, 2));
        p.setBrush(Qt::NoBrush);
        for (Metrics::Pane pane : DataPanes)
            if (m.isShown(pane))
                p.drawPath(outline(m, pane, in.outline));
        p.setRenderHint(QPainter::Antialiasing, false);
    }

    // Grid lines under the last line of every sector, separators and the header line.
    if (sectorSize >= bpl && sectorSize % bpl == 0) {
        p.setPen(pal.grid);
        const uint64_t linesPerSector = sectorSize / bpl;
        for (uint64_t li = 0; li < lines; ++li) {
            if ((top + li + 1) % linesPerSector == 0) {
                const int y = hh + int(li + 1) * rh - 1;
                p.drawLine(0, y, m.totalWidth(), y);
            }
        }
    }
    p.setPen(pal.lines);
    for (const Metrics::Column &c : m.columns())
        p.drawLine(c.x + c.width, 0, c.x + c.width, in.height);
    p.drawLine(0, hh - 1, m.totalWidth(), hh - 1);

    // "READ ERROR" over every visible unreadable sector.
    const Metrics::Column *hexColumn = m.column(Metrics::PaneHex);
    if (hexColumn && have) {
        p.setFont(m_watermark);
        p.setPen(pal.watermark);
        for (uint64_t s = firstSector; s <= lastSector; ++s) {
            if (sectorOk(s))
                continue;
            const uint64_t firstLine = s * sectorSize / bpl;
            const uint64_t rows = std::max<uint64_t>(1, sectorSize / bpl);
            const int64_t relTop = int64_t(firstLine) - int64_t(top);
            const QRect r(hexColumn->x + 40, hh + int(relTop) * rh, std::max(0, hexColumn->width - 80),
                          int(rows) * rh);
            p.drawText(r, Qt::AlignCenter | Qt::TextWordWrap, QString::fromLatin1(WatermarkText));
        }
        p.setFont(m.metricsFont());
    }
}

} // namespace HexEditor
