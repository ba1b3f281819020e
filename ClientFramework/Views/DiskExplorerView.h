// The Disk Explorer ("explorer"): the tree of computer, disks, partitions (with the gaps), volumes
// and folders over the node models, beside it the device map; the nodes' context menus and default
// commands through the command registry; folders populate on expansion on a worker thread.
#pragma once

#include "ClientFramework/Views/NodeView.h"

class QLabel;
class QTreeView;

namespace Framework {

class DeviceMap;

class DiskExplorerView : public NodeView
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("explorer");

    DiskExplorerView(NodeCore *root, Core::Commander *commander, QWidget *parent = nullptr);
    ~DiskExplorerView() override;

    QTreeView *tree() const { return m_tree; }
    DeviceMap *deviceMap() const { return m_map; }
    QLabel *tipLabel() const { return m_tip; }

    // INodeSource
    QList<NodeCore *> selectedNodes() const override;

    // Selects a node (and reveals it).
    bool selectNode(NodeCore *node);
    // Shows a tip above the tree (the rights that reading disks needs); "" hides it.
    void showTip(const QString &tip);

protected:
    QStringList actionCommands() const override;

private:
    QTreeView *m_tree;
    DeviceMap *m_map;
    QLabel *m_tip;
};

} // namespace Framework
