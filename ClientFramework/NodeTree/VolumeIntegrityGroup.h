// The "Volume Integrity Info" group of the property pane for a volume node (and for the partition
// that holds the volume).
#pragma once

#include "ClientFramework/NodeTree/IProperty.h"

class CVolume;

namespace VolumeIntegrityGroup {

// "Overall Integrity Status" with the name of the volume's grade, then each assessed item of its
// file system with "Valid", "Invalid" or "Yes". No items while the volume is not ready.
PropertyGroup of(CVolume *volume);

} // namespace VolumeIntegrityGroup
