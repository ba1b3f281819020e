#include "Kernel/Implementation/FS/Other/VolumeApFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

CVolumeApFS::CVolumeApFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeApFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryApFS>(this, parent, QString(), 0, 0);
}

std::uint64_t CVolumeApFS::OmapLookup(const std::uint8_t *node, std::size_t size, std::uint64_t oid)
{
    // Node header after the 32-byte object header: flags, level, key count, table of contents.
    const std::uint16_t flags = U16(node, size, 32);
    const std::uint16_t level = U16(node, size, 34);
    const std::uint32_t keys = U32(node, size, 36);
    const std::size_t tocOffset = U16(node, size, 40), tocLength = U16(node, size, 42);
    if (!(flags & 2) || !(flags & 4) || level != 0 || size < 56 + 40)
        return 0;
    const std::size_t toc = 56 + tocOffset;
    const std::size_t keyStart = toc + tocLength;
    // A root node keeps its tree information in the last 40 bytes; values count back from there.
    const std::size_t valueEnd = (flags & 1) ? size - 40 : size;
    if (!Fits(size, toc, tocLength) || std::uint64_t(keys) * 4 > tocLength)
        return 0;
    for (std::uint32_t i = 0; i < keys; ++i) {
        const std::size_t k = keyStart + U16(node, size, toc + 4 * i);
        const std::size_t vOff = U16(node, size, toc + 4 * i + 2);
        if (!Fits(size, k, 16) || vOff > valueEnd || vOff < 16)
            return 0;
        if (U64(node, size, k) == oid)
            return U64(node, size, valueEnd - vOff + 8);
    }
    return 0;
}

void CVolumeApFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 31;
    ClearEntries();
    std::vector<std::uint8_t> sb;
    if (!ReadBlock(0, 65536, sb)) {
        Message(QStringLiteral("Container superblock is not readable"));
        return;
    }
    const bool a = Detect::IsApFs(sb.data(), sb.size());
    std::uint32_t blockSize = U32(sb.data(), sb.size(), 36);
    if (!PowerOfTwo(blockSize, 4096, 65536)) {
        Message(QStringLiteral("Invalid container superblock"));
        return;
    }
    sb.resize(blockSize);
    if (a)
        m_validItems |= 1;
    // The latest valid superblock of the checkpoint descriptor area.
    const std::uint64_t blocks = U64(sb.data(), sb.size(), 40);
    const std::uint64_t descBase = U64(sb.data(), sb.size(), 112);
    const std::uint32_t descBlocks = U32(sb.data(), sb.size(), 104) & 0x7FFFFFFFu;
    std::vector<std::uint8_t> d, latest;
    for (std::uint32_t i = 0; a && i < std::min<std::uint32_t>(descBlocks, 256); ++i) {
        if (descBase + i >= blocks || !ReadBlock((descBase + i) * blockSize, blockSize, d))
            continue;
        if (Detect::IsApFs(d.data(), d.size()) &&
            (latest.empty() || U64(d.data(), d.size(), 16) > U64(latest.data(), latest.size(), 16)))
            latest = d;
    }
    if (!latest.empty()) {
        m_validItems |= 2;
        if (U64(latest.data(), latest.size(), 16) == U64(sb.data(), sb.size(), 16))
            m_validItems |= 4;
    }
    const std::vector<std::uint8_t> &s = latest.empty() ? sb : latest;
    BlockGeometry(blockSize, blocks);
    m_serial = VolumeText::SerialFromUuid(s.data(), s.size(), 72);
    // Object map, its B-tree root, then the first volume's superblock.
    std::vector<std::uint8_t> omap, tree, volume;
    const std::uint64_t omapBlock = U64(s.data(), s.size(), 160);
    if (omapBlock < blocks && ReadBlock(omapBlock * blockSize, blockSize, omap) &&
        Detect::ApFsChecksum(omap.data(), blockSize) == U64(omap.data(), omap.size(), 0) &&
        (U32(omap.data(), omap.size(), 24) & 0xFFFF) == 0x0B) {
        const std::uint64_t treeBlock = U64(omap.data(), omap.size(), 48);
        if (treeBlock < blocks && ReadBlock(treeBlock * blockSize, blockSize, tree) &&
            Detect::ApFsChecksum(tree.data(), blockSize) == U64(tree.data(), tree.size(), 0)) {
            m_validItems |= 8;
            const std::uint64_t fs = U64(s.data(), s.size(), 184);
            const std::uint64_t at = fs ? OmapLookup(tree.data(), tree.size(), fs) : 0;
            if (at != 0 && at < blocks && ReadBlock(at * blockSize, blockSize, volume) &&
                Equals(volume.data(), volume.size(), 32, "APSB", 4)) {
                m_validItems |= 16;
                m_label = VolumeText::Utf8(volume.data(), volume.size(), 704, 256);
            }
        }
    }
    MakeService<CEntryApFS>(QStringLiteral("$ContainerSuperBlock"), 0, blockSize >> m_sectorShift);
    MakeRoot<CEntryApFS>(QStringLiteral("Root"), 2);
}

std::uint32_t CVolumeApFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    if (!(v & 2))
        return 0;
    if (!(v & 8))
        return 1;
    if (!(v & 16) || !(v & 1))
        return 2;
    return (v & 4) ? 8 : 2;
}
