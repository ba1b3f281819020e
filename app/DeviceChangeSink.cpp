#include "app/DeviceChangeSink.h"

#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

namespace Solution {

namespace {

QString platformPath(const CDevice *device)
{
    CPlatformFile *handle = device ? device->GetHandle() : nullptr;
    return handle ? handle->GetName() : QString();
}

} // namespace

NodeCore *DeviceChangeSink::nodeForPath(const QString &devicePath)
{
    if (devicePath.isEmpty())
        return nullptr;
    if (CDevice *device = m_kernel.FindDeviceByPath(devicePath))
        if (NodeDevice *node = m_nodes.deviceNode(device))
            return node;
    for (NodeDevice *d : m_nodes.deviceNodes())
        if (d->device() && platformPath(d->device()) == devicePath)
            return d;
    return nullptr;
}

bool DeviceChangeSink::isAlive(NodeCore *node)
{
    if (node == m_nodes.computer())
        return true;
    for (NodeDevice *d : m_nodes.deviceNodes())
        if (d == node)
            return true;
    return false;
}

QString DeviceChangeSink::nodeName(NodeCore *node)
{
    return node ? node->text(NodeAttr::Name) : QString();
}

bool DeviceChangeSink::isBusy(NodeCore *node)
{
    return node && (node->state() & (NodeState::Busy | NodeState::Waiting));
}

bool DeviceChangeSink::isUnderProcessing(NodeCore *node)
{
    return node && (node->state() & NodeState::Busy);
}

bool DeviceChangeSink::isValidating()
{
    return m_kernel.IsEnumerating();
}

void DeviceChangeSink::repopulate(NodeCore *node)
{
    if (node == m_nodes.computer()) {
        m_kernel.Refresh();
        return;
    }
    auto *d = dynamic_cast<NodeDevice *>(node);
    if (!d || !d->device())
        return;
    CDevice *device = d->device();
    // Identified again on the enumeration thread: the same medium keeps its device (and every
    // view over it) and has its tables read again, a changed one is replaced.
    m_kernel.RequestDeviceRefresh(device);
}

void DeviceChangeSink::addDevice(const QString &devicePath)
{
    if (!m_kernel.FindDeviceByPath(devicePath))
        m_kernel.RequestAdd(devicePath);
}

} // namespace Solution
