// The disk kernel's own version, printed in the start-up log, image headers and the hardware report.
#pragma once

#include <QString>

namespace Kernel {

// "14.04.23": the text the kernel reports as its version.
QString version();

} // namespace Kernel
