// The common interface of everything in the kernel that holds sectors: devices, partitions,
// volumes, entries and RAID assemblies. Sector numbers, byte offsets and sizes are unsigned
// 64-bit; a sector size is a 32-bit byte count. Every transfer returns a success flag and
// leaves a system error code (0 when none applies) in its out-parameter.
#pragma once

#include <QString>
#include <cstdint>

// The kind of object behind a storage pointer.
enum class StorageKind : std::uint32_t {
    Device = 0,
    Partition = 1,
    Volume = 2,
    Entry = 3,
    Raid = 4,
};

class cStorage
{
public:
    // "None" for sector and cluster numbers throughout the kernel.
    static constexpr std::uint64_t NoSector = 0xFFFFFFFFFFFFFFFFull;

    virtual ~cStorage() = default;

    virtual StorageKind GetStorageKind() const = 0;
    virtual QString GetDisplayName() const = 0;

    // Size in bytes, bytes per logical sector and the number of sectors.
    virtual std::uint64_t GetSize() const = 0;
    virtual std::uint32_t GetBytesPerSector() const = 0;
    virtual std::uint64_t GetTotalSectors() const = 0;

    // Whole-sector transfers. A request that runs past the end is carried out for the sectors
    // that exist and then reported as a failure (a read fills the rest of the buffer with zeros).
    virtual bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer,
                             std::uint32_t &error) = 0;
    virtual bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                              std::uint32_t &error) = 0;

    // Byte-granular transfers on top of the sector transfers.
    virtual bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer,
                           std::uint32_t &error) = 0;
    virtual bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                            std::uint32_t &error) = 0;

    // Waits until everything written through the storage has reached the medium; a write that the
    // system had taken into its cache and could not place fails here. A write is finished only
    // after its flush. Storages without a medium below them have nothing to flush.
    virtual bool Flush(std::uint32_t &error)
    {
        error = 0;
        return true;
    }

protected:
    cStorage() = default;
    cStorage(const cStorage &) = delete;
    cStorage &operator=(const cStorage &) = delete;
};
