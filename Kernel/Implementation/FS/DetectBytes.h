// Bounds-checked readers of little- and big-endian integers in on-disk buffers. A field that
// does not lie wholly inside the buffer reads as 0.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace DiskBytes {

inline bool Fits(std::size_t size, std::size_t offset, std::size_t length)
{
    return offset <= size && length <= size - offset;
}

template <typename T> inline T LE(const std::uint8_t *buf, std::size_t size, std::size_t offset)
{
    if (!buf || !Fits(size, offset, sizeof(T)))
        return 0;
    T v = 0;
    for (std::size_t i = 0; i < sizeof(T); ++i)
        v |= static_cast<T>(static_cast<T>(buf[offset + i]) << (8 * i));
    return v;
}

template <typename T> inline T BE(const std::uint8_t *buf, std::size_t size, std::size_t offset)
{
    if (!buf || !Fits(size, offset, sizeof(T)))
        return 0;
    T v = 0;
    for (std::size_t i = 0; i < sizeof(T); ++i)
        v = static_cast<T>((v << 8) | buf[offset + i]);
    return v;
}

inline std::uint16_t U16(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return LE<std::uint16_t>(b, s, o);
}
inline std::uint32_t U32(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return LE<std::uint32_t>(b, s, o);
}
inline std::uint64_t U64(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return LE<std::uint64_t>(b, s, o);
}
inline std::uint16_t B16(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return BE<std::uint16_t>(b, s, o);
}
inline std::uint32_t B32(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return BE<std::uint32_t>(b, s, o);
}
inline std::uint64_t B64(const std::uint8_t *b, std::size_t s, std::size_t o)
{
    return BE<std::uint64_t>(b, s, o);
}

// The bytes at offset equal `text` (length bytes); false when they do not fit.
inline bool Equals(const std::uint8_t *buf, std::size_t size, std::size_t offset, const char *text,
                   std::size_t length)
{
    return buf && Fits(size, offset, length) && std::memcmp(buf + offset, text, length) == 0;
}

// Exactly one bit set and the value within [low, high].
inline bool PowerOfTwo(std::uint64_t v, std::uint64_t low, std::uint64_t high)
{
    return v != 0 && (v & (v - 1)) == 0 && v >= low && v <= high;
}

inline unsigned Log2(std::uint64_t v)
{
    unsigned n = 0;
    while (v > 1) {
        v >>= 1;
        ++n;
    }
    return n;
}

} // namespace DiskBytes
