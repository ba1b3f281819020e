#include "Kernel/Implementation/FS/EntryHandle.h"

#include "Kernel/Implementation/Common/cStorage.h"

#include <algorithm>
#include <cstring>

namespace {

// Walks a packed run string. Each call gives the next run; false at the end or on damage.
struct RunReader
{
    const QByteArray &runs;
    int at = 0;
    bool damaged = false;

    bool Next(std::uint64_t &start, std::uint64_t &length, int *where = nullptr)
    {
        if (at >= runs.size())
            return false;
        const std::uint8_t head = static_cast<std::uint8_t>(runs[at]);
        if (head == 0)
            return false;
        const int l = head & 0x0F;
        const int s = head >> 4;
        if (l < 1 || l > 8 || s > 8 || at + 1 + l + s > runs.size()) {
            damaged = true;
            return false;
        }
        if (where)
            *where = at;
        const auto *p = reinterpret_cast<const std::uint8_t *>(runs.constData()) + at + 1;
        length = 0;
        for (int i = 0; i < l; ++i)
            length |= std::uint64_t(p[i]) << (8 * i);
        if (s == 0) {
            start = CEntryHandle::Sparse;
        } else {
            start = 0;
            for (int i = 0; i < s; ++i)
                start |= std::uint64_t(p[l + i]) << (8 * i);
        }
        at += 1 + l + s;
        return true;
    }
};

} // namespace

CEntryHandle::CEntryHandle(cStorage *owner, std::uint8_t unitShift) : m_owner(owner), m_unitShift(unitShift)
{
}

CEntryHandle::~CEntryHandle() = default;

int CEntryHandle::Bytes(std::uint64_t v)
{
    int n = 1;
    while (n < 8 && (v >> (8 * n)) != 0)
        ++n;
    return n;
}

void CEntryHandle::DropCache()
{
    m_cache.clear();
    m_cacheIndex = None;
}

bool CEntryHandle::AddRun(std::uint64_t start, std::uint64_t length)
{
    if (length == 0 || m_unitShift > 63)
        return false;
    if ((length << m_unitShift) >> m_unitShift != length)
        return false;
    const std::uint64_t bytes = length << m_unitShift;
    if (bytes > ~0ull - m_totalBytes)
        return false;
    const bool sparse = start == Sparse;
    if (m_lastRun >= 0) {
        RunReader reader{m_runs, m_lastRun};
        std::uint64_t lastStart = 0, lastLength = 0;
        if (reader.Next(lastStart, lastLength)) {
            const bool lastSparse = lastStart == Sparse;
            const bool joins =
                (sparse && lastSparse) || (!sparse && !lastSparse && lastLength <= ~0ull - lastStart &&
                                           lastStart + lastLength == start);
            if (joins && length <= ~0ull - lastLength) {
                m_runs.truncate(m_lastRun);
                m_lastRun = -1;
                const std::uint64_t merged = lastLength + length;
                const std::uint64_t total = m_totalBytes;
                // Re-append the merged run; the total counts only the added part.
                m_totalBytes = total - (lastLength << m_unitShift);
                if (!AddRun(lastStart, merged)) {
                    m_totalBytes = total;
                    return false;
                }
                DropCache();
                return true;
            }
        }
    }
    const int l = Bytes(length);
    const int s = sparse ? 0 : Bytes(start);
    m_lastRun = m_runs.size();
    m_runs.append(static_cast<char>((s << 4) | l));
    for (int i = 0; i < l; ++i)
        m_runs.append(static_cast<char>((length >> (8 * i)) & 0xFF));
    for (int i = 0; i < s; ++i)
        m_runs.append(static_cast<char>((start >> (8 * i)) & 0xFF));
    m_totalBytes += bytes;
    DropCache();
    return true;
}

bool CEntryHandle::AppendRuns(const CEntryHandle &other)
{
    if (other.m_unitShift != m_unitShift || &other == this)
        return false;
    RunReader reader{other.m_runs};
    std::uint64_t start, length;
    bool ok = true;
    while (reader.Next(start, length))
        ok = AddRun(start, length) && ok;
    return ok && !reader.damaged;
}

int CEntryHandle::GetRunCount() const
{
    RunReader reader{m_runs};
    std::uint64_t start, length;
    int n = 0;
    while (reader.Next(start, length))
        ++n;
    return n;
}

