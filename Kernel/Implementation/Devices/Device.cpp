#include "Kernel/Implementation/Devices/Device.h"

#include <QFileInfo>
#include <algorithm>
#include <cstring>

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Devices/DeviceImage.h"
#include "Kernel/Implementation/Devices/DeviceVirtualSource.h"
#include "Kernel/Implementation/Devices/PartScanDevice.h"
#include "Kernel/Implementation/Devices/VolumeCreate.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

namespace {

// Platform transfers take a 32-bit byte count: larger requests go in pieces of at most this.
constexpr std::uint64_t MaxTransferBytes = 0x40000000ull;

} // namespace

CDevice::CDevice(cRoot *root, const DeviceInfo &info, CImageHandle *image, cStorage *raid)
    : m_root(root), m_info(info), m_image(image), m_raid(raid)
{
    m_partMan = std::make_unique<CPartMan>(this);
    ReadIdentityStrings();
    ScanPartitionTables();
    // A virtual device gets its sectors only with its source (SetVirtualSource).
    if (m_info.partStyle != PartStyle::VirtualManager)
        CreateVolumes();
}

CDevice::~CDevice()
{
    // Volumes read through partitions, partitions through the device.
    m_volume.reset();
    m_partitions.clear();
    if (m_info.handle) {
        if (m_info.handle->IsOpened())
            m_info.handle->Close(false);
        delete m_info.handle;
        m_info.handle = nullptr;
    }
    if (m_image)
        DeviceImage::Destroy(m_image);
}

void CDevice::Internal(const QString &text) const
{
    if (m_root)
        m_root->EmitInternal(text);
}

void CDevice::ScanPartitionTables()
{
    PartScan::Result result = PartScan::ScanDevice(*this, m_info, m_root);
    m_info.partStyle = result.partStyle;
    m_diskSignature = result.diskSignature;
    m_partitions = std::move(result.partitions);
}

namespace {

void CreatePartitionVolumes(CPartition &partition, const VolumeCreate::Options &options)
{
    // Gaps and extended partitions hold no volume of their own; a BSD container gets none either
    // and its slices, made by the creation, are children visited next.
    const std::uint32_t kind = partition.GetKind();
    if (kind != static_cast<std::uint32_t>(FileSystemKind::Unallocated) &&
        kind != static_cast<std::uint32_t>(FileSystemKind::Extended))
        partition.SetFileSystemVolume(VolumeCreate::CreateVolume(partition, options));
    for (std::uint32_t i = 0; i < partition.GetChildCount(); ++i)
        CreatePartitionVolumes(*partition.GetChildPartition(i), options);
}

void VisitPartition(CPartition &partition, const std::function<void(CPartition *, CVolume *)> &visit)
{
    if (CVolume *v = partition.Volume())
        visit(&partition, v);
    for (std::uint32_t i = 0; i < partition.GetChildCount(); ++i)
        VisitPartition(*partition.GetChildPartition(i), visit);
}

} // namespace

void CDevice::CreateVolumes()
{
    VolumeCreate::Options options;
    options.root = m_root;
    if (m_partitions.empty()) {
        m_volume = VolumeCreate::CreateVolume(*this, m_info.mediaType, options);
        return;
    }
    for (const auto &p : m_partitions)
        CreatePartitionVolumes(*p, options);
}

DeviceLayout::~DeviceLayout()
{
    // Volumes read through partitions, partitions through the device.
    volume.reset();
    partitions.clear();
}

std::unique_ptr<DeviceLayout> CDevice::ScanLayout(const DeviceInfo &fresh)
{
    auto layout = std::make_unique<DeviceLayout>();
    DeviceInfo facts = m_info;
    facts.partStyle = fresh.partStyle;
    facts.volumes = fresh.volumes;
    PartScan::Result result = PartScan::ScanDevice(*this, facts, m_root);
    layout->partStyle = result.partStyle;
    layout->diskSignature = result.diskSignature;
    layout->volumes = fresh.volumes;
    layout->partitions = std::move(result.partitions);
    if (layout->partStyle == PartStyle::VirtualManager)
        return layout;
    VolumeCreate::Options options;
    options.root = m_root;
    if (layout->partitions.empty())
        layout->volume = VolumeCreate::CreateVolume(*this, m_info.mediaType, options);
    for (const auto &p : layout->partitions)
        CreatePartitionVolumes(*p, options);
    return layout;
}

