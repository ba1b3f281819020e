#include "ClientFramework/NodeTree/NodeSortFilterModel.h"

#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodeModel.h"

#include <QCoreApplication>
#include <QDomElement>

NodeSortFilterModel::NodeSortFilterModel(QObject *parent) : QSortFilterProxyModel(parent)
{
    setRecursiveFilteringEnabled(false);
    setDynamicSortFilter(true);
}

void NodeSortFilterModel::setFilters(quint32 filters)
{
    filters &= All;
    if (filters == m_filters)
        return;
    m_filters = filters;
    invalidateFilter();
}

void NodeSortFilterModel::setFilter(Filter f, bool on)
{
    setFilters(on ? (m_filters | f) : (m_filters & ~quint32(f)));
}

QList<NodeSortFilterModel::Filter> NodeSortFilterModel::allFilters()
{
    return {MyComputer,     SystemDevices, Devices,     Removable, NotReady,
            VirtualDevices, Partitions,    Unallocated, Network,   SystemEntries};
}

QString NodeSortFilterModel::filterKey(Filter f)
{
    switch (f) {
    case MyComputer:
        return QStringLiteral("bmfMyComp");
    case SystemDevices:
        return QStringLiteral("bmfSysDvc");
    case Devices:
        return QStringLiteral("bmfDevices");
    case Removable:
        return QStringLiteral("bmfRemovable");
    case NotReady:
        return QStringLiteral("bmfNotReady");
    case VirtualDevices:
        return QStringLiteral("bmfVirtDvc");
    case Partitions:
        return QStringLiteral("bmfPartitions");
    case Unallocated:
        return QStringLiteral("bmfUnalloc");
    case Network:
        return QStringLiteral("bmfNetwork");
    case SystemEntries:
        return QStringLiteral("bmfSysEntries");
    default:
        return QString();
    }
}

QString NodeSortFilterModel::filterText(Filter f)
{
    auto tr = [](const char *t) { return QCoreApplication::translate("NodeCore", t); };
    switch (f) {
    case MyComputer:
        return tr("Show My Computer");
    case SystemDevices:
        return tr("Show System Devices");
    case Devices:
        return tr("Show Devices");
    case Removable:
        return tr("Show Removable Devices");
    case NotReady:
        return tr("Show Not Ready Devices");
    case VirtualDevices:
        return tr("Show Virtual Devices");
    case Partitions:
        return tr("Show partitions");
    case Unallocated:
        return tr("Show Unallocated Space");
    case Network:
        return tr("Show Network");
    case SystemEntries:
        return tr("Show System Entries");
    default:
        return QString();
    }
}

void NodeSortFilterModel::save(QDomElement &element, bool)
{
    for (Filter f : allFilters())
        element.setAttribute(filterKey(f), filter(f) ? QStringLiteral("1") : QStringLiteral("0"));
}

void NodeSortFilterModel::load(const QDomElement &element)
{
    quint32 filters = m_filters;
    for (Filter f : allFilters()) {
        const QString key = filterKey(f);
        if (!element.hasAttribute(key))
            continue;
        const QString v = element.attribute(key).trimmed().toLower();
        const bool on = v == QLatin1String("1") || v == QLatin1String("true") || v == QLatin1String("yes");
        filters = on ? (filters | f) : (filters & ~quint32(f));
    }
    setFilters(filters);
}

bool NodeSortFilterModel::accepts(const NodeCore *node) const
{
    if (!node)
        return true;
    switch (node->kind()) {
    case NodeKind::Computer:
        return filter(MyComputer);
    case NodeKind::Device:
        if (!filter(Devices))
            return false;
        if (!filter(SystemDevices) && node->hasFlags(NodeState::System))
            return false;
        if (!filter(Removable) && node->hasFlags(NodeState::Removable))
            return false;
        if (!filter(NotReady) && !node->isReady())
            return false;
        if (!filter(VirtualDevices) &&
            (node->state() & (NodeState::Virtual | NodeState::Raid | NodeState::Image)))
            return false;
        return true;
    case NodeKind::Partition:
        if (!filter(Partitions))
            return false;
        if (!filter(Unallocated) &&
            node->text(NodeAttr::Kind) == QCoreApplication::translate("NodeCore", "Unallocated"))
            return false;
        return true;
    case NodeKind::Folder:
    case NodeKind::File:
        return filter(SystemEntries) || !node->hasFlags(NodeState::System);
    default:
        return true;
    }
}

bool NodeSortFilterModel::filterAcceptsRow(int sourceRow, const QModelIndex &sourceParent) const
{
    const QModelIndex index = sourceModel()->index(sourceRow, 0, sourceParent);
    auto *node = static_cast<const NodeCore *>(index.data(NodeModel::NodeRole).value<void *>());
    return accepts(node);
}

bool NodeSortFilterModel::lessThan(const QModelIndex &left, const QModelIndex &right) const
{
    auto *l = static_cast<const NodeCore *>(left.data(NodeModel::NodeRole).value<void *>());
    auto *r = static_cast<const NodeCore *>(right.data(NodeModel::NodeRole).value<void *>());
    if (l && r && l->parent() == r->parent() && l->parent()) {
        // Folders before files; devices and partitions keep the kernel's order.
        const bool lf = l->kind() == NodeKind::Folder;
        const bool rf = r->kind() == NodeKind::Folder;
        if (lf != rf)
            return lf;
        if (l->kind() == NodeKind::Partition || l->kind() == NodeKind::Device ||
            l->kind() == NodeKind::Computer)
            return l->parent()->indexOf(l) < l->parent()->indexOf(r);
    }
    return QString::localeAwareCompare(left.data().toString(), right.data().toString()) < 0;
}
