// Own-format headers, string blocks, group tables, group records and zlib blocks from arbitrary
// bytes: reads and a full verification stay inside the input and end.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    CImageMemorySource source(QByteArray(reinterpret_cast<const char *>(data), qsizetype(size)));
    CImageHandle_Tarvo handle(nullptr, &source, QStringLiteral("fuzz.tdi"));
    if (!handle.IsValid())
        return 0;
    const uint64_t total = handle.GetTotalSectors();
    std::vector<uint8_t> buffer(size_t(32) << handle.GetSectorShift());
    for (uint64_t i = 0; i < 8; ++i) {
        uint64_t first = total / 8 * i;
        uint32_t count = uint32_t(std::min<uint64_t>(32, total - first));
        uint32_t error = 0;
        handle.ReadWrite(true, first, count, buffer.data(), error);
    }
    QString problem;
    handle.Verify({}, problem);
    return 0;
}
