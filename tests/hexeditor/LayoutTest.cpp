#include <QDomDocument>
#include <gtest/gtest.h>

#include "ClientFramework/Themes/Theme.h"
#include "hexeditor/Layout.h"
#include "hexeditor/PaintPalette.h"

using HexEditor::DiskArea;
using HexEditor::Metrics;
using HexEditor::PaintPalette;
namespace Layout = HexEditor::Layout;

namespace {

Metrics shownMetrics()
{
    Metrics m;
    m.setDataSize(1 << 20, 512);
    m.setViewportHeight(m.headerHeight() + 20 * m.rowHeight());
    return m;
}

} // namespace

TEST(Layout, OutlineOfOneLineIsARectangleStartingLeftOfTheDigits)
{
    Metrics m = shownMetrics();
    const QPolygon p = Layout::rangeOutline(m, Metrics::PaneHex, {16 + 2, 3});
    ASSERT_EQ(p.size(), 4);
    EXPECT_EQ(p[0], QPoint(m.byteX(Metrics::PaneHex, 2) - 2, m.lineY(1)));
    EXPECT_EQ(p[1].x(), m.byteX(Metrics::PaneHex, 4, 1) + m.cellWidth() + 2);
    EXPECT_EQ(p[2].y(), m.lineY(1) + m.rowHeight());
}

TEST(Layout, OutlineOfSeveralLinesIsOneStair)
{
    Metrics m = shownMetrics();
    // From byte 5 of line 2 to byte 3 of line 4.
    const DiskArea area{2 * 16 + 5, 16 - 5 + 16 + 4};
    const QPolygon p = Layout::rangeOutline(m, Metrics::PaneAscii, area);
    ASSERT_EQ(p.size(), 8);
    const int left = m.byteLeft(Metrics::PaneAscii, 0);
    const int right = m.byteRight(Metrics::PaneAscii, 15);
    EXPECT_EQ(p[0], QPoint(m.byteLeft(Metrics::PaneAscii, 5), m.lineY(2)));
    EXPECT_EQ(p[1], QPoint(right, m.lineY(2)));
    EXPECT_EQ(p[2], QPoint(right, m.lineY(4)));
    EXPECT_EQ(p[3], QPoint(m.byteRight(Metrics::PaneAscii, 3), m.lineY(4)));
    EXPECT_EQ(p[4], QPoint(m.byteRight(Metrics::PaneAscii, 3), m.lineY(5)));
    EXPECT_EQ(p[5], QPoint(left, m.lineY(5)));
    EXPECT_EQ(p[6], QPoint(left, m.lineY(3)));
    EXPECT_EQ(p[7], QPoint(m.byteLeft(Metrics::PaneAscii, 5), m.lineY(3)));
}

TEST(Layout, OutlineIsCutToTheViewAndEmptyOutsideIt)
{
    Metrics m = shownMetrics();
    m.setTopLine(1000);
    EXPECT_TRUE(Layout::rangeOutline(m, Metrics::PaneHex, {0, 16}).isEmpty());
    // A range of the whole storage stays within a line of the view.
    const QPolygon p = Layout::rangeOutline(m, Metrics::PaneHex, {0, 1 << 20});
    ASSERT_FALSE(p.isEmpty());
    EXPECT_GE(p.boundingRect().top(), m.lineY(999));
    EXPECT_LE(p.boundingRect().bottom(), m.lineY(1000 + 22) + m.rowHeight());
    EXPECT_TRUE(Layout::rangeOutline(m, Metrics::PaneUnicode, {1000 * 16, 4}).isEmpty()); // not shown
}

TEST(Layout, HeaderAndLineTexts)
{
    Metrics m = shownMetrics();
    m.setMetricsBytesPerLine(16);
    m.setMetricsGroup(8);
    m.setMetricsHexOffset(true);
    const QString header = Layout::hexHeader(m);
    EXPECT_EQ(header.mid(m.hexCell(10), 2), QStringLiteral("0A"));
    m.setMetricsHexOffset(false);
    EXPECT_EQ(Layout::hexHeader(m).mid(m.hexCell(10), 2), QStringLiteral("10"));

    const QByteArray bytes = QByteArray::fromHex("00FF41");
    const QString line = Layout::hexLine(m, bytes);
    EXPECT_EQ(line.mid(0, 9), QStringLiteral("00 FF 41 "));
    EXPECT_EQ(Layout::asciiLine(QByteArray::fromHex("41001F7F7E")), QStringLiteral("A...~"));
    EXPECT_EQ(Layout::unicodeLine(QByteArray::fromHex("41001604")), QString::fromUtf8("A Ж "));
    EXPECT_EQ(Layout::unicodeChar(0xD800), QLatin1Char('.'));
}

