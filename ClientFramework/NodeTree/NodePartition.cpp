#include "ClientFramework/NodeTree/NodePartition.h"

#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeMenu.h"
#include "ClientFramework/NodeTree/VolumeIntegrityGroup.h"
#include "ClientFramework/NodeTree/VolumeSource.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QCoreApplication>
#include <QMenu>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

NodePartition::NodePartition(CPartition *partition, int position, NodeCore *parent)
    : NodeStorage(parent), m_partition(partition), m_position(position)
{
    std::uint32_t s = 0;
    const cDevice *device = partition ? partition->GetDevice() : nullptr;
    if (!device || device->IsReady())
        s |= NodeState::Ready;
    setState(s);
    build();
}

NodePartition::~NodePartition()
{
    // The nodes below go before the node they point up to.
    qDeleteAll(childList());
    childList().clear();
}

void NodePartition::build()
{
    if (!m_partition)
        return;
    const std::uint32_t children = m_partition->GetChildCount();
    if (children > 0) {
        for (std::uint32_t i = 0; i < children; ++i)
            if (CPartition *c = m_partition->GetChildPartition(i))
                appendChild(new NodePartition(c, int(i), this));
    } else if (!isUnallocated() && !isExtended()) {
        m_volume = VolumeSource::volumeOf(m_partition);
        // A partition whose scan made slices of it is a container now.
        if (!m_volume && m_partition->GetChildCount() > 0) {
            for (std::uint32_t i = 0; i < m_partition->GetChildCount(); ++i)
                if (CPartition *c = m_partition->GetChildPartition(i))
                    appendChild(new NodePartition(c, int(i), this));
        } else if (m_volume) {
            appendChild(new NodeDrive(m_volume, this));
        }
    }
    setFlags(NodeState::Populated);
}

bool NodePartition::isUnallocated() const
{
    return m_partition && m_partition->GetKind() == std::uint32_t(FileSystemKind::Unallocated);
}

bool NodePartition::isExtended() const
{
    return m_partition && m_partition->GetKind() == std::uint32_t(FileSystemKind::Extended);
}

cStorage *NodePartition::kernelStorage() const
{
    return m_partition;
}

std::uint64_t NodePartition::firstSector() const
{
    return m_partition ? m_partition->GetStart() : 0;
}

QString NodePartition::partitionKindText(const CPartition *p)
{
    if (!p)
        return tr("Partition");
    switch (static_cast<FileSystemKind>(p->GetKind())) {
    case FileSystemKind::Unallocated:
        return tr("Unallocated");
    case FileSystemKind::Extended:
        // The extended partition of the boot record, or an extended link inside it.
        return p->GetParent() ? tr("Extended") : tr("Extended Root");
    case FileSystemKind::MetadataArea:
        return tr("Dynamic");
    case FileSystemKind::DataArea:
        return tr("Data LDM");
    default:
        break;
    }
    if (p->IsGptEntry())
        return tr("Partition");
    if (p->GetParent()) {
        const CPartition *parent = static_cast<const CPartition *>(p->GetParent());
        return parent->GetKind() == std::uint32_t(FileSystemKind::Extended) ? tr("Logical") : tr("Partition");
    }
    if (p->GetEntryType() != 0)
        return tr("Primary");
    return tr("Partition");
}

QString NodePartition::name() const
{
    if (!m_partition)
        return tr("Unallocated Space");
    if (isUnallocated())
        return tr("Unallocated Space");
    if (isExtended())
        return tr("Extended Partition");
    if (m_volume) {
        const QString label = m_volume->GetLabel().trimmed();
        if (!label.isEmpty())
            return label;
        return m_volume->GetDisplayName();
    }
    if (m_partition->IsGptEntry() && !m_partition->GetGpt().name.isEmpty())
        return m_partition->GetGpt().name;
    return m_partition->GetDisplayName();
}

QString NodePartition::key() const
{
    const std::uint32_t kind = m_partition ? m_partition->GetKind() : 0;
    const std::uint64_t start = m_partition ? m_partition->GetStart() : 0;
    // Kind and first sector: the key survives a refresh that renumbers the table's rows.
    return QStringLiteral("part-%1-%2").arg(kind).arg(start);
}

QString NodePartition::kindText() const
{
    return partitionKindText(m_partition);
}

QString NodePartition::sourceText() const
{
    if (!m_partition || isUnallocated() || isExtended())
        return QString();
    return FileSystemKindName(m_volume ? m_volume->GetKind() : m_partition->GetKind());
}

QString NodePartition::extraText(NodeAttr attr) const
{
    switch (attr) {
    case NodeAttr::FileSystem:
        return sourceText();
    case NodeAttr::Label:
        return m_volume ? m_volume->GetLabel() : QString();
    case NodeAttr::Path:
        return m_partition ? m_partition->GetDisplayName() : QString();
    default:
        return NodeStorage::extraText(attr);
    }
}

QList<PropertyGroup> NodePartition::properties() const
{
    QList<PropertyGroup> groups = NodeStorage::properties();
    PropertyGroup part{tr("Partition"), {}};
    for (NodeAttr a : {NodeAttr::FileSystem, NodeAttr::Label, NodeAttr::Size, NodeAttr::FirstSector,
                       NodeAttr::SectorCount, NodeAttr::SectorSize}) {
        const auto p = property(a);
        if (!p.second.isEmpty())
            part.items.append({p.first, p.second, QString()});
    }
    if (m_partition && m_partition->IsGptEntry() && !m_partition->GetGpt().name.isEmpty())
        part.items.append({tr("Partition Name"), m_partition->GetGpt().name, QString()});
    if (m_partition && m_partition->GetActive())
        part.items.append({tr("Active"), tr("Yes"), QString()});
    groups.append(part);
    if (m_volume && m_volume->IsReady())
        groups.append(VolumeIntegrityGroup::of(m_volume));
    return groups;
}

void NodePartition::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    const bool data = isReady() && !hasFlags(NodeState::Busy);
    const bool allocated = !isUnallocated();
    const auto *drive = childCount() == 1 ? dynamic_cast<const NodeDrive *>(child(0)) : nullptr;
    m.addCommand(QStringLiteral("cmdHex_NodeOpen"), data);
    m.addCommand(QStringLiteral("cmdNode_Browse"), data && drive);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdPart_Boot"), data && allocated);
    addActiveTableMenu(m, drive, data);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdPart_Create"), data && (isUnallocated() || isExtended()));
    for (const char *id :
         {"cmdPart_Convert", "cmdPart_Active", "cmdPart_Rename", "cmdPart_Resize", "cmdPart_Format"})
        m.addCommand(QString::fromLatin1(id), data && allocated);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdPart_Delete"), data && allocated);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdDI_Create"), data);
    m.addCommand(QStringLiteral("cmdOpenInOSBrowser"), data && drive);
    m.addPlaceholder();
    if (hasFlags(NodeState::Busy))
        m.addCommand(QStringLiteral("cmdNode_Stop"), true, tr("Stop"));
    else if (hasFlags(NodeState::Waiting))
        m.addCommand(QStringLiteral("cmdNode_Stop"), true, tr("Cancel"));
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

QString NodePartition::defaultCommand() const
{
    return QStringLiteral("cmdHex_NodeOpen");
}
