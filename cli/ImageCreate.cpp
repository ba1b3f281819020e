// brindle-cli image create: an own-format image of a device, partition source or image file.
#include "cli/Image.h"

#include <QElapsedTimer>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Images/TarvoWriter.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Source.h"

namespace Cli {

namespace {

int usage(Io &io, const QString &problem)
{
    io.err << "brindle-cli image create: " << problem << "\n"
           << "usage: brindle-cli image create SOURCE OUTPUT [--level N] [--sectors-per-block N] "
              "[--description TEXT]\n";
    return Usage;
}

} // namespace

int runImageCreate(const QStringList &args, Io &io)
{
    QStringList positional;
    TarvoWriteOptions options;
    for (int i = 0; i < args.size(); ++i) {
        const QString &a = args[i];
        if (a == QLatin1String("--level") || a == QLatin1String("--sectors-per-block") ||
            a == QLatin1String("--description")) {
            if (i + 1 >= args.size())
                return usage(io, QStringLiteral("%1 needs a value").arg(a));
            const QString value = args[++i];
            bool ok = true;
            if (a == QLatin1String("--level")) {
                options.level = value.toInt(&ok);
                if (!ok || options.level < 0 || options.level > 9)
                    return usage(io, QStringLiteral("the level must be 0 to 9"));
            } else if (a == QLatin1String("--sectors-per-block")) {
                options.sectorsPerBlock = value.toUInt(&ok);
                if (!ok || options.sectorsPerBlock == 0)
                    return usage(io, QStringLiteral("sectors per block must be a positive number"));
            } else {
                options.description = value;
            }
        } else if (a.startsWith(QLatin1String("--"))) {
            return usage(io, QStringLiteral("unknown option '%1'").arg(a));
        } else {
            positional << a;
        }
    }
    if (positional.size() != 2)
        return usage(io, QStringLiteral("SOURCE and OUTPUT are required"));

    CRoot root;
    QString error;
    CDevice *device = resolveSource(root, positional[0], error);
    if (!device) {
        io.err << "brindle-cli image create: " << error << "\n";
        return Failed;
    }
    std::uint8_t shift = 0;
    while ((1u << shift) < device->GetBytesPerSector() && shift < 31)
        ++shift;
    if ((std::uint64_t(options.sectorsPerBlock) << shift) > (1u << 24))
        return usage(io,
                     QStringLiteral("the block (sectors per block x sector size) must not exceed 16 MiB"));
    options.mediaType = std::uint32_t(device->GetMediaType());
    options.model = device->GetModel();
    options.identity = device->GetDisplayName();
    options.serial = device->GetSerial(0);
    options.sectorsPerTrack = device->GetSectorsPerTrack();
    options.tracksPerCylinder = device->GetTracksPerCylinder();

    const std::uint64_t total = device->GetTotalSectors();
    QElapsedTimer timer;
    timer.start();
    int lastPercent = -1;
    auto progress = [&](std::uint64_t done, std::uint64_t all) {
        const int percent = int(done * 100 / all);
        if (percent != lastPercent) {
            lastPercent = percent;
            io.err << "\rCreating image: " << percent << "% (" << done << " of " << all << " sectors)";
            io.err.flush();
        }
        return true;
    };
    auto read = [device](std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &err) {
        return device->ReadSectors(first, count, buffer, err);
    };
    CTarvoWriter writer(&root, options);
    const bool ok = writer.Write(positional[1], shift, total, read, progress);
    io.err << "\n";
    if (!ok) {
        io.err << "brindle-cli image create: " << writer.Problem() << "\n";
        return Failed;
    }
    const double seconds = std::max<qint64>(timer.elapsed(), 1) / 1000.0;
    io.out << "Created " << positional[1] << ": " << total << " sectors, " << writer.BytesWritten()
           << " bytes ("
           << QString::number(100.0 * double(writer.BytesWritten()) / double(total << shift), 'f', 1)
           << "% of the source) in " << QString::number(seconds, 'f', 2) << " s\n";
    return Ok;
}

} // namespace Cli
