#include "Kernel/Implementation/FS/Other/VolumeUFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

namespace {
constexpr std::uint64_t FirstSb = 0x100000000000000ull;
constexpr std::uint64_t LastSb = 0x200000000000000ull;
} // namespace

CVolumeUFS::CVolumeUFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeUFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryUFS>(this, parent, QString(), 0, 0);
}

void CVolumeUFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 1 | 2 | 4 | 16 | 32 | 64 | 1024 | 4096 | 8192 | 16384 | FirstSb | LastSb;
    ClearEntries();
    std::vector<std::uint8_t> sb;
    for (std::uint64_t at : {8192ull, 65536ull, 262144ull}) {
        if (ReadBlock(at, 1376, sb) && Detect::IsUfs(sb.data(), sb.size())) {
            m_superOffset = at;
            break;
        }
    }
    if (m_superOffset == NoSector) {
        Message(QStringLiteral("Superblock not found"));
        return;
    }
    const std::size_t n = sb.size();
    const std::uint8_t *b = sb.data();
    const bool ufs2 = U32(b, n, 1372) == 0x19540119;
    m_validItems |= 1 | FirstSb;
    const std::uint64_t sblkno = U32(b, n, 8), cblkno = U32(b, n, 12), iblkno = U32(b, n, 16);
    const std::uint64_t ncg = U32(b, n, 44), bsize = U32(b, n, 48), fsize = U32(b, n, 52);
    const std::uint64_t fpg = U32(b, n, 188);
    const std::uint64_t size = ufs2 ? U64(b, n, 1080) : U32(b, n, 36);
    if (PowerOfTwo(bsize, 4096, 65536))
        m_validItems |= 16;
    if (PowerOfTwo(fsize, 512, bsize) && bsize / fsize <= 8)
        m_validItems |= 32;
    if (U32(b, n, 184) > 0 && fpg > 0)
        m_validItems |= 64;
    if (ncg >= 1 && fpg > 0 && ncg <= size / fpg + 1 && ncg * fpg >= size)
        m_validItems |= 1024;
    if (fsize != 0 && size != 0 && size <= m_size / fsize)
        m_validItems |= 2;
    if (sblkno != 0 && fsize != 0 && sblkno * fsize <= 262144 && sblkno * fsize >= 8192)
        m_validItems |= 4096;
    if (cblkno > sblkno)
        m_validItems |= 8192;
    if (iblkno > cblkno)
        m_validItems |= 16384;
    // The copy in the last cylinder group.
    if ((m_validItems & (32 | 1024 | 64)) == (32 | 1024 | 64)) {
        std::uint64_t base = (ncg - 1) * fpg;
        if (!ufs2) {
            const std::uint64_t cgoffset = U32(b, n, 24), cgmask = U32(b, n, 28);
            base += cgoffset * ((ncg - 1) & ~cgmask);
        }
        std::vector<std::uint8_t> copy;
        if (base <= m_size / fsize && ReadBlock((base + sblkno) * fsize, 1376, copy) &&
            Detect::IsUfs(copy.data(), copy.size())) {
            m_validItems |= LastSb;
            if (U32(copy.data(), copy.size(), 48) == bsize && U32(copy.data(), copy.size(), 52) == fsize &&
                U32(copy.data(), copy.size(), 44) == ncg)
                m_validItems |= 4;
        }
    }
    UseSectorSize(m_sectorShift >= 9 ? (1u << m_sectorShift) : 512);
    if (m_validItems & 32)
        BlockGeometry(fsize, size);
    if (ufs2)
        m_label = VolumeText::Latin1(b, n, 680, 32);
    m_serial = U32(b, n, 144);
    if ((m_validItems & 32) && ufs2) {
        m_freeClusters = U64(b, n, 1016) * U32(b, n, 56) + U64(b, n, 1032);
        m_freeKnown = true;
    }
    MakeService<CEntryUFS>(QStringLiteral("$SuperBlock"), m_superOffset >> m_sectorShift,
                           (1376 + (1u << m_sectorShift) - 1) >> m_sectorShift);
    MakeRoot<CEntryUFS>(QStringLiteral("Root"), 2);
}

std::uint32_t CVolumeUFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    auto all = [v](std::uint64_t m) { return (v & m) == m; };
    if (all(0x30000000000F477ull))
        return 7;
    if (all(0x7473))
        return 6;
    if (all(0x6071))
        return 5;
    if (all(0x71))
        return 2;
    return 0;
}
