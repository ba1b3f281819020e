// Navigation points of partitions and devices, shared by the storage classes.
#pragma once

#include <QList>

#include <cstdint>

#include "hexeditor/NavigationPoint.h"

class cStorage;
class cPartition;
class cDevice;

namespace HexEditor::Navigation {

// The points of a partition-like object (a partition or a volume's medium) of file-system kind
// `kind`, placed `base` bytes into the storage they are shown on.
QList<NavigationPoint> volumePoints(cStorage &object, std::uint32_t kind, std::uint64_t base);

// The points of a partition on its device (offsets on the device): its own, then one submenu per
// logical partition of an extended partition.
QList<NavigationPoint> partitionPoints(cPartition &partition, std::uint64_t deviceSectorSize);

// The points of a whole device.
QList<NavigationPoint> devicePoints(cDevice &device);

} // namespace HexEditor::Navigation
