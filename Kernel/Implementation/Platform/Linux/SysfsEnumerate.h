// Linux listing of storage: the disks of /sys/block (what lsblk shows as disks), the devices built
// on other block devices (loop, device mapper, software RAID, network block devices) with what
// they are built from, their partitions and file systems as volumes, with mount points from
// /proc/self/mountinfo, labels and serial numbers from libblkid, sizes from statvfs, and the device
// database's serial from libudev.
#pragma once

#include "Kernel/Implementation/Common/RootEnumSource.h"

#include <QHash>
#include <QList>
#include <QMutex>
#include <QString>

namespace Sysfs {

// How a block device's kernel name is listed.
enum class Kind {
    Skip,         // not a storage device of the list (ram, zram, ...)
    Physical,     // sd, nvme, vd, hd, xvd, mmcblk
    Optical,      // sr
    Floppy,       // fd
    Loop,         // loop (listed only with a backing file)
    DeviceMapper, // dm-N (listed only with a size)
    SoftwareRaid, // mdN (listed only with a size, that is assembled and running)
    NetworkBlock, // nbdN (listed only with a size, that is connected)
};
Kind Classify(const QString &kernelName);

// The number of a volume-backed device: each kind has its own range, so loop3, dm-3, md3 and nbd3
// differ (loop 0.., device mapper 0x4000.., software RAID 0x8000.., network block 0xC000..).
// -1 for other kinds and for a kernel number beyond its range.
int VolumeBackedNumber(Kind kind, int kernelNumber);

// The number in a name such as "sr1", "fd0", "loop12"; -1 when there is none.
int TrailingNumber(const QString &kernelName);

// A key that orders physical disk names as a person would: sda < sdb < sdz < sdaa, nvme2n1 < nvme10n1.
QString NaturalKey(const QString &kernelName);

// One line of /proc/self/mountinfo.
struct MountEntry
{
    quint32 major = 0;
    quint32 minor = 0;
    QString root;       // the mounted directory inside the file system
    QString mountPoint; // unescaped
    QString fsType;
    QString source;
};
// Parses the mount table; malformed lines are skipped.
QList<MountEntry> ParseMountInfo(const QByteArray &text);

} // namespace Sysfs

class CSysfsEnumerationSource : public IEnumerationSource
{
public:
    // sysRoot and devRoot are the folders of /sys/block and /dev (tests may point elsewhere).
    explicit CSysfsEnumerationSource(const QString &sysBlock = QStringLiteral("/sys/block"),
                                     const QString &devRoot = QStringLiteral("/dev"));

    QList<EnumCandidate> Candidates() override;
    QList<VolumeInfo> Volumes() override;
    bool Resolve(const QString &path, EnumCandidate &out) override;

private:
    // Numbers of physical disks stay with their names while they are present.
    quint16 PhysicalNumber(const QString &kernelName, const QStringList &present);
    QString Attribute(const QString &kernelName, const QString &relative) const;
    // The path the system's tools name a block device by: /dev/mapper/NAME for a device-mapper
    // device, else /dev/NAME (partitions included).
    QString DevicePath(const QString &kernelName) const;
    // The devices below (folder "slaves") or above ("holders") a device, as device paths.
    QStringList Related(const QString &kernelName, const QString &folder) const;
    // What a device-mapper, software RAID or network block device is built as.
    BlockStack StackOf(const QString &kernelName, Sysfs::Kind kind) const;

    QString m_sysBlock;
    QString m_devRoot;
    QMutex m_mutex;
    QHash<QString, quint16> m_physicalNumbers;
};
