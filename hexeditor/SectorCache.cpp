#include "hexeditor/SectorCache.h"

#include <algorithm>

namespace HexEditor {

void SectorCache::pushNewest(Slot &slot)
{
    slot.older = m_newest;
    slot.newer = nullptr;
    if (m_newest)
        m_newest->newer = &slot;
    m_newest = &slot;
    if (!m_oldest)
        m_oldest = &slot;
    slot.inOrder = true;
    ++m_orderCount;
}

void SectorCache::unlink(Slot &slot)
{
    (slot.newer ? slot.newer->older : m_newest) = slot.older;
    (slot.older ? slot.older->newer : m_oldest) = slot.newer;
    slot.newer = slot.older = nullptr;
    slot.inOrder = false;
    --m_orderCount;
}

CachedSector *SectorCache::find(std::uint64_t n)
{
    auto it = m_map.find(n);
    if (it == m_map.end())
        return nullptr;
    Slot &slot = it->second;
    if (slot.inOrder && m_newest != &slot) {
        unlink(slot);
        pushNewest(slot);
    }
    return &slot.sector;
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
    Slot &slot = m_map.try_emplace(n).first->second;
    slot.sector = std::move(sector);
    const std::uint64_t size = std::uint64_t(slot.sector.data.size());
    m_bytes += size;
    if (!pinned(slot.sector)) {
        pushNewest(slot);
        m_evictableBytes += size;
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
    Slot &slot = it->second;
    const std::uint64_t size = std::uint64_t(slot.sector.data.size());
    m_bytes -= size;
    if (slot.inOrder) {
        unlink(slot);
        m_evictableBytes -= size;
    } else {
        m_pinned.erase(n);
    }
    m_map.erase(it);
}

void SectorCache::clear()
{
    m_map.clear();
    m_newest = m_oldest = nullptr;
    m_orderCount = 0;
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
        unlink(slot);
        m_evictableBytes -= size;
        m_pinned.insert(n);
    } else if (!pin && !slot.inOrder) {
        pushNewest(slot);
        m_evictableBytes += size;
        m_pinned.erase(n);
        trim();
    }
}

void SectorCache::trim()
{
    while (m_evictableBytes > m_bound && m_orderCount > 1) {
        QByteArray data = m_oldest->sector.data;
        remove(m_oldest->sector.number);
        // The buffer serves the next read when nobody else holds it.
        if (m_spare.isNull() && data.isDetached())
            m_spare = std::move(data);
    }
}

QByteArray SectorCache::buffer(qsizetype size)
{
    QByteArray b = std::move(m_spare);
    m_spare = QByteArray();
    if (b.size() != size || !b.isDetached())
        return QByteArray(size, '\0');
    b.fill('\0');
    return b;
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
