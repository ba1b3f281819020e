// The scan a device runs once at construction: boot record and extended chain, GUID partition
// table, logical-disk-manager database, and on devices without a boot-record signature the other
// volume managers (LVM2, ZFS). It produces the device's partitions in ascending order of start with
// the unallocated gaps between them, and the device's partition style. Every inconsistency found is
// reported as an internal message and the scan goes on with what is usable.
#pragma once

#include <QList>
#include <QString>

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Partitions/Partition.h"

class cDevice;

namespace PartScan {

// What the scan works on. Only `storage` is required; the rest describes the device.
struct Input
{
    cStorage *storage = nullptr;          // the device's sectors (sector size, total sectors, reads)
    cDevice *device = nullptr;            // owner recorded in the partitions made (may be null)
    QString deviceName;                   // named in the messages
    PartStyle partStyle = PartStyle::Raw; // the descriptor's partition style
    EnumSource source = EnumSource::PhysicalDrive;
    bool ready = true;
    // The device reads its own sectors (a platform, image or RAID handle). A volume-backed device
    // without one is only the volume it carries.
    bool ownSectors = true;
    QList<VolumeInfo> volumes; // the descriptor's platform volumes, matched to partitions
    // Internal messages, in the order raised.
    std::function<void(const QString &)> message;
    // Called once for each partition made (storage event 1 on a device).
    std::function<void(CPartition *)> partitionMade;
    // The file-system detector asked about sector 0 (returns a FileSystemKind code); may be empty.
    std::function<std::uint32_t(const std::uint8_t *sector, std::uint32_t size)> detectFileSystem;
};

struct Result
{
    PartStyle partStyle = PartStyle::Raw;
    std::uint32_t diskSignature = 0; // of the boot record (partition style 2 and 3)
    // Top-level partitions in ascending order of start, unallocated gaps included (kind 0);
    // logical partitions are children of their extended partition.
    std::vector<std::unique_ptr<CPartition>> partitions;
    // Where the logical-disk-manager private header was looked for (NoSector: nowhere).
    std::uint64_t ldmSector = cStorage::NoSector;
};

// Runs the whole scan over `input`.
Result Scan(const Input &input);

} // namespace PartScan
