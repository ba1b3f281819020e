// UFS1 and UFS2: the superblock at 8 KiB, 64 KiB or 256 KiB, its copy in the last cylinder
// group, fragments as clusters.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryUFS)

class CVolumeUFS : public CVolumeOther
{
public:
    CVolumeUFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;
    // Byte position of the superblock in use, or NoSector.
    std::uint64_t GetSuperblockOffset() const { return m_superOffset; }

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;

private:
    std::uint64_t m_superOffset = NoSector;
};