TEST(PaintPalette, GreyForm)
{
    EXPECT_EQ(PaintPalette::grey(QColor()), QColor(Qt::white));
    EXPECT_EQ(PaintPalette::grey(QColor(Qt::white)), QColor(0xC8, 0xC8, 0xC8));
    EXPECT_EQ(PaintPalette::grey(QColor(Qt::black)), QColor(0xA0, 0xA0, 0xA0));
    // (11 * 0xDC + 16 * 0x2F + 5 * 0x32) / 32 = (2420 + 752 + 250) / 32 = 106
    EXPECT_EQ(PaintPalette::grey(QColor(0xDC, 0x2F, 0x32, 0x40)), QColor(106, 106, 106, 255));
}

TEST(PaintPalette, ThemeColoursWithAlphaFirstAndPartialElements)
{
    EXPECT_EQ(PaintPalette::parseColor("#C8DCEBFF"), QColor(0xDC, 0xEB, 0xFF, 0xC8));
    EXPECT_EQ(PaintPalette::parseColor("#BBB"), QColor(0xBB, 0xBB, 0xBB));
    EXPECT_FALSE(PaintPalette::parseColor("#12345").isValid());
    EXPECT_FALSE(PaintPalette::parseColor("red").isValid());

    QDomDocument doc;
    ASSERT_TRUE(doc.setContent(QStringLiteral(
        "<hex-view><text default='#112233' modified='#bad'/><elements background='#445566'/>"
        "<template-palette item='#010203'><item foreground='#111' background='#222'/></template-palette>"
        "</hex-view>")));
    const PaintPalette p = PaintPalette::fromElement(doc.documentElement());
    EXPECT_EQ(p.text, QColor(0x11, 0x22, 0x33));
    EXPECT_EQ(p.modified, QColor(0xBB, 0xAA, 0xDD));
    EXPECT_EQ(p.background, QColor(0x44, 0x55, 0x66));
    EXPECT_EQ(p.header, PaintPalette::defaultTheme().header); // kept from the base
    EXPECT_EQ(p.templateItem, QColor(1, 2, 3));
    ASSERT_EQ(p.templateItems.size(), 1);
    EXPECT_EQ(p.templateItems[0].background, QColor(0x22, 0x22, 0x22));
    EXPECT_EQ(PaintPalette::darkTheme().searched.background, QColor(0xAA, 0x77, 0x33, 0x70));
}

TEST(PaintPalette, ThemeDocumentsCarryTheHexViewPalette)
{
    Framework::Theme light;
    ASSERT_TRUE(light.load(Framework::Theme::resourcePath(QStringLiteral("light"))));
    const PaintPalette fromLight = PaintPalette::fromTheme(light);
    const PaintPalette builtIn = PaintPalette::defaultTheme();
    EXPECT_EQ(fromLight.selected, builtIn.selected);
    EXPECT_EQ(fromLight.searched.foreground, builtIn.searched.foreground);
    EXPECT_EQ(fromLight.templateItems[4].background, builtIn.templateItems[4].background);

    Framework::Theme dark;
    ASSERT_TRUE(dark.load(Framework::Theme::resourcePath(QStringLiteral("dark"))));
    const PaintPalette fromDark = PaintPalette::fromTheme(dark);
    const PaintPalette darkBuiltIn = PaintPalette::darkTheme();
    EXPECT_EQ(fromDark.background, darkBuiltIn.background);
    EXPECT_EQ(fromDark.text, QColor(0xBB, 0xBB, 0xBB));
    EXPECT_EQ(fromDark.ghosted.foreground, darkBuiltIn.ghosted.foreground);
    EXPECT_EQ(fromDark.templateItems[0].background, QColor(0x88, 0, 0, 0x22));

    // Every entry is in the document, so a changed document changes the painting.
    EXPECT_GE(light.paletteEntries(QStringLiteral("hex-view")).size(), 32);
    EXPECT_EQ(light.paletteEntries(QStringLiteral("hex-view")),
              dark.paletteEntries(QStringLiteral("hex-view")));
}
