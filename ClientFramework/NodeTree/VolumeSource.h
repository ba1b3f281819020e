// Where a node finds the volume of a partition, or of a device without a table. The kernel keeps
// the volume of a partition; until every partition carries it, a volume is made here with the
// kernel's volume creation and owned by the node that asked for it.
#pragma once

#include <memory>

class CDevice;
class CPartition;
class CVolume;

namespace VolumeSource {

// The volume of the partition: the kernel's (owned stays null) or one made now (owned set).
// Null for unallocated space, extended partitions and containers.
CVolume *volumeOf(CPartition *partition, std::unique_ptr<CVolume> &owned);
// The volume of a device without a partition table, or null.
CVolume *volumeOf(CDevice *device, std::unique_ptr<CVolume> &owned);

} // namespace VolumeSource
