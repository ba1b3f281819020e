#include "PaintPalette.h"

#include <QRegularExpression>

#include "ClientFramework/Themes/Theme.h"

namespace HexEditor {

namespace {

QColor c(const char *text)
{
    return PaintPalette::parseColor(QString::fromLatin1(text));
}

void take(const QDomElement &e, const char *attr, QColor &target)
{
    if (e.isNull() || !e.hasAttribute(QString::fromLatin1(attr)))
        return;
    const QColor v = PaintPalette::parseColor(e.attribute(QString::fromLatin1(attr)));
    if (v.isValid())
        target = v;
}

} // namespace

QColor PaintPalette::parseColor(const QString &text)
{
    static const QRegularExpression pattern(
        QStringLiteral("^#([0-9A-Fa-f]{3}|[0-9A-Fa-f]{6}|[0-9A-Fa-f]{8})$"));
    const QString t = text.trimmed();
    if (!pattern.match(t).hasMatch())
        return {};
    // Qt reads "#AARRGGBB" with the alpha channel first, as the theme documents write it.
    return QColor(t);
}

PaintPalette PaintPalette::defaultTheme()
{
    PaintPalette p;
    p.text = c("#000000");
    p.header = c("#0000BE");
    p.disabled = c("#808080");
    p.modified = c("#FFC8C8");
    p.link = c("#0072BC");
    p.lines = c("#B4B4B4");
    p.grid = c("#DCDCDC");
    p.watermark = c("#FF877D");
    p.background = c("#FFFFFF");
    p.selected = c("#C8DCEBFF");
    p.cursor = {c("#FFFFFF"), c("#0000FF")};
    p.cursorInactive = c("#C3C3E6");
    p.bookmarkFrom = c("#7CB5DF");
    p.bookmarkTo = c("#D0F7FF");
    p.bookmarkBorder = c("#002E54");
    p.bookmarkCorner = c("#6D92AE");
    p.searched = {c("#C8A00000"), c("#F0F064C8")};
    p.ghosted = {c("#C8A00000"), c("#F5F5F0")};
    p.templateItem = c("#437EAA");
    p.templateItems = {{c("#DC2F32"), c("#FFEBEC")},
                       {c("#329600"), c("#EBFFE1")},
                       {c("#FFAF0F"), c("#FFFDE1")},
                       {c("#D22DD2"), c("#FFF0FF")},
                       {c("#437EAA"), c("#EDF8FF")}};
    return p;
}

PaintPalette PaintPalette::darkTheme()
{
    PaintPalette p;
    p.text = c("#BBB");
    p.header = c("#EBCD8C");
    p.disabled = c("#999");
    p.modified = c("#FFB");
    p.link = c("#87BED2");
    p.lines = c("#4B5569");
    p.grid = c("#4B5569");
    p.watermark = c("#FF877D");
    p.background = c("#323746");
    p.selected = c("#4B5569");
    p.cursor = {c("#000000"), c("#FFC814")};
    p.cursorInactive = c("#69613E");
    p.bookmarkFrom = c("#3C4150");
    p.bookmarkTo = c("#87BED2");
    p.bookmarkBorder = c("#323746");
    p.bookmarkCorner = c("#323746");
    p.searched = {c("#A00000C8"), c("#70AA7733")};
    p.ghosted = {c("#4482A0C3"), c("#3C4150")};
    p.templateItem = c("#437EAA");
    p.templateItems = {{c("#880000"), c("#22880000")},
                       {c("#008800"), c("#22008800")},
                       {c("#AAAA00"), c("#22AAAA00")},
                       {c("#AA88AA"), c("#33AA88AA")},
                       {c("#66000088"), c("#33000088")}};
    return p;
}

PaintPalette PaintPalette::fromElement(const QDomElement &hexView, const PaintPalette &base)
{
    PaintPalette p = base;
    if (hexView.isNull())
        return p;
    const QDomElement text = hexView.firstChildElement(QStringLiteral("text"));
    take(text, "default", p.text);
    take(text, "header", p.header);
    take(text, "disabled", p.disabled);
    take(text, "modified", p.modified);
    take(text, "link", p.link);
    const QDomElement el = hexView.firstChildElement(QStringLiteral("elements"));
    take(el, "lines", p.lines);
    take(el, "grid", p.grid);
    take(el, "watermark", p.watermark);
    take(el, "background", p.background);
    take(el, "background-selected", p.selected);
    const QDomElement cursor = hexView.firstChildElement(QStringLiteral("cursor"));
    take(cursor, "foreground", p.cursor.foreground);
    take(cursor, "background", p.cursor.background);
    take(cursor, "inactive", p.cursorInactive);
    const QDomElement bm = hexView.firstChildElement(QStringLiteral("bookmark"));
    take(bm, "from", p.bookmarkFrom);
    take(bm, "to", p.bookmarkTo);
    take(bm, "border", p.bookmarkBorder);
    take(bm, "corner", p.bookmarkCorner);
    const QDomElement searched = hexView.firstChildElement(QStringLiteral("searched"));
    take(searched, "foreground", p.searched.foreground);
    take(searched, "background", p.searched.background);
    const QDomElement ghosted = hexView.firstChildElement(QStringLiteral("ghosted"));
    take(ghosted, "foreground", p.ghosted.foreground);
    take(ghosted, "background", p.ghosted.background);
    const QDomElement tp = hexView.firstChildElement(QStringLiteral("template-palette"));
    take(tp, "item", p.templateItem);
    QList<Pair> items;
    for (QDomElement item = tp.firstChildElement(QStringLiteral("item")); !item.isNull();
         item = item.nextSiblingElement(QStringLiteral("item"))) {
        Pair pair = items.size() < p.templateItems.size() ? p.templateItems[items.size()] : Pair{};
        take(item, "foreground", pair.foreground);
        take(item, "background", pair.background);
        if (pair.foreground.isValid() || pair.background.isValid())
            items.append(pair);
    }
    if (!items.isEmpty())
        p.templateItems = items;
    return p;
}

PaintPalette PaintPalette::fromTheme(const Framework::Theme &theme)
{
    const PaintPalette base = theme.name() == QLatin1String("dark") ? darkTheme() : defaultTheme();
    const QString palette = QStringLiteral("hex-view");
    if (!theme.hasPalette(palette))
        return base;
    PaintPalette p = base;
    auto get = [&](const char *entry, QColor &target) {
        const QStringList entries = theme.paletteEntries(palette);
        if (entries.contains(QLatin1String(entry)))
            target = theme.color(palette, QLatin1String(entry), target);
    };
    get("text-default", p.text);
    get("text-header", p.header);
    get("text-disabled", p.disabled);
    get("text-modified", p.modified);
    get("text-link", p.link);
    get("elements-lines", p.lines);
    get("elements-grid", p.grid);
    get("elements-watermark", p.watermark);
    get("elements-background", p.background);
    get("elements-background-selected", p.selected);
    get("cursor-foreground", p.cursor.foreground);
    get("cursor-background", p.cursor.background);
    get("cursor-inactive", p.cursorInactive);
    get("bookmark-from", p.bookmarkFrom);
    get("bookmark-to", p.bookmarkTo);
    get("bookmark-border", p.bookmarkBorder);
    get("bookmark-corner", p.bookmarkCorner);
    get("searched-foreground", p.searched.foreground);
    get("searched-background", p.searched.background);
    get("ghosted-foreground", p.ghosted.foreground);
    get("ghosted-background", p.ghosted.background);
    get("template-palette-item", p.templateItem);
    for (int i = 0; i < p.templateItems.size(); ++i) {
        const QByteArray fg = QStringLiteral("template-palette-item%1-foreground").arg(i + 1).toLatin1();
        const QByteArray bg = QStringLiteral("template-palette-item%1-background").arg(i + 1).toLatin1();
        get(fg.constData(), p.templateItems[i].foreground);
        get(bg.constData(), p.templateItems[i].background);
    }
    return p;
}

PaintPalette PaintPalette::current()
{
    return fromTheme(Framework::Theme::active());
}

QColor PaintPalette::grey(const QColor &color)
{
    if (!color.isValid())
        return QColor(Qt::white);
    const int r = color.red(), g = color.green(), b = color.blue();
    if (r == 255 && g == 255 && b == 255)
        return QColor(0xC8, 0xC8, 0xC8);
    if (r == 0 && g == 0 && b == 0)
        return QColor(0xA0, 0xA0, 0xA0);
    const int v = (11 * r + 16 * g + 5 * b) / 32;
    return QColor(v, v, v);
}

PaintPalette PaintPalette::greyed() const
{
    PaintPalette p = *this;
    for (QColor *col : {&p.text,
                        &p.header,
                        &p.disabled,
                        &p.modified,
                        &p.link,
                        &p.lines,
                        &p.grid,
                        &p.watermark,
                        &p.background,
                        &p.selected,
                        &p.cursor.foreground,
                        &p.cursor.background,
                        &p.cursorInactive,
                        &p.bookmarkFrom,
                        &p.bookmarkTo,
                        &p.bookmarkBorder,
                        &p.bookmarkCorner,
                        &p.searched.foreground,
                        &p.searched.background,
                        &p.ghosted.foreground,
                        &p.ghosted.background,
                        &p.templateItem})
        *col = grey(*col);
    for (Pair &pair : p.templateItems) {
        pair.foreground = grey(pair.foreground);
        pair.background = grey(pair.background);
    }
    return p;
}

} // namespace HexEditor
