#include <gtest/gtest.h>

#include "hexeditor/Metrics.h"

using HexEditor::Metrics;

TEST(Metrics, OffsetDigitsFollowTheLargerOfDecimalAndHexadecimal)
{
    // 2^32 bytes: 10 decimal digits, 9 hexadecimal digits -> a column of 10 cells.
    EXPECT_EQ(Metrics::offsetDigitsFor(1ull << 32), 10);
    EXPECT_EQ(Metrics::offsetDigitsFor(4096), 8);
    EXPECT_EQ(Metrics::offsetDigitsFor(0), 8);
    EXPECT_EQ(Metrics::offsetDigitsFor(16ull << 40), 14);

    Metrics m;
    m.setDataSize(1ull << 32, 512);
    m.setMetricsHexOffset(true);
    EXPECT_EQ(m.formatOffset(0xABCDEF), QStringLiteral("0000ABCDEF"));
    m.setMetricsHexOffset(false);
    EXPECT_EQ(m.formatOffset(1234), QStringLiteral("0000001234"));
    ASSERT_NE(m.column(Metrics::PaneOffset), nullptr);
    EXPECT_EQ(m.column(Metrics::PaneOffset)->width, (1 + 10 + 1) * m.cellWidth());
}

TEST(Metrics, NibblePositionsWithGrouping)
{
    Metrics m;
    m.setDataSize(4096, 512);
    m.setMetricsGroup(8);
    EXPECT_EQ(m.hexCell(0, 0), 0);
    EXPECT_EQ(m.hexCell(0, 1), 1);
    EXPECT_EQ(m.hexCell(7, 0), 21);
    EXPECT_EQ(m.hexCell(8, 0), 26); // two more cells after the first group of 8
    EXPECT_EQ(m.hexCell(15, 1), 3 * 15 + 2 + 1);
    m.setMetricsGroup(0);
    EXPECT_EQ(m.hexCell(8, 0), 24);
    m.setMetricsGroup(4);
    EXPECT_EQ(m.hexCell(5, 0), 17);
    m.setMetricsGroup(5); // not offered: the default
    EXPECT_EQ(m.group(), 8u);

    // Columns stand in order, each where the previous ends (after its separator line).
    const auto &cols = m.columns();
    ASSERT_EQ(cols.size(), 3);
    EXPECT_EQ(cols[0].pane, Metrics::PaneOffset);
    EXPECT_EQ(cols[1].pane, Metrics::PaneHex);
    EXPECT_EQ(cols[2].pane, Metrics::PaneAscii);
    EXPECT_EQ(cols[1].x, cols[0].x + cols[0].width + 1);
    EXPECT_EQ(cols[2].x, cols[1].x + cols[1].width + 1);
    EXPECT_EQ(m.byteX(Metrics::PaneHex, 3, 1) - m.byteX(Metrics::PaneHex, 3, 0), m.cellWidth());

    m.setMetricsColumns(Metrics::PaneUnicode); // hex always shown, offset and ASCII off
    ASSERT_EQ(m.columns().size(), 2);
    EXPECT_FALSE(m.isShown(Metrics::PaneOffset));
    EXPECT_TRUE(m.isShown(Metrics::PaneHex));
    EXPECT_TRUE(m.isShown(Metrics::PaneUnicode));
}

TEST(Metrics, HitTestFindsEveryNibbleAndByte)
{
    Metrics m;
    m.setDataSize(1 << 20, 512);
    m.setMetricsColumns(Metrics::PaneOffset | Metrics::PaneAscii | Metrics::PaneUnicode);
    m.setViewportHeight(400);
    m.setTopLine(10);
    for (uint32_t bpl : {8u, 16u, 32u}) {
        m.setMetricsBytesPerLine(bpl);
        for (uint32_t i = 0; i < bpl; ++i) {
            for (int nibble = 0; nibble < 2; ++nibble) {
                const int x = m.byteX(Metrics::PaneHex, i, nibble) + m.cellWidth() / 2;
                const Metrics::Hit hit = m.hitTest(x, m.lineY(m.topLine() + 3) + 1);
                ASSERT_TRUE(hit.valid);
                EXPECT_EQ(hit.pane, Metrics::PaneHex);
                EXPECT_EQ(hit.line, m.topLine() + 3);
                EXPECT_EQ(hit.column, i);
                EXPECT_EQ(hit.nibble, nibble);
            }
            const Metrics::Hit a = m.hitTest(m.byteX(Metrics::PaneAscii, i) + 1, m.lineY(m.topLine()) + 1);
            EXPECT_EQ(a.pane, Metrics::PaneAscii);
            EXPECT_EQ(a.column, i);
            const Metrics::Hit u = m.hitTest(m.byteX(Metrics::PaneUnicode, i) + 1, m.lineY(m.topLine()) + 1);
            EXPECT_EQ(u.pane, Metrics::PaneUnicode);
            EXPECT_EQ(u.column, i & ~1u); // always even in the Unicode column
        }
    }
    EXPECT_TRUE(m.hitTest(50, 1).header);
    EXPECT_EQ(m.hitTest(m.column(Metrics::PaneOffset)->x + 5, m.lineY(m.topLine()) + 1).pane,
              Metrics::PaneOffset);
}

