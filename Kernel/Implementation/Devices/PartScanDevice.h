// The device's side of the scan: its sectors, its descriptor, and the root's signals.
#pragma once

#include "Kernel/Implementation/Partitions/PartScan.h"

class cRoot;
class CDevice;

namespace PartScan {

// The device's scan at construction: reads through the device, reports through `root`'s internal
// messages and announces each partition made with storage event 1. The device stores the result's
// partitions and partition style.
Result ScanDevice(CDevice &device, const DeviceInfo &descriptor, cRoot *root);

} // namespace PartScan
