// The layout of a Tarvo disk image, shared by its reader and its writer. All integers are
// little-endian; offsets are bytes of the concatenated image files.
//
//   header (128 bytes) | string block | blocks and group records | group table | trailer (16 bytes)
//
// Every block is zlib data on its own. A group record (u32 compressed length, u32 Adler-32 of
// the inflated index, zlib data) follows the blocks it indexes and inflates to their offsets
// (u64 each); the group table lists the offsets of the group records. The trailer carries the
// running Adler-32 of all inflated block bytes (high half), the Adler-32 of the header with that
// value in its field at 68 (low half), and the magic with bit 63 set.
#pragma once

#include <QByteArray>
#include <QString>
#include <cstdint>

namespace Tarvo {

constexpr std::uint64_t Magic = 0x0356485307AF0A08ull;
constexpr std::uint64_t TrailerMagic = Magic | (1ull << 63);
constexpr std::uint32_t HeaderSize = 128;
constexpr std::uint32_t TrailerSize = 16;
// The largest block accepted by the reader and made by the writer.
constexpr std::uint64_t MaxBlockSize = 1u << 24;

struct Header
{
    std::uint64_t firstSector = 0;
    std::uint64_t totalSectors = 0;
    std::uint8_t sectorShift = 9;
    std::uint32_t mediaType = 0; // 1 floppy, 2 fixed, 3 removable, 4 optical, 0 other
    std::uint32_t sectorsPerTrack = 0;
    std::uint32_t tracksPerCylinder = 0;
    std::uint32_t lengths[4] = {}; // UTF-16 code units of the four strings, without terminators
    QByteArray version;            // kernel version text (up to 8 bytes)
    std::uint32_t created = 0;     // seconds since 1970
    std::uint32_t sectorsPerBlock = 0;
    std::uint32_t checksum = 1; // field at 68: 1 when stored
    std::uint32_t stringBytes = 0;

    std::uint64_t BlockSize() const { return std::uint64_t(sectorsPerBlock) << sectorShift; }
    std::uint64_t Blocks() const { return (totalSectors - 1) / sectorsPerBlock + 1; }
    std::uint64_t BlocksPerGroup() const { return BlockSize() / 8; }
    std::uint64_t Groups() const { return (totalSectors - 1) / sectorsPerBlock / BlocksPerGroup() + 1; }
};

// Parses and checks the 128 header bytes on their own (sizes, shift, signature, string lengths);
// false with a reason when unsound.
bool ParseHeader(const std::uint8_t *bytes, Header &header, QString &problem);
// The 128 header bytes of `header`.
void BuildHeader(const Header &header, std::uint8_t *bytes);
// Adler-32 continuing from `start` (1 for a new sum).
std::uint32_t Adler(std::uint32_t start, const void *data, std::size_t size);
// The media code at offset 29 for a media type, and back.
std::uint32_t MediaTypeFromCode(const std::uint8_t *code);

} // namespace Tarvo