namespace {

bool SameVolume(const CVolume *a, const CVolume *b)
{
    if (!a || !b)
        return a == b;
    return a->GetKind() == b->GetKind() && a->GetLabel() == b->GetLabel() &&
           a->GetSerialNumber() == b->GetSerialNumber() && a->GetTotalSectors() == b->GetTotalSectors();
}

bool SamePartition(const CPartition &a, const CPartition &b)
{
    if (a.GetKind() != b.GetKind() || a.GetStart() != b.GetStart() || a.GetLength() != b.GetLength() ||
        a.GetActive() != b.GetActive() || a.GetTableSector() != b.GetTableSector() ||
        a.GetEntry() != b.GetEntry() || a.IsGptEntry() != b.IsGptEntry() ||
        a.GetGpt().typeGuid != b.GetGpt().typeGuid || a.GetGpt().uniqueGuid != b.GetGpt().uniqueGuid ||
        a.GetGpt().attributes != b.GetGpt().attributes || a.GetGpt().name != b.GetGpt().name ||
        a.GetChildCount() != b.GetChildCount() || !SameVolume(a.Volume(), b.Volume()))
        return false;
    for (std::uint32_t i = 0; i < a.GetChildCount(); ++i)
        if (!SamePartition(*a.GetChildPartition(i), *b.GetChildPartition(i)))
            return false;
    return true;
}

} // namespace

bool CDevice::HasLayout(const DeviceLayout &layout) const
{
    if (layout.partStyle != m_info.partStyle || layout.diskSignature != m_diskSignature ||
        layout.partitions.size() != m_partitions.size() || !SameVolume(layout.volume.get(), m_volume.get()))
        return false;
    for (std::size_t i = 0; i < m_partitions.size(); ++i)
        if (!SamePartition(*m_partitions[i], *layout.partitions[i]))
            return false;
    return true;
}

std::unique_ptr<DeviceLayout> CDevice::SwapLayout(std::unique_ptr<DeviceLayout> layout)
{
    auto previous = std::make_unique<DeviceLayout>();
    previous->partStyle = m_info.partStyle;
    previous->diskSignature = m_diskSignature;
    previous->volumes = m_info.volumes;
    previous->partitions = std::move(m_partitions);
    previous->volume = std::move(m_volume);
    m_info.partStyle = layout->partStyle;
    m_diskSignature = layout->diskSignature;
    m_info.volumes = layout->volumes;
    m_partitions = std::move(layout->partitions);
    m_volume = std::move(layout->volume);
    return previous;
}

void CDevice::ForEachVolume(const std::function<void(CPartition *, CVolume *)> &visit) const
{
    if (m_volume)
        visit(nullptr, m_volume.get());
    for (const auto &p : m_partitions)
        VisitPartition(*p, visit);
}

void CDevice::SetVirtualSource(cVirtualSource *source)
{
    m_virtual.reset(source);
    if (source && !m_volume && m_partitions.empty())
        CreateVolumes();
}

// ---- geometry and identity ---------------------------------------------------------------

QString CDevice::GetDisplayName() const
{
    if (m_image) {
        const QStringList files = DeviceImage::FileNames(m_image);
        if (!files.isEmpty())
            return QFileInfo(files.first()).fileName();
    }
    QString name = m_info.model;
    // A mapped device goes by its mapped name, as the system's tools show it.
    const QString where = !m_info.stack.mappedName.isEmpty() ? m_info.stack.mappedName
                          : !m_info.kernelName.isEmpty()     ? m_info.kernelName
                                                             : QString::number(m_info.number);
    if (name.isEmpty())
        return QStringLiteral("Disk %1").arg(where);
    return QStringLiteral("%1 (%2)").arg(name, where);
}

