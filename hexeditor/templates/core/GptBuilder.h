// The GUID partition table: the header sector followed by the 128 entries of 128 bytes.
#pragma once

#include <QByteArray>
#include <QString>

#include "hexeditor/templates/core/Builder.h"

namespace HexEditor::Templates {

class GptBuilder : public Builder
{
public:
    static constexpr std::uint32_t EntryCount = 128;
    static constexpr std::uint32_t EntrySize = 128;

    Type type() const override { return GuidPartitionTable; }
    // The header sector and as many sectors as the 128 entries take (0 for an unusable sector size).
    std::uint32_t recordSize(Source &source) const override;
    void build(Record &record) override;

    // The name of a partition type GUID (16 bytes in on-disk order); empty when not listed.
    static QString typeName(const QByteArray &guid);
};

} // namespace HexEditor::Templates
