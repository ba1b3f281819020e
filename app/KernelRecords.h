// The kernel root's records in the application log, with this product's reading of them: a disk
// the process may not open (no rights, in use elsewhere, no medium) is a normal condition of the
// machine, logged as a warning that leaves the exit status alone; every other platform failure is
// an error and every other misuse record a warning, as before.
#pragma once

#include "Kernel/Implementation/Common/KernelEvents.h"

class cRoot;

namespace Framework {
class Application;
}

namespace Solution::KernelRecords {

// Whether a platform record tells of a device that could not be opened for a normal reason.
bool isUnopenableDevice(const _event_platform &record);
// Whether a kernel message reports a device that is not ready.
bool isNotReadyDevice(const _event_internal &record);

// Logs the records of the root (queued to the log's thread); conditions go through the
// application when there is one.
void connect(cRoot *root, Framework::Application *application);

} // namespace Solution::KernelRecords
