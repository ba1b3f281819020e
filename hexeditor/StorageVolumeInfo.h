// The volume questions shared by the partition, volume and file storages: MFT record and catalog
// node placement through the volume's information request, and the inode size.
#pragma once

#include <cstdint>

class CVolume;
class cStorage;

namespace HexEditor::VolumeInfoQuery {

// MFT record count (last index + 1; 1 when the volume answers otherwise); 0 when not NTFS.
std::uint64_t mftRecordCount(CVolume *volume);
// Byte offset of MFT record `index` on a storage whose sectors are the volume's medium's, shifted
// by `base` bytes; 0 when it cannot be placed below `sectorCount` sectors.
std::uint64_t mftRecordOffset(CVolume *volume, std::uint64_t index, std::uint64_t base,
                              std::uint64_t sectorCount);
// Catalog node count and position (HFS+); 0 otherwise.
std::uint64_t catalogNodeCount(CVolume *volume);
std::uint64_t catalogNodeOffset(CVolume *volume, std::uint64_t index, std::uint64_t base);
// MFT record size from the boot sector's byte 0x40 (1024 when unreadable).
std::uint32_t mftRecordSize(CVolume *volume);
// Inode size of an ext volume from its superblock; `fallback` when it has none.
std::uint32_t inodeSize(CVolume *volume, std::uint32_t fallback);

} // namespace HexEditor::VolumeInfoQuery
