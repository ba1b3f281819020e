// A whole disk from arbitrary bytes built as a device: the partition scan and the volume of every
// partition (BSD slices included) or of the whole disk, made as the device is constructed, then
// each volume's geometry, integrity and first sectors.
#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    // Mostly a raw disk; a header that names an image format gives that format's handle.
    CImageMemorySource source(QByteArray(reinterpret_cast<const char *>(data), qsizetype(size)));
    QString problem;
    std::unique_ptr<CImageHandle> handle =
        ImageOpen::CreateHandle(nullptr, &source, QStringLiteral("fuzz.img"), problem);
    if (!handle)
        return 0;
    std::unique_ptr<CDevice> device(ImageOpen::BuildDevice(nullptr, std::move(handle), problem));
    if (!device)
        return 0;
    std::vector<uint8_t> buffer(4096);
    device->ForEachVolume([&buffer](CPartition *, CVolume *volume) {
        uint64_t first = 0, last = 0, cluster0 = 0, valid = 0, checked = 0;
        volume->GetClusterRange(first, last, cluster0);
        volume->GetIntegrity(valid, checked);
        (void)volume->GetDisplayName();
        uint32_t error = 0;
        if (volume->GetBytesPerSector() <= buffer.size())
            volume->ReadSectors(0, 1, buffer.data(), error);
    });
    return 0;
}
