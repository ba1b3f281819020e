// Little- and big-endian integers in on-disk and image structures: the kernel's one set of byte
// readers and writers.
//
// Checked reads take the buffer's size (or a QByteArray) and read a field that does not lie wholly
// inside the buffer as 0. Unchecked reads and the writers take a pointer to a field the caller has
// already bounded.
#pragma once

#include <QByteArray>

#include <cstddef>
#include <cstdint>

namespace ByteOrder {

// Whether `length` bytes at `offset` lie inside a buffer of `size` bytes.
inline bool Fits(std::size_t size, std::size_t offset, std::size_t length)
{
    return offset <= size && length <= size - offset;
}

// ---- checked reads over a pointer and a size ---------------------------------------------

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

// A field of `bytes` bytes (beyond 8 the low 8 bytes' value is kept); 0 for none.
inline std::uint64_t ReadLe(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t bytes)
{
    if (!buf || bytes == 0 || !Fits(size, offset, bytes))
        return 0;
    std::uint64_t v = 0;
    for (std::size_t i = bytes; i-- > 0;)
        v = (v << 8) | buf[offset + i];
    return v;
}
inline std::uint64_t ReadBe(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t bytes)
{
    if (!buf || bytes == 0 || !Fits(size, offset, bytes))
        return 0;
    std::uint64_t v = 0;
    for (std::size_t i = 0; i < bytes; ++i)
        v = (v << 8) | buf[offset + i];
    return v;
}

// ---- checked reads over a QByteArray -----------------------------------------------------

inline const std::uint8_t *Data(const QByteArray &b)
{
    return reinterpret_cast<const std::uint8_t *>(b.constData());
}
inline std::uint64_t readLe(const QByteArray &b, qsizetype offset, int bytes)
{
    if (offset < 0 || bytes <= 0)
        return 0;
    return ReadLe(Data(b), std::size_t(b.size()), std::size_t(offset), std::size_t(bytes));
}
inline std::uint64_t readBe(const QByteArray &b, qsizetype offset, int bytes)
{
    if (offset < 0 || bytes <= 0)
        return 0;
    return ReadBe(Data(b), std::size_t(b.size()), std::size_t(offset), std::size_t(bytes));
}
inline std::uint16_t le16(const QByteArray &b, qsizetype o)
{
    return static_cast<std::uint16_t>(readLe(b, o, 2));
}
inline std::uint32_t le32(const QByteArray &b, qsizetype o)
{
    return static_cast<std::uint32_t>(readLe(b, o, 4));
}
inline std::uint64_t le64(const QByteArray &b, qsizetype o)
{
    return readLe(b, o, 8);
}
inline std::uint16_t be16(const QByteArray &b, qsizetype o)
{
    return static_cast<std::uint16_t>(readBe(b, o, 2));
}
inline std::uint32_t be32(const QByteArray &b, qsizetype o)
{
    return static_cast<std::uint32_t>(readBe(b, o, 4));
}
inline std::uint64_t be64(const QByteArray &b, qsizetype o)
{
    return readBe(b, o, 8);
}

// ---- unchecked reads of a field already bounded ------------------------------------------

inline std::uint16_t le16(const std::uint8_t *p)
{
    return std::uint16_t(p[0] | (p[1] << 8));
}
inline std::uint32_t le32(const std::uint8_t *p)
{
    return std::uint32_t(p[0]) | (std::uint32_t(p[1]) << 8) | (std::uint32_t(p[2]) << 16) |
           (std::uint32_t(p[3]) << 24);
}
inline std::uint64_t le64(const std::uint8_t *p)
{
    return std::uint64_t(le32(p)) | (std::uint64_t(le32(p + 4)) << 32);
}
inline std::uint32_t be32(const std::uint8_t *p)
{
    return (std::uint32_t(p[0]) << 24) | (std::uint32_t(p[1]) << 16) | (std::uint32_t(p[2]) << 8) |
           std::uint32_t(p[3]);
}
inline std::uint64_t be64(const std::uint8_t *p)
{
    return (std::uint64_t(be32(p)) << 32) | be32(p + 4);
}

// ---- writers ----------------------------------------------------------------------------

inline void putLe16(std::uint8_t *p, std::uint16_t v)
{
    p[0] = std::uint8_t(v);
    p[1] = std::uint8_t(v >> 8);
}
inline void putLe32(std::uint8_t *p, std::uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        p[i] = std::uint8_t(v >> (8 * i));
}
inline void putLe64(std::uint8_t *p, std::uint64_t v)
{
    for (int i = 0; i < 8; ++i)
        p[i] = std::uint8_t(v >> (8 * i));
}
inline void putBe32(std::uint8_t *p, std::uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        p[i] = std::uint8_t(v >> (24 - 8 * i));
}
inline void putBe64(std::uint8_t *p, std::uint64_t v)
{
    putBe32(p, std::uint32_t(v >> 32));
    putBe32(p + 4, std::uint32_t(v));
}

} // namespace ByteOrder
