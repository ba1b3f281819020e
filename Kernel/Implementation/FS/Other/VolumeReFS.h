// ReFS: the boot sector at sector 0 and its copy in the last sector; geometry from the boot
// sector. The metadata structures behind it are not read.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryReFS)

class CVolumeReFS : public CVolumeOther
{
public:
    CVolumeReFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;
    std::uint8_t GetMajorVersion() const { return m_major; }

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;

private:
    std::uint8_t m_major = 0;
};
