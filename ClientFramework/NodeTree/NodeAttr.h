// Node attribute codes and the bits of a node's state word.
#pragma once

#include <QHashFunctions>
#include <QtGlobal>

// The attributes a node answers a text (and a display value) for.
enum class NodeAttr : quint32 {
    Name = 2,
    Description = 3,
    Source = 4,
    TypeKey = 5,
    Key = 6,
    Size = 8,
    FreeSpace = 9,
    FileSystem = 12,
    Label = 13,
    Serial = 14,
    FirstSector = 15,
    SectorCount = 16,
    SectorSize = 17,
    Model = 18,
    Firmware = 19,
    Path = 20,
    EntryIndex = 21,
    Attributes = 22,
    Children = 23,
    Kind = 28,
    Location = 29,
    Status = 32,
};

inline size_t qHash(NodeAttr attr, size_t seed = 0) noexcept
{
    return ::qHash(static_cast<quint32>(attr), seed);
}

// The bits of a node's 32-bit state word.
namespace NodeState {
enum : quint32 {
    InvalidLow = 0x40,       // one of the three invalid bits
    InvalidMid = 0x80,       // one of the three invalid bits
    Deleted = 0x100,         // a deleted entry of a file system
    Populated = 0x800,       // the children have been built
    System = 0x1000,         // system object
    Virtual = 0x2000,        // virtual object
    ReadOnly = 0x4000,       // read-only
    Removable = 0x8000,      // removable medium
    Image = 0x10000,         // a mounted disk image
    Raid = 0x20000,          // a RAID assembly
    Ready = 0x100000,        // ready
    Waiting = 0x200000,      // queued for a process
    Busy = 0x400000,         // a process runs on it
    InvalidHigh = 0x1000000, // one of the three invalid bits
    Warning = 0x40000000,    // warning state
    Critical = 0x80000000,   // critical state

    // Invalid only with all three bits.
    Invalid = InvalidHigh | InvalidMid | InvalidLow,
};
} // namespace NodeState

// What a node stands for.
enum class NodeKind : int {
    Root,
    Computer,
    Device,
    Partition,
    Drive,
    Folder,
    File,
    Container,
    Other,
};
