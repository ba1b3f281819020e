#include "Kernel/Implementation/FS/VolumeText.h"

#include "Kernel/Implementation/FS/DetectBytes.h"

namespace VolumeText {

namespace {

std::size_t Clip(std::size_t size, std::size_t offset, std::size_t length)
{
    if (offset >= size)
        return 0;
    return length < size - offset ? length : size - offset;
}

} // namespace

QString Latin1(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t length)
{
    length = Clip(size, offset, length);
    std::size_t n = 0;
    while (n < length && buf[offset + n] != 0)
        ++n;
    return QString::fromLatin1(reinterpret_cast<const char *>(buf + offset), static_cast<qsizetype>(n))
        .trimmed();
}

QString Utf8(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t length)
{
    length = Clip(size, offset, length);
    std::size_t n = 0;
    while (n < length && buf[offset + n] != 0)
        ++n;
    return QString::fromUtf8(reinterpret_cast<const char *>(buf + offset), static_cast<qsizetype>(n))
        .trimmed();
}

QString Utf16(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t count,
              bool bigEndian)
{
    QString out;
    for (std::size_t i = 0; i < count; ++i) {
        if (!DiskBytes::Fits(size, offset + 2 * i, 2))
            break;
        const char16_t u =
            bigEndian ? DiskBytes::B16(buf, size, offset + 2 * i) : DiskBytes::U16(buf, size, offset + 2 * i);
        if (u == 0)
            break;
        out.append(QChar(u));
    }
    return out;
}

std::uint32_t SerialFromUuid(const std::uint8_t *buf, std::size_t size, std::size_t offset)
{
    return DiskBytes::B32(buf, size, offset);
}

} // namespace VolumeText
