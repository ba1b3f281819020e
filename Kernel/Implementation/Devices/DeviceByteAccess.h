// Byte-granular reads and writes on top of a storage's whole-sector transfers, with a
// one-sector buffer for the partial sectors at either end of a request. Whole sectors go
// straight between the storage and the caller's buffer, outside the adapter's mutex.
#pragma once

#include <QMutex>
#include <QRecursiveMutex>
#include <cstdint>
#include <vector>

class cStorage;

class CByteAccess
{
public:
    CByteAccess() = default;
    CByteAccess(const CByteAccess &) = delete;
    CByteAccess &operator=(const CByteAccess &) = delete;

    // A request that runs past the storage's end is carried out for the bytes that exist,
    // the rest of a read buffer is zeroed, and the call reports failure.
    bool Read(cStorage &storage, std::uint64_t offset, std::uint64_t length, void *buffer,
              std::uint32_t &error);
    bool Write(cStorage &storage, std::uint64_t offset, std::uint64_t length, const void *buffer,
               std::uint32_t &error);

    // Forgets the held sector when it lies in [first, first + count): the storage calls this
    // for every sector write so the buffer never serves stale bytes.
    void Invalidate(std::uint64_t first, std::uint64_t count);

    // The sector the buffer holds, or all bits set when none.
    std::uint64_t HeldSector() const;

private:
    bool LoadSector(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize, std::uint32_t &error);
    bool ReadPart(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize, std::uint32_t from,
                  std::uint32_t size, std::uint8_t *out, std::uint32_t &error);
    bool WritePart(cStorage &storage, std::uint64_t sector, std::uint32_t sectorSize, std::uint32_t from,
                   std::uint32_t size, const std::uint8_t *in, std::uint32_t &error);
    bool WholeSectors(cStorage &storage, bool read, std::uint64_t first, std::uint64_t count,
                      std::uint32_t sectorSize, std::uint8_t *data, std::uint32_t &error);

    // Recursive: a sector write made while the buffer is held comes back through Invalidate.
    mutable QRecursiveMutex m_mutex;
    std::vector<std::uint8_t> m_buffer; // allocated at first use, one sector
    std::uint64_t m_held = 0xFFFFFFFFFFFFFFFFull;
};
