// The Disk Explorer ("explorer"): the tree of computer, disks, partitions (with the gaps), volumes
// and folders over the node models, beside it the device map; the nodes' context menus and default
// commands through the command registry; folders populate on expansion on a worker thread.
#pragma once

#include "Views/GenericView.h"
#include "Views/INodeSource.h"

class DiskBrowserModel;
class NodeSortFilterModel;
class QLabel;
class QTreeView;

namespace Core {
class Commander;
}

namespace Framework {

class DeviceMap;

class DiskExplorerView : public GenericView, public INodeSource
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("explorer");

    DiskExplorerView(NodeCore *root, Core::Commander *commander, QWidget *parent = nullptr);
    ~DiskExplorerView() override;

    QTreeView *tree() const { return m_tree; }
    DeviceMap *deviceMap() const { return m_map; }
    DiskBrowserModel *model() const { return m_model; }
    NodeSortFilterModel *filterModel() const { return m_filter; }
    QLabel *tipLabel() const { return m_tip; }

    // INodeSource
    QList<NodeCore *> selectedNodes() const override;

    // Selects a node (and reveals it).
    bool selectNode(NodeCore *node);
    // The context menu the tree shows for the current selection.
    void fillContextMenu(QMenu *menu) const;
    // Runs the default command of a node through the registry.
    bool activate(NodeCore *node);
    // Shows a tip above the tree (the rights that reading disks needs); "" hides it.
    void showTip(const QString &tip);

    QList<QAction *> widgetActions(Menu menu) const override;
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

signals:
    // A folder population started ("Populating %1") or ended.
    void populationStarted(const QString &text);
    void populationFinished(bool cancelled);

private:
    NodeCore *nodeAt(const QModelIndex &proxyIndex) const;

    NodeCore *m_root;
    Core::Commander *m_commander;
    DiskBrowserModel *m_model;
    NodeSortFilterModel *m_filter;
    QTreeView *m_tree;
    DeviceMap *m_map;
    QLabel *m_tip;
    QList<QAction *> m_filterActions;
};

} // namespace Framework
