#include "hexeditor/FillPattern.h"

#include <cstring>

namespace HexEditor::FillPattern {

bool isValid(const QByteArray &pattern)
{
    return !pattern.isEmpty() && pattern.size() <= MaxLength;
}

QByteArray fill(const QByteArray &pattern, std::uint64_t length)
{
    if (!isValid(pattern) || length > MaxBlock)
        return QByteArray();
    QByteArray block(qsizetype(length), Qt::Uninitialized);
    const qsizetype size = pattern.size();
    for (qsizetype at = 0; at < block.size(); at += size)
        std::memcpy(block.data() + at, pattern.constData(), std::size_t(std::min(size, block.size() - at)));
    return block;
}

QByteArray fromText(const QString &text, bool *ok)
{
    QByteArray bytes;
    bytes.reserve(text.size());
    for (const QChar c : text) {
        if (c.unicode() > 0xFF) {
            if (ok)
                *ok = false;
            return QByteArray();
        }
        bytes.append(char(c.unicode()));
    }
    if (ok)
        *ok = true;
    return bytes;
}

QString toText(const QByteArray &pattern)
{
    return QString::fromLatin1(pattern);
}

QByteArray fromHex(const QString &hex, bool *ok)
{
    QByteArray bytes;
    int high = -1;
    for (const QChar c : hex) {
        if (c == QLatin1Char(' ')) {
            if (high >= 0)
                break; // a blank inside a pair
            continue;
        }
        const int digit = c.isDigit() ? c.unicode() - '0'
                          : (c.toLower() >= QLatin1Char('a') && c.toLower() <= QLatin1Char('f'))
                              ? c.toLower().unicode() - 'a' + 10
                              : -1;
        if (c.unicode() > 0x7F || digit < 0) {
            high = -2;
            break;
        }
        if (high < 0) {
            high = digit;
        } else {
            bytes.append(char(high * 16 + digit));
            high = -1;
        }
    }
    const bool good = high == -1;
    if (ok)
        *ok = good;
    return good ? bytes : QByteArray();
}

QString toHex(const QByteArray &pattern)
{
    return QString::fromLatin1(pattern.toHex(' ').toUpper());
}

} // namespace HexEditor::FillPattern
