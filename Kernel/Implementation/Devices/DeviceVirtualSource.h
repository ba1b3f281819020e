// A read-only source of a virtual device that is not assembled from partitions (volume
// managers such as LVM or ZFS): it serves reads in 512-byte units.
#pragma once

#include <cstdint>

class cVirtualSource
{
public:
    static constexpr std::uint32_t UnitSize = 512;

    virtual ~cVirtualSource() = default;
    // Reads `units` 512-byte units from unit `first`; returns the number of bytes delivered.
    virtual std::uint64_t ReadUnits(std::uint64_t first, std::uint64_t units, void *buffer) = 0;
};