std::uint64_t CDevice::GetSize() const
{
    return m_info.totalBytes();
}

std::uint32_t CDevice::GetBytesPerSector() const
{
    return m_info.bytesPerSector();
}

std::uint32_t CDevice::GetPhysicalBytesPerSector() const
{
    return m_info.physicalBytesPerSector();
}

std::uint64_t CDevice::GetTotalSectors() const
{
    return m_info.totalSectors;
}

bool CDevice::IsReady() const
{
    return m_info.ready != 0;
}

bool CDevice::IsLost() const
{
    return m_info.handle && m_info.handle->IsLost();
}

bool CDevice::IsWritable()
{
    if (m_info.handle)
        return m_info.handle->IsWritable();
    if (m_image)
        return DeviceImage::IsWritable(m_image);
    return false;
}

std::uint32_t CDevice::GetPartitionCount() const
{
    return std::uint32_t(m_partitions.size());
}

CPartition *CDevice::GetPartition(std::uint32_t index) const
{
    return index < m_partitions.size() ? m_partitions[index].get() : nullptr;
}

std::uint64_t CDevice::UserValue(std::uint64_t value)
{
    const std::uint64_t old = m_userValue;
    if (value != 0xFFFFFFFFFFFFFFFFull)
        m_userValue = value;
    return old;
}

bool CDevice::Flush()
{
    std::uint32_t error = 0;
    return Flush(error);
}

bool CDevice::Flush(std::uint32_t &error)
{
    error = 0;
    bool ok = true;
    // Every path flushes; the first failure's error is kept.
    auto flush = [&](auto &target) {
        std::uint32_t e = 0;
        if (!target.Flush(e) && ok) {
            ok = false;
            error = e;
        }
    };
    if (m_info.handle)
        flush(*m_info.handle);
    if (m_image) {
        std::uint32_t e = 0;
        if (!DeviceImage::Flush(m_image, e) && ok) {
            ok = false;
            error = e;
        }
    }
    if (m_raid)
        flush(*m_raid);
    // The volume handles that writes inside a volume (or all of a volume-backed device) go through.
    std::vector<CPartition *> todo;
    for (const auto &p : m_partitions)
        todo.push_back(p.get());
    for (std::size_t i = 0; i < todo.size(); ++i) {
        for (const auto &c : todo[i]->Children())
            todo.push_back(c.get());
        if (CPlatformFile *h = todo[i]->GetVolumeHandle())
            flush(*h);
        // A device assembled from partitions of others writes through them.
        if (m_info.partStyle == PartStyle::VirtualManager && !m_virtual && todo[i]->GetDevice() != this)
            flush(*todo[i]);
    }
    return ok;
}

bool CDevice::Close(bool withPartitions)
{
    bool ok = true;
    if (m_info.handle && m_info.handle->IsOpened())
        ok = m_info.handle->Close(false);
    if (withPartitions) {
        // Every partition, logical ones included, gives up its own volume handle.
        std::vector<CPartition *> todo;
        for (const auto &p : m_partitions)
            todo.push_back(p.get());
        while (!todo.empty()) {
            CPartition *p = todo.back();
            todo.pop_back();
            if (CPlatformFile *h = p->GetVolumeHandle(); h && h->IsOpened() && !h->IsLocked())
                ok = h->Close(false) && ok;
            for (const auto &c : p->Children())
                todo.push_back(c.get());
        }
    }
    return ok;
}

MediaType CDevice::GetMediaType() const
{
    return m_info.mediaType;
}

std::int32_t CDevice::GetRotation() const
{
    return m_info.rotation;
}

QString CDevice::GetModel() const
{
    return m_info.model;
}

QString CDevice::GetSerial(std::uint8_t which) const
{
    switch (which) {
    case 0:
        return m_info.serial;
    case 1:
        return m_info.serialControl;
    case 2:
        return m_info.serialIdentify;
    case 3:
        return m_info.serialManagement;
    default:
        return QString();
    }
}

void CDevice::SetSerial(const QString &serial)
{
    m_info.serial = serial;
}

