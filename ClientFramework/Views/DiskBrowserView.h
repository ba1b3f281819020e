// The File Browser ("browser"): a folder tree of computer, disks, partitions, volumes and folders
// on the left, the children of the current folder (files included) in a list on the right, with
// the location of that folder above. Folders populate on demand on worker threads; the selection
// of the pane used last is the view's node selection; context menus and default commands come
// from the nodes through the command registry.
#pragma once

#include "ClientFramework/Views/NodeView.h"

class QLabel;
class QSortFilterProxyModel;
class QSplitter;

namespace Framework {

class DiskBrowserView : public NodeView
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("browser");

    DiskBrowserView(NodeCore *root, Core::Commander *commander, QWidget *parent = nullptr);
    ~DiskBrowserView() override;

    QTreeView *folderTree() const { return m_tree; }
    QTreeView *fileList() const { return m_list; }
    QLabel *locationLabel() const { return m_location; }
    QAction *upAction() const { return m_up; }
    // The tree's proxy over the filter switches (shared by both panes): no files.
    QSortFilterProxyModel *folderModel() const { return m_folders; }

    // INodeSource: the selection of the pane used last (the tree's when the list has none).
    QList<NodeCore *> selectedNodes() const override;

    // The node whose children the list shows (a volume shows its root folder's), or nullptr.
    NodeCore *currentFolder() const;
    // The node selected in the tree, or nullptr.
    NodeCore *treeNode() const;

    // Shows a node: a file is selected in the list of its folder, anything else is selected and
    // expanded in the tree. False when the node is not shown (filtered out, or not in the tree).
    bool browseTo(NodeCore *node);
    // Makes a node the tree's selection, so the list shows its children.
    bool openFolder(NodeCore *node);
    // Moves the tree's selection to the parent of the current node.
    bool goUp();
    // Double-click or Enter: the node's default command; a node without one opens as a folder.
    bool activate(NodeCore *node) override;

    QList<QAction *> widgetActions(Menu menu) const override;
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

protected:
    bool eventFilter(QObject *watched, QEvent *event) override;
    QStringList actionCommands() const override;
    void filtersChanged() override;

private:
    enum class Pane { Tree, List };

    // Expands the computer, disks and partitions below a tree index.
    void expandDisks(const QModelIndex &parent);
    NodeCore *treeNodeAt(const QModelIndex &folderIndex) const;
    QModelIndex folderIndexOf(const NodeCore *node) const;
    QList<NodeCore *> treeSelection() const;
    QList<NodeCore *> listSelection() const;
    void setActivePane(Pane pane);
    void onTreeCurrentChanged();
    void onListActivated(const QModelIndex &index);
    void showContextMenu(QTreeView *view, const QPoint &pos);
    void updateLocation();

    QSortFilterProxyModel *m_folders;
    QTreeView *m_tree;
    QTreeView *m_list;
    QSplitter *m_splitter;
    QLabel *m_location;
    QAction *m_up;
    Pane m_pane = Pane::Tree;
};

} // namespace Framework
