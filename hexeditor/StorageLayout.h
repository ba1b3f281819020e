// The named structures inside a partition or volume, found from its own boot sector or
// superblock: where the boot sector and its copy, the FATs, the root folder, the MFT and its
// mirror, the volume header, the superblocks lie. Only Qt Core: the fuzz build links it.
#pragma once

#include <QByteArray>
#include <QList>
#include <QString>

#include <cstdint>
#include <functional>

#include "hexeditor/templates/TemplateType.h"

namespace HexEditor::Layout {

struct Point
{
    QString title; // with "%1" for the sector number
    std::uint64_t offset = 0;
    Templates::Type type = Templates::None;
    bool primary = true;
    std::uint32_t kind = 1; // 1 jump, 3 ask for an MFT record, 4 ask for a catalog node
};

// Reads `length` bytes at byte `offset` of the partition; a short or empty answer means unreadable.
using Reader = std::function<QByteArray(std::uint64_t offset, std::uint32_t length)>;

// The points of a partition or volume of file-system kind `kind` (7 FAT, 8 FAT32, 9 exFAT,
// 10 NTFS, 13 HFS+, 14 to 16 Ext, 17 UFS, 20 BtrFS), `size` bytes long with `sectorSize`-byte
// sectors, followed by "First Sector (%1)" and "Last Sector (%1)". Positions that fall outside the
// partition are left out.
QList<Point> volumePoints(std::uint32_t kind, std::uint64_t size, std::uint32_t sectorSize,
                          const Reader &read);

// The signed boot-sector byte 0x40 of NTFS: negative n means 2^-n bytes, else n clusters.
std::uint32_t ntfsRecordSize(std::int8_t value, std::uint32_t clusterSize);

// The inode size of an ext2/3/4 superblock (1024 bytes from byte 1024): 128 for revision 0,
// else its own field when it is a power of two from 128 to the block size; 0 when no superblock.
std::uint32_t extInodeSize(const QByteArray &superblock);

} // namespace HexEditor::Layout
