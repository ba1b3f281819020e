// Turns the kernel root's records into log entries.
#pragma once

#include "Kernel/Implementation/Common/KernelEvents.h"

#include <QString>

class cRoot;

namespace Framework {

class Application;

namespace KernelLog {

// "Platform Message - %1; File Name: %2; Position: %3; Block: %4; System Error: %5 (%6)".
QString platformText(const _event_platform &record);

// Which records tell of a normal condition of the machine (a disk the process may not open)
// rather than of a fault. A test left null takes no record for a condition.
struct ConditionTests
{
    bool (*platform)(const _event_platform &record) = nullptr;
    bool (*internal)(const _event_internal &record) = nullptr;
};

// Logs the trace, misuse and platform-failure records of the root (queued to the log's thread), and
// its storage events: "Accessing local devices...", "Data storage detected %1", "Storage removed %1"
// and "Local devices enumeration completed".
// Records the tests take for conditions go through the application's logCondition, warnings that
// leave the exit status alone (plain warnings once the application is gone); every other platform
// failure is an error and every other misuse record a warning.
void connect(cRoot *root, Application *application = nullptr, ConditionTests conditions = {});

} // namespace KernelLog
} // namespace Framework
