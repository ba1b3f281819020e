#include "ClientFramework/NodeTree/NodeFile.h"

#include "ClientFramework/NodeTree/EntryInfo.h"
#include "ClientFramework/NodeTree/NodeMenu.h"

#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QCoreApplication>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

NodeFile::NodeFile(CEntry *entry, NodeCore *parent) : NodeCore(parent), m_entry(entry)
{
    setState(EntryInfo::stateOf(entry));
}

NodeFile::~NodeFile() = default;

std::uint64_t NodeFile::size() const
{
    return m_entry ? m_entry->GetSize() : 0;
}

std::uint32_t NodeFile::sectorSize() const
{
    const CVolume *v = kernelVolume();
    return v ? v->GetBytesPerSector() : 512;
}

std::uint64_t NodeFile::firstSector() const
{
    const CPartition *p = kernelPartition();
    return p ? p->GetStart() : 0;
}

std::uint64_t NodeFile::sectorCount() const
{
    const CVolume *v = kernelVolume();
    return v ? v->GetTotalSectors() : 0;
}

cStorage *NodeFile::kernelStorage() const
{
    return m_entry;
}

CDevice *NodeFile::kernelDevice() const
{
    return EntryInfo::deviceOf(m_entry);
}

CPartition *NodeFile::kernelPartition() const
{
    return EntryInfo::partitionOf(m_entry);
}

CVolume *NodeFile::kernelVolume() const
{
    return EntryInfo::volumeOf(m_entry);
}

QString NodeFile::statusText() const
{
    return EntryInfo::statusText(m_entry);
}

QString NodeFile::name() const
{
    return m_entry ? m_entry->GetName() : QString();
}

QString NodeFile::key() const
{
    return EntryInfo::key(m_entry);
}

QString NodeFile::kindText() const
{
    return tr("File");
}

QString NodeFile::extraText(NodeAttr attr) const
{
    switch (attr) {
    case NodeAttr::Size:
        return sizeText(size());
    case NodeAttr::EntryIndex:
        return m_entry && m_entry->GetIndex() != CEntry::NoIndex ? QString::number(m_entry->GetIndex())
                                                                 : QString();
    default:
        return QString();
    }
}

QList<PropertyGroup> NodeFile::properties() const
{
    PropertyGroup general{tr("General Information"), {}};
    for (NodeAttr a :
         {NodeAttr::Name, NodeAttr::Kind, NodeAttr::Location, NodeAttr::Size, NodeAttr::Status}) {
        const auto p = property(a);
        general.items.append({p.first, p.second, QString()});
    }
    general.items.append({tr("Size in Bytes"), QString::number(size()), QString()});
    return {general, EntryInfo::attributeGroup(m_entry), EntryInfo::advancedGroup(m_entry)};
}

void NodeFile::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    const bool data = isReady();
    m.addCommand(QStringLiteral("cmdPreview"), data && size() > 0);
    m.addCommand(QStringLiteral("cmdHex_NodeOpen"), data && size() > 0);
    m.addCommand(QStringLiteral("cmdHex_FileRecord"), data);
    m.addPlaceholder();
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

QString NodeFile::defaultCommand() const
{
    return size() > 0 ? QStringLiteral("cmdHex_NodeOpen") : QStringLiteral("cmdHex_FileRecord");
}
