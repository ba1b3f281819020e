#include "DiskBrowserView.h"

#include "Commands/Commander.h"
#include "NodeTree/DiskBrowserModel.h"
#include "NodeTree/NodeCoreList.h"
#include "NodeTree/NodeDrive.h"
#include "NodeTree/NodeFolder.h"
#include "NodeTree/NodeSortFilterModel.h"

#include <QAction>
#include <QDomElement>
#include <QEvent>
#include <QHeaderView>
#include <QKeyEvent>
#include <QLabel>
#include <QMenu>
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

// Nodes the tree opens at once so the disks and their volumes are in sight.
bool expandsAtOnce(const NodeCore *n)
{
    return n && (n->kind() == NodeKind::Computer || n->kind() == NodeKind::Device ||
                 n->kind() == NodeKind::Partition);
}

// The node whose children stand for a node in the list: a volume lists its root folder.
NodeCore *listedFolder(NodeCore *n)
{
    if (auto *drive = dynamic_cast<NodeDrive *>(n); drive && drive->rootFolder())
        return drive->rootFolder();
    return n;
}

} // namespace

DiskBrowserView::DiskBrowserView(NodeCore *root, Core::Commander *commander, QWidget *parent)
    : GenericView(ViewId, tr("File Browser"), parent), m_commander(commander),
      m_model(new DiskBrowserModel(root, this)), m_filter(new NodeSortFilterModel(this)),
      m_folders(new FolderFilter(this)), m_tree(new QTreeView), m_list(new QTreeView),
      m_splitter(new QSplitter(Qt::Horizontal)), m_location(new QLabel), m_up(new QAction(tr("Up"), this))
{
    m_model->setColumns({NodeAttr::Name, NodeAttr::Size, NodeAttr::Kind, NodeAttr::Status});
    m_filter->setSourceModel(m_model);
    m_filter->sort(0); // folders first, then by name; disks and partitions in the kernel's order
    m_folders->setSourceModel(m_filter);

    m_tree->setObjectName(QStringLiteral("browserFolders"));
    m_tree->setModel(m_folders);
    m_tree->setHeaderHidden(true);
    m_tree->setSelectionMode(QAbstractItemView::SingleSelection);
    m_tree->setExpandsOnDoubleClick(false);
    m_tree->setUniformRowHeights(true);
    m_tree->setContextMenuPolicy(Qt::CustomContextMenu);

    m_list->setObjectName(QStringLiteral("browserFiles"));
    m_list->setModel(m_filter);
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
    connect(m_filter, &QAbstractItemModel::rowsRemoved, this, [this] {
        updateLocation();
        announceSelection();
    });
    connect(m_filter, &QAbstractItemModel::modelReset, this, [this] { onTreeCurrentChanged(); });
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
    m_tree->installEventFilter(this);
    m_list->installEventFilter(this);

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
            updateLocation();
            announceSelection();
        });
        m_filterActions << a;
    }
    updateLocation();
}

DiskBrowserView::~DiskBrowserView()
{
    // The models go before the views: nothing may call back into this half-destroyed view.
    m_tree->removeEventFilter(this);
    m_list->removeEventFilter(this);
    m_tree->selectionModel()->disconnect(this);
    m_list->selectionModel()->disconnect(this);
    m_filter->disconnect(this);
    m_folders->disconnect(this);
    m_model->disconnect(this);
    m_model->cancelAll();
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
    return listNodeAt(m_folders->mapToSource(folderIndex));
}

NodeCore *DiskBrowserView::listNodeAt(const QModelIndex &filterIndex) const
{
    if (!filterIndex.isValid())
        return nullptr;
    return m_model->nodeOf(m_filter->mapToSource(filterIndex));
}

QModelIndex DiskBrowserView::filterIndexOf(const NodeCore *node) const
{
    if (!node || node == m_model->rootNode())
        return {};
    return m_filter->mapFromSource(m_model->indexOf(node));
}

QModelIndex DiskBrowserView::folderIndexOf(const NodeCore *node) const
{
    const QModelIndex i = filterIndexOf(node);
    return i.isValid() ? m_folders->mapFromSource(i) : QModelIndex();
}

