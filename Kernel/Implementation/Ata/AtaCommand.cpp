#include "Kernel/Implementation/Ata/AtaCommand.h"

#include "Kernel/Implementation/Common/ByteOrder.h"

#include <cstring>

namespace Ata {

using ByteOrder::putLe16;
using ByteOrder::putLe32;
using ByteOrder::putLe64;

Request BuildRequest(const Command &command, const std::uint8_t *dataOut)
{
    Request r{};
    std::uint8_t *h = r.data();

    std::uint16_t flags = 0;
    if (command.direction == Direction::In)
        flags = Flag::DataIn;
    else if (command.direction == Direction::Out)
        flags = Flag::DataOut;
    if (command.ext48)
        flags |= Flag::Command48Bit;
    const bool withData = command.direction != Direction::None;

    putLe16(h + Offset::Length, HeaderSize);
    putLe16(h + Offset::Flags, flags);
    putLe32(h + Offset::TransferLength, withData ? DataSize : 0);
    putLe32(h + Offset::TimeOut, command.timeOutSeconds);
    putLe64(h + Offset::DataBufferOffset, HeaderSize);

    std::uint8_t *cur = h + Offset::CurrentTaskFile;
    cur[Reg::Features] = command.features;
    cur[Reg::SectorCount] = command.device ? 1 : 0;
    cur[Reg::LbaLow] = std::uint8_t(command.address);
    cur[Reg::LbaMid] = std::uint8_t(command.address >> 8);
    cur[Reg::LbaHigh] = std::uint8_t(command.address >> 16);
    std::uint8_t device = command.device ? *command.device : 0x40;
    if (command.ext48) {
        std::uint8_t *prev = h + Offset::PreviousTaskFile;
        prev[Reg::LbaLow] = std::uint8_t(command.address >> 24);
        prev[Reg::LbaMid] = std::uint8_t(command.address >> 32);
        prev[Reg::LbaHigh] = std::uint8_t(command.address >> 40);
    } else {
        // A 28-bit address keeps its top four bits in the device register.
        device = std::uint8_t((device & 0xF0) | ((command.address >> 24) & 0x0F));
    }
    cur[Reg::Device] = device;
    cur[Reg::Command] = command.command;

    if (command.direction == Direction::Out && dataOut)
        std::memcpy(h + HeaderSize, dataOut, DataSize);
    return r;
}

bool CheckReply(const std::uint8_t *reply, std::uint32_t returned, bool ext48, std::uint64_t &address)
{
    address = 0;
    if (returned != HeaderSize && returned != RequestSize)
        return false;
    const std::uint8_t *cur = reply + Offset::CurrentTaskFile;
    const std::uint8_t status = cur[Reg::Command];
    if (status & (StatusError | StatusDataRequest))
        return false;
    address = std::uint64_t(cur[Reg::LbaLow]) | std::uint64_t(cur[Reg::LbaMid]) << 8 |
              std::uint64_t(cur[Reg::LbaHigh]) << 16;
    if (ext48) {
        const std::uint8_t *prev = reply + Offset::PreviousTaskFile;
        address |= std::uint64_t(prev[Reg::LbaLow]) << 24 | std::uint64_t(prev[Reg::LbaMid]) << 32 |
                   std::uint64_t(prev[Reg::LbaHigh]) << 40;
    } else {
        address |= std::uint64_t(cur[Reg::Device] & 0x0F) << 24;
    }
    return true;
}

} // namespace Ata
