// VMDK sparse headers, embedded descriptors, grain directories and tables, and descriptor text
// from arbitrary bytes.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandleVMWare.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    const QByteArray bytes(reinterpret_cast<const char *>(data), qsizetype(size));
    (void)CImageHandle_VMWare::LooksLikeDescriptor(bytes.left(1 << 16));
    CImageMemorySource source(bytes);
    CImageHandle_VMWare handle(nullptr, &source, QStringLiteral("fuzz.vmdk"));
    if (!handle.IsValid())
        return 0;
    std::vector<uint8_t> buffer(64 * 512);
    const uint64_t total = handle.GetTotalSectors();
    for (uint64_t i = 0; i < 16; ++i) {
        uint64_t first = total / 16 * i + (i % 3) * 127;
        if (first >= total)
            continue;
        uint32_t count = uint32_t(std::min<uint64_t>(64, total - first));
        uint32_t error = 0;
        handle.ReadWrite(true, first, count, buffer.data(), error);
    }
    return 0;
}
