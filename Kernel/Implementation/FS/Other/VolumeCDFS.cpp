#include "Kernel/Implementation/FS/Other/VolumeCDFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

CVolumeCDFS::CVolumeCDFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeCDFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryCDFS>(this, parent, QString(), 0, 0);
}

void CVolumeCDFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 1;
    ClearEntries();
    UseSectorSize(2048);
    std::vector<std::uint8_t> d, pvd;
    std::uint64_t pvdSector = NoSector, svdSector = NoSector;
    std::vector<std::uint8_t> svd;
    // Descriptors from sector 16 up to the terminator (type 255).
    for (std::uint64_t sector = 16; sector < 16 + 64; ++sector) {
        if (!ReadBlock(sector * 2048, 2048, d) || !Equals(d.data(), d.size(), 1, "CD001", 5) || d[0] == 255)
            break;
        if (d[0] == 1 && pvdSector == NoSector && Detect::IsCdfs(d.data(), d.size())) {
            pvd = d;
            pvdSector = sector;
        } else if (d[0] == 2 && svdSector == NoSector) {
            svd = d;
            svdSector = sector;
        }
    }
    if (pvdSector == NoSector) {
        Message(QStringLiteral("Primary volume descriptor not found"));
        m_validItems = 0;
        return;
    }
    m_validItems |= 1;
    const std::uint64_t space = U32(pvd.data(), pvd.size(), 80);
    if (svdSector != NoSector) {
        m_checkedItems |= 6;
        if (Detect::IsCdfs(svd.data(), svd.size())) {
            m_validItems |= 2;
            if (U32(svd.data(), svd.size(), 80) == space)
                m_validItems |= 4;
        }
    }
    BlockGeometry(2048, space);
    m_label = VolumeText::Latin1(pvd.data(), pvd.size(), 40, 32);
    MakeService<CEntryCDFS>(QStringLiteral("$PVD"), pvdSector, 1);
    if (svdSector != NoSector)
        MakeService<CEntryCDFS>(QStringLiteral("$SVD"), svdSector, 1);
    const std::uint64_t rootExtent = U32(pvd.data(), pvd.size(), 156 + 2);
    const std::uint64_t rootLength = U32(pvd.data(), pvd.size(), 156 + 10);
    CEntry *root =
        MakeRoot<CEntryCDFS>(QStringLiteral("Root"), rootExtent, rootExtent, (rootLength + 2047) / 2048, 11);
    if (root)
        root->SetSize(rootLength);
}
