#include "Kernel/Implementation/Platform/Linux/SysfsEnumerate.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QMutexLocker>
#include <QSet>

#include <algorithm>

#include <blkid/blkid.h>
#include <libudev.h>
#include <sys/statvfs.h>

namespace Sysfs {

Kind Classify(const QString &name)
{
    auto startsWithThenDigitOrLetter = [&](const char *prefix) {
        return name.startsWith(QLatin1String(prefix)) && name.size() > qsizetype(strlen(prefix));
    };
    if (startsWithThenDigitOrLetter("loop"))
        return Kind::Loop;
    // Only the plain numbered names: md_d0 and the like are not arrays of today's kernels.
    auto prefixThenNumber = [&](const char *prefix) {
        const qsizetype n = qsizetype(strlen(prefix));
        if (!name.startsWith(QLatin1String(prefix)) || name.size() == n)
            return false;
        for (qsizetype i = n; i < name.size(); ++i) {
            if (!name.at(i).isDigit())
                return false;
        }
        return true;
    };
    if (prefixThenNumber("dm-"))
        return Kind::DeviceMapper;
    if (prefixThenNumber("md"))
        return Kind::SoftwareRaid;
    if (prefixThenNumber("nbd"))
        return Kind::NetworkBlock;
    if (startsWithThenDigitOrLetter("sr"))
        return Kind::Optical;
    if (startsWithThenDigitOrLetter("fd"))
        return Kind::Floppy;
    if (startsWithThenDigitOrLetter("nvme") || startsWithThenDigitOrLetter("mmcblk") ||
        startsWithThenDigitOrLetter("xvd"))
        return Kind::Physical;
    for (const char *p : {"sd", "vd", "hd"}) {
        if (startsWithThenDigitOrLetter(p) && name.at(2).isLower())
            return Kind::Physical;
    }
    return Kind::Skip;
}

int TrailingNumber(const QString &name)
{
    qsizetype i = name.size();
    while (i > 0 && name.at(i - 1).isDigit())
        --i;
    if (i == name.size() || name.size() - i > 5)
        return -1;
    bool ok = false;
    int n = name.mid(i).toInt(&ok);
    return ok ? n : -1;
}

int VolumeBackedNumber(Kind kind, int kernelNumber)
{
    constexpr int range = 0x4000;
    if (kernelNumber < 0 || kernelNumber >= range)
        return -1;
    switch (kind) {
    case Kind::Loop:
        return kernelNumber;
    case Kind::DeviceMapper:
        return range + kernelNumber;
    case Kind::SoftwareRaid:
        return 2 * range + kernelNumber;
    case Kind::NetworkBlock:
        return 3 * range + kernelNumber;
    default:
        return -1;
    }
}

QString NaturalKey(const QString &name)
{
    // Letters-only suffixes (sda, sdaa) order by length first; digit runs are padded.
    qsizetype prefixEnd = 0;
    while (prefixEnd < name.size() && prefixEnd < 2)
        ++prefixEnd;
    if (name.startsWith(QLatin1String("nvme")) || name.startsWith(QLatin1String("mmcblk")) ||
        name.startsWith(QLatin1String("xvd")))
        prefixEnd =
            name.startsWith(QLatin1String("xvd")) ? 3 : (name.startsWith(QLatin1String("nvme")) ? 4 : 6);
    QString prefix = name.left(prefixEnd);
    QString rest = name.mid(prefixEnd);
    QString padded;
    qsizetype i = 0;
    while (i < rest.size()) {
        if (rest.at(i).isDigit()) {
            qsizetype j = i;
            while (j < rest.size() && rest.at(j).isDigit())
                ++j;
            padded += rest.mid(i, j - i).rightJustified(10, QLatin1Char('0'));
            i = j;
        } else {
            padded += rest.at(i);
            ++i;
        }
    }
    return QStringLiteral("%1|%2|%3").arg(prefix).arg(padded.size(), 4, 10, QLatin1Char('0')).arg(padded);
}

namespace {

// Undoes the octal escapes (\040 and the like) of the mount table.
QString Unescape(const QByteArray &field)
{
    QByteArray out;
    out.reserve(field.size());
    for (qsizetype i = 0; i < field.size(); ++i) {
        if (field[i] == '\\' && i + 3 < field.size()) {
            char a = field[i + 1], b = field[i + 2], c = field[i + 3];
            if (a >= '0' && a <= '3' && b >= '0' && b <= '7' && c >= '0' && c <= '7') {
                out.append(char(((a - '0') << 6) | ((b - '0') << 3) | (c - '0')));
                i += 3;
                continue;
            }
        }
        out.append(field[i]);
    }
    return QString::fromUtf8(out);
}

} // namespace

QList<MountEntry> ParseMountInfo(const QByteArray &text)
{
    QList<MountEntry> out;
    const QList<QByteArray> lines = text.split('\n');
    for (const QByteArray &line : lines) {
        const QList<QByteArray> fields = line.split(' ');
        // id parent major:minor root mountpoint options [optional...] - fstype source superoptions
        if (fields.size() < 10)
            continue;
        qsizetype dash = fields.indexOf(QByteArray("-"), 6);
        if (dash < 0 || dash + 2 >= fields.size())
            continue;
        const QList<QByteArray> dev = fields[2].split(':');
        if (dev.size() != 2)
            continue;
        bool okMajor = false, okMinor = false;
        MountEntry e;
        e.major = dev[0].toUInt(&okMajor);
        e.minor = dev[1].toUInt(&okMinor);
        if (!okMajor || !okMinor)
            continue;
        e.root = Unescape(fields[3]);
        e.mountPoint = Unescape(fields[4]);
        e.fsType = QString::fromUtf8(fields[dash + 1]);
        e.source = Unescape(fields[dash + 2]);
        out.append(e);
    }
    return out;
}

} // namespace Sysfs

