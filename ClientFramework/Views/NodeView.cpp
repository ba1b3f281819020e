#include "ClientFramework/Views/NodeView.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeCoreList.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"

#include <QAction>
#include <QItemSelectionModel>
#include <QMenu>
#include <QTreeView>

namespace Framework {

NodeView::NodeView(const QString &viewId, const QString &title, NodeCore *root, Core::Commander *commander,
                   const QList<NodeAttr> &columns, QWidget *parent)
    : GenericView(viewId, title, parent), m_commander(commander), m_model(new DiskBrowserModel(root, this)),
      m_filter(new NodeSortFilterModel(this))
{
    m_model->setColumns(columns);
    m_filter->setSourceModel(m_model);

    // The status bar shows a population until the last one running has ended.
    connect(m_model, &DiskBrowserModel::populationStarted, this, [this](NodeCore *, const QString &text) {
        ++m_populating;
        emit populationStarted(text);
    });
    connect(m_model, &DiskBrowserModel::populationFinished, this, [this](NodeCore *, bool cancelled) {
        m_populating = qMax(0, m_populating - 1);
        if (m_populating == 0)
            emit populationFinished(cancelled);
    });

    for (NodeSortFilterModel::Filter f : NodeSortFilterModel::allFilters()) {
        const QString text = NodeSortFilterModel::filterText(f);
        if (text.isEmpty())
            continue;
        auto *a = new QAction(text, this);
        a->setObjectName(NodeSortFilterModel::filterKey(f));
        a->setCheckable(true);
        a->setChecked(m_filter->filter(f));
        connect(a, &QAction::toggled, this, [this, f](bool on) {
            m_filter->setFilter(f, on);
            filtersChanged();
        });
        m_filterActions << a;
    }
}

NodeView::~NodeView()
{
    m_model->cancelAll();
}

bool NodeView::expandsAtOnce(const NodeCore *node)
{
    return node && (node->kind() == NodeKind::Computer || node->kind() == NodeKind::Device ||
                    node->kind() == NodeKind::Partition);
}

NodeCore *NodeView::nodeAt(const QModelIndex &filterIndex) const
{
    if (!filterIndex.isValid())
        return nullptr;
    return m_model->nodeOf(m_filter->mapToSource(filterIndex));
}

QModelIndex NodeView::filterIndexOf(const NodeCore *node) const
{
    if (!node || node == m_model->rootNode())
        return {};
    return m_filter->mapFromSource(m_model->indexOf(node));
}

QList<QModelIndex> NodeView::selectedRows(const QAbstractItemView *view)
{
    return view->selectionModel()->selectedRows(0);
}

void NodeView::selectRow(QTreeView *tree, const QModelIndex &index)
{
    for (QModelIndex p = index.parent(); p.isValid(); p = p.parent())
        tree->expand(p);
    tree->selectionModel()->setCurrentIndex(index,
                                            QItemSelectionModel::ClearAndSelect | QItemSelectionModel::Rows);
    tree->scrollTo(index);
}

void NodeView::announceSelection()
{
    emit nodeSelectionChanged(selectedNodes());
}

void NodeView::fillContextMenu(QMenu *menu) const
{
    const QList<NodeCore *> nodes = selectedNodes();
    if (nodes.size() == 1)
        nodes.first()->contextMenu(menu);
    else if (nodes.size() > 1)
        NodeCoreList(nodes.cbegin(), nodes.cend()).contextMenu(menu);
}

void NodeView::execContextMenu(QAbstractItemView *view, const QPoint &pos)
{
    if (selectedNodes().isEmpty())
        return;
    QMenu menu(this);
    fillContextMenu(&menu);
    if (!menu.isEmpty())
        menu.exec(view->viewport()->mapToGlobal(pos));
}

bool NodeView::activate(NodeCore *node)
{
    if (!node || !m_commander)
        return false;
    const QString id = node->defaultCommand();
    if (id.isEmpty())
        return false;
    return m_commander->execute(id, {node});
}

QList<QAction *> NodeView::widgetActions(Menu menu) const
{
    if (menu == ViewMenu)
        return m_filterActions;
    if (!m_commander)
        return {};
    // In the Edit menu, "Select All" has its shortcut only while this view is the active one.
    if (menu == EditMenu) {
        if (QAction *a = m_commander->action(QStringLiteral("cmdNode_SelectAll")))
            return {a};
        return {};
    }
    if (menu == ActionsMenu) {
        QList<QAction *> list;
        for (const QString &id : actionCommands())
            if (QAction *a = m_commander->action(id))
                list << a;
        return list;
    }
    return {};
}

void NodeView::save(QDomElement &element, bool flush)
{
    m_filter->save(element, flush);
}

void NodeView::load(const QDomElement &element)
{
    m_filter->load(element);
    for (QAction *a : std::as_const(m_filterActions))
        for (NodeSortFilterModel::Filter f : NodeSortFilterModel::allFilters())
            if (NodeSortFilterModel::filterKey(f) == a->objectName()) {
                const QSignalBlocker block(a);
                a->setChecked(m_filter->filter(f));
            }
}

} // namespace Framework
