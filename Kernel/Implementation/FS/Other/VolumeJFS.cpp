#include "Kernel/Implementation/FS/Other/VolumeJFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

namespace {
constexpr std::uint64_t BadSecondary = 0x10000000000000ull;
constexpr std::uint64_t Dirty = 0x20000000000000ull;
constexpr std::uint64_t MainSb = 0x100000000000000ull;
constexpr std::uint64_t SpareSb = 0x200000000000000ull;
} // namespace

CVolumeJFS::CVolumeJFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeJFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryJFS>(this, parent, QString(), 0, 0);
}

void CVolumeJFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 1 | 2 | 4 | 16 | 128 | 256 | MainSb | SpareSb;
    ClearEntries();
    std::vector<std::uint8_t> main, spare;
    const bool a = ReadBlock(32768, 512, main) && Detect::IsJfs(main.data(), main.size());
    const bool c = ReadBlock(61440, 512, spare) && Detect::IsJfs(spare.data(), spare.size());
    if (a)
        m_validItems |= MainSb;
    if (c)
        m_validItems |= SpareSb;
    const std::vector<std::uint8_t> &s = a ? main : spare;
    const std::uint8_t *b = s.data();
    const std::size_t n = s.size();
    if (Equals(b, n, 0, "JFS1", 4))
        m_validItems |= 1;
    const std::uint32_t version = U32(b, n, 4);
    if (version == 1 || version == 2)
        m_validItems |= 2;
    const std::uint32_t bsize = U32(b, n, 16), pbsize = U32(b, n, 24);
    if (PowerOfTwo(pbsize, 512, 4096) && U16(b, n, 28) == Log2(pbsize))
        m_validItems |= 4;
    if (PowerOfTwo(bsize, 512, 4096) && bsize >= pbsize && U16(b, n, 20) == Log2(bsize))
        m_validItems |= 16;
    const std::uint64_t size = U64(b, n, 8); // in physical blocks
    if (size != 0 && pbsize != 0 && size <= m_size / pbsize)
        m_validItems |= 128;
    const std::uint32_t agsize = U32(b, n, 32);
    if (agsize != 0 && (agsize & (agsize - 1)) == 0)
        m_validItems |= 256;
    if (U32(b, n, 36) & 0x00010000u)
        m_validItems |= BadSecondary;
    if (U32(b, n, 40) != 0)
        m_validItems |= Dirty;
    if (!a && !c) {
        Message(QStringLiteral("Superblock not found"));
        return;
    }
    if ((m_validItems & (4 | 16 | 128)) == (4 | 16 | 128))
        BlockGeometry(bsize, size * pbsize / bsize);
    m_label = VolumeText::Latin1(b, n, 152, 16);
    if (m_label.isEmpty())
        m_label = VolumeText::Latin1(b, n, 101, 11);
    m_serial = VolumeText::SerialFromUuid(b, n, 136);
    MakeService<CEntryJFS>(QStringLiteral("$SuperBlock"), 32768 >> m_sectorShift, 1);
    MakeService<CEntryJFS>(QStringLiteral("$SuperBlockSpare"), 61440 >> m_sectorShift, 1);
    MakeRoot<CEntryJFS>(QStringLiteral("Root"), 2);
}

std::uint32_t CVolumeJFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    const std::uint64_t core = 0x40000000000F3FFull;
    const bool flagged = (v & 0x30000000000000ull) != 0;
    const bool allChecked = (v & m_checkedItems) == m_checkedItems;
    if ((v & core) == core && ((v & 0x3000) || allChecked)) {
        int grade = allChecked ? 8 : 6;
        if (!(v & 0x3000000000000ull))
            grade -= 1;
        if (flagged)
            grade -= 2;
        return static_cast<std::uint32_t>(grade < 0 ? 0 : grade);
    }
    if ((v & core) == core)
        return flagged ? 2 : 4;
    if ((v & 0x3FF) == 0x3FF)
        return 3;
    if ((v & 0x195) == 0x195)
        return 2;
    return 0;
}
