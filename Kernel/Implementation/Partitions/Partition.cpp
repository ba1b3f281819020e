#include "Kernel/Implementation/Partitions/Partition.h"

#include "Kernel/Implementation/FS/Volume.h"

#include <algorithm>
#include <cstring>

CPartition::CPartition(cDevice *device, cStorage *storage, CPartition *parent, std::uint32_t kind,
                       std::uint64_t start, std::uint64_t length)
    : m_device(device), m_parent(parent), m_start(start), m_length(length), m_kind(kind), m_storage(storage)
{
}

CPartition::~CPartition()
{
    // The volume reads through this partition, the slices of a container through the device.
    m_fileSystem.reset();
    m_children.clear();
}

void CPartition::SetFileSystemVolume(std::unique_ptr<CVolume> volume)
{
    m_fileSystem = std::move(volume);
}

cPartition *CPartition::GetChild(std::uint32_t index) const
{
    return GetChildPartition(index);
}

CPartition *CPartition::GetChildPartition(std::uint32_t index) const
{
    return index < m_children.size() ? m_children[index].get() : nullptr;
}

void CPartition::SetEntry(const std::uint8_t *entry16)
{
    std::memcpy(m_entry.data(), entry16, 16);
}

void CPartition::SetGpt(const GptFields &gpt)
{
    m_gpt = gpt;
    m_isGpt = true;
}

CPartition *CPartition::AddChild(std::unique_ptr<CPartition> child)
{
    child->m_parent = this;
    m_children.push_back(std::move(child));
    return m_children.back().get();
}

QString CPartition::GetDisplayName() const
{
    QString device = m_storage ? m_storage->GetDisplayName() : QString();
    return QStringLiteral("%1, %2 %3+%4").arg(device, FileSystemKindName(m_kind)).arg(m_start).arg(m_length);
}

std::uint32_t CPartition::GetBytesPerSector() const
{
    return m_storage ? m_storage->GetBytesPerSector() : 512;
}

std::uint64_t CPartition::GetSize() const
{
    std::uint64_t bps = GetBytesPerSector();
    return m_length <= UINT64_MAX / bps ? m_length * bps : UINT64_MAX;
}

bool CPartition::Flush(std::uint32_t &error)
{
    error = 0;
    return m_storage ? m_storage->Flush(error) : true;
}

bool CPartition::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    error = 0;
    if (!m_storage || first >= m_length)
        return false;
    std::uint32_t bps = GetBytesPerSector();
    std::uint64_t room = m_length - first;
    std::uint32_t n = room < count ? static_cast<std::uint32_t>(room) : count;
    bool ok = m_storage->ReadSectors(m_start + first, n, buffer, error);
    if (n < count) {
        std::memset(static_cast<std::uint8_t *>(buffer) + std::uint64_t(n) * bps, 0,
                    std::uint64_t(count - n) * bps);
        return false;
    }
    return ok;
}

bool CPartition::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                              std::uint32_t &error)
{
    error = 0;
    if (!m_storage || first >= m_length)
        return false;
    std::uint64_t room = m_length - first;
    std::uint32_t n = room < count ? static_cast<std::uint32_t>(room) : count;
    bool ok = m_storage->WriteSectors(m_start + first, n, buffer, error);
    return ok && n == count;
}

// Byte access on top of sector access: partial sectors go through the one-sector buffer under its
// mutex; whole sectors go straight between the caller's buffer and the device.
bool CPartition::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint32_t bps = GetBytesPerSector();
    auto *out = static_cast<std::uint8_t *>(buffer);
    while (length > 0) {
        std::uint64_t sector = offset / bps;
        std::uint32_t inSector = static_cast<std::uint32_t>(offset % bps);
        if (inSector == 0 && length >= bps) {
            std::uint64_t whole = std::min<std::uint64_t>(length / bps, 0x10000);
            if (!ReadSectors(sector, static_cast<std::uint32_t>(whole), out, error))
                return false;
            std::uint64_t bytes = whole * bps;
            out += bytes;
            offset += bytes;
            length -= bytes;
            continue;
        }
        std::uint64_t part = std::min<std::uint64_t>(bps - inSector, length);
        {
            std::lock_guard<std::mutex> lock(m_byteMutex);
            if (m_byteBuffer.size() != qsizetype(bps)) {
                m_byteBuffer.resize(bps);
                m_byteSector = NoSector;
            }
            if (m_byteSector != sector) {
                if (!ReadSectors(sector, 1, m_byteBuffer.data(), error)) {
                    m_byteSector = NoSector;
                    return false;
                }
                m_byteSector = sector;
            }
            std::memcpy(out, m_byteBuffer.constData() + inSector, part);
        }
        out += part;
        offset += part;
        length -= part;
    }
    return true;
}

bool CPartition::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                            std::uint32_t &error)
{
    error = 0;
    if (length == 0)
        return true;
    const std::uint32_t bps = GetBytesPerSector();
    const auto *in = static_cast<const std::uint8_t *>(buffer);
    while (length > 0) {
        std::uint64_t sector = offset / bps;
        std::uint32_t inSector = static_cast<std::uint32_t>(offset % bps);
        if (inSector == 0 && length >= bps) {
            std::uint64_t whole = std::min<std::uint64_t>(length / bps, 0x10000);
            {
                // The held sector may be among those written: forget it.
                std::lock_guard<std::mutex> lock(m_byteMutex);
                if (m_byteSector != NoSector && m_byteSector >= sector && m_byteSector - sector < whole)
                    m_byteSector = NoSector;
            }
            if (!WriteSectors(sector, static_cast<std::uint32_t>(whole), in, error))
                return false;
            std::uint64_t bytes = whole * bps;
            in += bytes;
            offset += bytes;
            length -= bytes;
            continue;
        }
        std::uint64_t part = std::min<std::uint64_t>(bps - inSector, length);
        {
            std::lock_guard<std::mutex> lock(m_byteMutex);
            if (m_byteBuffer.size() != qsizetype(bps)) {
                m_byteBuffer.resize(bps);
                m_byteSector = NoSector;
            }
            if (m_byteSector != sector) {
                if (!ReadSectors(sector, 1, m_byteBuffer.data(), error)) {
                    m_byteSector = NoSector;
                    return false;
                }
                m_byteSector = sector;
            }
            std::memcpy(m_byteBuffer.data() + inSector, in, part);
            if (!WriteSectors(sector, 1, m_byteBuffer.constData(), error)) {
                m_byteSector = NoSector;
                return false;
            }
        }
        in += part;
        offset += part;
        length -= part;
    }
    return true;
}
