// Shared pieces of the disk-image tests: a bare kernel root that records platform messages, a
// generated disk with random, structured and empty areas, and reading a whole image back.
#pragma once

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Images/ImageHandle.h"

#include <QByteArray>
#include <QList>
#include <QString>

#include <cstring>
#include <random>

namespace ImageTest {

class RecordingRoot : public cRoot
{
public:
    RecordingRoot()
    {
        QObject::connect(this, &cRoot::kernelPlatform,
                         [this](const _event_platform &e) { platform.append(e); });
    }
    uint8_t RetryCount(uint8_t) override { return 2; }
    QList<_event_platform> platform;
};

// A disk of `sectors` 512-byte sectors: random data, sectors stamped with their number, and
// runs of zeros long enough to leave whole 2 MiB blocks unallocated in sparse formats.
inline QByteArray makeDisk(std::uint64_t sectors, std::uint32_t seed = 1)
{
    QByteArray disk(qsizetype(sectors * 512), '\0');
    std::mt19937_64 rng(seed);
    for (std::uint64_t s = 0; s < sectors; ++s) {
        char *p = disk.data() + s * 512;
        const std::uint64_t zone = (s / 4096) % 3;
        if (zone == 1)
            continue; // 2 MiB of zeros
        if (s % 4096 >= 3000) {
            std::snprintf(p, 512, "sector %llu of the test disk", static_cast<unsigned long long>(s));
            continue;
        }
        for (int i = 0; i < 512; i += 8) {
            std::uint64_t v = rng();
            std::memcpy(p + i, &v, 8);
        }
    }
    return disk;
}

// Reads every sector of the handle in requests of `chunk` sectors.
inline QByteArray readAll(CImageHandle &handle, std::uint32_t chunk = 777)
{
    QByteArray all(qsizetype(handle.GetTotalSectors() * handle.GetBytesPerSector()), '\0');
    for (std::uint64_t s = 0; s < handle.GetTotalSectors();) {
        std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(chunk, handle.GetTotalSectors() - s));
        std::uint32_t error = 0;
        if (!handle.ReadWrite(true, s, n, all.data() + s * handle.GetBytesPerSector(), error))
            return {};
        s += n;
    }
    return all;
}

} // namespace ImageTest
