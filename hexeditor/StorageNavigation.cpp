#include "hexeditor/StorageNavigation.h"

#include <QLocale>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "hexeditor/StorageLayout.h"

namespace HexEditor::Navigation {

namespace {

QString sectorText(std::uint64_t offset, std::uint32_t sectorSize)
{
    return QLocale().toString(qulonglong(sectorSize ? offset / sectorSize : 0));
}

} // namespace

QList<NavigationPoint> volumePoints(cStorage &object, std::uint32_t kind, std::uint64_t base)
{
    const std::uint32_t ss = object.GetBytesPerSector();
    const std::uint64_t size = object.GetSize();
    auto reader = [&object](std::uint64_t offset, std::uint32_t length) -> QByteArray {
        if (offset >= object.GetSize())
            return QByteArray();
        const std::uint64_t n = std::min<std::uint64_t>(length, object.GetSize() - offset);
        QByteArray bytes(qsizetype(n), '\0');
        std::uint32_t error = 0;
        if (!object.ReadBytes(offset, n, bytes.data(), error))
            return QByteArray();
        return bytes;
    };
    QList<NavigationPoint> points;
    for (const Layout::Point &p : Layout::volumePoints(kind, size, ss, reader)) {
        NavigationPoint n;
        n.offset = base + p.offset;
        n.title = p.title.contains(QLatin1String("%1")) ? p.title.arg(sectorText(n.offset, ss)) : p.title;
        n.templateType = p.type;
        n.primary = p.primary ? 1 : 0;
        n.kind = p.kind;
        points.append(n);
    }
    return points;
}

QList<NavigationPoint> partitionPoints(cPartition &partition, std::uint64_t deviceSectorSize)
{
    const std::uint64_t base = partition.GetStart() * deviceSectorSize;
    QList<NavigationPoint> points;
    if (partition.GetKind() == std::uint32_t(FileSystemKind::Extended) || partition.GetChildCount()) {
        for (std::uint32_t i = 0; i < partition.GetChildCount(); ++i) {
            cPartition *child = partition.GetChild(i);
            if (!child)
                continue;
            points.append(NavigationPoint::submenu(
                QStringLiteral("%1 [%2]").arg(child->GetDisplayName(), FileSystemKindName(child->GetKind())),
                partitionPoints(*child, deviceSectorSize)));
        }
    }
    if (partition.GetKind() != std::uint32_t(FileSystemKind::Extended))
        points.append(volumePoints(partition, partition.GetKind(), base));
    return points;
}

QList<NavigationPoint> devicePoints(cDevice &device)
{
    const std::uint32_t ss = device.GetBytesPerSector();
    QList<NavigationPoint> points;
    points.append(
        NavigationPoint::jump(QStringLiteral("Partition Table (0)"), 0, Templates::MasterBootRecord));
    if (device.GetPartStyle() == PartStyle::Gpt && device.GetSize() >= 2ull * ss)
        points.append(NavigationPoint::jump(QStringLiteral("Partition Table (%1)").arg(sectorText(ss, ss)),
                                            ss, Templates::GuidPartitionTable));
    for (std::uint32_t i = 0; i < device.GetPartitionCount(); ++i) {
        cPartition *p = device.GetPartition(i);
        if (!p || p->GetKind() == 0) // unallocated space holds no structures
            continue;
        points.append(NavigationPoint::submenu(
            QStringLiteral("%1 [%2]").arg(p->GetDisplayName(), FileSystemKindName(p->GetKind())),
            partitionPoints(*p, ss)));
    }
    return points;
}

} // namespace HexEditor::Navigation
