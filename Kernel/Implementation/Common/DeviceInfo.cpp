#include "Kernel/Implementation/Common/DeviceInfo.h"

#include <QHash>

QString MediaTypeName(quint32 code)
{
    switch (code) {
    case 1:
        return QStringLiteral("Floppy Disk");
    case 2:
        return QStringLiteral("Fixed Disk");
    case 3:
        return QStringLiteral("Removable Disk");
    case 4:
        return QStringLiteral("CDRom Disk");
    case 5:
        return QStringLiteral("Virtual Manager");
    case 6:
        return QStringLiteral("Virtual Device");
    case 7:
        return QStringLiteral("RAID Assembly");
    default:
        return QStringLiteral("Unknown Device");
    }
}

QString PartStyleName(quint32 code)
{
    switch (code) {
    case 0:
        return QStringLiteral("Raw (not partitioned)");
    case 1:
        return QStringLiteral("Device as Volume");
    case 2:
        return QStringLiteral("Master Boot Record");
    case 3:
        return QStringLiteral("GUID Partition Table");
    case 4:
        return QStringLiteral("Logical Volume Manager");
    case 5:
        return QStringLiteral("Device as ZFS component");
    case 6:
        return QStringLiteral("Virtual Manager");
    default:
        return QStringLiteral("Unknown");
    }
}

QString FileSystemKindName(quint32 code)
{
    static const char *const names[] = {
        "Unallocated",   "Extended",      "Metadata Area", "Data Area", "Microsoft reserved",
        "Partition BSD", "Partition WSS", "FAT",           "FAT32",     "exFAT",
        "NTFS",          "UDF",           "CDFS",          "HFS+",      "Ext2",
        "Ext3",          "Ext4",          "UFS",           "ReFS",      "ZFS",
        "BtrFS",         "XFS",           "JFS",           "ApFS"};
    if (code < sizeof(names) / sizeof(names[0]))
        return QLatin1String(names[code]);
    return QStringLiteral("Unknown");
}

FileSystemKind FileSystemKindFromName(const QString &name)
{
    static const QHash<QString, FileSystemKind> map = {
        // Names of the volume information query.
        {QStringLiteral("FAT"), FileSystemKind::Fat},
        {QStringLiteral("FAT32"), FileSystemKind::Fat32},
        {QStringLiteral("EXFAT"), FileSystemKind::ExFat},
        {QStringLiteral("NTFS"), FileSystemKind::Ntfs},
        {QStringLiteral("UDF"), FileSystemKind::Udf},
        {QStringLiteral("CDFS"), FileSystemKind::Cdfs},
        {QStringLiteral("HFS"), FileSystemKind::HfsPlus},
        {QStringLiteral("REFS"), FileSystemKind::ReFs},
        // Names libblkid and the mount table use.
        {QStringLiteral("VFAT"), FileSystemKind::Fat},
        {QStringLiteral("MSDOS"), FileSystemKind::Fat},
        {QStringLiteral("NTFS3"), FileSystemKind::Ntfs},
        {QStringLiteral("ISO9660"), FileSystemKind::Cdfs},
        {QStringLiteral("HFSPLUS"), FileSystemKind::HfsPlus},
        {QStringLiteral("EXT2"), FileSystemKind::Ext2},
        {QStringLiteral("EXT3"), FileSystemKind::Ext3},
        {QStringLiteral("EXT4"), FileSystemKind::Ext4},
        {QStringLiteral("UFS"), FileSystemKind::Ufs},
        {QStringLiteral("ZFS_MEMBER"), FileSystemKind::Zfs},
        {QStringLiteral("ZFS"), FileSystemKind::Zfs},
        {QStringLiteral("BTRFS"), FileSystemKind::BtrFs},
        {QStringLiteral("XFS"), FileSystemKind::Xfs},
        {QStringLiteral("JFS"), FileSystemKind::Jfs},
        {QStringLiteral("APFS"), FileSystemKind::ApFs},
    };
    return map.value(name.trimmed().toUpper(), FileSystemKind::Unknown);
}

QStringList DeviceAttributeNames(quint32 flags)
{
    static const char *const names[31] = {"Floppy",
                                          "CD-DVD",
                                          "RAM",
                                          "Virtual",
                                          "Removable",
                                          "Fixed",
                                          "Dynamic",
                                          "Remote",
                                          "Logical",
                                          "DI",
                                          "SSD",
                                          "RAID",
                                          "LDM",
                                          "WSS",
                                          "HPA DCO Ready",
                                          "SMART Ready",
                                          "System",
                                          "Not Ready",
                                          "Not Initialized",
                                          "Start Up",
                                          "Wipeable",
                                          "Erasable",
                                          "Detected",
                                          "Detected Live",
                                          nullptr,
                                          "SMART Failed",
                                          "SMART Warnings",
                                          "No Port",
                                          "Security Supported",
                                          "Security Frozen",
                                          "Secure Erasable"};
    QStringList out;
    for (int bit = 0; bit < 31; ++bit) {
        if ((flags & (1u << bit)) && names[bit])
            out << QLatin1String(names[bit]);
    }
    return out;
}

QString DeviceAttributeText(quint32 flags)
{
    return DeviceAttributeNames(flags).join(QStringLiteral(", "));
}

QString ImageKindName(quint32 code)
{
    switch (code) {
    case 0:
        return QStringLiteral("Data Storage Device");
    case 1:
        return QStringLiteral("RAW Data (Binary) Disk Image");
    case 2:
        return QStringLiteral("Tarvo Disk Image");
    case 3:
        return QStringLiteral("Virtual PC Disk Image");
    case 4:
        return QStringLiteral("Virtual Machine (VMWare) Disk Image");
    case 5:
        return QStringLiteral("Fragmented RAW Data Disk Image");
    case 6:
        return QStringLiteral("Tarvo Backup Image");
    default:
        return QStringLiteral("Unknown Image");
    }
}

QString RotationText(qint32 rotation)
{
    if (rotation == Rotation::SolidState)
        return QStringLiteral("Solid State");
    if (rotation == Rotation::Rotating)
        return QStringLiteral("Rotating");
    if (rotation >= Rotation::MinRpm && rotation <= Rotation::MaxRpm)
        return QStringLiteral("%1 rpm").arg(rotation);
    return QStringLiteral("Unknown");
}

QString BackingKindName(BackingKind kind)
{
    switch (kind) {
    case BackingKind::Loop:
        return QStringLiteral("Loop Device");
    case BackingKind::LogicalVolume:
        return QStringLiteral("LVM Logical Volume");
    case BackingKind::EncryptedVolume:
        return QStringLiteral("Encrypted Volume");
    case BackingKind::Multipath:
        return QStringLiteral("Multipath Device");
    case BackingKind::DeviceMapper:
        return QStringLiteral("Device Mapper");
    case BackingKind::SoftwareRaid:
        return QStringLiteral("Software RAID");
    case BackingKind::NetworkBlock:
        return QStringLiteral("Network Block Device");
    case BackingKind::None:
        break;
    }
    return QString();
}

QString BlockStack::KindText() const
{
    const QString name = BackingKindName(kind);
    if (name.isEmpty() || detail.isEmpty())
        return name;
    return QStringLiteral("%1 (%2)").arg(name, detail);
}
