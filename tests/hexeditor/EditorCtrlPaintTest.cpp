#include <QDomDocument>
#include <QImage>
#include <QMenu>
#include <QScrollBar>

#include "hexeditor/PaintPalette.h"
#include "tests/hexeditor/EditorCtrlFixture.h"

using HexEditor::DiskArea;
using HexEditor::EditorCtrl;
using HexEditor::Metrics;
using HexEditor::NavigationPoint;
using HexEditor::PaintPalette;

using EditorCtrlPaint = EditorCtrlFixture;

namespace {

int countNear(const QImage &img, const QColor &c, const QRect &area, int tolerance = 8)
{
    int n = 0;
    const QRect r = area.intersected(img.rect());
    for (int y = r.top(); y <= r.bottom(); ++y)
        for (int x = r.left(); x <= r.right(); ++x) {
            const QColor p = img.pixelColor(x, y);
            if (std::abs(p.red() - c.red()) <= tolerance && std::abs(p.green() - c.green()) <= tolerance &&
                std::abs(p.blue() - c.blue()) <= tolerance)
                ++n;
        }
    return n;
}

QImage paintedViewport(EditorCtrl &ctrl)
{
    return ctrl.viewport()->grab().toImage().convertToFormat(QImage::Format_RGB32);
}

} // namespace

TEST_F(EditorCtrlPaint, UnreadableSectorGetsTheWatermarkAndOneMessage)
{
    disk->badReads.insert(1);
    storage->clearCache();
    QSignalSpy failed(storage.get(), &HexEditor::Storage::readFailed);
    ctrl->setBytesPerLine(32); // 16 lines per sector: sector 1 is in view
    const QImage img = paintedViewport(*ctrl);
    ASSERT_FALSE(img.isNull());
    const Metrics::Column *hex = ctrl->column(Metrics::PaneHex);
    const QRect sector1(hex->x, ctrl->lineY(16), hex->width, 16 * ctrl->rowHeight());
    const QRect sector0(hex->x, ctrl->lineY(0), hex->width, 16 * ctrl->rowHeight());
    const QColor watermark = ctrl->paintPalette().watermark;
    EXPECT_GT(countNear(img, watermark, sector1), 20);
    EXPECT_EQ(countNear(img, watermark, sector0), 0);
    paintedViewport(*ctrl);
    EXPECT_LE(failed.size(), 1); // the unreadable sector stays cached
}

TEST_F(EditorCtrlPaint, ModifiedBytesSelectionAndCaretAreDistinct)
{
    PaintPalette pal = ctrl->paintPalette();
    pal.selected = QColor(0xC8, 0xDC, 0xEB); // opaque, so the painted pixels carry it exactly
    ctrl->setPaintPalette(pal);
    const Metrics::Column *ascii = ctrl->column(Metrics::PaneAscii);
    const QRect line2(ascii->x, ctrl->lineY(2), ascii->width, ctrl->rowHeight());
    EXPECT_EQ(countNear(paintedViewport(*ctrl), pal.modified, line2, 2), 0);
    ASSERT_TRUE(ctrl->applyEdit(32, "abcd"));
    ctrl->setCaretOffset(0);
    EXPECT_GT(countNear(paintedViewport(*ctrl), pal.modified, line2, 2), 10);

    const QRect line5(0, ctrl->lineY(5), ctrl->totalWidth(), ctrl->rowHeight());
    EXPECT_EQ(countNear(paintedViewport(*ctrl), pal.selected, line5, 2), 0);
    ctrl->setSelection({80, 8});
    EXPECT_GT(countNear(paintedViewport(*ctrl), pal.selected, line5, 2), 10);

    ctrl->setCaretOffset(16 * 7 + 3);
    const QRect line7(0, ctrl->lineY(7), ctrl->totalWidth(), ctrl->rowHeight());
    const QImage img = paintedViewport(*ctrl);
    EXPECT_GT(countNear(img, pal.cursor.background, line7, 2), 10);
    EXPECT_GT(countNear(img, pal.cursorInactive, line7, 2), 10);
}

