// Writes a Tarvo disk image of a sector source, block by block in constant memory: header,
// string block, zlib blocks with a group record after every full group, group table, trailer.
#pragma once

#include <QString>
#include <cstdint>
#include <functional>

class cRoot;

struct TarvoWriteOptions
{
    int level = 6;                       // zlib compression level 0..9
    std::uint32_t sectorsPerBlock = 128; // block size = sectorsPerBlock << sector shift
    QString description;                 // string 1
    QString model;                       // string 2: the source device's model
    QString identity;                    // string 3: a second identity text of the source
    QString serial;                      // string 4: the source device's serial
    std::uint64_t firstSector = 0;       // where on its source the image starts
    std::uint32_t mediaType = 0;         // 1 floppy, 2 fixed, 3 removable, 4 optical
    std::uint32_t sectorsPerTrack = 0;
    std::uint32_t tracksPerCylinder = 0;
    std::uint32_t created = 0; // seconds since 1970; 0 takes the current time
};

class CTarvoWriter
{
public:
    // Reads `count` sectors from `first` into `buffer`; false with a system error on failure.
    using SectorReader =
        std::function<bool(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)>;
    // Told the sectors written so far and the total; returning false cancels the creation.
    using Progress = std::function<bool(std::uint64_t done, std::uint64_t total)>;

    CTarvoWriter(cRoot *root, const TarvoWriteOptions &options);

    // Writes the image of `totalSectors` sectors of 1 << sectorShift bytes to `path` (replaced).
    // On failure the partial file is deleted and the reason is given by Problem().
    bool Write(const QString &path, std::uint8_t sectorShift, std::uint64_t totalSectors,
               const SectorReader &read, const Progress &progress = {});

    const QString &Problem() const { return m_problem; }
    // Bytes written to the image file by the last Write.
    std::uint64_t BytesWritten() const { return m_written; }

private:
    cRoot *m_root;
    TarvoWriteOptions m_options;
    QString m_problem;
    std::uint64_t m_written = 0;
};
