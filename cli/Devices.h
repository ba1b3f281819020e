// brindle-cli devices [--json]: the kernel's devices in kernel order.
#pragma once

#include "cli/CliCommand.h"

#include <QJsonObject>

class CDevice;

namespace Cli {

// One device as an object of the --json list, and as the text block "disk:INDEX ...".
QJsonObject DeviceJson(CDevice *device);
void PrintDevice(QTextStream &out, uint32_t index, CDevice *device);

int runDevices(const QStringList &args, Io &io);

} // namespace Cli
