// The template source over the hex editor's storage: reads go through its sector cache, so a
// template shows the bytes as edited.
#pragma once

#include "hexeditor/templates/core/Source.h"

namespace HexEditor {
class Storage;
}

namespace HexEditor::Templates {

class StorageSource : public Source
{
public:
    explicit StorageSource(Storage *storage) : m_storage(storage) {}

    Storage *storage() const { return m_storage; }
    std::uint64_t size() const override;
    std::uint32_t sectorSize() const override;
    QByteArray read(std::uint64_t offset, std::uint32_t length) override;
    std::uint32_t mftRecordSize() const override;
    std::uint32_t inodeSize() const override;

private:
    Storage *m_storage;
};

} // namespace HexEditor::Templates
