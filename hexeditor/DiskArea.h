// A byte range of a hex-editor storage: the payload of the editor's data-change notifications.
#pragma once

#include <QMetaType>

#include <cstdint>

namespace HexEditor {

struct DiskArea
{
    uint64_t offset = 0;
    uint64_t length = 0;

    // One past the last byte, saturating at the top of the 64-bit range.
    uint64_t end() const { return length > UINT64_MAX - offset ? UINT64_MAX : offset + length; }
    bool contains(uint64_t pos) const { return pos >= offset && pos < end(); }
    bool intersects(const DiskArea &o) const { return offset < o.end() && o.offset < end(); }
    bool operator==(const DiskArea &) const = default;
};

} // namespace HexEditor

Q_DECLARE_METATYPE(HexEditor::DiskArea)
