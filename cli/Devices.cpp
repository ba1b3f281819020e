#include "cli/Devices.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>

namespace Cli {

namespace {

QString SourceText(EnumSource source)
{
    switch (source) {
    case EnumSource::Floppy:
        return QStringLiteral("floppy");
    case EnumSource::PhysicalDrive:
        return QStringLiteral("physical drive");
    case EnumSource::OpticalDrive:
        return QStringLiteral("optical drive");
    case EnumSource::VolumeBacked:
        return QStringLiteral("virtual disk");
    }
    return QStringLiteral("unknown");
}

QString PathOf(const CDevice *device)
{
    CPlatformFile *handle = device->GetHandle();
    return handle ? handle->GetName() : QString();
}

} // namespace

QJsonObject DeviceJson(CDevice *d)
{
    const DeviceInfo &info = d->GetDescriptor();
    QJsonObject o;
    o.insert(QStringLiteral("number"), int(info.number));
    o.insert(QStringLiteral("source"), int(static_cast<quint8>(info.source)));
    o.insert(QStringLiteral("name"), d->GetDisplayName());
    o.insert(QStringLiteral("path"), PathOf(d));
    o.insert(QStringLiteral("mediaType"), MediaTypeName(d->GetMediaType()));
    o.insert(QStringLiteral("partStyle"), PartStyleName(d->GetPartStyle()));
    o.insert(QStringLiteral("sectorSize"), qint64(d->GetBytesPerSector()));
    o.insert(QStringLiteral("physicalSectorSize"), qint64(d->GetPhysicalBytesPerSector()));
    o.insert(QStringLiteral("totalSectors"), qint64(d->GetTotalSectors()));
    o.insert(QStringLiteral("model"), d->GetModel());
    o.insert(QStringLiteral("firmware"), d->GetFirmware());
    o.insert(QStringLiteral("serial"), d->GetSerial(0));
    o.insert(QStringLiteral("rotation"), int(d->GetRotation()));
    o.insert(QStringLiteral("attributes"),
             QJsonArray::fromStringList(DeviceAttributeNames(d->GetAttributes())));
    o.insert(QStringLiteral("kind"), BackingKindName(info.stack.kind));
    o.insert(QStringLiteral("kindDetail"), info.stack.detail);
    o.insert(QStringLiteral("members"), QJsonArray::fromStringList(info.stack.members));
    o.insert(QStringLiteral("holders"), QJsonArray::fromStringList(info.stack.holders));
    return o;
}

void PrintDevice(QTextStream &out, uint32_t index, CDevice *d)
{
    const DeviceInfo &info = d->GetDescriptor();
    out << "disk:" << index << "  " << d->GetDisplayName() << "  " << PathOf(d) << "\n";
    out << "    number " << info.number << ", source " << int(static_cast<quint8>(info.source)) << " ("
        << SourceText(info.source) << "), " << MediaTypeName(d->GetMediaType()) << ", "
        << PartStyleName(d->GetPartStyle()) << "\n";
    out << "    " << d->GetTotalSectors() << " sectors of " << d->GetBytesPerSector() << " bytes (physical "
        << d->GetPhysicalBytesPerSector() << "), " << d->GetSize() << " bytes\n";
    out << "    model: " << d->GetModel() << "; firmware: " << d->GetFirmware()
        << "; serial: " << d->GetSerial(0) << "; rotation: " << RotationText(d->GetRotation()) << "\n";
    if (!info.backingFile.isEmpty())
        out << "    image file: " << info.backingFile << "\n";
    if (info.stack.kind != BackingKind::None)
        out << "    kind: " << info.stack.KindText() << "\n";
    if (!info.stack.members.isEmpty())
        out << "    members: " << info.stack.members.join(QStringLiteral(", ")) << "\n";
    if (!info.stack.holders.isEmpty())
        out << "    holders: " << info.stack.holders.join(QStringLiteral(", ")) << "\n";
    out << "    attributes: " << DeviceAttributeText(d->GetAttributes()) << "\n";
    if (!info.ready && !info.notReadyReason.isEmpty())
        out << "    not ready: " << info.notReadyReason << "\n";
}

int runDevices(const QStringList &args, Io &io)
{
    bool json = false;
    for (const QString &a : args) {
        if (a == QLatin1String("--json")) {
            json = true;
        } else {
            io.err << "brindle-cli devices: unknown argument '" << a
                   << "'\nUsage: brindle-cli devices [--json]\n";
            return Usage;
        }
    }
    CRoot root;
    if (!root.RefreshAndWait()) {
        io.err << "brindle-cli devices: device enumeration did not finish\n";
        return Failed;
    }
    const QList<CDevice *> devices = root.Devices();
    if (json) {
        QJsonArray list;
        for (CDevice *d : devices)
            list.append(DeviceJson(d));
        io.out << QString::fromUtf8(QJsonDocument(list).toJson(QJsonDocument::Indented));
        return Ok;
    }
    if (devices.isEmpty())
        io.out << "No storage devices found.\n";
    for (qsizetype i = 0; i < devices.size(); ++i)
        PrintDevice(io.out, uint32_t(i), devices[i]);
    return Ok;
}

} // namespace Cli