std::uint32_t CDevice::GetSectorsPerTrack() const
{
    return m_info.sectorsPerTrack ? m_info.sectorsPerTrack : 63;
}

std::uint32_t CDevice::GetTracksPerCylinder() const
{
    return m_info.tracksPerCylinder ? m_info.tracksPerCylinder : 255;
}

std::uint64_t CDevice::GetCylinders() const
{
    if (!m_info.sectorsPerTrack || !m_info.tracksPerCylinder)
        return 0;
    return m_info.totalSectors / m_info.tracksPerCylinder / m_info.sectorsPerTrack;
}

std::uint8_t CDevice::GetImageIdentity(std::uint8_t &source, std::uint16_t &number, QStringList &files) const
{
    source = std::uint8_t(m_info.source);
    number = m_info.number;
    files = m_image ? DeviceImage::FileNames(m_image) : QStringList();
    return m_info.sub;
}

cStorage *CDevice::GetRaidIdentity() const
{
    return m_raid.get();
}

PartStyle CDevice::GetPartStyle() const
{
    return m_info.partStyle;
}

// ---- sector access -----------------------------------------------------------------------

bool CDevice::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    return Transfer(true, first, count, static_cast<std::uint8_t *>(buffer), error);
}

bool CDevice::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer, std::uint32_t &error)
{
    // The byte-access buffer must not keep an older copy of a sector written here.
    m_bytes.Invalidate(first, count);
    // Write paths pass the buffer on untouched; the transfer takes one pointer for both directions.
    return Transfer(false, first, count, static_cast<std::uint8_t *>(const_cast<void *>(buffer)), error);
}

bool CDevice::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    return m_bytes.Read(*this, offset, length, buffer, error);
}

bool CDevice::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error)
{
    return m_bytes.Write(*this, offset, length, buffer, error);
}

bool CDevice::Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                       std::uint32_t &error)
{
    error = 0;
    const std::uint64_t total = m_info.totalSectors;
    if (first >= total)
        return false;
    const std::uint32_t ss = GetBytesPerSector();
    std::uint32_t n = count;
    if (total - first < count) {
        n = std::uint32_t(total - first);
        if (read)
            std::memset(buffer + std::uint64_t(n) * ss, 0, std::uint64_t(count - n) * ss);
    }
    if (n == 0)
        return true; // nothing asked, nothing to do

    bool ok;
    if (m_info.partStyle == PartStyle::VirtualManager) {
        ok = TransferVirtual(read, first, n, buffer, error);
    } else if (m_raid) {
        ok = read ? m_raid->ReadSectors(first, n, buffer, error)
                  : m_raid->WriteSectors(first, n, buffer, error);
    } else if (m_image) {
        ok = DeviceImage::Transfer(m_image, read, first, n, buffer, error);
    } else if (!m_info.handle) {
        ok = TransferBackingVolume(read, first, n, buffer, error);
    } else {
        bool handled = false;
        ok = read ? false : WriteSplit(first, n, buffer, error, handled);
        if (!handled)
            ok = TransferPlatform(m_info.handle, read, first * ss, std::uint64_t(n) * ss, buffer, error);
    }
    // A clipped request reports failure after doing what exists.
    return ok && n == count;
}

bool CDevice::TransferPlatform(CPlatformFile *handle, bool read, std::uint64_t offset, std::uint64_t length,
                               std::uint8_t *buffer, std::uint32_t &error)
{
    // Pieces stay whole sectors so no transfer splits a sector.
    const std::uint64_t ss = GetBytesPerSector();
    const std::uint64_t piece = MaxTransferBytes - MaxTransferBytes % ss;
    while (length) {
        const std::uint32_t size = std::uint32_t(std::min(length, piece));
        if (!handle->ReadWrite(read, offset, size, buffer)) {
            error = handle->GetError();
            return false;
        }
        offset += size;
        buffer += size;
        length -= size;
    }
    return true;
}

