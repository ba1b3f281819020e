// UDF: anchor volume descriptor pointers at block 256 and at the end, the volume descriptor
// sequence they point to, the logical volume identifier as label.
#pragma once

#include "Kernel/Implementation/FS/Other/VolumeOther.h"

BRINDLE_OTHER_ENTRY(CEntryUDF)

class CVolumeUDF : public CVolumeOther
{
public:
    CVolumeUDF(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);

    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;
    // The UDF block size found (0 when no anchor was found).
    std::uint32_t GetBlockSize() const { return m_blockSize; }

    // Whether the 16-byte descriptor tag at the start of `b` is sound (checksum, identifier) and
    // records `location` as its own block.
    static bool TagValid(const std::uint8_t *b, std::size_t size, std::uint16_t id, std::uint32_t location);
    // A "dstring" field (compression id 8 or 16, length in the last byte).
    static QString DString(const std::uint8_t *b, std::size_t size, std::size_t offset, std::size_t length);

protected:
    void Initialize() override;

private:
    std::uint32_t m_blockSize = 0;
};
