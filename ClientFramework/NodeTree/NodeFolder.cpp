#include "ClientFramework/NodeTree/NodeFolder.h"

#include "ClientFramework/NodeTree/EntryInfo.h"
#include "ClientFramework/NodeTree/NodeFile.h"
#include "ClientFramework/NodeTree/NodeMenu.h"
#include "ClientFramework/Threads/NodeTag.h"

#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <QCoreApplication>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

NodeFolder::NodeFolder(CEntry *entry, NodeCore *parent) : NodeStatic(parent), m_entry(entry)
{
    setState(EntryInfo::stateOf(entry));
}

NodeFolder::~NodeFolder()
{
    qDeleteAll(m_pending);
}

cStorage *NodeFolder::kernelStorage() const
{
    return m_entry;
}

CDevice *NodeFolder::kernelDevice() const
{
    return EntryInfo::deviceOf(m_entry);
}

CPartition *NodeFolder::kernelPartition() const
{
    return EntryInfo::partitionOf(m_entry);
}

CVolume *NodeFolder::kernelVolume() const
{
    return EntryInfo::volumeOf(m_entry);
}

std::uint32_t NodeFolder::entryCount() const
{
    return m_entry ? m_entry->GetChildCount() : 0;
}

CEntry *NodeFolder::entryAt(std::uint32_t index) const
{
    return m_entry ? static_cast<CEntry *>(m_entry->GetChild(index)) : nullptr;
}

bool NodeFolder::needsPopulation() const
{
    if (!m_entry)
        return false;
    return !isPopulated() || std::uint32_t(childCount()) != m_entry->GetChildCount();
}

bool NodeFolder::populate(Threads::NodeTag *tag)
{
    qDeleteAll(m_pending);
    m_pending.clear();
    m_pendingCounters = Counters();
    m_prepared = false;
    m_cancelled = false;
    if (!m_entry)
        return true;
    const bool force = tag && tag->force();
    const std::uint32_t count = m_entry->GetChildCount();
    if (!force && isPopulated() && std::uint32_t(childCount()) == count)
        return true;
    const bool top = !tag || tag->depth() == 0;
    if (tag && top) {
        tag->setText(tr("Populating %1").arg(name()));
        tag->start();
    }
    for (std::uint32_t i = 0; i < count; ++i) {
        if (tag && tag->isCancelled()) {
            qDeleteAll(m_pending);
            m_pending.clear();
            m_cancelled = true;
            return false;
        }
        auto *e = static_cast<CEntry *>(m_entry->GetChild(i));
        if (!e)
            continue;
        if (e->IsFolder()) {
            auto *folder = new NodeFolder(e, this);
            m_pending.append(folder);
            if (tag && tag->recursive()) {
                tag->enter();
                folder->populate(tag);
                tag->leave();
                // The sub-folder is not shown yet: it takes its children at once.
                folder->applyPopulation();
                if (tag->isCancelled())
                    continue; // the loop's check ends the population
            }
            const Counters &c = folder->counters();
            m_pendingCounters.folders += 1 + c.folders;
            m_pendingCounters.files += c.files;
            m_pendingCounters.size += c.size;
            m_pendingCounters.deleted += c.deleted;
        } else {
            m_pending.append(new NodeFile(e, this));
            m_pendingCounters.files += 1;
            m_pendingCounters.size += e->GetSize();
        }
        if (EntryInfo::isDeleted(e))
            m_pendingCounters.deleted += 1;
        if (tag && top)
            tag->setProgress(i + 1, count);
    }
    if (tag && tag->isCancelled()) {
        qDeleteAll(m_pending);
        m_pending.clear();
        m_cancelled = true;
        return false;
    }
    m_prepared = true;
    return true;
}

void NodeFolder::applyPopulation()
{
    if (m_cancelled) {
        // A cancelled population leaves the folder unpopulated: the next expansion starts again.
        m_cancelled = false;
        clearChildren();
        mutableCounters() = Counters();
        setFlags(NodeState::Populated, false);
        notifyChildrenChanged();
        return;
    }
    if (!m_prepared)
        return;
    m_prepared = false;
    clearChildren();
    mutableCounters() = m_pendingCounters;
    QList<NodeCore *> fresh;
    fresh.swap(m_pending);
    appendChildren(fresh);
    setFlags(NodeState::Populated);
    notifyChildrenChanged();
}

QString NodeFolder::statusText() const
{
    return EntryInfo::statusText(m_entry);
}

QString NodeFolder::name() const
{
    return m_entry ? m_entry->GetName() : QString();
}

QString NodeFolder::key() const
{
    return EntryInfo::key(m_entry);
}

QString NodeFolder::kindText() const
{
    return tr("File Folder");
}

QString NodeFolder::extraText(NodeAttr attr) const
{
    switch (attr) {
    case NodeAttr::Size:
        return isPopulated() ? sizeText(counters().size) : QString();
    case NodeAttr::Children:
        return isPopulated() ? tr("%1 folder(s), %2 file(s)").arg(counters().folders).arg(counters().files)
                             : QString();
    case NodeAttr::EntryIndex:
        return m_entry && m_entry->GetIndex() != CEntry::NoIndex ? QString::number(m_entry->GetIndex())
                                                                 : QString();
    default:
        return QString();
    }
}

QList<PropertyGroup> NodeFolder::properties() const
{
    QList<PropertyGroup> groups = NodeStatic::properties();
    for (NodeAttr a : {NodeAttr::Size, NodeAttr::Children}) {
        const auto p = property(a);
        if (!p.second.isEmpty())
            groups.first().items.append({p.first, p.second, QString()});
    }
    groups.append(EntryInfo::attributeGroup(m_entry));
    groups.append(EntryInfo::advancedGroup(m_entry));
    return groups;
}

void NodeFolder::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    const bool data = isReady();
    m.addCommand(QStringLiteral("cmdHex_FileRecord"), data);
    m.addCommand(QStringLiteral("cmdOpenInOSBrowser"), data);
    m.addPlaceholder();
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

QString NodeFolder::defaultCommand() const
{
    // A folder opens by expanding it in the view.
    return QString();
}

QString NodeFolderRoot::name() const
{
    const CEntry *e = entry();
    const QString n = e ? e->GetName() : QString();
    return n.isEmpty() ? QStringLiteral("\\") : n;
}
