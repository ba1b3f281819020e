// ATA commands sent through the platform's ATA pass-through device control: the 48-byte
// request header followed by a 512-byte data buffer, and the checks of the answer.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <optional>

namespace Ata {

// The pass-through device control and the sizes of its request.
constexpr std::uint32_t IoctlAtaPassThrough = 0x4D02C;
constexpr std::uint32_t HeaderSize = 48;
constexpr std::uint32_t DataSize = 512;
constexpr std::uint32_t RequestSize = HeaderSize + DataSize;

// Header layout (little-endian): length u16 @0, flags u16 @2, path/target/lun/reserved u8
// @4..7, data transfer length u32 @8, time-out in seconds u32 @12, reserved u32 @16, data
// buffer offset u64 @24, previous task file 8 bytes @32, current task file 8 bytes @40.
namespace Offset {
constexpr std::size_t Length = 0;
constexpr std::size_t Flags = 2;
constexpr std::size_t TransferLength = 8;
constexpr std::size_t TimeOut = 12;
constexpr std::size_t DataBufferOffset = 24;
constexpr std::size_t PreviousTaskFile = 32;
constexpr std::size_t CurrentTaskFile = 40;
} // namespace Offset

// Task file registers, by index inside an 8-byte task file.
namespace Reg {
constexpr std::size_t Features = 0; // error register in an answer
constexpr std::size_t SectorCount = 1;
constexpr std::size_t LbaLow = 2;
constexpr std::size_t LbaMid = 3;
constexpr std::size_t LbaHigh = 4;
constexpr std::size_t Device = 5;
constexpr std::size_t Command = 6; // status register in an answer
} // namespace Reg

namespace Flag {
constexpr std::uint16_t DataIn = 2;
constexpr std::uint16_t DataOut = 4;
constexpr std::uint16_t Command48Bit = 8;
} // namespace Flag

// Status register bits that make a command fail: error and data request.
constexpr std::uint8_t StatusError = 0x01;
constexpr std::uint8_t StatusDataRequest = 0x08;

// Command codes used by the device layer.
namespace Code {
constexpr std::uint8_t IdentifyDevice = 0xEC;
constexpr std::uint8_t IdentifyPacketDevice = 0xA1;
constexpr std::uint8_t ReadNativeMaxAddress = 0xF8;
constexpr std::uint8_t ReadNativeMaxAddressExt = 0x27;
constexpr std::uint8_t SetMaxAddress = 0xF9;
constexpr std::uint8_t SetMaxAddressExt = 0x37;
constexpr std::uint8_t DeviceConfiguration = 0xB1;
} // namespace Code

// Features of DEVICE CONFIGURATION.
namespace DcoFeature {
constexpr std::uint8_t Restore = 0xC0;
constexpr std::uint8_t Identify = 0xC2;
constexpr std::uint8_t Set = 0xC3;
} // namespace DcoFeature

enum class Direction { None, In, Out };

struct Command
{
    std::uint8_t command = 0;
    std::uint8_t features = 0;
    // LBA registers: bits 0..23 for any command, bits 24..47 for a 48-bit command; for a
    // 28-bit command bits 24..27 travel in the low nibble of the device register.
    std::uint64_t address = 0;
    // The device register; when given the sector count is 1, otherwise it is 0 and the device
    // register is 0x40.
    std::optional<std::uint8_t> device;
    Direction direction = Direction::None;
    bool ext48 = false;
    std::uint32_t timeOutSeconds = 15;
};

using Request = std::array<std::uint8_t, RequestSize>;

// Builds the request: header, then the data buffer (copied from `dataOut` for a command that
// writes data, zeros otherwise).
Request BuildRequest(const Command &command, const std::uint8_t *dataOut = nullptr);

// Checks an answer of `returned` bytes (the request buffer as the platform gave it back):
// the returned length must be 48 or 560 and the status must have neither the error nor the
// data-request bit. On success `address` receives the LBA registers of the answer.
bool CheckReply(const std::uint8_t *reply, std::uint32_t returned, bool ext48, std::uint64_t &address);

} // namespace Ata
