#include "hexeditor/StorageLayout.h"

namespace HexEditor::Layout {

namespace {

std::uint64_t le(const QByteArray &b, int at, int bytes)
{
    if (at < 0 || at + bytes > b.size())
        return 0;
    std::uint64_t v = 0;
    for (int i = bytes - 1; i >= 0; --i)
        v = (v << 8) | std::uint8_t(b[at + i]);
    return v;
}

std::uint64_t be(const QByteArray &b, int at, int bytes)
{
    if (at < 0 || at + bytes > b.size())
        return 0;
    std::uint64_t v = 0;
    for (int i = 0; i < bytes; ++i)
        v = (v << 8) | std::uint8_t(b[at + i]);
    return v;
}

bool isPowerOfTwo(std::uint64_t v)
{
    return v && !(v & (v - 1));
}

// a * b, or none (all ones) when it overflows.
std::uint64_t mul(std::uint64_t a, std::uint64_t b)
{
    if (a && b > UINT64_MAX / a)
        return UINT64_MAX;
    return a * b;
}

std::uint64_t add(std::uint64_t a, std::uint64_t b)
{
    return b > UINT64_MAX - a ? UINT64_MAX : a + b;
}

class Builder
{
public:
    Builder(std::uint64_t size, QList<Point> &out) : m_size(size), m_out(out) {}
    void add(const QString &title, std::uint64_t offset, Templates::Type type, bool primary = true)
    {
        if (offset < m_size)
            m_out.append(Point{title, offset, type, primary, 1});
    }

private:
    std::uint64_t m_size;
    QList<Point> &m_out;
};

void fatPoints(bool fat32, const QByteArray &boot, Builder &b)
{
    const Templates::Type type = fat32 ? Templates::Fat32BootSector : Templates::FatBootSector;
    b.add(QStringLiteral("Boot Sector (%1)"), 0, type);
    const std::uint64_t bps = le(boot, 0x0B, 2);
    const std::uint64_t spc = le(boot, 0x0D, 1);
    const std::uint64_t reserved = le(boot, 0x0E, 2);
    const std::uint64_t fats = le(boot, 0x10, 1);
    const std::uint64_t fatSize = fat32 ? le(boot, 0x24, 4) : le(boot, 0x16, 2);
    if (!isPowerOfTwo(bps) || bps < 128 || bps > 4096 || !spc || !reserved || !fats || !fatSize)
        return;
    if (fat32) {
        const std::uint64_t backup = le(boot, 0x32, 2);
        if (backup && backup != 0xFFFF && backup < reserved)
            b.add(QStringLiteral("Boot Sector Copy (%1)"), backup * bps, type, false);
    }
    b.add(QStringLiteral("FAT1 (%1)"), reserved * bps, Templates::None);
    if (fats >= 2)
        b.add(QStringLiteral("FAT2 (%1)"), (reserved + fatSize) * bps, Templates::None);
    const std::uint64_t dataStart = reserved + fats * fatSize;
    if (!fat32) {
        b.add(QStringLiteral("Root Directory (%1)"), dataStart * bps, Templates::FatDirectoryEntry);
    } else {
        const std::uint64_t rootCluster = le(boot, 0x2C, 4);
        if (rootCluster >= 2)
            b.add(QStringLiteral("Root Directory (%1)"),
                  mul(::HexEditor::Layout::add(dataStart, mul(rootCluster - 2, spc)), bps),
                  Templates::FatDirectoryEntry);
    }
}

void exFatPoints(const QByteArray &boot, Builder &b)
{
    b.add(QStringLiteral("Boot Sector (%1)"), 0, Templates::ExFatBootSector);
    const std::uint32_t bpsShift = std::uint32_t(le(boot, 0x6C, 1));
    const std::uint32_t spcShift = std::uint32_t(le(boot, 0x6D, 1));
    if (bpsShift < 9 || bpsShift > 12 || spcShift > 25 - bpsShift)
        return;
    const std::uint64_t bps = 1ull << bpsShift;
    b.add(QStringLiteral("Boot Sector Copy (%1)"), 12 * bps, Templates::ExFatBootSector, false);
    const std::uint64_t fatOffset = le(boot, 0x50, 4);
    const std::uint64_t heap = le(boot, 0x58, 4);
    const std::uint64_t root = le(boot, 0x60, 4);
    if (fatOffset)
        b.add(QStringLiteral("FAT (%1)"), fatOffset * bps, Templates::None);
    if (heap && root >= 2)
        b.add(QStringLiteral("Root Directory (%1)"), mul(heap + ((root - 2) << spcShift), bps),
              Templates::ExFatDirectoryEntry);
}

void ntfsPoints(const QByteArray &boot, std::uint64_t size, Builder &b)
{
    b.add(QStringLiteral("Boot Sector (%1)"), 0, Templates::NtfsBootSector);
    const std::uint64_t bps = le(boot, 0x0B, 2);
    const std::uint64_t spc = le(boot, 0x0D, 1);
    if (!isPowerOfTwo(bps) || bps < 256 || bps > 4096 || !spc)
        return;
    // Sectors per cluster above 0x80 are a negative shift.
    const std::uint64_t clusterBytes = spc <= 0x80 ? spc * bps : (spc >= 0xF4 ? (bps << (256 - spc)) : 0);
    const std::uint64_t total = le(boot, 0x28, 8);
    const std::uint64_t copy = total && mul(total, bps) < size ? mul(total, bps) : size - (size % bps) - bps;
    if (size >= bps)
        b.add(QStringLiteral("Boot Sector Copy (%1)"), copy, Templates::NtfsBootSector, false);
    if (clusterBytes) {
        b.add(QStringLiteral("$MFT (%1)"), mul(le(boot, 0x30, 8), clusterBytes),
              Templates::NtfsMftFileRecord);
        b.add(QStringLiteral("$MFT Mirror (%1)"), mul(le(boot, 0x38, 8), clusterBytes),
              Templates::NtfsMftFileRecord, false);
    }
}

void hfsPoints(const QByteArray &header, std::uint64_t size, Builder &b)
{
    b.add(QStringLiteral("Volume Header (%1)"), 1024, Templates::HfsPlusVolumeHeader);
    if (size >= 2048)
        b.add(QStringLiteral("Volume Header Copy (%1)"), size - 1024, Templates::HfsPlusVolumeHeader, false);
    const std::uint64_t blockSize = be(header, 0x28, 4);
    const std::uint64_t catalogStart = be(header, 0x110 + 16, 4);
    if (isPowerOfTwo(blockSize) && blockSize >= 512 && catalogStart)
        b.add(QStringLiteral("Catalog File (%1)"), mul(catalogStart, blockSize),
              Templates::HfsPlusCatalogNode);
}

} // namespace

std::uint32_t ntfsRecordSize(std::int8_t value, std::uint32_t clusterSize)
{
    if (value < 0) {
        const int shift = -int(value);
        return shift < 31 ? 1u << shift : 0;
    }
    const std::uint64_t bytes = std::uint64_t(std::uint8_t(value)) * clusterSize;
    return bytes <= 0x80000000ull ? std::uint32_t(bytes) : 0;
}

std::uint32_t extInodeSize(const QByteArray &sb)
{
    if (le(sb, 0x38, 2) != 0xEF53)
        return 0;
    if (le(sb, 0x4C, 4) == 0)
        return 128;
    const std::uint64_t logBlock = le(sb, 0x18, 4);
    const std::uint64_t inode = le(sb, 0x58, 2);
    if (logBlock > 6 || !isPowerOfTwo(inode) || inode < 128 || inode > (1024ull << logBlock))
        return 0;
    return std::uint32_t(inode);
}

QList<Point> volumePoints(std::uint32_t kind, std::uint64_t size, std::uint32_t sectorSize,
                          const Reader &read)
{
    QList<Point> out;
    Builder b(size, out);
    switch (kind) {
    case 7:
    case 8:
        fatPoints(kind == 8, read(0, 512), b);
        break;
    case 9:
        exFatPoints(read(0, 512), b);
        break;
    case 10:
        ntfsPoints(read(0, 512), size, b);
        out.append(Point{QStringLiteral("MFT No..."), 0, Templates::None, true, 3});
        break;
    case 13:
        hfsPoints(read(1024, 512), size, b);
        out.append(Point{QStringLiteral("Node No..."), 0, Templates::None, true, 4});
        break;
    case 14:
    case 15:
    case 16:
        b.add(QStringLiteral("Superblock (%1)"), 1024, Templates::ExtSuperBlock);
        break;
    case 17: {
        // UFS2 keeps its superblock at 64 KiB, UFS1 at 8 KiB; the magic tells which.
        const QByteArray two = read(65536 + 1372, 4);
        const bool ufs2 = le(two, 0, 4) == 0x19540119;
        b.add(QStringLiteral("Superblock (%1)"), ufs2 ? 65536 : 8192, Templates::UfsSuperblock);
        break;
    }
    case 20:
        for (const std::uint64_t at : {0x10000ull, 0x4000000ull, 0x4000000000ull})
            if (add(at, 4096) <= size)
                b.add(QStringLiteral("Superblock (%1)"), at, Templates::BtrFsSuperblock, at == 0x10000ull);
        break;
    default:
        break;
    }
    if (sectorSize && size >= sectorSize) {
        out.append(Point{QStringLiteral("First Sector (%1)"), 0, Templates::None, true, 1});
        out.append(Point{QStringLiteral("Last Sector (%1)"), (size / sectorSize - 1) * sectorSize,
                         Templates::None, true, 1});
    }
    return out;
}

} // namespace HexEditor::Layout