namespace {

QString ReadSmall(const QString &path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadOnly))
        return {};
    return QString::fromUtf8(f.read(4096)).trimmed();
}

quint64 ReadNumber(const QString &path)
{
    bool ok = false;
    quint64 v = ReadSmall(path).toULongLong(&ok);
    return ok ? v : 0;
}

// What libblkid finds on a block device: file-system type, label and serial (UUID).
struct Probe
{
    bool opened = false;
    QString type;
    QString label;
    QString uuid;
};

Probe ProbeFileSystem(const QString &path)
{
    Probe p;
    QByteArray name = QFile::encodeName(path);
    blkid_probe pr = blkid_new_probe_from_filename(name.constData());
    if (!pr)
        return p;
    p.opened = true;
    blkid_probe_enable_superblocks(pr, 1);
    blkid_probe_set_superblocks_flags(pr, BLKID_SUBLKS_LABEL | BLKID_SUBLKS_UUID | BLKID_SUBLKS_TYPE);
    blkid_probe_enable_partitions(pr, 0);
    if (blkid_do_safeprobe(pr) == 0) {
        const char *value = nullptr;
        size_t len = 0;
        if (blkid_probe_lookup_value(pr, "TYPE", &value, &len) == 0 && value)
            p.type = QString::fromUtf8(value);
        if (blkid_probe_lookup_value(pr, "LABEL", &value, &len) == 0 && value)
            p.label = QString::fromUtf8(value);
        if (blkid_probe_lookup_value(pr, "UUID", &value, &len) == 0 && value)
            p.uuid = QString::fromUtf8(value);
    }
    blkid_free_probe(pr);
    return p;
}

// The serial of the system's device database (ID_SERIAL_SHORT, else ID_SERIAL).
QString UdevSerial(struct udev *udev, const QString &kernelName)
{
    if (!udev)
        return {};
    QByteArray sysname = kernelName.toUtf8();
    struct udev_device *dev = udev_device_new_from_subsystem_sysname(udev, "block", sysname.constData());
    if (!dev)
        return {};
    QString serial;
    for (const char *key : {"ID_SERIAL_SHORT", "ID_SERIAL"}) {
        const char *value = udev_device_get_property_value(dev, key);
        if (value && *value) {
            serial = QString::fromUtf8(value);
            break;
        }
    }
    udev_device_unref(dev);
    return serial;
}

struct DevNumber
{
    quint32 major = 0;
    quint32 minor = 0;
    bool valid = false;
};

