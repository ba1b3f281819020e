// The descriptor that device enumeration produces and a device object is built from,
// with the kernel-wide codes it carries (source, media type, partition style,
// file-system kind, attribute bits, image kinds, rotation) and their display names.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>

#include <cstdint>

class CPlatformFile;

// How a device was found; also the "disk prefix" of the command line.
enum class EnumSource : quint8 {
    Floppy = 0,        // floppy volume by letter
    PhysicalDrive = 1, // physical drive
    OpticalDrive = 2,  // optical drive
    VolumeBacked = 3,  // volume-backed device (on Linux: loop, device-mapper, software RAID and
                       // network block devices)
};

// The kind of medium. Codes outside the list are possible and print as "Unknown Device".
enum class MediaType : quint32 {
    Unknown = 0,
    Floppy = 1,
    Fixed = 2,
    Removable = 3,
    CdRom = 4,
    VirtualManager = 5,
    VirtualDevice = 6,
    RaidAssembly = 7,
};
QString MediaTypeName(quint32 code);
inline QString MediaTypeName(MediaType t)
{
    return MediaTypeName(static_cast<quint32>(t));
}

// How a device is partitioned. Codes outside the list print as "Unknown".
enum class PartStyle : quint8 {
    Raw = 0, // not partitioned (not initialised)
    DeviceAsVolume = 1,
    Mbr = 2,
    Gpt = 3,
    Lvm = 4,
    ZfsComponent = 5,
    VirtualManager = 6,
};
QString PartStyleName(quint32 code);
inline QString PartStyleName(PartStyle s)
{
    return PartStyleName(static_cast<quint32>(s));
}

// File-system and partition-kind code shared by partitions and volumes.
enum class FileSystemKind : quint32 {
    Unallocated = 0,
    Extended = 1,
    MetadataArea = 2,
    DataArea = 3,
    MicrosoftReserved = 4,
    PartitionBsd = 5,
    PartitionWss = 6,
    Fat = 7,
    Fat32 = 8,
    ExFat = 9,
    Ntfs = 10,
    Udf = 11,
    Cdfs = 12,
    HfsPlus = 13,
    Ext2 = 14,
    Ext3 = 15,
    Ext4 = 16,
    Ufs = 17,
    ReFs = 18,
    Zfs = 19,
    BtrFs = 20,
    Xfs = 21,
    Jfs = 22,
    ApFs = 23,
    Unknown = 0xFFFFFFFF,
};
QString FileSystemKindName(quint32 code);
inline QString FileSystemKindName(FileSystemKind k)
{
    return FileSystemKindName(static_cast<quint32>(k));
}
// Maps a platform's file-system name (compared upper-case) to its code; Unknown when not listed.
// Besides the names the volume information query gives ("FAT", "NTFS", ...), the names
// libblkid uses on Linux ("vfat", "ext4", "btrfs", ...) are understood.
FileSystemKind FileSystemKindFromName(const QString &name);

// Device attribute bits (one u32 per device).
namespace DeviceAttribute {
enum : quint32 {
    Floppy = 1u << 0,
    CdDvd = 1u << 1,
    Ram = 1u << 2,
    Virtual = 1u << 3,
    Removable = 1u << 4,
    Fixed = 1u << 5,
    Dynamic = 1u << 6,
    Remote = 1u << 7,
    Logical = 1u << 8,
    DiskImage = 1u << 9,
    Ssd = 1u << 10,
    Raid = 1u << 11,
    Ldm = 1u << 12,
    Wss = 1u << 13,
    HpaDcoReady = 1u << 14,
    SmartReady = 1u << 15,
    System = 1u << 16,
    NotReady = 1u << 17,
    NotInitialized = 1u << 18,
    StartUp = 1u << 19,
    Wipeable = 1u << 20,
    Erasable = 1u << 21,
    Detected = 1u << 22,
    DetectedLive = 1u << 23,
    InterruptedErase = 1u << 24, // shown in the device name ("%1, Interrupted Erase"), not in the list
    SmartFailed = 1u << 25,
    SmartWarnings = 1u << 26,
    NoPort = 1u << 27,
    SecuritySupported = 1u << 28,
    SecurityFrozen = 1u << 29,
    SecureErasable = 1u << 30,
};
} // namespace DeviceAttribute
// Names of the set bits in bit order ("Fixed", "SSD", ...); bit 24 and bit 31 have none.
QStringList DeviceAttributeNames(quint32 flags);
// The names joined by ", ".
QString DeviceAttributeText(quint32 flags);

// Kinds of image behind an image-backed device. Codes outside the list print as "Unknown Image".
enum class ImageKind : quint32 {
    DataStorageDevice = 0,
    RawImage = 1,
    OwnImage = 2,
    VirtualPc = 3,
    VmWare = 4,
    FragmentedRaw = 5,
    OwnBackup = 6,
};
QString ImageKindName(quint32 code);
inline QString ImageKindName(ImageKind k)
{
    return ImageKindName(static_cast<quint32>(k));
}

