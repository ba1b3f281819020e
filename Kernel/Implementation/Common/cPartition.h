// The interface of one partition of a device. The layers below the device (file-system detection,
// the volumes) know a partition only through it, never through the partition class.
#pragma once

#include <cstdint>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cStorage.h"

class cDevice;
class CPlatformFile;

// What the rest of the kernel sees of a partition.
class cPartition : public cStorage
{
public:
    StorageKind GetStorageKind() const override { return StorageKind::Partition; }

    // The device that holds the partition (null for a partition built over a bare sector reader).
    virtual cDevice *GetDevice() const = 0;
    // The extended partition of a logical partition, else null.
    virtual cPartition *GetParent() const = 0;
    // FileSystemKind code: 0 unallocated, 1 extended, 2 metadata area, 3 data area, 4 and above
    // a partition type or a file system.
    virtual std::uint32_t GetKind() const = 0;
    // Bit 7 of the boot indicator (0x80) or 0.
    virtual std::uint8_t GetActive() const = 0;
    // The sector of the table that holds the entry (0 for the boot record and GPT entries).
    virtual std::uint64_t GetTableSector() const = 0;
    // First sector on the device and length in sectors.
    virtual std::uint64_t GetStart() const = 0;
    virtual std::uint64_t GetLength() const = 0;
    // Logical partitions of an extended partition.
    virtual std::uint32_t GetChildCount() const = 0;
    virtual cPartition *GetChild(std::uint32_t index) const = 0;
    // The platform volume that covers exactly this partition, or null.
    virtual const VolumeInfo *GetVolumeInfo() const = 0;
    // The partition's own open volume handle (a locked volume written through its own handle),
    // or null. The device's write split sends writes inside the partition through it.
    virtual CPlatformFile *GetVolumeHandle() const = 0;
};
