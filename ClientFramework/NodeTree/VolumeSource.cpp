#include "VolumeSource.h"

#include "Kernel/Implementation/Device.h"
#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/VolumeCreate.h"
#include "Kernel/Implementation/Partition.h"
#include "Kernel/Implementation/Root.h"

namespace VolumeSource {

namespace {

bool hasNoVolume(std::uint32_t kind)
{
    // Unallocated space, extended partitions, metadata areas, reserved and container partitions.
    switch (static_cast<FileSystemKind>(kind)) {
    case FileSystemKind::Unallocated:
    case FileSystemKind::Extended:
    case FileSystemKind::MetadataArea:
    case FileSystemKind::MicrosoftReserved:
    case FileSystemKind::PartitionBsd:
        return true;
    default:
        return false;
    }
}

} // namespace

CVolume *volumeOf(CPartition *partition, std::unique_ptr<CVolume> &owned)
{
    owned.reset();
    if (!partition || hasNoVolume(partition->GetKind()) || partition->GetChildCount() > 0)
        return nullptr;
    cDevice *device = partition->GetDevice();
    if (device && !device->IsReady())
        return nullptr;
    VolumeCreate::Options options;
    if (auto *d = dynamic_cast<CDevice *>(device))
        options.root = d->GetRoot();
    owned = VolumeCreate::CreateVolume(*partition, options);
    return owned.get();
}

CVolume *volumeOf(CDevice *device, std::unique_ptr<CVolume> &owned)
{
    owned.reset();
    if (!device || !device->IsReady() || device->GetPartitionCount() > 0 || device->GetTotalSectors() == 0)
        return nullptr;
    VolumeCreate::Options options;
    options.root = device->GetRoot();
    owned = VolumeCreate::CreateVolume(*device, device->GetMediaType(), options);
    // A device without a table is a volume only when a file system was recognised on it.
    if (owned && Detect::Undetermined(owned->GetKind()))
        owned.reset();
    return owned.get();
}

} // namespace VolumeSource
