#include "Kernel/Implementation/Root/RootEnumerate.h"

#include "Kernel/Implementation/Ata/AtaCommand.h"
#include "Kernel/Implementation/Ata/AtaIdentify.h"
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "Kernel/Implementation/Root/RootIdentity.h"

#include <QByteArray>

#include <cstring>
#include <vector>

using namespace DeviceControl;

namespace {

bool IsPartitionable(EnumSource source)
{
    // Loop devices are whole disks on this platform and carry partition tables like drives.
    return source == EnumSource::PhysicalDrive || source == EnumSource::VolumeBacked;
}

// A control the platform does not offer is no failure of the device.
bool IsUnsupported(uint32_t error)
{
    return error == SystemError::InvalidFunction || error == SystemError::NotSupported ||
           error == SystemError::CallNotImplemented;
}

QString ReadyText(uint8_t ready)
{
    return ready ? QStringLiteral("ready") : QStringLiteral("not");
}

} // namespace

CEnumerator::CEnumerator(CRoot *root, IEnumerationSource &source) : m_root(root), m_source(source) {}

void CEnumerator::Internal(const QString &text)
{
    if (m_root)
        m_root->EmitInternal(text);
}

void CEnumerator::Record(uint32_t operation, const QString &name, uint32_t error)
{
    if (m_root)
        m_root->EmitPlatform(operation, name, 0, 0, error);
}

QString CEnumerator::DeviceName(const DeviceInfo &info) const
{
    return info.handle ? info.handle->GetName() : info.kernelName;
}

void CEnumerator::FillFromPlatform(const EnumCandidate &c, DeviceInfo &info)
{
    int shift = RootIdentity::SectorShift(c.logicalSectorSize);
    if (shift > 0)
        info.sectorShift = uint8_t(shift);
    int physical = RootIdentity::SectorShift(c.physicalSectorSize);
    info.physicalSectorShift = physical > 0 ? uint8_t(physical) : info.sectorShift;
    info.alignmentOffset = c.alignmentOffset;
    info.totalSectors = c.sizeBytes >> info.sectorShift;
    if (info.model.isEmpty())
        info.model = c.model;
    if (info.firmware.isEmpty())
        info.firmware = c.firmware;
    if (info.rotation == Rotation::Unknown && c.rotational >= 0)
        info.rotation = c.rotational ? Rotation::Rotating : Rotation::SolidState;
}

bool CEnumerator::ReadIdentifyBlock(DeviceInfo &info, uint8_t *block512)
{
    for (uint8_t command : {Ata::Code::IdentifyDevice, Ata::Code::IdentifyPacketDevice}) {
        Ata::Command cmd;
        cmd.command = command;
        cmd.direction = Ata::Direction::In;
        Ata::Request request = Ata::BuildRequest(cmd);
        Ata::Request reply{};
        uint32_t returned = 0;
        if (!info.handle->DIOC(Ata::IoctlAtaPassThrough, request.data(), Ata::RequestSize, reply.data(),
                               Ata::RequestSize, &returned))
            continue;
        uint64_t address = 0;
        if (!Ata::CheckReply(reply.data(), returned, false, address) || returned != Ata::RequestSize)
            continue;
        if (RootIdentity::IsNonZero(reply.data() + Ata::HeaderSize, Ata::DataSize)) {
            std::memcpy(block512, reply.data() + Ata::HeaderSize, Ata::DataSize);
            return true;
        }
    }
    // Drives behind other buses: the SCSI ATA information page carries the same identify block.
    std::vector<uint8_t> request = AtaIdentify::BuildAtaInfoInquiry();
    std::vector<uint8_t> answer = request;
    uint32_t returned = 0;
    if (info.handle->DIOC(AtaIdentify::ScsiPassThroughCode, request.data(), uint32_t(request.size()),
                          answer.data(), uint32_t(answer.size()), &returned) &&
        AtaIdentify::ParseAtaInfoReply(answer.data(), returned, block512) &&
        RootIdentity::IsNonZero(block512, 512))
        return true;
    return false;
}

