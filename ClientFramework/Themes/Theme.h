// A theme: an XML document compiled into the program that gives a style sheet and named
// palettes of colours. Palettes are looked up by element name ("node", "hex", ...):
//   <theme name="light" title="Light">
//     <stylesheet>...</stylesheet>
//     <node default="#000000"><critical>#F33</critical>...</node>
//     <hex ...>...</hex>
//   </theme>
// An entry is a child element whose text (or "color" attribute) is the colour; an entry that is
// missing answers the palette's "default" attribute.
#pragma once

#include <QColor>
#include <QHash>
#include <QString>
#include <QStringList>

namespace Framework {

class Theme
{
public:
    Theme() = default;

    // Loads a theme document (":/themes/light.xml"); false when it cannot be read or parsed.
    bool load(const QString &resourcePath);
    // Parses a theme document from text.
    bool parse(const QByteArray &xml, QString *error = nullptr);

    QString name() const { return m_name; }
    QString title() const { return m_title; }
    QString styleSheet() const { return m_styleSheet; }

    // The colour of an entry of a palette; the palette's default when the entry is missing; an
    // invalid colour when the palette is missing.
    QColor color(const QString &palette, const QString &entry) const;
    // The same with a fallback for a missing palette or entry.
    QColor color(const QString &palette, const QString &entry, const QColor &fallback) const;
    bool hasPalette(const QString &palette) const { return m_palettes.contains(palette); }
    QStringList paletteEntries(const QString &palette) const;

    // The themes compiled in ("light", "dark") and the active one (light until set).
    static QStringList available();
    static QString resourcePath(const QString &name);
    static const Theme &active();
    static bool setActive(const QString &name);

private:
    struct Palette
    {
        QColor defaultColor;
        QHash<QString, QColor> entries;
    };
    QString m_name;
    QString m_title;
    QString m_styleSheet;
    QHash<QString, Palette> m_palettes;
};

} // namespace Framework
