#include "cli/Image.h"

#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Source.h"

namespace Cli {

namespace {

CDevice *openImageDevice(CRoot &root, const QString &path, QString &error)
{
    return ImageOpen::OpenImage(&root, path, error);
}

// Every SOURCE argument also takes an image file.
const bool g_registered = (registerImageOpener(&openImageDevice), true);

} // namespace

int runImage(const QStringList &args, Io &io)
{
    (void)g_registered;
    const QString sub = args.value(0);
    if (sub == QLatin1String("info"))
        return runImageInfo(args.mid(1), io);
    if (sub == QLatin1String("create"))
        return runImageCreate(args.mid(1), io);
    if (sub == QLatin1String("verify"))
        return runImageVerify(args.mid(1), io);
    io.err << "brindle-cli image: "
           << (sub.isEmpty() ? QStringLiteral("no subcommand given")
                             : QStringLiteral("unknown subcommand '%1'").arg(sub))
           << "\nusage: brindle-cli image info FILE [--json]\n"
              "       brindle-cli image create SOURCE OUTPUT [--level N] [--sectors-per-block N] "
              "[--description TEXT]\n"
              "       brindle-cli image verify FILE\n";
    return Usage;
}

} // namespace Cli
