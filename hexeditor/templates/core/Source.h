// What a template reads through: the bytes and the geometry of the storage open in the hex editor
// (or of a kernel object for the headless tool).
#pragma once

#include <QByteArray>

#include <cstdint>

namespace HexEditor::Templates {

class Source
{
public:
    virtual ~Source() = default;

    // Size in bytes and bytes per sector (0 when there is nothing behind the source).
    virtual std::uint64_t size() const = 0;
    virtual std::uint32_t sectorSize() const = 0;
    // The bytes from `offset`; fewer (or none) when the range is not readable.
    virtual QByteArray read(std::uint64_t offset, std::uint32_t length) = 0;

    // Geometry some kinds size their records by.
    virtual std::uint32_t mftRecordSize() const { return 1024; }
    virtual std::uint32_t inodeSize() const { return 128; }
};

} // namespace HexEditor::Templates
