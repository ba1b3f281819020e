// The records of the Logical Disk Manager database: private header, table of contents, volume
// manager database header, transaction log and the 128-byte VBLK records. All big-endian.
#pragma once

#include "hexeditor/templates/core/Builder.h"

namespace HexEditor::Templates {

class LdmBuilder : public Builder
{
public:
    std::uint32_t recordSize(Source &) const override { return 512; }
    bool bigEndian() const override { return true; }
};

class LdmPrivHeadBuilder : public LdmBuilder
{
public:
    Type type() const override { return LdmPrivateHeader; }
    bool hasCopyColumn() const override { return true; }
    void build(Record &record) override;
};

class LdmTocBuilder : public LdmBuilder
{
public:
    Type type() const override { return LdmTocBlock; }
    bool hasCopyColumn() const override { return true; }
    void build(Record &record) override;
};

class LdmVmdbBuilder : public LdmBuilder
{
public:
    Type type() const override { return LdmVmdbBlock; }
    void build(Record &record) override;
};

class LdmKlogBuilder : public LdmBuilder
{
public:
    Type type() const override { return LdmKLogBlock; }
    void build(Record &record) override;
};

class LdmVblkBuilder : public LdmBuilder
{
public:
    static constexpr std::uint32_t MaxDataLength = 104;

    Type type() const override { return LdmVblkBlock; }
    std::uint32_t recordSize(Source &) const override { return 128; }
    void build(Record &record) override;
};

} // namespace HexEditor::Templates
