#include "ClientFramework/NodeTree/VolumeSource.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

namespace VolumeSource {

CVolume *volumeOf(const CPartition *partition)
{
    return partition ? partition->Volume() : nullptr;
}

CVolume *volumeOf(const CDevice *device)
{
    if (!device || device->GetPartitionCount() > 0)
        return nullptr;
    CVolume *volume = device->Volume();
    // Bytes without a recognised file system are shown as the device alone.
    if (volume && Detect::Undetermined(volume->GetKind()))
        return nullptr;
    return volume;
}

} // namespace VolumeSource
