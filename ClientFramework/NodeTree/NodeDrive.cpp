#include "ClientFramework/NodeTree/NodeDrive.h"

#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodeMenu.h"
#include "ClientFramework/NodeTree/VolumeIntegrityGroup.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QAction>
#include <QCoreApplication>
#include <QMenu>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

// The index that asks a volume for its file-table copies without selecting one.
constexpr std::uint8_t QueryCopies = 0xFF;

} // namespace

void addActiveTableMenu(NodeMenu &m, const NodeDrive *drive, bool enabled)
{
    if (!drive || !m.menu())
        return;
    int current = -1;
    const QStringList copies = drive->fileTableCopies(&current);
    if (copies.isEmpty())
        return;
    QMenu probe;
    NodeMenu scratch(&probe, drive);
    if (!scratch.addCommand(QStringLiteral("cmdPart_FT")))
        return; // the command is not registered: no sub-menu either
    auto *sub = new QMenu(tr("Active Table"), m.menu());
    sub->setObjectName(QStringLiteral("ActiveTable"));
    NodeMenu s(sub, drive);
    for (int i = 0; i < copies.size(); ++i) {
        QAction *a = s.addCommand(QStringLiteral("cmdPart_FT"), enabled, copies[i], QVariant(i));
        if (a) {
            a->setCheckable(true);
            a->setChecked(i == current);
        }
    }
    m.addSubMenu(sub);
}

NodeDrive::NodeDrive(CVolume *volume, NodeCore *parent) : NodeStorage(parent), m_volume(volume)
{
    std::uint32_t s = 0;
    if (m_volume && m_volume->IsReady())
        s |= NodeState::Ready;
    setState(s);
    if (m_volume && m_volume->IsReady() && m_volume->GetRootEntry()) {
        m_rootFolder = new NodeFolderRoot(m_volume->GetRootEntry(), this);
        appendChild(m_rootFolder);
    }
    setFlags(NodeState::Populated);
}

NodeDrive::~NodeDrive() = default;

cStorage *NodeDrive::kernelStorage() const
{
    return m_volume;
}

CPartition *NodeDrive::kernelPartition() const
{
    for (const NodeCore *n = parent(); n; n = n->parent())
        if (auto *k = dynamic_cast<const IKernelStorage *>(n))
            return k->kernelPartition();
    return nullptr;
}

CEntry *NodeDrive::kernelEntry() const
{
    return m_volume ? m_volume->GetRootEntry() : nullptr;
}

std::uint64_t NodeDrive::firstSector() const
{
    const CPartition *p = kernelPartition();
    return p ? p->GetStart() : 0;
}

std::uint32_t NodeDrive::entryCount() const
{
    CEntry *root = kernelEntry();
    return root ? root->GetChildCount() : 0;
}

CEntry *NodeDrive::entryAt(std::uint32_t index) const
{
    CEntry *root = kernelEntry();
    return root ? static_cast<CEntry *>(root->GetChild(index)) : nullptr;
}

QStringList NodeDrive::fileTableCopies(int *current) const
{
    if (current)
        *current = -1;
    if (!m_volume || !m_volume->IsReady())
        return {};
    std::uint8_t count = 0;
    std::uint8_t inUse = 0;
    m_volume->SelectFileTableCopy(QueryCopies, count, inUse);
    if (count == 0)
        return {};
    QStringList names;
    const auto kind = static_cast<FileSystemKind>(m_volume->GetKind());
    for (int i = 0; i < count; ++i) {
        if (kind == FileSystemKind::Ntfs)
            names << (i == 0 ? QStringLiteral("$MFT")
                             : (i == 1 ? QStringLiteral("$MFT Mirror") : tr("Copy %1").arg(i + 1)));
        else if (kind == FileSystemKind::Fat || kind == FileSystemKind::Fat32)
            names << tr("FAT %1").arg(i + 1);
        else
            names << tr("Copy %1").arg(i + 1);
    }
    if (current && inUse < count)
        *current = inUse;
    return names;
}

bool NodeDrive::isDamaged() const
{
    if (!m_volume || !m_volume->IsReady())
        return false;
    std::uint64_t valid = 0;
    std::uint64_t checked = 0;
    m_volume->GetIntegrity(valid, checked);
    // Damaged: an item the volume was expected to have is not valid.
    return checked != CVolume::AllItems && (valid & checked) != checked;
}

QString NodeDrive::statusText() const
{
    QString text = NodeStorage::statusText();
    if (isReady() && isDamaged())
        text = tr("Damaged");
    return text;
}

