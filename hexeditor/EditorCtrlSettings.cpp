// The editor control's settings: the "hex-editor" element with its "font" and "viewport" children.
#include "hexeditor/EditorCtrl.h"

#include <QDomDocument>

#include "ClientFramework/Settings/SettingsDocument.h"

namespace HexEditor {

namespace {

QDomElement childOf(QDomElement parent, const QString &name)
{
    QDomElement e = parent.firstChildElement(name);
    if (e.isNull()) {
        e = parent.ownerDocument().createElement(name);
        parent.appendChild(e);
    }
    return e;
}

uint32_t readUInt(const QDomElement &e, const QString &name, uint32_t fallback)
{
    bool ok = false;
    const uint32_t v = e.attribute(name).toUInt(&ok);
    return ok ? v : fallback;
}

} // namespace

void EditorCtrl::save(QDomElement &element, bool flush)
{
    if (element.isNull())
        return;
    QDomElement font = childOf(element, QStringLiteral("font"));
    font.setAttribute(QStringLiteral("name"), fontFamily());
    font.setAttribute(QStringLiteral("size"), fontSize());
    QDomElement viewport = childOf(element, QStringLiteral("viewport"));
    viewport.setAttribute(QStringLiteral("hex-offset"),
                          hexOffset() ? QStringLiteral("true") : QStringLiteral("false"));
    viewport.setAttribute(QStringLiteral("bytes"), bytesPerLine());
    viewport.setAttribute(QStringLiteral("columns"), columnMask());
    viewport.setAttribute(QStringLiteral("group"), group());
    viewport.setAttribute(QStringLiteral("wheel"), wheelLines());
    viewport.setAttribute(QStringLiteral("page"), pageCount());
    if (flush)
        Framework::SettingsDocument::instance().save();
}

void EditorCtrl::load(const QDomElement &element)
{
    const QDomElement font = element.firstChildElement(QStringLiteral("font"));
    const QString family = font.attribute(QStringLiteral("name"), defaultFontFamily());
    const int size = int(readUInt(font, QStringLiteral("size"), DefaultFontSize));
    const bool knownSize = size == 9 || size == 10 || size == 11 || size == 12 || size == 14;
    setEditorFont(family.isEmpty() ? defaultFontFamily() : family, knownSize ? size : DefaultFontSize);

    const QDomElement viewport = element.firstChildElement(QStringLiteral("viewport"));
    const QString hex = viewport.attribute(QStringLiteral("hex-offset"), QStringLiteral("false")).toLower();
    setHexOffset(hex == QStringLiteral("true") || hex == QStringLiteral("1"));
    setMetricsGroup(readUInt(viewport, QStringLiteral("group"), DefaultGroup));
    setColumns(readUInt(viewport, QStringLiteral("columns"), DefaultColumns));
    setBytesPerLine(readUInt(viewport, QStringLiteral("bytes"), DefaultBytesPerLine));
    setWheelLines(int(std::min<uint32_t>(readUInt(viewport, QStringLiteral("wheel"), 3), 1000)));
    setPageCount(int(std::min<uint32_t>(readUInt(viewport, QStringLiteral("page"), 1), 1000)));
}

} // namespace HexEditor