bool CEnumerator::Identify(const EnumCandidate &c, DeviceInfo &info)
{
    info = DeviceInfo();
    info.number = c.number;
    info.source = c.source;
    info.sub = 0;
    info.mediaType = c.mediaType;
    info.kernelName = c.kernelName;
    info.backingFile = c.backingFile;
    info.diskSequence = c.diskSequence;
    info.removable = c.removable;
    info.stack = c.stack;
    if (c.source == EnumSource::Floppy || c.source == EnumSource::OpticalDrive)
        info.partStyle = PartStyle::DeviceAsVolume;
    info.handle =
        new CPlatformFile(m_root, c.path, c.openAsVolume ? PlatformKind::Volume : PlatformKind::Device);
    CPlatformFile *h = info.handle;
    const QString name = c.path;
    if (c.readOnly)
        h->SetWritable(false);

    // 1. Open. A candidate that vanished meanwhile is dropped; any other refusal (rights, no
    // medium) still lists the device, as not ready, so the user sees why.
    if (!h->Reopen(false)) {
        uint32_t error = h->GetError();
        if (error == SystemError::FileNotFound || error == SystemError::PathNotFound ||
            error == SystemError::DevNotExist) {
            delete info.handle;
            info.handle = nullptr;
            return false;
        }
        info.ready = 0;
        info.notReadyReason = QStringLiteral("Error [%1]: %2")
                                  .arg(error)
                                  .arg(m_root ? m_root->Backend().ErrorText(error) : QString());
        Internal(QStringLiteral("Device=%1, Not Ready: %2").arg(name, info.notReadyReason));
        FillFromPlatform(c, info);
        if (c.source == EnumSource::PhysicalDrive)
            info.serialManagement = RootIdentity::ManagementSerial(c.managementSerial);
        return true;
    }

    // 2. Geometry.
    DISK_GEOMETRY geometry{};
    uint32_t returned = 0;
    bool geometryOk =
        h->DIOC(IOCTL_DISK_GET_DRIVE_GEOMETRY, nullptr, 0, &geometry, sizeof(geometry), &returned) &&
        returned >= sizeof(geometry);
    if (geometryOk) {
        info.ready = 1;
        if (c.source == EnumSource::PhysicalDrive && geometry.MediaType == RemovableMedia)
            info.mediaType = MediaType::Removable;
        uint64_t cylinders = geometry.Cylinders > 0 ? uint64_t(geometry.Cylinders) : 0;
        info.totalSectors = cylinders * geometry.TracksPerCylinder * geometry.SectorsPerTrack;
        info.sectorsPerTrack = geometry.SectorsPerTrack;
        info.tracksPerCylinder = geometry.TracksPerCylinder;
        int shift = RootIdentity::SectorShift(geometry.BytesPerSector);
        if (shift < 0) {
            Internal(QStringLiteral("Device=%1, Sector=%2").arg(name).arg(geometry.BytesPerSector));
            // A sector size outside 512..4096 cannot address the device: keep 512.
            shift = 9;
        }
        info.sectorShift = uint8_t(shift);
        info.physicalSectorShift = info.sectorShift;
    } else {
        uint32_t error = h->GetError();
        int shift = RootIdentity::SectorShift(c.logicalSectorSize);
        if (c.sizeBytes && shift > 0) {
            // The device is open and the platform's listing knows its size and sector size exactly:
            // it is ready even where the platform answers no geometry control.
            FillFromPlatform(c, info);
            info.ready = 1;
            geometryOk = true;
        } else {
            if (!IsUnsupported(error))
                Record(uint32_t(PlatformOperation::DiskGetDriveGeometry), name, error);
            info.ready = 0;
            info.notReadyReason = QStringLiteral("Error [%1]: %2")
                                      .arg(error)
                                      .arg(m_root ? m_root->Backend().ErrorText(error) : QString());
            Internal(QStringLiteral("Device=%1, Not Ready: %2").arg(name, info.notReadyReason));
            FillFromPlatform(c, info);
        }
    }
    if (c.source == EnumSource::Floppy) {
        h->Close(false);
        return true;
    }

    // 3. Partition information: the exact length and, for a drive, the style of its table.
    if (geometryOk) {
        PARTITION_INFORMATION_EX partEx{};
        PARTITION_INFORMATION part{};
        if (h->DIOC(IOCTL_DISK_GET_PARTITION_INFO_EX, nullptr, 0, &partEx, sizeof(partEx), &returned) &&
            returned >= 24) {
            if (partEx.PartitionLength > 0)
                info.totalSectors = uint64_t(partEx.PartitionLength) >> info.sectorShift;
            if (IsPartitionable(c.source)) {
                if (partEx.PartitionStyle == PARTITION_STYLE_MBR)
                    info.partStyle = PartStyle::Mbr;
                else if (partEx.PartitionStyle == PARTITION_STYLE_GPT)
                    info.partStyle = PartStyle::Gpt;
            }
        } else if (h->DIOC(IOCTL_DISK_GET_PARTITION_INFO, nullptr, 0, &part, sizeof(part), &returned) &&
                   returned >= 16) {
            if (part.PartitionLength > 0)
                info.totalSectors = uint64_t(part.PartitionLength) >> info.sectorShift;
            if (IsPartitionable(c.source))
                info.partStyle = PartStyle::Mbr;
        } else {
            if (!IsUnsupported(h->GetError()))
                Record(uint32_t(PlatformOperation::DiskGetPartitionInfo), name, h->GetError());
            // The platform's own count of the device's bytes is exact where the queries fail.
            if (c.sizeBytes)
                info.totalSectors = c.sizeBytes >> info.sectorShift;
            // Without the platform's word on the table style, the first sector tells it: a
            // protective entry (type 0xEE) marks a GUID table, anything else with the boot
            // signature a master boot record (checked below).
            if (IsPartitionable(c.source)) {
                QByteArray sector(int(info.bytesPerSector()), '\0');
                if (h->Read(0, uint32_t(sector.size()), sector.data())) {
                    info.partStyle = PartStyle::Mbr;
                    for (int entry = 0; entry < 4; ++entry) {
                        if (uint8_t(sector[446 + entry * 16 + 4]) == 0xEE)
                            info.partStyle = PartStyle::Gpt;
                    }
                }
            }
        }

        // 4. A table style needs the boot signature in the first sector.
        if (info.partStyle == PartStyle::Mbr || info.partStyle == PartStyle::Gpt) {
            QByteArray sector(int(info.bytesPerSector()), '\0');
            if (!h->Read(0, uint32_t(sector.size()), sector.data()) || uint8_t(sector[510]) != 0x55 ||
                uint8_t(sector[511]) != 0xAA)
                info.partStyle = PartStyle::Raw;
        }
    }

    // 5. Storage device descriptor: model, firmware and the device-control serial.
    {
        STORAGE_PROPERTY_QUERY query{};
        query.PropertyId = StorageDeviceProperty;
        query.QueryType = PropertyStandardQuery;
        QByteArray answer(512, '\0');
        if (h->DIOC(IOCTL_STORAGE_QUERY_PROPERTY, &query, sizeof(query), answer.data(),
                    uint32_t(answer.size()), &returned)) {
            uint32_t got = qMin<uint32_t>(returned, uint32_t(answer.size()));
            RootIdentity::DescriptorStrings d = RootIdentity::ParseDeviceDescriptor(
                reinterpret_cast<const uint8_t *>(answer.constData()), got);
            if (d.valid) {
                info.serialControl = d.serial;
                info.model = d.model;
                info.firmware = d.firmware;
            }
        }
    }

    // 6. Access alignment: physical sector size and alignment offset.
    {
        STORAGE_PROPERTY_QUERY query{};
        query.PropertyId = StorageAccessAlignmentProperty;
        STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR alignment{};
        if (h->DIOC(IOCTL_STORAGE_QUERY_PROPERTY, &query, sizeof(query), &alignment, sizeof(alignment),
                    &returned) &&
            returned >= sizeof(alignment)) {
            int shift = RootIdentity::SectorShift(alignment.BytesPerPhysicalSector);
            if (shift < 0) {
                Internal(QStringLiteral("Device=%1, PhysicalSectorsize=%2")
                             .arg(name)
                             .arg(alignment.BytesPerPhysicalSector));
            } else {
                info.physicalSectorShift = uint8_t(shift);
                info.alignmentOffset = alignment.BytesOffsetForSectorAlignment;
            }
        } else if (geometryOk) {
            int shift = RootIdentity::SectorShift(c.physicalSectorSize);
            if (shift > 0) {
                info.physicalSectorShift = uint8_t(shift);
                info.alignmentOffset = c.alignmentOffset;
            }
        }
        if (info.physicalSectorShift < info.sectorShift)
            info.physicalSectorShift = info.sectorShift;
    }

    // 7. Identify data: reading-order model, firmware, serial and the nominal rotation.
    {
        uint8_t block[512];
        if (ReadIdentifyBlock(info, block)) {
            RootIdentity::IdentifyStrings s = RootIdentity::ParseIdentify(block);
            if (s.valid) {
                if (!s.model.isEmpty())
                    info.model = s.model;
                if (!s.firmware.isEmpty())
                    info.firmware = s.firmware;
                info.serialIdentify = s.serial;
            }
            if (s.rotation != Rotation::Unknown)
                info.rotation = s.rotation;
        }
    }

    // 8. Seek penalty.
    if (info.rotation == Rotation::Unknown) {
        STORAGE_PROPERTY_QUERY query{};
        query.PropertyId = StorageDeviceSeekPenaltyProperty;
        DEVICE_SEEK_PENALTY_DESCRIPTOR penalty{};
        if (h->DIOC(IOCTL_STORAGE_QUERY_PROPERTY, &query, sizeof(query), &penalty, sizeof(penalty),
                    &returned) &&
            returned >= sizeof(penalty))
            info.rotation = penalty.IncursSeekPenalty ? Rotation::Rotating : Rotation::SolidState;
        else if (c.rotational >= 0)
            info.rotation = c.rotational ? Rotation::Rotating : Rotation::SolidState;
    }

    h->Close(false);

    // 12. The system's device database: model, firmware and the management serial.
    if (c.source == EnumSource::PhysicalDrive) {
        if (info.model.isEmpty())
            info.model = c.model;
        if (info.firmware.isEmpty())
            info.firmware = c.firmware;
        info.serialManagement = RootIdentity::ManagementSerial(c.managementSerial);
    }
    // 13. A serial that is the identify serial with its pairs swapped is that serial.
    RootIdentity::MatchSwappedSerial(info.serialIdentify, info.serialControl, info.serialManagement);
    return true;
}

