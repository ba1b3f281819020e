// Linux listing of storage: the disks of /sys/block (what lsblk shows as disks), their partitions
// and file systems as volumes, with mount points from /proc/self/mountinfo, labels and serial
// numbers from libblkid, sizes from statvfs, and the device database's serial from libudev.
#pragma once

#include "Kernel/Implementation/RootEnumSource.h"

#include <QHash>
#include <QList>
#include <QMutex>
#include <QString>

namespace Sysfs {

// How a block device's kernel name is listed.
enum class Kind {
    Skip,     // not a storage device of the list (ram, zram, dm, md, ...)
    Physical, // sd, nvme, vd, hd, xvd, mmcblk
    Optical,  // sr
    Floppy,   // fd
    Loop,     // loop (listed only with a backing file)
};
Kind Classify(const QString &kernelName);

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

    QString m_sysBlock;
    QString m_devRoot;
    QMutex m_mutex;
    QHash<QString, quint16> m_physicalNumbers;
};
