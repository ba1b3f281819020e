// A QAbstractItemModel over a node tree ("Data Model"). Each index stands for one node (its
// internal pointer); the columns show node attributes (Name, Kind, Status by default). The
// model subscribes to its root node and follows every change of the tree; the tree is only
// changed on the interface thread.
#pragma once

#include "ClientFramework/NodeTree/IPublisher.h"
#include "ClientFramework/NodeTree/NodeAttr.h"

#include <QAbstractItemModel>
#include <QList>

class NodeCore;

class NodeModel : public QAbstractItemModel, public INodeSubscriber
{
    Q_OBJECT
public:
    // Role answering the node pointer (NodeCore *) of an index, and the node's key.
    static constexpr int NodeRole = Qt::UserRole + 1;
    static constexpr int KeyRole = Qt::UserRole + 2;
    static constexpr int TypeKeyRole = Qt::UserRole + 3;
    static constexpr int StateRole = Qt::UserRole + 4;

    explicit NodeModel(NodeCore *root, QObject *parent = nullptr);
    ~NodeModel() override;

    NodeCore *rootNode() const { return m_root; }
    QString title() const;

    void setColumns(const QList<NodeAttr> &columns);
    const QList<NodeAttr> &columns() const { return m_columns; }

    NodeCore *nodeOf(const QModelIndex &index) const;
    QModelIndex indexOf(const NodeCore *node, int column = 0) const;

    // QAbstractItemModel
    QModelIndex index(int row, int column, const QModelIndex &parent = QModelIndex()) const override;
    QModelIndex parent(const QModelIndex &child) const override;
    int rowCount(const QModelIndex &parent = QModelIndex()) const override;
    int columnCount(const QModelIndex &parent = QModelIndex()) const override;
    QVariant data(const QModelIndex &index, int role = Qt::DisplayRole) const override;
    QVariant headerData(int section, Qt::Orientation orientation, int role = Qt::DisplayRole) const override;
    Qt::ItemFlags flags(const QModelIndex &index) const override;

    // INodeSubscriber
    void nodeChanged(NodeCore *node, bool recursive) override;
    void childrenAboutToBeInserted(NodeCore *parent, int first, int last) override;
    void childrenInserted(NodeCore *parent, int first, int last) override;
    void childrenAboutToBeRemoved(NodeCore *parent, int first, int last) override;
    void childrenRemoved(NodeCore *parent, int first, int last) override;
    void publisherDestroyed(NodeCore *node) override;

    // The column title of an attribute.
    static QString attributeTitle(NodeAttr attr);

protected:
    QModelIndex parentIndexOf(NodeCore *parent) const;
    void emitChangedRecursive(const QModelIndex &parent);

    NodeCore *m_root = nullptr;
    QList<NodeAttr> m_columns;
};
