#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/FS/VolumeText.h"

#include <vector>

using namespace DiskBytes;

namespace {

// The kinds whose own classes come with their file systems: what the boot area tells of the
// geometry, label and serial number.
struct Basic
{
    bool ok = false;
    std::uint32_t sectorSize = 0;  // 0: keep the partition's
    std::uint64_t sectorCount = 0; // 0: keep the size's
    std::uint64_t clusterBytes = 0;
    std::uint64_t cluster0 = 0, first = 0, last = 0;
    bool freeKnown = false;
    std::uint64_t freeClusters = 0;
    QString label;
    std::uint32_t serial = 0;
};

} // namespace

CVolumeXXX::CVolumeXXX(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolume(medium, description, root)
{
    Initialize();
}

void CVolumeXXX::Initialize()
{
    Basic g;
    std::vector<std::uint8_t> b(4096, 0);
    const std::size_t n = b.size();
    auto read = [&](std::uint64_t offset, std::size_t bytes) {
        b.assign(std::max(bytes, n), 0);
        return ReadRaw(offset, bytes, b.data());
    };
    const std::uint64_t partSector = 1ull << m_sectorShift;
    switch (m_kind) {
    case 7:
    case 8: {
        bool found =
            read(0, 512) && (m_kind == 7 ? Detect::IsFat(b.data(), 512) : Detect::IsFat32(b.data(), 512));
        if (!found && m_kind == 8)
            found = read(6 * partSector, 512) && Detect::IsFat32(b.data(), 512);
        if (!found)
            break;
        const std::uint64_t bps = U16(b.data(), n, 11), spc = b[13], reserved = U16(b.data(), n, 14);
        const std::uint64_t fats = b[16], root = U16(b.data(), n, 17);
        const std::uint64_t total = U16(b.data(), n, 19) ? U16(b.data(), n, 19) : U32(b.data(), n, 32);
        const std::uint64_t spf = U16(b.data(), n, 22) ? U16(b.data(), n, 22) : U32(b.data(), n, 36);
        const std::uint64_t dataStart = reserved + fats * spf + (root * 32 + bps - 1) / bps;
        if (total <= dataStart || dataStart < 2 * spc)
            break;
        g.sectorSize = static_cast<std::uint32_t>(bps);
        g.sectorCount = total;
        g.clusterBytes = bps * spc;
        g.cluster0 = dataStart - 2 * spc;
        g.first = 2;
        g.last = (total - dataStart) / spc + 1;
        const bool fat32 = m_kind == 8;
        g.serial = U32(b.data(), n, fat32 ? 67 : 39);
        g.label = VolumeText::Latin1(b.data(), n, fat32 ? 71 : 43, 11);
        if (g.label == QLatin1String("NO NAME"))
            g.label.clear();
        g.ok = true;
        break;
    }
    case 9: {
        bool found = read(0, 512) && Detect::IsExFat(b.data(), 512);
        if (!found)
            found = read(12 * partSector, 512) && Detect::IsExFat(b.data(), 512);
        if (!found)
            break;
        const unsigned bpsShift = b[108], spcShift = b[109];
        const std::uint64_t heap = U32(b.data(), n, 88), count = U32(b.data(), n, 92);
        const std::uint64_t rootCluster = U32(b.data(), n, 96);
        if (heap < (2ull << spcShift))
            break;
        g.sectorSize = 1u << bpsShift;
        g.sectorCount = U64(b.data(), n, 72);
        g.clusterBytes = 1ull << (bpsShift + spcShift);
        g.cluster0 = heap - (2ull << spcShift);
        g.first = 2;
        g.last = count + 1;
        g.serial = U32(b.data(), n, 100);
        // The label is an entry of type 0x83 in the first cluster of the root folder.
        const std::uint64_t clusterBytes = g.clusterBytes;
        const std::uint64_t rootByte = (g.cluster0 + (rootCluster << spcShift)) << bpsShift;
        if (clusterBytes <= (1u << 20) && read(rootByte, static_cast<std::size_t>(clusterBytes))) {
            for (std::size_t at = 0; at + 32 <= clusterBytes; at += 32) {
                if (b[at] == 0)
                    break;
                if (b[at] == 0x83) {
                    g.label = VolumeText::Utf16(b.data(), b.size(), at + 2,
                                                std::min<std::size_t>(b[at + 1], 11), false);
                    break;
                }
            }
        }
        g.ok = true;
        break;
    }
    case 10: {
        bool found = read(0, 512) && Detect::IsNtfs(b.data(), 512);
        if (!found && m_size >= partSector)
            found = read(m_size - partSector, 512) && Detect::IsNtfs(b.data(), 512);
        if (!found)
            break;
        const std::uint64_t bps = U16(b.data(), n, 11);
        const unsigned raw = b[13];
        const std::uint64_t spc = raw > 128 ? (1ull << (256 - raw)) : raw;
        const std::uint64_t total = U64(b.data(), n, 40);
        const std::uint64_t clusterBytes = bps * spc;
        const std::uint64_t mft = U64(b.data(), n, 48);
        const std::uint32_t recordField = U32(b.data(), n, 64);
        std::uint64_t record = 0;
        if (recordField <= 127)
            record = recordField * clusterBytes;
        else if (recordField < 255 && 256 - recordField < 17)
            record = 1ull << (256 - recordField);
        if (!PowerOfTwo(record, 1024, 4096))
            record = 1024;
        g.sectorSize = static_cast<std::uint32_t>(bps);
        g.sectorCount = total;
        g.clusterBytes = clusterBytes;
        g.first = 0;
        g.last = total / spc - 1;
        g.serial = U32(b.data(), n, 72);
        // The label is the $VOLUME_NAME attribute of MFT record 3.
        if (mft <= (~0ull / clusterBytes) &&
            read(mft * clusterBytes + 3 * record, static_cast<std::size_t>(record)) &&
            Equals(b.data(), n, 0, "FILE", 4)) {
            const std::size_t usa = U16(b.data(), n, 4), usaCount = U16(b.data(), n, 6);
            bool fixed = usaCount >= 1 && Fits(record, usa, usaCount * 2ull);
            for (std::size_t i = 1; fixed && i < usaCount; ++i) {
                const std::size_t end = i * 512 - 2;
                if (end + 2 > record || U16(b.data(), n, end) != U16(b.data(), n, usa)) {
                    fixed = false;
                    break;
                }
                b[end] = b[usa + 2 * i];
                b[end + 1] = b[usa + 2 * i + 1];
            }
            std::size_t at = U16(b.data(), n, 20);
            for (int guard = 0; fixed && guard < 64 && at + 24 <= record; ++guard) {
                const std::uint32_t type = U32(b.data(), n, at), length = U32(b.data(), n, at + 4);
                if (type == 0xFFFFFFFF || length < 24 || at + length > record)
                    break;
                if (type == 0x60 && b[at + 8] == 0) {
                    const std::size_t valueLength = U32(b.data(), n, at + 16),
                                      valueOffset = U16(b.data(), n, at + 20);
                    if (valueOffset + valueLength <= length)
                        g.label = VolumeText::Utf16(b.data(), n, at + valueOffset, valueLength / 2, false);
                    break;
                }
                at += length;
            }
        }
        g.ok = true;
        break;
    }
    case 13: {
        bool found = read(1024, 512) && Detect::IsHfsPlus(b.data(), 512);
        if (!found && m_size >= 1024)
            found = read(m_size - 1024, 512) && Detect::IsHfsPlus(b.data(), 512);
        if (!found)
            break;
        const std::uint64_t blockSize = B32(b.data(), n, 40), blocks = B32(b.data(), n, 44);
        g.clusterBytes = blockSize;
        g.first = 0;
        g.last = blocks - 1;
        g.freeKnown = true;
        g.freeClusters = B32(b.data(), n, 48);
        g.ok = true;
        break;
    }
    case 14:
    case 15:
    case 16: {
        if (!read(1024, 1024) || Detect::ExtKind(b.data(), 1024) == Detect::KindUnknown)
            break;
        const std::uint64_t blockSize = 1024ull << U32(b.data(), n, 24);
        std::uint64_t blocks = U32(b.data(), n, 4), freeBlocks = U32(b.data(), n, 12);
        if (U32(b.data(), n, 96) & 0x80) {
            blocks |= std::uint64_t(U32(b.data(), n, 336)) << 32;
            freeBlocks |= std::uint64_t(U32(b.data(), n, 344)) << 32;
        }
        g.clusterBytes = blockSize;
        g.first = 0;
        g.last = blocks - 1;
        g.freeKnown = true;
        g.freeClusters = freeBlocks;
        g.label = VolumeText::Utf8(b.data(), n, 120, 16);
        g.serial = VolumeText::SerialFromUuid(b.data(), n, 104);
        g.ok = true;
        break;
    }
    default:
        break;
    }
    if (!g.ok)
        return;
    if (g.sectorSize >= 512 && g.sectorSize <= 4096 && (g.sectorSize & (g.sectorSize - 1)) == 0) {
        m_sectorShift = static_cast<std::uint8_t>(Log2(g.sectorSize));
        m_sectorCount = m_size >> m_sectorShift;
    }
    if (g.sectorCount != 0 && g.sectorCount < m_sectorCount)
        m_sectorCount = g.sectorCount;
    const std::uint64_t clusterSectors = g.clusterBytes >> m_sectorShift;
    if (clusterSectors == 0)
        return;
    // The last cluster may not pass the end of the volume.
    const std::uint64_t fit = m_sectorCount > g.cluster0 ? (m_sectorCount - g.cluster0) / clusterSectors : 0;
    if (fit == 0)
        return;
    if (g.last > fit - 1)
        g.last = fit - 1;
    if (!SetClusterGeometry(g.clusterBytes, g.cluster0, g.first, g.last))
        return;
    m_label = g.label;
    m_serial = g.serial;
    m_freeKnown = g.freeKnown;
    m_freeClusters = g.freeClusters;
}
