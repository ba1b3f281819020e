#include "hexeditor/StorageFile.h"

#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"

namespace HexEditor {

namespace {

constexpr std::uint32_t AttrNoRuns = 0x10000000; // the data lives in the record itself
constexpr std::uint32_t AttrRunsInSectors = 0x20000000;

} // namespace

StorageFile::StorageFile(CEntry *entry, QObject *parent)
    : StorageVolumeBase(nullptr, entry ? entry->GetVolume() : nullptr, parent), m_entry(entry)
{
    if (!m_entry)
        return;
    CVolume *volume = this->volume();
    m_partition = volume ? dynamic_cast<cPartition *>(volume->GetMedium()) : nullptr;
    m_device = m_partition ? m_partition->GetDevice() : nullptr;
    if (m_partition)
        m_partitionFirstSector = m_partition->GetStart();
    setTitle(m_entry->GetDisplayName());

    const std::uint32_t kind = volume ? volume->GetKind() : 24;
    m_extentsInSectors = (m_entry->GetAttributes() & AttrRunsInSectors) || (kind >= 13 && kind <= 17);
    cStorage *medium = volume ? volume->GetMedium() : nullptr;
    const std::uint64_t ss = medium ? medium->GetBytesPerSector() : 0;
    if (!(m_entry->GetAttributes() & AttrNoRuns) && ss) {
        (void)m_entry->GetSize(); // the file system fills the runs on first use
        const CEntryHandle &handle = m_entry->GetHandle();
        const int shift = handle.GetUnitShift();
        for (int i = 0; i < handle.GetRunCount(); ++i) {
            std::uint64_t start = 0, length = 0;
            if (!handle.GetRun(i, start, length) || start == CEntryHandle::Sparse || !length)
                continue;
            if (shift >= 64 || start > (UINT64_MAX >> shift) || length > (UINT64_MAX >> shift))
                continue;
            const std::uint64_t firstByte = start << shift, bytes = length << shift;
            if (bytes > UINT64_MAX - firstByte)
                continue;
            const std::uint64_t first = firstByte / ss;
            const std::uint64_t last = (firstByte + bytes - 1) / ss;
            m_extents.insert(first, last);
            if (m_startInPartition == ~0ull)
                m_startInPartition = first * ss;
        }
    }
    if (m_device)
        setKernelObject(m_device);
    else
        setMode(FileMode);
}

bool StorageFile::setMode(int mode)
{
    cStorage *object = nullptr;
    switch (mode) {
    case DiskMode:
        object = m_device;
        break;
    case PartitionMode:
        object = m_partition;
        break;
    case FileMode:
        object = m_entry;
        break;
    default:
        return false;
    }
    if (!object)
        return false;
    m_mode = mode;
    setKernelObject(object);
    return true;
}

std::uint64_t StorageFile::fileStartOffset() const
{
    const std::uint64_t inPartition = m_startInPartition == ~0ull ? 0 : m_startInPartition;
    switch (m_mode) {
    case DiskMode:
        return m_partitionFirstSector * (m_device ? m_device->GetBytesPerSector() : 0) + inPartition;
    case PartitionMode:
        return inPartition;
    default:
        return 0;
    }
}

bool StorageFile::isFileSector(std::uint64_t s) const
{
    if (m_mode == FileMode)
        return s < sectorCount();
    const std::uint64_t shift = m_mode == DiskMode ? m_partitionFirstSector : 0;
    if (s < shift)
        return false;
    const std::uint64_t p = s - shift;
    auto it = m_extents.upperBound(p);
    if (it == m_extents.begin())
        return false;
    --it;
    return p >= it.key() && p <= it.value();
}

bool StorageFile::volumeBase(std::uint64_t &base) const
{
    base = m_mode == DiskMode && m_device ? m_partitionFirstSector * m_device->GetBytesPerSector() : 0;
    return m_mode != FileMode;
}

QList<NavigationPoint> StorageFile::buildNavigationPoints()
{
    std::uint64_t base = 0;
    if (!m_entry || !volume() || !volumeBase(base))
        return {};
    const std::uint32_t kind = volume()->GetKind();
    const std::uint64_t position = m_entry->GetPosition();
    if (kind == 10) {
        const std::uint64_t at = mftRecordOffset(position);
        if (at)
            return {NavigationPoint::jump(tr("File's MFT record"), at, Templates::NtfsMftFileRecord)};
        return {};
    }
    // Other file systems give the position of the entry's record as a volume sector or byte.
    const std::uint64_t vss = volume()->GetBytesPerSector();
    const std::uint64_t volumeByte = (m_entry->GetAttributes() & AttrRunsInSectors)
                                         ? (position <= UINT64_MAX / vss ? position * vss : UINT64_MAX)
                                         : position;
    if (volumeByte == UINT64_MAX || volumeByte > UINT64_MAX - base)
        return {};
    const std::uint64_t at = base + volumeByte;
    switch (kind) {
    case 7:
    case 8:
        return {NavigationPoint::jump(tr("File's directory entry"), at, Templates::FatDirectoryEntry)};
    case 9:
        return {NavigationPoint::jump(tr("File's directory entry"), at, Templates::ExFatDirectoryEntry)};
    case 14:
    case 15:
    case 16:
        return {NavigationPoint::jump(tr("File's inode"), at, Templates::ExtInode)};
    case 13:
        return {NavigationPoint::jump(tr("File's catalog record"), at, Templates::HfsPlusFileRecord)};
    default:
        return {};
    }
}

} // namespace HexEditor
