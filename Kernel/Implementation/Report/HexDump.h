// Text dump of raw bytes, sixteen to a line: the offset as eight hexadecimal digits, three spaces,
// each byte as a space and two hexadecimal digits, two spaces and the bytes as characters. Bytes
// below 0x20, above 0x7F and '<' print as '.'; the columns of a short last line are padded with
// spaces. The hardware report's sector dumps and the command-line sector reader share this format.
#pragma once

#include <QByteArray>
#include <QString>

#include <cstddef>
#include <cstdint>

namespace HexDump {

inline constexpr std::size_t BytesPerLine = 16;

// One line without its line end; `count` above 16 is cut to 16. An offset above 0xFFFFFFFF prints
// with as many digits as it needs.
QString Line(std::uint64_t offset, const std::uint8_t *bytes, std::size_t count);

// Every line of a block, each followed by `lineEnd`; the first line carries `baseOffset`.
QString Lines(const std::uint8_t *data, std::size_t size, std::uint64_t baseOffset = 0,
              const QString &lineEnd = QStringLiteral("\r\n"));
inline QString Lines(const QByteArray &data, std::uint64_t baseOffset = 0,
                     const QString &lineEnd = QStringLiteral("\r\n"))
{
    return Lines(reinterpret_cast<const std::uint8_t *>(data.constData()),
                 static_cast<std::size_t>(data.size()), baseOffset, lineEnd);
}

// The character a byte shows as in the character column.
inline char PrintableChar(std::uint8_t byte)
{
    return (byte < 0x20 || byte > 0x7F || byte == '<') ? '.' : static_cast<char>(byte);
}

} // namespace HexDump
