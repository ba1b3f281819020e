#include "Kernel/Implementation/Devices/DeviceImage.h"

#include "Kernel/Implementation/Images/ImageHandle.h"

namespace DeviceImage {

bool Transfer(CImageHandle *image, bool read, std::uint64_t first, std::uint32_t count, void *buffer,
              std::uint32_t &error)
{
    return image->ReadWrite(read, first, count, buffer, error);
}

bool Flush(CImageHandle *image, std::uint32_t &error)
{
    return image->Flush(error);
}

bool IsWritable(const CImageHandle *image)
{
    return image->IsWritable();
}

QStringList FileNames(const CImageHandle *image)
{
    return image->GetFileNames();
}

void Destroy(CImageHandle *image)
{
    delete image;
}

} // namespace DeviceImage
