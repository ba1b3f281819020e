// Saturating arithmetic for offsets computed from record fields.
#pragma once

#include <cstdint>
#include <limits>

namespace HexEditor::Templates::SizeMath {

inline constexpr std::uint64_t None = std::numeric_limits<std::uint64_t>::max();

inline std::uint64_t mul(std::uint64_t a, std::uint64_t b)
{
    std::uint64_t r = 0;
    return __builtin_mul_overflow(a, b, &r) ? None : r;
}

inline std::uint64_t add(std::uint64_t a, std::uint64_t b)
{
    std::uint64_t r = 0;
    return __builtin_add_overflow(a, b, &r) ? None : r;
}

} // namespace HexEditor::Templates::SizeMath
