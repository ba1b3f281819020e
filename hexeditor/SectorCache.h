// The storage's sector cache: a hash from sector number to cached sector with a least-recently-
// used order. Sectors with modified marks and unreadable sectors are never evicted (the edits
// must survive until saved, and an unreadable sector's message is given once); unmodified
// readable sectors are evicted, oldest use first, when their bytes exceed the bound. The use
// order is linked through the hash's own entries, and the buffer of the last evicted sector is
// kept for the next read, so paging through a large medium allocates little per sector.
#pragma once

#include <cstdint>
#include <set>
#include <unordered_map>
#include <vector>

#include "hexeditor/Storage.h"

namespace HexEditor {

class SectorCache
{
public:
    explicit SectorCache(std::uint64_t bound = Storage::DefaultCacheBound) : m_bound(bound) {}

    // The cached sector, marked as used most recently; null when not cached.
    CachedSector *find(std::uint64_t n);
    // Looks without changing the order.
    const CachedSector *peek(std::uint64_t n) const;
    // Inserts (or replaces) a sector and evicts beyond the bound; returns the cached copy.
    CachedSector *insert(CachedSector &&sector);
    void remove(std::uint64_t n);
    void clear();
    // Call after the marks of sector n changed: a sector that gained marks is kept for good, one
    // that lost them becomes evictable again.
    void refresh(std::uint64_t n);
    // Evicts the least recently used unpinned sectors beyond the bound (never the newest one).
    void trim();
    // A buffer of `size` bytes for the next sector read: an evicted sector's when one is free.
    QByteArray buffer(qsizetype size);

    // Every cached sector number with a modified mark, ascending.
    std::vector<std::uint64_t> modifiedSectors() const;
    // Every cached sector, in no particular order.
    template <typename F> void forEach(F &&f) const
    {
        for (const auto &kv : m_map)
            f(kv.second.sector);
    }

    std::uint64_t bound() const { return m_bound; }
    void setBound(std::uint64_t bytes)
    {
        m_bound = bytes;
        trim();
    }
    std::uint64_t count() const { return std::uint64_t(m_map.size()); }
    std::uint64_t bytes() const { return m_bytes; }
    // Bytes of the sectors that may be evicted.
    std::uint64_t evictableBytes() const { return m_evictableBytes; }
    std::uint64_t pinnedCount() const { return m_pinned.size(); }

private:
    struct Slot
    {
        CachedSector sector;
        bool inOrder = false; // pinned sectors are not in the use order
        Slot *newer = nullptr;
        Slot *older = nullptr;
    };
    static bool pinned(const CachedSector &s) { return !s.readOk || s.isModified(); }
    void pushNewest(Slot &slot);
    void unlink(Slot &slot);

    // Entries of an unordered map keep their addresses until erased: the use order links them.
    std::unordered_map<std::uint64_t, Slot> m_map;
    Slot *m_newest = nullptr;
    Slot *m_oldest = nullptr;
    std::uint64_t m_orderCount = 0;
    std::set<std::uint64_t> m_pinned; // modified or unreadable, ascending
    QByteArray m_spare;               // an evicted sector's buffer, reused by the next read
    std::uint64_t m_bound;
    std::uint64_t m_bytes = 0;
    std::uint64_t m_evictableBytes = 0;
};

} // namespace HexEditor
