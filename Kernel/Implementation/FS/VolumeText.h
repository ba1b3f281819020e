// Decoding of the label and identifier strings found in boot sectors and superblocks.
#pragma once

#include <QString>

#include <cstddef>
#include <cstdint>

namespace VolumeText {

// A fixed-width 8-bit field: stops at the first zero byte, trailing blanks removed.
QString Latin1(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t length);
// A fixed-width UTF-8 field (stops at the first zero byte, trailing blanks removed).
QString Utf8(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t length);
// `count` UTF-16 units, little- or big-endian (stops at the first zero unit).
QString Utf16(const std::uint8_t *buf, std::size_t size, std::size_t offset, std::size_t count,
              bool bigEndian);
// The 32-bit serial shown for a volume identified by a UUID: its first four bytes, in order.
std::uint32_t SerialFromUuid(const std::uint8_t *buf, std::size_t size, std::size_t offset);

} // namespace VolumeText
