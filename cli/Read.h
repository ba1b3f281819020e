// brindle-cli read: bytes of a device through the kernel's byte access, as a hex dump or raw.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

namespace Cli {

int runRead(const QStringList &args, Io &io);

} // namespace Cli