TEST_F(EditorCtrlPaint, TemplateColoringAndOutline)
{
    const PaintPalette pal = ctrl->paintPalette();
    ctrl->setTemplateColoring({{{0, 4}, 0, 1, false}, {{4, 4}, 1, 2, false}});
    const QRect line0(0, ctrl->lineY(0), ctrl->totalWidth(), ctrl->rowHeight());
    EXPECT_GT(countNear(paintedViewport(*ctrl), pal.templateItems[1].background, line0, 2), 10);
    ctrl->setTemplateColoringEnabled(false);
    EXPECT_EQ(countNear(paintedViewport(*ctrl), pal.templateItems[1].background, line0, 2), 0);
    ctrl->setTemplateOutline({16 * 3, 20});
    const QRect lines3to4(0, ctrl->lineY(3) - 2, ctrl->totalWidth(), 2 * ctrl->rowHeight() + 4);
    EXPECT_GT(countNear(paintedViewport(*ctrl), pal.templateItem, lines3to4, 30), 20);

    // A click on a field reports it; a double-click selects its bytes.
    ctrl->setTemplateColoringEnabled(true);
    QSignalSpy clicked(ctrl.get(), &EditorCtrl::templateFieldClicked);
    QTest::mouseClick(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(5));
    ASSERT_EQ(clicked.size(), 1);
    EXPECT_EQ(clicked[0].at(0).toInt(), 2);
    QTest::mouseDClick(ctrl->viewport(), Qt::LeftButton, {}, cellPoint(5));
    EXPECT_EQ(ctrl->selection(), (DiskArea{4, 4}));
}

TEST_F(EditorCtrlPaint, SixteenTerabyteDiskScrollsEndToEnd)
{
    open(16ull << 40);
    QScrollBar *bar = ctrl->verticalScrollBar();
    EXPECT_EQ(bar->maximum(), Metrics::ScrollRange);
    EXPECT_EQ(ctrl->offsetDigits(), 14);

    bar->setValue(bar->maximum());
    EXPECT_EQ(ctrl->topLine(), ctrl->maxTopLine());
    EXPECT_EQ(ctrl->topLine() + uint64_t(ctrl->fullyVisibleLines()), ctrl->lineCount());
    EXPECT_FALSE(paintedViewport(*ctrl).isNull());

    bar->setValue(bar->maximum() / 2);
    EXPECT_NEAR(double(ctrl->topLine()), double(ctrl->maxTopLine()) / 2, ctrl->scrollScale() + 1);
    bar->setValue(0);
    EXPECT_EQ(ctrl->topLine(), 0u);

    key(Qt::Key_End, Qt::ControlModifier);
    EXPECT_EQ(ctrl->caretOffset(), (16ull << 40) - 1);
    EXPECT_EQ(bar->value(), bar->maximum());
    key(Qt::Key_Home, Qt::ControlModifier);
    EXPECT_EQ(bar->value(), 0);
    ctrl->setCaretOffset(8ull << 40);
    EXPECT_NEAR(bar->value(), bar->maximum() / 2, 2);
    // Reading the view touched only the visible sectors.
    EXPECT_LT(disk->readRequests, 200);
}

TEST_F(EditorCtrlPaint, SettingsRoundTripAndBadValuesFallBack)
{
    ctrl->setHexOffset(true);
    ctrl->setBytesPerLine(32);
    ctrl->setColumns(Metrics::PaneOffset | Metrics::PaneUnicode);
    ctrl->setGrouping(4);
    ctrl->setWheelLines(5);
    ctrl->setPageCount(2);
    ctrl->setEditorFont(QStringLiteral("No Such Font Family"), 14);
    QDomDocument doc;
    QDomElement root = doc.createElement(QStringLiteral("hex-editor"));
    doc.appendChild(root);
    ctrl->save(root);
    const QDomElement viewport = root.firstChildElement(QStringLiteral("viewport"));
    EXPECT_EQ(viewport.attribute(QStringLiteral("bytes")), QStringLiteral("32"));
    EXPECT_EQ(viewport.attribute(QStringLiteral("columns")), QStringLiteral("13"));
    EXPECT_EQ(viewport.attribute(QStringLiteral("hex-offset")), QStringLiteral("true"));
    EXPECT_EQ(root.firstChildElement(QStringLiteral("font")).attribute(QStringLiteral("size")),
              QStringLiteral("14"));

    EditorCtrl other(storage.get(), true);
    other.load(root);
    EXPECT_TRUE(other.hexOffset());
    EXPECT_EQ(other.bytesPerLine(), 32u);
    EXPECT_EQ(other.columnMask(), 13u);
    EXPECT_EQ(other.group(), 4u);
    EXPECT_EQ(other.wheelLines(), 5);
    EXPECT_EQ(other.pageCount(), 2);
    EXPECT_EQ(other.fontSize(), 14);
    // The family is absent here: the system's fixed-pitch font stands in at the same size.
    EXPECT_EQ(other.metricsFont().pointSize(), 14);
    const QFontMetrics fm(other.metricsFont());
    EXPECT_EQ(fm.horizontalAdvance(QLatin1Char('W')), fm.horizontalAdvance(QLatin1Char('.')));
    EXPECT_EQ(fm.horizontalAdvance(QStringLiteral("0123456789ABCDEF")), 16 * other.cellWidth());

    QDomDocument bad;
    ASSERT_TRUE(bad.setContent(QStringLiteral("<hex-editor><font name='' size='99'/><viewport bytes='17' "
                                              "group='3' columns='x' wheel='-4'/></hex-editor>")));
    other.load(bad.documentElement());
    EXPECT_EQ(other.bytesPerLine(), 16u);
    EXPECT_EQ(other.group(), 8u);
    EXPECT_EQ(other.columnMask(), 11u);
    EXPECT_EQ(other.fontSize(), 11);
    EXPECT_EQ(other.wheelLines(), 3);
    EXPECT_FALSE(other.hexOffset());
}

