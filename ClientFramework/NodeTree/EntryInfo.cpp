#include "ClientFramework/NodeTree/EntryInfo.h"

#include "ClientFramework/NodeTree/NodeAttr.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QCoreApplication>

namespace EntryInfo {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

QString yesNo(bool on)
{
    return on ? tr("Yes") : tr("No");
}

} // namespace

bool isDeleted(const CEntry *entry)
{
    return entry && (entry->GetAttributes() & AttrDeleted) != 0;
}

bool isSystem(const CEntry *entry)
{
    return entry && (entry->GetAttributes() & (CEntry::AttrSystemArea | AttrSystem)) != 0;
}

QString statusText(const CEntry *entry)
{
    if (isDeleted(entry))
        return tr("Deleted");
    if (isSystem(entry))
        return tr("System");
    return tr("Healthy");
}

std::uint32_t stateOf(const CEntry *entry)
{
    std::uint32_t s = 0;
    if (!entry)
        return s;
    const CVolume *v = entry->GetVolume();
    if (!v || v->IsReady())
        s |= NodeState::Ready;
    if (isSystem(entry))
        s |= NodeState::System;
    if (isDeleted(entry))
        s |= NodeState::Deleted;
    return s;
}

CVolume *volumeOf(const CEntry *entry)
{
    return entry ? entry->GetVolume() : nullptr;
}

CPartition *partitionOf(const CEntry *entry)
{
    const CVolume *v = volumeOf(entry);
    return v ? dynamic_cast<CPartition *>(v->GetMedium()) : nullptr;
}

CDevice *deviceOf(const CEntry *entry)
{
    const CVolume *v = volumeOf(entry);
    if (!v)
        return nullptr;
    cStorage *medium = v->GetMedium();
    if (auto *d = dynamic_cast<CDevice *>(medium))
        return d;
    if (auto *p = dynamic_cast<CPartition *>(medium))
        return dynamic_cast<CDevice *>(p->GetDevice());
    return nullptr;
}

QString key(const CEntry *entry)
{
    if (!entry)
        return QString();
    const QString index =
        entry->GetIndex() == CEntry::NoIndex ? QStringLiteral("-") : QString::number(entry->GetIndex());
    return QStringLiteral("%1[%2]").arg(entry->GetName(), index);
}

PropertyGroup attributeGroup(const CEntry *entry)
{
    PropertyGroup g{tr("Attributes"), {}};
    const std::uint32_t a = entry ? entry->GetAttributes() : 0;
    g.items.append({tr("Read Only"), yesNo(a & 0x01), QString()});
    g.items.append({tr("Hidden"), yesNo(a & 0x02), QString()});
    g.items.append({tr("System"), yesNo(a & (AttrSystem | CEntry::AttrSystemArea)), QString()});
    g.items.append({tr("Archive"), yesNo(a & 0x20), QString()});
    g.items.append({tr("Deleted"), yesNo(a & AttrDeleted), QString()});
    g.items.append({tr("Attribute Bits"), QStringLiteral("0x%1").arg(a, 8, 16, QLatin1Char('0')), QString()});
    return g;
}

PropertyGroup advancedGroup(const CEntry *entry)
{
    PropertyGroup g{tr("Advanced Properties"), {}};
    const QString unknown = tr("Unknown");
    QString firstSector = unknown;
    QString firstCluster = unknown;
    QString chain = unknown;
    QString position = unknown;
    QString type = unknown;
    if (entry) {
        const CVolume *v = entry->GetVolume();
        const CEntryHandle &h = entry->GetHandle();
        const std::uint32_t sector = v ? v->GetBytesPerSector() : 512;
        const std::uint64_t at = h.MapOffset(0);
        if (at != cStorage::NoSector && sector) {
            firstSector = QString::number(at / sector);
            if (v && v->GetClusterSize())
                firstCluster = QString::number(v->SectorToCluster(at / sector));
        }
        std::uint64_t units = 0;
        for (int i = 0; i < h.GetRunCount(); ++i) {
            std::uint64_t start = 0;
            std::uint64_t length = 0;
            if (h.GetRun(i, start, length))
                units += length;
        }
        const std::uint8_t shift = h.GetUnitShift();
        if (h.GetRunCount() > 0 && shift < 64)
            chain = QString::number(units << shift);
        std::uint64_t pos = entry->GetPosition();
        if (entry->GetAttributes() & CEntry::AttrSectorPosition)
            pos *= sector;
        position = QString::number(pos);
        type = (entry->GetAttributes() & CEntry::AttrSystemArea) ? tr("Service Area")
               : entry->IsFolder()                               ? tr("Folder")
                                                                 : tr("File");
    }
    g.items.append({tr("First Sector"), firstSector, QString()});
    g.items.append({tr("First Cluster"), firstCluster, QString()});
    g.items.append({tr("Cluster Chain Size"), chain, QString()});
    g.items.append({tr("File Entry Position"), position, tr("File table entry position on volume in bytes")});
    g.items.append({tr("File Entry Length"), unknown, tr("File table entry length in bytes")});
    g.items.append({tr("File Entry Type"), type, QString()});
    g.items.append({tr("Named Streams"), QStringLiteral("0"), QString()});
    return g;
}

} // namespace EntryInfo
