#include "ClientFramework/NodeTree/NodeRoot.h"

#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeDevice.h"

#include "Kernel/Implementation/Common/KernelEvents.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QCoreApplication>

NodeRoot::NodeRoot(CRoot *root, QObject *parent) : QObject(parent), NodeStatic(nullptr), m_root(root)
{
    setState(NodeState::Ready | NodeState::Populated);
    m_computer = new NodeComputer(this);
    m_computer->setState(NodeState::Ready);
    appendChild(m_computer);
    if (m_root) {
        // Storage events come from the enumeration thread as queued calls, or directly when the
        // kernel root works on this thread; either way they are handled here.
        connect(m_root, &cRoot::kernelStorage, this, &NodeRoot::onKernelStorage);
        synchronize();
    }
}

NodeRoot::~NodeRoot()
{
    if (m_root)
        disconnect(m_root, nullptr, this, nullptr);
}

QString NodeRoot::name() const
{
    return QCoreApplication::translate("NodeCore", "Local System Root");
}

NodeDevice *NodeRoot::deviceNode(const CDevice *device) const
{
    for (NodeCore *c : children())
        if (c->kind() == NodeKind::Device && static_cast<NodeDevice *>(c)->device() == device)
            return static_cast<NodeDevice *>(c);
    return nullptr;
}

QList<NodeDevice *> NodeRoot::deviceNodes() const
{
    QList<NodeDevice *> list;
    for (NodeCore *c : children())
        if (c->kind() == NodeKind::Device)
            list.append(static_cast<NodeDevice *>(c));
    return list;
}

int NodeRoot::insertRowFor(const CDevice *device) const
{
    // Device nodes follow the kernel's device order, after the computer node.
    const QList<CDevice *> order = m_root ? m_root->Devices() : QList<CDevice *>();
    const qsizetype at = order.indexOf(const_cast<CDevice *>(device));
    int row = 0;
    for (; row < childCount(); ++row) {
        NodeCore *c = child(row);
        if (c->kind() != NodeKind::Device)
            continue;
        const qsizetype other = order.indexOf(static_cast<NodeDevice *>(c)->device());
        if (at >= 0 && other > at)
            break;
    }
    return row;
}

NodeDevice *NodeRoot::addDevice(CDevice *device)
{
    if (!device || deviceNode(device))
        return nullptr;
    // The partition scan announces a device once per partition before the device is listed;
    // only a listed device is ever dereferenced.
    if (m_root && !m_root->Devices().contains(device))
        return nullptr;
    auto *node = new NodeDevice(device, this);
    insertChild(insertRowFor(device), node);
    emit deviceAdded(node);
    if (!node->isReady())
        emit notReadyTip(NodeDevice::permissionTip());
    return node;
}

bool NodeRoot::removeDevice(const CDevice *device)
{
    for (int row = 0; row < childCount(); ++row) {
        NodeCore *c = child(row);
        if (c->kind() == NodeKind::Device && static_cast<NodeDevice *>(c)->device() == device) {
            // Listeners let go of the node, and of what they read through it, while both stand.
            emit deviceRemoved(static_cast<NodeDevice *>(c));
            removeChild(row);
            return true;
        }
    }
    return false;
}

void NodeRoot::synchronize()
{
    if (!m_root)
        return;
    const QList<CDevice *> devices = m_root->Devices();
    for (NodeDevice *n : deviceNodes())
        if (!devices.contains(n->device()))
            removeDevice(n->device());
    for (CDevice *d : devices)
        if (!deviceNode(d))
            addDevice(d);
}

bool NodeRoot::anyNotReady() const
{
    for (NodeDevice *n : deviceNodes())
        if (!n->isReady())
            return true;
    return false;
}

void NodeRoot::onKernelStorage(const _event_storage &event)
{
    switch (event.code) {
    case _event_storage::DeviceAdded:
        addDevice(event.device);
        break;
    case _event_storage::DeviceRemoved:
        removeDevice(event.device);
        break;
    case _event_storage::ChangeCompleted:
        if (NodeDevice *n = deviceNode(event.device)) {
            if (m_root && m_root->Devices().contains(event.device)) {
                n->refreshState();
                n->rebuild();
                n->notifyChanged(true);
            }
        }
        break;
    case _event_storage::EnumerationCompleted:
        synchronize();
        break;
    default:
        break;
    }
}
