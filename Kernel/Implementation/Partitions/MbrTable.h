// The boot-record partition table: four 16-byte entries at byte 446 of the boot record and of every
// extended boot record, the disk signature at byte 440 and the bytes 0x55 0xAA at 510..511.
#pragma once

#include <QByteArray>

#include <array>
#include <cstdint>

#include "Kernel/Implementation/Common/ByteOrder.h"

namespace Mbr {

constexpr int EntryOffset = 446;
constexpr int EntrySize = 16;
constexpr int EntryCount = 4;
constexpr int DiskSignatureOffset = 440;

constexpr std::uint8_t TypeExtendedChs = 0x05;
constexpr std::uint8_t TypeExtendedLba = 0x0F;
constexpr std::uint8_t TypeGptProtective = 0xEE;
constexpr std::uint8_t TypeLdm = 0x42;

struct Entry
{
    std::array<std::uint8_t, 16> raw{};

    std::uint8_t bootIndicator() const { return raw[0]; }
    std::uint8_t type() const { return raw[4]; }
    std::uint32_t start() const { return ByteOrder::le32(raw.data() + 8); }
    std::uint32_t count() const { return ByteOrder::le32(raw.data() + 12); }
    bool isExtended() const { return type() == TypeExtendedChs || type() == TypeExtendedLba; }
    bool isZero() const;
    // An entry with a starting sector needs its CHS sector/cylinder words, its type and its count
    // non-zero; an entry with starting sector 0 must be zero in all its bytes.
    bool isValid() const;
};

struct Table
{
    std::array<Entry, EntryCount> entries;
    std::uint32_t diskSignature = 0;
};

// Reads the four entries of a table sector (at least 512 bytes; else all entries read as zero).
Table parse(const QByteArray &sector);

// Reorders the four entries in the sector buffer by starting sector, ascending (a selection sort,
// so entries with start 0 come first).
void sortEntries(QByteArray &sector);

} // namespace Mbr
