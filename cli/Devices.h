// brindle-cli devices [--json]: the kernel's devices in kernel order.
#pragma once

#include "CliCommand.h"

namespace Cli {

int runDevices(const QStringList &args, Io &io);

} // namespace Cli
