// The sector geometry of the storage a node stands for. A file answers with the geometry of the
// volume that holds it.
#pragma once

#include <cstdint>

class IStorageGeometry
{
public:
    virtual ~IStorageGeometry() = default;

    virtual std::uint32_t sectorSize() const = 0;
    // First sector on the device (0 for a device).
    virtual std::uint64_t firstSector() const = 0;
    virtual std::uint64_t sectorCount() const = 0;
};
