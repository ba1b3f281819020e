// The Master Boot Record: boot code, disk serial number, four partition entries and the signature.
#pragma once

#include <QString>

#include "hexeditor/templates/core/Builder.h"

namespace HexEditor::Templates {

class Source;

class MbrBuilder : public Builder
{
public:
    Type type() const override { return MasterBootRecord; }
    std::uint32_t recordSize(Source &) const override { return 512; }
    void build(Record &record) override;

    // The kernel's file-system code of an entry: 0 for an unused type, 1 for an extended
    // partition, else what the partition's first bytes hold, else what the type byte says.
    static std::uint32_t entryKind(Source &source, std::uint8_t type, std::uint64_t start,
                                   std::uint64_t count);
};

} // namespace HexEditor::Templates
