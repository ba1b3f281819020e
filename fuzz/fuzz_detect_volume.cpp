// Detection and volume creation over arbitrary partition contents: the probe sequence, the
// classifier, the ZFS label and UDF checks, the BSD disk label, every volume class, the integrity
// listing and the packed run lists.
#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/Devices/VolumeCreate.h"
#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/EntryHandle.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QByteArray>

#include <cstring>

namespace {

// The input as a partition's bytes; reads beyond the input fail.
class InputStorage : public cStorage
{
public:
    InputStorage(const std::uint8_t *data, std::size_t size, std::uint32_t sectorSize)
        : m_data(data), m_size(size), m_sectorSize(sectorSize)
    {
    }
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("input"); }
    std::uint64_t GetSize() const override { return GetTotalSectors() * m_sectorSize; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return m_size / m_sectorSize; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        return ReadBytes(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &) override
    {
        __builtin_trap();
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        const std::uint64_t size = GetSize();
        if (offset > size || length > size - offset)
            return false;
        std::memcpy(buffer, m_data + offset, length);
        return true;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &) override
    {
        __builtin_trap();
    }

private:
    const std::uint8_t *m_data;
    std::size_t m_size;
    std::uint32_t m_sectorSize;
};

void Exercise(CVolume &v)
{
    std::uint64_t valid = 0, checked = 0, first = 0, last = 0, cluster0 = 0;
    const std::uint32_t grade = v.GetIntegrity(valid, checked);
    VolumeIntegrity::Items(v.GetKind(), valid, checked);
    VolumeIntegrity::GradeName(grade);
    v.GetDisplayName();
    v.GetClusterRange(first, last, cluster0);
    v.ClusterToSector(last);
    v.SectorToCluster(v.GetTotalSectors() ? v.GetTotalSectors() - 1 : 0);
    for (int i = 0; i < v.GetServiceEntryCount(); ++i) {
        CEntry *e = v.GetServiceEntry(i);
        char b[64];
        std::uint32_t error = 0;
        e->ReadBytes(0, sizeof b, b, error);
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    if (size < 2)
        return 0;
    // The first byte chooses the sector size and whether the media is optical.
    const std::uint32_t sectorSize = 512u << (data[0] & 3);
    const MediaType media = (data[0] & 4) ? MediaType::CdRom : MediaType::Fixed;
    const std::uint8_t *body = data + 1;
    const std::size_t bodySize = size - 1;

    Detect::ClassifyBootBlock(body, bodySize);
    Detect::IsZfsLabel(body, bodySize);
    VolumeCreate::ParseBsdDiskLabel(body, bodySize, bodySize / 512, data[0]);

    InputStorage storage(body, bodySize, sectorSize);
    bool backup = false;
    Detect::DetectFileSystem(storage, 0, storage.GetSize(), (data[0] & 8) != 0, backup, media);
    if (std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(storage, media))
        Exercise(*v);
    // Every class over the same bytes.
    VolumeDescription d;
    d.size = storage.GetSize();
    d.sectorSize = sectorSize;
    d.ready = 1;
    for (std::uint32_t kind : {7u, 8u, 9u, 10u, 11u, 12u, 13u, 14u, 17u, 18u, 19u, 20u, 21u, 22u, 23u}) {
        std::unique_ptr<CVolume> v = VolumeCreate::CreateVolumeForKind(kind, &storage, d);
        Exercise(*v);
    }
    CPartition partition(nullptr, &storage, nullptr, 24, 0, storage.GetTotalSectors());
    if (std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(partition))
        Exercise(*v);

    CEntryHandle handle(&storage, data[0] & 15);
    if (handle.SetRuns(QByteArray(reinterpret_cast<const char *>(body),
                                  static_cast<qsizetype>(std::min<std::size_t>(bodySize, 256))))) {
        handle.MapOffset(handle.GetTotalBytes() / 2);
        char b[32];
        std::uint32_t error = 0;
        handle.SetCacheShift(static_cast<std::uint8_t>(std::min(data[0] >> 3, 20)));
        if (handle.GetTotalBytes() > 32)
            handle.Read(handle.GetTotalBytes() - 32, 32, b, error);
    }
    return 0;
}
