// brindle-cli hwinfo FILE: the hardware-information report of this machine.
#pragma once

#include "cli/CliCommand.h"

namespace Cli {

int runHwInfo(const QStringList &args, Io &io);

} // namespace Cli
