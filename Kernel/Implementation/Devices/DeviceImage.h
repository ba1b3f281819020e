// The device's view of an image handle, kept in a file of its own so the device code needs
// only a forward declaration of the handle.
#pragma once

#include <QStringList>
#include <cstdint>

class CImageHandle;

namespace DeviceImage {

bool Transfer(CImageHandle *image, bool read, std::uint64_t first, std::uint32_t count, void *buffer,
              std::uint32_t &error);
bool IsWritable(const CImageHandle *image);
bool Flush(CImageHandle *image, std::uint32_t &error);
QStringList FileNames(const CImageHandle *image);
void Destroy(CImageHandle *image);

} // namespace DeviceImage
