// The logical disk manager's database of a dynamic disk: the private header ("PRIVHEAD"), its table
// of contents ("TOCBLOCK"), the volume database header ("VMDB") and its records ("VBLK"). All
// multi-byte fields are big-endian. Every length and position read is checked against the device
// and the database before it is used.
#pragma once

#include <QByteArray>
#include <QString>

#include <cstdint>
#include <functional>
#include <optional>
#include <vector>

#include "Kernel/Implementation/Common/cStorage.h"

namespace Ldm {

constexpr std::uint32_t PrivHeadBytes = 391;
constexpr std::uint32_t TocBlockBytes = 104;
constexpr std::uint32_t VmdbBytes = 197;
// The sector that holds the first copy of the private header on a boot-record disk.
constexpr std::uint64_t PrivHeadFallbackSector = 6;
// Bounds on what the database may make the reader do.
constexpr std::uint32_t MaxRecords = 65536;
constexpr std::uint64_t MaxDatabaseBytes = 64u << 20;

struct Area
{
    std::uint64_t start = 0;
    std::uint64_t length = 0;
    bool operator==(const Area &o) const { return start == o.start && length == o.length; }
};

// One assembled record of the database (its fragments joined).
struct Record
{
    std::uint32_t group = 0;    // the record's group number (its id across fragments)
    std::uint8_t type = 0;      // low nibble of the type byte with its high nibble (0x32, 0x33, ...)
    std::uint32_t sequence = 0; // sequence number of the first fragment
    std::uint64_t objectId = 0;
    QString name;
    QString volumeType; // for volume records ("gen", "raid5", ...)
    QByteArray data;    // the joined payload after the 0x10-byte fragment header
};

struct ReadResult
{
    bool found = false; // a private header was accepted
    std::uint64_t privHeadSector = cStorage::NoSector;
    Area metadata; // the configuration (database) area
    Area data;     // the logical disk (where the dynamic volumes lie)
    bool areasValid = false;
    QString diskGuid;
    QString diskGroupGuid;
    QString diskGroupName;
    bool databaseValid = false;
    std::vector<Record> records; // assembled records of state "ACTIVE"
    bool hasRaid5 = false;
};

// Reads the database. `place` is where the walk found the private header (the device's last
// sector for a boot-record disk, the last sector of the GPT metadata entry); sector 6 is tried
// next. For a GPT disk `gptMetadata` and `gptData` are the GPT's LDM entries, which the header
// must agree with.
ReadResult read(cStorage &storage, std::uint64_t place, const std::optional<Area> &gptMetadata,
                const std::optional<Area> &gptData, const QString &deviceName,
                const std::function<void(const QString &)> &message);

// The byte sum of a structure with its checksum field (u32 at 8) taken as 0.
std::uint32_t checksum(const QByteArray &bytes, qsizetype length);

} // namespace Ldm
