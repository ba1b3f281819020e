#include "Kernel/Implementation/Devices/PartScanDevice.h"

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Devices/Device.h"

namespace PartScan {

Result ScanDevice(CDevice &device, const DeviceInfo &descriptor, cRoot *root)
{
    Input in;
    in.storage = &device;
    in.device = &device;
    in.deviceName = device.GetDisplayName();
    in.partStyle = descriptor.partStyle;
    in.source = descriptor.source;
    in.ready = descriptor.ready != 0;
    in.ownSectors = descriptor.source != EnumSource::VolumeBacked || descriptor.handle != nullptr ||
                    device.GetImageHandle() != nullptr;
    in.volumes = descriptor.volumes;
    // The partitions made here are not announced one by one: the device is not listed yet, and
    // once it is, the root announces it (storage event 1) and then the volumes on its partitions.
    if (root)
        in.message = [root](const QString &text) { root->EmitInternal(text); };
    return Scan(in);
}

} // namespace PartScan
