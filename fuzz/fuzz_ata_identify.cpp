// Identify data, configuration overlay blocks and pass-through answers from arbitrary bytes: no
// read outside the buffers whatever the drive answers.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "Kernel/Implementation/Ata/AtaCommand.h"
#include "Kernel/Implementation/Ata/AtaIdentify.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    std::vector<std::uint8_t> block(AtaIdentify::Size, 0);
    std::memcpy(block.data(), data, std::min(size, block.size()));
    bool uses48 = false;
    (void)AtaIdentify::AccessibleSectors(block.data(), uses48);
    QString model, firmware, serial;
    (void)AtaIdentify::Strings(block.data(), model, firmware, serial);
    (void)AtaIdentify::DcoChecksumValid(block.data());
    (void)AtaIdentify::DcoMaxAddress(block.data());

    // Answers arrive in buffers of the request's size; the returned count is the drive's word.
    std::vector<std::uint8_t> answer(AtaIdentify::ScsiRequestSize, 0);
    std::memcpy(answer.data(), data, std::min(size, answer.size()));
    const std::uint32_t returned = size >= 4 ? std::uint32_t(data[0] | data[1] << 8) : 0;
    std::uint8_t identify[AtaIdentify::Size];
    (void)AtaIdentify::ParseAtaInfoReply(answer.data(), returned, identify);
    std::uint64_t address = 0;
    (void)Ata::CheckReply(answer.data(), returned, size & 1, address);
    return 0;
}