// The kind of a device-mapper device from the prefix its owner gives its uuid; the format of an
// encrypted volume is the uuid's second field ("CRYPT-LUKS2-...").
BackingKind DeviceMapperKind(const QString &uuid, QString &detail)
{
    if (uuid.startsWith(QLatin1String("LVM-")))
        return BackingKind::LogicalVolume;
    if (uuid.startsWith(QLatin1String("CRYPT-"))) {
        detail = uuid.section(QLatin1Char('-'), 1, 1);
        return BackingKind::EncryptedVolume;
    }
    if (uuid.startsWith(QLatin1String("mpath-")))
        return BackingKind::Multipath;
    return BackingKind::DeviceMapper;
}

DevNumber ParseDev(const QString &text)
{
    DevNumber d;
    QStringList parts = text.split(QLatin1Char(':'));
    if (parts.size() == 2) {
        bool a = false, b = false;
        d.major = parts[0].toUInt(&a);
        d.minor = parts[1].toUInt(&b);
        d.valid = a && b;
    }
    return d;
}

} // namespace

CSysfsEnumerationSource::CSysfsEnumerationSource(const QString &sysBlock, const QString &devRoot)
    : m_sysBlock(sysBlock), m_devRoot(devRoot)
{
}

QString CSysfsEnumerationSource::Attribute(const QString &kernelName, const QString &relative) const
{
    return ReadSmall(m_sysBlock + QLatin1Char('/') + kernelName + QLatin1Char('/') + relative);
}

QString CSysfsEnumerationSource::DevicePath(const QString &kernelName) const
{
    const QString mapped = Attribute(kernelName, QStringLiteral("dm/name"));
    if (!mapped.isEmpty())
        return m_devRoot + QStringLiteral("/mapper/") + mapped;
    return m_devRoot + QLatin1Char('/') + kernelName;
}

QStringList CSysfsEnumerationSource::Related(const QString &kernelName, const QString &folder) const
{
    // The entries are links named after the devices; a link whose target is gone still names one.
    QDir dir(m_sysBlock + QLatin1Char('/') + kernelName + QLatin1Char('/') + folder);
    QStringList names = dir.entryList(QDir::AllEntries | QDir::System | QDir::NoDotAndDotDot);
    std::sort(names.begin(), names.end(),
              [](const QString &a, const QString &b) { return Sysfs::NaturalKey(a) < Sysfs::NaturalKey(b); });
    QStringList out;
    for (const QString &n : std::as_const(names))
        out << DevicePath(n);
    return out;
}

BlockStack CSysfsEnumerationSource::StackOf(const QString &kernelName, Sysfs::Kind kind) const
{
    BlockStack stack;
    switch (kind) {
    case Sysfs::Kind::Loop:
        stack.kind = BackingKind::Loop;
        break;
    case Sysfs::Kind::DeviceMapper:
        stack.kind = DeviceMapperKind(Attribute(kernelName, QStringLiteral("dm/uuid")), stack.detail);
        stack.mappedName = Attribute(kernelName, QStringLiteral("dm/name"));
        break;
    case Sysfs::Kind::SoftwareRaid:
        stack.kind = BackingKind::SoftwareRaid;
        stack.detail = Attribute(kernelName, QStringLiteral("md/level"));
        break;
    case Sysfs::Kind::NetworkBlock:
        stack.kind = BackingKind::NetworkBlock;
        break;
    default:
        break;
    }
    stack.members = Related(kernelName, QStringLiteral("slaves"));
    stack.holders = Related(kernelName, QStringLiteral("holders"));
    return stack;
}

quint16 CSysfsEnumerationSource::PhysicalNumber(const QString &kernelName, const QStringList &present)
{
    // Called with m_mutex held. Names no longer present give their numbers back; new names take the
    // smallest free numbers in name order.
    for (auto it = m_physicalNumbers.begin(); it != m_physicalNumbers.end();) {
        if (!present.contains(it.key()))
            it = m_physicalNumbers.erase(it);
        else
            ++it;
    }
    QStringList sorted = present;
    std::sort(sorted.begin(), sorted.end(),
              [](const QString &a, const QString &b) { return Sysfs::NaturalKey(a) < Sysfs::NaturalKey(b); });
    for (const QString &name : std::as_const(sorted)) {
        if (m_physicalNumbers.contains(name))
            continue;
        QSet<quint16> used;
        for (quint16 v : std::as_const(m_physicalNumbers))
            used.insert(v);
        quint16 n = 0;
        while (used.contains(n) && n < 0xFFFF)
            ++n;
        m_physicalNumbers.insert(name, n);
    }
    return m_physicalNumbers.value(kernelName);
}

