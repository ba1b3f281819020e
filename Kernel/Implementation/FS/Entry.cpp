#include "Kernel/Implementation/FS/Entry.h"

#include "Kernel/Implementation/FS/Volume.h"

#include <algorithm>
#include <cstring>

CEntry::CEntry(CVolume *volume, CEntry *parent, const QString &name, std::uint64_t position,
               std::uint32_t attributes, std::uint64_t index)
    : m_volume(volume), m_parent(parent), m_index(index), m_position(position), m_attributes(attributes),
      m_handle(volume, 0)
{
    SetName(name);
}

CEntry::~CEntry() = default;

void CEntry::SetName(const QString &name)
{
    // At most 65,535 characters are kept; the header keeps the low 15 bits of the count.
    const qsizetype length = std::min<qsizetype>(name.size(), 65535);
    bool wide = false;
    for (qsizetype i = 0; i < length; ++i) {
        if (name[i].unicode() >= 256) {
            wide = true;
            break;
        }
    }
    const std::uint16_t header = static_cast<std::uint16_t>((wide ? 0x8000 : 0) | (length & 0x7FFF));
    m_name.clear();
    m_name.reserve(2 + length * (wide ? 2 : 1));
    m_name.append(static_cast<char>(header & 0xFF));
    m_name.append(static_cast<char>(header >> 8));
    for (qsizetype i = 0; i < length; ++i) {
        const char16_t u = name[i].unicode();
        m_name.append(static_cast<char>(u & 0xFF));
        if (wide)
            m_name.append(static_cast<char>(u >> 8));
    }
}

QString CEntry::GetName() const
{
    if (m_name.size() < 2)
        return QString();
    const auto *p = reinterpret_cast<const std::uint8_t *>(m_name.constData());
    const bool wide = (p[1] & 0x80) != 0;
    // The stored bytes give the real length; the header's count may have lost its top bit.
    const qsizetype length = (m_name.size() - 2) / (wide ? 2 : 1);
    QString out;
    out.reserve(length);
    for (qsizetype i = 0; i < length; ++i) {
        if (wide)
            out.append(QChar(char16_t(p[2 + 2 * i] | (p[3 + 2 * i] << 8))));
        else
            out.append(QChar(char16_t(p[2 + i])));
    }
    return out;
}

int CEntry::Compare(const CEntry &other) const
{
    const bool a = IsFolder(), b = other.IsFolder();
    if (a != b)
        return a ? -1 : 1;
    const QString x = GetName(), y = other.GetName();
    const qsizetype n = std::min(x.size(), y.size());
    for (qsizetype i = 0; i < n; ++i) {
        if (x[i] != y[i])
            return x[i].unicode() < y[i].unicode() ? -1 : 1;
    }
    if (x.size() != y.size())
        return x.size() < y.size() ? -1 : 1;
    if (m_position != other.m_position)
        return m_position < other.m_position ? -1 : 1;
    return 0;
}

void CEntry::EnsureChildren()
{
    if (m_loaded)
        return;
    m_loaded = true;
    if (IsFolder())
        LoadChildren();
}

void CEntry::EnsureRuns()
{
    if (m_runsLoaded)
        return;
    m_runsLoaded = true;
    LoadRuns();
}

std::uint32_t CEntry::GetChildCount()
{
    EnsureChildren();
    return static_cast<std::uint32_t>(std::min<std::size_t>(m_children.size(), 0xFFFFFFFFu));
}

cEntry *CEntry::GetChild(std::uint32_t index)
{
    EnsureChildren();
    return index < m_children.size() ? m_children[index].get() : nullptr;
}

CEntry *CEntry::AddChild(std::unique_ptr<CEntry> child)
{
    if (!child)
        return nullptr;
    child->m_parent = this;
    m_children.push_back(std::move(child));
    return m_children.back().get();
}

std::uint64_t CEntry::GetSize() const
{
    return m_size != NoIndex ? m_size : m_handle.GetTotalBytes();
}

std::uint32_t CEntry::GetBytesPerSector() const
{
    return m_volume ? m_volume->GetBytesPerSector() : 512;
}

std::uint64_t CEntry::GetTotalSectors() const
{
    const std::uint32_t bps = GetBytesPerSector();
    return (GetSize() + bps - 1) / bps;
}

std::uint64_t CEntry::SectorsEnd() const
{
    const std::uint64_t size = GetSize();
    const std::uint64_t bps = GetBytesPerSector();
    const std::uint64_t tail = size % bps;
    if (!tail)
        return size;
    return size > ~0ull - (bps - tail) ? ~0ull : size + (bps - tail);
}

bool CEntry::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    error = 0;
    EnsureRuns();
    const std::uint64_t size = GetSize();
    const std::uint64_t have = offset >= size ? 0 : std::min(length, size - offset);
    // Bytes the runs do not cover (an entry larger than its allocation) read as zeros.
    const std::uint64_t mapped =
        offset >= m_handle.GetTotalBytes() ? 0 : std::min(have, m_handle.GetTotalBytes() - offset);
    if (mapped > 0 && !m_handle.Read(offset, mapped, buffer, error))
        return false;
    // The last sector goes on past the size with zeros (what lies there on the medium is not the
    // entry's); past the last sector nothing is there and the read fails after the zeros.
    if (length > mapped)
        std::memset(static_cast<std::uint8_t *>(buffer) + mapped, 0, length - mapped);
    const std::uint64_t end = SectorsEnd();
    return offset <= end && length <= end - offset;
}

bool CEntry::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error)
{
    error = 0;
    EnsureRuns();
    const std::uint64_t end = SectorsEnd();
    if (offset > end || length > end - offset)
        return false;
    // Only the entry's own bytes reach the medium: the zeros after its size in the last sector
    // would overwrite whatever lies there.
    const std::uint64_t size = GetSize();
    const std::uint64_t inside = offset >= size ? 0 : std::min(length, size - offset);
    return inside == 0 || m_handle.Write(offset, inside, buffer, error);
}

bool CEntry::Flush(std::uint32_t &error)
{
    error = 0;
    return !m_volume || m_volume->Flush(error);
}

bool CEntry::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    const std::uint64_t bps = GetBytesPerSector();
    if (first > (~0ull) / bps)
        return false;
    return ReadBytes(first * bps, std::uint64_t(count) * bps, buffer, error);
}

bool CEntry::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer, std::uint32_t &error)
{
    const std::uint64_t bps = GetBytesPerSector();
    if (first > (~0ull) / bps)
        return false;
    return WriteBytes(first * bps, std::uint64_t(count) * bps, buffer, error);
}
