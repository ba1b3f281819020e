#include "cli/Volumes.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QJsonValue>

#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Source.h"

namespace Cli {

namespace {

struct Row
{
    QString partition; // index path, "-" for the whole device
    std::uint64_t start = 0;
    CVolume *volume = nullptr;
};

// The volumes the partition and the slices a BSD label turns it into own, depth first.
void Collect(CPartition *p, const QString &path, std::vector<Row> &rows)
{
    if (!p)
        return;
    if (CVolume *volume = p->Volume())
        rows.push_back(Row{path, p->GetStart(), volume});
    for (std::uint32_t i = 0; i < p->GetChildCount(); ++i)
        Collect(p->GetChildPartition(i), path + QLatin1Char('.') + QString::number(i), rows);
}

QString SerialText(std::uint32_t serial)
{
    return QStringLiteral("%1").arg(serial, 8, 16, QLatin1Char('0')).toUpper();
}

QJsonObject RowJson(const Row &r)
{
    CVolume *v = r.volume;
    std::uint64_t first = 0, last = 0, cluster0 = 0, valid = 0, checked = 0;
    v->GetClusterRange(first, last, cluster0);
    const std::uint32_t grade = v->GetIntegrity(valid, checked);
    QJsonObject o;
    o.insert(QStringLiteral("partition"), r.partition);
    o.insert(QStringLiteral("start"), qint64(r.start));
    o.insert(QStringLiteral("kind"), qint64(v->GetKind()));
    o.insert(QStringLiteral("kindName"), FileSystemKindName(v->GetKind()));
    o.insert(QStringLiteral("displayName"), v->GetDisplayName());
    o.insert(QStringLiteral("label"), v->GetLabel());
    o.insert(QStringLiteral("serial"), SerialText(v->GetSerialNumber()));
    o.insert(QStringLiteral("sectorSize"), qint64(v->GetBytesPerSector()));
    o.insert(QStringLiteral("sectorCount"), qint64(v->GetTotalSectors()));
    o.insert(QStringLiteral("clusterSize"), qint64(v->GetClusterSize()));
    o.insert(QStringLiteral("firstCluster"), qint64(first));
    o.insert(QStringLiteral("lastCluster"), qint64(last));
    o.insert(QStringLiteral("cluster0Sector"), qint64(cluster0));
    o.insert(QStringLiteral("freeBytes"),
             v->IsFreeKnown() ? QJsonValue(qint64(v->GetFreeBytes())) : QJsonValue());
    o.insert(QStringLiteral("grade"), qint64(grade));
    o.insert(QStringLiteral("gradeName"), VolumeIntegrity::GradeName(grade));
    QJsonArray items;
    for (const VolumeIntegrity::Item &item : VolumeIntegrity::Items(v->GetKind(), valid, checked)) {
        QJsonObject i;
        i.insert(QStringLiteral("name"), item.name);
        i.insert(QStringLiteral("state"), item.state);
        items.append(i);
    }
    o.insert(QStringLiteral("items"), items);
    o.insert(QStringLiteral("messages"), QJsonArray::fromStringList(v->Messages()));
    return o;
}

void PrintRow(QTextStream &out, const Row &r)
{
    CVolume *v = r.volume;
    std::uint64_t first = 0, last = 0, cluster0 = 0, valid = 0, checked = 0;
    v->GetClusterRange(first, last, cluster0);
    const std::uint32_t grade = v->GetIntegrity(valid, checked);
    out << "Partition " << r.partition << "  start " << r.start << "\n";
    out << "    Kind: " << v->GetKind() << " " << FileSystemKindName(v->GetKind()) << "\n";
    out << "    Display name: " << v->GetDisplayName() << "\n";
    out << "    Label: '" << v->GetLabel() << "'  serial " << SerialText(v->GetSerialNumber()) << "\n";
    out << "    Sector size: " << v->GetBytesPerSector() << "  sectors " << v->GetTotalSectors() << "\n";
    out << "    Cluster size: " << v->GetClusterSize() << "  clusters " << first << ".." << last
        << "  cluster 0 at sector " << cluster0 << "\n";
    if (v->IsFreeKnown())
        out << "    Free bytes: " << v->GetFreeBytes() << "\n";
    out << "    Overall Integrity Status: " << grade << " " << VolumeIntegrity::GradeName(grade) << "\n";
    for (const VolumeIntegrity::Item &item : VolumeIntegrity::Items(v->GetKind(), valid, checked))
        out << "        " << item.name << ": " << item.state << "\n";
    for (const QString &m : v->Messages())
        out << "    Message: " << m << "\n";
}

} // namespace

int runVolumes(const QStringList &args, Io &io)
{
    static const char usage[] = "Usage: brindle-cli volumes SOURCE [--json]\n";
    bool json = false;
    QString source;
    for (const QString &a : args) {
        if (a == QLatin1String("--json")) {
            json = true;
        } else if (source.isEmpty() && !a.startsWith(QLatin1String("--"))) {
            source = a;
        } else {
            io.err << "brindle-cli volumes: unknown argument '" << a << "'\n" << usage;
            return Usage;
        }
    }
    if (source.isEmpty()) {
        io.err << "brindle-cli volumes: SOURCE is missing\n" << usage;
        return Usage;
    }
    CRoot root;
    QString error;
    CDevice *device = resolveSource(root, source, error);
    if (!device) {
        io.err << "brindle-cli volumes: " << (error.isEmpty() ? QStringLiteral("no such device") : error)
               << "\n";
        return Failed;
    }
    std::vector<Row> rows;
    if (CVolume *whole = device->Volume())
        rows.push_back(Row{QStringLiteral("-"), 0, whole});
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
        Collect(device->GetPartition(i), QString::number(i), rows);
    if (json) {
        QJsonArray list;
        for (const Row &r : rows)
            list.append(RowJson(r));
        io.out << QString::fromUtf8(QJsonDocument(list).toJson(QJsonDocument::Indented));
        return Ok;
    }
    io.out << device->GetDisplayName() << "\n";
    if (rows.empty())
        io.out << "No volumes.\n";
    for (const Row &r : rows)
        PrintRow(io.out, r);
    return Ok;
}

} // namespace Cli
