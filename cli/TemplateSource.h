// A template source over a kernel storage: byte reads bounded by the storage's size.
#pragma once

#include "Kernel/Implementation/Common/cStorage.h"
#include "hexeditor/templates/core/Source.h"

namespace Cli {

class TemplateSource : public HexEditor::Templates::Source
{
public:
    explicit TemplateSource(cStorage &storage) : m_storage(storage) {}

    std::uint64_t size() const override { return m_storage.GetSize(); }
    std::uint32_t sectorSize() const override { return m_storage.GetBytesPerSector(); }
    QByteArray read(std::uint64_t offset, std::uint32_t length) override;

private:
    cStorage &m_storage;
};

} // namespace Cli