void CEnumerator::ClaimVolumes(DeviceInfo &info, QList<VolumeInfo> &volumes, QList<bool> &claimed)
{
    const QString name = DeviceName(info);
    for (qsizetype i = 0; i < volumes.size(); ++i) {
        if (claimed.value(i))
            continue;
        VolumeInfo &v = volumes[i];
        bool mine = false;
        for (const VolumeExtent &e : std::as_const(v.extents)) {
            if (e.number == info.number && e.source == info.source && e.sub == info.sub)
                mine = true;
        }
        if (!mine)
            continue;
        if (v.mediaType != info.mediaType) {
            if (info.mediaType == MediaType::Fixed && !info.ready && v.mediaType == MediaType::Removable)
                info.mediaType = MediaType::Removable;
            else
                Internal(QStringLiteral("Device=%1(%2), Volume=%3(%4)")
                             .arg(name)
                             .arg(static_cast<uint32_t>(info.mediaType))
                             .arg(v.path)
                             .arg(static_cast<uint32_t>(v.mediaType)));
        }
        if (v.ready != info.ready)
            Internal(QStringLiteral("Device=%1(%2), Volume=%3(%4)")
                         .arg(name, ReadyText(info.ready), v.path, ReadyText(v.ready)));
        if (v.sectorShift == 0) {
            v.sectorShift = info.sectorShift;
            v.sectorSize = info.bytesPerSector();
        } else if (v.sectorShift != info.sectorShift) {
            Internal(QStringLiteral("Device=%1(%2), Volume=%3(%4)")
                         .arg(name)
                         .arg(info.sectorShift)
                         .arg(v.path)
                         .arg(v.sectorShift));
        }
        info.volumes.append(v);
        claimed[i] = true;
    }
}

