#include "Kernel/Implementation/Platform/Linux/LinuxBlockInfo.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>

#include <blkid/blkid.h>
#include <fcntl.h>
#include <libudev.h>
#include <linux/fs.h>
#include <linux/hdreg.h>
#include <sys/ioctl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>
#include <unistd.h>

#include <algorithm>
#include <cstring>

namespace {

QString readSysfs(const QString &path)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadOnly))
        return {};
    return QString::fromUtf8(f.read(4096)).trimmed();
}

uint64_t readSysfsNumber(const QString &path, bool *ok = nullptr)
{
    bool parsed = false;
    const uint64_t value = readSysfs(path).toULongLong(&parsed);
    if (ok)
        *ok = parsed;
    return parsed ? value : 0;
}

QString devNodeOf(const QString &sysfsPath)
{
    const QString uevent = readSysfs(sysfsPath + QStringLiteral("/uevent"));
    for (const QString &line : uevent.split(QLatin1Char('\n'))) {
        if (line.startsWith(QLatin1String("DEVNAME=")))
            return QStringLiteral("/dev/") + line.mid(8);
    }
    return QStringLiteral("/dev/") + QFileInfo(sysfsPath).fileName();
}

dev_t devOf(const QString &sysfsPath)
{
    const QStringList parts = readSysfs(sysfsPath + QStringLiteral("/dev")).split(QLatin1Char(':'));
    if (parts.size() != 2)
        return 0;
    return makedev(parts[0].toUInt(), parts[1].toUInt());
}

class Udev
{
public:
    Udev() : m_udev(udev_new()) {}
    ~Udev()
    {
        if (m_udev)
            udev_unref(m_udev);
    }
    udev *get() const { return m_udev; }

private:
    udev *m_udev;
};

} // namespace

QString PathOfDescriptor(int fd)
{
    return QFile::symLinkTarget(QStringLiteral("/proc/self/fd/%1").arg(fd));
}

LinuxBlockInfo QueryBlockInfo(int fd)
{
    LinuxBlockInfo info;
    struct stat st
    {
    };
    if (fd < 0 || fstat(fd, &st) != 0 || !S_ISBLK(st.st_mode))
        return info;
    info.isBlock = true;
    info.device = st.st_rdev;
    uint64_t size = 0;
    if (ioctl(fd, BLKGETSIZE64, &size) == 0)
        info.sizeBytes = size;
    int value = 0;
    if (ioctl(fd, BLKSSZGET, &value) == 0 && value > 0)
        info.logicalSector = uint32_t(value);
    unsigned int physical = 0;
    if (ioctl(fd, BLKPBSZGET, &physical) == 0 && physical > 0)
        info.physicalSector = physical;
    else
        info.physicalSector = info.logicalSector;
    value = 0;
    if (ioctl(fd, BLKALIGNOFF, &value) == 0 && value > 0)
        info.alignmentOffset = uint32_t(value);
    value = 0;
    if (ioctl(fd, BLKROGET, &value) == 0)
        info.readOnly = value != 0;
    struct hd_geometry geo
    {
    };
    if (ioctl(fd, HDIO_GETGEO, &geo) == 0 && geo.heads && geo.sectors) {
        info.heads = geo.heads;
        info.sectorsPerTrack = geo.sectors;
    }

    info.sysfsPath =
        QFileInfo(QStringLiteral("/sys/dev/block/%1:%2").arg(major(st.st_rdev)).arg(minor(st.st_rdev)))
            .canonicalFilePath();
    if (info.sysfsPath.isEmpty())
        return info;
    QString diskPath = info.sysfsPath;
    if (QFileInfo::exists(info.sysfsPath + QStringLiteral("/partition"))) {
        info.isPartition = true;
        info.partitionNumber = uint32_t(readSysfsNumber(info.sysfsPath + QStringLiteral("/partition")));
        info.startBytes = readSysfsNumber(info.sysfsPath + QStringLiteral("/start")) * 512;
        diskPath = QFileInfo(info.sysfsPath).path();
    }
    info.diskNode = devNodeOf(diskPath);
    info.diskDevice = info.isPartition ? devOf(diskPath) : info.device;
    info.removable = readSysfsNumber(diskPath + QStringLiteral("/removable")) != 0;
    bool ok = false;
    const uint64_t rotational = readSysfsNumber(diskPath + QStringLiteral("/queue/rotational"), &ok);
    if (ok)
        info.rotational = rotational ? 1 : 0;
    info.cdrom = major(info.diskDevice) == 11; // SCSI CD-ROM
    return info;
}

