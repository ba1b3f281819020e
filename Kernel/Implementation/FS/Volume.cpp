#include "Kernel/Implementation/FS/Volume.h"

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <QFileInfo>

#include <algorithm>
#include <atomic>
#include <cstring>

namespace {

std::uint8_t ShiftOf(std::uint32_t sectorSize)
{
    std::uint8_t s = 0;
    while (s < 31 && (1u << s) < sectorSize)
        ++s;
    return s;
}

} // namespace

CVolume::CVolume(cStorage *medium, const VolumeDescription &d, cRoot *root)
    : m_medium(medium), m_name(d.name), m_secondName(d.secondName), m_driveId(d.driveId), m_ready(d.ready),
      m_size(d.size), m_handle(d.handle), m_kind(d.kind), m_mountId(d.mountId), m_rootObject(root)
{
    std::uint32_t sectorSize = d.sectorSize;
    if (sectorSize < 512 || sectorSize > 65536 || (sectorSize & (sectorSize - 1)) != 0)
        sectorSize = 512;
    m_sectorShift = ShiftOf(sectorSize);
    if (medium && m_size > medium->GetSize())
        m_size = medium->GetSize();
    m_assessed = QDateTime::currentDateTime();
    m_sectorCount = m_size >> m_sectorShift;
    m_cluster0Sector = 0;
    m_clusterShift = 0;
    m_firstCluster = 0;
    m_lastCluster = m_sectorCount ? m_sectorCount - 1 : 0;
}

CVolume::~CVolume() = default;

QString CVolume::GetDisplayName() const
{
    QString text;
    if (!m_ready)
        text = QStringLiteral("[not ready]");
    else
        text = m_label.isEmpty() ? QStringLiteral("Local Disk") : m_label;
    if (m_driveId < NoLetter)
        return text + QStringLiteral(" (%1:)").arg(QChar(char16_t('A' + m_driveId)));
    // Without a letter: where the volume is mounted, else its device, else the mount id.
    if (!m_secondName.isEmpty()) {
        QString last = QFileInfo(m_secondName).fileName();
        if (last.isEmpty())
            last = m_secondName;
        return text + QStringLiteral(" (%1)").arg(last);
    }
    if (!m_name.isEmpty())
        return text + QStringLiteral(" (%1)").arg(QFileInfo(m_name).fileName());
    return text + QStringLiteral(" (%1:)").arg(m_mountId);
}

std::uint64_t CVolume::GetSize() const
{
    return m_sectorCount << m_sectorShift;
}

std::uint32_t CVolume::GetDriveId() const
{
    return m_driveId < NoLetter ? m_driveId : (m_mountId | 0x80000000u);
}

std::uint32_t CVolume::GetClusterSize() const
{
    return 1u << (m_sectorShift + m_clusterShift);
}

std::uint32_t CVolume::GetClusterRange(std::uint64_t &firstCluster, std::uint64_t &lastCluster,
                                       std::uint64_t &cluster0Sector) const
{
    firstCluster = m_firstCluster;
    lastCluster = m_lastCluster;
    cluster0Sector = m_cluster0Sector;
    return 1u << m_clusterShift;
}

std::uint64_t CVolume::SectorToCluster(std::uint64_t sector) const
{
    if (sector < m_cluster0Sector)
        return NoSector;
    const std::uint64_t cluster = (sector - m_cluster0Sector) >> m_clusterShift;
    if (cluster < m_firstCluster || cluster > m_lastCluster)
        return NoSector;
    return cluster;
}

std::uint64_t CVolume::ClusterToSector(std::uint64_t cluster) const
{
    if (cluster < m_firstCluster || cluster > m_lastCluster)
        return NoSector;
    if (cluster > (~0ull >> m_clusterShift))
        return NoSector;
    const std::uint64_t rel = cluster << m_clusterShift;
    if (rel > ~0ull - m_cluster0Sector)
        return NoSector;
    return rel + m_cluster0Sector;
}

std::uint64_t CVolume::GetFreeBytes() const
{
    const unsigned shift = m_sectorShift + m_clusterShift;
    if (shift >= 64 || m_freeClusters > (~0ull >> shift))
        return ~0ull;
    return m_freeClusters << shift;
}

bool CVolume::IsClusterFree(std::uint64_t)
{
    return false;
}

bool CVolume::ReadCluster(std::uint64_t cluster, void *buffer, std::uint32_t &error)
{
    error = 0;
    const std::uint64_t sector = ClusterToSector(cluster);
    if (sector == NoSector) {
        Message(QStringLiteral("Attempt to read invalid cluster number %1").arg(cluster));
        return false;
    }
    return ReadSectors(sector, 1u << m_clusterShift, buffer, error);
}

bool CVolume::WriteCluster(std::uint64_t cluster, const void *buffer, std::uint32_t &error)
{
    error = 0;
    const std::uint64_t sector = ClusterToSector(cluster);
    if (sector == NoSector) {
        Message(QStringLiteral("Attempt to write invalid cluster number %1").arg(cluster));
        return false;
    }
    return WriteSectors(sector, 1u << m_clusterShift, buffer, error);
}

