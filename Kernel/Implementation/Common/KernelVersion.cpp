#include "Kernel/Implementation/Common/KernelVersion.h"

namespace Kernel {

QString version()
{
    return QStringLiteral("14.04.23");
}

} // namespace Kernel
