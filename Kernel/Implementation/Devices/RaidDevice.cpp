#include "Kernel/Implementation/Devices/RaidDevice.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Raid/RaidHandle.h"

namespace RaidDevice {

CDevice *Make(cRoot *root, std::unique_ptr<CRaidHandle> handle, std::uint16_t number, const QString &model)
{
    if (!handle || !handle->IsValid())
        return nullptr;
    const std::uint32_t ss = handle->GetBytesPerSector();
    if (ss < 512 || ss > 4096 || (ss & (ss - 1)) != 0)
        return nullptr;
    DeviceInfo info;
    info.number = number;
    info.source = EnumSource::PhysicalDrive;
    info.mediaType = MediaType::RaidAssembly;
    info.ready = 1;
    quint8 shift = 9;
    while ((1u << shift) < ss)
        ++shift;
    info.sectorShift = shift;
    info.physicalSectorShift = shift;
    info.totalSectors = handle->GetTotalSectors();
    info.model = model.isEmpty() ? handle->GetDisplayName() : model;
    auto *device = new CDevice(root, info, nullptr, handle.release());
    device->SetAttributes(device->GetAttributes() | DeviceAttribute::Raid | DeviceAttribute::Virtual);
    return device;
}

} // namespace RaidDevice
