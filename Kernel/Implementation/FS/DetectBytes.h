// Bounds-checked field reads for the file-system probes: the byte-order readers of ByteOrder.h
// (a field that does not lie wholly inside the buffer reads as 0), text and range checks.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

#include "Kernel/Implementation/Common/ByteOrder.h"

namespace DiskBytes {

using ByteOrder::B16;
using ByteOrder::B32;
using ByteOrder::B64;
using ByteOrder::BE;
using ByteOrder::Fits;
using ByteOrder::LE;
using ByteOrder::U16;
using ByteOrder::U32;
using ByteOrder::U64;

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