bool CVolume::ApplyBootSector(const void *, std::uint32_t)
{
    return false;
}

bool CVolume::SelectFileTableCopy(std::uint8_t, std::uint8_t &count, std::uint8_t &current)
{
    count = 0;
    current = 0;
    return false;
}

std::int32_t CVolume::GetServiceEntryCount() const
{
    return static_cast<std::int32_t>(m_service.size());
}

CEntry *CVolume::GetServiceEntry(std::int32_t index) const
{
    return index >= 0 && std::size_t(index) < m_service.size() ? m_service[index].get() : nullptr;
}

std::uint32_t CVolume::GetIntegrity(std::uint64_t &validItems, std::uint64_t &checkedItems)
{
    validItems = m_validItems;
    checkedItems = m_checkedItems;
    if (m_checkedItems == AllItems)
        return 0;
    if (m_validItems == m_checkedItems)
        return 8;
    return std::min<std::uint32_t>(GradeIntegrity(), 8);
}

std::uint32_t CVolume::GradeIntegrity()
{
    return 0;
}

std::unique_ptr<CEntry> CVolume::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntry>(this, parent, QString(), 0, 0);
}

QByteArray CVolume::QueryInfo(const QByteArray &)
{
    return QByteArray();
}

std::uint64_t CVolume::UserValue(std::uint64_t value)
{
    const std::uint64_t old = m_userValue;
    if (value != AllItems)
        m_userValue = value;
    return old;
}

QStringList CVolume::Messages() const
{
    std::lock_guard<std::mutex> lock(m_messageMutex);
    return m_messages;
}

void CVolume::Initialize() {}

void CVolume::Message(const QString &text)
{
    const QString full = QStringLiteral("%1: %2").arg(GetDisplayName(), text);
    {
        std::lock_guard<std::mutex> lock(m_messageMutex);
        if (m_messages.size() < 1000)
            m_messages << full;
    }
    if (m_rootObject)
        m_rootObject->EmitInternal(full);
}

void CVolume::SetOverlay(std::uint64_t primary, std::uint64_t copy, const QByteArray &bytes)
{
    if (bytes.isEmpty()) {
        m_overlay.clear();
        m_overlaySector[0] = m_overlaySector[1] = NoSector;
        return;
    }
    m_overlay = bytes;
    m_overlaySector[0] = primary;
    m_overlaySector[1] = copy;
}

CEntry *CVolume::AddServiceEntry(std::unique_ptr<CEntry> entry)
{
    if (!entry)
        return nullptr;
    m_service.push_back(std::move(entry));
    return m_service.back().get();
}

void CVolume::ClearEntries()
{
    m_service.clear();
    m_root.reset();
}

CEntry *CVolume::AddServiceArea(const QString &name, std::uint64_t sector, std::uint64_t count)
{
    if (count == 0 || sector >= m_sectorCount)
        return nullptr;
    count = std::min(count, m_sectorCount - sector);
    auto entry = std::make_unique<CEntry>(this, nullptr, name, sector,
                                          CEntry::AttrSystemArea | CEntry::AttrSectorPosition);
    entry->GetHandle().SetUnitShift(m_sectorShift);
    entry->GetHandle().AddRun(sector, count);
    return AddServiceEntry(std::move(entry));
}

bool CVolume::SetClusterGeometry(std::uint64_t clusterBytes, std::uint64_t cluster0Sector,
                                 std::uint64_t firstCluster, std::uint64_t lastCluster)
{
    const std::uint64_t sectorSize = 1ull << m_sectorShift;
    if (clusterBytes < sectorSize || (clusterBytes & (clusterBytes - 1)) != 0 || clusterBytes > (1ull << 31))
        return false;
    std::uint8_t shift = 0;
    while ((sectorSize << shift) < clusterBytes)
        ++shift;
    if (firstCluster > lastCluster)
        return false;
    m_clusterShift = shift;
    m_cluster0Sector = cluster0Sector;
    m_firstCluster = firstCluster;
    m_lastCluster = lastCluster;
    return true;
}

bool CVolume::ReadRaw(std::uint64_t offset, std::uint64_t length, void *buffer)
{
    std::uint32_t error = 0;
    if (!m_medium || offset > m_size || length > m_size - offset)
        return false;
    return m_medium->ReadBytes(offset, length, buffer, error);
}

bool CVolume::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    return Transfer(true, first, count, static_cast<std::uint8_t *>(buffer), error);
}

bool CVolume::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer, std::uint32_t &error)
{
    return Transfer(false, first, count, static_cast<std::uint8_t *>(const_cast<void *>(buffer)), error);
}

