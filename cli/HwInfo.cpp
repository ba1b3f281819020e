#include "cli/HwInfo.h"

#include "cli/Version.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Report/HardwareInfo.h"
#include "Kernel/Implementation/Root/Root.h"

namespace Cli {

int runHwInfo(const QStringList &args, Io &io)
{
    if (args.size() != 1 || args.first().startsWith(QLatin1Char('-'))) {
        io.err << "Usage: brindle-cli hwinfo FILE\n";
        return Usage;
    }
    const QString target = args.first();
    CRoot root;
    if (!root.RefreshAndWait()) {
        io.err << "brindle-cli hwinfo: device enumeration did not finish\n";
        return Failed;
    }
    std::uint32_t error = 0;
    if (!HardwareInfo::Write(root, target, QString(), QStringLiteral("brindle-cli %1").arg(versionText()), {},
                             error)) {
        io.err << "brindle-cli hwinfo: cannot write " << target << ": "
               << QStringLiteral("Error [%1]: %2").arg(error).arg(systemErrorText(error)) << "\n";
        return Failed;
    }
    io.out << "Hardware report of " << root.GetDeviceCount() << " devices written to " << target << "\n";
    return Ok;
}

} // namespace Cli