QList<EnumCandidate> CSysfsEnumerationSource::Candidates()
{
    QDir dir(m_sysBlock);
    QStringList names = dir.entryList(QDir::Dirs | QDir::NoDotAndDotDot | QDir::System, QDir::Name);
    QStringList physical;
    // Hidden disks (the per-path devices of multipath NVMe) are not listed, as lsblk does not.
    names.erase(std::remove_if(names.begin(), names.end(),
                               [this](const QString &n) {
                                   return Attribute(n, QStringLiteral("hidden")) == QLatin1String("1");
                               }),
                names.end());
    for (const QString &n : std::as_const(names)) {
        if (Sysfs::Classify(n) == Sysfs::Kind::Physical)
            physical << n;
    }
    std::sort(physical.begin(), physical.end(),
              [](const QString &a, const QString &b) { return Sysfs::NaturalKey(a) < Sysfs::NaturalKey(b); });

    struct udev *udev = udev_new();
    QList<EnumCandidate> out;
    auto describe = [&](const QString &name, EnumCandidate &c) {
        c.kernelName = name;
        c.path = m_devRoot + QLatin1Char('/') + name;
        c.sizeBytes = ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/size")) * 512;
        c.logicalSectorSize = quint32(
            ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/queue/logical_block_size")));
        c.physicalSectorSize = quint32(
            ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/queue/physical_block_size")));
        c.alignmentOffset =
            quint32(ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/alignment_offset")));
        QString rot = Attribute(name, QStringLiteral("queue/rotational"));
        c.rotational = rot.isEmpty() ? -1 : (rot == QLatin1String("1") ? 1 : 0);
        c.removable = Attribute(name, QStringLiteral("removable")) == QLatin1String("1");
        c.diskSequence = ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/diskseq"));
        QString vendor = Attribute(name, QStringLiteral("device/vendor"));
        QString model = Attribute(name, QStringLiteral("device/model"));
        // PCI vendor ids ("0x1af4") are not names.
        if (vendor.startsWith(QLatin1String("0x")))
            vendor.clear();
        c.model = (vendor.isEmpty() || model.isEmpty()) ? model : vendor + QLatin1Char(' ') + model;
        c.model = c.model.trimmed();
        c.firmware = Attribute(name, QStringLiteral("device/rev"));
        if (c.firmware.isEmpty())
            c.firmware = Attribute(name, QStringLiteral("device/firmware_rev"));
        c.managementSerial = UdevSerial(udev, name);
        if (c.managementSerial.isEmpty())
            c.managementSerial = Attribute(name, QStringLiteral("device/serial"));
        if (c.managementSerial.isEmpty())
            c.managementSerial = Attribute(name, QStringLiteral("serial"));
        c.stack = StackOf(name, Sysfs::Classify(name));
    };

    {
        QMutexLocker guard(&m_mutex);
        for (const QString &name : std::as_const(physical)) {
            EnumCandidate c;
            c.source = EnumSource::PhysicalDrive;
            c.number = PhysicalNumber(name, physical);
            describe(name, c);
            c.mediaType = c.removable ? MediaType::Removable : MediaType::Fixed;
            out.append(c);
        }
    }
    for (const QString &name : std::as_const(names)) {
        Sysfs::Kind kind = Sysfs::Classify(name);
        if (kind == Sysfs::Kind::Physical || kind == Sysfs::Kind::Skip)
            continue;
        int number = Sysfs::TrailingNumber(name);
        if (number < 0 || number > 0xFFFF)
            continue;
        EnumCandidate c;
        c.number = quint16(number);
        if (kind == Sysfs::Kind::Loop) {
            QString backing = Attribute(name, QStringLiteral("loop/backing_file"));
            number = Sysfs::VolumeBackedNumber(kind, number);
            if (backing.isEmpty() || number < 0)
                continue;
            c.number = quint16(number);
            c.source = EnumSource::VolumeBacked;
            c.mediaType = MediaType::Fixed;
            c.backingFile = backing;
        } else if (kind == Sysfs::Kind::DeviceMapper || kind == Sysfs::Kind::SoftwareRaid ||
                   kind == Sysfs::Kind::NetworkBlock) {
            // Nothing mapped, assembled or connected: nothing to read, not listed (as a loop device
            // without an image).
            number = Sysfs::VolumeBackedNumber(kind, number);
            if (number < 0 || ReadNumber(m_sysBlock + QLatin1Char('/') + name + QStringLiteral("/size")) == 0)
                continue;
            c.number = quint16(number);
            c.source = EnumSource::VolumeBacked;
            c.mediaType = MediaType::Fixed;
            // Other programs assemble these over the user's data: they are only ever read here.
            c.readOnly = true;
        } else if (kind == Sysfs::Kind::Optical) {
            c.source = EnumSource::OpticalDrive;
            c.mediaType = MediaType::CdRom;
        } else {
            if (number > 25)
                continue;
            c.source = EnumSource::Floppy;
            c.mediaType = MediaType::Floppy;
        }
        describe(name, c);
        if (!c.stack.mappedName.isEmpty())
            c.path = DevicePath(name);
        out.append(c);
    }
    if (udev)
        udev_unref(udev);
    // Floppy, physical, optical, volume-backed: the order the devices are looked for.
    std::stable_sort(out.begin(), out.end(), [](const EnumCandidate &a, const EnumCandidate &b) {
        auto rank = [](EnumSource s) {
            switch (s) {
            case EnumSource::Floppy:
                return 0;
            case EnumSource::PhysicalDrive:
                return 1;
            case EnumSource::OpticalDrive:
                return 2;
            default:
                return 3;
            }
        };
        if (rank(a.source) != rank(b.source))
            return rank(a.source) < rank(b.source);
        return a.number < b.number;
    });
    return out;
}

QList<VolumeInfo> CSysfsEnumerationSource::Volumes()
{
    const QList<EnumCandidate> disks = Candidates();
    QFile mountFile(QStringLiteral("/proc/self/mountinfo"));
    QList<Sysfs::MountEntry> mounts;
    if (mountFile.open(QIODevice::ReadOnly))
        mounts = Sysfs::ParseMountInfo(mountFile.readAll());

    auto findMount = [&](const DevNumber &dev) -> const Sysfs::MountEntry * {
        const Sysfs::MountEntry *first = nullptr;
        for (const Sysfs::MountEntry &m : std::as_const(mounts)) {
            if (!dev.valid || m.major != dev.major || m.minor != dev.minor)
                continue;
            if (m.root == QLatin1String("/"))
                return &m;
            if (!first)
                first = &m;
        }
        return first;
    };

    QList<VolumeInfo> out;
    for (const EnumCandidate &disk : disks) {
        const QString diskDir = m_sysBlock + QLatin1Char('/') + disk.kernelName;
        const quint32 sectorSize = disk.logicalSectorSize ? disk.logicalSectorSize : 512;
        int shift = 0;
        for (int s = 9; s <= 12; ++s) {
            if (sectorSize == (1u << s))
                shift = s;
        }

        auto makeVolume = [&](const QString &path, const QString &sysDir, quint32 partNumber, quint64 start,
                              quint64 length) {
            VolumeInfo v;
            v.path = path;
            v.mediaType = disk.mediaType;
            v.sectorSize = sectorSize;
            v.sectorShift = quint8(shift);
            v.partitionNumber = partNumber;
            v.totalSize = length;
            VolumeExtent e;
            e.number = disk.number;
            e.source = disk.source;
            e.sub = 0;
            e.offset = start;
            e.length = length;
            v.extents.append(e);

            Probe probe = ProbeFileSystem(v.path);
            const Sysfs::MountEntry *mount = findMount(ParseDev(ReadSmall(sysDir + QStringLiteral("/dev"))));
            v.fileSystemName = probe.type;
            if (v.fileSystemName.isEmpty() && mount)
                v.fileSystemName = mount->fsType;
            v.fileSystem = FileSystemKindFromName(v.fileSystemName);
            v.label = probe.label;
            v.serial = probe.uuid;
            v.ready = (probe.opened || mount) ? 1 : 0;
            if (mount) {
                v.mountPoint = mount->mountPoint;
                struct statvfs st
                {
                };
                QByteArray mp = QFile::encodeName(mount->mountPoint);
                if (statvfs(mp.constData(), &st) == 0) {
                    quint64 unit = st.f_frsize ? st.f_frsize : st.f_bsize;
                    v.clusterSize = quint32(unit);
                    v.totalSize = quint64(st.f_blocks) * unit;
                    v.freeSize = quint64(st.f_bavail) * unit;
                }
            }
            return v;
        };

        // Partitions: the sub-folders that carry a partition number.
        QDir dir(diskDir);
        const QStringList entries = dir.entryList(QDir::Dirs | QDir::NoDotAndDotDot, QDir::Name);
        QList<VolumeInfo> parts;
        for (const QString &entry : entries) {
            const QString sysDir = diskDir + QLatin1Char('/') + entry;
            if (!entry.startsWith(disk.kernelName) ||
                !QFileInfo::exists(sysDir + QStringLiteral("/partition")))
                continue;
            quint32 number = quint32(ReadNumber(sysDir + QStringLiteral("/partition")));
            quint64 start = ReadNumber(sysDir + QStringLiteral("/start")) * 512;
            quint64 length = ReadNumber(sysDir + QStringLiteral("/size")) * 512;
            parts.append(makeVolume(m_devRoot + QLatin1Char('/') + entry, sysDir, number, start, length));
        }
        std::sort(parts.begin(), parts.end(), [](const VolumeInfo &a, const VolumeInfo &b) {
            return a.partitionNumber < b.partitionNumber;
        });
        if (!parts.isEmpty()) {
            out += parts;
            continue;
        }
        // No partitions: a file system on the whole device is its one volume.
        if (disk.sizeBytes == 0)
            continue;
        VolumeInfo whole = makeVolume(disk.path, diskDir, 0, 0, disk.sizeBytes);
        if (!whole.fileSystemName.isEmpty())
            out.append(whole);
    }
    return out;
}

bool CSysfsEnumerationSource::Resolve(const QString &path, EnumCandidate &out)
{
    const QList<EnumCandidate> all = Candidates();
    auto pick = [&](EnumSource source, int number) {
        for (const EnumCandidate &c : all) {
            if (c.source == source && c.number == number) {
                out = c;
                return true;
            }
        }
        return false;
    };
    const QString lower = path.toLower();
    const QString prefix = QStringLiteral("\\\\.\\");
    if (lower.startsWith(prefix)) {
        QString rest = lower.mid(prefix.size());
        bool ok = false;
        if (rest.size() == 2 && rest.at(1) == QLatin1Char(':') && rest.at(0) >= QLatin1Char('a') &&
            rest.at(0) <= QLatin1Char('z'))
            return pick(EnumSource::Floppy, rest.at(0).unicode() - 'a');
        if (rest.startsWith(QLatin1String("physicaldrive"))) {
            int n = rest.mid(13).toInt(&ok);
            return ok && rest.size() > 13 && pick(EnumSource::PhysicalDrive, n);
        }
        if (rest.startsWith(QLatin1String("cdrom"))) {
            int n = rest.mid(5).toInt(&ok);
            return ok && rest.size() > 5 && pick(EnumSource::OpticalDrive, n);
        }
        return false;
    }
    if (!path.startsWith(QLatin1Char('/')))
        return false;
    // Links such as /dev/disk/by-id/... name the device they point to.
    QString canonical = QFileInfo(path).canonicalFilePath();
    if (canonical.isEmpty())
        canonical = path;
    const QString name = QFileInfo(canonical).fileName();
    for (const EnumCandidate &c : all) {
        if (c.kernelName == name || c.path == canonical) {
            out = c;
            return true;
        }
    }
    return false;
}

std::unique_ptr<IEnumerationSource> MakePlatformEnumerationSource()
{
    return std::make_unique<CSysfsEnumerationSource>();
}
