#include "ClientFramework/NodeTree/NodeCore.h"

#include "ClientFramework/NodeTree/NodeMenu.h"
#include "ClientFramework/Themes/Theme.h"
#include "ClientFramework/Threads/NodeTag.h"

#include <QCoreApplication>
#include <QMenu>

namespace {

Core::Commander *g_commander = nullptr;

NodeCore::FeatureHook &hookSlot()
{
    static NodeCore::FeatureHook hook;
    return hook;
}

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

NodeCore::NodeCore(NodeCore *parent) : m_parent(parent) {}

NodeCore::~NodeCore()
{
    for (INodeSubscriber *s : std::as_const(m_subscribers))
        s->publisherDestroyed(this);
    m_subscribers.clear();
    qDeleteAll(m_children);
    m_children.clear();
}

int NodeCore::indexOf(const NodeCore *child) const
{
    for (int i = 0; i < m_children.size(); ++i)
        if (m_children[i] == child)
            return i;
    return -1;
}

bool NodeCore::isAncestorOf(const NodeCore *node) const
{
    for (const NodeCore *n = node; n; n = n->parent())
        if (n == this)
            return true;
    return false;
}

NodeCore *NodeCore::findByKey(const QString &key)
{
    if (text(NodeAttr::Key) == key)
        return this;
    for (NodeCore *c : std::as_const(m_children))
        if (NodeCore *found = c->findByKey(key))
            return found;
    return nullptr;
}

void NodeCore::appendChild(NodeCore *child)
{
    insertChild(int(m_children.size()), child);
}

void NodeCore::insertChild(int row, NodeCore *child)
{
    if (!child)
        return;
    row = qBound(0, row, int(m_children.size()));
    emitAboutToInsert(row, row);
    child->m_parent = this;
    child->m_linked = true;
    m_children.insert(row, child);
    emitInserted(row, row);
}

void NodeCore::appendChildren(const QList<NodeCore *> &children)
{
    if (children.isEmpty())
        return;
    const int first = int(m_children.size());
    const int last = first + int(children.size()) - 1;
    emitAboutToInsert(first, last);
    for (NodeCore *c : children) {
        c->m_parent = this;
        c->m_linked = true;
        m_children.append(c);
    }
    emitInserted(first, last);
}

void NodeCore::removeChild(int row)
{
    if (row < 0 || row >= m_children.size())
        return;
    emitAboutToRemove(row, row);
    NodeCore *child = m_children.takeAt(row);
    emitRemoved(row, row);
    delete child;
}

void NodeCore::clearChildren()
{
    if (m_children.isEmpty())
        return;
    const int last = int(m_children.size()) - 1;
    emitAboutToRemove(0, last);
    QList<NodeCore *> old;
    old.swap(m_children);
    emitRemoved(0, last);
    qDeleteAll(old);
}

void NodeCore::setFlags(std::uint32_t flags, bool on)
{
    if (on)
        m_state |= flags;
    else
        m_state &= ~flags;
}

void NodeCore::subscribe(INodeSubscriber *subscriber)
{
    if (subscriber && !m_subscribers.contains(subscriber))
        m_subscribers.append(subscriber);
}

void NodeCore::unsubscribe(INodeSubscriber *subscriber)
{
    m_subscribers.removeAll(subscriber);
}

bool NodeCore::populate(Threads::NodeTag *)
{
    return true;
}

bool NodeCore::populateNow(bool recursive, bool force)
{
    Threads::NodeTag tag(this, recursive, force);
    const bool ok = populate(&tag);
    if (tag.state() == Threads::Tag::State::Idle)
        tag.start();
    tag.finish();
    applyPopulation();
    return ok;
}

void NodeCore::notifyChanged(bool recursive)
{
    for (NodeCore *n = this; n; n = n->m_linked ? n->m_parent : nullptr)
        for (INodeSubscriber *s : std::as_const(n->m_subscribers))
            s->nodeChanged(this, recursive);
}

void NodeCore::notifyChildrenChanged()
{
    notifyChanged(true);
}

void NodeCore::emitAboutToInsert(int first, int last)
{
    for (NodeCore *n = this; n; n = n->m_linked ? n->m_parent : nullptr)
        for (INodeSubscriber *s : std::as_const(n->m_subscribers))
            s->childrenAboutToBeInserted(this, first, last);
}

void NodeCore::emitInserted(int first, int last)
{
    for (NodeCore *n = this; n; n = n->m_linked ? n->m_parent : nullptr)
        for (INodeSubscriber *s : std::as_const(n->m_subscribers))
            s->childrenInserted(this, first, last);
}

void NodeCore::emitAboutToRemove(int first, int last)
{
    for (NodeCore *n = this; n; n = n->m_linked ? n->m_parent : nullptr)
        for (INodeSubscriber *s : std::as_const(n->m_subscribers))
            s->childrenAboutToBeRemoved(this, first, last);
}

void NodeCore::emitRemoved(int first, int last)
{
    for (NodeCore *n = this; n; n = n->m_linked ? n->m_parent : nullptr)
        for (INodeSubscriber *s : std::as_const(n->m_subscribers))
            s->childrenRemoved(this, first, last);
}

QString NodeCore::text(NodeAttr attr) const
{
    switch (attr) {
    case NodeAttr::Name:
        return name();
    case NodeAttr::Source:
        return sourceText();
    case NodeAttr::TypeKey:
        return typeKey();
    case NodeAttr::Key:
        return key();
    case NodeAttr::Kind:
        return kindText();
    case NodeAttr::Location: {
        // Nodes below the invisible root are located by the names on the way down.
        const QString own = name();
        if (!m_parent || !m_parent->m_parent)
            return own;
        const QString up = m_parent->text(NodeAttr::Location);
        return up.isEmpty() ? own : tr("%1 > %2").arg(up, own);
    }
    case NodeAttr::Status:
        return statusText();
    default:
        return extraText(attr);
    }
}

QVariant NodeCore::data(NodeAttr attr, int role) const
{
    if (role == Qt::DisplayRole)
        return text(attr);
    if (role == Qt::ForegroundRole && attr == NodeAttr::Status)
        return statusColor();
    return QVariant();
}

QString NodeCore::extraText(NodeAttr) const
{
    return QString();
}

QPair<QString, QString> NodeCore::property(NodeAttr attr) const
{
    QString label;
    switch (attr) {
    case NodeAttr::Name:
        label = tr("Name");
        break;
    case NodeAttr::Description:
        label = tr("Description");
        break;
    case NodeAttr::Source:
        label = tr("Source");
        break;
    case NodeAttr::TypeKey:
        label = tr("Type");
        break;
    case NodeAttr::Key:
        label = tr("Key");
        break;
    case NodeAttr::Size:
        label = tr("Size");
        break;
    case NodeAttr::FreeSpace:
        label = tr("Free Space");
        break;
    case NodeAttr::FileSystem:
        label = tr("File System");
        break;
    case NodeAttr::Label:
        label = tr("Label");
        break;
    case NodeAttr::Serial:
        label = tr("Serial Number");
        break;
    case NodeAttr::FirstSector:
        label = tr("First Sector");
        break;
    case NodeAttr::SectorCount:
        label = tr("Sectors");
        break;
    case NodeAttr::SectorSize:
        label = tr("Sector Size");
        break;
    case NodeAttr::Model:
        label = tr("Model");
        break;
    case NodeAttr::Firmware:
        label = tr("Firmware");
        break;
    case NodeAttr::Path:
        label = tr("Path");
        break;
    case NodeAttr::EntryIndex:
        label = tr("Entry Index");
        break;
    case NodeAttr::Attributes:
        label = tr("Attributes");
        break;
    case NodeAttr::Children:
        label = tr("Contents");
        break;
    case NodeAttr::Kind:
        label = tr("Kind");
        break;
    case NodeAttr::Location:
        label = tr("Location");
        break;
    case NodeAttr::Status:
        label = tr("Status");
        break;
    }
    return {label, text(attr)};
}

QList<PropertyGroup> NodeCore::properties() const
{
    PropertyGroup general{tr("General Information"), {}};
    for (NodeAttr a : {NodeAttr::Name, NodeAttr::Kind, NodeAttr::Location, NodeAttr::Status}) {
        const auto p = property(a);
        if (!p.second.isEmpty())
            general.items.append({p.first, p.second, QString()});
    }
    return {general};
}

QString NodeCore::statusText() const
{
    if (hasFlags(NodeState::Busy))
        return tr("Busy");
    if (hasFlags(NodeState::Waiting))
        return tr("Waiting");
    if (hasFlags(NodeState::ReadOnly))
        return tr("Read only");
    if (hasFlags(NodeState::Ready))
        return tr("Ready");
    return tr("Not Ready");
}

QString NodeCore::statusColorEntry() const
{
    if (isInvalid())
        return QStringLiteral("invalid");
    if (hasFlags(NodeState::Warning))
        return QStringLiteral("warning");
    if (hasFlags(NodeState::Critical))
        return QStringLiteral("critical");
    if ((m_state & (NodeState::Busy | NodeState::Waiting)) != 0)
        return QStringLiteral("ghost");
    if (hasFlags(NodeState::Virtual))
        return QStringLiteral("virtual");
    if (hasFlags(NodeState::System))
        return QStringLiteral("system");
    if (!hasFlags(NodeState::Ready))
        return QStringLiteral("default");
    return QStringLiteral("success");
}

QColor NodeCore::statusColor() const
{
    return Framework::Theme::active().color(QStringLiteral("node"), statusColorEntry(), QColor(Qt::black));
}

void NodeCore::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

void NodeCore::setCommander(Core::Commander *commander)
{
    g_commander = commander;
}

Core::Commander *NodeCore::commander()
{
    return g_commander;
}

void NodeCore::setFeatureHook(FeatureHook hook)
{
    hookSlot() = std::move(hook);
}

const NodeCore::FeatureHook &NodeCore::featureHook()
{
    return hookSlot();
}

QString NodeCore::sizeText(std::uint64_t bytes)
{
    if (bytes < 1024)
        return tr("%1 bytes").arg(bytes);
    static const char *const units[] = {"KB", "MB", "GB", "TB", "PB", "EB"};
    double value = double(bytes);
    int unit = -1;
    while (value >= 1024.0 && unit < 5) {
        value /= 1024.0;
        ++unit;
    }
    const int decimals = value < 10.0 ? 2 : (value < 100.0 ? 1 : 0);
    return QStringLiteral("%1 %2").arg(QString::number(value, 'f', decimals), tr(units[unit]));
}
