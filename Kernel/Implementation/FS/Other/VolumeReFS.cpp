#include "Kernel/Implementation/FS/Other/VolumeReFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"

using namespace DiskBytes;

CVolumeReFS::CVolumeReFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeReFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryReFS>(this, parent, QString(), 0, 0);
}

void CVolumeReFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 7;
    ClearEntries();
    std::vector<std::uint8_t> primary, copy;
    const std::uint64_t partSector = 1ull << m_sectorShift;
    const bool a = ReadBlock(0, 512, primary) && Detect::IsReFs(primary.data(), primary.size());
    const bool c = m_size >= partSector && ReadBlock(m_size - partSector, 512, copy) &&
                   Detect::IsReFs(copy.data(), copy.size());
    if (a)
        m_validItems |= 1;
    if (c)
        m_validItems |= 2;
    if (a && c && primary == copy)
        m_validItems |= 4;
    if (!a && !c) {
        Message(QStringLiteral("Invalid boot sector 0"));
        return;
    }
    const std::vector<std::uint8_t> &b = a ? primary : copy;
    const std::size_t n = b.size();
    const std::uint32_t bps = U32(b.data(), n, 32), spc = U32(b.data(), n, 36);
    const std::uint64_t sectors = U64(b.data(), n, 24);
    m_major = b[40];
    UseSectorSize(bps);
    BlockGeometry(std::uint64_t(bps) * spc, sectors / spc);
    m_serial = U32(b.data(), n, 56);
    MakeService<CEntryReFS>(QStringLiteral("$Boot"), 0, 1);
    if (m_sectorCount > 0)
        MakeService<CEntryReFS>(QStringLiteral("$BootMirr"), m_sectorCount - 1, 1);
    MakeRoot<CEntryReFS>(QStringLiteral("Root"), 0);
}

std::uint32_t CVolumeReFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    if (!(v & 8) || !(v & 16) || (m_major == 3 && !(v & 32)) || !(v & 64) || !(v & 128) || !(v & 1024))
        return 1;
    if (!(v & 256) || !(v & 512))
        return 2;
    if (!(v & 1))
        return 3;
    if (!(v & 2))
        return 4;
    return (v & 4) ? 8 : 5;
}
