#include "ClientFramework/NodeTree/NodeDevice.h"

#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeMenu.h"
#include "ClientFramework/NodeTree/NodePartition.h"
#include "ClientFramework/NodeTree/VolumeSource.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <QCoreApplication>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

bool isImage(const CDevice *d)
{
    return d->GetDescriptor().sub != 0 || (d->GetAttributes() & DeviceAttribute::DiskImage) != 0 ||
           d->GetImageHandle() != nullptr;
}

bool isRaid(const CDevice *d)
{
    return d->GetRaidIdentity() != nullptr || d->GetMediaType() == MediaType::RaidAssembly ||
           (d->GetAttributes() & DeviceAttribute::Raid) != 0;
}

bool isVirtual(const CDevice *d)
{
    const MediaType m = d->GetMediaType();
    return m == MediaType::VirtualDevice || m == MediaType::VirtualManager ||
           (d->GetAttributes() & DeviceAttribute::Virtual) != 0;
}

bool isRemovable(const CDevice *d)
{
    return d->GetMediaType() == MediaType::Removable || d->GetDescriptor().removable ||
           (d->GetAttributes() & DeviceAttribute::Removable) != 0;
}

} // namespace

NodeDevice::NodeDevice(CDevice *device, NodeCore *parent) : NodeStorage(parent), m_device(device)
{
    refreshState();
    rebuild();
}

NodeDevice::~NodeDevice()
{
    // The nodes below go before the node they point up to.
    qDeleteAll(childList());
    childList().clear();
}

cStorage *NodeDevice::kernelStorage() const
{
    return m_device;
}

void NodeDevice::refreshState()
{
    std::uint32_t s = state() & (NodeState::Busy | NodeState::Waiting | NodeState::Populated);
    if (m_device) {
        const std::uint32_t a = m_device->GetAttributes();
        if (m_device->IsReady() && !(a & DeviceAttribute::NotReady)) {
            s |= NodeState::Ready;
            if (!m_device->IsWritable())
                s |= NodeState::ReadOnly;
        }
        if (isImage(m_device))
            s |= NodeState::Image;
        if (isRaid(m_device))
            s |= NodeState::Raid;
        if (isVirtual(m_device))
            s |= NodeState::Virtual;
        if (isRemovable(m_device))
            s |= NodeState::Removable;
        if (a & DeviceAttribute::System)
            s |= NodeState::System;
        if (a & (DeviceAttribute::SmartWarnings | DeviceAttribute::InterruptedErase))
            s |= NodeState::Warning;
        if (a & DeviceAttribute::SmartFailed)
            s |= NodeState::Critical;
    }
    setState(s);
}

void NodeDevice::rebuild()
{
    // The kernel objects the children stand for: the partitions (with their index in the kernel's
    // list), or the whole-device volume.
    QList<QPair<CPartition *, int>> partitions;
    CVolume *whole = nullptr;
    QList<const cStorage *> wanted;
    if (m_device && isReady()) {
        const std::uint32_t count = m_device->GetPartitionCount();
        for (std::uint32_t i = 0; i < count; ++i)
            if (CPartition *p = m_device->GetPartition(i)) {
                partitions.append({p, int(i)});
                wanted.append(p);
            }
        if (count == 0 && (whole = VolumeSource::volumeOf(m_device)))
            wanted.append(whole);
    }
    // The same objects keep their nodes, and with them whatever shows or selects those nodes.
    QList<const cStorage *> held;
    for (NodeCore *c : children())
        if (auto *k = dynamic_cast<IKernelStorage *>(c))
            held.append(k->kernelStorage());
    if (isPopulated() && held == wanted)
        return;
    clearChildren();
    for (const auto &[partition, index] : partitions)
        appendChild(new NodePartition(partition, index, this));
    if (whole)
        appendChild(new NodeDrive(whole, this));
    setFlags(NodeState::Populated, m_device && isReady());
}

QString NodeDevice::biosNumber() const
{
    if (!m_device || isImage(m_device) || m_device->GetDescriptor().source != EnumSource::PhysicalDrive)
        return QString();
    const unsigned number = 0x80u + m_device->GetDescriptor().number;
    if (number > 0xFF)
        return QString();
    return QStringLiteral("%1h").arg(number, 2, 16, QLatin1Char('0'));
}

QString NodeDevice::permissionTip()
{
    return tr("Reading disks needs root or membership of the disk group.");
}

QString NodeDevice::notReadyTip() const
{
    return isReady() ? QString() : permissionTip();
}

QString NodeDevice::name() const
{
    if (!m_device)
        return QString();
    QString model = m_device->GetModel().trimmed();
    if (model.isEmpty())
        model = m_device->GetDisplayName();
    if (!isReady() || m_device->GetSize() == 0)
        return model;
    return tr("%1 (%2)").arg(model, sizeText(m_device->GetSize()));
}

QString NodeDevice::typeKey() const
{
    return QStringLiteral("device");
}

QString NodeDevice::key() const
{
    if (!m_device)
        return QString();
    const DeviceInfo &info = m_device->GetDescriptor();
    const QString number = QString::number(info.number);
    if (isImage(m_device))
        return QStringLiteral("di-%1").arg(number);
    if (isRaid(m_device))
        return QStringLiteral("raid-%1").arg(number);
    if (isVirtual(m_device))
        return QStringLiteral("virtual-%1").arg(number);
    // A disk that tells its serial number keeps its key when it comes back under another number.
    const QString serial = m_device->GetSerial(0).trimmed();
    const QString firmware = m_device->GetFirmware().trimmed();
    if (isRemovable(m_device) && !serial.isEmpty())
        return QStringLiteral("rem-%1-%2-%3").arg(biosNumber(), firmware, serial);
    if (!serial.isEmpty())
        return QStringLiteral("disk-%1-%2-%3").arg(m_device->GetModel().trimmed(), firmware, serial);
    return QStringLiteral("device-%1").arg(number);
}