namespace {

class PointStorage : public HexEditor::Storage
{
public:
    using Storage::Storage;

protected:
    QList<NavigationPoint> buildNavigationPoints() override
    {
        return {
            NavigationPoint::jump(QStringLiteral("Partition Table (0)"), 0, HexEditor::Templates::Type(1)),
            NavigationPoint::submenu(
                QStringLiteral("Part 1 [FAT]"),
                {NavigationPoint::jump(QStringLiteral("First Sector (2,048)"), 1048576)}),
            NavigationPoint::ask(QStringLiteral("MFT No..."), NavigationPoint::AskMftRecord)};
    }
};

} // namespace

TEST_F(EditorCtrlPaint, NavigateMenuListsTheStoragesPoints)
{
    EditorCtrlFakeDisk big(4 << 20);
    PointStorage points(&big);
    EditorCtrl c(&points, true);
    QSignalSpy offsets(&c, &EditorCtrl::templateOffsetChanged);
    QSignalSpy requests(&c, &EditorCtrl::templateRequest);
    QSignalSpy mft(&c, &EditorCtrl::mftRecordRequested);
    std::unique_ptr<QMenu> menu(c.createContextMenu());
    QMenu *navigate = nullptr;
    for (QAction *a : menu->actions())
        if (a->menu() && a->text() == QStringLiteral("Navigate "))
            navigate = a->menu();
    ASSERT_NE(navigate, nullptr);
    const QList<QAction *> items = navigate->actions();
    ASSERT_EQ(items.size(), 3);
    EXPECT_EQ(items[0]->text(), QStringLiteral("Partition Table (0)"));
    ASSERT_NE(items[1]->menu(), nullptr);
    items[0]->trigger();
    ASSERT_EQ(offsets.size(), 1);
    EXPECT_EQ(offsets[0].at(0).toULongLong(), 0u);
    EXPECT_TRUE(offsets[0].at(1).toBool());
    ASSERT_EQ(requests.size(), 1);
    EXPECT_EQ(requests[0].at(0).toInt(), 1);
    items[1]->menu()->actions().at(0)->trigger();
    EXPECT_EQ(c.caretOffset(), 1048576u);
    items[2]->trigger();
    EXPECT_EQ(mft.size(), 1);
}

TEST_F(EditorCtrlPaint, BookmarkToolTipTextAndDisabledGrey)
{
    ctrl->setBookmarks({{{64, 8}, QStringLiteral("Boot"), true}});
    const QImage img = paintedViewport(*ctrl);
    const QRect line4(0, ctrl->lineY(4), ctrl->totalWidth(), ctrl->rowHeight());
    EXPECT_GT(countNear(img, ctrl->paintPalette().bookmarkBorder, line4, 20), 4);
    ctrl->setEnabled(false);
    const QImage grey = paintedViewport(*ctrl);
    EXPECT_EQ(countNear(grey, ctrl->paintPalette().cursor.background, grey.rect(), 2), 0);
}
