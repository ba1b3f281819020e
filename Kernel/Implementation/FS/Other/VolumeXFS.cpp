#include "Kernel/Implementation/FS/Other/VolumeXFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

CVolumeXFS::CVolumeXFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeXFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryXFS>(this, parent, QString(), 0, 0);
}

void CVolumeXFS::Initialize()
{
    m_validItems = 0;
    // Every item but the sparse-inode feature, which is shown only when present.
    m_checkedItems = 0x7FFFFFFFull & ~0x100000ull;
    m_checkedItems |= 0x700000000ull;
    ClearEntries();
    std::vector<std::uint8_t> s;
    if (!ReadBlock(0, 512, s) || !Equals(s.data(), s.size(), 0, "XFSB", 4)) {
        Message(QStringLiteral("Main SuperBlock is invalid"));
        m_checkedItems = AllItems;
        m_validItems = AllItems;
        return;
    }
    const std::uint8_t *b = s.data();
    const std::size_t n = s.size();
    std::uint64_t v = 1;
    const std::uint32_t blockSize = B32(b, n, 4);
    const std::uint64_t dblocks = B64(b, n, 8);
    const std::uint64_t rootino = B64(b, n, 56);
    const std::uint32_t rextsize = B32(b, n, 80), agblocks = B32(b, n, 84), agcount = B32(b, n, 88);
    const std::uint16_t version = B16(b, n, 100), sectSize = B16(b, n, 102), inodeSize = B16(b, n, 104);
    const std::uint16_t inopblock = B16(b, n, 106);
    const std::uint8_t blocklog = b[120], sectlog = b[121], inodelog = b[122], inopblog = b[123],
                       agblklog = b[124];
    const std::uint8_t inprogress = b[126], imaxPct = b[127], dirblklog = b[192];
    const std::uint16_t qflags = B16(b, n, 176);
    const std::uint32_t logsunit = B32(b, n, 196);
    const bool v5 = (version & 0xF) == 5;
    const std::uint32_t roCompat = v5 ? B32(b, n, 212) : 0, incompat = v5 ? B32(b, n, 216) : 0;
    const bool sizes = PowerOfTwo(blockSize, 512, 65536) && PowerOfTwo(sectSize, 512, 32768);
    if (PowerOfTwo(blockSize, 512, 65536) && dblocks != 0 && dblocks <= m_size / blockSize)
        v |= 2;
    if (PowerOfTwo(sectSize, 512, 32768))
        v |= 16;
    if (PowerOfTwo(blockSize, 512, 65536))
        v |= 32;
    if (agblocks >= 64 && agblocks <= dblocks)
        v |= 64;
    if (PowerOfTwo(inodeSize, 256, 2048))
        v |= 128;
    if (sectSize && sectlog == Log2(sectSize) && PowerOfTwo(sectSize, 1, 1u << 16))
        v |= 256;
    if (blockSize && blocklog == Log2(blockSize) && PowerOfTwo(blockSize, 1, 1u << 16))
        v |= 512;
    if (inodeSize && inodelog == Log2(inodeSize) && PowerOfTwo(inodeSize, 1, 1u << 16))
        v |= 1024;
    if (blocklog + dirblklog <= 16)
        v |= 2048;
    bool uuidZero = true;
    for (int i = 0; i < 16; ++i)
        uuidZero = uuidZero && b[32 + i] == 0;
    if (!uuidZero)
        v |= 4096;
    if (rootino != 0)
        v |= 8192;
    if (agcount >= 1)
        v |= 16384;
    if (agcount >= 1 && std::uint64_t(agcount) * agblocks >= dblocks &&
        std::uint64_t(agcount - 1) * agblocks < dblocks)
        v |= 32768;
    if ((version & 0xF) == 4 || v5)
        v |= 0x10000;
    if ((incompat & ~0x3Full) == 0)
        v |= 0x20000;
    if ((incompat & ~0x3Full) == 0 && (roCompat & ~0xFull) == 0)
        v |= 0x40000;
    if ((qflags & ~0x3FFu) == 0)
        v |= 0x80000;
    if (incompat & 2)
        v |= 0x100000;
    if (logsunit <= 1 || (logsunit % 512 == 0 && logsunit <= 262144))
        v |= 0x200000;
    if (inodeSize && inopblock == blockSize / inodeSize)
        v |= 0x400000;
    if (inopblock && inopblog == Log2(inopblock))
        v |= 0x800000;
    if (rextsize >= 1 && std::uint64_t(rextsize) * blockSize <= (1ull << 30))
        v |= 0x1000000;
    if (imaxPct <= 100)
        v |= 0x2000000;
    if (agblklog < 32 && inopblog < 32 && (rootino >> (agblklog + inopblog)) < agcount)
        v |= 0x4000000;
    if (agblocks && agblklog == Log2(agblocks) + ((agblocks & (agblocks - 1)) ? 1 : 0))
        v |= 0x8000000;
    if (inprogress == 0)
        v |= 0x10000000;
    if (v5 || (version & 0x2000))
        v |= 0x40000000;
    // The headers of every allocation group (at most 64 are examined).
    if (sizes && agcount >= 1) {
        bool allAgf = true, allAgi = true, allSb = true;
        std::vector<std::uint8_t> h;
        const std::uint32_t groups = std::min<std::uint32_t>(agcount, 64);
        for (std::uint32_t g = 0; g < groups; ++g) {
            const std::uint64_t base = std::uint64_t(g) * agblocks * blockSize;
            const bool agf = ReadBlock(base + sectSize, 512, h) && Equals(h.data(), h.size(), 0, "XAGF", 4) &&
                             B32(h.data(), h.size(), 8) == g;
            const bool agi = ReadBlock(base + 2ull * sectSize, 512, h) &&
                             Equals(h.data(), h.size(), 0, "XAGI", 4) && B32(h.data(), h.size(), 8) == g;
            const bool sb = ReadBlock(base, 512, h) && Detect::IsXfs(h.data(), h.size()) &&
                            B32(h.data(), h.size(), 4) == blockSize && B64(h.data(), h.size(), 8) == dblocks;
            if (g == 0) {
                if (agf)
                    v |= 4;
                if (agi)
                    v |= 8;
            }
            if (g == 1 && sb)
                v |= 0x20000000;
            allAgf = allAgf && agf;
            allAgi = allAgi && agi;
            allSb = allSb && sb;
        }
        if (allAgf)
            v |= 0x100000000ull;
        if (allAgi)
            v |= 0x200000000ull;
        if (allSb)
            v |= 0x400000000ull;
        if (agcount < 2)
            m_checkedItems &= ~0x20000000ull;
    }
    m_validItems = v;
    if (v & 2)
        BlockGeometry(blockSize, dblocks);
    if ((v & 2) && B64(b, n, 144) <= dblocks) {
        m_freeClusters = B64(b, n, 144);
        m_freeKnown = true;
    }
    m_label = VolumeText::Latin1(b, n, 108, 12);
    m_serial = VolumeText::SerialFromUuid(b, n, 32);
    MakeService<CEntryXFS>(QStringLiteral("$SuperBlock"), 0, 1);
    MakeRoot<CEntryXFS>(QStringLiteral("Root"), rootino);
}

std::uint32_t CVolumeXFS::GradeIntegrity()
{
    const std::uint64_t v = m_validItems;
    if ((v & 0x70CC3FFFFull) == 0x70CC3FFFFull)
        return 8;
    if ((v & 0xC0BD) == 0xC0BD)
        return 6;
    if ((v & 0x8C3FFF3) == 0x8C3FFF3)
        return 5;
    return 0;
}
