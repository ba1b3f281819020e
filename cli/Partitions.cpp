#include "cli/Partitions.h"

#include <QFileInfo>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QMutex>
#include <QMutexLocker>

#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Partitions/GptReader.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Source.h"

namespace Cli {

namespace {

QJsonObject PartitionJson(const cPartition *p, int index)
{
    const auto *c = dynamic_cast<const CPartition *>(p);
    QJsonObject o;
    o.insert(QStringLiteral("index"), index);
    o.insert(QStringLiteral("kind"), qint64(p->GetKind()));
    o.insert(QStringLiteral("kindName"), FileSystemKindName(p->GetKind()));
    o.insert(QStringLiteral("start"), qint64(p->GetStart()));
    o.insert(QStringLiteral("length"), qint64(p->GetLength()));
    o.insert(QStringLiteral("active"), (p->GetActive() & 0x80) != 0);
    o.insert(QStringLiteral("tableSector"), qint64(p->GetTableSector()));
    const bool gpt = c && c->IsGptEntry();
    o.insert(QStringLiteral("typeGuid"), gpt ? Gpt::guidText(c->GetGpt().typeGuid) : QString());
    o.insert(QStringLiteral("guid"), gpt ? Gpt::guidText(c->GetGpt().uniqueGuid) : QString());
    o.insert(QStringLiteral("name"), gpt ? c->GetGpt().name : QString());
    QJsonArray children;
    for (std::uint32_t i = 0; i < p->GetChildCount(); ++i)
        children.append(PartitionJson(p->GetChild(i), int(i)));
    o.insert(QStringLiteral("children"), children);
    return o;
}

void PrintPartition(QTextStream &out, const cPartition *p, const QString &index, int depth)
{
    const auto *c = dynamic_cast<const CPartition *>(p);
    const QString indent(depth * 4, QLatin1Char(' '));
    out << indent << index << "  " << p->GetKind() << " " << FileSystemKindName(p->GetKind()) << "  start "
        << p->GetStart() << "  length " << p->GetLength() << "  end "
        << (p->GetLength() ? p->GetStart() + p->GetLength() - 1 : p->GetStart()) << "  table "
        << p->GetTableSector() << (p->GetActive() & 0x80 ? "  active" : "");
    if (c && c->GetEntryType())
        out << QStringLiteral("  type 0x%1").arg(c->GetEntryType(), 2, 16, QLatin1Char('0'));
    out << "\n";
    if (c && c->IsGptEntry()) {
        out << indent << "    type GUID " << Gpt::guidText(c->GetGpt().typeGuid) << "  unique GUID "
            << Gpt::guidText(c->GetGpt().uniqueGuid) << "  name '" << c->GetGpt().name << "'\n";
    }
    for (std::uint32_t i = 0; i < p->GetChildCount(); ++i)
        PrintPartition(out, p->GetChild(i), index + QLatin1Char('.') + QString::number(i), depth + 1);
}

} // namespace

int runPartitions(const QStringList &args, Io &io)
{
    bool json = false;
    QString source;
    for (const QString &a : args) {
        if (a == QLatin1String("--json")) {
            json = true;
        } else if (source.isEmpty() && !a.startsWith(QLatin1String("--"))) {
            source = a;
        } else {
            io.err << "brindle-cli partitions: unknown argument '" << a
                   << "'\nUsage: brindle-cli partitions SOURCE [--json]\n";
            return Usage;
        }
    }
    if (source.isEmpty()) {
        io.err
            << "brindle-cli partitions: SOURCE is missing\nUsage: brindle-cli partitions SOURCE [--json]\n";
        return Usage;
    }

    CRoot root;
    // The scan runs while the device is built, possibly on the enumeration thread.
    QMutex mutex;
    QStringList messages;
    QObject::connect(
        &root, &cRoot::kernelInternal, &root,
        [&mutex, &messages](const _event_internal &e) {
            QMutexLocker lock(&mutex);
            messages << e.text;
        },
        Qt::DirectConnection);
    QString error;
    CDevice *device = resolveSource(root, source, error);
    if (!device) {
        io.err << "brindle-cli partitions: " << (error.isEmpty() ? QStringLiteral("no such device") : error)
               << "\n";
        return Failed;
    }
    // Only the messages about this device (each names it).
    QStringList own;
    {
        QMutexLocker lock(&mutex);
        const QString name = device->GetDisplayName();
        for (const QString &m : messages)
            if (m.contains(name))
                own << m;
    }

    const quint32 style = static_cast<quint32>(device->GetPartStyle());
    if (json) {
        QJsonObject o;
        o.insert(QStringLiteral("partStyle"), qint64(style));
        o.insert(QStringLiteral("sectorSize"), qint64(device->GetBytesPerSector()));
        o.insert(QStringLiteral("totalSectors"), qint64(device->GetTotalSectors()));
        o.insert(QStringLiteral("messages"), QJsonArray::fromStringList(own));
        QJsonArray list;
        for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
            list.append(PartitionJson(device->GetPartition(i), int(i)));
        o.insert(QStringLiteral("partitions"), list);
        io.out << QString::fromUtf8(QJsonDocument(o).toJson(QJsonDocument::Indented));
        return Ok;
    }
    io.out << device->GetDisplayName() << "\n";
    io.out << "Partition style: " << style << " " << PartStyleName(style) << "\n";
    io.out << "Sector size: " << device->GetBytesPerSector()
           << "; total sectors: " << device->GetTotalSectors() << "\n";
    for (const QString &m : own)
        io.out << "Message: " << m << "\n";
    if (device->GetPartitionCount() == 0)
        io.out << "No partitions.\n";
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
        PrintPartition(io.out, device->GetPartition(i), QString::number(i), 0);
    return Ok;
}

} // namespace Cli
