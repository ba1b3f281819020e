#include "DiskExplorerView.h"

#include "Commands/Commander.h"
#include "NodeTree/DiskBrowserModel.h"
#include "NodeTree/NodeCoreList.h"
#include "NodeTree/NodeSortFilterModel.h"
#include "Views/DeviceMap.h"

#include <QAction>
#include <QHeaderView>
#include <QLabel>
#include <QMenu>
#include <QScrollArea>
#include <QSplitter>
#include <QTreeView>
#include <QVBoxLayout>

namespace Framework {

DiskExplorerView::DiskExplorerView(NodeCore *root, Core::Commander *commander, QWidget *parent)
    : GenericView(ViewId, tr("Disk Explorer"), parent), m_root(root), m_commander(commander),
      m_model(new DiskBrowserModel(root, this)), m_filter(new NodeSortFilterModel(this)),
      m_tree(new QTreeView), m_map(new DeviceMap), m_tip(new QLabel)
{
    m_model->setColumns({NodeAttr::Name, NodeAttr::Kind, NodeAttr::Size, NodeAttr::Status});
    m_filter->setSourceModel(m_model);

    m_tree->setObjectName(QStringLiteral("explorerTree"));
    m_tree->setModel(m_filter);
    m_tree->setSelectionMode(QAbstractItemView::ExtendedSelection);
    m_tree->setExpandsOnDoubleClick(false);
    m_tree->setUniformRowHeights(true);
    m_tree->setAlternatingRowColors(true);
    m_tree->setContextMenuPolicy(Qt::CustomContextMenu);
    m_tree->header()->setStretchLastSection(true);
    m_tree->setColumnWidth(0, 320);
    m_tree->setColumnWidth(1, 110);
    m_tree->setColumnWidth(2, 90);

    m_tip->setObjectName(QStringLiteral("notReadyTip"));
    m_tip->setWordWrap(true);
    m_tip->setStyleSheet(QStringLiteral("QLabel { background: #FFF4CE; color: #5C4500; padding: 4px; "
                                        "border-bottom: 1px solid #E0C060; }"));
    m_tip->hide();

    m_map->setRoot(root, m_model);
    auto *mapScroll = new QScrollArea;
    mapScroll->setObjectName(QStringLiteral("deviceMapArea"));
    mapScroll->setWidgetResizable(true);
    mapScroll->setWidget(m_map);

    auto *splitter = new QSplitter(Qt::Vertical);
    splitter->addWidget(m_tree);
    splitter->addWidget(mapScroll);
    splitter->setStretchFactor(0, 3);
    splitter->setStretchFactor(1, 2);
    splitter->setSizes({360, 200});
    auto *page = new QWidget;
    auto *layout = new QVBoxLayout(page);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(0);
    layout->addWidget(m_tip);
    layout->addWidget(splitter, 1);
    setCentralWidget(page);

    // Disks show their partitions at once; folders wait for expansion.
    m_tree->expandToDepth(1);
    connect(m_filter, &QAbstractItemModel::rowsInserted, this,
            [this](const QModelIndex &parent, int first, int last) {
                NodeCore *p = nodeAt(parent);
                if (parent.isValid() && p && p->kind() != NodeKind::Device &&
                    p->kind() != NodeKind::Partition)
                    return;
                for (int row = first; row <= last; ++row) {
                    const QModelIndex index = m_filter->index(row, 0, parent);
                    NodeCore *n = nodeAt(index);
                    if (n && (n->kind() == NodeKind::Device || n->kind() == NodeKind::Partition ||
                              n->kind() == NodeKind::Computer))
                        m_tree->expand(index);
                }
            });
    connect(m_tree->selectionModel(), &QItemSelectionModel::selectionChanged, this, [this] {
        const QList<NodeCore *> nodes = selectedNodes();
        m_map->setSelectedNode(nodes.isEmpty() ? nullptr : nodes.constFirst());
        emit nodeSelectionChanged(nodes);
    });
    // Removed rows leave the selection without a selection signal: announce what is left.
    connect(m_filter, &QAbstractItemModel::rowsRemoved, this,
            [this] { emit nodeSelectionChanged(selectedNodes()); });
    connect(m_tree, &QTreeView::activated, this,
            [this](const QModelIndex &index) { activate(nodeAt(index)); });
    connect(m_tree, &QWidget::customContextMenuRequested, this, [this](const QPoint &pos) {
        if (selectedNodes().isEmpty())
            return;
        QMenu menu(this);
        fillContextMenu(&menu);
        if (!menu.isEmpty())
            menu.exec(m_tree->viewport()->mapToGlobal(pos));
    });
    connect(m_map, &DeviceMap::nodeClicked, this, [this](NodeCore *n) { selectNode(n); });
    connect(m_map, &DeviceMap::nodeActivated, this, [this](NodeCore *n) {
        selectNode(n);
        activate(n);
    });
    connect(m_model, &DiskBrowserModel::populationStarted, this,
            [this](NodeCore *, const QString &text) { emit populationStarted(text); });
    connect(m_model, &DiskBrowserModel::populationFinished, this,
            [this](NodeCore *, bool cancelled) { emit populationFinished(cancelled); });

    for (NodeSortFilterModel::Filter f : NodeSortFilterModel::allFilters()) {
        const QString text = NodeSortFilterModel::filterText(f);
        if (text.isEmpty())
            continue;
        auto *a = new QAction(text, this);
        a->setObjectName(NodeSortFilterModel::filterKey(f));
        a->setCheckable(true);
        a->setChecked(m_filter->filter(f));
        connect(a, &QAction::toggled, this, [this, f](bool on) { m_filter->setFilter(f, on); });
        m_filterActions << a;
    }
}

DiskExplorerView::~DiskExplorerView()
{
    m_model->cancelAll();
}

NodeCore *DiskExplorerView::nodeAt(const QModelIndex &proxyIndex) const
{
    if (!proxyIndex.isValid())
        return nullptr;
    return m_model->nodeOf(m_filter->mapToSource(proxyIndex));
}

QList<NodeCore *> DiskExplorerView::selectedNodes() const
{
    QList<NodeCore *> nodes;
    for (const QModelIndex &i : m_tree->selectionModel()->selectedRows(0))
        if (NodeCore *n = nodeAt(i))
            nodes << n;
    return nodes;
}

bool DiskExplorerView::selectNode(NodeCore *node)
{
    const QModelIndex source = m_model->indexOf(node);
    const QModelIndex index = m_filter->mapFromSource(source);
    if (!index.isValid())
        return false;
    for (QModelIndex p = index.parent(); p.isValid(); p = p.parent())
        m_tree->expand(p);
    m_tree->selectionModel()->setCurrentIndex(index, QItemSelectionModel::ClearAndSelect |
                                                         QItemSelectionModel::Rows);
    m_tree->scrollTo(index);
    return true;
}

void DiskExplorerView::fillContextMenu(QMenu *menu) const
{
    const QList<NodeCore *> nodes = selectedNodes();
    if (nodes.size() == 1)
        nodes.first()->contextMenu(menu);
    else if (nodes.size() > 1)
        NodeCoreList(nodes.cbegin(), nodes.cend()).contextMenu(menu);
}

bool DiskExplorerView::activate(NodeCore *node)
{
    if (!node || !m_commander)
        return false;
    const QString id = node->defaultCommand();
    if (id.isEmpty())
        return false;
    return m_commander->execute(id, {node});
}

void DiskExplorerView::showTip(const QString &tip)
{
    m_tip->setText(tip);
    m_tip->setVisible(!tip.isEmpty());
}

QList<QAction *> DiskExplorerView::widgetActions(Menu menu) const
{
    if (menu == ViewMenu)
        return m_filterActions;
    // In the Edit menu, "Select All" has its shortcut only while this view is the active one.
    if (menu == EditMenu && m_commander)
        if (QAction *a = m_commander->action(QStringLiteral("cmdNode_SelectAll")))
            return {a};
    if (menu == ActionsMenu && m_commander) {
        QList<QAction *> list;
        for (const char *id : {"cmdRefresh", "cmdRemove", "cmdProperties"})
            if (QAction *a = m_commander->action(QString::fromLatin1(id)))
                list << a;
        return list;
    }
    return {};
}

void DiskExplorerView::save(QDomElement &element, bool flush)
{
    m_filter->save(element, flush);
}

void DiskExplorerView::load(const QDomElement &element)
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
