#include "Kernel/Implementation/Partitions/PartScanMemory.h"

#include <algorithm>
#include <cstring>

namespace PartScan {

MemoryStorage::MemoryStorage(std::uint32_t bytesPerSector, std::uint64_t totalSectors, QByteArray head,
                             QByteArray tail)
    : m_bps(bytesPerSector ? bytesPerSector : 512), m_total(totalSectors), m_head(std::move(head)),
      m_tail(std::move(tail))
{
    const std::uint64_t size = m_total <= UINT64_MAX / m_bps ? m_total * m_bps : UINT64_MAX;
    if (std::uint64_t(m_head.size()) > size)
        m_head.truncate(qsizetype(size));
    if (std::uint64_t(m_tail.size()) > size)
        m_tail = m_tail.right(qsizetype(size));
    m_tailStart = size - std::uint64_t(m_tail.size());
}

bool MemoryStorage::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    error = 0;
    auto *out = static_cast<char *>(buffer);
    std::memset(out, 0, length);
    const std::uint64_t size = GetSize();
    if (offset >= size || length > size - offset) {
        error = 38; // end of the medium
        return false;
    }
    auto copy = [&](const QByteArray &src, std::uint64_t srcStart) {
        const std::uint64_t srcEnd = srcStart + std::uint64_t(src.size());
        const std::uint64_t a = std::max(offset, srcStart), b = std::min(offset + length, srcEnd);
        if (a < b)
            std::memcpy(out + (a - offset), src.constData() + (a - srcStart), b - a);
    };
    copy(m_head, 0);
    copy(m_tail, m_tailStart);
    return true;
}

bool MemoryStorage::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                               std::uint32_t &error)
{
    error = 0;
    const std::uint64_t size = GetSize();
    if (offset >= size || length > size - offset) {
        error = 38;
        return false;
    }
    const auto *in = static_cast<const char *>(buffer);
    bool all = true;
    for (std::uint64_t i = 0; i < length; ++i) {
        const std::uint64_t at = offset + i;
        if (at < std::uint64_t(m_head.size()))
            m_head[qsizetype(at)] = in[i];
        else if (at >= m_tailStart)
            m_tail[qsizetype(at - m_tailStart)] = in[i];
        else
            all = false;
    }
    return all;
}

bool MemoryStorage::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    ++m_reads;
    error = 0;
    if (first >= m_total)
        return false;
    const std::uint64_t n = std::min<std::uint64_t>(count, m_total - first);
    bool ok = ReadBytes(first * m_bps, n * m_bps, buffer, error);
    if (n < count) {
        std::memset(static_cast<char *>(buffer) + n * m_bps, 0, (count - n) * std::uint64_t(m_bps));
        return false;
    }
    return ok;
}

bool MemoryStorage::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                                 std::uint32_t &error)
{
    error = 0;
    if (first >= m_total || count > m_total - first)
        return false;
    return WriteBytes(first * m_bps, std::uint64_t(count) * m_bps, buffer, error);
}

} // namespace PartScan
