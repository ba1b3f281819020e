#include "hexeditor/HexInt64Validator.h"

#include <QLocale>

namespace HexEditor {

namespace {

struct Parsed
{
    bool negative = false;
    bool hex = false;
    QString digits; // without sign, prefix, group separators and blanks
};

Parsed split(const QString &input, const QLocale &locale)
{
    Parsed p;
    QString rest = input;
    if (rest.startsWith(QLatin1Char('-'))) {
        p.negative = true;
        rest.remove(0, 1);
    }
    if (rest.startsWith(QLatin1String("0x"), Qt::CaseInsensitive)) {
        p.hex = true;
        rest.remove(0, 2);
    }
    rest.remove(locale.groupSeparator());
    QString digits;
    digits.reserve(rest.size());
    for (const QChar c : rest)
        if (!c.isSpace())
            digits.append(c);
    p.digits = digits;
    return p;
}

std::optional<int64_t> convert(const Parsed &p)
{
    if (p.digits.isEmpty())
        return std::nullopt;
    for (const QChar c : p.digits) {
        const bool ok =
            p.hex ? (c.isDigit() || (c.toLower() >= QLatin1Char('a') && c.toLower() <= QLatin1Char('f')))
                  : (c >= QLatin1Char('0') && c <= QLatin1Char('9'));
        if (!ok)
            return std::nullopt;
    }
    bool ok = false;
    const qulonglong magnitude = p.digits.toULongLong(&ok, p.hex ? 16 : 10);
    if (!ok)
        return std::nullopt;
    if (p.negative) {
        if (magnitude > static_cast<qulonglong>(INT64_MAX) + 1)
            return std::nullopt;
        return magnitude == static_cast<qulonglong>(INT64_MAX) + 1 ? INT64_MIN
                                                                   : -static_cast<int64_t>(magnitude);
    }
    if (magnitude > static_cast<qulonglong>(INT64_MAX))
        return std::nullopt;
    return static_cast<int64_t>(magnitude);
}

} // namespace

HexInt64Validator::HexInt64Validator(int64_t minimum, int64_t maximum, QObject *parent)
    : QValidator(parent), m_min(minimum), m_max(maximum)
{
}

void HexInt64Validator::setRange(int64_t minimum, int64_t maximum)
{
    if (m_min == minimum && m_max == maximum)
        return;
    m_min = minimum;
    m_max = maximum;
    emit changed();
}

bool HexInt64Validator::isHexadecimal(const QString &text)
{
    QString rest = text;
    if (rest.startsWith(QLatin1Char('-')))
        rest.remove(0, 1);
    return rest.startsWith(QLatin1String("0x"), Qt::CaseInsensitive);
}

QValidator::State HexInt64Validator::validate(QString &input, int &pos) const
{
    const QLocale loc = locale();
    const Parsed p = split(input, loc);
    if (p.negative && m_min >= 0)
        return Invalid;
    if (p.digits.isEmpty() || (p.negative && !p.hex && p.digits == QLatin1String("0")))
        return Intermediate;
    const std::optional<int64_t> v = convert(p);
    if (!v)
        return Invalid;
    if (*v < m_min)
        return *v < 0 ? Invalid : Intermediate;
    if (*v > m_max)
        return Invalid;
    if (!p.hex) {
        const bool atEnd = pos >= input.size();
        const QString grouped = loc.toString(static_cast<qlonglong>(*v));
        if (grouped != input) {
            input = grouped;
            if (atEnd || pos > input.size())
                pos = input.size();
        }
    }
    return Acceptable;
}

std::optional<int64_t> HexInt64Validator::value(const QString &text) const
{
    return convert(split(text.trimmed(), locale()));
}

std::optional<int64_t> HexInt64Validator::acceptedValue(const QString &text) const
{
    const std::optional<int64_t> v = value(text);
    if (!v || *v < m_min || *v > m_max)
        return std::nullopt;
    return v;
}

} // namespace HexEditor