bool CVolume::Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                       std::uint32_t &error)
{
    error = 0;
    if (!buffer || first >= m_sectorCount)
        return false;
    if (count == 0)
        return true;
    const std::uint64_t sectorSize = 1ull << m_sectorShift;
    std::uint32_t n = count;
    const bool cut = std::uint64_t(count) > m_sectorCount - first;
    if (cut)
        n = static_cast<std::uint32_t>(m_sectorCount - first);
    const std::uint64_t bytes = std::uint64_t(n) * sectorSize;
    bool ok = true;
    if (m_handle) {
        const bool lockHere = !read && !m_handle->IsLocked();
        if (lockHere && !m_handle->Lock()) {
            error = m_handle->GetError();
            return false;
        }
        std::uint64_t done = 0;
        while (ok && done < bytes) {
            const std::uint32_t part =
                static_cast<std::uint32_t>(std::min<std::uint64_t>(bytes - done, 1u << 30));
            ok = m_handle->ReadWrite(read, first * sectorSize + done, part, buffer + done);
            done += part;
        }
        if (!ok)
            error = m_handle->GetError();
        // The unlock closes the handle: what it wrote must be on the medium before.
        if (ok && !read && lockHere)
            ok = m_handle->Flush(error);
        if (lockHere)
            m_handle->Unlock();
    } else if (!m_medium) {
        ok = false;
    } else if (m_medium->GetBytesPerSector() == sectorSize) {
        ok = read ? m_medium->ReadSectors(first, n, buffer, error)
                  : m_medium->WriteSectors(first, n, buffer, error);
    } else {
        ok = read ? m_medium->ReadBytes(first * sectorSize, bytes, buffer, error)
                  : m_medium->WriteBytes(first * sectorSize, bytes, buffer, error);
    }
    // The overlay serves its sectors whatever the medium answered.
    if (!m_overlay.isEmpty()) {
        const std::uint64_t from = first * sectorSize, to = from + bytes;
        for (std::uint64_t sector : m_overlaySector) {
            if (sector == NoSector || sector > (~0ull >> m_sectorShift))
                continue;
            const std::uint64_t oFrom = sector * sectorSize;
            const std::uint64_t oTo = oFrom + std::uint64_t(m_overlay.size());
            const std::uint64_t a = std::max(from, oFrom), b = std::min(to, oTo);
            if (a >= b)
                continue;
            if (read)
                std::memcpy(buffer + (a - from), m_overlay.constData() + (a - oFrom), b - a);
            else
                std::memcpy(m_overlay.data() + (a - oFrom), buffer + (a - from), b - a);
        }
    }
    if (cut && read)
        std::memset(buffer + bytes, 0, std::uint64_t(count - n) * sectorSize);
    return ok && !cut;
}

bool CVolume::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint64_t sectorSize = 1ull << m_sectorShift;
    auto *out = static_cast<std::uint8_t *>(buffer);
    QByteArray one(static_cast<qsizetype>(sectorSize), 0);
    while (length > 0) {
        const std::uint64_t sector = offset >> m_sectorShift;
        const std::uint64_t in = offset & (sectorSize - 1);
        if (in == 0 && length >= sectorSize) {
            const std::uint64_t whole = std::min<std::uint64_t>(length >> m_sectorShift, 0x4000);
            if (!ReadSectors(sector, static_cast<std::uint32_t>(whole), out, error))
                return false;
            out += whole << m_sectorShift;
            offset += whole << m_sectorShift;
            length -= whole << m_sectorShift;
            continue;
        }
        if (!ReadSectors(sector, 1, one.data(), error))
            return false;
        const std::uint64_t part = std::min(sectorSize - in, length);
        std::memcpy(out, one.constData() + in, part);
        out += part;
        offset += part;
        length -= part;
    }
    return true;
}

bool CVolume::Flush(std::uint32_t &error)
{
    error = 0;
    if (m_handle && !m_handle->Flush(error))
        return false;
    return !m_medium || m_medium->Flush(error);
}

bool CVolume::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint64_t sectorSize = 1ull << m_sectorShift;
    const auto *in = static_cast<const std::uint8_t *>(buffer);
    QByteArray one(static_cast<qsizetype>(sectorSize), 0);
    while (length > 0) {
        const std::uint64_t sector = offset >> m_sectorShift;
        const std::uint64_t at = offset & (sectorSize - 1);
        if (at == 0 && length >= sectorSize) {
            const std::uint64_t whole = std::min<std::uint64_t>(length >> m_sectorShift, 0x4000);
            if (!WriteSectors(sector, static_cast<std::uint32_t>(whole), in, error))
                return false;
            in += whole << m_sectorShift;
            offset += whole << m_sectorShift;
            length -= whole << m_sectorShift;
            continue;
        }
        // A partial sector is read, patched and written whole.
        if (!ReadSectors(sector, 1, one.data(), error))
            return false;
        const std::uint64_t part = std::min(sectorSize - at, length);
        std::memcpy(one.data() + at, in, part);
        if (!WriteSectors(sector, 1, one.constData(), error))
            return false;
        in += part;
        offset += part;
        length -= part;
    }
    return true;
}
