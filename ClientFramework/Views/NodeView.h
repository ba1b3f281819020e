// A view that shows the node tree through its own DiskBrowserModel and filter switches: what the
// Disk Explorer and the File Browser have in common. The selection goes to the window manager,
// context menus and default commands come from the nodes through the command registry, the status
// bar shows "Populating %1" until the last population running has ended, and the filter switches
// are kept in the view's settings element.
#pragma once

#include "ClientFramework/NodeTree/NodeAttr.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/INodeSource.h"

#include <QList>
#include <QModelIndex>
#include <QStringList>

class DiskBrowserModel;
class NodeCore;
class NodeSortFilterModel;
class QAbstractItemView;
class QAction;
class QMenu;
class QPoint;
class QTreeView;

namespace Core {
class Commander;
}

namespace Framework {

class NodeView : public GenericView, public INodeSource
{
    Q_OBJECT
public:
    DiskBrowserModel *model() const { return m_model; }
    NodeSortFilterModel *filterModel() const { return m_filter; }

    // The context menu for the current selection: one node's own, or the one of several nodes.
    void fillContextMenu(QMenu *menu) const;
    // Double-click or Enter: runs the node's default command through the registry.
    virtual bool activate(NodeCore *node);

    QList<QAction *> widgetActions(Menu menu) const override;
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

    // Nodes the trees open at once so the disks and their volumes are in sight.
    static bool expandsAtOnce(const NodeCore *node);

signals:
    // A folder population started ("Populating %1"), or the last one running ended.
    void populationStarted(const QString &text);
    void populationFinished(bool cancelled);

protected:
    NodeView(const QString &viewId, const QString &title, NodeCore *root, Core::Commander *commander,
             const QList<NodeAttr> &columns, QWidget *parent);
    ~NodeView() override;

    Core::Commander *commander() const { return m_commander; }
    // The filter switches of the View menu, in the order of the filters.
    const QList<QAction *> &filterActions() const { return m_filterActions; }
    // The commands of the Actions menu.
    virtual QStringList actionCommands() const = 0;
    // A filter switch was toggled (the filter has the new state already).
    virtual void filtersChanged() {}

    // The node of a row of the filter model, and back (the invisible root has no row).
    NodeCore *nodeAt(const QModelIndex &filterIndex) const;
    QModelIndex filterIndexOf(const NodeCore *node) const;
    // The nodes of the selected rows of a view; map turns a row of that view's model into a node.
    template <typename Map> static QList<NodeCore *> selectedRowNodes(const QAbstractItemView *view, Map map);
    // Makes a row the tree's only selection and current row, its parents expanded and it in sight.
    static void selectRow(QTreeView *tree, const QModelIndex &index);
    // Shows the context menu of the current selection at a point of a view (nothing selected, none).
    void execContextMenu(QAbstractItemView *view, const QPoint &pos);
    // Tells the window manager what is selected now.
    void announceSelection();

private:
    static QList<QModelIndex> selectedRows(const QAbstractItemView *view);

    Core::Commander *m_commander;
    DiskBrowserModel *m_model;
    NodeSortFilterModel *m_filter;
    QList<QAction *> m_filterActions;
    int m_populating = 0;
};

template <typename Map> QList<NodeCore *> NodeView::selectedRowNodes(const QAbstractItemView *view, Map map)
{
    QList<NodeCore *> nodes;
    for (const QModelIndex &i : selectedRows(view))
        if (NodeCore *n = map(i))
            nodes << n;
    return nodes;
}

} // namespace Framework
