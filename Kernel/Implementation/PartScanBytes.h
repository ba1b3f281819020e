// Bounded little- and big-endian field reads for the partition-table parsers. Every read checks its
// offset against the buffer: a field outside reads as 0.
#pragma once

#include <QByteArray>

#include <cstddef>
#include <cstdint>

namespace PartScan {

inline std::uint64_t readLe(const QByteArray &b, qsizetype offset, int bytes)
{
    if (offset < 0 || bytes <= 0 || offset > b.size() - bytes)
        return 0;
    std::uint64_t v = 0;
    for (int i = bytes - 1; i >= 0; --i)
        v = (v << 8) | static_cast<std::uint8_t>(b[offset + i]);
    return v;
}

inline std::uint64_t readBe(const QByteArray &b, qsizetype offset, int bytes)
{
    if (offset < 0 || bytes <= 0 || offset > b.size() - bytes)
        return 0;
    std::uint64_t v = 0;
    for (int i = 0; i < bytes; ++i)
        v = (v << 8) | static_cast<std::uint8_t>(b[offset + i]);
    return v;
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

// True when the buffer holds `text` at `offset`.
inline bool hasText(const QByteArray &b, qsizetype offset, const char *text)
{
    const qsizetype n = static_cast<qsizetype>(qstrlen(text));
    return offset >= 0 && offset <= b.size() - n && b.mid(offset, n) == QByteArray(text, n);
}

// True when bytes 510..511 hold 0x55 0xAA.
inline bool hasBootSignature(const QByteArray &sector)
{
    return sector.size() >= 512 && static_cast<std::uint8_t>(sector[510]) == 0x55 &&
           static_cast<std::uint8_t>(sector[511]) == 0xAA;
}

} // namespace PartScan
