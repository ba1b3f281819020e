// The GUID partition table reader: the protective boot record, the header at the protective entry's
// sector (or, failing that, in the device's last sector), the entry array with its CRC32, the other
// header and its entry array, and the checks of every entry.
#pragma once

#include <QByteArray>
#include <QString>

#include <array>
#include <cstdint>
#include <vector>

#include "Kernel/Implementation/Common/cStorage.h"

namespace Gpt {

using Guid = std::array<std::uint8_t, 16>; // on-disk byte order

// Result codes of the reader. A code with EntriesInconsistent added means the entries themselves
// are inconsistent (overlap, bad GUIDs, outside the usable area, unused entries not blank).
enum Code : std::uint32_t {
    Ok = 0,
    MbrReadFailed = 1,
    MbrNoSignature = 2,
    ProtectiveCount = 3,
    ProtectiveStart = 4,
    HeaderReadFailed = 5,
    HeaderSignature = 6,
    HeaderSize = 7,
    HeaderCrc = 8,
    HeaderSector = 9,
    OtherHeaderSector = 10,
    EntrySize = 11,
    EntryCount = 12,
    UsableRange = 13,
    AreasOverlap = 14,
    EntriesInconsistent = 0x80,
};

constexpr std::uint32_t HeaderBytes = 92;
constexpr std::uint32_t EntryBytes = 128;
// The largest entry array the reader accepts (bytes); a real table holds 128 entries (16 KiB).
constexpr std::uint32_t MaxArrayBytes = 4u << 20;

struct Header
{
    QByteArray raw; // the header's bytes as read (header size bytes)
    std::uint32_t revision = 0;
    std::uint32_t headerSize = 0;
    std::uint32_t headerCrc = 0;
    std::uint64_t thisSector = 0;
    std::uint64_t otherSector = 0;
    std::uint64_t firstUsable = 0;
    std::uint64_t lastUsable = 0;
    Guid diskGuid{};
    std::uint64_t arraySector = 0;
    std::uint32_t entryCount = 0;
    std::uint32_t entrySize = 0;
    std::uint32_t arrayCrc = 0;
};

struct Entry
{
    Guid typeGuid{};
    Guid uniqueGuid{};
    std::uint64_t first = 0;
    std::uint64_t last = 0;
    std::uint64_t attributes = 0;
    QString name;
    bool used() const;
};

struct ReadResult
{
    std::uint32_t code = Ok;
    bool headerValid = false;    // a header was accepted (primary or the one in the last sector)
    bool fromLastSector = false; // the accepted header was read from the device's last sector
    Header header;
    bool backupValid = false;       // the other header matches the accepted one
    bool entriesFound = false;      // the accepted header's entry array read with a matching CRC
    bool entriesFromBackup = false; // the array came from the other header's copy
    std::vector<Entry> entries;     // every slot of the array, used or not
    std::uint64_t backupArraySector = cStorage::NoSector; // the other header's identical array
};

// Reads the table of `storage`. Never reads outside the device; the entry array is bounded by
// MaxArrayBytes.
ReadResult read(cStorage &storage);

// The CRC32 of the GPT specification (zlib's).
std::uint32_t crc32(const char *data, std::size_t size);

// Checks a header read at `sector` (buffer of at least one sector); returns a code (0 when good).
std::uint32_t checkHeader(const QByteArray &buffer, std::uint64_t sector, std::uint64_t totalSectors,
                          std::uint32_t bytesPerSector, Header &header);

// "5808C8AA-7E8F-42E0-85D2-E1E90434CFB3" from on-disk bytes; empty text for a zero GUID.
QString guidText(const Guid &guid);
// The on-disk bytes of a GUID text (braces optional).
Guid guidFromText(const QString &text);
bool isZero(const Guid &guid);

// Type GUIDs the kernel itself distinguishes.
extern const Guid LdmMetadata;   // 5808C8AA-7E8F-42E0-85D2-E1E90434CFB3
extern const Guid LdmData;       // AF9B60A0-1431-4F62-BC68-3311714A69AD
extern const Guid MsReserved;    // E3C9E316-0B5C-4DB8-817D-F92DF00215AE
extern const Guid StorageSpaces; // E75CAF8F-F680-4CEE-AFA3-B001E56EFC2D

// The FileSystemKind code the type GUID alone decides (2, 3, 4, 5 or 6), else 0xFFFFFFFF.
std::uint32_t kindOfType(const Guid &type);

} // namespace Gpt
