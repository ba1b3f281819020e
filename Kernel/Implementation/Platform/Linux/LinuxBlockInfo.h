// What Linux knows of an open block device: sizes from its ioctls, its place in sysfs, the identity
// udev gives it, and the partition table libblkid reads from its disk.
#pragma once

#include <QList>
#include <QString>

#include <cstdint>
#include <sys/types.h>

struct LinuxBlockInfo
{
    bool isBlock = false;
    dev_t device = 0;
    QString sysfsPath; // /sys/dev/block/MAJ:MIN resolved
    bool isPartition = false;
    uint32_t partitionNumber = 0;
    uint64_t startBytes = 0; // of a partition on its disk
    QString diskNode;        // /dev node of the whole disk (the device itself when it is a disk)
    dev_t diskDevice = 0;
    uint64_t sizeBytes = 0;
    uint32_t logicalSector = 512;
    uint32_t physicalSector = 512;
    uint32_t alignmentOffset = 0;
    uint32_t heads = 0; // 0: the device gives no geometry
    uint32_t sectorsPerTrack = 0;
    bool readOnly = false;
    bool removable = false;
    int rotational = -1; // -1 unknown
    bool cdrom = false;
};

// Sizes, flags and sysfs place of the block device open as fd; isBlock false for anything else.
LinuxBlockInfo QueryBlockInfo(int fd);

struct LinuxDeviceIdentity
{
    QString vendor;
    QString model;
    QString revision;
    QString serial;
    QString bus; // udev ID_BUS: "ata", "usb", "scsi", "nvme", ... or empty
};

// Vendor, model, revision and serial of a whole disk from sysfs and udev.
LinuxDeviceIdentity QueryDeviceIdentity(const LinuxBlockInfo &info);

struct LinuxPartitionEntry
{
    uint32_t number = 0;
    uint64_t startBytes = 0;
    uint64_t sizeBytes = 0;
    uint32_t mbrType = 0;
    QString typeGuid;
    QString uuid;
    QString name;
    uint64_t flags = 0;
    bool extended = false;
};

struct LinuxPartitionTable
{
    QString type; // "dos", "gpt", or empty when none
    QString id;   // disk signature (8 hex digits) or disk GUID
    QList<LinuxPartitionEntry> entries;
};

// The partition table of the disk at the node, as libblkid reads it; false when the disk cannot be read.
bool ReadPartitionTable(const QString &diskNode, LinuxPartitionTable &table);

// The partitions the kernel has for a disk (sysfs), as number and byte range, in number order.
QList<LinuxPartitionEntry> KernelPartitions(const LinuxBlockInfo &disk);

// Parses "xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx" into the mixed-endian GUID layout (16 bytes); false when
// the text is not a GUID.
bool ParseGuidText(const QString &text, uint8_t out[16]);

// Path of the file open as fd (for a second, independent open).
QString PathOfDescriptor(int fd);
