// Byte writes that reach the medium only as whole sectors: runs of whole sectors go to the kernel
// object as they are (at most `maxSectors` per request), a partial first or last sector is read,
// patched and written back whole. A partial sector that cannot be read is not written (its other
// bytes would be lost). Header-only (kernel and Qt Core): the headless tool's write command uses
// the same path as the editor's save and block transfers.
#pragma once

#include <QByteArray>

#include <algorithm>
#include <cstdint>
#include <cstring>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cStorage.h"

namespace HexEditor::SectorWrite {

struct Result
{
    std::uint64_t written = 0;          // bytes of the input that reached the medium
    std::uint64_t failedSector = ~0ull; // the sector that failed, else all ones
    std::uint32_t error = 0;
    bool readFailed = false; // the failure was reading a partial sector
    bool ok() const { return failedSector == ~0ull; }
};

inline Result writeBytes(cStorage &object, std::uint64_t offset, const char *data, std::uint64_t length,
                         std::uint32_t maxSectors = 1024)
{
    Result r;
    const std::uint64_t ss = object.GetBytesPerSector();
    const std::uint64_t total = object.GetTotalSectors();
    if (!ss || !maxSectors)
        return r;
    QByteArray buffer;
    while (r.written < length) {
        const std::uint64_t pos = offset + r.written;
        const std::uint64_t n = pos / ss;
        const std::uint64_t start = pos % ss;
        const std::uint64_t left = length - r.written;
        if (n >= total) {
            r.failedSector = n;
            r.error = SystemError::SectorNotFound;
            return r;
        }
        if (start || left < ss) {
            // One partial sector: read, patch, write whole.
            const std::uint64_t count = std::min(ss - start, left);
            buffer.resize(qsizetype(ss));
            std::uint32_t error = 0;
            if (!object.ReadSectors(n, 1, buffer.data(), error)) {
                r.failedSector = n;
                r.error = error ? error : SystemError::ReadFault;
                r.readFailed = true;
                return r;
            }
            std::memcpy(buffer.data() + start, data + r.written, std::size_t(count));
            if (!object.WriteSectors(n, 1, buffer.constData(), error)) {
                r.failedSector = n;
                r.error = error ? error : SystemError::WriteFault;
                return r;
            }
            r.written += count;
            continue;
        }
        const std::uint64_t whole = std::min<std::uint64_t>({left / ss, maxSectors, total - n});
        std::uint32_t error = 0;
        if (!object.WriteSectors(n, std::uint32_t(whole), data + r.written, error)) {
            r.failedSector = n;
            r.error = error ? error : SystemError::WriteFault;
            return r;
        }
        r.written += whole * ss;
    }
    return r;
}

} // namespace HexEditor::SectorWrite
