#include "Kernel/Implementation/Report/HexDump.h"

namespace HexDump {

namespace {

constexpr char Digits[] = "0123456789ABCDEF";

} // namespace

QString Line(std::uint64_t offset, const std::uint8_t *bytes, std::size_t count)
{
    if (count > BytesPerLine)
        count = BytesPerLine;
    if (!bytes)
        count = 0;
    QByteArray line;
    line.reserve(8 + 3 + 3 * BytesPerLine + 2 + BytesPerLine);
    line += QByteArray::number(static_cast<qulonglong>(offset), 16).toUpper().rightJustified(8, '0');
    line += "   ";
    for (std::size_t i = 0; i < BytesPerLine; ++i) {
        if (i < count) {
            line += ' ';
            line += Digits[bytes[i] >> 4];
            line += Digits[bytes[i] & 0x0F];
        } else {
            line += "   ";
        }
    }
    line += "  ";
    for (std::size_t i = 0; i < BytesPerLine; ++i)
        line += i < count ? PrintableChar(bytes[i]) : ' ';
    return QString::fromLatin1(line);
}

QString Lines(const std::uint8_t *data, std::size_t size, std::uint64_t baseOffset, const QString &lineEnd)
{
    QString text;
    if (!data)
        return text;
    text.reserve(static_cast<qsizetype>((size / BytesPerLine + 1) * (80 + lineEnd.size())));
    for (std::size_t pos = 0; pos < size; pos += BytesPerLine) {
        const std::size_t n = size - pos < BytesPerLine ? size - pos : BytesPerLine;
        text += Line(baseOffset + pos, data + pos, n);
        text += lineEnd;
    }
    return text;
}

} // namespace HexDump
