// The invisible root of the node tree ("Local System Root"): built over the kernel root, it holds
// the computer node and one device node per kernel device (computer first, devices in the
// kernel's order after it), and adds and removes device nodes as the kernel announces devices
// arriving and leaving. The kernel's storage events reach it on the interface thread.
#pragma once

#include "ClientFramework/NodeTree/NodeCore.h"

#include <QObject>

class CRoot;
class CDevice;
class NodeComputer;
class NodeDevice;
struct _event_storage;

class NodeRoot : public QObject, public NodeStatic
{
    Q_OBJECT
public:
    explicit NodeRoot(CRoot *root, QObject *parent = nullptr);
    ~NodeRoot() override;

    // The node tree's meaning of these names, not QObject's.
    using NodeStatic::children;
    using NodeStatic::parent;
    using NodeStatic::property;

    NodeKind kind() const override { return NodeKind::Root; }
    CRoot *kernelRoot() const { return m_root; }
    NodeComputer *computer() const { return m_computer; }

    // The device node of a kernel device, or null.
    NodeDevice *deviceNode(const CDevice *device) const;
    QList<NodeDevice *> deviceNodes() const;

    // Adds a node for a listed kernel device that has none yet (returns it, or null).
    NodeDevice *addDevice(CDevice *device);
    // Removes and destroys the node of a device (the device itself may already be gone: only
    // the pointer is compared). deviceRemoved goes out first, while the node still stands.
    bool removeDevice(const CDevice *device);
    // Brings the device nodes in line with the kernel's device list.
    void synchronize();

    // Whether some device could not be opened (for the "needs root" tip).
    bool anyNotReady() const;

public slots:
    void onKernelStorage(const _event_storage &event);

signals:
    void deviceAdded(NodeDevice *node);
    // The node of a leaving device, about to be destroyed with every node below it.
    void deviceRemoved(NodeDevice *node);
    // A device could not be opened (permissions): the tip text to show.
    void notReadyTip(const QString &tip);

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("root"); }
    QString key() const override { return QStringLiteral("root"); }

private:
    int insertRowFor(const CDevice *device) const;

    CRoot *m_root = nullptr;
    NodeComputer *m_computer = nullptr;
};
