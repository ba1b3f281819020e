// The device-change handler's view of this product: device nodes of the node tree over the kernel
// root, and the kernel requests that bring a changed device up to date.
#pragma once

#include "ClientFramework/DeviceChange/DeviceChangeSink.h"

class CRoot;
class NodeRoot;

namespace Solution {

class DeviceChangeSink : public Framework::DeviceChange::IDeviceChangeSink
{
public:
    DeviceChangeSink(CRoot &kernel, NodeRoot &nodes) : m_kernel(kernel), m_nodes(nodes) {}

    NodeCore *nodeForPath(const QString &devicePath) override;
    bool isAlive(NodeCore *node) override;
    QString nodeName(NodeCore *node) override;
    bool isBusy(NodeCore *node) override;
    bool isUnderProcessing(NodeCore *node) override;
    bool isValidating() override;
    // A device whose medium or layout changed leaves the kernel and is identified again at its
    // path (its partitions read anew); an image device's nodes are rebuilt; the computer node
    // refreshes the whole device list.
    void repopulate(NodeCore *node) override;
    void addDevice(const QString &devicePath) override;

private:
    CRoot &m_kernel;
    NodeRoot &m_nodes;
};

} // namespace Solution
