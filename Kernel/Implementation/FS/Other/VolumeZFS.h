// ZFS: the four vdev labels (two at the start, two at the end), their uberblock arrays and the
// pool name of the label's name-value list.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryZFS)

class CVolumeZFS : public CVolumeOther
{
public:
    CVolumeZFS(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;

    // The string value of `name` in an XDR-encoded name-value list (the label's 112 KiB area),
    // or an empty string. Reads only inside the buffer.
    static QString NvString(const std::uint8_t *b, std::size_t size, const char *name);

protected:
    void Initialize() override;
};