QList<NodeCore *> DiskBrowserView::treeSelection() const
{
    QList<NodeCore *> nodes;
    for (const QModelIndex &i : m_tree->selectionModel()->selectedRows(0))
        if (NodeCore *n = treeNodeAt(i))
            nodes << n;
    return nodes;
}

QList<NodeCore *> DiskBrowserView::listSelection() const
{
    QList<NodeCore *> nodes;
    for (const QModelIndex &i : m_list->selectionModel()->selectedRows(0))
        if (NodeCore *n = listNodeAt(i))
            nodes << n;
    return nodes;
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
    return listNodeAt(m_list->rootIndex());
}

void DiskBrowserView::setActivePane(Pane pane)
{
    m_pane = pane;
}

void DiskBrowserView::announceSelection()
{
    emit nodeSelectionChanged(selectedNodes());
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
        m_filter->fetchMore(folder);
    m_pane = Pane::Tree;
    updateLocation();
    announceSelection();
}

void DiskBrowserView::onListActivated(const QModelIndex &index)
{
    NodeCore *n = listNodeAt(index);
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
    const NodeCore *root = m_model->rootNode();
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
    for (QModelIndex p = index.parent(); p.isValid(); p = p.parent())
        m_tree->expand(p);
    m_tree->selectionModel()->setCurrentIndex(index, QItemSelectionModel::ClearAndSelect |
                                                         QItemSelectionModel::Rows);
    m_tree->scrollTo(index);
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
    for (; p && p != m_model->rootNode(); p = p->parent())
        if (openFolder(p))
            return true;
    return false;
}

bool DiskBrowserView::browseTo(NodeCore *node)
{
    if (!node || node == m_model->rootNode())
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
    if (selectedNodes().isEmpty())
        return;
    QMenu menu(this);
    fillContextMenu(&menu);
    if (!menu.isEmpty())
        menu.exec(view->viewport()->mapToGlobal(pos));
}

void DiskBrowserView::fillContextMenu(QMenu *menu) const
{
    const QList<NodeCore *> nodes = selectedNodes();
    if (nodes.size() == 1)
        nodes.first()->contextMenu(menu);
    else if (nodes.size() > 1)
        NodeCoreList(nodes.cbegin(), nodes.cend()).contextMenu(menu);
}

bool DiskBrowserView::activate(NodeCore *node)
{
    if (!node)
        return false;
    const QString id = node->defaultCommand();
    if (id.isEmpty())
        return node->kind() != NodeKind::File && openFolder(node);
    return m_commander && m_commander->execute(id, {node});
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
    if (menu == ViewMenu) {
        QList<QAction *> list{m_up, nullptr};
        return list + m_filterActions;
    }
    if (menu == EditMenu && m_commander) {
        if (QAction *a = m_commander->action(QStringLiteral("cmdNode_SelectAll")))
            return {a};
        return {};
    }
    if (menu == ActionsMenu && m_commander) {
        QList<QAction *> list;
        for (const char *id : {"cmdHex_NodeOpen", "cmdHex_FileRecord", "cmdUpdate", "cmdProperties"})
            if (QAction *a = m_commander->action(QString::fromLatin1(id)))
                list << a;
        return list;
    }
    return {};
}

void DiskBrowserView::save(QDomElement &element, bool flush)
{
    m_filter->save(element, flush);
    element.setAttribute(SplitterAttribute, QString::fromLatin1(m_splitter->saveState().toBase64()));
}

void DiskBrowserView::load(const QDomElement &element)
{
    m_filter->load(element);
    for (QAction *a : std::as_const(m_filterActions))
        for (NodeSortFilterModel::Filter f : NodeSortFilterModel::allFilters())
            if (NodeSortFilterModel::filterKey(f) == a->objectName()) {
                const QSignalBlocker block(a);
                a->setChecked(m_filter->filter(f));
            }
    const QByteArray state = QByteArray::fromBase64(element.attribute(SplitterAttribute).toLatin1());
    if (!state.isEmpty())
        m_splitter->restoreState(state);
    updateLocation();
}

} // namespace Framework
