#include "hexeditor/StoragePartition.h"

#include <functional>

#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "hexeditor/StorageNavigation.h"
#include "hexeditor/StorageVolumeInfo.h"

namespace HexEditor {

StoragePartition::StoragePartition(cPartition *partition, CVolume *volume, QObject *parent)
    : Storage(partition, parent), m_partition(partition), m_volume(volume)
{
}

std::uint32_t StoragePartition::fileSystemKind() const
{
    if (m_volume)
        return m_volume->GetKind();
    return m_partition ? m_partition->GetKind() : 24;
}

std::uint64_t StoragePartition::mftRecordCount() const
{
    return VolumeInfoQuery::mftRecordCount(m_volume);
}

std::uint64_t StoragePartition::mftRecordOffset(std::uint64_t index) const
{
    return VolumeInfoQuery::mftRecordOffset(m_volume, index, 0, sectorCount());
}

QList<NavigationPoint> StoragePartition::buildNavigationPoints()
{
    if (!m_partition)
        return {};
    QList<NavigationPoint> points;
    for (std::uint32_t i = 0; i < m_partition->GetChildCount(); ++i) {
        cPartition *child = m_partition->GetChild(i);
        if (!child)
            continue;
        // Logical partitions lie at their device positions; here they are shown from our start.
        QList<NavigationPoint> inner = Navigation::partitionPoints(*child, m_partition->GetBytesPerSector());
        const std::uint64_t shift = m_partition->GetStart() * m_partition->GetBytesPerSector();
        std::function<void(QList<NavigationPoint> &)> rebase = [&](QList<NavigationPoint> &list) {
            for (NavigationPoint &p : list) {
                p.offset = p.offset >= shift ? p.offset - shift : 0;
                rebase(p.children);
            }
        };
        rebase(inner);
        points.append(NavigationPoint::submenu(
            QStringLiteral("%1 [%2]").arg(child->GetDisplayName(), FileSystemKindName(child->GetKind())),
            inner));
    }
    points.append(Navigation::volumePoints(*m_partition, fileSystemKind(), 0));
    return points;
}

} // namespace HexEditor
