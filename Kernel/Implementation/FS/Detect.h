// File-system detection: the classifier that recognises a boot sector or superblock, the
// fixed sequence of probe reads over a partition, the ZFS label check and the UDF probe.
// Everything here only reads, through the storage's byte transfers, and checks every field
// against the buffer it came from.
#pragma once

#include <cstddef>
#include <cstdint>

#include "Kernel/Implementation/Common/DeviceInfo.h"

class cStorage;
class cPartition;

namespace Detect {

// Not recognised, or not determined yet.
constexpr std::uint32_t KindUnknown = 24;
// Whether a partition's kind still asks for detection (24, or the platform's all-ones code).
inline bool Undetermined(std::uint32_t kind)
{
    return kind == KindUnknown || kind == static_cast<std::uint32_t>(FileSystemKind::Unknown);
}

// The FileSystemKind code of the boot sector or superblock at the start of `buffer`
// (7 FAT, 8 FAT32, 9 exFAT, 10 NTFS, 12 CDFS, 13 HFS+, 14..16 ext, 17 UFS, 18 ReFS, 20 BtrFS,
// 21 XFS, 22 JFS, 23 ApFS), or 24 when nothing is recognised.
std::uint32_t ClassifyBootBlock(const std::uint8_t *buffer, std::size_t size);

// The single tests the classifier is made of (each answers whether the buffer holds that
// structure); the volume classes use them on their primary and backup copies.
bool IsFat(const std::uint8_t *b, std::size_t size);
bool IsFat32(const std::uint8_t *b, std::size_t size);
bool IsExFat(const std::uint8_t *b, std::size_t size);
bool IsCdfs(const std::uint8_t *b, std::size_t size);
bool IsReFs(const std::uint8_t *b, std::size_t size);
bool IsApFs(const std::uint8_t *b, std::size_t size);
bool IsNtfs(const std::uint8_t *b, std::size_t size);
bool IsHfsPlus(const std::uint8_t *b, std::size_t size);
std::uint32_t ExtKind(const std::uint8_t *b, std::size_t size); // 14, 15, 16 or 24
bool IsUfs(const std::uint8_t *b, std::size_t size);
bool IsBtrFs(const std::uint8_t *b, std::size_t size);
bool IsXfs(const std::uint8_t *b, std::size_t size);
bool IsJfs(const std::uint8_t *b, std::size_t size);

// The decoded NTFS boot sector check word; valid when all of NtfsValidMask are set.
constexpr std::uint32_t NtfsValidMask = 0x13C008E;
std::uint32_t NtfsCheckWord(const std::uint8_t *b, std::size_t size);

// ReFS boot sector checksum over bytes 3..511 without bytes 22 and 23.
std::uint16_t ReFsChecksum(const std::uint8_t *b, std::size_t size);
// APFS object checksum (Fletcher-64 over 32-bit words from byte 8 to the end of the block).
std::uint64_t ApFsChecksum(const std::uint8_t *b, std::size_t blockSize);

// A ZFS uberblock: its magic in either byte order and a known version.
bool IsZfsUberblock(const std::uint8_t *b, std::size_t size);
// The ZFS label check over a 256 KiB label.
bool IsZfsLabel(const std::uint8_t *b, std::size_t size);

// The UDF volume recognition walk from byte `start` + 32,768; true when it ends with
// "BEA01", "NSR02"/"NSR03", "TEA01" in this order.
bool ProbeUdf(cStorage &storage, std::uint64_t start = 0);

// The probe sequence over `storage` (a partition, or a whole device without a table).
// `mediaType` is the device's media type (CdRom makes only the optical probe run).
std::uint32_t DetectFileSystem(cStorage &storage, std::uint64_t start, std::uint64_t length,
                               bool stopAtSignature, bool &usedBackup,
                               MediaType mediaType = MediaType::Unknown);
// The same over a partition, with the media type of its device.
std::uint32_t DetectFileSystem(cPartition &partition, std::uint64_t start, std::uint64_t length,
                               bool stopAtSignature, bool &usedBackup);

} // namespace Detect
