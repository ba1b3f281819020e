#include "Kernel/Implementation/FS/Other/VolumeBtrFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

#include <cstring>

using namespace DiskBytes;

namespace {
constexpr std::uint64_t Primary = 65536;
constexpr std::uint64_t Mirror = 67108864;
constexpr std::uint64_t Matched = 0x200000000000000ull;
} // namespace

CVolumeBtrFS::CVolumeBtrFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeBtrFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryBtrFS>(this, parent, QString(), 0, 0);
}

std::uint32_t CVolumeBtrFS::Crc32c(const std::uint8_t *data, std::size_t size)
{
    std::uint32_t crc = 0xFFFFFFFFu;
    for (std::size_t i = 0; i < size; ++i) {
        crc ^= data[i];
        for (int k = 0; k < 8; ++k)
            crc = (crc >> 1) ^ (0x82F63B78u & (0u - (crc & 1u)));
    }
    return ~crc;
}

void CVolumeBtrFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 0xFF | 0x10000 | 0x20000;
    ClearEntries();
    std::vector<std::uint8_t> sb, mirror;
    const bool a = ReadBlock(Primary, 4096, sb) && Detect::IsBtrFs(sb.data(), sb.size());
    const bool hasMirror = m_size >= Mirror + 4096;
    const bool c =
        hasMirror && ReadBlock(Mirror, 4096, mirror) && Detect::IsBtrFs(mirror.data(), mirror.size());
    if (hasMirror)
        m_checkedItems |= Matched;
    if (!a && !c) {
        Message(QStringLiteral("Superblock not found"));
        return;
    }
    const std::vector<std::uint8_t> &s = a ? sb : mirror;
    const std::uint8_t *b = s.data();
    const std::size_t n = s.size();
    const std::uint32_t sector = U32(b, n, 144);
    const std::uint64_t total = U64(b, n, 112), used = U64(b, n, 120);
    if (a)
        m_validItems |= 1;
    if (U64(b, n, 72) >= 1)
        m_validItems |= 2;
    if (total >= used)
        m_validItems |= 4;
    if (U64(b, n, 136) >= 1)
        m_validItems |= 8;
    if (PowerOfTwo(sector, 4096, 65536))
        m_validItems |= 16;
    if (PowerOfTwo(U32(b, n, 148), sector, 65536))
        m_validItems |= 32;
    if (PowerOfTwo(U32(b, n, 152), sector, 65536))
        m_validItems |= 64;
    if (U16(b, n, 196) == 0 && Crc32c(b + 32, n - 32) == U32(b, n, 0))
        m_validItems |= 128;
    const std::uint32_t sysArray = U32(b, n, 160);
    if (U64(b, n, 88) != 0 && U64(b, n, 88) % sector == 0 && sysArray > 0 && sysArray <= 2048)
        m_validItems |= 0x10000;
    if (U64(b, n, 80) != 0 && U64(b, n, 80) % sector == 0)
        m_validItems |= 0x20000;
    if (a && c && std::memcmp(sb.data() + 32, mirror.data() + 32, 16) == 0)
        m_validItems |= Matched;
    BlockGeometry(sector, total / sector);
    if (m_clusterShift + m_sectorShift == Log2(sector) && total >= used) {
        m_freeClusters = (total - used) / sector;
        m_freeKnown = true;
    }
    m_label = VolumeText::Utf8(b, n, 299, 256);
    m_serial = VolumeText::SerialFromUuid(b, n, 32);
    MakeService<CEntryBtrFS>(QStringLiteral("$SuperBlock"), Primary >> m_sectorShift, 4096 >> m_sectorShift);
    if (hasMirror)
        MakeService<CEntryBtrFS>(QStringLiteral("$SuperBlockMirr"), Mirror >> m_sectorShift,
                                 4096 >> m_sectorShift);
    MakeRoot<CEntryBtrFS>(QStringLiteral("Root"), 256);
}

std::uint32_t CVolumeBtrFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    if ((v & 0xF00FF) == 0xF00FF)
        return 7;
    if ((v & 0xFB) == 0xFB)
        return 6;
    return 0;
}
