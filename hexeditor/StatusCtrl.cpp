#include "hexeditor/StatusCtrl.h"

#include "hexeditor/ViewResources.h"

#include <QHBoxLayout>
#include <QIcon>
#include <QLabel>
#include <QLocale>
#include <QProgressBar>
#include <QToolButton>

namespace HexEditor {

namespace {

QString hex(uint64_t v)
{
    return QString::number(v, 16).toUpper();
}

QLabel *makeLabel(const char *name, QWidget *parent, QHBoxLayout *layout)
{
    auto *label = new QLabel(parent);
    label->setObjectName(QLatin1String(name));
    label->setTextFormat(Qt::RichText);
    layout->addWidget(label);
    return label;
}

} // namespace

StatusCtrl::StatusCtrl(QWidget *parent) : QWidget(parent)
{
    initViewResources();
    setObjectName(QStringLiteral("StatusCtrl"));
    auto *layout = new QHBoxLayout(this);
    layout->setContentsMargins(4, 0, 4, 0);
    layout->setSpacing(12);
    m_stop = new QToolButton(this);
    m_stop->setObjectName(QStringLiteral("btnStop"));
    m_stop->setIcon(QIcon(QStringLiteral(":/hexeditor/stop")));
    m_stop->setToolTip(tr("Stop"));
    m_stop->setAutoRaise(true);
    m_stop->setVisible(false);
    connect(m_stop, &QToolButton::clicked, this, &StatusCtrl::stopProcess);
    layout->addWidget(m_stop);
    m_progress = new QProgressBar(this);
    m_progress->setRange(0, 100);
    m_progress->setMaximumWidth(160);
    m_progress->setVisible(false);
    layout->addWidget(m_progress);
    m_selection = makeLabel("lblSelection", this, layout);
    layout->addStretch(1);
    m_sector = makeLabel("lblSector", this, layout);
    m_offset = makeLabel("lblOffset", this, layout);
    m_line = makeLabel("lblLine", this, layout);
    m_col = makeLabel("lblCol", this, layout);
    m_format = makeLabel("lblOffsetFormat", this, layout);
    m_editable = makeLabel("lblEditable", this, layout);
    setCaret(0, 0, 0, 0);
    onStateChanged(false, true, false);
}

QLabel *StatusCtrl::label(const QString &objectName) const
{
    return findChild<QLabel *>(objectName);
}

void StatusCtrl::setCaret(uint64_t offset, uint64_t sector, uint64_t line, uint32_t column)
{
    const QLocale loc;
    m_sector->setText(tr("Sector: <b>%1 (0x%2)</b>").arg(loc.toString(qulonglong(sector)), hex(sector)));
    m_offset->setText(tr("Offset: <b>%1 (0x%2)</b>").arg(loc.toString(qulonglong(offset)), hex(offset)));
    m_line->setText(tr("Ln: <b>%1</b>").arg(loc.toString(qulonglong(line))));
    m_col->setText(tr("Col: <b>%1</b>").arg(column));
}

void StatusCtrl::onSelectionChanged(const DiskArea &area, uint bytesPerSector)
{
    m_area = area;
    m_bytesPerSector = bytesPerSector;
    showSelection();
}

void StatusCtrl::showSelection()
{
    if (m_area.length == 0) {
        m_selection->clear();
        m_selection->setToolTip(QString());
        return;
    }
    const bool aligned = m_bytesPerSector != 0 && m_area.offset % m_bytesPerSector == 0 &&
                         m_area.length % m_bytesPerSector == 0;
    const QString color = aligned ? AlignedColor : UnalignedColor;
    const QLocale loc;
    const uint64_t first = m_area.offset;
    const uint64_t last = m_area.end() - 1;
    const QString length = loc.toString(qulonglong(m_area.length));
    if (m_hex)
        m_selection->setText(tr("Selection: <b style='color: %1;'>%2 (0x%3) - %4 (0x%5) [%6]</b>")
                                 .arg(color, loc.toString(qulonglong(first)), hex(first),
                                      loc.toString(qulonglong(last)), hex(last), length));
    else
        m_selection->setText(
            tr("Selection: <b style='color: %1;'>%2 - %3 [%4]</b>")
                .arg(color, loc.toString(qulonglong(first)), loc.toString(qulonglong(last)), length));
    m_selection->setToolTip(
        tr("Selection is%1 aligned to sectors boundaries").arg(aligned ? QString() : tr(" <b>not</b>")));
}

void StatusCtrl::onStateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian)
{
    m_hex = isHexOffset;
    m_format->setText(tr("<b>%1</b>, %2")
                          .arg(isHexOffset ? tr("<b>HEX</b>") : tr("<b>DEC</b>"),
                               isBigEndian ? tr("Big Endian") : tr("Little Endian")));
    m_format->setToolTip(isHexOffset ? tr("Hexadecimal offset and addressing")
                                     : tr("Decimal offset and addressing"));
    m_editable->setText(isReadOnly ? tr(" <b style='color: green;'>Read Only</b> ")
                                   : tr(" <b style='color: red;'>Read/Write</b> "));
    m_editable->setToolTip(tr("<b>%1</b><br/>To change editing mode use <b>Ctrl+Alt+E</b> shortcut of "
                              "<b>Edit > Allow Edit Content</b> menu command.")
                               .arg(isReadOnly ? tr("Read Only mode") : tr("Editing Allowed")));
    showSelection();
}

void StatusCtrl::onThreadProgress(int percent)
{
    m_stop->setVisible(true);
    m_progress->setVisible(true);
    m_progress->setValue(qBound(0, percent, 100));
}

void StatusCtrl::onThreadFinished(int result, const QString &note)
{
    Q_UNUSED(result);
    m_stop->setVisible(false);
    m_progress->setVisible(false);
    m_progress->setValue(0);
    m_progress->setToolTip(note);
}

} // namespace HexEditor
