#include "cli/Source.h"

#include "Kernel/Implementation/Common/RootEnumSource.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QFileInfo>

#include <atomic>

namespace Cli {

namespace {

std::atomic<ImageOpener> g_imageOpener{nullptr};

} // namespace

void registerImageOpener(ImageOpener opener)
{
    g_imageOpener = opener;
}

ImageOpener imageOpener()
{
    return g_imageOpener;
}

CDevice *resolveSource(CRoot &root, const QString &source, QString &error)
{
    error.clear();
    if (source.isEmpty()) {
        error = QStringLiteral("no source given");
        return nullptr;
    }

    if (source.startsWith(QLatin1String("disk:"), Qt::CaseInsensitive)) {
        bool ok = false;
        const uint index = source.mid(5).toUInt(&ok);
        if (!ok) {
            error = QStringLiteral("'%1': the device number after 'disk:' is not a number").arg(source);
            return nullptr;
        }
        if (!root.HasRefreshed() && !root.RefreshAndWait()) {
            error = QStringLiteral("device enumeration did not finish");
            return nullptr;
        }
        CDevice *device = root.GetDevice(index);
        if (!device)
            error = QStringLiteral("'%1': there is no device %2 (%3 devices found)")
                        .arg(source)
                        .arg(index)
                        .arg(root.GetDeviceCount());
        return device;
    }

    // A device path: the listed device, else one identified now.
    EnumCandidate candidate;
    if (root.EnumerationSource().Resolve(source, candidate)) {
        if (CDevice *known = root.FindDeviceByPath(candidate.path))
            return known;
        if (CDevice *known = root.FindDevice(candidate.number, candidate.source, 0))
            return known;
        if (CDevice *added = root.AddDevice(candidate.path))
            return added;
        error = QStringLiteral("'%1': the device has no readable sectors").arg(source);
        return nullptr;
    }
    if (CDevice *known = root.FindDeviceByPath(source))
        return known;

    if (ImageOpener opener = imageOpener()) {
        QString openerError;
        if (CDevice *image = opener(root, source, openerError))
            return image;
        error = openerError.isEmpty()
                    ? QStringLiteral("'%1': not a device or disk image that can be opened").arg(source)
                    : openerError;
        return nullptr;
    }
    if (QFileInfo::exists(source))
        error = QStringLiteral("'%1' is not a storage device (disk images are not supported by this build)")
                    .arg(source);
    else
        error = QStringLiteral("'%1': no such device or file").arg(source);
    return nullptr;
}

} // namespace Cli
