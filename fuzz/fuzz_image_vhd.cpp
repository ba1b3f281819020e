// VHD footers, dynamic headers and block tables from arbitrary bytes, then reads of the sectors
// they describe: no read outside the input, no allocation sized by an unchecked field.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    CImageMemorySource source(QByteArray(reinterpret_cast<const char *>(data), qsizetype(size)));
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
