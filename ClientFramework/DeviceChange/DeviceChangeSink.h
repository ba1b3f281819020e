// What the device-change handler needs from the node tree and the kernel: finding the node of a
// device, its state, and the refreshes it asks for when the postponed timer fires.
#pragma once

#include <QString>

class NodeCore;

namespace Framework::DeviceChange {

class IDeviceChangeSink
{
public:
    virtual ~IDeviceChangeSink() = default;

    // The device node of a platform device path ("/dev/sdb"), or nullptr.
    virtual NodeCore *nodeForPath(const QString &devicePath) = 0;
    // Whether the node is still part of the tree (a pending node may have gone meanwhile).
    virtual bool isAlive(NodeCore *node) = 0;
    virtual QString nodeName(NodeCore *node) = 0;
    // Busy or Waiting.
    virtual bool isBusy(NodeCore *node) = 0;
    // In the list of nodes under processing (a running process works on it).
    virtual bool isUnderProcessing(NodeCore *node) = 0;
    // A validation run of the kernel root is in progress.
    virtual bool isValidating() = 0;

    // Re-populates the node from the kernel (a device whose medium or layout changed, or vanished).
    virtual void repopulate(NodeCore *node) = 0;
    // Identifies and adds a device that appeared at a path.
    virtual void addDevice(const QString &devicePath) = 0;
};

} // namespace Framework::DeviceChange
