#include "ClientFramework/Views/DiskBrowserView.h"

#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeSortFilterModel.h"

#include <QAction>
#include <QDomElement>
#include <QEvent>
#include <QHeaderView>
#include <QKeyEvent>
#include <QLabel>
#include <QSortFilterProxyModel>
#include <QSplitter>
#include <QStyle>
#include <QToolBar>
#include <QTreeView>

namespace Framework {

namespace {

const QString SplitterAttribute = QStringLiteral("splitter");

const NodeCore *nodeOfIndex(const QModelIndex &index)
{
    return static_cast<const NodeCore *>(index.data(NodeModel::NodeRole).value<void *>());
}

// The folder tree's rows: everything but files, in the name column only.
class FolderFilter : public QSortFilterProxyModel
{
public:
    using QSortFilterProxyModel::QSortFilterProxyModel;

protected:
    bool filterAcceptsRow(int sourceRow, const QModelIndex &sourceParent) const override
    {
        const NodeCore *n = nodeOfIndex(sourceModel()->index(sourceRow, 0, sourceParent));
        return !n || n->kind() != NodeKind::File;
    }
    bool filterAcceptsColumn(int sourceColumn, const QModelIndex &) const override
    {
        return sourceColumn == 0;
    }
};

// The node whose children stand for a node in the list: a volume lists its root folder.
NodeCore *listedFolder(NodeCore *n)
{
    if (auto *drive = dynamic_cast<NodeDrive *>(n); drive && drive->rootFolder())
        return drive->rootFolder();
    return n;
}

} // namespace

DiskBrowserView::DiskBrowserView(NodeCore *root, Core::Commander *commander, QWidget *parent)
    : NodeView(ViewId, tr("File Browser"), root, commander,
               {NodeAttr::Name, NodeAttr::Size, NodeAttr::Kind, NodeAttr::Status}, parent),
      m_folders(new FolderFilter(this)), m_tree(new QTreeView), m_list(new QTreeView),
      m_splitter(new QSplitter(Qt::Horizontal)), m_location(new QLabel), m_up(new QAction(tr("Up"), this))
{
    filterModel()->sort(0); // folders first, then by name; disks and partitions in the kernel's order
    m_folders->setSourceModel(filterModel());

    m_tree->setObjectName(QStringLiteral("browserFolders"));
    m_tree->setModel(m_folders);
    m_tree->setHeaderHidden(true);
    m_tree->setSelectionMode(QAbstractItemView::SingleSelection);
    m_tree->setExpandsOnDoubleClick(false);
    m_tree->setUniformRowHeights(true);
    m_tree->setContextMenuPolicy(Qt::CustomContextMenu);

    m_list->setObjectName(QStringLiteral("browserFiles"));
    m_list->setModel(filterModel());
    m_list->setRootIsDecorated(false);
    m_list->setItemsExpandable(false);
    m_list->setExpandsOnDoubleClick(false);
    m_list->setSelectionMode(QAbstractItemView::ExtendedSelection);
    m_list->setUniformRowHeights(true);
    m_list->setAlternatingRowColors(true);
    m_list->setContextMenuPolicy(Qt::CustomContextMenu);
    m_list->header()->setStretchLastSection(true);
    m_list->setColumnWidth(0, 220);
    m_list->setColumnWidth(1, 80);
    m_list->setColumnWidth(2, 100);

    m_splitter->setObjectName(QStringLiteral("browserSplitter"));
    m_splitter->addWidget(m_tree);
    m_splitter->addWidget(m_list);
    m_splitter->setStretchFactor(0, 2);
    m_splitter->setStretchFactor(1, 3);
    m_splitter->setSizes({300, 500});
    setCentralWidget(m_splitter);

    m_up->setObjectName(QStringLiteral("browserUp"));
    m_up->setIcon(style()->standardIcon(QStyle::SP_FileDialogToParent));
    m_up->setShortcut(QKeySequence(Qt::ALT | Qt::Key_Up));
    m_up->setShortcutContext(Qt::WidgetWithChildrenShortcut);
    m_up->setStatusTip(tr("Show the folder above."));
    addAction(m_up);
    connect(m_up, &QAction::triggered, this, [this] { goUp(); });
    m_location->setObjectName(QStringLiteral("browserLocation"));
    m_location->setTextInteractionFlags(Qt::TextSelectableByMouse);
    auto *bar = new QToolBar(tr("Location"), this);
    bar->setObjectName(QStringLiteral("browserBar"));
    bar->setMovable(false);
    bar->addAction(m_up);
    bar->addWidget(m_location);
    addToolBar(bar);

    // Disks show their partitions and volumes at once; folders wait until they are opened.
    expandDisks(QModelIndex());
    connect(m_folders, &QAbstractItemModel::rowsInserted, this,
            [this](const QModelIndex &parent, int first, int last) {
                if (parent.isValid() && !expandsAtOnce(treeNodeAt(parent)))
                    return;
                for (int row = first; row <= last; ++row) {
                    const QModelIndex i = m_folders->index(row, 0, parent);
                    if (expandsAtOnce(treeNodeAt(i))) {
                        m_tree->expand(i);
                        expandDisks(i); // a disk arrives with its partitions and volumes
                    }
                }
            });

    connect(m_tree->selectionModel(), &QItemSelectionModel::currentChanged, this,
            &DiskBrowserView::onTreeCurrentChanged);
    connect(m_tree->selectionModel(), &QItemSelectionModel::selectionChanged, this, [this] {
        setActivePane(Pane::Tree);
        announceSelection();
    });
    connect(m_list->selectionModel(), &QItemSelectionModel::selectionChanged, this, [this] {
        if (!listSelection().isEmpty())
            m_pane = Pane::List;
        announceSelection();
    });
    // Removed rows leave the selection without a selection signal: announce what is left.
    connect(filterModel(), &QAbstractItemModel::rowsRemoved, this, [this] {
        updateLocation();
        announceSelection();
    });
    connect(filterModel(), &QAbstractItemModel::modelReset, this, [this] { onTreeCurrentChanged(); });
    connect(m_tree, &QTreeView::activated, this, [this](const QModelIndex &index) {
        NodeCore *n = treeNodeAt(index);
        if (n && n->defaultCommand().isEmpty())
            m_tree->setExpanded(index, !m_tree->isExpanded(index));
        else
            activate(n);
    });
    connect(m_list, &QTreeView::activated, this, &DiskBrowserView::onListActivated);
    connect(m_tree, &QTreeView::expanded, this,
            [this](const QModelIndex &index) { m_folders->fetchMore(index); });
    connect(m_tree, &QWidget::customContextMenuRequested, this,
            [this](const QPoint &pos) { showContextMenu(m_tree, pos); });
    connect(m_list, &QWidget::customContextMenuRequested, this,
            [this](const QPoint &pos) { showContextMenu(m_list, pos); });
    m_tree->installEventFilter(this);
    m_list->installEventFilter(this);
    updateLocation();
}

DiskBrowserView::~DiskBrowserView()
{
    // The models go before the views: nothing may call back into this half-destroyed view.
    m_tree->removeEventFilter(this);
    m_list->removeEventFilter(this);
    m_tree->selectionModel()->disconnect(this);
    m_list->selectionModel()->disconnect(this);
    filterModel()->disconnect(this);
    m_folders->disconnect(this);
    model()->disconnect(this);
}

void DiskBrowserView::expandDisks(const QModelIndex &parent)
{
    for (int row = 0; row < m_folders->rowCount(parent); ++row) {
        const QModelIndex i = m_folders->index(row, 0, parent);
        if (expandsAtOnce(treeNodeAt(i))) {
            m_tree->expand(i);
            expandDisks(i);
        }
    }
}

NodeCore *DiskBrowserView::treeNodeAt(const QModelIndex &folderIndex) const
{
    if (!folderIndex.isValid())
        return nullptr;
    return nodeAt(m_folders->mapToSource(folderIndex));
}

QModelIndex DiskBrowserView::folderIndexOf(const NodeCore *node) const
{
    const QModelIndex i = filterIndexOf(node);
    return i.isValid() ? m_folders->mapFromSource(i) : QModelIndex();
}

QList<NodeCore *> DiskBrowserView::treeSelection() const
{
    return selectedRowNodes(m_tree, [this](const QModelIndex &i) { return treeNodeAt(i); });
}

QList<NodeCore *> DiskBrowserView::listSelection() const
{
    return selectedRowNodes(m_list, [this](const QModelIndex &i) { return nodeAt(i); });
}

QList<NodeCore *> DiskBrowserView::selectedNodes() const
{
    if (m_pane == Pane::List) {
        const QList<NodeCore *> nodes = listSelection();
        if (!nodes.isEmpty())
            return nodes;
    }
    return treeSelection();
}

NodeCore *DiskBrowserView::treeNode() const
{
    return treeNodeAt(m_tree->selectionModel()->currentIndex());
}

NodeCore *DiskBrowserView::currentFolder() const
{
    return nodeAt(m_list->rootIndex());
}

void DiskBrowserView::setActivePane(Pane pane)
{
    m_pane = pane;
}

void DiskBrowserView::onTreeCurrentChanged()
{
    NodeCore *n = treeNode();
    QModelIndex folder = filterIndexOf(listedFolder(n));
    if (!folder.isValid())
        folder = filterIndexOf(n); // the root folder is filtered out: the volume's own rows
    m_list->selectionModel()->clear();
    m_list->setRootIndex(folder);
    // Asked even while another view populates the folder: this view takes over if that one stops.
    if (folder.isValid())
        filterModel()->fetchMore(folder);
    m_pane = Pane::Tree;
    updateLocation();
    announceSelection();
}

void DiskBrowserView::onListActivated(const QModelIndex &index)
{
    NodeCore *n = nodeAt(index);
    if (!n)
        return;
    // A folder, volume or disk opens in place, as in any file browser; a file runs its command.
    if (n->kind() != NodeKind::File && openFolder(n))
        return;
    activate(n);
}

void DiskBrowserView::updateLocation()
{
    const NodeCore *folder = currentFolder();
    // The tree may be gone already (the model lets go of its root first).
    const NodeCore *root = model()->rootNode();
    const QString text = folder ? folder->text(NodeAttr::Location)
                         : root ? root->text(NodeAttr::Name)
                                : QString();
    m_location->setText(text);
    m_location->setToolTip(text);
    m_up->setEnabled(treeNode() != nullptr);
}

bool DiskBrowserView::openFolder(NodeCore *node)
{
    const QModelIndex index = folderIndexOf(node);
    if (!index.isValid())
        return false;
    selectRow(m_tree, index);
    // Selecting the node that was current already changes nothing: the list shows it anyway.
    if (currentFolder() != listedFolder(node) && filterIndexOf(listedFolder(node)).isValid())
        onTreeCurrentChanged();
    return true;
}

bool DiskBrowserView::goUp()
{
    NodeCore *n = treeNode();
    if (!n)
        return false;
    NodeCore *p = n->parent();
    // The root folder and its volume show the same list: step over the volume.
    if (auto *drive = dynamic_cast<NodeDrive *>(p); drive && drive->rootFolder() == n)
        p = p->parent();
    for (; p && p != model()->rootNode(); p = p->parent())
        if (openFolder(p))
            return true;
    return false;
}

bool DiskBrowserView::browseTo(NodeCore *node)
{
    if (!node || node == model()->rootNode())
        return false;
    NodeCore *file = node->kind() == NodeKind::File ? node : nullptr;
    NodeCore *folder = file ? file->parent() : node;
    if (!openFolder(folder))
        return false;
    m_tree->expand(folderIndexOf(folder));
    if (NodeCore *rootFolder = listedFolder(folder); rootFolder != folder)
        m_tree->expand(folderIndexOf(rootFolder));
    if (file) {
        const QModelIndex index = filterIndexOf(file);
        if (!index.isValid())
            return false;
        m_list->selectionModel()->setCurrentIndex(index, QItemSelectionModel::ClearAndSelect |
                                                             QItemSelectionModel::Rows);
        m_list->scrollTo(index);
        m_pane = Pane::List;
        m_list->setFocus();
    } else {
        m_pane = Pane::Tree;
        m_tree->setFocus();
    }
    announceSelection();
    return true;
}

void DiskBrowserView::showContextMenu(QTreeView *view, const QPoint &pos)
{
    if (view == m_list) {
        // A click beside the rows means the folder itself.
        if (!m_list->indexAt(pos).isValid())
            m_list->selectionModel()->clear();
        m_pane = listSelection().isEmpty() ? Pane::Tree : Pane::List;
    } else {
        m_pane = Pane::Tree;
    }
    announceSelection();
    execContextMenu(view, pos);
}

bool DiskBrowserView::activate(NodeCore *node)
{
    if (node && node->defaultCommand().isEmpty())
        return node->kind() != NodeKind::File && openFolder(node);
    return NodeView::activate(node);
}

bool DiskBrowserView::eventFilter(QObject *watched, QEvent *event)
{
    if (event->type() == QEvent::FocusIn) {
        const Pane before = m_pane;
        m_pane = watched == m_list && !listSelection().isEmpty() ? Pane::List : Pane::Tree;
        if (m_pane != before)
            announceSelection();
    } else if (event->type() == QEvent::KeyPress &&
               static_cast<QKeyEvent *>(event)->key() == Qt::Key_Backspace) {
        goUp();
        return true;
    }
    return GenericView::eventFilter(watched, event);
}

QList<QAction *> DiskBrowserView::widgetActions(Menu menu) const
{
    if (menu == ViewMenu)
        return QList<QAction *>{m_up, nullptr} + filterActions();
    return NodeView::widgetActions(menu);
}

QStringList DiskBrowserView::actionCommands() const
{
    return {QStringLiteral("cmdHex_NodeOpen"), QStringLiteral("cmdHex_FileRecord"),
            QStringLiteral("cmdUpdate"), QStringLiteral("cmdProperties")};
}

void DiskBrowserView::filtersChanged()
{
    updateLocation();
    announceSelection();
}

void DiskBrowserView::save(QDomElement &element, bool flush)
{
    NodeView::save(element, flush);
    element.setAttribute(SplitterAttribute, QString::fromLatin1(m_splitter->saveState().toBase64()));
}

void DiskBrowserView::load(const QDomElement &element)
{
    NodeView::load(element);
    const QByteArray state = QByteArray::fromBase64(element.attribute(SplitterAttribute).toLatin1());
    if (!state.isEmpty())
        m_splitter->restoreState(state);
    updateLocation();
}

} // namespace Framework