LinuxDeviceIdentity QueryDeviceIdentity(const LinuxBlockInfo &info)
{
    LinuxDeviceIdentity id;
    if (!info.isBlock || info.sysfsPath.isEmpty())
        return id;
    const QString disk = info.isPartition ? QFileInfo(info.sysfsPath).path() : info.sysfsPath;
    id.vendor = readSysfs(disk + QStringLiteral("/device/vendor"));
    id.model = readSysfs(disk + QStringLiteral("/device/model"));
    id.revision = readSysfs(disk + QStringLiteral("/device/rev"));
    if (id.revision.isEmpty())
        id.revision = readSysfs(disk + QStringLiteral("/device/firmware_rev"));
    id.serial = readSysfs(disk + QStringLiteral("/device/serial"));
    Udev u;
    if (u.get()) {
        udev_device *dev = udev_device_new_from_devnum(u.get(), 'b', info.diskDevice);
        if (dev) {
            auto prop = [dev](const char *key) {
                const char *v = udev_device_get_property_value(dev, key);
                return v ? QString::fromUtf8(v).trimmed() : QString();
            };
            if (id.serial.isEmpty())
                id.serial = prop("ID_SERIAL_SHORT");
            if (id.model.isEmpty())
                id.model = prop("ID_MODEL");
            if (id.vendor.isEmpty())
                id.vendor = prop("ID_VENDOR");
            if (id.revision.isEmpty())
                id.revision = prop("ID_REVISION");
            id.bus = prop("ID_BUS");
            udev_device_unref(dev);
        }
    }
    if (id.bus.isEmpty()) {
        const QString name = QFileInfo(disk).fileName();
        if (name.startsWith(QLatin1String("nvme")))
            id.bus = QStringLiteral("nvme");
        else if (name.startsWith(QLatin1String("loop")))
            id.bus = QStringLiteral("loop");
        else if (name.startsWith(QLatin1String("mmcblk")))
            id.bus = QStringLiteral("mmc");
        else if (name.startsWith(QLatin1String("vd")))
            id.bus = QStringLiteral("virtio");
    }
    return id;
}

bool ReadPartitionTable(const QString &diskNode, LinuxPartitionTable &table)
{
    table = {};
    const int fd = ::open(QFile::encodeName(diskNode).constData(), O_RDONLY | O_CLOEXEC);
    if (fd < 0)
        return false;
    blkid_probe probe = blkid_new_probe();
    if (!probe) {
        ::close(fd);
        return false;
    }
    bool ok = false;
    if (blkid_probe_set_device(probe, fd, 0, 0) == 0) {
        blkid_probe_enable_superblocks(probe, 0);
        blkid_probe_enable_partitions(probe, 1);
        blkid_probe_set_partitions_flags(probe, BLKID_PARTS_ENTRY_DETAILS);
        ok = true;
        blkid_partlist list = blkid_probe_get_partitions(probe);
        blkid_parttable root = list ? blkid_partlist_get_table(list) : nullptr;
        if (root) {
            const char *type = blkid_parttable_get_type(root);
            const char *id = blkid_parttable_get_id(root);
            table.type = QString::fromLatin1(type ? type : "");
            table.id = QString::fromLatin1(id ? id : "");
            const int count = blkid_partlist_numof_partitions(list);
            for (int i = 0; i < count && i < 4096; ++i) {
                blkid_partition part = blkid_partlist_get_partition(list, i);
                if (!part)
                    continue;
                LinuxPartitionEntry entry;
                entry.number = uint32_t(std::max(0, blkid_partition_get_partno(part)));
                entry.startBytes = uint64_t(std::max<blkid_loff_t>(0, blkid_partition_get_start(part))) * 512;
                entry.sizeBytes = uint64_t(std::max<blkid_loff_t>(0, blkid_partition_get_size(part))) * 512;
                entry.mbrType = uint32_t(std::max(0, blkid_partition_get_type(part)));
                const char *typeText = blkid_partition_get_type_string(part);
                const char *uuid = blkid_partition_get_uuid(part);
                const char *name = blkid_partition_get_name(part);
                entry.typeGuid = QString::fromLatin1(typeText ? typeText : "");
                entry.uuid = QString::fromLatin1(uuid ? uuid : "");
                entry.name = QString::fromUtf8(name ? name : "");
                entry.flags = blkid_partition_get_flags(part);
                entry.extended = blkid_partition_is_extended(part) != 0;
                table.entries.append(entry);
            }
        }
    }
    blkid_free_probe(probe);
    ::close(fd);
    return ok;
}

QList<LinuxPartitionEntry> KernelPartitions(const LinuxBlockInfo &disk)
{
    QList<LinuxPartitionEntry> list;
    if (disk.sysfsPath.isEmpty() || disk.isPartition)
        return list;
    const QDir dir(disk.sysfsPath);
    for (const QString &name : dir.entryList(QDir::Dirs | QDir::NoDotAndDotDot)) {
        const QString path = dir.filePath(name);
        bool ok = false;
        const uint64_t number = readSysfsNumber(path + QStringLiteral("/partition"), &ok);
        if (!ok || number == 0 || number > UINT32_MAX)
            continue;
        LinuxPartitionEntry entry;
        entry.number = uint32_t(number);
        entry.startBytes = readSysfsNumber(path + QStringLiteral("/start")) * 512;
        entry.sizeBytes = readSysfsNumber(path + QStringLiteral("/size")) * 512;
        list.append(entry);
    }
    std::sort(list.begin(), list.end(), [](const auto &a, const auto &b) { return a.number < b.number; });
    return list;
}

bool ParseGuidText(const QString &text, uint8_t out[16])
{
    const QString t = text.trimmed();
    if (t.size() != 36 || t[8] != QLatin1Char('-') || t[13] != QLatin1Char('-') ||
        t[18] != QLatin1Char('-') || t[23] != QLatin1Char('-'))
        return false;
    QString hex = t;
    hex.remove(QLatin1Char('-'));
    const QByteArray raw = QByteArray::fromHex(hex.toLatin1());
    if (raw.size() != 16 || hex.size() != 32)
        return false;
    for (QChar c : hex)
        if (!c.isDigit() && !(c.toLower() >= QLatin1Char('a') && c.toLower() <= QLatin1Char('f')))
            return false;
    // The first three groups are stored little-endian.
    const int order[16] = {3, 2, 1, 0, 5, 4, 7, 6, 8, 9, 10, 11, 12, 13, 14, 15};
    for (int i = 0; i < 16; ++i)
        out[i] = uint8_t(raw[order[i]]);
    return true;
}
