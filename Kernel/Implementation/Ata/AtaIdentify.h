// Fields of the 512-byte ATA identify data and of the device configuration overlay block, and
// the SCSI ATA information page that carries identify data on drives behind other buses.
// Every function reads only inside the buffers it is given.
#pragma once

#include <QString>
#include <cstddef>
#include <cstdint>
#include <vector>

namespace AtaIdentify {

constexpr std::size_t Size = 512;

// Little-endian word `index` (0..255) of a 512-byte block.
std::uint16_t Word(const std::uint8_t *block, unsigned index);
bool AllZero(const std::uint8_t *data, std::size_t size);

// Accessible sectors: words 57..58 without LBA support, words 100..103 with 48-bit
// addressing supported and enabled (`uses48` true), else words 60..61.
std::uint64_t AccessibleSectors(const std::uint8_t *identify, bool &uses48);

// Model (words 27..46), firmware (23..26) and serial (10..19), each trimmed; false (all empty)
// unless words 1, 3 and 6 are non-zero. The texts are byte-swapped in pairs unless the model
// already reads in order (makers' prefixes, or "ST" with digits in third and fourth place).
bool Strings(const std::uint8_t *identify, QString &model, QString &firmware, QString &serial);

// Device configuration overlay block: the 512 bytes sum to 0 modulo 256.
bool DcoChecksumValid(const std::uint8_t *dco);
// The 48-bit maximum address of words 3..5.
std::uint64_t DcoMaxAddress(const std::uint8_t *dco);
// Stores a new maximum address in words 3..5 and recomputes the checksum byte (the last).
void SetDcoMaxAddress(std::uint8_t *dco, std::uint64_t maxAddress);

// The SCSI pass-through request (IOCTL_SCSI_PASS_THROUGH) for INQUIRY of the ATA information
// page (0x89): a 56-byte header, 32 bytes of sense, then room for the 572-byte page.
constexpr std::uint32_t ScsiPassThroughCode = 0x4D004;
constexpr std::uint32_t ScsiHeaderSize = 56;
constexpr std::uint32_t ScsiSenseSize = 32;
constexpr std::uint32_t AtaInfoPageSize = 572;
constexpr std::uint32_t ScsiRequestSize = ScsiHeaderSize + ScsiSenseSize + AtaInfoPageSize;
std::vector<std::uint8_t> BuildAtaInfoInquiry();
// Takes the identify data out of an answer of `returned` bytes; false when the answer is
// short, carries a SCSI status, or is not the ATA information page.
bool ParseAtaInfoReply(const std::uint8_t *reply, std::uint32_t returned, std::uint8_t *identify);

} // namespace AtaIdentify
