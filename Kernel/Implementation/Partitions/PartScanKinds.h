// What the scan can tell about a device or partition from its first sectors (through the
// file-system classifier), and the other volume managers' labels.
#pragma once

#include <QByteArray>

#include <cstdint>

#include "Kernel/Implementation/Common/cStorage.h"

namespace PartScan {

// The FileSystemKind code (7..23) the classifier finds at the start of `sector`, else 0xFFFFFFFF.
std::uint32_t bootSectorKind(const QByteArray &sector);

// The FileSystemKind code found in the first 68 KiB of the range, else 0xFFFFFFFF. Never reads
// outside the range.
std::uint32_t sniffFileSystem(cStorage &storage, std::uint64_t start, std::uint64_t length);

// The kind a boot-record type byte alone decides (BSD 5, Storage Spaces 6), else 0xFFFFFFFF.
std::uint32_t kindOfMbrType(std::uint8_t type);

// Linux LVM2: "LABELONE" with "LVM2 001" at byte 24 in one of the first four sectors.
bool hasLvm2Label(cStorage &storage);
// ZFS: a vdev label with an uberblock (magic 0x00bab10c, either byte order) in one of the four
// label places (256 KiB each; two at the start, two at the end of the device).
bool hasZfsLabel(cStorage &storage);

} // namespace PartScan
