#include "Kernel/Implementation/Partitions/GptReader.h"

#include <QUuid>

#include <algorithm>
#include <cstring>
#include <zlib.h>

#include "Kernel/Implementation/Partitions/MbrTable.h"
#include "Kernel/Implementation/Partitions/PartScanBytes.h"

namespace Gpt {

using PartScan::le32;
using PartScan::le64;

const Guid LdmMetadata = guidFromText(QStringLiteral("5808C8AA-7E8F-42E0-85D2-E1E90434CFB3"));
const Guid LdmData = guidFromText(QStringLiteral("AF9B60A0-1431-4F62-BC68-3311714A69AD"));
const Guid MsReserved = guidFromText(QStringLiteral("E3C9E316-0B5C-4DB8-817D-F92DF00215AE"));
const Guid StorageSpaces = guidFromText(QStringLiteral("E75CAF8F-F680-4CEE-AFA3-B001E56EFC2D"));

namespace {

// BSD partition types of the common BSD systems.
const Guid BsdTypes[] = {
    guidFromText(QStringLiteral("516E7CB4-6ECF-11D6-8FF8-00022D09712B")), // FreeBSD data
    guidFromText(QStringLiteral("516E7CB6-6ECF-11D6-8FF8-00022D09712B")), // FreeBSD UFS
    guidFromText(QStringLiteral("516E7CBA-6ECF-11D6-8FF8-00022D09712B")), // FreeBSD ZFS
    guidFromText(QStringLiteral("824CC7A0-36A8-11E3-890A-952519AD3F61")), // OpenBSD data
    guidFromText(QStringLiteral("49F48D5A-B10E-11DC-B99B-0019D1879648")), // NetBSD FFS
};

// Reads whole sectors; false when the read fails or would leave the device.
bool readSectors(cStorage &storage, std::uint64_t first, std::uint32_t count, QByteArray &out)
{
    const std::uint32_t bps = storage.GetBytesPerSector();
    const std::uint64_t total = storage.GetTotalSectors();
    if (bps == 0 || count == 0 || first >= total || count > total - first)
        return false;
    if (std::uint64_t(count) * bps > MaxArrayBytes + 8192)
        return false;
    out.resize(qsizetype(count) * bps);
    std::uint32_t error = 0;
    return storage.ReadSectors(first, count, out.data(), error);
}

Guid guidAt(const QByteArray &b, qsizetype offset)
{
    Guid g{};
    if (offset >= 0 && offset + 16 <= b.size())
        std::memcpy(g.data(), b.constData() + offset, 16);
    return g;
}

bool halvesNonZero(const Guid &g)
{
    bool lo = false, hi = false;
    for (int i = 0; i < 8; ++i)
        lo |= g[i] != 0;
    for (int i = 8; i < 16; ++i)
        hi |= g[i] != 0;
    return lo && hi;
}

// Reads and checks the header at `sector`.
std::uint32_t readHeader(cStorage &storage, std::uint64_t sector, Header &header)
{
    QByteArray buf;
    if (!readSectors(storage, sector, 1, buf))
        return HeaderReadFailed;
    return checkHeader(buf, sector, storage.GetTotalSectors(), storage.GetBytesPerSector(), header);
}

// The header's bytes with the fields that differ between the two copies neutralised: the CRC, the
// two header sectors (swapped for the other copy) and the entry-array sector.
QByteArray comparable(const Header &h, bool swap)
{
    QByteArray b = h.raw.left(HeaderBytes);
    if (b.size() < qsizetype(HeaderBytes))
        return {};
    std::memset(b.data() + 16, 0, 4);
    std::memset(b.data() + 72, 0, 8);
    if (swap) {
        QByteArray a = b.mid(24, 8), o = b.mid(32, 8);
        std::memcpy(b.data() + 24, o.constData(), 8);
        std::memcpy(b.data() + 32, a.constData(), 8);
    }
    return b;
}

bool readArray(cStorage &storage, const Header &h, QByteArray &array)
{
    const std::uint32_t bps = storage.GetBytesPerSector();
    const std::uint64_t bytes = std::uint64_t(h.entryCount) * h.entrySize;
    if (bps == 0 || bytes == 0 || bytes > MaxArrayBytes || bytes % bps != 0)
        return false;
    if (!readSectors(storage, h.arraySector, static_cast<std::uint32_t>(bytes / bps), array))
        return false;
    return crc32(array.constData(), std::size_t(array.size())) == h.arrayCrc;
}

std::vector<Entry> parseEntries(const QByteArray &array, std::uint32_t entrySize)
{
    std::vector<Entry> out;
    if (entrySize < EntryBytes)
        return out;
    const qsizetype n = array.size() / entrySize;
    out.reserve(std::size_t(n));
    for (qsizetype i = 0; i < n; ++i) {
        const qsizetype o = i * entrySize;
        Entry e;
        e.typeGuid = guidAt(array, o);
        e.uniqueGuid = guidAt(array, o + 16);
        e.first = le64(array, o + 32);
        e.last = le64(array, o + 40);
        e.attributes = le64(array, o + 48);
        QString name;
        for (int c = 0; c < 36; ++c) {
            char16_t ch = char16_t(static_cast<std::uint8_t>(array[o + 56 + 2 * c]) |
                                   static_cast<std::uint8_t>(array[o + 57 + 2 * c]) << 8);
            if (ch == 0)
                break;
            name.append(QChar(ch));
        }
        e.name = name;
        out.push_back(e);
    }
    return out;
}

// Checks every entry; returns EntriesInconsistent when one fails.
std::uint32_t checkEntries(const std::vector<Entry> &entries, const QByteArray &array,
                           std::uint32_t entrySize, const Header &h)
{
    bool bad = false;
    struct Range
    {
        std::uint64_t first, last;
    };
    std::vector<Range> ranges;
    std::vector<Guid> uniques;
    for (std::size_t i = 0; i < entries.size(); ++i) {
        const Entry &e = entries[i];
        if (!e.used()) {
            const char *p = array.constData() + qsizetype(i) * entrySize;
            for (int b = 0; b < 56; ++b)
                if (p[b] != 0) {
                    bad = true;
                    break;
                }
            continue;
        }
        if (!halvesNonZero(e.typeGuid) || !halvesNonZero(e.uniqueGuid))
            bad = true;
        if (e.first < h.firstUsable || e.last > h.lastUsable || e.first > e.last)
            bad = true;
        ranges.push_back({e.first, e.last});
        uniques.push_back(e.uniqueGuid);
    }
    std::sort(ranges.begin(), ranges.end(), [](const Range &a, const Range &b) { return a.first < b.first; });
    for (std::size_t i = 1; i < ranges.size(); ++i)
        if (ranges[i].first <= ranges[i - 1].last)
            bad = true;
    std::sort(uniques.begin(), uniques.end());
    if (std::adjacent_find(uniques.begin(), uniques.end()) != uniques.end())
        bad = true;
    return bad ? EntriesInconsistent : Ok;
}

} // namespace

bool Entry::used() const
{
    return !isZero(typeGuid);
}

bool isZero(const Guid &guid)
{
    return std::all_of(guid.begin(), guid.end(), [](std::uint8_t b) { return b == 0; });
}

std::uint32_t crc32(const char *data, std::size_t size)
{
    uLong crc = ::crc32(0L, Z_NULL, 0);
    while (size > 0) {
        uInt n = size > 0x40000000 ? 0x40000000 : uInt(size);
        crc = ::crc32(crc, reinterpret_cast<const Bytef *>(data), n);
        data += n;
        size -= n;
    }
    return static_cast<std::uint32_t>(crc);
}

QString guidText(const Guid &g)
{
    if (isZero(g))
        return {};
    QUuid u(std::uint32_t(g[0] | g[1] << 8 | g[2] << 16 | std::uint32_t(g[3]) << 24),
            std::uint16_t(g[4] | g[5] << 8), std::uint16_t(g[6] | g[7] << 8), g[8], g[9], g[10], g[11], g[12],
            g[13], g[14], g[15]);
    return u.toString(QUuid::WithoutBraces).toUpper();
}

Guid guidFromText(const QString &text)
{
    QUuid u(text);
    Guid g{};
    if (u.isNull())
        return g;
    g[0] = std::uint8_t(u.data1);
    g[1] = std::uint8_t(u.data1 >> 8);
    g[2] = std::uint8_t(u.data1 >> 16);
    g[3] = std::uint8_t(u.data1 >> 24);
    g[4] = std::uint8_t(u.data2);
    g[5] = std::uint8_t(u.data2 >> 8);
    g[6] = std::uint8_t(u.data3);
    g[7] = std::uint8_t(u.data3 >> 8);
    std::memcpy(g.data() + 8, u.data4, 8);
    return g;
}

std::uint32_t kindOfType(const Guid &type)
{
    if (type == LdmMetadata)
        return 2;
    if (type == LdmData)
        return 3;
    if (type == MsReserved)
        return 4;
    for (const Guid &b : BsdTypes)
        if (type == b)
            return 5;
    if (type == StorageSpaces)
        return 6;
    return 0xFFFFFFFF;
}

std::uint32_t checkHeader(const QByteArray &buffer, std::uint64_t sector, std::uint64_t totalSectors,
                          std::uint32_t bytesPerSector, Header &h)
{
    h = Header();
    if (!PartScan::hasText(buffer, 0, "EFI PART"))
        return HeaderSignature;
    h.revision = le32(buffer, 8);
    h.headerSize = le32(buffer, 12);
    if (h.headerSize != HeaderBytes && h.headerSize != bytesPerSector)
        return HeaderSize;
    if (buffer.size() < qsizetype(h.headerSize))
        return HeaderSize;
    h.raw = buffer.left(h.headerSize);
    h.headerCrc = le32(buffer, 16);
    QByteArray zeroed = h.raw;
    std::memset(zeroed.data() + 16, 0, 4);
    if (crc32(zeroed.constData(), std::size_t(zeroed.size())) != h.headerCrc)
        return HeaderCrc;
    h.thisSector = le64(buffer, 24);
    h.otherSector = le64(buffer, 32);
    h.firstUsable = le64(buffer, 40);
    h.lastUsable = le64(buffer, 48);
    h.diskGuid = guidAt(buffer, 56);
    h.arraySector = le64(buffer, 72);
    h.entryCount = le32(buffer, 80);
    h.entrySize = le32(buffer, 84);
    h.arrayCrc = le32(buffer, 88);
    if (h.thisSector != sector)
        return HeaderSector;
    if (h.otherSector == 0 || h.otherSector >= totalSectors)
        return OtherHeaderSector;
    if (h.entrySize != EntryBytes)
        return EntrySize;
    const std::uint64_t arrayBytes = std::uint64_t(h.entryCount) * h.entrySize;
    if (h.entryCount == 0 || bytesPerSector == 0 || arrayBytes % bytesPerSector != 0 ||
        arrayBytes > MaxArrayBytes)
        return EntryCount;
    const std::uint64_t arraySectors = arrayBytes / bytesPerSector;
    if (h.arraySector >= totalSectors || arraySectors > totalSectors - h.arraySector)
        return EntryCount;
    if (h.firstUsable > h.lastUsable)
        return UsableRange;
    struct Area
    {
        std::uint64_t start, length;
    };
    Area areas[5] = {
        {0, 1}, {h.thisSector, 1}, {h.otherSector, 1}, {h.firstUsable, 1}, {h.arraySector, arraySectors}};
    std::sort(std::begin(areas), std::end(areas),
              [](const Area &a, const Area &b) { return a.start < b.start; });
    for (int i = 1; i < 5; ++i)
        if (areas[i - 1].start + areas[i - 1].length > areas[i].start)
            return AreasOverlap;
    return Ok;
}

ReadResult read(cStorage &storage)
{
    ReadResult r;
    const std::uint64_t total = storage.GetTotalSectors();
    QByteArray mbr;
    {
        // Bytes 0..511 of the device.
        const std::uint32_t bps = storage.GetBytesPerSector();
        if (bps < 512 || !readSectors(storage, 0, 1, mbr)) {
            r.code = MbrReadFailed;
            return r;
        }
    }
    if (!PartScan::hasBootSignature(mbr)) {
        r.code = MbrNoSignature;
        return r;
    }
    const Mbr::Table table = Mbr::parse(mbr);
    int protective = 0;
    std::uint64_t headerSector = 0;
    for (const Mbr::Entry &e : table.entries)
        if (e.type() == Mbr::TypeGptProtective) {
            ++protective;
            headerSector = e.start();
        }
    if (protective != 1) {
        r.code = ProtectiveCount;
        return r;
    }
    if (headerSector == 0 || total < 2 || headerSector >= total - 1) {
        r.code = ProtectiveStart;
        return r;
    }

    std::uint32_t code = readHeader(storage, headerSector, r.header);
    if (code != Ok) {
        r.code = code;
        if (readHeader(storage, total - 1, r.header) != Ok) {
            r.header = Header();
            return r;
        }
        r.fromLastSector = true;
    }
    r.headerValid = true;
    const Header &h = r.header;

    QByteArray array;
    if (readArray(storage, h, array)) {
        r.entriesFound = true;
    }

    // The other header: valid when its CRC is good and it equals this one with the two header
    // sectors swapped and its own entry-array sector.
    Header other;
    if (readHeader(storage, h.otherSector, other) == Ok && comparable(other, true) == comparable(h, false)) {
        r.backupValid = true;
        QByteArray otherArray;
        if (readArray(storage, other, otherArray)) {
            if (r.entriesFound && otherArray == array)
                r.backupArraySector = other.arraySector;
            else if (!r.entriesFound) {
                // This header's array is damaged: the copy holds the same entries.
                array = otherArray;
                r.entriesFromBackup = true;
            }
        }
    }

    if (r.entriesFound || r.entriesFromBackup) {
        r.entries = parseEntries(array, h.entrySize);
        code = r.code | checkEntries(r.entries, array, h.entrySize, h);
        r.code = code;
    }
    return r;
}

} // namespace Gpt
