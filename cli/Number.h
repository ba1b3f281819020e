// Byte counts and offsets on the command line: decimal, or hexadecimal with a "0x" prefix.
#pragma once

#include <QString>

#include <cstdint>

namespace Cli {

inline bool parseNumber(const QString &text, std::uint64_t &value)
{
    bool ok = false;
    if (text.startsWith(QLatin1String("0x"), Qt::CaseInsensitive))
        value = text.mid(2).toULongLong(&ok, 16);
    else
        value = text.toULongLong(&ok, 10);
    return ok;
}

} // namespace Cli
