#include "Kernel/Implementation/Devices/LdmAssembly.h"

#include "Kernel/Implementation/Common/ByteOrder.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/DeviceVirtualSource.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Raid/RaidHandle.h"

#include <QSet>

#include <map>
#include <optional>

#include <algorithm>

namespace LdmAssembly {

namespace {

constexpr std::uint8_t TypeComponent = 0x32;
constexpr std::uint8_t TypePartition = 0x33;
constexpr std::uint8_t TypeDisk3 = 0x34;
constexpr std::uint8_t TypeDisk4 = 0x44;
constexpr std::uint8_t TypeVolume = 0x51;
constexpr std::uint8_t FlagStripe = 0x10; // component: stripe size and columns follow
constexpr std::uint8_t FlagIndex = 0x08;  // partition: column index follows
constexpr std::uint64_t MaxColumns = 256;

// Reads the variable-length fields of a record body: a length byte, then that many bytes.
class Fields
{
public:
    Fields(const QByteArray &record, qsizetype from) : m_b(record), m_pos(from) {}
    bool ok() const { return m_ok; }
    std::uint64_t Number()
    {
        const int n = Byte();
        if (n > 8 || !Need(n))
            return Fail();
        const std::uint64_t v = ByteOrder::readBe(m_b, m_pos, n);
        m_pos += n;
        return v;
    }
    QString Text()
    {
        const int n = Byte();
        if (!Need(n)) {
            Fail();
            return {};
        }
        const QString s = QString::fromLatin1(m_b.constData() + m_pos, n);
        m_pos += n;
        return s;
    }
    QByteArray Bytes(int n)
    {
        if (!Need(n)) {
            Fail();
            return {};
        }
        const QByteArray r = m_b.mid(m_pos, n);
        m_pos += n;
        return r;
    }
    std::uint64_t Fixed64() { return ByteOrder::readBe(Bytes(8), 0, 8); }
    int Byte()
    {
        if (!Need(1))
            return static_cast<int>(Fail());
        return static_cast<std::uint8_t>(m_b[m_pos++]);
    }
    void Skip(int n)
    {
        if (Need(n))
            m_pos += n;
        else
            Fail();
    }

private:
    bool Need(int n) const { return m_ok && n >= 0 && m_pos + n <= m_b.size(); }
    std::uint64_t Fail()
    {
        m_ok = false;
        return 0;
    }
    const QByteArray &m_b;
    qsizetype m_pos;
    bool m_ok = true;
};

QString GuidText(const QByteArray &raw)
{
    const QByteArray hex = raw.toHex();
    return QString::fromLatin1(hex.left(8) + '-' + hex.mid(8, 4) + '-' + hex.mid(12, 4) + '-' +
                               hex.mid(16, 4) + '-' + hex.mid(20, 12));
}

// Serves a device's 512-byte units from the volume's storage.
class VolumeSource : public cVirtualSource
{
public:
    explicit VolumeSource(std::unique_ptr<Volume> volume) : m_volume(std::move(volume)) {}

