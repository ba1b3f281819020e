#include "ClientFramework/Views/DiskExplorerView.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"
#include "ClientFramework/Views/DeviceMap.h"

#include <QHeaderView>
#include <QLabel>
#include <QScrollArea>
#include <QSplitter>
#include <QTreeView>
#include <QVBoxLayout>

namespace Framework {

DiskExplorerView::DiskExplorerView(NodeCore *root, Core::Commander *commander, QWidget *parent)
    : NodeView(ViewId, tr("Disk Explorer"), root, commander,
               {NodeAttr::Name, NodeAttr::Kind, NodeAttr::Size, NodeAttr::Status}, parent),
      m_tree(new QTreeView), m_map(new DeviceMap), m_tip(new QLabel)
{
    m_tree->setObjectName(QStringLiteral("explorerTree"));
    m_tree->setModel(filterModel());
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

    m_map->setRoot(root, model());
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
    connect(filterModel(), &QAbstractItemModel::rowsInserted, this,
            [this](const QModelIndex &parent, int first, int last) {
                NodeCore *p = nodeAt(parent);
                if (parent.isValid() && p && p->kind() != NodeKind::Device &&
                    p->kind() != NodeKind::Partition)
                    return;
                for (int row = first; row <= last; ++row) {
                    const QModelIndex index = filterModel()->index(row, 0, parent);
                    if (expandsAtOnce(nodeAt(index)))
                        m_tree->expand(index);
                }
            });
    connect(m_tree->selectionModel(), &QItemSelectionModel::selectionChanged, this, [this] {
        const QList<NodeCore *> nodes = selectedNodes();
        m_map->setSelectedNode(nodes.isEmpty() ? nullptr : nodes.constFirst());
        emit nodeSelectionChanged(nodes);
    });
    // Removed rows leave the selection without a selection signal: announce what is left.
    connect(filterModel(), &QAbstractItemModel::rowsRemoved, this, [this] { announceSelection(); });
    connect(m_tree, &QTreeView::activated, this,
            [this](const QModelIndex &index) { activate(nodeAt(index)); });
    connect(m_tree, &QWidget::customContextMenuRequested, this,
            [this](const QPoint &pos) { execContextMenu(m_tree, pos); });
    connect(m_map, &DeviceMap::nodeClicked, this, [this](NodeCore *n) { selectNode(n); });
    connect(m_map, &DeviceMap::nodeActivated, this, [this](NodeCore *n) {
        selectNode(n);
        activate(n);
    });
}

DiskExplorerView::~DiskExplorerView() = default;

QList<NodeCore *> DiskExplorerView::selectedNodes() const
{
    return selectedRowNodes(m_tree, [this](const QModelIndex &i) { return nodeAt(i); });
}

bool DiskExplorerView::selectNode(NodeCore *node)
{
    const QModelIndex index = filterIndexOf(node);
    if (!index.isValid())
        return false;
    selectRow(m_tree, index);
    return true;
}

void DiskExplorerView::showTip(const QString &tip)
{
    m_tip->setText(tip);
    m_tip->setVisible(!tip.isEmpty());
}

QStringList DiskExplorerView::actionCommands() const
{
    return {QStringLiteral("cmdRefresh"), QStringLiteral("cmdRemove"), QStringLiteral("cmdProperties")};
}

} // namespace Framework
