// One template kind: its record size, its per-kind properties and the builder that turns the
// record's bytes into a field tree.
#pragma once

#include <QVariantList>

#include <cstdint>

#include "hexeditor/templates/core/TemplateType.h"

namespace HexEditor::Templates {

class Record;
class Source;

class Builder
{
public:
    virtual ~Builder() = default;

    virtual Type type() const = 0;
    // The record size in bytes for this source (0 when the kind cannot be placed on it).
    virtual std::uint32_t recordSize(Source &source) const = 0;
    // Whether the "Copy Value" column is shown, and whether a copy record is read for it.
    virtual bool hasCopyColumn() const { return false; }
    virtual bool readsCopy() const { return hasCopyColumn(); }
    virtual bool bigEndian() const { return false; }
    // Appends the fields to the record's root, reading the record's buffers.
    virtual void build(Record &record) = 0;
    // Further (absolute offset, bytes) pairs to write together with an edit of `size` bytes at
    // record offset `offset`.
    virtual QVariantList dependentChanges(const Record &record, std::uint32_t offset,
                                          std::uint32_t size) const
    {
        (void)record;
        (void)offset;
        (void)size;
        return {};
    }
};

} // namespace HexEditor::Templates
