#include "Kernel/Implementation/Devices/VolumeCreate.h"

#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/Other/VolumeApFS.h"
#include "Kernel/Implementation/FS/Other/VolumeBtrFS.h"
#include "Kernel/Implementation/FS/Other/VolumeCDFS.h"
#include "Kernel/Implementation/FS/Other/VolumeJFS.h"
#include "Kernel/Implementation/FS/Other/VolumeReFS.h"
#include "Kernel/Implementation/FS/Other/VolumeUDF.h"
#include "Kernel/Implementation/FS/Other/VolumeUFS.h"
#include "Kernel/Implementation/FS/Other/VolumeXFS.h"
#include "Kernel/Implementation/FS/Other/VolumeZFS.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <atomic>

using namespace DiskBytes;

namespace VolumeCreate {

namespace {

// After detection found nothing: the UDF recognition sequence, then an ISO 9660 descriptor
// (an optical image on a device that is not an optical drive).
std::uint32_t ProbeOptical(cStorage &storage)
{
    if (Detect::ProbeUdf(storage))
        return static_cast<std::uint32_t>(FileSystemKind::Udf);
    std::vector<std::uint8_t> d(2048, 0);
    std::uint32_t error = 0;
    if (storage.GetSize() >= 32768 + 2048 && storage.ReadBytes(32768, 2048, d.data(), error) &&
        Detect::IsCdfs(d.data(), d.size()))
        return static_cast<std::uint32_t>(FileSystemKind::Cdfs);
    return Detect::KindUnknown;
}

} // namespace

std::uint32_t NextMountId()
{
    static std::atomic<std::uint32_t> next{1};
    return next.fetch_add(1) & 0x7FFFFFFFu;
}

std::unique_ptr<CVolume> CreateVolumeForKind(std::uint32_t kind, cStorage *medium, const VolumeDescription &d,
                                             cRoot *root)
{
    VolumeDescription description = d;
    description.kind = kind;
    switch (kind) {
    case 11:
        return std::make_unique<CVolumeUDF>(medium, description, root);
    case 12:
        return std::make_unique<CVolumeCDFS>(medium, description, root);
    case 17:
        return std::make_unique<CVolumeUFS>(medium, description, root);
    case 18:
        return std::make_unique<CVolumeReFS>(medium, description, root);
    case 19:
        return std::make_unique<CVolumeZFS>(medium, description, root);
    case 20:
        return std::make_unique<CVolumeBtrFS>(medium, description, root);
    case 21:
        return std::make_unique<CVolumeXFS>(medium, description, root);
    case 22:
        return std::make_unique<CVolumeJFS>(medium, description, root);
    case 23:
        return std::make_unique<CVolumeApFS>(medium, description, root);
    default:
        // FAT, exFAT, NTFS, HFS+ and ext until their own classes join, and everything else.
        return std::make_unique<CVolumeXXX>(medium, description, root);
    }
}

std::vector<BsdSlice> ParseBsdDiskLabel(const std::uint8_t *b, std::size_t size,
                                        std::uint64_t partitionSectors, std::uint64_t deviceStart)
{
    std::vector<BsdSlice> out;
    const std::uint32_t magic = 0x82564557u;
    if (!b || size < 148 || U32(b, size, 0) != magic || U32(b, size, 132) != magic)
        return out;
    const std::uint32_t count = U16(b, size, 138);
    if (count == 0 || count > 22 || 148 + std::size_t(count) * 16 > size)
        return out;
    std::uint16_t sum = 0;
    for (std::size_t i = 0; i < 148 + std::size_t(count) * 16; i += 2)
        sum ^= U16(b, size, i);
    if (sum != 0)
        return out;
    // Slice 'c' covers the whole partition; when it starts at the partition's device sector the
    // label gives absolute offsets.
    std::uint64_t bias = 0;
    if (count > 2 && deviceStart != 0 && U32(b, size, 148 + 2 * 16 + 4) == deviceStart)
        bias = deviceStart;
    for (std::uint32_t i = 0; i < count; ++i) {
        const std::size_t at = 148 + std::size_t(i) * 16;
        const std::uint64_t length = U32(b, size, at);
        std::uint64_t start = U32(b, size, at + 4);
        const std::uint8_t type = b[at + 12];
        if (length == 0 || type == 0 || i == 2)
            continue;
        if (start < bias)
            continue;
        start -= bias;
        if (start >= partitionSectors || length > partitionSectors - start)
            continue;
        out.push_back(BsdSlice{start, length, type, static_cast<int>(i)});
    }
    return out;
}

std::vector<BsdSlice> ReadBsdDiskLabel(cStorage &storage, std::uint64_t deviceStart)
{
    std::vector<std::uint8_t> sector(512, 0);
    std::uint32_t error = 0;
    if (storage.GetTotalSectors() < 2 || !storage.ReadBytes(512, 512, sector.data(), error))
        return {};
    const std::uint64_t sectors = storage.GetSize() / 512;
    return ParseBsdDiskLabel(sector.data(), sector.size(), sectors, deviceStart);
}

VolumeDescription DescribePartition(CPartition &partition)
{
    VolumeDescription d;
    const std::uint32_t bps = partition.GetBytesPerSector();
    d.sectorSize = bps;
    d.start = partition.GetStart() * bps;
    d.size = partition.GetSize();
    d.kind = partition.GetKind();
    d.handle = partition.GetVolumeHandle();
    if (const VolumeInfo *info = partition.GetVolumeInfo()) {
        d.name = info->path;
        d.secondName = info->mountPoint;
        d.driveId = info->letter >= 0 && info->letter < 26 ? static_cast<std::uint32_t>(info->letter)
                                                           : CVolume::NoLetter;
        d.ready = info->ready;
    } else {
        // Not known to the platform: ready when its first sector can be read.
        std::vector<std::uint8_t> probe(bps, 0);
        std::uint32_t error = 0;
        d.ready = partition.GetTotalSectors() > 0 && partition.ReadSectors(0, 1, probe.data(), error) ? 1 : 0;
    }
    d.mountId = NextMountId();
    return d;
}

std::unique_ptr<CVolume> CreateVolume(CPartition &partition, const Options &options)
{
    VolumeDescription d = options.description ? *options.description : DescribePartition(partition);
    if (options.description && d.mountId == 0)
        d.mountId = NextMountId();
    const std::uint32_t unknown = Detect::KindUnknown;
    if (!options.description && partition.GetLength() != 0 && options.realPartition &&
        Detect::Undetermined(d.kind)) {
        bool usedBackup = false;
        d.kind = Detect::DetectFileSystem(partition, 0, partition.GetSize(), false, usedBackup);
    }
    if (!options.description && Detect::Undetermined(d.kind) && partition.GetLength() >= 32)
        d.kind = ProbeOptical(partition);
    // A UFS partition, or one whose table entry already calls it a BSD container, is examined for
    // a disk label once (its slices are not).
    const bool bsdCandidate = d.kind == static_cast<std::uint32_t>(FileSystemKind::Ufs) ||
                              (d.kind == static_cast<std::uint32_t>(FileSystemKind::PartitionBsd) &&
                               partition.GetChildCount() == 0);
    if (bsdCandidate && !partition.GetParent()) {
        const std::vector<BsdSlice> slices = ReadBsdDiskLabel(partition, partition.GetStart());
        if (!slices.empty()) {
            partition.SetKind(static_cast<std::uint32_t>(FileSystemKind::PartitionBsd));
            // The slices read through the device at their device sectors; without a device (a
            // bare sector reader) through the container, relative to it.
            cDevice *device = partition.GetDevice();
            for (const BsdSlice &s : slices) {
                auto child = device ? std::make_unique<CPartition>(device, device, &partition, unknown,
                                                                   partition.GetStart() + s.start, s.length)
                                    : std::make_unique<CPartition>(nullptr, &partition, &partition, unknown,
                                                                   s.start, s.length);
                CPartition *made = partition.AddChild(std::move(child));
                if (made && options.announcePartition)
                    options.announcePartition(made);
            }
            return nullptr;
        }
    }
    std::unique_ptr<CVolume> volume = CreateVolumeForKind(d.kind, &partition, d, options.root);
    partition.SetKind(volume->GetKind());
    if (options.realPartition && options.announceVolume)
        options.announceVolume(volume.get());
    return volume;
}

std::unique_ptr<CVolume> CreateVolume(cStorage &storage, MediaType mediaType, const Options &options)
{
    VolumeDescription d = options.description ? *options.description : VolumeDescription();
    if (!options.description) {
        d.sectorSize = storage.GetBytesPerSector();
        d.size = storage.GetSize();
        d.start = 0;
        std::vector<std::uint8_t> probe(d.sectorSize, 0);
        std::uint32_t error = 0;
        d.ready = storage.GetTotalSectors() > 0 && storage.ReadSectors(0, 1, probe.data(), error) ? 1 : 0;
        bool usedBackup = false;
        d.kind = Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, usedBackup, mediaType);
        if (d.kind == Detect::KindUnknown && storage.GetTotalSectors() >= 32)
            d.kind = ProbeOptical(storage);
    }
    if (d.mountId == 0)
        d.mountId = NextMountId();
    std::unique_ptr<CVolume> volume = CreateVolumeForKind(d.kind, &storage, d, options.root);
    if (options.announceVolume)
        options.announceVolume(volume.get());
    return volume;
}

} // namespace VolumeCreate
