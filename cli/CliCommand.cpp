#include "cli/CliCommand.h"

#include "cli/Devices.h"
#include "cli/HwInfo.h"
#include "cli/Image.h"
#include "cli/Partitions.h"
#include "cli/Read.h"
#include "cli/Template.h"
#include "cli/Version.h"
#include "cli/Volumes.h"
#include "cli/Write.h"

namespace Cli {

namespace {

void printHelp(QTextStream &out)
{
    out << "Usage: brindle-cli COMMAND [ARGUMENTS]\n"
           "       brindle-cli --version | --help\n\n"
           "Reads disks, partitions, volumes and disk images through Brindle's disk kernel.\n\n"
           "Commands:\n";
    for (const Command &c : commands()) {
        QString head = QStringLiteral("  %1 %2").arg(QLatin1String(c.name), QLatin1String(c.usage));
        out << head << "\n      " << c.summary << "\n";
    }
}

} // namespace

const QList<Command> &commands()
{
    static const QList<Command> table = {
        // Commands register here, in the order --help lists them.
        {"devices", "[--json]", "Lists the storage devices in kernel order.", &runDevices},
        {"partitions", "SOURCE [--json]", "Lists a device's partition style, partitions and gaps.", &runPartitions},
        {"volumes", "SOURCE [--json]", "Lists the volume of every partition: file system, geometry, label and integrity.", &runVolumes},
        {"hwinfo", "FILE", "Writes the hardware-information report of this machine as XML.", &runHwInfo},
        {"read", "SOURCE --offset N --length N [--raw]", "Prints bytes of a device as a hex dump, or raw.", &runRead},
        {"write", "SOURCE --offset N (--hex HEX | --file PATH) --yes", "Writes bytes to a device or image, whole sectors through the kernel.", &runWrite},
        {"image", "info FILE [--json] | create SOURCE OUTPUT [--level N] [--sectors-per-block N] [--description TEXT] | verify FILE", "Shows, creates (own format) or verifies a disk image.", &runImage},
        {"template", "SOURCE --type ID|NAME --offset N [--copy-offset N] [--json] | SOURCE --auto [--json]", "Prints the field tree of a structure template placed at an offset.", &runTemplate},
    };
    return table;
}

int run(const QStringList &args, Io &io)
{
    if (args.isEmpty()) {
        printHelp(io.err);
        return Usage;
    }
    const QString &first = args.first();
    if (first == QLatin1String("--version") || first == QLatin1String("-version")) {
        io.out << "brindle-cli " << versionText() << "\n";
        return Ok;
    }
    if (first == QLatin1String("--help") || first == QLatin1String("-help") || first == QLatin1String("-h")) {
        printHelp(io.out);
        return Ok;
    }
    for (const Command &c : commands()) {
        if (first == QLatin1String(c.name))
            return c.run(args.mid(1), io);
    }
    io.err << "brindle-cli: unknown command '" << first << "' (see brindle-cli --help)\n";
    return Usage;
}

} // namespace Cli
