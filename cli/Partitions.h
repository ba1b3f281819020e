// brindle-cli partitions: a device's partition style and its partitions in device order, logical
// partitions nested under their extended partition, gaps included.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

namespace Cli {

int runPartitions(const QStringList &args, Io &io);

} // namespace Cli
