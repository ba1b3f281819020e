#include "Kernel/Implementation/Root/ImageOpen.h"

#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Images/ImageHandleRaw.h"
#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Images/ImageHandleVMWare.h"
#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QFileInfo>
#include <QMutex>

#include <cstring>

namespace ImageOpen {

namespace {

constexpr std::uint64_t MaxDescriptorBytes = 1u << 20;

// Serialises the choice of a device number with the insertion of the device.
QMutex &numberMutex()
{
    static QMutex mutex;
    return mutex;
}

bool startsWithCaseless(const QByteArray &bytes, const char *text)
{
    const std::size_t n = std::strlen(text);
    return std::size_t(bytes.size()) >= n && qstrnicmp(bytes.constData(), text, uint(n)) == 0;
}

} // namespace

ImageKind Identify(const QByteArray &head, const QByteArray &tail, std::uint64_t size)
{
    const auto *h = reinterpret_cast<const std::uint8_t *>(head.constData());
    if (head.size() >= 8 && ImageBytes::le64(h) == Tarvo::Magic)
        return ImageKind::OwnImage;
    if (startsWithCaseless(head, "KDMV"))
        return ImageKind::VmWare;
    // The footer at the end, or its copy at the start of a dynamic image (whose overflow files
    // carry the footer at their end).
    if (tail.size() >= 512 && tail.right(512).startsWith("conectix"))
        return ImageKind::VirtualPc;
    if (head.startsWith("conectix") && head.size() >= 512 &&
        CImageHandle_VirtualPC::CheckFooter(reinterpret_cast<const std::uint8_t *>(head.constData())))
        return ImageKind::VirtualPc;
    if (size <= MaxDescriptorBytes && std::uint64_t(head.size()) == size &&
        CImageHandle_VMWare::LooksLikeDescriptor(head))
        return ImageKind::VmWare;
    return ImageKind::RawImage;
}

ImageKind IdentifyFile(cRoot *root, const QString &path)
{
    CPlatformFile file(root, path, PlatformKind::File);
    file.SetWritable(false);
    std::uint64_t size = 0;
    if (!file.Reopen(true) || !file.GetSize(size)) {
        if (file.IsOpened())
            file.Close(false);
        return ImageKind::DataStorageDevice;
    }
    // Small files are read whole (a descriptor is text of any length up to 1 MiB).
    const std::uint64_t headSize = size <= MaxDescriptorBytes ? size : 512;
    QByteArray head(qsizetype(headSize), '\0');
    QByteArray tail(qsizetype(std::min<std::uint64_t>(size, 512)), '\0');
    bool ok = (headSize == 0 || file.Read(0, std::uint32_t(headSize), head.data())) &&
              (tail.isEmpty() ||
               file.Read(size - std::uint64_t(tail.size()), std::uint32_t(tail.size()), tail.data()));
    file.Close(false);
    if (!ok)
        return ImageKind::DataStorageDevice;
    return Identify(head, tail, size);
}

QStringList SplitFiles(const QString &first)
{
    QStringList files{first};
    const QFileInfo info(first);
    const QString suffix = info.suffix();
    bool digits = suffix.size() >= 2;
    for (QChar c : suffix)
        digits = digits && c.isDigit();
    if (!digits)
        return files;
    const QString stem = first.left(first.size() - suffix.size());
    const int width = int(suffix.size());
    for (qint64 n = suffix.toLongLong() + 1; files.size() < 10000; ++n) {
        const QString next = stem + QStringLiteral("%1").arg(n, width, 10, QLatin1Char('0'));
        if (!QFileInfo::exists(next))
            break;
        files << next;
    }
    return files;
}

std::unique_ptr<CImageHandle> CreateHandle(cRoot *root, const QString &path, QString &problem,
                                           std::uint8_t rawSectorShift)
{
    std::unique_ptr<CImageHandle> handle;
    switch (IdentifyFile(root, path)) {
    case ImageKind::OwnImage:
        handle = std::make_unique<CImageHandle_Tarvo>(root, SplitFiles(path));
        break;
    case ImageKind::VirtualPc:
        handle = std::make_unique<CImageHandle_VirtualPC>(root, CImageHandle_VirtualPC::ImageFiles(path));
        break;
    case ImageKind::VmWare:
        handle = std::make_unique<CImageHandle_VMWare>(root, path);
        break;
    case ImageKind::RawImage:
        handle = std::make_unique<CImageHandle_Raw>(root, SplitFiles(path), rawSectorShift);
        break;
    default:
        problem = QStringLiteral("%1 cannot be opened").arg(path);
        return nullptr;
    }
    if (!handle->IsValid()) {
        problem =
            QStringLiteral("%1: %2 refused: %3")
                .arg(path, ImageKindName(handle->GetKind()),
                     handle->GetProblem().isEmpty() ? QStringLiteral("no sectors") : handle->GetProblem());
        return nullptr;
    }
    return handle;
}

std::unique_ptr<CImageHandle> CreateHandle(cRoot *root, cStorage *source, const QString &name,
                                           QString &problem)
{
    if (!source) {
        problem = QStringLiteral("%1 cannot be opened").arg(name);
        return nullptr;
    }
    const std::uint64_t size = source->GetSize();
    const std::uint64_t headSize = size <= MaxDescriptorBytes ? size : 512;
    QByteArray head(qsizetype(headSize), '\0');
    QByteArray tail(qsizetype(std::min<std::uint64_t>(size, 512)), '\0');
    std::uint32_t error = 0;
    if ((headSize && !source->ReadBytes(0, headSize, head.data(), error)) ||
        (!tail.isEmpty() && !source->ReadBytes(size - std::uint64_t(tail.size()), std::uint64_t(tail.size()),
                                               tail.data(), error))) {
        problem = QStringLiteral("%1 cannot be read").arg(name);
        return nullptr;
    }
    std::unique_ptr<CImageHandle> handle;
    switch (Identify(head, tail, size)) {
    case ImageKind::OwnImage:
        handle = std::make_unique<CImageHandle_Tarvo>(root, source, name);
        break;
    case ImageKind::VirtualPc:
        handle = std::make_unique<CImageHandle_VirtualPC>(root, source, name);
        break;
    case ImageKind::VmWare:
        handle = std::make_unique<CImageHandle_VMWare>(root, source, name);
        break;
    default:
        handle = std::make_unique<CImageHandle_Raw>(root, source, name);
        break;
    }
    if (!handle->IsValid()) {
        problem =
            QStringLiteral("%1: %2 refused: %3")
                .arg(name, ImageKindName(handle->GetKind()),
                     handle->GetProblem().isEmpty() ? QStringLiteral("no sectors") : handle->GetProblem());
        return nullptr;
    }
    return handle;
}

CDevice *BuildDevice(CRoot *root, std::unique_ptr<CImageHandle> handle, QString &problem)
{
    if (!handle || !handle->IsValid()) {
        problem = QStringLiteral("image holds no sectors");
        return nullptr;
    }
    DeviceInfo info;
    info.source = EnumSource::PhysicalDrive;
    info.sub = std::uint8_t(handle->GetKind());
    info.mediaType = MediaType::Fixed;
    info.ready = 1;
    info.handle = nullptr;
    handle->Describe(info);
    if (info.model.isEmpty() && !handle->GetFiles().isEmpty())
        info.model = QFileInfo(handle->GetFileNames().first()).fileName();
    info.number = 0;
    if (root) {
        while (info.number < 0xFFFF && root->FindDevice(info.number, info.source, info.sub))
            ++info.number;
    }
    auto *device = new CDevice(root, info, handle.release());
    if (device->GetTotalSectors() == 0) {
        delete device;
        problem = QStringLiteral("image holds no sectors");
        return nullptr;
    }
    return device;
}

CDevice *OpenImage(CRoot *root, const QString &path, QString &problem)
{
    std::unique_ptr<CImageHandle> handle = CreateHandle(root, path, problem);
    if (!handle)
        return nullptr;
    QMutexLocker locker(&numberMutex());
    CDevice *device = BuildDevice(root, std::move(handle), problem);
    if (device && root && !root->AddImageDevice(device)) {
        delete device;
        problem = QStringLiteral("%1 cannot be added").arg(path);
        return nullptr;
    }
    return device;
}

CDevice *OpenFragmented(CRoot *root, const QList<CImageHandle_Fragmented::Piece> &pieces,
                        std::uint64_t totalSectors, QString &problem)
{
    auto handle = std::make_unique<CImageHandle_Fragmented>(root, pieces, totalSectors);
    if (!handle->IsValid()) {
        problem = handle->GetProblem().isEmpty() ? QStringLiteral("no sectors") : handle->GetProblem();
        return nullptr;
    }
    QMutexLocker locker(&numberMutex());
    CDevice *device = BuildDevice(root, std::move(handle), problem);
    if (device && root && !root->AddImageDevice(device)) {
        delete device;
        problem = QStringLiteral("fragmented image cannot be added");
        return nullptr;
    }
    return device;
}

} // namespace ImageOpen
