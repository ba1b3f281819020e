// The version line of the headless tool: the product's file version and the disk kernel's.
#pragma once

#include <QString>

namespace Cli {

QString versionText();

} // namespace Cli
