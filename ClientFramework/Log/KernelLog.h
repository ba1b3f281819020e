// Turns the kernel root's records into log entries.
#pragma once

#include "Kernel/Implementation/KernelEvents.h"

#include <QString>

class cRoot;

namespace Framework::KernelLog {

// "Platform Message - %1; File Name: %2; Position: %3; Block: %4; System Error: %5 (%6)".
QString platformText(const _event_platform &record);

// Logs the trace, misuse and platform-failure records of the root (queued to the log's thread).
void connect(cRoot *root);

} // namespace Framework::KernelLog
