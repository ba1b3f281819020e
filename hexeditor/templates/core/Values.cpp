#include "hexeditor/templates/core/Values.h"

#include <QDateTime>
#include <QRegularExpression>
#include <QStringDecoder>
#include <QStringEncoder>

#include <cctype>
#include <limits>

namespace HexEditor::Templates::Values {

namespace {

const QDateTime &windowsEpoch()
{
    static const QDateTime epoch(QDate(1601, 1, 1), QTime(0, 0), Qt::UTC);
    return epoch;
}

// 100-ns ticks since 1601 as a broken-down time without any zone shift; invalid above the range
// the platform conversion accepts.
QDateTime fromTicks(std::uint64_t ticks)
{
    if (ticks > std::uint64_t(std::numeric_limits<std::int64_t>::max()))
        return {};
    const QDateTime utc = windowsEpoch().addMSecs(qint64(ticks / 10000));
    return QDateTime(utc.date(), utc.time());
}

QString shortDateTime(const QDateTime &dt, const QLocale &locale)
{
    return dt.isValid() ? locale.toString(dt, QLocale::ShortFormat) : QString();
}

QString editDateTime(const QDateTime &dt)
{
    if (!dt.isValid())
        return {};
    const QDate d = dt.date();
    const QTime t = dt.time();
    return QStringLiteral("%1-%2-%3 %4:%5:%6")
        .arg(d.year())
        .arg(d.month(), 2, 10, QLatin1Char('0'))
        .arg(d.day(), 2, 10, QLatin1Char('0'))
        .arg(t.hour(), 2, 10, QLatin1Char('0'))
        .arg(t.minute(), 2, 10, QLatin1Char('0'))
        .arg(t.second(), 2, 10, QLatin1Char('0'));
}

QDate dosDate(std::uint32_t word)
{
    return QDate(1980 + int((word >> 9) & 0x7F), int((word >> 5) & 0x0F), int(word & 0x1F));
}

QTime dosTime(std::uint32_t word)
{
    return QTime(int((word >> 11) & 0x1F), int((word >> 5) & 0x3F), int(word & 0x1F) * 2);
}

// UTF-16 units of a field, byte-swapped for big-endian records.
QList<char16_t> units(const QByteArray &b, std::uint32_t offset, std::uint32_t count, bool bigEndian)
{
    QList<char16_t> out;
    out.reserve(count);
    for (std::uint32_t i = 0; i < count; ++i) {
        const auto lo = std::uint8_t(b[offset + 2 * i]), hi = std::uint8_t(b[offset + 2 * i + 1]);
        out.append(bigEndian ? char16_t(lo << 8 | hi) : char16_t(hi << 8 | lo));
    }
    return out;
}

QString unitsText(const QList<char16_t> &u, qsizetype count)
{
    return QString(reinterpret_cast<const QChar *>(u.constData()), count);
}

QByteArray unitsBytes(const QString &text, bool bigEndian)
{
    QByteArray out;
    for (QChar c : text) {
        const char16_t u = c.unicode();
        if (bigEndian) {
            out.append(char(u >> 8));
            out.append(char(u & 0xFF));
        } else {
            out.append(char(u & 0xFF));
            out.append(char(u >> 8));
        }
    }
    return out;
}

struct Stamp
{
    int year, month, day, hour = 0, minute = 0, second = 0;
};

// "YYYY-MM-DD" (10 characters) or "YYYY-MM-DD hh:mm:ss" (19 characters).
std::optional<Stamp> parseStamp(const QString &text, bool withTime)
{
    static const QRegularExpression date(QStringLiteral("^(\\d{4})-(\\d{2})-(\\d{2})$"));
    static const QRegularExpression dateTime(
        QStringLiteral("^(\\d{4})-(\\d{2})-(\\d{2}) (\\d{2}):(\\d{2}):(\\d{2})$"));
    const auto m = (withTime ? dateTime : date).match(text);
    if (!m.hasMatch())
        return std::nullopt;
    Stamp s{m.captured(1).toInt(), m.captured(2).toInt(), m.captured(3).toInt()};
    if (withTime) {
        s.hour = m.captured(4).toInt();
        s.minute = m.captured(5).toInt();
        s.second = m.captured(6).toInt();
    }
    if (s.month < 1 || s.month > 12 || s.day < 1 || s.day > 31 || s.hour > 23 || s.minute > 59)
        return std::nullopt;
    return s;
}

QString padded8(const QByteArray &b, std::uint32_t offset, std::uint32_t size)
{
    QByteArray raw = b.mid(offset, size);
    const qsizetype zero = raw.indexOf('\0');
    if (zero >= 0)
        raw.truncate(zero);
    QString s = fromLocal8(raw);
    for (QChar &c : s)
        if (c.unicode() < 0x20)
            c = QLatin1Char('.');
    return s;
}

} // namespace

bool inside(const QByteArray &buffer, std::uint32_t offset, std::uint32_t size)
{
    return std::uint64_t(offset) + size <= std::uint64_t(buffer.size());
}

bool readUnsigned(const QByteArray &b, std::uint32_t offset, std::uint32_t size, bool bigEndian,
                  std::uint64_t &value)
{
    if (size == 0 || size > 8 || !inside(b, offset, size))
        return false;
    value = 0;
    for (std::uint32_t i = 0; i < size; ++i) {
        const std::uint64_t byte = std::uint8_t(b[offset + i]);
        value |= bigEndian ? byte << (8 * (size - 1 - i)) : byte << (8 * i);
    }
    return true;
}

QByteArray writeUnsigned(std::uint64_t value, std::uint32_t size, bool bigEndian)
{
    QByteArray out(size, '\0');
    for (std::uint32_t i = 0; i < size && i < 8; ++i) {
        const char byte = char((value >> (8 * i)) & 0xFF);
        out[bigEndian ? size - 1 - i : i] = byte;
    }
    return out;
}

std::uint32_t numberWidth(FieldFormat format)
{
    switch (format) {
    case UInt8:
    case Hex8:
        return 1;
    case UInt16:
    case Hex16:
        return 2;
    case UInt32:
    case Hex32:
        return 4;
    case UInt48:
        return 6;
    case UInt64:
        return 8;
    default:
        return 0;
    }
}

QString fromLocal8(const QByteArray &bytes)
{
    QStringDecoder decoder(QStringConverter::System);
    return decoder.decode(bytes);
}

QByteArray toLocal8(const QString &text)
{
    QStringEncoder encoder(QStringConverter::System);
    return encoder.encode(text);
}

QString hexPairs(const QByteArray &bytes, const QString &separator)
{
    static const char digits[] = "0123456789ABCDEF";
    QString out;
    out.reserve(bytes.size() * (2 + separator.size()));
    for (qsizetype i = 0; i < bytes.size(); ++i) {
        if (i)
            out += separator;
        const auto v = std::uint8_t(bytes[i]);
        out += QLatin1Char(digits[v >> 4]);
        out += QLatin1Char(digits[v & 15]);
    }
    return out;
}

QString display(FieldFormat format, const QByteArray &b, std::uint32_t offset, std::uint32_t size,
                std::uint32_t parentSize, bool bigEndian, const QLocale &locale)
{
    std::uint64_t v = 0;
    switch (format) {
    case UInt8:
        return readUnsigned(b, offset, 1, false, v) ? QString::number(v) : QString();
    case UInt16:
    case UInt32:
    case UInt64:
        return readUnsigned(b, offset, numberWidth(format), bigEndian, v) ? locale.toString(qulonglong(v))
                                                                          : QString();
    case UInt48:
        return readUnsigned(b, offset, 6, false, v) ? locale.toString(qulonglong(v)) : QString();
    case Hex8:
    case Hex16:
    case Hex32:
        if (!readUnsigned(b, offset, numberWidth(format), format != Hex8 && bigEndian, v))
            return {};
        return QStringLiteral("0x") +
               QStringLiteral("%1").arg(qulonglong(v), 2, 16, QLatin1Char('0')).toUpper();
    case AnsiZeroPadded:
    case AnsiSpacePadded:
    case DosName:
        return inside(b, offset, size) ? padded8(b, offset, size) : QString();
    case Utf16Fixed:
    case ExFatName: {
        if (size < 2 || !inside(b, offset, size))
            return {};
        const auto u = units(b, offset, size / 2, bigEndian);
        if (u.last() != 0)
            return unitsText(u, u.size());
        const qsizetype zero = u.indexOf(0);
        return unitsText(u, zero);
    }
    case LongName: {
        if (!inside(b, offset, size))
            return {};
        const auto u = units(b, offset, size / 2, false);
        const qsizetype zero = u.indexOf(0);
        return unitsText(u, zero < 0 ? u.size() : zero);
    }
    case Utf8Text: {
        if (!inside(b, offset, size))
            return {};
        QByteArray raw = b.mid(offset, size);
        const qsizetype zero = raw.indexOf('\0');
        if (zero >= 0)
            raw.truncate(zero);
        return QString::fromUtf8(raw);
    }
    case HexBytes:
        if (!inside(b, offset, size))
            return {};
        return QStringLiteral("%1%2").arg(size == 1 ? QStringLiteral("0x") : QString(),
                                          hexPairs(b.mid(offset, size), QStringLiteral(" ")));
    case DosDate:
        if (!readUnsigned(b, offset, 2, bigEndian, v))
            return {};
        return locale.toString(dosDate(std::uint32_t(v)), QLocale::ShortFormat);
    case DosDateTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return shortDateTime(QDateTime(dosDate(std::uint32_t(v >> 16)), dosTime(std::uint32_t(v & 0xFFFF))),
                             locale);
    case Bit:
        if (parentSize != 1 && parentSize != 2 && parentSize != 4)
            return QStringLiteral("false");
        if (!readUnsigned(b, offset, parentSize, bigEndian, v))
            return {};
        return size < 64 && (v >> size) & 1 ? QStringLiteral("true") : QStringLiteral("false");
    case FileTime:
        if (!readUnsigned(b, offset, 8, bigEndian, v))
            return {};
        return shortDateTime(fromTicks(v), locale);
    case NtTime:
        if (!readUnsigned(b, offset, 8, bigEndian, v))
            return {};
        return v == 0 ? QString() : shortDateTime(fromTicks(v), locale);
    case HfsTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return shortDateTime(QDateTime::fromSecsSinceEpoch(qint64(v) - HfsEpochShift), locale);
    case UnixTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return shortDateTime(QDateTime::fromSecsSinceEpoch(qint64(v)), locale);
    case UnixNanoTime:
        if (!readUnsigned(b, offset, 8, bigEndian, v))
            return {};
        return shortDateTime(QDateTime::fromSecsSinceEpoch(qint64(v / 1000000000ull)), locale);
    case Group:
    case Text:
    case Caption:
    case Note:
        break;
    }
    return {};
}

QVariant edit(FieldFormat format, const QByteArray &b, std::uint32_t offset, std::uint32_t size,
              std::uint32_t parentSize, bool bigEndian, const QLocale &locale)
{
    std::uint64_t v = 0;
    switch (format) {
    case UInt8:
    case UInt16:
    case UInt32:
    case UInt64:
        if (!readUnsigned(b, offset, numberWidth(format), bigEndian, v))
            return {};
        return QVariant::fromValue(qulonglong(v));
    case UInt48:
        if (!readUnsigned(b, offset, 6, false, v))
            return {};
        return QVariant::fromValue(qulonglong(v));
    case HexBytes:
        if (!inside(b, offset, size))
            return {};
        return hexPairs(b.mid(offset, size), QString());
    case DosDate: {
        if (!readUnsigned(b, offset, 2, bigEndian, v))
            return {};
        const auto w = std::uint32_t(v);
        return QStringLiteral("%1-%2-%3")
            .arg(1980 + int((w >> 9) & 0x7F), 4, 10, QLatin1Char(' '))
            .arg(int((w >> 5) & 0x0F), 2, 10, QLatin1Char('0'))
            .arg(int(w & 0x1F), 2, 10, QLatin1Char('0'));
    }
    case DosDateTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return editDateTime(QDateTime(dosDate(std::uint32_t(v >> 16)), dosTime(std::uint32_t(v & 0xFFFF))));
    case FileTime:
        if (!readUnsigned(b, offset, 8, bigEndian, v))
            return {};
        return editDateTime(fromTicks(v));
    case HfsTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return editDateTime(QDateTime::fromSecsSinceEpoch(qint64(v) - HfsEpochShift));
    case UnixTime:
        if (!readUnsigned(b, offset, 4, bigEndian, v))
            return {};
        return editDateTime(QDateTime::fromSecsSinceEpoch(qint64(v)));
    case UnixNanoTime:
    case NtTime:
    case Group:
    case Text:
    case Caption:
    case Note:
        return {};
    default:
        return display(format, b, offset, size, parentSize, bigEndian, locale);
    }
}

std::optional<std::uint64_t> parseNumber(const QString &text, const QLocale &locale)
{
    QString t = text.simplified();
    if (t.startsWith(QLatin1Char('-')))
        return std::nullopt;
    const QString group = locale.groupSeparator();
    if (!group.isEmpty())
        t.remove(group);
    t.remove(QLatin1Char(' '));
    bool ok = false;
    std::uint64_t v = 0;
    if (t.startsWith(QLatin1String("0x"), Qt::CaseInsensitive))
        v = t.mid(2).toULongLong(&ok, 16);
    else
        v = t.toULongLong(&ok, 10);
    if (!ok || t.isEmpty())
        return std::nullopt;
    return v;
}

std::optional<QByteArray> parse(FieldFormat format, const QString &text, std::uint32_t size, bool bigEndian,
                                const QLocale &locale, const QByteArray &parentBytes)
{
    switch (format) {
    case UInt8:
    case UInt16:
    case UInt32:
    case UInt48:
    case UInt64:
    case Hex8:
    case Hex16:
    case Hex32: {
        const auto v = parseNumber(text, locale);
        const std::uint32_t width = numberWidth(format);
        if (!v || (width < 8 && *v >> (8 * width)))
            return std::nullopt;
        return writeUnsigned(*v, width, format != UInt48 && bigEndian);
    }
    case AnsiZeroPadded:
    case AnsiSpacePadded:
    case DosName: {
        const QByteArray bytes = toLocal8(format == DosName ? text.toUpper() : text);
        if (bytes.size() > qsizetype(size))
            return std::nullopt;
        QByteArray out(size, format == AnsiZeroPadded ? '\0' : ' ');
        out.replace(0, bytes.size(), bytes);
        return out;
    }
    case Utf16Fixed:
    case ExFatName: {
        const QByteArray bytes = unitsBytes(text, format == Utf16Fixed && bigEndian);
        if (bytes.size() > qsizetype(size))
            return std::nullopt;
        QByteArray out(size, '\0');
        out.replace(0, bytes.size(), bytes);
        return out;
    }
    case LongName: {
        QByteArray bytes = unitsBytes(text, false);
        if (bytes.size() > qsizetype(size))
            return std::nullopt;
        if (bytes.size() + 2 <= qsizetype(size))
            bytes.append(2, '\0');
        QByteArray out(size, char(0xFF));
        out.replace(0, bytes.size(), bytes);
        return out;
    }
    case Utf8Text: {
        const QByteArray bytes = text.toUtf8();
        if (bytes.size() > qsizetype(size))
            return std::nullopt;
        QByteArray out(size, '\0');
        out.replace(0, bytes.size(), bytes);
        return out;
    }
    case HexBytes: {
        QString t = text;
        t.remove(QLatin1Char(' '));
        if (t.size() != qsizetype(size) * 2)
            return std::nullopt;
        for (QChar ch : t)
            if (!isxdigit(ch.unicode() < 128 ? int(ch.unicode()) : 'x'))
                return std::nullopt;
        return QByteArray::fromHex(t.toLatin1());
    }
    case DosDate: {
        const auto s = parseStamp(text, false);
        if (!s || s->year < 1980 || s->year > 2107)
            return std::nullopt;
        const std::uint32_t w = std::uint32_t(s->year - 1980) << 9 | std::uint32_t(s->month) << 5 | s->day;
        return writeUnsigned(w, 2, bigEndian);
    }
    case DosDateTime: {
        const auto s = parseStamp(text, true);
        if (!s || s->year < 1980 || s->year > 2107 || s->second > 58)
            return std::nullopt;
        const std::uint32_t date = std::uint32_t(s->year - 1980) << 9 | std::uint32_t(s->month) << 5 | s->day;
        const std::uint32_t time =
            std::uint32_t(s->hour) << 11 | std::uint32_t(s->minute) << 5 | std::uint32_t(s->second / 2);
        return writeUnsigned(date << 16 | time, 4, bigEndian);
    }
    case FileTime:
    case NtTime: {
        const auto s = parseStamp(text, true);
        if (!s || s->year < 1601 || s->year > 30827 || s->second > 59)
            return std::nullopt;
        const QDate d(s->year, s->month, s->day);
        if (!d.isValid())
            return std::nullopt;
        const QDateTime dt(d, QTime(s->hour, s->minute, s->second), Qt::UTC);
        const std::int64_t ms = windowsEpoch().msecsTo(dt);
        if (ms < 0)
            return std::nullopt;
        return writeUnsigned(std::uint64_t(ms) * 10000, 8, bigEndian);
    }
    case UnixTime:
    case HfsTime:
    case UnixNanoTime: {
        const auto s = parseStamp(text, true);
        if (!s || s->second > 59)
            return std::nullopt;
        const QDate d(s->year, s->month, s->day);
        if (!d.isValid())
            return std::nullopt;
        std::int64_t secs = QDateTime(d, QTime(s->hour, s->minute, s->second)).toSecsSinceEpoch();
        if (format == HfsTime)
            secs += HfsEpochShift;
        if (secs < 0)
            return std::nullopt;
        if (format == UnixNanoTime) {
            if (std::uint64_t(secs) > std::numeric_limits<std::uint64_t>::max() / 1000000000ull)
                return std::nullopt;
            return writeUnsigned(std::uint64_t(secs) * 1000000000ull, 8, bigEndian);
        }
        if (secs > 0xFFFFFFFFll)
            return std::nullopt;
        return writeUnsigned(std::uint64_t(secs), 4, bigEndian);
    }
    case Bit: {
        const auto width = std::uint32_t(parentBytes.size());
        std::uint64_t v = 0;
        if ((width != 1 && width != 2 && width != 4) || size >= 8 * width ||
            !readUnsigned(parentBytes, 0, width, bigEndian, v))
            return std::nullopt;
        if (text.trimmed() == QLatin1String("1"))
            v |= std::uint64_t(1) << size;
        else
            v &= ~(std::uint64_t(1) << size);
        return writeUnsigned(v, width, bigEndian);
    }
    case Group:
    case Text:
    case Caption:
    case Note:
        break;
    }
    return std::nullopt;
}

} // namespace HexEditor::Templates::Values