bool CDevice::TransferVirtual(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                              std::uint32_t &error)
{
    const std::uint32_t ss = GetBytesPerSector();
    if (m_virtual) {
        if (!read) {
            error = 1;
            return false;
        }
        const std::uint64_t bytes = std::uint64_t(count) * ss;
        const std::uint64_t unit = cVirtualSource::UnitSize;
        if ((first * ss) % unit || bytes % unit) {
            error = 1;
            return false;
        }
        if (m_virtual->ReadUnits(first * ss / unit, bytes / unit, buffer) != bytes) {
            error = 2;
            return false;
        }
        return true;
    }
    // Assembled from partitions: the partition that holds the first sector serves what it can,
    // the rest continues after it.
    CPartition *part = nullptr;
    for (const auto &p : m_partitions) {
        if (first >= p->GetStart() && first - p->GetStart() < p->GetLength()) {
            part = p.get();
            break;
        }
    }
    if (!part)
        return false;
    const std::uint64_t rel = first - part->GetStart();
    const std::uint32_t here = std::uint32_t(std::min<std::uint64_t>(count, part->GetLength() - rel));
    const bool ok =
        read ? part->ReadSectors(rel, here, buffer, error) : part->WriteSectors(rel, here, buffer, error);
    if (here == count)
        return ok;
    std::uint32_t restError = 0;
    const bool rest =
        Transfer(read, first + here, count - here, buffer + std::uint64_t(here) * ss, restError);
    if (!rest) {
        if (ok)
            error = restError;
        return false;
    }
    return ok;
}

bool CDevice::TransferBackingVolume(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                                    std::uint32_t &error)
{
    // Only a volume-backed device with exactly one volume whose handle is open.
    if (m_info.source != EnumSource::VolumeBacked || m_info.volumes.size() != 1 || m_partitions.size() != 1)
        return false;
    CPlatformFile *volume = m_partitions.front()->GetVolumeHandle();
    if (!volume || !volume->IsOpened())
        return false;
    const std::uint32_t ss = GetBytesPerSector();
    return TransferPlatform(volume, read, first * ss, std::uint64_t(count) * ss, buffer, error);
}

bool CDevice::WriteSplit(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer, std::uint32_t &error,
                         bool &handled)
{
    handled = false;
    const std::uint64_t end = first + count;
    CPartition *owner = nullptr;
    std::vector<CPartition *> todo;
    for (const auto &p : m_partitions)
        todo.push_back(p.get());
    // Table order, children right after their extended partition.
    for (std::size_t i = 0; i < todo.size() && !owner; ++i) {
        CPartition *p = todo[i];
        CPlatformFile *h = p->GetVolumeHandle();
        if (h && p->GetLength() && p->GetStart() < end && first < p->GetStart() + p->GetLength())
            owner = p;
        std::size_t at = i + 1;
        for (const auto &c : p->Children())
            todo.insert(todo.begin() + std::ptrdiff_t(at++), c.get());
    }
    if (!owner)
        return false;
    handled = true;

    const std::uint32_t ss = GetBytesPerSector();
    const std::uint64_t pStart = owner->GetStart();
    const std::uint64_t pEnd = pStart + owner->GetLength();
    const std::uint64_t midFirst = std::max(first, pStart);
    const std::uint64_t midEnd = std::min(end, pEnd);

    bool ok = true;
    std::uint32_t firstError = 0;
    auto keep = [&](bool partOk, std::uint32_t partError) {
        if (!partOk && ok) {
            ok = false;
            firstError = partError;
        }
    };
    if (midFirst > first) {
        std::uint32_t e = 0;
        const bool r = Transfer(false, first, std::uint32_t(midFirst - first), buffer, e);
        keep(r, e);
    }
    {
        std::uint32_t e = 0;
        const bool r = TransferPlatform(owner->GetVolumeHandle(), false, (midFirst - pStart) * ss,
                                        (midEnd - midFirst) * ss, buffer + (midFirst - first) * ss, e);
        keep(r, e);
    }
    if (end > midEnd) {
        std::uint32_t e = 0;
        const bool r =
            Transfer(false, midEnd, std::uint32_t(end - midEnd), buffer + (midEnd - first) * ss, e);
        keep(r, e);
    }
    error = firstError;
    return ok;
}
