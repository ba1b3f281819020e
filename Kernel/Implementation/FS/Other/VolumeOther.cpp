#include "Kernel/Implementation/FS/Other/VolumeOther.h"

#include "Kernel/Implementation/FS/DetectBytes.h"

bool CVolumeOther::ReadBlock(std::uint64_t offset, std::size_t length, std::vector<std::uint8_t> &out)
{
    out.assign(length, 0);
    if (ReadRaw(offset, length, out.data()))
        return true;
    out.assign(length, 0);
    return false;
}

void CVolumeOther::UseSectorSize(std::uint32_t bytes)
{
    if (!DiskBytes::PowerOfTwo(bytes, 512, 65536))
        return;
    m_sectorShift = static_cast<std::uint8_t>(DiskBytes::Log2(bytes));
    m_sectorCount = m_size >> m_sectorShift;
    m_clusterShift = 0;
    m_cluster0Sector = 0;
    m_firstCluster = 0;
    m_lastCluster = m_sectorCount ? m_sectorCount - 1 : 0;
}

void CVolumeOther::BlockGeometry(std::uint64_t blockBytes, std::uint64_t blocks)
{
    const std::uint64_t sectorSize = 1ull << m_sectorShift;
    if (blockBytes < sectorSize || blocks == 0)
        return;
    const std::uint64_t perBlock = blockBytes / sectorSize;
    const std::uint64_t fit = m_sectorCount / perBlock;
    if (fit == 0)
        return;
    if (blocks > fit)
        blocks = fit;
    SetClusterGeometry(blockBytes, 0, 0, blocks - 1);
}
