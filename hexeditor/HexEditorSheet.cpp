#include "hexeditor/HexEditorSheet.h"

#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Metrics.h"
#include "hexeditor/View.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/MainView.h"

#include <QCheckBox>
#include <QComboBox>
#include <QFontDatabase>
#include <QFormLayout>
#include <QSpinBox>

#include <algorithm>

namespace HexEditor {

namespace {

const QString FontElement = QStringLiteral("font");
const QString ViewportElement = QStringLiteral("viewport");
constexpr int MaxScroll = 1000;

struct SizeChoice
{
    int size;
    const char *text;
};
constexpr SizeChoice FontSizes[] = {
    {14, QT_TRANSLATE_NOOP("HexEditor::HexEditorSheet", "Largest")},
    {12, QT_TRANSLATE_NOOP("HexEditor::HexEditorSheet", "Large")},
    {11, QT_TRANSLATE_NOOP("HexEditor::HexEditorSheet", "Medium")},
    {10, QT_TRANSLATE_NOOP("HexEditor::HexEditorSheet", "Smaller")},
    {9, QT_TRANSLATE_NOOP("HexEditor::HexEditorSheet", "Smallest")},
};
constexpr uint32_t BytesPerLine[] = {8, 16, 32, 64, 128};

QDomElement childOf(QDomElement parent, const QString &name)
{
    QDomElement e = parent.firstChildElement(name);
    if (e.isNull() && !parent.isNull()) {
        e = parent.ownerDocument().createElement(name);
        parent.appendChild(e);
    }
    return e;
}

// A number attribute: missing or not a number gives the fallback.
bool readNumber(const QDomElement &e, const QString &name, qlonglong &value)
{
    if (!e.hasAttribute(name))
        return false;
    bool ok = false;
    const qlonglong v = e.attribute(name).trimmed().toLongLong(&ok);
    if (ok)
        value = v;
    return ok;
}

// Selects the entry whose data is value; a value not in the list selects the first entry.
void selectData(QComboBox *box, const QVariant &value)
{
    const int index = box->findData(value);
    box->setCurrentIndex(index >= 0 ? index : 0);
}

} // namespace

HexEditorSheet::HexEditorSheet(std::function<QDomElement()> element, QWidget *parent)
    : PreferenceSheet(ObjectName, element ? std::move(element) : &HexEditorSheet::settingsElement, parent),
      m_hexOffset(new QCheckBox(tr("&Hexadecimal offsets"), this)), m_wheel(new QSpinBox(this)),
      m_pages(new QSpinBox(this)), m_ascii(new QCheckBox(tr("Show A&SCII column"), this)),
      m_unicode(new QCheckBox(tr("Show &UNICODE column"), this)), m_bytes(new QComboBox(this)),
      m_fontName(new QComboBox(this)), m_fontSize(new QComboBox(this))
{
    m_hexOffset->setObjectName(QStringLiteral("hexOffset"));
    m_wheel->setObjectName(QStringLiteral("wheelLines"));
    m_pages->setObjectName(QStringLiteral("pages"));
    m_ascii->setObjectName(QStringLiteral("asciiColumn"));
    m_unicode->setObjectName(QStringLiteral("unicodeColumn"));
    m_bytes->setObjectName(QStringLiteral("bytesPerLine"));
    m_fontName->setObjectName(QStringLiteral("fontName"));
    m_fontSize->setObjectName(QStringLiteral("fontSize"));

    m_wheel->setRange(1, MaxScroll);
    m_pages->setRange(1, MaxScroll);
    for (uint32_t n : BytesPerLine)
        m_bytes->addItem(QString::number(n), n);
    for (const QString &family : fontFamilies())
        m_fontName->addItem(family, family);
    for (const SizeChoice &c : FontSizes)
        m_fontSize->addItem(tr(c.text), c.size);

    form()->addRow(m_hexOffset);
    form()->addRow(tr("Lines to scroll on a &wheel roll:"), m_wheel);
    form()->addRow(tr("&Pages to scroll on a PgUp/PgDown:"), m_pages);
    form()->addRow(m_ascii);
    form()->addRow(m_unicode);
    form()->addRow(tr("&Bytes per line:"), m_bytes);
    form()->addRow(tr("&Font name:"), m_fontName);
    form()->addRow(tr("F&ont size:"), m_fontSize);
    showValues(defaults());
}

QDomElement HexEditorSheet::settingsElement()
{
    auto &settings = Framework::SettingsDocument::instance();
    QDomElement views = Framework::SettingsDocument::child(
        settings.element(Framework::MainView::SettingsElement), Framework::MainView::ViewsElement);
    return Framework::SettingsDocument::child(Framework::SettingsDocument::child(views, View::ViewId),
                                              View::EditorSettingsElement);
}

QStringList HexEditorSheet::fontFamilies()
{
    QStringList families;
    for (const QString &family : QFontDatabase::families())
        if (QFontDatabase::isFixedPitch(family) && !QFontDatabase::isPrivateFamily(family))
            families.append(family);
    families.removeDuplicates();
    // The editor's default stands in with the system's fixed font when it is not installed; it is
    // offered all the same, first.
    const QString fallback = Metrics::defaultFontFamily();
    if (!families.contains(fallback))
        families.prepend(fallback);
    return families;
}

HexEditorSheet::Values HexEditorSheet::defaults()
{
    Values v;
    v.fontName = Metrics::defaultFontFamily();
    v.fontSize = Metrics::DefaultFontSize;
    v.hexOffset = false;
    v.wheelLines = 3;
    v.pages = 1;
    v.columns = Metrics::DefaultColumns;
    v.bytesPerLine = Metrics::DefaultBytesPerLine;
    return v;
}

QString HexEditorSheet::pageTitle() const
{
    return Framework::Identity::ShortName;
}

QString HexEditorSheet::pageDescription() const
{
    return tr("%1 allows to inspect low-level disk's sectors and file system structures")
        .arg(Framework::Identity::ShortName);
}

QIcon HexEditorSheet::pageIcon() const
{
    return QIcon(IconPath);
}

HexEditorSheet::Values HexEditorSheet::values() const
{
    Values v;
    v.fontName = m_fontName->currentData().toString();
    v.fontSize = m_fontSize->currentData().toInt();
    v.hexOffset = m_hexOffset->isChecked();
    v.wheelLines = m_wheel->value();
    v.pages = m_pages->value();
    uint32_t mask = m_storedColumns & ~uint32_t(Metrics::PaneAscii | Metrics::PaneUnicode);
    if (m_ascii->isChecked())
        mask |= Metrics::PaneAscii;
    if (m_unicode->isChecked())
        mask |= Metrics::PaneUnicode;
    v.columns = mask;
    v.bytesPerLine = m_bytes->currentData().toUInt();
    return v;
}

void HexEditorSheet::showValues(const Values &v)
{
    m_storedColumns = v.columns;
    m_hexOffset->setChecked(v.hexOffset);
    m_wheel->setValue(std::clamp(v.wheelLines, 1, MaxScroll));
    m_pages->setValue(std::clamp(v.pages, 1, MaxScroll));
    m_ascii->setChecked(v.columns & Metrics::PaneAscii);
    m_unicode->setChecked(v.columns & Metrics::PaneUnicode);
    selectData(m_bytes, v.bytesPerLine);
    selectData(m_fontName, v.fontName);
    selectData(m_fontSize, v.fontSize);
}

void HexEditorSheet::loadSettings()
{
    const QDomElement element = settings();
    const QDomElement font = element.firstChildElement(FontElement);
    const QDomElement viewport = element.firstChildElement(ViewportElement);
    Values v = defaults();
    // Missing values show the defaults; values that are there but not offered select the first entry.
    if (font.hasAttribute(QStringLiteral("name")))
        v.fontName = font.attribute(QStringLiteral("name"));
    qlonglong n = 0;
    if (font.hasAttribute(QStringLiteral("size")))
        v.fontSize = readNumber(font, QStringLiteral("size"), n) && n > 0 && n < 100 ? int(n) : -1;
    if (viewport.hasAttribute(QStringLiteral("hex-offset"))) {
        const QString hex = viewport.attribute(QStringLiteral("hex-offset")).trimmed().toLower();
        v.hexOffset = hex == QStringLiteral("true") || hex == QStringLiteral("1");
    }
    if (readNumber(viewport, QStringLiteral("wheel"), n))
        v.wheelLines = int(std::clamp<qlonglong>(n, 1, MaxScroll));
    if (readNumber(viewport, QStringLiteral("page"), n))
        v.pages = int(std::clamp<qlonglong>(n, 1, MaxScroll));
    if (readNumber(viewport, QStringLiteral("columns"), n) && n >= 0 && n <= qlonglong(UINT32_MAX))
        v.columns = uint32_t(n);
    if (viewport.hasAttribute(QStringLiteral("bytes")))
        v.bytesPerLine =
            readNumber(viewport, QStringLiteral("bytes"), n) && n > 0 && n <= 4096 ? uint32_t(n) : 0;
    showValues(v);
}

void HexEditorSheet::saveSettings()
{
    QDomElement element = settings();
    if (element.isNull())
        return;
    const Values v = values();
    QDomElement font = childOf(element, FontElement);
    font.setAttribute(QStringLiteral("name"), v.fontName);
    font.setAttribute(QStringLiteral("size"), v.fontSize);
    QDomElement viewport = childOf(element, ViewportElement);
    viewport.setAttribute(QStringLiteral("hex-offset"),
                          v.hexOffset ? QStringLiteral("true") : QStringLiteral("false"));
    viewport.setAttribute(QStringLiteral("wheel"), v.wheelLines);
    viewport.setAttribute(QStringLiteral("page"), v.pages);
    viewport.setAttribute(QStringLiteral("columns"), v.columns);
    viewport.setAttribute(QStringLiteral("bytes"), v.bytesPerLine);
    m_storedColumns = v.columns;
    if (m_applier)
        m_applier(v);
}

void HexEditorSheet::restoreDefaults()
{
    Values v = defaults();
    // Only the two column bits of the page have defaults; the rest of the stored mask stays.
    v.columns = (m_storedColumns & ~uint32_t(Metrics::PaneAscii | Metrics::PaneUnicode)) | Metrics::PaneAscii;
    showValues(v);
}

void HexEditorSheet::applyTo(EditorCtrl *editor, const Values &v)
{
    if (!editor)
        return;
    editor->setEditorFont(v.fontName, v.fontSize);
    editor->setWheelLines(v.wheelLines);
    editor->setPageCount(v.pages);
    editor->setColumns((editor->columnMask() & ~uint32_t(Metrics::PaneAscii | Metrics::PaneUnicode)) |
                       (v.columns & uint32_t(Metrics::PaneAscii | Metrics::PaneUnicode)));
    editor->setBytesPerLine(v.bytesPerLine);
    editor->setHexOffset(v.hexOffset);
}

} // namespace HexEditor
