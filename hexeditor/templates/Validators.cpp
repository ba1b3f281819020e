#include "hexeditor/templates/Validators.h"

#include <QLocale>

#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

HexUInt64Validator::HexUInt64Validator(std::uint64_t minimum, std::uint64_t maximum, QObject *parent)
    : QValidator(parent), m_min(minimum), m_max(maximum)
{
}

QValidator::State HexUInt64Validator::validate(QString &input, int &) const
{
    const QString t = input.simplified();
    if (t.isEmpty() || t.compare(QLatin1String("0x"), Qt::CaseInsensitive) == 0)
        return Intermediate;
    const auto v = Values::parseNumber(t, QLocale());
    if (!v || *v < m_min || *v > m_max)
        return Invalid;
    return Acceptable;
}

HexTimeValidator::HexTimeValidator(bool dateOnly, int minYear, int maxYear, int maxSecond, QObject *parent)
    : QValidator(parent), m_dateOnly(dateOnly), m_minYear(minYear), m_maxYear(maxYear), m_maxSecond(maxSecond)
{
}

QValidator::State HexTimeValidator::validate(QString &input, int &) const
{
    const int length = m_dateOnly ? 10 : 19;
    if (input.size() != length)
        return input.size() < length ? Intermediate : Invalid;
    State state = Acceptable;
    // Each part: position, width, lower limit, upper limit (a value below the lower limit may still
    // grow; one above the upper limit never becomes valid).
    struct Part
    {
        int pos, width, min, max;
    };
    QList<Part> parts = {{0, 4, m_minYear, m_maxYear}, {5, 2, 1, 12}, {8, 2, 1, 31}};
    if (!m_dateOnly)
        parts += QList<Part>{{11, 2, 0, 23}, {14, 2, 0, 59}, {17, 2, 0, m_maxSecond}};
    for (const Part &p : parts) {
        const QString text = input.mid(p.pos, p.width);
        if (text.trimmed().isEmpty() || text.contains(QLatin1Char(' '))) {
            state = Intermediate;
            continue;
        }
        bool ok = false;
        const int v = text.toInt(&ok);
        if (!ok || v > p.max)
            return Invalid;
        if (v < p.min)
            state = Intermediate;
    }
    return state;
}

HexDosFileNameValidator::HexDosFileNameValidator(int maxLength, QObject *parent)
    : QValidator(parent), m_maxLength(maxLength)
{
}

bool HexDosFileNameValidator::allowed(QChar c) const
{
    static const QString extra = QStringLiteral("$%'-_@~`!(){}^#&");
    const char16_t u = c.unicode();
    return (u >= 'A' && u <= 'Z') || (u >= 'a' && u <= 'z') || (u >= '0' && u <= '9') || u > 127 ||
           extra.contains(c);
}

QValidator::State HexDosFileNameValidator::validate(QString &input, int &) const
{
    if (input.isEmpty())
        return m_emptyAcceptable ? Acceptable : Intermediate;
    if (input.size() > m_maxLength)
        return Invalid;
    for (QChar c : input)
        if (!allowed(c))
            return Invalid;
    return Acceptable;
}

HexLongFileNameValidator::HexLongFileNameValidator(int maxLength, QObject *parent)
    : HexDosFileNameValidator(maxLength, parent)
{
    m_emptyAcceptable = true;
}

bool HexLongFileNameValidator::allowed(QChar c) const
{
    static const QString extra = QStringLiteral("+,;=[] ");
    return HexDosFileNameValidator::allowed(c) || extra.contains(c);
}

HexExFatFileNameValidator::HexExFatFileNameValidator(int maxLength, QObject *parent)
    : QValidator(parent), m_maxLength(maxLength)
{
}

QValidator::State HexExFatFileNameValidator::validate(QString &input, int &) const
{
    static const QString banned = QStringLiteral("\"*/:<>?\\|");
    if (input.size() > m_maxLength)
        return Invalid;
    for (QChar c : input)
        if (c.unicode() < 32 || banned.contains(c))
            return Invalid;
    return Acceptable;
}

HexPatternValidator::HexPatternValidator(int maxBytes, QObject *parent)
    : QValidator(parent), m_maxBytes(maxBytes)
{
}

QValidator::State HexPatternValidator::validate(QString &input, int &pos) const
{
    QString digits = input;
    digits.remove(QLatin1Char(' '));
    for (QChar c : digits)
        if (!c.isDigit() && !(c.toUpper() >= QLatin1Char('A') && c.toUpper() <= QLatin1Char('F')))
            return Invalid;
    if (digits.size() > 2 * m_maxBytes)
        return Invalid;
    digits = digits.toUpper();
    QString pairs;
    for (int i = 0; i < digits.size(); i += 2) {
        if (!pairs.isEmpty())
            pairs += QLatin1Char(' ');
        pairs += digits.mid(i, 2);
    }
    // The caret keeps its place among the digits.
    int digitsBefore = 0;
    for (int i = 0; i < pos && i < input.size(); ++i)
        if (input[i] != QLatin1Char(' '))
            ++digitsBefore;
    input = pairs;
    pos = digitsBefore + (digitsBefore > 0 ? (digitsBefore - 1) / 2 : 0);
    if (digits.size() % 2 != 0 || digits.size() < 2 * m_maxBytes)
        return Intermediate;
    return Acceptable;
}

} // namespace HexEditor::Templates
