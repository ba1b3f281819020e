#include "hexeditor/StorageVolume.h"

#include "Kernel/Implementation/FS/Volume.h"
#include "hexeditor/StorageNavigation.h"

namespace HexEditor {

StorageVolume::StorageVolume(CVolume *volume, QObject *parent)
    : StorageVolumeBase(volume ? volume->GetMedium() : nullptr, volume, parent)
{
    if (volume)
        setTitle(volume->GetDisplayName());
}

bool StorageVolume::isHfsVolume() const
{
    return volume() && volume()->GetKind() == 13;
}

QString StorageVolume::name() const
{
    return volume() ? volume()->GetDisplayName() : Storage::name();
}

QList<NavigationPoint> StorageVolume::buildNavigationPoints()
{
    if (!volume() || !kernelObject())
        return {};
    return Navigation::volumePoints(*kernelObject(), fileSystemKind(), 0);
}

} // namespace HexEditor