    std::uint64_t ReadUnits(std::uint64_t first, std::uint64_t units, void *buffer) override
    {
        cStorage &s = *m_volume->storage;
        const std::uint32_t ss = s.GetBytesPerSector();
        if (ss == 0 || units > (std::uint64_t(1) << 40))
            return 0;
        const std::uint64_t offset = first * UnitSize, bytes = units * UnitSize;
        if (offset % ss || bytes % ss)
            return 0;
        auto *out = static_cast<std::uint8_t *>(buffer);
        std::uint64_t done = 0;
        while (done < bytes) {
            const std::uint64_t sectors = std::min<std::uint64_t>((bytes - done) / ss, 1u << 16);
            std::uint32_t error = 0;
            if (!s.ReadSectors((offset + done) / ss, static_cast<std::uint32_t>(sectors), out + done, error))
                return done;
            done += sectors * ss;
        }
        return done;
    }

private:
    std::unique_ptr<Volume> m_volume;
};

int SectorShift(std::uint32_t size)
{
    int shift = 0;
    while (shift < 31 && (1u << shift) < size)
        ++shift;
    return shift;
}

} // namespace

Database Decode(const std::vector<Ldm::Record> &records, const std::function<void(const QString &)> &message)
{
    Database db;
    auto say = [&](const QString &t) {
        if (message)
            message(t);
    };
    for (const Ldm::Record &r : records) {
        const QByteArray &rec = r.data;
        if (rec.size() < 0x18)
            continue;
        const std::uint8_t flags = static_cast<std::uint8_t>(rec[0x12]);
        Fields f(rec, 0x18);
        const std::uint64_t id = f.Number();
        const QString name = f.Text();
        switch (r.type) {
        case TypeComponent: {
            Component c;
            c.id = id;
            c.name = name;
            f.Text(); // state
            c.arrayType = static_cast<std::uint8_t>(f.Byte());
            f.Skip(4);
            f.Number(); // children
            f.Skip(16); // log commit id and an unknown field
            c.volume = f.Number();
            f.Skip(1);
            if (flags & FlagStripe) {
                c.stripe = f.Number();
                c.columns = f.Number();
            }
            if (f.ok())
                db.components.append(c);
            else
                say(QStringLiteral("LDM component record %1 cannot be decoded").arg(name));
            break;
        }
        case TypePartition: {
            Extent e;
            e.id = id;
            e.name = name;
            f.Skip(12);
            e.start = f.Fixed64();
            e.volumeOffset = f.Fixed64();
            e.size = f.Number();
            e.component = f.Number();
            e.disk = f.Number();
            if (flags & FlagIndex)
                e.index = static_cast<std::int64_t>(f.Number());
            if (f.ok())
                db.extents.append(e);
            else
                say(QStringLiteral("LDM partition record %1 cannot be decoded").arg(name));
            break;
        }
        case TypeDisk3:
        case TypeDisk4: {
            const QString guid = r.type == TypeDisk3 ? f.Text() : GuidText(f.Bytes(16));
            if (f.ok())
                db.disks.append({id, guid.toLower()});
            break;
        }
        case TypeVolume:
            if (f.ok())
                db.volumes.append({id, name});
            break;
        default:
            break;
        }
    }
    return db;
}

std::vector<std::unique_ptr<Volume>> Assemble(const Database &db, const QList<Disk> &disks,
                                              const std::function<void(const QString &)> &message)
{
    std::vector<std::unique_ptr<Volume>> out;
    auto refuse = [&](const QString &name, const QString &why) {
        if (message)
            message(QStringLiteral("Dynamic volume %1 cannot be assembled: %2").arg(name, why));
    };
    auto diskOf = [&](std::uint64_t diskId) -> const Disk * {
        for (const auto &[id, guid] : db.disks) {
            if (id != diskId)
                continue;
            for (const Disk &d : disks)
                if (d.storage && d.diskGuid.compare(guid, Qt::CaseInsensitive) == 0)
                    return &d;
        }
        return nullptr;
    };

    // Volumes in the order their components name them.
    QList<std::uint64_t> volumeIds;
    for (const Component &c : db.components)
        if (!volumeIds.contains(c.volume))
            volumeIds.append(c.volume);

    for (std::uint64_t vid : volumeIds) {
        auto volume = std::make_unique<Volume>();
        volume->id = vid;
        volume->name = QStringLiteral("Volume %1").arg(vid);
        for (const auto &[id, name] : db.volumes)
            if (id == vid)
                volume->name = name;

        std::vector<std::unique_ptr<cStorage>> componentStorages;
        QString kind, failure;
        for (const Component &c : db.components) {
            if (c.volume != vid)
                continue;
            QList<Extent> pieces;
            for (const Extent &e : db.extents)
                if (e.component == c.id)
                    pieces.append(e);
            const bool striped = c.arrayType == 1 || c.arrayType == 3;
            std::stable_sort(pieces.begin(), pieces.end(), [striped](const Extent &a, const Extent &b) {
                return striped && a.index >= 0 && b.index >= 0 ? a.index < b.index
                                                               : a.volumeOffset < b.volumeOffset;
            });
            if (pieces.isEmpty() || pieces.size() > qsizetype(MaxColumns)) {
                failure = QStringLiteral("component %1 has %2 pieces").arg(c.name).arg(pieces.size());
                continue;
            }

            // Each piece is a partition of its disk's data area; a piece on a missing disk stays empty.
            QList<cStorage *> members;
            QList<std::uint64_t> starts, lengths;
            std::uint32_t sectorSize = 0;
            int missing = 0;
            for (const Extent &e : pieces) {
                const Disk *d = diskOf(e.disk);
                const bool fits = d && e.start < d->dataLength && e.size <= d->dataLength - e.start &&
                                  d->dataStart + d->dataLength <= d->storage->GetTotalSectors() && e.size > 0;
                if (!fits) {
                    ++missing;
                    members.append(nullptr);
                    starts.append(0);
                    lengths.append(e.size ? e.size : cStorage::NoSector);
                    continue;
                }
                auto part = std::make_unique<CPartition>(d->device, d->storage, nullptr,
                                                         static_cast<std::uint32_t>(FileSystemKind::DataArea),
                                                         d->dataStart + e.start, e.size);
                if (!sectorSize)
                    sectorSize = d->storage->GetBytesPerSector();
                members.append(part.get());
                starts.append(0);
                lengths.append(e.size);
                volume->parts.push_back(std::move(part));
                if (d->device && !volume->memberDevices.contains(d->device))
                    volume->memberDevices.append(d->device);
            }
            if (!sectorSize) {
                failure = QStringLiteral("no disk of component %1 is present").arg(c.name);
                continue;
            }

            std::uint32_t layout = 2;
            std::uint64_t stripe = 0;
            if (c.arrayType == 1) {
                layout = 3;
                kind = QStringLiteral("Striped");
            } else if (c.arrayType == 3) {
                layout = static_cast<std::uint32_t>(RaidLayout::ParityLeftAsymmetric);
                kind = QStringLiteral("RAID-5");
            } else {
                kind = pieces.size() > 1 ? QStringLiteral("Spanned") : QStringLiteral("Simple");
            }
            if (striped) {
                stripe = c.stripe;
                if (stripe == 0 || stripe > 0xFFFFFFFFull ||
                    (c.columns && c.columns != std::uint64_t(pieces.size()))) {
                    failure = QStringLiteral("component %1 has stripe %2 and %3 columns for %4 pieces")
                                  .arg(c.name)
                                  .arg(stripe)
                                  .arg(c.columns)
                                  .arg(pieces.size());
                    continue;
                }
            }
            if (missing)
                volume->degraded = true;
            std::uint64_t total = 0;
            auto raid = std::make_unique<CRaidHandle>(vid, c.id, layout, members, starts, lengths, sectorSize,
                                                      static_cast<std::uint32_t>(stripe), total);
            if (total == 0) {
                failure =
                    missing
                        ? QStringLiteral("%1 piece(s) of component %2 are missing").arg(missing).arg(c.name)
                        : raid->GetRefusal();
                continue;
            }
            componentStorages.push_back(std::move(raid));
        }

        if (componentStorages.empty()) {
            refuse(volume->name, failure.isEmpty() ? QStringLiteral("no component") : failure);
            continue;
        }
        if (componentStorages.size() == 1 && failure.isEmpty()) {
            volume->kind = kind;
            volume->storage = std::move(componentStorages.front());
        } else if (componentStorages.size() == 1) {
            // A mirror with one readable copy left reads through it alone.
            volume->kind = QStringLiteral("Mirrored");
            volume->degraded = true;
            volume->storage = std::move(componentStorages.front());
        } else {
            QList<cStorage *> copies;
            QList<std::uint64_t> starts, lengths;
            for (auto &s : componentStorages) {
                copies.append(s.get());
                starts.append(0);
                lengths.append(cStorage::NoSector);
            }
            std::uint64_t total = 0;
            auto mirror = std::make_unique<CRaidHandle>(vid, 0, 4, copies, starts, lengths,
                                                        copies.first()->GetBytesPerSector(), 0, total);
            if (total == 0) {
                refuse(volume->name, mirror->GetRefusal());
                continue;
            }
            volume->kind = QStringLiteral("Mirrored");
            volume->degraded = volume->degraded || !failure.isEmpty();
            for (auto &s : componentStorages)
                volume->parts.push_back(std::move(s));
            volume->storage = std::move(mirror);
        }
        out.push_back(std::move(volume));
    }
    return out;
}

CDevice *MakeDevice(cRoot *root, std::unique_ptr<Volume> volume, std::uint16_t number)
{
    if (!volume || !volume->storage)
        return nullptr;
    const cStorage &s = *volume->storage;
    const std::uint32_t ss = s.GetBytesPerSector();
    if (ss < 512 || (ss & (ss - 1)) != 0)
        return nullptr;
    DeviceInfo info;
    info.number = number;
    info.source = EnumSource::PhysicalDrive;
    info.mediaType = MediaType::RaidAssembly;
    info.ready = 1;
    info.partStyle = PartStyle::VirtualManager;
    info.sectorShift = static_cast<quint8>(SectorShift(ss));
    info.physicalSectorShift = info.sectorShift;
    info.totalSectors = s.GetTotalSectors();
    info.model = QStringLiteral("%1 Dynamic Volume %2").arg(volume->kind, volume->name);
    const QList<CDevice *> members = volume->memberDevices;
    auto *device = new CDevice(root, info);
    device->Members() = members;
    device->SetVirtualSource(new VolumeSource(std::move(volume)));
    device->SetAttributes(device->GetAttributes() | DeviceAttribute::Virtual | DeviceAttribute::Raid);
    return device;
}

QList<CDevice *> AssembleDevices(cRoot *root, const QList<CDevice *> &devices, std::uint16_t firstNumber,
                                 const std::function<void(const QString &)> &message,
                                 const std::function<bool(std::uint16_t number)> &listed)
{
    struct Group
    {
        std::vector<Ldm::Record> records;
        QList<Disk> disks;
    };
    QList<QString> order;
    std::map<QString, Group> groups;
    for (CDevice *device : devices) {
        if (!device || !device->IsReady() || device->GetPartStyle() == PartStyle::VirtualManager)
            continue;
        const CPartition *metadata = nullptr, *data = nullptr;
        for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i) {
            const CPartition *p = device->GetPartition(i);
            if (p && p->GetKind() == static_cast<std::uint32_t>(FileSystemKind::MetadataArea) && !metadata)
                metadata = p;
            if (p && p->GetKind() == static_cast<std::uint32_t>(FileSystemKind::DataArea) && !data)
                data = p;
        }
        if (!metadata || device->GetTotalSectors() == 0)
            continue;
        const bool gpt = device->GetPartStyle() == PartStyle::Gpt;
        std::optional<Ldm::Area> gptMetadata, gptData;
        std::uint64_t place = device->GetTotalSectors() - 1;
        if (gpt) {
            if (!data || metadata->GetLength() == 0)
                continue;
            gptMetadata = Ldm::Area{metadata->GetStart(), metadata->GetLength()};
            gptData = Ldm::Area{data->GetStart(), data->GetLength()};
            place = metadata->GetStart() + metadata->GetLength() - 1;
        }
        const Ldm::ReadResult r =
            Ldm::read(*device, place, gptMetadata, gptData, device->GetDisplayName(), {});
        if (!r.found || !r.areasValid || !r.databaseValid)
            continue;
        const QString key = r.diskGroupGuid.toLower();
        if (!order.contains(key))
            order.append(key);
        Group &g = groups[key];
        if (g.records.empty())
            g.records = r.records;
        Disk d;
        d.storage = device;
        d.device = device;
        d.diskGuid = r.diskGuid;
        d.dataStart = r.data.start;
        d.dataLength = r.data.length;
        g.disks.append(d);
    }

    QList<CDevice *> out;
    std::uint32_t number = firstNumber;
    for (const QString &key : order) {
        Group &g = groups[key];
        for (auto &volume : Assemble(Decode(g.records, message), g.disks, message)) {
            if (number > 0xFFFF)
                break;
            const auto n = static_cast<std::uint16_t>(number);
            if (listed && listed(n)) {
                ++number;
                continue;
            }
            if (CDevice *d = MakeDevice(root, std::move(volume), n))
                out.append(d), ++number;
        }
    }
    return out;
}

} // namespace LdmAssembly
