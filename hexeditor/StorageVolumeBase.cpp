#include "hexeditor/StorageVolumeBase.h"

#include "Kernel/Implementation/FS/Volume.h"
#include "hexeditor/StorageVolumeInfo.h"

namespace HexEditor {

StorageVolumeBase::StorageVolumeBase(cStorage *active, CVolume *volume, QObject *parent)
    : Storage(active, parent), m_volume(volume)
{
    if (!m_volume)
        return;
    const std::uint32_t kind = m_volume->GetKind();
    if (kind == 10)
        m_mftRecordSize = VolumeInfoQuery::mftRecordSize(m_volume);
    if (kind >= 13 && kind <= 16)
        m_inodeSize = VolumeInfoQuery::inodeSize(m_volume, m_inodeSize);
}

std::uint32_t StorageVolumeBase::fileSystemKind() const
{
    return m_volume ? m_volume->GetKind() : 24;
}

std::uint32_t StorageVolumeBase::clusterSize() const
{
    return m_volume ? m_volume->GetClusterSize() : 0;
}

std::uint64_t StorageVolumeBase::mftRecordCount() const
{
    return VolumeInfoQuery::mftRecordCount(m_volume);
}

std::uint64_t StorageVolumeBase::mftRecordOffset(std::uint64_t index) const
{
    std::uint64_t base = 0;
    if (!volumeBase(base))
        return 0;
    return VolumeInfoQuery::mftRecordOffset(m_volume, index, base, sectorCount());
}

std::uint64_t StorageVolumeBase::catalogNodeCount() const
{
    return VolumeInfoQuery::catalogNodeCount(m_volume);
}

std::uint64_t StorageVolumeBase::catalogNodeOffset(std::uint64_t index) const
{
    std::uint64_t base = 0;
    if (!volumeBase(base))
        return 0;
    return VolumeInfoQuery::catalogNodeOffset(m_volume, index, base);
}

} // namespace HexEditor
