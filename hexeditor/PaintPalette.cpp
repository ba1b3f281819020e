#include "hexeditor/PaintPalette.h"

#include <QRegularExpression>

#include "ClientFramework/Themes/Theme.h"

namespace HexEditor {

namespace {

QColor c(const char *text)
{
    return PaintPalette::parseColor(QString::fromLatin1(text));
}

// One colour of the palette: where a theme gives it (the attribute of a child of "hex-view"; the
// palette entry is "element-attribute") and its built-in values in the default and the dark theme.
struct Entry
{
    const char *element;
    const char *attribute;
    const char *light;
    const char *dark;
    QColor PaintPalette::*color = nullptr;
    PaintPalette::Pair PaintPalette::*pair = nullptr;
    QColor PaintPalette::Pair::*side = nullptr;

    QColor &in(PaintPalette &p) const { return pair ? (p.*pair).*side : p.*color; }
    QString themeEntry() const
    {
        return QString::fromLatin1(element) + u'-' + QString::fromLatin1(attribute);
    }
};

using P = PaintPalette;
using Pair = PaintPalette::Pair;

const Entry g_entries[] = {
    {"text", "default", "#000000", "#BBB", &P::text},
    {"text", "header", "#0000BE", "#EBCD8C", &P::header},
    {"text", "disabled", "#808080", "#999", &P::disabled},
    {"text", "modified", "#FFC8C8", "#FFB", &P::modified},
    {"text", "link", "#0072BC", "#87BED2", &P::link},
    {"elements", "lines", "#B4B4B4", "#4B5569", &P::lines},
    {"elements", "grid", "#DCDCDC", "#4B5569", &P::grid},
    {"elements", "watermark", "#FF877D", "#FF877D", &P::watermark},
    {"elements", "background", "#FFFFFF", "#323746", &P::background},
    {"elements", "background-selected", "#C8DCEBFF", "#4B5569", &P::selected},
    {"cursor", "foreground", "#FFFFFF", "#000000", nullptr, &P::cursor, &Pair::foreground},
    {"cursor", "background", "#0000FF", "#FFC814", nullptr, &P::cursor, &Pair::background},
    {"cursor", "inactive", "#C3C3E6", "#69613E", &P::cursorInactive},
    {"bookmark", "from", "#7CB5DF", "#3C4150", &P::bookmarkFrom},
    {"bookmark", "to", "#D0F7FF", "#87BED2", &P::bookmarkTo},
    {"bookmark", "border", "#002E54", "#323746", &P::bookmarkBorder},
    {"bookmark", "corner", "#6D92AE", "#323746", &P::bookmarkCorner},
    {"searched", "foreground", "#C8A00000", "#A00000C8", nullptr, &P::searched, &Pair::foreground},
    {"searched", "background", "#F0F064C8", "#70AA7733", nullptr, &P::searched, &Pair::background},
    {"ghosted", "foreground", "#C8A00000", "#4482A0C3", nullptr, &P::ghosted, &Pair::foreground},
    {"ghosted", "background", "#F5F5F0", "#3C4150", nullptr, &P::ghosted, &Pair::background},
    {"template-palette", "item", "#437EAA", "#437EAA", &P::templateItem},
};

// The field colouring's built-in pairs: foreground and background of the default, then of the dark theme.
const char *const g_items[][4] = {
    {"#DC2F32", "#FFEBEC", "#880000", "#22880000"},   {"#329600", "#EBFFE1", "#008800", "#22008800"},
    {"#FFAF0F", "#FFFDE1", "#AAAA00", "#22AAAA00"},   {"#D22DD2", "#FFF0FF", "#AA88AA", "#33AA88AA"},
    {"#437EAA", "#EDF8FF", "#66000088", "#33000088"},
};

PaintPalette builtIn(bool dark)
{
    PaintPalette p;
    for (const Entry &e : g_entries)
        e.in(p) = c(dark ? e.dark : e.light);
    const int at = dark ? 2 : 0;
    for (const auto &item : g_items)
        p.templateItems.append({c(item[at]), c(item[at + 1])});
    return p;
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
    return builtIn(false);
}

PaintPalette PaintPalette::darkTheme()
{
    return builtIn(true);
}

PaintPalette PaintPalette::fromElement(const QDomElement &hexView, const PaintPalette &base)
{
    PaintPalette p = base;
    if (hexView.isNull())
        return p;
    for (const Entry &e : g_entries)
        take(hexView.firstChildElement(QString::fromLatin1(e.element)), e.attribute, e.in(p));
    const QDomElement tp = hexView.firstChildElement(QStringLiteral("template-palette"));
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
    const QStringList entries = theme.paletteEntries(palette);
    auto get = [&](const QString &entry, QColor &target) {
        if (entries.contains(entry))
            target = theme.color(palette, entry, target);
    };
    for (const Entry &e : g_entries)
        get(e.themeEntry(), e.in(p));
    for (int i = 0; i < p.templateItems.size(); ++i) {
        get(QStringLiteral("template-palette-item%1-foreground").arg(i + 1), p.templateItems[i].foreground);
        get(QStringLiteral("template-palette-item%1-background").arg(i + 1), p.templateItems[i].background);
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
    for (const Entry &e : g_entries)
        e.in(p) = grey(e.in(p));
    for (Pair &pair : p.templateItems) {
        pair.foreground = grey(pair.foreground);
        pair.background = grey(pair.background);
    }
    return p;
}

} // namespace HexEditor
