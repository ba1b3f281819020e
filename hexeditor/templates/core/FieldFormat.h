// How a template field's bytes are shown and edited.
#pragma once

#include <cstdint>

namespace HexEditor::Templates {

enum FieldFormat : std::uint32_t {
    Group = 1,
    UInt8 = 2,
    UInt16 = 3,
    UInt32 = 4,
    UInt48 = 5,
    UInt64 = 6,
    AnsiZeroPadded = 7,
    AnsiSpacePadded = 8,
    Utf16Fixed = 9,
    ExFatName = 10,
    DosName = 11,
    LongName = 12,
    Utf8Text = 13,
    HexBytes = 14,
    DosDate = 15,
    DosDateTime = 16,
    Bit = 17,
    Hex8 = 18,
    Hex16 = 19,
    Hex32 = 20,
    Text = 21,
    FileTime = 22,
    HfsTime = 23,
    UnixTime = 24,
    UnixNanoTime = 25,
    NtTime = 26,
    Caption = 27,
    Note = 28,
};

// Which column of the field tree a selection is in: none (name, offset, a group or the root), the
// primary value column or the copy value column.
enum Context : int {
    ContextNone = 0,
    ContextPrimary = 1,
    ContextCopy = 2,
};

} // namespace HexEditor::Templates