bool NodeDrive::onImage() const
{
    for (const NodeCore *n = parent(); n; n = n->parent())
        if (n->kind() == NodeKind::Device)
            return n->hasFlags(NodeState::Image);
    return false;
}

bool NodeDrive::onRaid() const
{
    for (const NodeCore *n = parent(); n; n = n->parent())
        if (n->kind() == NodeKind::Device)
            return n->hasFlags(NodeState::Raid);
    return false;
}

bool NodeDrive::onVirtual() const
{
    for (const NodeCore *n = parent(); n; n = n->parent())
        if (n->kind() == NodeKind::Device)
            return n->hasFlags(NodeState::Virtual);
    return false;
}

QString NodeDrive::name() const
{
    if (!m_volume || !m_volume->IsReady())
        return tr("[not ready]");
    return m_volume->GetDisplayName();
}

QString NodeDrive::typeKey() const
{
    return (onImage() || onVirtual() || onRaid()) ? QStringLiteral("drive-virtual") : QStringLiteral("drive");
}

QString NodeDrive::key() const
{
    const std::uint32_t kind = m_volume ? m_volume->GetKind() : 0;
    return QStringLiteral("drive-%1-%2").arg(kind).arg(firstSector());
}

QString NodeDrive::kindText() const
{
    if (onImage())
        return tr("Disk Image");
    if (onVirtual() || onRaid())
        return tr("Virtual Volume");
    return tr("Volume");
}

QString NodeDrive::sourceText() const
{
    if (onImage())
        return tr("Disk Image Volume");
    if (onRaid())
        return tr("RAID Assembly Volume");
    return m_volume ? FileSystemKindName(m_volume->GetKind()) : QString();
}

QString NodeDrive::extraText(NodeAttr attr) const
{
    if (!m_volume)
        return NodeStorage::extraText(attr);
    switch (attr) {
    case NodeAttr::FileSystem:
        return FileSystemKindName(m_volume->GetKind());
    case NodeAttr::Label:
        return m_volume->GetLabel();
    case NodeAttr::Serial:
        return m_volume->GetSerialNumber()
                   ? QStringLiteral("%1-%2")
                         .arg(m_volume->GetSerialNumber() >> 16, 4, 16, QLatin1Char('0'))
                         .arg(m_volume->GetSerialNumber() & 0xFFFF, 4, 16, QLatin1Char('0'))
                         .toUpper()
                   : QString();
    case NodeAttr::FreeSpace:
        return m_volume->IsFreeKnown() ? sizeText(m_volume->GetFreeBytes()) : QString();
    case NodeAttr::Path:
        return m_volume->GetName();
    default:
        return NodeStorage::extraText(attr);
    }
}

QList<PropertyGroup> NodeDrive::properties() const
{
    QList<PropertyGroup> groups = NodeStorage::properties();
    PropertyGroup vol{tr("Volume"), {}};
    for (NodeAttr a :
         {NodeAttr::FileSystem, NodeAttr::Label, NodeAttr::Serial, NodeAttr::Size, NodeAttr::FreeSpace,
          NodeAttr::Path, NodeAttr::FirstSector, NodeAttr::SectorCount, NodeAttr::SectorSize}) {
        const auto p = property(a);
        if (!p.second.isEmpty())
            vol.items.append({p.first, p.second, QString()});
    }
    if (m_volume && m_volume->IsReady())
        vol.items.append({tr("Cluster Size"), QString::number(m_volume->GetClusterSize()), QString()});
    groups.append(vol);
    if (m_volume && m_volume->IsReady())
        groups.append(VolumeIntegrityGroup::of(m_volume));
    return groups;
}

void NodeDrive::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    const bool data = isReady() && !hasFlags(NodeState::Busy);
    m.addCommand(QStringLiteral("cmdHex_NodeOpen"), data);
    m.addCommand(QStringLiteral("cmdNode_Browse"), data);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdPart_Boot"), data);
    addActiveTableMenu(m, this, data);
    m.addSeparator();
    for (const char *id : {"cmdPart_Active", "cmdPart_Rename", "cmdPart_Resize", "cmdPart_Format"})
        m.addCommand(QString::fromLatin1(id), data);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdPart_Delete"), data);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdDI_Create"), data);
    m.addCommand(QStringLiteral("cmdOpenInOSBrowser"), data);
    m.addPlaceholder();
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

QString NodeDrive::defaultCommand() const
{
    return QStringLiteral("cmdHex_NodeOpen");
}

QString NodeDriveDetected::statusText() const
{
    return tr("%1, Scanned").arg(NodeDrive::statusText());
}

QString NodeDriveDetected::kindText() const
{
    return tr("Detected Volume");
}
