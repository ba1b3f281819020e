#include "hexeditor/templates/OffsetEditCtrl.h"

#include "hexeditor/templates/core/SizeMath.h"
#include "hexeditor/templates/core/Values.h"

#include <QLocale>

namespace HexEditor::Templates {

namespace {

// A decimal or "0x" hexadecimal number; blanks are ignored.
std::optional<std::uint64_t> number(const QString &text)
{
    return Values::parseNumber(text, QLocale::c());
}

} // namespace

OffsetEditCtrl::OffsetEditCtrl(QWidget *parent) : QLineEdit(parent)
{
    setMaximumWidth(160);
    connect(this, &QLineEdit::editingFinished, this, &OffsetEditCtrl::onEditingFinished);
    setOffset(0);
}

void OffsetEditCtrl::setHexOffsets(bool hex)
{
    m_hex = hex;
    setOffset(m_offset);
}

void OffsetEditCtrl::setOffset(std::uint64_t offset)
{
    m_offset = offset;
    setText(m_hex ? QStringLiteral("0x%1")
                        .arg(offset, 0, 16)
                        .toUpper()
                        .replace(QLatin1String("0X"), QLatin1String("0x"))
                  : QString::number(offset));
}

std::optional<std::uint64_t> OffsetEditCtrl::parse(const QString &text) const
{
    const qsizetype colon = text.indexOf(QLatin1Char(':'));
    if (colon < 0)
        return number(text);
    const auto sector = number(text.left(colon));
    const auto within = number(text.mid(colon + 1));
    if (!sector || !within)
        return std::nullopt;
    const std::uint64_t base = SizeMath::mul(*sector, m_sectorSize);
    const std::uint64_t at = SizeMath::add(base, *within);
    if (base == SizeMath::None || at == SizeMath::None)
        return std::nullopt;
    return at;
}

void OffsetEditCtrl::onEditingFinished()
{
    const auto v = parse(text());
    if (!v) {
        setOffset(m_offset);
        return;
    }
    if (*v == m_offset)
        return;
    m_offset = *v;
    emit offsetEdited(quint64(*v));
}

} // namespace HexEditor::Templates
