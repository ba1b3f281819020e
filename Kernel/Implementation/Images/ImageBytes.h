// Integers of a fixed byte order in image structures (the readers and writers of ByteOrder.h) and
// the small checks the image parsers share.
#pragma once

#include <cstddef>
#include <cstdint>

#include "Kernel/Implementation/Common/ByteOrder.h"

namespace ImageBytes {

using ByteOrder::be32;
using ByteOrder::be64;
using ByteOrder::le16;
using ByteOrder::le32;
using ByteOrder::le64;
using ByteOrder::putBe32;
using ByteOrder::putBe64;
using ByteOrder::putLe32;
using ByteOrder::putLe64;

inline bool isPowerOfTwo(std::uint64_t v)
{
    return v != 0 && (v & (v - 1)) == 0;
}
inline bool allZero(const std::uint8_t *p, std::size_t n)
{
    for (std::size_t i = 0; i < n; ++i)
        if (p[i])
            return false;
    return true;
}

} // namespace ImageBytes
