// Enumeration of the entries below a volume or folder, for lazy population.
#pragma once

#include <cstdint>

class CEntry;

class IFileContainer
{
public:
    virtual ~IFileContainer() = default;

    virtual std::uint32_t entryCount() const = 0;
    virtual CEntry *entryAt(std::uint32_t index) const = 0;
};
