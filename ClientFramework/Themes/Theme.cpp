#include "ClientFramework/Themes/Theme.h"

#include <QDomDocument>
#include <QFile>
#include <QMutex>
#include <QMutexLocker>

// The theme documents are compiled into this static library; their resource must be
// registered before the first lookup.
static void initThemeResources()
{
    Q_INIT_RESOURCE(brindle_themes);
}

namespace Framework {

namespace {

QColor parseColor(const QString &text)
{
    const QString t = text.trimmed();
    if (t.isEmpty())
        return QColor();
    return QColor::fromString(t);
}

struct ActiveTheme
{
    QMutex mutex;
    Theme theme;
    bool loaded = false;
};

ActiveTheme &activeSlot()
{
    static ActiveTheme slot;
    return slot;
}

} // namespace

bool Theme::load(const QString &resourcePath)
{
    initThemeResources();
    QFile file(resourcePath);
    if (!file.open(QIODevice::ReadOnly))
        return false;
    return parse(file.readAll());
}

bool Theme::parse(const QByteArray &xml, QString *error)
{
    QDomDocument doc;
    QString message;
    if (!doc.setContent(xml, &message)) {
        if (error)
            *error = message;
        return false;
    }
    const QDomElement top = doc.documentElement();
    if (top.tagName() != QLatin1String("theme")) {
        if (error)
            *error = QStringLiteral("not a theme document");
        return false;
    }
    m_name = top.attribute(QStringLiteral("name"));
    m_title = top.attribute(QStringLiteral("title"), m_name);
    m_styleSheet.clear();
    m_palettes.clear();
    for (QDomElement e = top.firstChildElement(); !e.isNull(); e = e.nextSiblingElement()) {
        if (e.tagName() == QLatin1String("stylesheet")) {
            m_styleSheet = e.text();
            continue;
        }
        Palette palette;
        palette.defaultColor = parseColor(e.attribute(QStringLiteral("default")));
        for (QDomElement c = e.firstChildElement(); !c.isNull(); c = c.nextSiblingElement()) {
            QColor colour = parseColor(
                c.hasAttribute(QStringLiteral("color")) ? c.attribute(QStringLiteral("color")) : c.text());
            if (colour.isValid())
                palette.entries.insert(c.tagName(), colour);
        }
        m_palettes.insert(e.tagName(), palette);
    }
    return true;
}

QColor Theme::color(const QString &palette, const QString &entry) const
{
    const auto it = m_palettes.constFind(palette);
    if (it == m_palettes.constEnd())
        return QColor();
    if (entry == QLatin1String("default"))
        return it->defaultColor;
    return it->entries.value(entry, it->defaultColor);
}

QColor Theme::color(const QString &palette, const QString &entry, const QColor &fallback) const
{
    const auto it = m_palettes.constFind(palette);
    if (it == m_palettes.constEnd())
        return fallback;
    if (entry == QLatin1String("default"))
        return it->defaultColor.isValid() ? it->defaultColor : fallback;
    const auto e = it->entries.constFind(entry);
    if (e != it->entries.constEnd())
        return *e;
    return it->defaultColor.isValid() ? it->defaultColor : fallback;
}

QStringList Theme::paletteEntries(const QString &palette) const
{
    QStringList names = m_palettes.value(palette).entries.keys();
    names.sort();
    return names;
}

QStringList Theme::available()
{
    return {QStringLiteral("light"), QStringLiteral("dark")};
}

QString Theme::resourcePath(const QString &name)
{
    return QStringLiteral(":/themes/%1.xml").arg(name);
}

const Theme &Theme::active()
{
    ActiveTheme &slot = activeSlot();
    QMutexLocker lock(&slot.mutex);
    if (!slot.loaded) {
        slot.loaded = true;
        slot.theme.load(resourcePath(QStringLiteral("light")));
    }
    return slot.theme;
}

bool Theme::setActive(const QString &name)
{
    Theme theme;
    if (!theme.load(resourcePath(name)))
        return false;
    ActiveTheme &slot = activeSlot();
    QMutexLocker lock(&slot.mutex);
    slot.theme = theme;
    slot.loaded = true;
    return true;
}

} // namespace Framework
