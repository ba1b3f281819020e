#include "Kernel/Implementation/Platform/Linux/LinuxDeviceControl.h"

#include "Kernel/Implementation/Platform/Linux/LinuxAtaPassThrough.h"
#include "Kernel/Implementation/Platform/Linux/LinuxBackend.h"
#include "Kernel/Implementation/Platform/Linux/LinuxBlockInfo.h"
#include "Kernel/Implementation/Platform/Linux/LinuxScsiPassThrough.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/DriveLayout.h"

#include <QByteArray>
#include <QFile>
#include <QMutexLocker>

#include <cerrno>
#include <cstring>
#include <fcntl.h>
#include <linux/fs.h>
#include <sys/ioctl.h>
#include <sys/sysmacros.h>
#include <unistd.h>

using namespace DeviceControl;

namespace {

// The disk number a Linux block device has in device-control answers: its device number.
uint32_t diskNumberOf(dev_t device)
{
    return (uint32_t(major(device)) << 20) | (uint32_t(minor(device)) & 0xFFFFF);
}

// Copies a fixed-size answer: too small a buffer fails with 122.
template <typename T> uint32_t answerWith(const T &value, void *out, uint32_t outSize, uint32_t &returned)
{
    if (!out || outSize < sizeof(T))
        return SystemError::InsufficientBuffer;
    std::memcpy(out, &value, sizeof(T));
    returned = sizeof(T);
    return 0;
}

uint32_t styleOf(const QString &tableType)
{
    if (tableType == QLatin1String("gpt"))
        return PARTITION_STYLE_GPT;
    if (tableType == QLatin1String("dos"))
        return PARTITION_STYLE_MBR;
    return PARTITION_STYLE_RAW;
}

void fillDetails(PARTITION_INFORMATION_EX &entry, const LinuxPartitionEntry &part)
{
    if (entry.PartitionStyle == PARTITION_STYLE_GPT) {
        ParseGuidText(part.typeGuid, reinterpret_cast<uint8_t *>(&entry.Gpt.PartitionType));
        ParseGuidText(part.uuid, reinterpret_cast<uint8_t *>(&entry.Gpt.PartitionId));
        entry.Gpt.Attributes = part.flags;
        const QString name = part.name.left(36);
        for (int i = 0; i < name.size(); ++i)
            entry.Gpt.Name[i] = name.at(i).unicode();
    } else if (entry.PartitionStyle == PARTITION_STYLE_MBR) {
        entry.Mbr.PartitionType = uint8_t(part.mbrType);
        entry.Mbr.BootIndicator = (part.flags & 0x80) ? 1 : 0;
        entry.Mbr.RecognizedPartition = part.mbrType != 0 && !part.extended ? 1 : 0;
        entry.Mbr.HiddenSectors = uint32_t(part.startBytes / 512);
    }
}

// The layout of a disk: the partitions the kernel has, with the details of the table entry of the same
// number. Containers of logical partitions carry no partition number.
DriveLayout layoutOf(const LinuxBlockInfo &info)
{
    DriveLayout layout;
    LinuxPartitionTable table;
    ReadPartitionTable(info.diskNode, table);
    const uint32_t style = styleOf(table.type);
    layout.header.PartitionStyle = style;
    if (style == PARTITION_STYLE_MBR) {
        bool ok = false;
        layout.header.Mbr.Signature = table.id.toUInt(&ok, 16);
    } else if (style == PARTITION_STYLE_GPT) {
        ParseGuidText(table.id, reinterpret_cast<uint8_t *>(&layout.header.Gpt.DiskId));
        layout.header.Gpt.MaxPartitionCount = 128;
    }
    for (const LinuxPartitionEntry &kernel : KernelPartitions(info)) {
        PARTITION_INFORMATION_EX entry =
            MakePartitionEntry(style == PARTITION_STYLE_RAW ? PARTITION_STYLE_MBR : style, kernel.number,
                               kernel.startBytes, kernel.sizeBytes);
        for (const LinuxPartitionEntry &part : table.entries) {
            if (part.number != kernel.number || part.startBytes != kernel.startBytes)
                continue;
            fillDetails(entry, part);
            if (part.extended) {
                entry.PartitionNumber = 0;
                entry.PartitionLength = int64_t(part.sizeBytes);
            }
        }
        layout.entries.append(entry);
    }
    return layout;
}

PARTITION_INFORMATION_EX partitionInfoOf(const LinuxBlockInfo &info)
{
    if (!info.isPartition) {
        LinuxPartitionTable table;
        ReadPartitionTable(info.diskNode, table);
        return MakePartitionEntry(styleOf(table.type), 0, 0, info.sizeBytes);
    }
    LinuxPartitionTable table;
    ReadPartitionTable(info.diskNode, table);
    const uint32_t style = styleOf(table.type);
    PARTITION_INFORMATION_EX entry =
        MakePartitionEntry(style == PARTITION_STYLE_RAW ? PARTITION_STYLE_MBR : style, info.partitionNumber,
                           info.startBytes, info.sizeBytes);
    for (const LinuxPartitionEntry &part : table.entries)
        if (part.number == info.partitionNumber && part.startBytes == info.startBytes)
            fillDetails(entry, part);
    return entry;
}

DISK_GEOMETRY geometryOf(const LinuxBlockInfo &info)
{
    DISK_GEOMETRY g{};
    // Without a geometry of its own a disk is described with 255 heads of 63 sectors.
    g.TracksPerCylinder = info.heads ? info.heads : 255;
    g.SectorsPerTrack = info.sectorsPerTrack ? info.sectorsPerTrack : 63;
    g.BytesPerSector = info.logicalSector;
    g.MediaType = info.removable ? RemovableMedia : FixedMedia;
    const uint64_t cylinder = uint64_t(g.TracksPerCylinder) * g.SectorsPerTrack * g.BytesPerSector;
    g.Cylinders = int64_t(cylinder ? info.sizeBytes / cylinder : 0);
    return g;
}

uint32_t busTypeOf(const QString &bus)
{
    if (bus == QLatin1String("ata"))
        return BusTypeSata;
    if (bus == QLatin1String("usb"))
        return BusTypeUsb;
    if (bus == QLatin1String("scsi"))
        return BusTypeScsi;
    if (bus == QLatin1String("nvme"))
        return BusTypeNvme;
    if (bus == QLatin1String("mmc"))
        return BusTypeSd;
    if (bus == QLatin1String("loop"))
        return BusTypeFileBackedVirtual;
    if (bus == QLatin1String("virtio"))
        return BusTypeVirtual;
    return BusTypeUnknown;
}

uint32_t deviceDescriptor(const LinuxBlockInfo &info, void *out, uint32_t outSize, uint32_t &returned)
{
    const LinuxDeviceIdentity id = QueryDeviceIdentity(info);
    STORAGE_DEVICE_DESCRIPTOR d;
    std::memset(&d, 0, sizeof d);
    QByteArray answer(sizeof d, '\0');
    auto addText = [&answer](const QString &text) -> uint32_t {
        if (text.isEmpty())
            return 0;
        const uint32_t offset = uint32_t(answer.size());
        answer.append(text.toLatin1());
        answer.append('\0');
        return offset;
    };
    d.Version = sizeof d;
    d.DeviceType = info.cdrom ? 0x05 : 0x00;
    d.RemovableMedia = info.removable ? 1 : 0;
    d.VendorIdOffset = addText(id.vendor);
    d.ProductIdOffset = addText(id.model);
    d.ProductRevisionOffset = addText(id.revision);
    d.SerialNumberOffset = addText(id.serial);
    d.BusType = busTypeOf(id.bus);
    d.Size = uint32_t(answer.size());
    std::memcpy(answer.data(), &d, sizeof d);
    if (!out || outSize < 8)
        return SystemError::InsufficientBuffer;
    returned = std::min<uint32_t>(outSize, uint32_t(answer.size()));
    std::memcpy(out, answer.constData(), returned);
    return 0;
}

uint32_t queryProperty(const LinuxBlockInfo &info, const void *in, uint32_t inSize, void *out,
                       uint32_t outSize, uint32_t &returned)
{
    if (!in || inSize < 8)
        return SystemError::InvalidParameter;
    STORAGE_PROPERTY_QUERY query{};
    std::memcpy(&query, in, 8);
    if (query.QueryType == 1) { // does the property exist?
        const bool known = query.PropertyId == StorageDeviceProperty ||
                           query.PropertyId == StorageAccessAlignmentProperty ||
                           query.PropertyId == StorageDeviceSeekPenaltyProperty;
        return known ? 0 : SystemError::NotSupported;
    }
    if (query.QueryType != PropertyStandardQuery)
        return SystemError::InvalidParameter;
    switch (query.PropertyId) {
    case StorageDeviceProperty:
        return deviceDescriptor(info, out, outSize, returned);
    case StorageAccessAlignmentProperty: {
        STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR a{};
        a.Version = a.Size = sizeof a;
        a.BytesPerLogicalSector = info.logicalSector;
        a.BytesPerPhysicalSector = info.physicalSector;
        a.BytesOffsetForSectorAlignment = info.alignmentOffset;
        return answerWith(a, out, outSize, returned);
    }
    case StorageDeviceSeekPenaltyProperty: {
        if (info.rotational < 0)
            return SystemError::NotSupported;
        DEVICE_SEEK_PENALTY_DESCRIPTOR s{};
        s.Version = s.Size = sizeof s;
        s.IncursSeekPenalty = uint8_t(info.rotational);
        return answerWith(s, out, outSize, returned);
    }
    default:
        return SystemError::NotSupported;
    }
}

} // namespace

