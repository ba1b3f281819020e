// A RAID assembly as a device of the kernel: media type 7 ("RAID Assembly"), its sectors served by
// the assembly's handle and its partition tables scanned like those of any disk.
#pragma once

#include <QString>

#include <cstdint>
#include <memory>

class CDevice;
class CRaidHandle;
class cRoot;

namespace RaidDevice {

// The device over `handle` (the device takes ownership), numbered `number` and named `model`
// (the handle's display name when empty). Null, with the handle destroyed, when the assembly is not
// valid or its sector size is not one a device can have.
CDevice *Make(cRoot *root, std::unique_ptr<CRaidHandle> handle, std::uint16_t number,
              const QString &model = {});

} // namespace RaidDevice
