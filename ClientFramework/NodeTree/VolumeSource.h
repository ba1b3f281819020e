// Where a node finds the volume of a partition, or of a device without a table: the kernel makes
// them with the device and owns them (CPartition::Volume, CDevice::Volume). The nodes only
// borrow them.
#pragma once

class CDevice;
class CPartition;
class CVolume;

namespace VolumeSource {

// The partition's volume; null for unallocated space, extended partitions and containers.
CVolume *volumeOf(const CPartition *partition);
// The volume over a whole device without a table, when a file system was recognised on it.
CVolume *volumeOf(const CDevice *device);

} // namespace VolumeSource
