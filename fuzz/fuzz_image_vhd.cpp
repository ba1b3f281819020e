// VHD footers, dynamic headers and block tables from arbitrary bytes, then reads of the sectors
// they describe: no read outside the input, no allocation sized by an unchecked field.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"

namespace {

std::uint64_t be64(const std::uint8_t *p)
{
    std::uint64_t v = 0;
    for (int i = 0; i < 8; ++i)
        v = v << 8 | p[i];
    return v;
}

void putBe32(std::uint8_t *p, std::uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        p[i] = std::uint8_t(v >> (24 - 8 * i));
}

// The one's complement of the byte sum, the checksum field counted as zeros.
std::uint32_t Checksum(const std::uint8_t *data, std::size_t size, std::size_t checksumAt)
{
    std::uint32_t sum = 0;
    for (std::size_t i = 0; i < size; ++i)
        sum += i >= checksumAt && i < checksumAt + 4 ? 0 : data[i];
    return ~sum;
}

// Makes the checksums right again after mutation: the footer's, its copy at the start of a dynamic
// image and the dynamic header's, so that the structures behind them are reached.
void Repair(std::uint8_t *image, std::size_t size)
{
    using Vhd = CImageHandle_VirtualPC;
    if (size < 2048)
        return;
    std::uint8_t *footer = image + size - Vhd::FooterSize;
    putBe32(footer + 64, Checksum(footer, Vhd::FooterSize, 64));
    const std::uint64_t dataOffset = be64(footer + 16);
    if (dataOffset == ~std::uint64_t(0))
        return;
    std::memcpy(image, footer, Vhd::FooterSize);
    if (dataOffset <= size - Vhd::FooterSize &&
        size - Vhd::FooterSize - dataOffset >= Vhd::DynamicHeaderSize) {
        std::uint8_t *header = image + dataOffset;
        putBe32(header + 36, Checksum(header, Vhd::DynamicHeaderSize, 36));
    }
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 1)
        return 0;
    // Byte 0, bit 0: repair the checksums, so that half of the inputs reach the structures and
    // half still meet the checks. The rest is the image.
    QByteArray bytes(reinterpret_cast<const char *>(data + 1), qsizetype(size - 1));
    if (data[0] & 1)
        Repair(reinterpret_cast<std::uint8_t *>(bytes.data()), std::size_t(bytes.size()));
    CImageMemorySource source(bytes);
    CImageHandle_VirtualPC handle(nullptr, &source, QStringLiteral("fuzz.vhd"));
    if (!handle.IsValid())
        return 0;
    std::vector<uint8_t> buffer(64 * 512);
    const uint64_t total = handle.GetTotalSectors();
    // A few requests spread over the disk, some across block boundaries.
    for (uint64_t i = 0; i < 16; ++i) {
        uint64_t first = total / 16 * i + (i % 3) * 4093;
        if (first >= total)
            continue;
        uint32_t count = uint32_t(std::min<uint64_t>(64, total - first));
        uint32_t error = 0;
        handle.ReadWrite(true, first, count, buffer.data(), error);
    }
    uint32_t error = 0;
    handle.ReadWrite(true, total, 1, buffer.data(), error);
    return 0;
}
