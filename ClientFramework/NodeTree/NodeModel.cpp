#include "ClientFramework/NodeTree/NodeModel.h"

#include "ClientFramework/NodeTree/NodeCore.h"

#include <QCoreApplication>

NodeModel::NodeModel(NodeCore *root, QObject *parent)
    : QAbstractItemModel(parent), m_root(root), m_columns{NodeAttr::Name, NodeAttr::Kind, NodeAttr::Status}
{
    if (m_root)
        m_root->subscribe(this);
}

NodeModel::~NodeModel()
{
    if (m_root)
        m_root->unsubscribe(this);
}

QString NodeModel::title() const
{
    return QCoreApplication::translate("NodeCore", "Data Model");
}

void NodeModel::setColumns(const QList<NodeAttr> &columns)
{
    beginResetModel();
    m_columns = columns.isEmpty() ? QList<NodeAttr>{NodeAttr::Name} : columns;
    endResetModel();
}

NodeCore *NodeModel::nodeOf(const QModelIndex &index) const
{
    if (!index.isValid())
        return m_root;
    return static_cast<NodeCore *>(index.internalPointer());
}

QModelIndex NodeModel::indexOf(const NodeCore *node, int column) const
{
    if (!node || node == m_root || !m_root || !m_root->isAncestorOf(node))
        return QModelIndex();
    const NodeCore *parent = node->parent();
    const int row = parent ? parent->indexOf(node) : -1;
    if (row < 0)
        return QModelIndex();
    return createIndex(row, column, const_cast<NodeCore *>(node));
}

QModelIndex NodeModel::parentIndexOf(NodeCore *parent) const
{
    return parent == m_root ? QModelIndex() : indexOf(parent);
}

QModelIndex NodeModel::index(int row, int column, const QModelIndex &parent) const
{
    if (column < 0 || column >= m_columns.size())
        return QModelIndex();
    NodeCore *p = nodeOf(parent);
    NodeCore *c = p ? p->child(row) : nullptr;
    return c ? createIndex(row, column, c) : QModelIndex();
}

QModelIndex NodeModel::parent(const QModelIndex &child) const
{
    if (!child.isValid())
        return QModelIndex();
    NodeCore *node = nodeOf(child);
    NodeCore *p = node ? node->parent() : nullptr;
    if (!p || p == m_root)
        return QModelIndex();
    return indexOf(p);
}

int NodeModel::rowCount(const QModelIndex &parent) const
{
    if (parent.isValid() && parent.column() != 0)
        return 0;
    NodeCore *p = nodeOf(parent);
    return p ? p->childCount() : 0;
}

int NodeModel::columnCount(const QModelIndex &) const
{
    return int(m_columns.size());
}

QVariant NodeModel::data(const QModelIndex &index, int role) const
{
    if (!index.isValid() || index.column() >= m_columns.size())
        return QVariant();
    NodeCore *node = nodeOf(index);
    if (!node)
        return QVariant();
    const NodeAttr attr = m_columns[index.column()];
    switch (role) {
    case Qt::DisplayRole:
    case Qt::ToolTipRole:
        return node->text(attr);
    case Qt::ForegroundRole:
        return attr == NodeAttr::Status ? node->data(attr, Qt::ForegroundRole) : QVariant();
    case NodeRole:
        return QVariant::fromValue(static_cast<void *>(node));
    case KeyRole:
        return node->text(NodeAttr::Key);
    case TypeKeyRole:
        return node->text(NodeAttr::TypeKey);
    case StateRole:
        return QVariant::fromValue(quint32(node->state()));
    default:
        return QVariant();
    }
}

QString NodeModel::attributeTitle(NodeAttr attr)
{
    auto tr = [](const char *t) { return QCoreApplication::translate("NodeCore", t); };
    switch (attr) {
    case NodeAttr::Name:
        return tr("Name");
    case NodeAttr::Source:
        return tr("Source");
    case NodeAttr::Kind:
        return tr("Kind");
    case NodeAttr::Location:
        return tr("Location");
    case NodeAttr::Status:
        return tr("Status");
    case NodeAttr::Size:
        return tr("Size");
    case NodeAttr::FileSystem:
        return tr("File System");
    case NodeAttr::FreeSpace:
        return tr("Free Space");
    case NodeAttr::Key:
        return tr("Key");
    case NodeAttr::TypeKey:
        return tr("Type");
    default:
        return QString::number(quint32(attr));
    }
}

QVariant NodeModel::headerData(int section, Qt::Orientation orientation, int role) const
{
    if (orientation != Qt::Horizontal || role != Qt::DisplayRole || section < 0 ||
        section >= m_columns.size())
        return QVariant();
    return attributeTitle(m_columns[section]);
}

Qt::ItemFlags NodeModel::flags(const QModelIndex &index) const
{
    if (!index.isValid())
        return Qt::NoItemFlags;
    return Qt::ItemIsEnabled | Qt::ItemIsSelectable;
}

void NodeModel::nodeChanged(NodeCore *node, bool recursive)
{
    if (!node || !m_root || !m_root->isAncestorOf(node))
        return;
    if (node != m_root) {
        const QModelIndex first = indexOf(node, 0);
        if (first.isValid())
            emit dataChanged(first, indexOf(node, int(m_columns.size()) - 1));
    }
    if (recursive)
        emitChangedRecursive(node == m_root ? QModelIndex() : indexOf(node));
}

void NodeModel::emitChangedRecursive(const QModelIndex &parent)
{
    const int rows = rowCount(parent);
    if (rows == 0)
        return;
    emit dataChanged(index(0, 0, parent), index(rows - 1, int(m_columns.size()) - 1, parent));
    for (int r = 0; r < rows; ++r)
        emitChangedRecursive(index(r, 0, parent));
}

void NodeModel::childrenAboutToBeInserted(NodeCore *parent, int first, int last)
{
    beginInsertRows(parentIndexOf(parent), first, last);
}

void NodeModel::childrenInserted(NodeCore *, int, int)
{
    endInsertRows();
}

void NodeModel::childrenAboutToBeRemoved(NodeCore *parent, int first, int last)
{
    beginRemoveRows(parentIndexOf(parent), first, last);
}

void NodeModel::childrenRemoved(NodeCore *, int, int)
{
    endRemoveRows();
}

void NodeModel::publisherDestroyed(NodeCore *node)
{
    if (node == m_root) {
        beginResetModel();
        m_root = nullptr;
        endResetModel();
    }
}
