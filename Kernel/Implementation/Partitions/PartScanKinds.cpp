#include "Kernel/Implementation/Partitions/PartScanKinds.h"

#include <algorithm>

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/Partitions/PartScanBytes.h"

namespace PartScan {

namespace {

constexpr std::uint32_t Unknown = 0xFFFFFFFF;

// Reads `bytes` from byte `offset` of the range [start, start+length) in whole sectors.
bool readRange(cStorage &s, std::uint64_t start, std::uint64_t length, std::uint64_t offset,
               std::uint32_t bytes, QByteArray &out)
{
    const std::uint32_t bps = s.GetBytesPerSector();
    const std::uint64_t total = s.GetTotalSectors();
    if (bps < 512 || bps > 65536 || bytes == 0 || offset % bps != 0)
        return false;
    const std::uint32_t count = (bytes + bps - 1) / bps;
    const std::uint64_t first = offset / bps;
    if (first >= length || count > length - first || start >= total || first > total - start ||
        count > total - start - first)
        return false;
    out.resize(qsizetype(count) * bps);
    std::uint32_t error = 0;
    return s.ReadSectors(start + first, count, out.data(), error);
}

} // namespace

std::uint32_t bootSectorKind(const QByteArray &b)
{
    const std::uint32_t k = Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(b.constData()),
                                                      std::size_t(b.size()));
    return k >= 7 && k <= 23 ? k : Unknown;
}

std::uint32_t sniffFileSystem(cStorage &s, std::uint64_t start, std::uint64_t length)
{
    // Enough for the superblocks that lie furthest in (Btrfs at 64 KiB).
    const std::uint32_t bps = s.GetBytesPerSector();
    if (bps < 512 || bps > 65536)
        return Unknown;
    const std::uint64_t want = (68 * 1024 + bps - 1) / bps;
    const std::uint32_t sectors = static_cast<std::uint32_t>(std::min<std::uint64_t>(want, length));
    QByteArray head;
    if (sectors == 0 || !readRange(s, start, length, 0, sectors * bps, head))
        return Unknown;
    return bootSectorKind(head);
}

std::uint32_t kindOfMbrType(std::uint8_t type)
{
    switch (type) {
    case 0xA5: // FreeBSD
    case 0xA6: // OpenBSD
    case 0xA9: // NetBSD
        return 5;
    default:
        return Unknown;
    }
}

bool hasLvm2Label(cStorage &s)
{
    const std::uint32_t bps = s.GetBytesPerSector();
    if (bps < 512)
        return false;
    // The label sits in one of the first four 512-byte sectors.
    QByteArray buf;
    const std::uint64_t sectors = (2048 + bps - 1) / bps;
    if (!readRange(s, 0, s.GetTotalSectors(), 0, std::uint32_t(sectors * bps), buf))
        return false;
    for (int i = 0; i < 4; ++i)
        if (hasText(buf, i * 512, "LABELONE") && hasText(buf, i * 512 + 24, "LVM2 001"))
            return true;
    return false;
}

bool hasZfsLabel(cStorage &s)
{
    const std::uint32_t bps = s.GetBytesPerSector();
    const std::uint64_t total = s.GetTotalSectors();
    if (bps < 512 || bps > 65536)
        return false;
    constexpr std::uint64_t LabelSize = 256 * 1024;
    const std::uint64_t bytes = total * bps;
    if (total > UINT64_MAX / bps || bytes < 4 * LabelSize)
        return false;
    const std::uint64_t end = bytes / LabelSize * LabelSize; // labels at the end are 256 KiB aligned
    const std::uint64_t labels[4] = {0, LabelSize, end - 2 * LabelSize, end - LabelSize};
    for (std::uint64_t label : labels) {
        // The uberblock ring fills the second half of the label; slots are at least 1 KiB.
        QByteArray ring;
        if (!readRange(s, 0, total, label + 128 * 1024, 128 * 1024, ring))
            continue;
        for (qsizetype o = 0; o + 8 <= ring.size(); o += 1024) {
            const std::uint64_t magic = le64(ring, o);
            if (magic == 0x00bab10cull || magic == 0x0cb1ba0000000000ull)
                return true;
        }
    }
    return false;
}

} // namespace PartScan
