#include "Kernel/Implementation/Devices/DeviceByteAccess.h"

#include <QMutexLocker>
#include <algorithm>
#include <cstring>

#include "Kernel/Implementation/Common/cStorage.h"

namespace {

constexpr std::uint64_t None = 0xFFFFFFFFFFFFFFFFull;
// Whole sectors are passed on in pieces whose count fits the sector transfer's 32-bit count.
constexpr std::uint64_t MaxSectorsPerCall = 0x80000000ull;

// Clips [offset, offset + length) to the storage's size; false when nothing is left.
bool clip(std::uint64_t size, std::uint64_t offset, std::uint64_t &length)
{
    if (offset >= size) {
        length = 0;
        return false;
    }
    length = std::min(length, size - offset);
    return true;
}

} // namespace

std::uint64_t CByteAccess::HeldSector() const
{
    QMutexLocker lock(&m_mutex);
    return m_held;
}

void CByteAccess::Invalidate(std::uint64_t first, std::uint64_t count)
{
    QMutexLocker lock(&m_mutex);
    if (m_held != None && m_held >= first && m_held - first < count)
        m_held = None;
}

bool CByteAccess::LoadSector(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize,
                             std::uint32_t &error)
{
    if (m_buffer.size() != sectorSize) {
        m_buffer.assign(sectorSize, 0);
        m_held = None;
    }
    if (m_held == sector)
        return true;
    m_held = None;
    if (!storage.ReadSectors(sector, 1, m_buffer.data(), error))
        return false;
    m_held = sector;
    return true;
}

bool CByteAccess::ReadPart(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize,
                           std::uint32_t from, std::uint32_t size, std::uint8_t *out, std::uint32_t &error)
{
    QMutexLocker lock(&m_mutex);
    if (!LoadSector(storage, sector, sectorSize, error))
        return false;
    std::memcpy(out, m_buffer.data() + from, size);
    return true;
}

bool CByteAccess::WritePart(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize,
                            std::uint32_t from, std::uint32_t size, const std::uint8_t *in,
                            std::uint32_t &error)
{
    QMutexLocker lock(&m_mutex);
    // Always fresh from the medium: the held copy may predate a write made elsewhere.
    m_held = None;
    if (!LoadSector(storage, sector, sectorSize, error))
        return false;
    std::memcpy(m_buffer.data() + from, in, size);
    if (!storage.WriteSectors(sector, 1, m_buffer.data(), error)) {
        m_held = None;
        return false;
    }
    m_held = sector; // the buffer now equals the sector on the medium
    return true;
}

bool CByteAccess::WholeSectors(cStorage &storage, bool read, std::uint64_t first, std::uint64_t count,
                               std::uint32_t sectorSize, std::uint8_t *data, std::uint32_t &error)
{
    while (count) {
        const std::uint32_t n = std::uint32_t(std::min(count, MaxSectorsPerCall));
        const bool ok =
            read ? storage.ReadSectors(first, n, data, error) : storage.WriteSectors(first, n, data, error);
        if (!ok)
            return false;
        first += n;
        count -= n;
        data += std::uint64_t(n) * sectorSize;
    }
    return true;
}

bool CByteAccess::Read(cStorage &storage, std::uint64_t offset, std::uint64_t length, void *buffer,
                       std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint32_t ss = storage.GetBytesPerSector();
    if (ss == 0)
        return false;
    auto *out = static_cast<std::uint8_t *>(buffer);
    std::uint64_t todo = length;
    const bool inside = clip(storage.GetSize(), offset, todo);
    if (todo < length)
        std::memset(out + todo, 0, length - todo);
    if (!inside)
        return false;

    std::uint64_t pos = offset;
    std::uint64_t left = todo;
    // A head inside a sector.
    if (const std::uint32_t in = std::uint32_t(pos % ss)) {
        const std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(ss - in, left));
        if (!ReadPart(storage, pos / ss, ss, in, n, out, error))
            return false;
        pos += n;
        out += n;
        left -= n;
    }
    if (left) {
        const std::uint64_t whole = left / ss;
        const std::uint32_t tail = std::uint32_t(left % ss);
        // The partial last sector first, then the whole sectors before it.
        if (tail && !ReadPart(storage, pos / ss + whole, ss, 0, tail, out + whole * ss, error))
            return false;
        if (whole && !WholeSectors(storage, true, pos / ss, whole, ss, out, error))
            return false;
    }
    return todo == length;
}

bool CByteAccess::Write(cStorage &storage, std::uint64_t offset, std::uint64_t length, const void *buffer,
                        std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint32_t ss = storage.GetBytesPerSector();
    if (ss == 0)
        return false;
    // The sector transfer takes a writable pointer for both directions; writes never change it.
    auto *in = static_cast<std::uint8_t *>(const_cast<void *>(buffer));
    std::uint64_t todo = length;
    if (!clip(storage.GetSize(), offset, todo))
        return false;

    std::uint64_t pos = offset;
    std::uint64_t left = todo;
    if (const std::uint32_t at = std::uint32_t(pos % ss)) {
        const std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(ss - at, left));
        if (!WritePart(storage, pos / ss, ss, at, n, in, error))
            return false;
        pos += n;
        in += n;
        left -= n;
    }
    if (left) {
        const std::uint64_t whole = left / ss;
        const std::uint32_t tail = std::uint32_t(left % ss);
        if (tail && !WritePart(storage, pos / ss + whole, ss, 0, tail, in + whole * ss, error))
            return false;
        if (whole && !WholeSectors(storage, false, pos / ss, whole, ss, in, error))
            return false;
    }
    return todo == length;
}
