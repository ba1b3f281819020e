// The storage's sector cache: a hash from sector number to cached sector with a least-recently-
// used order. Sectors with modified marks and unreadable sectors are never evicted (the edits
// must survive until saved, and an unreadable sector's message is given once); unmodified
// readable sectors are evicted, oldest use first, when their bytes exceed the bound.
#pragma once

#include <cstdint>
#include <list>
#include <set>
#include <unordered_map>
#include <vector>

#include "Storage.h"

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
    std::uint64_t count() const { return m_map.size(); }
    std::uint64_t bytes() const { return m_bytes; }
    // Bytes of the sectors that may be evicted.
    std::uint64_t evictableBytes() const { return m_evictableBytes; }
    std::uint64_t pinnedCount() const { return m_pinned.size(); }

private:
    struct Slot
    {
        CachedSector sector;
        bool inOrder = false; // pinned sectors are not in the use order
        std::list<std::uint64_t>::iterator use;
    };
    static bool pinned(const CachedSector &s) { return !s.readOk || s.isModified(); }

    std::unordered_map<std::uint64_t, Slot> m_map;
    std::list<std::uint64_t> m_order; // front: most recently used
    std::set<std::uint64_t> m_pinned; // modified or unreadable, ascending
    std::uint64_t m_bound;
    std::uint64_t m_bytes = 0;
    std::uint64_t m_evictableBytes = 0;
};

} // namespace HexEditor
