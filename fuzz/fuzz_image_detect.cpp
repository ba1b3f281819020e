// Identifying an image format from arbitrary bytes and opening the handle it names, as the
// open-image function does for a file found on a volume.
#include <cstddef>
#include <cstdint>
#include <vector>

#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    const QByteArray bytes(reinterpret_cast<const char *>(data), qsizetype(size));
    (void)ImageOpen::Identify(bytes.left(512), bytes.right(512), uint64_t(size));
    CImageMemorySource source(bytes);
    QString problem;
    std::unique_ptr<CImageHandle> handle =
        ImageOpen::CreateHandle(nullptr, &source, QStringLiteral("fuzz"), problem);
    if (!handle)
        return 0;
    std::vector<uint8_t> buffer(size_t(8) << handle->GetSectorShift());
    uint32_t error = 0;
    handle->ReadWrite(true, 0, uint32_t(std::min<uint64_t>(8, handle->GetTotalSectors())), buffer.data(),
                      error);
    handle->ReadWrite(true, handle->GetTotalSectors() - 1, 1, buffer.data(), error);
    return 0;
}
