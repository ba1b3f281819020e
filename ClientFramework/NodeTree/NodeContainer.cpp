#include "ClientFramework/NodeTree/NodeContainer.h"

#include "ClientFramework/NodeTree/EntryInfo.h"
#include "ClientFramework/NodeTree/NodeFile.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeMenu.h"

#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <QCoreApplication>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

NodeContainer::NodeContainer(const QString &title, NodeCore *parent) : NodeCore(parent), m_title(title)
{
    setState(NodeState::Ready | NodeState::Populated);
}

QString NodeContainer::kindText() const
{
    return tr("File Group");
}

QList<PropertyGroup> NodeContainer::properties() const
{
    QList<PropertyGroup> groups = NodeCore::properties();
    groups.first().items.append({tr("Items"), QString::number(childCount()), QString()});
    return groups;
}

void NodeContainer::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    m.addPlaceholder();
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

void NodeFileContainer::addEntry(CEntry *entry)
{
    if (!entry)
        return;
    m_entries.append(entry);
    if (entry->IsFolder())
        appendChild(new NodeFolder(entry, this));
    else
        appendChild(new NodeFile(entry, this));
}

std::uint32_t NodeFileContainer::entryCount() const
{
    return std::uint32_t(m_entries.size());
}

CEntry *NodeFileContainer::entryAt(std::uint32_t index) const
{
    return index < std::uint32_t(m_entries.size()) ? m_entries[qsizetype(index)] : nullptr;
}

cStorage *NodeFileContainer::kernelStorage() const
{
    return kernelVolume();
}

CDevice *NodeFileContainer::kernelDevice() const
{
    return m_entries.isEmpty() ? nullptr : EntryInfo::deviceOf(m_entries.first());
}

CVolume *NodeFileContainer::kernelVolume() const
{
    return m_entries.isEmpty() ? nullptr : EntryInfo::volumeOf(m_entries.first());
}
