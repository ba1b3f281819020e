// The command-line action's host over the disk kernel: the hardware report and mounted images.
// Finding device and file nodes needs the node tree, which this host does not have yet, so those
// requests still find nothing.
#pragma once

#include "RequestHost.h"

class CRoot;

namespace CLI {

class KernelHost : public NoKernelHost
{
public:
    explicit KernelHost(CRoot &root) : m_root(root) {}

    // Enumerates the machine's storage and writes the report; the outcome is logged.
    bool saveHardwareInfo(const QString &fileName) override;

    // Opens an image file (any supported format) and adds it to the kernel as a virtual disk.
    bool mountImage(const QString &path);

private:
    CRoot &m_root;
};

} // namespace CLI