TEST(Metrics, TopLineStaysInRangeAndScrollsOnlyWhenNeeded)
{
    Metrics m;
    m.setDataSize(16 * 100, 512); // 100 lines
    m.setViewportHeight(m.headerHeight() + 10 * m.rowHeight());
    EXPECT_EQ(m.fullyVisibleLines(), 10);
    EXPECT_EQ(m.maxTopLine(), 90u);
    m.setTopLine(500);
    EXPECT_EQ(m.topLine(), 90u);
    m.scrollBy(-1000);
    EXPECT_EQ(m.topLine(), 0u);
    EXPECT_FALSE(m.scrollIntoView(9));
    EXPECT_TRUE(m.scrollIntoView(10));
    EXPECT_EQ(m.topLine(), 1u);
    EXPECT_TRUE(m.scrollIntoView(0));
    EXPECT_EQ(m.topLine(), 0u);
    // Bytes per line change keeps the byte at the top.
    m.setTopLine(40);
    m.setMetricsBytesPerLine(32);
    EXPECT_EQ(m.topLine(), 20u);
}

TEST(Metrics, ScrollScaleCoversSixteenTerabytesEndToEnd)
{
    Metrics m;
    const uint64_t size = 16ull << 40;
    m.setDataSize(size, 512);
    m.setViewportHeight(m.headerHeight() + 50 * m.rowHeight());
    const uint64_t maxTop = m.maxTopLine();
    EXPECT_EQ(maxTop, size / 16 - 50);
    EXPECT_GT(m.scrollScale(), 1.0);
    EXPECT_EQ(m.scrollMaximum(), Metrics::ScrollRange);

    // First line.
    EXPECT_EQ(m.topLineForScrollValue(0), 0u);
    m.setTopLine(0);
    EXPECT_EQ(m.scrollValue(), 0);
    // Last line.
    EXPECT_EQ(m.topLineForScrollValue(m.scrollMaximum()), maxTop);
    m.setTopLine(maxTop);
    EXPECT_EQ(m.scrollValue(), m.scrollMaximum());
    // Middle: within one scroll step of half the range, and the mapping round-trips.
    const uint64_t mid = m.topLineForScrollValue(m.scrollMaximum() / 2);
    const double step = m.scrollScale();
    EXPECT_NEAR(double(mid), double(maxTop) / 2, step + 1);
    m.setTopLine(mid);
    EXPECT_NEAR(m.scrollValue(), m.scrollMaximum() / 2, 1);
    // Every scroll value reaches a different line (monotone).
    EXPECT_LT(m.topLineForScrollValue(1000), m.topLineForScrollValue(1001));

    // A storage that fits keeps a scale of 1.
    m.setDataSize(1 << 20, 512);
    EXPECT_DOUBLE_EQ(m.scrollScale(), 1.0);
    EXPECT_EQ(m.topLineForScrollValue(17), 17u);
}

TEST(Metrics, CaretOffsetAndSector)
{
    Metrics m;
    m.setDataSize(1 << 20, 4096);
    const Metrics::Caret c = m.caretAt(5000, Metrics::PaneUnicode);
    EXPECT_EQ(c.line, 312u);
    EXPECT_EQ(c.column, 8); // 5000 % 16 = 8
    EXPECT_EQ(c.offset(), 5000u);
    EXPECT_EQ(c.sector(), 1u);
    const Metrics::Caret odd = m.caretAt(5001, Metrics::PaneUnicode);
    EXPECT_EQ(odd.column, 8); // rounded down to even
    EXPECT_EQ(m.caretAt(5001, Metrics::PaneHex, 1).nibble, 1);
    EXPECT_EQ(m.caretAt(5001, Metrics::PaneAscii, 1).nibble, 0);
}
