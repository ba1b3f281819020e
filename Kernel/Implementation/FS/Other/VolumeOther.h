// What the volumes of the other file systems share: reading their boot blocks from the start of
// the volume and building the root and service entries with the entry class of each.
#pragma once

#include "Kernel/Implementation/FS/Volume.h"

#include <vector>

class CVolumeOther : public CVolume
{
public:
    using CVolume::CVolume;

protected:
    // Reads `length` bytes at byte `offset` of the volume into `out` (zero-filled on failure).
    bool ReadBlock(std::uint64_t offset, std::size_t length, std::vector<std::uint8_t> &out);
    // Uses `bytes` as the volume's sector size (the file system's own block addressing unit).
    void UseSectorSize(std::uint32_t bytes);
    // The root folder at `position`, with its data at `start` for `length` units of `unitShift`.
    template <typename Entry>
    CEntry *MakeRoot(const QString &name, std::uint64_t position, std::uint64_t start = CEntryHandle::None,
                     std::uint64_t length = 0, std::uint8_t unitShift = 0)
    {
        auto root = std::make_unique<Entry>(this, nullptr, name, position, CEntry::AttrFolder | 0x6);
        if (start != CEntryHandle::None && length != 0) {
            root->GetHandle().SetUnitShift(unitShift);
            root->GetHandle().AddRun(start, length);
        }
        SetRootEntry(std::move(root));
        return GetRootEntry();
    }
    // A service entry over `count` volume sectors from `sector`, of the file system's entry class.
    template <typename Entry>
    CEntry *MakeService(const QString &name, std::uint64_t sector, std::uint64_t count)
    {
        if (count == 0 || sector >= m_sectorCount)
            return nullptr;
        count = std::min(count, m_sectorCount - sector);
        auto entry = std::make_unique<Entry>(this, nullptr, name, sector,
                                             CEntry::AttrSystemArea | CEntry::AttrSectorPosition);
        entry->GetHandle().SetUnitShift(m_sectorShift);
        entry->GetHandle().AddRun(sector, count);
        return AddServiceEntry(std::move(entry));
    }
    // The cluster geometry of a file system addressed in blocks of `blockBytes` from sector 0,
    // cut to the volume's end.
    void BlockGeometry(std::uint64_t blockBytes, std::uint64_t blocks);
};

// An entry of one of these file systems; folders are not listed yet.
#define BRINDLE_OTHER_ENTRY(Name)                                                                            \
    class Name : public CEntry                                                                               \
    {                                                                                                        \
    public:                                                                                                  \
        using CEntry::CEntry;                                                                                \
    };
