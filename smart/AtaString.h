// Text fields of ATA identify data: two characters per 16-bit word, high byte first.
#pragma once

#include <QString>
#include <cstddef>
#include <cstdint>

namespace Smart {

// Decodes `words` 16-bit little-endian words of `identify` starting at `firstWord`,
// swapping the two bytes of each word, and trims blanks and NULs at both ends.
// Reads nothing outside the `size` bytes of `identify`.
QString ataString(const uint8_t *identify, size_t size, unsigned firstWord, unsigned words);

} // namespace Smart
