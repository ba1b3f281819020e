// The hex view's colours: the "hex-view" element of the active theme's palette, with the default
// and the dark theme's values built in for a theme that lacks an entry.
#pragma once

#include <QColor>
#include <QDomElement>
#include <QList>
#include <QString>

namespace Framework {
class Theme;
}

namespace HexEditor {

struct PaintPalette
{
    struct Pair
    {
        QColor foreground;
        QColor background;
    };

    QColor text;           // text default
    QColor header;         // text header
    QColor disabled;       // text disabled
    QColor modified;       // text modified
    QColor link;           // text link
    QColor lines;          // elements lines
    QColor grid;           // elements grid
    QColor watermark;      // elements watermark
    QColor background;     // elements background
    QColor selected;       // elements background-selected
    Pair cursor;           // cursor foreground / background
    QColor cursorInactive; // cursor inactive
    QColor bookmarkFrom, bookmarkTo, bookmarkBorder, bookmarkCorner;
    Pair searched;
    Pair ghosted;
    QColor templateItem;       // outline of the selected template field
    QList<Pair> templateItems; // field colouring, used in turn

    static PaintPalette defaultTheme();
    static PaintPalette darkTheme();

    // Reads the "hex-view" element of a theme palette; entries it lacks keep the values of `base`.
    static PaintPalette fromElement(const QDomElement &hexView, const PaintPalette &base = defaultTheme());

    // The "hex-view" palette of a theme document (entries "text-default", "cursor-background",
    // "template-palette-item1-foreground" and so on); entries it lacks keep the built-in values.
    static PaintPalette fromTheme(const Framework::Theme &theme);
    // The palette of the active application theme (the default theme when none is loaded).
    static PaintPalette current();

    // A theme colour: "#" and three, six or eight hexadecimal digits (with eight, alpha first).
    // An invalid text gives an invalid colour.
    static QColor parseColor(const QString &text);

    // The grey form of a colour: invalid -> white, white -> #C8C8C8, black -> #A0A0A0, others the
    // grey (11 R + 16 G + 5 B) / 32, fully opaque.
    static QColor grey(const QColor &c);
    // Every colour in its grey form.
    PaintPalette greyed() const;
};

} // namespace HexEditor
