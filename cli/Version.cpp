#include "cli/Version.h"

#include "Kernel/Implementation/Common/KernelVersion.h"

namespace Cli {

QString versionText()
{
    return QStringLiteral("24.0.25 (kernel %1)").arg(Kernel::version());
}

} // namespace Cli
