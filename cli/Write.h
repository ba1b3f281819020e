// brindle-cli write: bytes written to a device or image through the kernel, whole sectors only
// (partial sectors are read, patched and written back), after an explicit --yes.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

class CRoot;

namespace Cli {

int runWrite(const QStringList &args, Io &io);
// The same over a given kernel root.
int runWrite(const QStringList &args, Io &io, CRoot &root);

} // namespace Cli
