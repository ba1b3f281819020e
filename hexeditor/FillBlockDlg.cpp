#include "hexeditor/FillBlockDlg.h"

#include <QDialogButtonBox>
#include <QFormLayout>
#include <QLabel>
#include <QLineEdit>
#include <QLocale>
#include <QPushButton>
#include <QRegularExpressionValidator>
#include <QVBoxLayout>

namespace HexEditor {

FillBlockDlg::FillBlockDlg(const DiskArea &block, QWidget *parent) : QDialog(parent)
{
    setWindowTitle(tr("Fill Block"));
    const QLocale locale;
    const uint64_t last = block.length ? block.offset + block.length - 1 : block.offset;
    m_range =
        new QLabel(tr("From <b>%1</b> to <b>%2</b> [total <b>%3</b> bytes] by pattern provided below:")
                       .arg(locale.toString(qulonglong(block.offset)), locale.toString(qulonglong(last)),
                            locale.toString(qulonglong(block.length))));
    m_text = new QLineEdit;
    m_text->setObjectName(QStringLiteral("editText"));
    m_text->setMaxLength(MaxPattern);
    m_hex = new QLineEdit;
    m_hex->setObjectName(QStringLiteral("editHex"));
    m_hex->setValidator(new QRegularExpressionValidator(
        QRegularExpression(QStringLiteral("([0-9A-Fa-f]{2}\\s*){0,%1}[0-9A-Fa-f]?").arg(MaxPattern)), m_hex));
    m_size = new QLabel;
    m_buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel);

    auto *form = new QFormLayout;
    form->addRow(tr("Text:"), m_text);
    form->addRow(tr("Hex values:"), m_hex);
    auto *layout = new QVBoxLayout(this);
    layout->addWidget(m_range);
    layout->addLayout(form);
    layout->addWidget(m_size);
    layout->addWidget(m_buttons);

    connect(m_text, &QLineEdit::textEdited, this, &FillBlockDlg::onTextEdited);
    connect(m_hex, &QLineEdit::textEdited, this, &FillBlockDlg::onHexEdited);
    connect(m_buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(m_buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    update();
}

void FillBlockDlg::setPattern(const QByteArray &pattern)
{
    m_pattern = pattern.left(MaxPattern);
    m_text->setText(QString::fromLatin1(m_pattern));
    m_hex->setText(QString::fromLatin1(m_pattern.toHex(' ').toUpper()));
    update();
}

QByteArray FillBlockDlg::fillBytes(const QByteArray &pattern, uint64_t length)
{
    QByteArray out;
    if (pattern.isEmpty() || length > (uint64_t(1) << 30))
        return out;
    out.reserve(qsizetype(length));
    const uint64_t whole = length / uint64_t(pattern.size());
    for (uint64_t i = 0; i < whole; ++i)
        out.append(pattern);
    out.append(pattern.left(qsizetype(length % uint64_t(pattern.size()))));
    return out;
}

void FillBlockDlg::onTextEdited(const QString &text)
{
    m_pattern = text.toLatin1().left(MaxPattern);
    m_hex->setText(QString::fromLatin1(m_pattern.toHex(' ').toUpper()));
    update();
}

void FillBlockDlg::onHexEdited(const QString &text)
{
    QString digits = text;
    digits.remove(QRegularExpression(QStringLiteral("\\s")));
    if (digits.size() % 2)
        digits.chop(1); // a half-typed pair counts once it is complete
    m_pattern = QByteArray::fromHex(digits.toLatin1()).left(MaxPattern);
    m_text->setText(QString::fromLatin1(m_pattern));
    update();
}

void FillBlockDlg::update()
{
    m_size->setText(tr("Pattern size: %1 bytes [Maximum: %2 bytes]").arg(m_pattern.size()).arg(MaxPattern));
    m_buttons->button(QDialogButtonBox::Ok)->setEnabled(!m_pattern.isEmpty());
}

} // namespace HexEditor