LinuxDeviceControl::LinuxDeviceControl(LinuxBackend &backend, int fd, PlatformHandle handle)
    : m_backend(backend), m_fd(fd), m_handle(handle)
{
}

bool LinuxDeviceControl::Run(uint32_t code, const void *in, uint32_t inSize, void *out, uint32_t outSize,
                             uint32_t &returned, uint32_t &error)
{
    returned = 0;
    error = Answer(code, in, inSize, out, outSize, returned);
    if (returned > outSize)
        returned = outSize;
    return error == 0;
}

uint32_t LinuxDeviceControl::Answer(uint32_t code, const void *in, uint32_t inSize, void *out,
                                    uint32_t outSize, uint32_t &returned)
{
    if (m_fd < 0)
        return SystemError::InvalidHandle;
    const LinuxBlockInfo info = QueryBlockInfo(m_fd);
    if (!info.isBlock)
        return SystemError::InvalidFunction; // ordinary files answer no device controls

    switch (code) {
    case IOCTL_DISK_GET_DRIVE_GEOMETRY:
        return answerWith(geometryOf(info), out, outSize, returned);
    case IOCTL_DISK_GET_DRIVE_GEOMETRY_EX: {
        DISK_GEOMETRY_EX g{};
        g.Geometry = geometryOf(info);
        g.DiskSize = int64_t(info.sizeBytes);
        return answerWith(g, out, outSize, returned);
    }
    case IOCTL_DISK_GET_LENGTH_INFO:
        return answerWith(GET_LENGTH_INFORMATION{int64_t(info.sizeBytes)}, out, outSize, returned);
    case IOCTL_DISK_IS_WRITABLE:
        return info.readOnly ? SystemError::WriteProtect : 0;
    case IOCTL_DISK_UPDATE_PROPERTIES:
        // Asks the kernel to read the partition table again (an explicit request only).
        if (info.isPartition)
            return SystemError::InvalidFunction;
        return ioctl(m_fd, BLKRRPART) == 0 ? 0 : errnoToSystemError(errno);
    case IOCTL_DISK_GET_PARTITION_INFO_EX:
        return answerWith(partitionInfoOf(info), out, outSize, returned);
    case IOCTL_DISK_GET_PARTITION_INFO: {
        const PARTITION_INFORMATION_EX ex = partitionInfoOf(info);
        if (ex.PartitionStyle == PARTITION_STYLE_GPT)
            return SystemError::InvalidFunction; // the old query knows no GPT partitions
        PARTITION_INFORMATION p{};
        p.StartingOffset = ex.StartingOffset;
        p.PartitionLength = ex.PartitionLength;
        p.PartitionNumber = ex.PartitionNumber;
        if (ex.PartitionStyle == PARTITION_STYLE_MBR) {
            p.HiddenSectors = ex.Mbr.HiddenSectors;
            p.PartitionType = ex.Mbr.PartitionType;
            p.BootIndicator = ex.Mbr.BootIndicator;
            p.RecognizedPartition = ex.Mbr.RecognizedPartition;
        }
        return answerWith(p, out, outSize, returned);
    }
    case IOCTL_DISK_GET_DRIVE_LAYOUT_EX:
        if (info.isPartition)
            return SystemError::InvalidFunction;
        return layoutOf(info).Answer(out, outSize, returned);
    case IOCTL_STORAGE_GET_DEVICE_NUMBER: {
        STORAGE_DEVICE_NUMBER n{};
        n.DeviceType = info.cdrom ? FILE_DEVICE_CD_ROM : FILE_DEVICE_DISK;
        n.DeviceNumber = diskNumberOf(info.diskDevice);
        n.PartitionNumber = info.isPartition ? info.partitionNumber : 0;
        return answerWith(n, out, outSize, returned);
    }
    case IOCTL_VOLUME_GET_VOLUME_DISK_EXTENTS: {
        struct
        {
            VOLUME_DISK_EXTENTS header;
            DISK_EXTENT extent;
        } answer{};
        answer.header.NumberOfDiskExtents = 1;
        answer.extent.DiskNumber = diskNumberOf(info.diskDevice);
        answer.extent.StartingOffset = int64_t(info.startBytes);
        answer.extent.ExtentLength = int64_t(info.sizeBytes);
        return answerWith(answer, out, outSize, returned);
    }
    case IOCTL_STORAGE_QUERY_PROPERTY:
        return queryProperty(info, in, inSize, out, outSize, returned);
    case IOCTL_ATA_PASS_THROUGH:
        return LinuxAtaPassThrough(m_fd, in, inSize, out, outSize, returned);
    case SMART_GET_VERSION:
    case SMART_RCV_DRIVE_DATA:
    case SMART_SEND_DRIVE_COMMAND:
        return LinuxSmartControl(m_fd, code, in, inSize, out, outSize, returned);
    case IOCTL_SCSI_PASS_THROUGH:
        return LinuxScsiPassThrough(m_fd, in, inSize, out, outSize, returned);
    case IOCTL_SCSI_PASS_THROUGH_DIRECT:
        return LinuxScsiPassThroughDirect(m_fd, in, inSize, out, outSize, returned);
    case FSCTL_ALLOW_EXTENDED_DASD_IO:
        return 0;
    case FSCTL_LOCK_VOLUME:
        return Lock();
    case FSCTL_UNLOCK_VOLUME:
        return Unlock();
    case FSCTL_DISMOUNT_VOLUME:
        // File systems are never unmounted behind the user's back.
        return SystemError::NotSupported;
    default:
        return SystemError::InvalidFunction;
    }
}

// The lock of a volume is an exclusive open of its block device: it fails while the device is mounted or
// held exclusively by someone else, and keeps others from mounting it until the unlock.
uint32_t LinuxDeviceControl::Lock()
{
    QMutexLocker guard(&m_backend.m_locksMutex);
    if (m_backend.m_locks.count(m_handle))
        return SystemError::AccessDenied;
    const QString path = PathOfDescriptor(m_fd);
    if (path.isEmpty())
        return SystemError::InvalidHandle;
    const int fd = ::open(QFile::encodeName(path).constData(), O_RDONLY | O_EXCL | O_CLOEXEC);
    if (fd < 0)
        return errno == EBUSY ? SystemError::AccessDenied : errnoToSystemError(errno);
    m_backend.m_locks[m_handle] = fd;
    return 0;
}

uint32_t LinuxDeviceControl::Unlock()
{
    QMutexLocker guard(&m_backend.m_locksMutex);
    auto it = m_backend.m_locks.find(m_handle);
    if (it == m_backend.m_locks.end())
        return SystemError::NotLocked;
    ::close(it->second);
    m_backend.m_locks.erase(it);
    return 0;
}
