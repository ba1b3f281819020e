// Layout arithmetic of the hex editor control: view settings, font cells, columns, nibble positions,
// hit tests, the visible line window and the scroll bar's scale for storages of any size.
#pragma once

#include <QByteArray>
#include <QFont>
#include <QList>
#include <QMetaType>
#include <QRect>
#include <QString>

#include <cstdint>

namespace HexEditor {

class Metrics
{
public:
    // Panes of the control; also the bits of the column mask (the hexadecimal pane is always shown).
    enum Pane : int32_t { PaneNone = 0, PaneHex = 1, PaneAscii = 2, PaneUnicode = 4, PaneOffset = 8 };

    static constexpr int LineSpacing = 3;
    static constexpr int HeaderExtra = 3;
    static constexpr int DefaultFontSize = 11;
    static constexpr uint32_t DefaultBytesPerLine = 16;
    static constexpr uint32_t DefaultColumns = PaneAscii | PaneOffset | PaneHex;
    static constexpr uint32_t DefaultGroup = 8;
    // The largest value the vertical scroll bar is given; longer storages are scaled onto it.
    static constexpr int ScrollRange = 1 << 30;

    struct Caret
    {
        uint64_t line = 0;
        uint8_t column = 0;
        int32_t nibble = 0;
        int32_t pane = PaneHex;
        QByteArray snapshot;
        uint32_t bytesPerLine = DefaultBytesPerLine;
        uint32_t sectorSize = 512;

        uint64_t offset() const { return line * bytesPerLine + column; }
        uint64_t sector() const { return sectorSize ? offset() / sectorSize : 0; }
        // Same place and same bytes under it.
        bool sameAs(const Caret &o) const
        {
            return line == o.line && column == o.column && nibble == o.nibble && pane == o.pane &&
                   snapshot == o.snapshot;
        }
    };

    // One shown column: its pane, left pixel and width in pixels.
    struct Column
    {
        Pane pane = PaneNone;
        int x = 0;
        int width = 0;
    };

    // Where a point of the viewport lands.
    struct Hit
    {
        bool valid = false;
        bool header = false;
        Pane pane = PaneNone;
        uint64_t line = 0;
        uint8_t column = 0;
        int32_t nibble = 0;
    };

    Metrics();
    virtual ~Metrics() = default;

    // --- settings -----------------------------------------------------------------------------
    static bool isAllowedBytesPerLine(uint32_t n)
    {
        return n == 8 || n == 16 || n == 32 || n == 64 || n == 128;
    }
    static bool isAllowedGroup(uint32_t n) { return n == 0 || n == 4 || n == 8 || n == 16; }
    // The default family; on systems without it the fixed-pitch system font of the same size is used.
    static QString defaultFontFamily() { return QStringLiteral("Courier New"); }
    // The font actually used for a family and point size.
    static QFont resolveFont(const QString &family, int pointSize);

    const QFont &metricsFont() const { return m_font; }
    QString fontFamily() const { return m_fontFamily; }
    int fontSize() const { return m_fontSize; }
    uint32_t bytesPerLine() const { return m_bytesPerLine; }
    uint32_t columnMask() const { return m_columns; }
    uint32_t group() const { return m_group; }
    bool hexOffset() const { return m_hexOffset; }
    int wheelLines() const { return m_wheelLines; }
    int pageCount() const { return m_pages; }

    void setMetricsFont(const QString &family, int pointSize);
    void setMetricsBytesPerLine(uint32_t n);
    void setMetricsColumns(uint32_t mask);
    void setMetricsGroup(uint32_t n);
    void setMetricsHexOffset(bool on);
    void setWheelLines(int n) { m_wheelLines = n < 1 ? 1 : n; }
    void setPageCount(int n) { m_pages = n < 1 ? 1 : n; }

    // --- data -----------------------------------------------------------------------------------
    // Size of the storage shown (sets the offset digits) and its sector size.
    void setDataSize(uint64_t size, uint32_t sectorSize);
    uint64_t dataSize() const { return m_size; }
    uint32_t sectorSize() const { return m_sectorSize; }
    // Offset digits: at least 8, or the decimal or hexadecimal digits of the size.
    int offsetDigits() const { return m_offsetDigits; }
    static int offsetDigitsFor(uint64_t size);
    QString formatOffset(uint64_t offset) const;
    // Lines from the start of the storage to its last byte.
    uint64_t lineCount() const;

    // --- geometry --------------------------------------------------------------------------------
    int cellWidth() const { return m_cellWidth; }
    int rowHeight() const { return m_rowHeight; }
    int ascent() const { return m_ascent; }
    int headerHeight() const { return m_rowHeight + HeaderExtra; }
    const QList<Column> &columns() const { return m_layout; }
    const Column *column(Pane pane) const;
    bool isShown(Pane pane) const;
    int totalWidth() const;
    // Cells from the hexadecimal column's first digit to the high (0) or low (1) nibble of a byte.
    int hexCell(uint32_t byteIndex, int nibble = 0) const;
    // Pixel x of the first glyph of a byte (nibble in the hex pane) in a pane; -1 when not shown.
    int byteX(Pane pane, uint32_t byteIndex, int nibble = 0) const;
    // Left and right pixel of a byte's box in a pane (the hex box starts 2 pixels left of its digits).
    int byteLeft(Pane pane, uint32_t byteIndex) const;
    int byteRight(Pane pane, uint32_t byteIndex) const;
    // Pixel y of the top of a line relative to the viewport (the line must be near the top line).
    int lineY(uint64_t line) const;

    // --- viewport -----------------------------------------------------------------------------
    void setViewportHeight(int pixels);
    int visibleLines() const { return m_visibleLines; }
    // Whole lines visible (the last partly visible one excluded).
    int fullyVisibleLines() const;
    uint64_t topLine() const { return m_topLine; }
    uint64_t maxTopLine() const;
    // Clamps into 0 .. line count - visible lines; returns true when the top line changed.
    bool setTopLine(uint64_t line);
    bool scrollBy(int64_t lines);
    // Moves the top line only when the line is above the top or below the last visible line.
    bool scrollIntoView(uint64_t line);

    // The scroll bar's scale factor and the mapping between top line and scroll bar value.
    double scrollScale() const;
    int scrollMaximum() const;
    int scrollValue() const;
    uint64_t topLineForScrollValue(int value) const;

    // --- hit test ----------------------------------------------------------------------------------
    Hit hitTest(int x, int y) const;

    // The caret at an offset with this metrics' line width and sector size.
    Caret caretAt(uint64_t offset, int32_t pane, int32_t nibble = 0) const;

protected:
    // Called after any change that moves cells (font, columns, bytes per line, grouping, size).
    virtual void layoutChanged() {}

private:
    void relayout();

    QString m_fontFamily;
    int m_fontSize = DefaultFontSize;
    QFont m_font;
    uint32_t m_bytesPerLine = DefaultBytesPerLine;
    uint32_t m_columns = DefaultColumns;
    uint32_t m_group = DefaultGroup;
    bool m_hexOffset = false;
    int m_wheelLines = 3;
    int m_pages = 1;

    uint64_t m_size = 0;
    uint32_t m_sectorSize = 512;
    int m_offsetDigits = 8;

    int m_cellWidth = 8;
    int m_ascent = 10;
    int m_rowHeight = 16;
    QList<Column> m_layout;

    int m_viewportHeight = 0;
    int m_visibleLines = 0;
    uint64_t m_topLine = 0;
};

} // namespace HexEditor

Q_DECLARE_METATYPE(HexEditor::Metrics::Caret)
