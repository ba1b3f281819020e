// brindle-cli image verify: inflates every block of an own-format image and checks its sums.
#include "cli/Image.h"

#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

namespace Cli {

int runImageVerify(const QStringList &args, Io &io)
{
    if (args.size() != 1 || args.first().startsWith(QLatin1String("--"))) {
        io.err << "usage: brindle-cli image verify FILE\n";
        return Usage;
    }
    const QString file = args.first();
    const ImageKind kind = ImageOpen::IdentifyFile(nullptr, file);
    if (kind != ImageKind::OwnImage) {
        io.err << "brindle-cli image verify: " << file
               << (kind == ImageKind::DataStorageDevice
                       ? QStringLiteral(" cannot be read")
                       : QStringLiteral(" is not a %1").arg(ImageKindName(ImageKind::OwnImage)))
               << "\n";
        return Failed;
    }
    CImageHandle_Tarvo handle(nullptr, ImageOpen::SplitFiles(file));
    if (!handle.IsValid()) {
        io.err << "brindle-cli image verify: " << file << " is damaged: " << handle.GetProblem() << "\n";
        return Failed;
    }
    int lastPercent = -1;
    QString problem;
    const bool sound = handle.Verify(
        [&](std::uint64_t done, std::uint64_t all) {
            const int percent = int(done * 100 / all);
            if (percent != lastPercent) {
                lastPercent = percent;
                io.err << "\rVerifying image: " << percent << "%";
                io.err.flush();
            }
            return true;
        },
        problem);
    io.err << "\n";
    if (!sound) {
        io.out << file << ": damaged: " << problem << "\n";
        return Failed;
    }
    io.out << file << ": sound (" << handle.GetHeader().Blocks() << " blocks, " << handle.GetTotalSectors()
           << " sectors)\n";
    return Ok;
}

} // namespace Cli