QString NodeDevice::kindText() const
{
    if (!m_device)
        return QString();
    const std::uint32_t a = m_device->GetAttributes();
    QString text = (a & (DeviceAttribute::Dynamic | DeviceAttribute::Ldm)) ? tr("Dynamic") : tr("Basic");
    if ((a & DeviceAttribute::Ssd) || m_device->GetRotation() == Rotation::SolidState)
        text += tr(", SSD");
    return text;
}

QString NodeDevice::sourceText() const
{
    if (!m_device)
        return QString();
    if (isImage(m_device)) {
        std::uint8_t source = 0;
        std::uint16_t number = 0;
        QStringList files;
        const std::uint8_t kind = m_device->GetImageIdentity(source, number, files);
        if (kind > std::uint8_t(ImageKind::OwnBackup))
            return tr("Unknown Disk Image");
        if (files.isEmpty())
            return tr("unidentified source");
        if (files.size() > 1)
            return tr("combined file chunks");
        return tr("Loaded from %1").arg(files.first());
    }
    const DeviceInfo &info = m_device->GetDescriptor();
    if (info.source == EnumSource::VolumeBacked && !info.backingFile.isEmpty())
        return tr("Loaded from %1").arg(info.backingFile);
    if (info.stack.kind != BackingKind::None)
        return info.stack.KindText();
    return MediaTypeName(m_device->GetMediaType());
}

QString NodeDevice::extraText(NodeAttr attr) const
{
    if (!m_device)
        return QString();
    switch (attr) {
    case NodeAttr::Model:
        return m_device->GetModel();
    case NodeAttr::Firmware:
        return m_device->GetFirmware();
    case NodeAttr::Serial:
        return m_device->GetSerial(0);
    case NodeAttr::Path:
        return m_device->GetDisplayName();
    case NodeAttr::FileSystem:
        return PartStyleName(m_device->GetPartStyle());
    case NodeAttr::Description:
        return DeviceAttributeText(m_device->GetAttributes());
    default:
        return NodeStorage::extraText(attr);
    }
}

QString NodeDevice::statusText() const
{
    QString text = NodeStorage::statusText();
    if (!m_device)
        return text;
    const std::uint32_t a = m_device->GetAttributes();
    if (a & DeviceAttribute::SmartFailed)
        text = tr("%1, SMART Failed").arg(text);
    if (a & DeviceAttribute::InterruptedErase)
        text = tr("%1, Interrupted Erase").arg(text);
    if (isReady() && (a & DeviceAttribute::NotInitialized))
        text = tr("%1, Not Initialized").arg(text);
    if (a & DeviceAttribute::SmartWarnings)
        text = tr("%1, SMART Warnings").arg(text);
    return text;
}

QList<PropertyGroup> NodeDevice::properties() const
{
    QList<PropertyGroup> groups = NodeStorage::properties();
    PropertyGroup device{tr("Device"), {}};
    for (NodeAttr a : {NodeAttr::Model, NodeAttr::Firmware, NodeAttr::Serial, NodeAttr::Source,
                       NodeAttr::Path, NodeAttr::FileSystem, NodeAttr::Size, NodeAttr::SectorSize,
                       NodeAttr::SectorCount, NodeAttr::Description}) {
        const auto p = property(a);
        if (!p.second.isEmpty())
            device.items.append(
                {a == NodeAttr::FileSystem ? tr("Partition Style") : p.first, p.second, QString()});
    }
    if (m_device) {
        const BlockStack &stack = m_device->GetDescriptor().stack;
        if (!stack.members.isEmpty())
            device.items.append({tr("Members"), stack.members.join(QStringLiteral(", ")),
                                 tr("The block devices this device is built from")});
        if (!stack.holders.isEmpty())
            device.items.append({tr("Holders"), stack.holders.join(QStringLiteral(", ")),
                                 tr("The block devices built on this device")});
    }
    if (!isReady())
        device.items.append({tr("Note"), notReadyTip(), QString()});
    groups.append(device);
    return groups;
}

void NodeDevice::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    const bool data = isReady() && !hasFlags(NodeState::Busy);
    const auto enabled = [data](const QString &) { return data; };
    m.addAll({QStringLiteral("cmdHex_NodeOpen"), QStringLiteral("cmdNode_Browse"), NodeMenu::Separator,
              QStringLiteral("cmdDisk_Init"), QStringLiteral("cmdPart_ConvMBR"),
              QStringLiteral("cmdPart_ConvGPT"), QStringLiteral("cmdPart_Convert"),
              QStringLiteral("cmdPart_Create"), QStringLiteral("cmdDisk_Virtual"),
              QStringLiteral("cmdPart_Virtual"), NodeMenu::Separator, QStringLiteral("cmdDI_Verify"),
              QStringLiteral("cmdDI_Create"), NodeMenu::Separator, QStringLiteral("cmdPart_Table"),
              QStringLiteral("cmdDisk_Rollback"), NodeMenu::Placeholder},
             enabled);
    if (state() & (NodeState::Busy | NodeState::Waiting))
        m.addCommand(QStringLiteral("cmdNode_Stop"), true, tr("Stop"));
    m.addSeparator();
    if (hasFlags(NodeState::Image))
        m.addCommand(QStringLiteral("cmdRemove"), !hasFlags(NodeState::Busy));
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdSmartInfo"), data && !hasFlags(NodeState::Image));
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}

QString NodeDevice::defaultCommand() const
{
    return QStringLiteral("cmdHex_NodeOpen");
}
