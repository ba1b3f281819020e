// The kinds that have a builder, the builder of each, the file-system code to kind table and the
// automatic choice of the template pane.
#pragma once

#include <QList>

#include <cstdint>
#include <memory>

#include "hexeditor/templates/core/Builder.h"
#include "hexeditor/templates/core/TemplateType.h"

enum class StorageKind : std::uint32_t;

namespace HexEditor::Templates {

// A new builder of that kind; null for None and for kinds without one yet.
std::unique_ptr<Builder> createBuilder(int type);
// The kinds createBuilder makes, in id order.
QList<Type> availableTypes();

// The kind for a kernel file-system code. Codes 1 (extended boot record) and 20 (BtrFS) give a kind
// only for the automatic choice.
Type kindOfFileSystem(std::uint32_t code, bool automatic);

struct Placement
{
    Type type = None;
    std::uint64_t offset = 0;
};

// What the pane picks for a storage: by the file-system code for a partition or volume, by the
// partition style (2 boot record, 3 GUID table) for a device.
Placement automaticChoice(StorageKind kind, std::uint32_t fileSystemKind, std::uint32_t partitionStyle,
                          std::uint32_t sectorSize);

} // namespace HexEditor::Templates
