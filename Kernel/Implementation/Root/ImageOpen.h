// Opening disk images: the format of a file is identified from its content, the matching image
// handle is made, and an image-backed device is built on it and added to the kernel root.
#pragma once

#include <QByteArray>
#include <QString>
#include <QStringList>
#include <cstdint>
#include <memory>

#include "Kernel/Implementation/Images/ImageHandleFragmented.h"

class CDevice;
class CImageHandle;
class CRoot;
class cRoot;
class cStorage;

namespace ImageOpen {

// The format that the first bytes (up to 512), the last bytes (up to 512) and the size of a
// file show: OwnImage, VirtualPc, VmWare, or RawImage for anything else.
ImageKind Identify(const QByteArray &head, const QByteArray &tail, std::uint64_t size);
// The same for a file; DataStorageDevice when the file cannot be read.
ImageKind IdentifyFile(cRoot *root, const QString &path);

// The files of a split image given its first file: a name whose extension is all digits
// ("disk.001") is followed by the next numbers of the same width that exist beside it.
QStringList SplitFiles(const QString &first);

// Makes the handle for an image file (a split raw image by its first file; a VHD with its
// overflow files). Null with a reason when the file cannot be opened or is not sound.
std::unique_ptr<CImageHandle> CreateHandle(cRoot *root, const QString &path, QString &problem,
                                           std::uint8_t rawSectorShift = 9);
// The same for an image file that lies on a kernel volume (read-only).
std::unique_ptr<CImageHandle> CreateHandle(cRoot *root, cStorage *source, const QString &name,
                                           QString &problem);

// Builds an image-backed device on a sound handle (the device owns it), with a number no
// other image device of the root has. Null (the handle destroyed) when it holds no sectors.
CDevice *BuildDevice(CRoot *root, std::unique_ptr<CImageHandle> handle, QString &problem);

// Identifies, opens and adds the image at path to the root, announced like any device.
// Null with a reason when the image is refused.
CDevice *OpenImage(CRoot *root, const QString &path, QString &problem);
// Adds a fragmented image of pieces placed at given sectors.
CDevice *OpenFragmented(CRoot *root, const QList<CImageHandle_Fragmented::Piece> &pieces,
                        std::uint64_t totalSectors, QString &problem);

} // namespace ImageOpen
