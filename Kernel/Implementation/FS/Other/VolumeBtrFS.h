// Btrfs: the superblock at 64 KiB and its mirror at 64 MiB; geometry in sectors of the file
// system's own size; free space from the superblock's byte counts.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryBtrFS)

class CVolumeBtrFS : public CVolumeOther
{
public:
    CVolumeBtrFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

    // CRC-32C (Castagnoli) as the superblock checksum uses it.
    static std::uint32_t Crc32c(const std::uint8_t *data, std::size_t size);

protected:
    void Initialize() override;
    std::uint32_t GradeIntegrity() override;
};