// Rotation values of DeviceInfo::rotation: -1 unknown, 0 solid state, 1 rotating at an
// unknown speed, 1025..65534 nominal revolutions per minute.
namespace Rotation {
constexpr qint32 Unknown = -1;
constexpr qint32 SolidState = 0;
constexpr qint32 Rotating = 1;
constexpr qint32 MinRpm = 1025;
constexpr qint32 MaxRpm = 65534;
} // namespace Rotation
// "Unknown", "Solid State", "Rotating" or "%1 rpm".
QString RotationText(qint32 rotation);

// What a volume-backed device is built from on the platform. Codes print as the names of
// `BackingKindName`.
enum class BackingKind : quint8 {
    None = 0,            // a drive of its own
    Loop = 1,            // an image file attached as a device
    LogicalVolume = 2,   // a logical volume of a volume group
    EncryptedVolume = 3, // an opened encrypted volume (LUKS or plain)
    Multipath = 4,       // one device over several paths to the same disk
    DeviceMapper = 5,    // any other mapping of other block devices
    SoftwareRaid = 6,    // a software RAID array
    NetworkBlock = 7,    // a disk served over the network
};
// "Loop Device", "LVM Logical Volume", "Encrypted Volume", "Multipath Device", "Device Mapper",
// "Software RAID", "Network Block Device"; empty for None.
QString BackingKindName(BackingKind kind);

// How a device stands among the platform's block devices: what it is built as, the devices it is
// built from and the devices built on it. Members and holders are the platform's device paths.
struct BlockStack
{
    BackingKind kind = BackingKind::None;
    QString detail;      // the level of a software RAID ("raid1"), the format of an encrypted
                         // volume ("LUKS2", "PLAIN"); may be empty
    QString mappedName;  // the mapped name of a device-mapper device, as the system's tools show it
    QStringList members; // the devices below it
    QStringList holders; // the devices above it

    // The kind's name with the detail in parentheses ("Software RAID (raid1)").
    QString KindText() const;
};

// One piece of a volume on a device: the device's identity and a byte range on it.
struct VolumeExtent
{
    quint16 number = 0;
    EnumSource source = EnumSource::PhysicalDrive;
    quint8 sub = 0;
    quint64 offset = 0; // bytes from the device's start
    quint64 length = 0; // bytes
};

// One volume as the platform reports it.
struct VolumeInfo
{
    QString path;                             // volume path (Linux: the block device, /dev/sda1)
    qint8 letter = -1;                        // drive letter index (0 = A), -1 none
    MediaType mediaType = MediaType::Unknown; // from the platform drive type
    quint8 ready = 0;
    FileSystemKind fileSystem = FileSystemKind::Unknown;
    QString label;
    QString serial;
    quint32 clusterSize = 0;
    quint32 sectorSize = 0;
    quint8 sectorShift = 0; // 0 when the sector size is unknown
    quint64 totalSize = 0;  // bytes
    quint64 freeSize = 0;   // bytes available
    QList<VolumeExtent> extents;
    // Beyond the common fields: where the platform mounted it and its own file-system name.
    QString mountPoint;
    QString fileSystemName;
    quint32 partitionNumber = 0; // 1-based partition number on its device, 0 for a whole device
};

// Everything enumeration knows about one device.
struct DeviceInfo
{
    quint16 number = 0;
    EnumSource source = EnumSource::PhysicalDrive;
    quint8 sub = 0; // 0: found by enumeration; else an image-backed device
    MediaType mediaType = MediaType::Unknown;
    quint8 ready = 0; // 1 when the geometry query answered
    CPlatformFile *handle = nullptr;
    PartStyle partStyle = PartStyle::Raw;
    quint8 sectorShift = 9;
    quint8 physicalSectorShift = 9;
    quint32 alignmentOffset = 0;
    quint64 totalSectors = 0;
    quint32 sectorsPerTrack = 0;
    quint32 tracksPerCylinder = 0;
    QString model;
    QString firmware;
    QString serial; // the serial shown: empty here, chosen by the device object
    QString serialControl;
    QString serialIdentify;
    QString serialManagement;
    qint32 rotation = Rotation::Unknown;
    QList<VolumeInfo> volumes;

    // Beyond the common fields, what the platform adds:
    QString kernelName;       // the platform's short name ("sda", "loop3"); may be empty
    QString backingFile;      // the image file of a volume-backed (loop) device
    QString notReadyReason;   // why the device could not be opened or queried
    quint64 diskSequence = 0; // the platform's media sequence number, 0 when unknown
    bool removable = false;   // the platform reports removable media
    BlockStack stack;         // what the device is built from and what is built on it

    // Byte sizes that follow from the shifts.
    quint32 bytesPerSector() const { return 1u << sectorShift; }
    quint32 physicalBytesPerSector() const { return 1u << physicalSectorShift; }
    quint64 totalBytes() const { return sectorShift < 64 ? totalSectors << sectorShift : 0; }
};
