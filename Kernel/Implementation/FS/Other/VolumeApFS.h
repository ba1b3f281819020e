// APFS: the container superblock in block 0 and the latest one of the checkpoint descriptor
// area, the container's object map and the first volume's superblock (its name is the label).
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryApFS)

class CVolumeApFS : public CVolumeOther
{
public:
    CVolumeApFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

    // The physical block of virtual object `oid` in the object map whose B-tree root node is
    // `node` (one block): 0 when not found. Only a root that is also a leaf is searched.
    static std::uint64_t OmapLookup(const std::uint8_t *node, std::size_t blockSize, std::uint64_t oid);

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;
};
