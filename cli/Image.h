// brindle-cli image: information on a disk image, creating an own-format image of a source, and
// verifying one. The image opener that lets every SOURCE name an image file is registered here.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

namespace Cli {

int runImage(const QStringList &args, Io &io);

int runImageInfo(const QStringList &args, Io &io);
int runImageCreate(const QStringList &args, Io &io);
int runImageVerify(const QStringList &args, Io &io);

} // namespace Cli
