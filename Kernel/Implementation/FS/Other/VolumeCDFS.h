// ISO 9660: the primary volume descriptor at 32 KiB (and a supplementary one when present),
// 2048-byte sectors, the root directory record.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryCDFS)

class CVolumeCDFS : public CVolumeOther
{
public:
    CVolumeCDFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

protected:
    void Initialize() override;
};
