// brindle-cli hwinfo FILE: the hardware-information report of this machine.
#pragma once

#include "CliCommand.h"

namespace Cli {

int runHwInfo(const QStringList &args, Io &io);

} // namespace Cli
