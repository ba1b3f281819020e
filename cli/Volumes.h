// brindle-cli volumes: the volume of every partition of a device (nested ones included), or of
// the whole device when it has no partitions: kind, geometry, label, serial number, free space,
// integrity grade and items, and the messages the volume raised.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

namespace Cli {

int runVolumes(const QStringList &args, Io &io);

} // namespace Cli
