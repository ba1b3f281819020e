#include "StorageVolume.h"

#include "Kernel/Implementation/FS/Volume.h"
#include "StorageNavigation.h"
#include "StorageVolumeInfo.h"

namespace HexEditor {

StorageVolume::StorageVolume(CVolume *volume, QObject *parent)
    : Storage(volume ? volume->GetMedium() : nullptr, parent), m_volume(volume)
{
    if (!m_volume)
        return;
    setTitle(m_volume->GetDisplayName());
    if (m_volume->GetKind() == 10)
        m_mftRecordSize = VolumeInfoQuery::mftRecordSize(m_volume);
    if (m_volume->GetKind() >= 13 && m_volume->GetKind() <= 16)
        m_inodeSize = VolumeInfoQuery::inodeSize(m_volume, m_inodeSize);
}

bool StorageVolume::isHfsVolume() const
{
    return m_volume && m_volume->GetKind() == 13;
}

QString StorageVolume::name() const
{
    return m_volume ? m_volume->GetDisplayName() : Storage::name();
}

std::uint32_t StorageVolume::fileSystemKind() const
{
    return m_volume ? m_volume->GetKind() : 24;
}

std::uint32_t StorageVolume::clusterSize() const
{
    return m_volume ? m_volume->GetClusterSize() : 0;
}

std::uint64_t StorageVolume::mftRecordCount() const
{
    return VolumeInfoQuery::mftRecordCount(m_volume);
}

std::uint64_t StorageVolume::mftRecordOffset(std::uint64_t index) const
{
    return VolumeInfoQuery::mftRecordOffset(m_volume, index, 0, sectorCount());
}

std::uint64_t StorageVolume::catalogNodeCount() const
{
    return VolumeInfoQuery::catalogNodeCount(m_volume);
}

std::uint64_t StorageVolume::catalogNodeOffset(std::uint64_t index) const
{
    return VolumeInfoQuery::catalogNodeOffset(m_volume, index, 0);
}

QList<NavigationPoint> StorageVolume::buildNavigationPoints()
{
    if (!m_volume || !kernelObject())
        return {};
    return Navigation::volumePoints(*kernelObject(), fileSystemKind(), 0);
}

} // namespace HexEditor