void CEnumerator::FinishDevice(DeviceInfo &info)
{
    const QString name = DeviceName(info);
    // 10. Checks after claiming.
    if (info.mediaType == MediaType::Unknown)
        Internal(QStringLiteral("Device=%1").arg(name));
    if (((info.source == EnumSource::Floppy || info.source == EnumSource::OpticalDrive) &&
         info.volumes.size() != 1 && info.ready) ||
        (!info.ready && info.volumes.size() >= 2))
        Internal(QStringLiteral("Device=%1, Volumes=%2").arg(name).arg(info.volumes.size()));

    // 11. A drive that is one volume from its first byte is shown as such.
    if (!IsPartitionable(info.source) || info.volumes.size() != 1)
        return;
    if (info.mediaType != MediaType::Fixed && info.mediaType != MediaType::Removable)
        return;
    const VolumeInfo &v = info.volumes.first();
    if (v.extents.size() != 1 || v.extents.first().offset != 0 || v.extents.first().length == 0)
        return;
    if ((info.partStyle == PartStyle::Mbr || info.partStyle == PartStyle::Gpt) && info.ready)
        info.partStyle = PartStyle::DeviceAsVolume;
    // A file system on the whole device (no table at all) is the same thing.
    else if (info.partStyle == PartStyle::Raw && v.partitionNumber == 0 &&
             v.fileSystem != FileSystemKind::Unknown)
        info.partStyle = PartStyle::DeviceAsVolume;
}

bool CEnumerator::IdentifyWithVolumes(const EnumCandidate &candidate, DeviceInfo &info)
{
    if (!Identify(candidate, info))
        return false;
    QList<VolumeInfo> volumes = m_source.Volumes();
    QList<bool> claimed(volumes.size(), false);
    ClaimVolumes(info, volumes, claimed);
    FinishDevice(info);
    return true;
}

QList<DeviceInfo> CEnumerator::Enumerate()
{
    QList<VolumeInfo> volumes = m_source.Volumes();
    for (const VolumeInfo &v : std::as_const(volumes)) {
        if (v.sectorSize && RootIdentity::SectorShift(v.sectorSize) < 0)
            Internal(QStringLiteral("Volume=%1, Sector=%2").arg(v.path).arg(v.sectorSize));
    }
    QList<bool> claimed(volumes.size(), false);
    QList<DeviceInfo> out;
    const QList<EnumCandidate> candidates = m_source.Candidates();
    for (const EnumCandidate &c : candidates) {
        DeviceInfo info;
        if (!Identify(c, info))
            continue;
        ClaimVolumes(info, volumes, claimed);
        FinishDevice(info);
        out.append(info);
    }
    return out;
}
