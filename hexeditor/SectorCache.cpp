#include "SectorCache.h"

#include <algorithm>

namespace HexEditor {

CachedSector *SectorCache::find(std::uint64_t n)
{
    auto it = m_map.find(n);
    if (it == m_map.end())
        return nullptr;
    if (it->second.inOrder)
        m_order.splice(m_order.begin(), m_order, it->second.use);
    return &it->second.sector;
}

const CachedSector *SectorCache::peek(std::uint64_t n) const
{
    auto it = m_map.find(n);
    return it == m_map.end() ? nullptr : &it->second.sector;
}

CachedSector *SectorCache::insert(CachedSector &&sector)
{
    const std::uint64_t n = sector.number;
    remove(n);
    Slot &slot = m_map[n];
    slot.sector = std::move(sector);
    m_bytes += std::uint64_t(slot.sector.data.size());
    if (!pinned(slot.sector)) {
        m_order.push_front(n);
        slot.use = m_order.begin();
        slot.inOrder = true;
        m_evictableBytes += std::uint64_t(slot.sector.data.size());
    } else {
        m_pinned.insert(n);
    }
    CachedSector *result = &slot.sector;
    trim();
    return result;
}

void SectorCache::remove(std::uint64_t n)
{
    auto it = m_map.find(n);
    if (it == m_map.end())
        return;
    const std::uint64_t size = std::uint64_t(it->second.sector.data.size());
    m_bytes -= size;
    if (it->second.inOrder) {
        m_order.erase(it->second.use);
        m_evictableBytes -= size;
    } else {
        m_pinned.erase(n);
    }
    m_map.erase(it);
}

void SectorCache::clear()
{
    m_map.clear();
    m_order.clear();
    m_pinned.clear();
    m_bytes = 0;
    m_evictableBytes = 0;
}

void SectorCache::refresh(std::uint64_t n)
{
    auto it = m_map.find(n);
    if (it == m_map.end())
        return;
    Slot &slot = it->second;
    const std::uint64_t size = std::uint64_t(slot.sector.data.size());
    const bool pin = pinned(slot.sector);
    if (pin && slot.inOrder) {
        m_order.erase(slot.use);
        slot.inOrder = false;
        m_evictableBytes -= size;
        m_pinned.insert(n);
    } else if (!pin && !slot.inOrder) {
        m_order.push_front(n);
        slot.use = m_order.begin();
        slot.inOrder = true;
        m_evictableBytes += size;
        m_pinned.erase(n);
        trim();
    }
}

void SectorCache::trim()
{
    while (m_evictableBytes > m_bound && m_order.size() > 1) {
        const std::uint64_t victim = m_order.back();
        remove(victim);
    }
}

std::vector<std::uint64_t> SectorCache::modifiedSectors() const
{
    std::vector<std::uint64_t> result;
    for (const std::uint64_t n : m_pinned)
        if (m_map.at(n).sector.isModified())
            result.push_back(n);
    return result;
}

} // namespace HexEditor
