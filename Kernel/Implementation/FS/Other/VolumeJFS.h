// JFS: the superblock at 32 KiB and its spare at 60 KiB; aggregate blocks as clusters.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryJFS)

class CVolumeJFS : public CVolumeOther
{
public:
    CVolumeJFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;
};
