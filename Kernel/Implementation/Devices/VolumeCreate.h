// Volume creation: every partition (and every device without a table) gets one volume, of the
// class its detected file system calls for. A UFS partition that carries a BSD disk label
// becomes a container ("Partition BSD") with one child partition per slice instead.
#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "Kernel/Implementation/FS/Volume.h"

class CPartition;
class cRoot;

namespace VolumeCreate {

struct Options
{
    cRoot *root = nullptr; // receives the volume's internal messages
    // Called with each volume made on a real partition, and with each slice partition made
    // from a BSD disk label (the kernel root's storage notification).
    std::function<void(CVolume *)> announceVolume;
    std::function<void(CPartition *)> announcePartition;
    // A ready description: detection is skipped and its kind is used.
    const VolumeDescription *description = nullptr;
    // False for the "none" index (a device without a table seen as one partition): then no
    // detection runs on the partition's own range through this path and nothing is announced.
    bool realPartition = true;
};

// One slice of a BSD disk label: first sector and length relative to the labelled partition,
// and the label's file-system type byte.
struct BsdSlice
{
    std::uint64_t start = 0;
    std::uint64_t length = 0;
    std::uint8_t fsType = 0;
    int index = 0; // 0 = 'a'
};

// The slices of the BSD disk label in sector 1 of `storage` (magic, checksum and bounds
// checked); `deviceStart` is the labelled partition's first device sector (labels that give
// absolute offsets are recognised by their whole-partition slice 'c'). Empty without a label.
std::vector<BsdSlice> ReadBsdDiskLabel(cStorage &storage, std::uint64_t deviceStart);
std::vector<BsdSlice> ParseBsdDiskLabel(const std::uint8_t *sector, std::size_t size,
                                        std::uint64_t partitionSectors, std::uint64_t deviceStart);

// The volume class for `kind` (CVolumeXXX when the kind has none).
std::unique_ptr<CVolume> CreateVolumeForKind(std::uint32_t kind, cStorage *medium,
                                             const VolumeDescription &description, cRoot *root = nullptr);

// The next volume number of the kernel (the mount id of volumes without a drive letter).
std::uint32_t NextMountId();

// The description of `partition`: its range, sector size and kind, and the platform volume
// that covers it.
VolumeDescription DescribePartition(CPartition &partition);

// Detects the partition's file system when its kind is 24 (and then the UDF probe), reads a BSD
// disk label of a top-level UFS partition (making its slices children of the partition, kind 5,
// and no volume), sets the partition's kind to the volume's and announces the volume. Returns
// the volume for the partition to own, or null for a BSD container.
std::unique_ptr<CVolume> CreateVolume(CPartition &partition, const Options &options = Options());

// The same for a whole storage (a device or an image without a table): detection over its range,
// then the volume.
std::unique_ptr<CVolume> CreateVolume(cStorage &storage, MediaType mediaType,
                                      const Options &options = Options());

} // namespace VolumeCreate
