// XFS: the primary superblock at 0 with the AGF and AGI headers after it, and the superblock,
// AGF and AGI of every allocation group; file-system blocks as clusters.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryXFS)

class CVolumeXFS : public CVolumeOther
{
public:
    CVolumeXFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;
};