bool CEntryHandle::GetRun(int index, std::uint64_t &start, std::uint64_t &length) const
{
    RunReader reader{m_runs};
    int n = 0;
    while (reader.Next(start, length)) {
        if (n++ == index)
            return true;
    }
    return false;
}

bool CEntryHandle::SetRuns(const QByteArray &packed)
{
    Clear();
    RunReader reader{packed};
    std::uint64_t start, length;
    while (reader.Next(start, length)) {
        if (!AddRun(start, length)) {
            Clear();
            return false;
        }
    }
    if (reader.damaged) {
        Clear();
        return false;
    }
    return true;
}

std::uint64_t CEntryHandle::MapOffset(std::uint64_t offset) const
{
    RunReader reader{m_runs};
    std::uint64_t start, length, at = 0;
    while (reader.Next(start, length)) {
        const std::uint64_t bytes = length << m_unitShift;
        if (offset - at < bytes) {
            if (start == Sparse)
                return None;
            const std::uint64_t base = start << m_unitShift;
            if ((base >> m_unitShift) != start || offset - at > ~0ull - base)
                return None;
            return base + (offset - at);
        }
        at += bytes;
    }
    return None;
}

void CEntryHandle::SetUnitShift(std::uint8_t shift)
{
    if (shift == m_unitShift)
        return;
    Clear();
    m_unitShift = shift;
}

void CEntryHandle::SetCacheShift(std::uint8_t shift)
{
    m_cacheShift = shift;
    DropCache();
}

void CEntryHandle::Clear()
{
    m_runs.clear();
    m_totalBytes = 0;
    m_lastRun = -1;
    DropCache();
}

bool CEntryHandle::Read(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    return Transfer(true, offset, length, buffer, error);
}

bool CEntryHandle::Write(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error)
{
    return Transfer(false, offset, length, const_cast<void *>(buffer), error);
}

bool CEntryHandle::Transfer(bool read, std::uint64_t offset, std::uint64_t length, void *buffer,
                            std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    if (!m_owner || !buffer || offset > m_totalBytes || length > m_totalBytes - offset)
        return false;
    const std::uint8_t shift = std::min<std::uint8_t>(std::max<std::uint8_t>(m_cacheShift, m_unitShift), 31);
    if (shift != m_cacheShift) {
        m_cacheShift = shift;
        DropCache();
    }
    const std::uint64_t piece = 1ull << shift;
    auto *out = static_cast<std::uint8_t *>(buffer);

    // Moves bytes between the buffer and the owner for one stretch of the entry, run by run.
    auto direct = [&](std::uint64_t from, std::uint64_t count, std::uint8_t *data) -> bool {
        RunReader reader{m_runs};
        std::uint64_t start, runLength, at = 0;
        while (count > 0 && reader.Next(start, runLength)) {
            const std::uint64_t bytes = runLength << m_unitShift;
            if (from - at < bytes) {
                const std::uint64_t inRun = from - at;
                const std::uint64_t n = std::min(count, bytes - inRun);
                if (start == Sparse) {
                    if (!read)
                        return false;
                    std::memset(data, 0, n);
                } else {
                    const std::uint64_t pos = (start << m_unitShift) + inRun;
                    const bool ok = read ? m_owner->ReadBytes(pos, n, data, error)
                                         : m_owner->WriteBytes(pos, n, data, error);
                    if (!ok)
                        return false;
                }
                data += n;
                from += n;
                count -= n;
            }
            at += bytes;
        }
        return count == 0;
    };

    if (!read) {
        DropCache();
        return direct(offset, length, out);
    }
    while (length > 0) {
        const std::uint64_t index = offset >> shift;
        const std::uint64_t pieceStart = index << shift;
        const std::uint64_t pieceBytes = std::min(piece, m_totalBytes - pieceStart);
        if (m_cacheIndex != index) {
            m_cache.resize(static_cast<qsizetype>(pieceBytes));
            m_cacheIndex = None;
            if (!direct(pieceStart, pieceBytes, reinterpret_cast<std::uint8_t *>(m_cache.data())))
                return false;
            m_cacheIndex = index;
        }
        const std::uint64_t inPiece = offset - pieceStart;
        const std::uint64_t n = std::min(length, pieceBytes - inPiece);
        std::memcpy(out, m_cache.constData() + inPiece, n);
        out += n;
        offset += n;
        length -= n;
    }
    return true;
}
