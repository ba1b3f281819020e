// brindle-cli template: the field tree of a template placed at an offset of a source, built by the
// same code the hex editor's template pane uses.
#pragma once

#include <QStringList>

#include "cli/CliCommand.h"

namespace Cli {

int runTemplate(const QStringList &args, Io &io);

} // namespace Cli
