#include "hexeditor/Storage.h"

#include <algorithm>
#include <cstring>

#include "Kernel/Implementation/Common/SystemError.h"
#include "hexeditor/SectorCache.h"
#include "hexeditor/StorageWriteGuard.h"

namespace HexEditor {

namespace {

const int g_diskAreaType = qRegisterMetaType<HexEditor::DiskArea>("HexEditor::DiskArea");

// Merges touching ranges of an ascending list.
void appendRange(QList<DiskArea> &ranges, std::uint64_t offset, std::uint64_t length)
{
    if (!ranges.isEmpty() && ranges.last().end() == offset)
        ranges.last().length += length;
    else
        ranges.append(DiskArea{offset, length});
}

} // namespace

bool ReadResult::byteReadOk(std::uint64_t offset, std::uint32_t sectorSize, std::uint64_t index) const
{
    if (!sectorSize)
        return false;
    const std::uint64_t n = (offset + index) / sectorSize;
    if (n < firstSector || n - firstSector >= std::uint64_t(sectorOk.size()))
        return false;
    return sectorOk[qsizetype(n - firstSector)];
}

Storage::Storage(cStorage *active, QObject *parent)
    : QObject(parent), m_cache(std::make_unique<SectorCache>()), m_active(active)
{
    (void)g_diskAreaType;
    if (m_active)
        m_title = m_active->GetDisplayName();
}

Storage::~Storage() = default;

bool Storage::isHfsVolume() const
{
    return false;
}

StorageKind Storage::kind() const
{
    return m_active ? m_active->GetStorageKind() : StorageKind::Device;
}

QString Storage::name() const
{
    return m_active ? m_active->GetDisplayName() : QString();
}

std::uint32_t Storage::fileSystemKind() const
{
    return 24;
}

std::uint32_t Storage::clusterSize() const
{
    return 0;
}

std::uint32_t Storage::sectorSize() const
{
    return m_active ? m_active->GetBytesPerSector() : 0;
}

std::uint64_t Storage::sectorCount() const
{
    return m_active ? m_active->GetTotalSectors() : 0;
}

std::uint64_t Storage::size() const
{
    return m_active ? m_active->GetSize() : 0;
}

std::uint64_t Storage::mftRecordCount() const
{
    return 0;
}

std::uint64_t Storage::mftRecordOffset(std::uint64_t) const
{
    return 0;
}

std::uint32_t Storage::mftRecordSize() const
{
    return 1024;
}

std::uint64_t Storage::catalogNodeCount() const
{
    return 0;
}

std::uint64_t Storage::catalogNodeOffset(std::uint64_t) const
{
    return 0;
}

std::uint32_t Storage::inodeSize() const
{
    return 128;
}

QString Storage::readFailureText(std::uint64_t n, std::uint32_t error) const
{
    return tr("Failed to read sector %1 from %2. Error code %3.").arg(n).arg(name()).arg(error);
}

QString Storage::writeFailureText(std::uint64_t n, std::uint32_t error) const
{
    return tr("Failed to write sector %1 to %2. Error code %3.").arg(n).arg(name()).arg(error);
}

QString Storage::writeRefusedText(std::uint32_t error) const
{
    return tr("%1 cannot be opened for writing (Error [%2]: %3). Nothing was written; the changes are kept.")
        .arg(name())
        .arg(error)
        .arg(systemErrorText(error));
}

QString Storage::flushFailureText(std::uint32_t error) const
{
    return tr("The changes did not reach %1 (Error [%2]: %3). They are kept as not saved.")
        .arg(name())
        .arg(error)
        .arg(systemErrorText(error));
}

bool Storage::readFromKernel(std::uint64_t n, QByteArray &out, std::uint32_t &error)
{
    out = m_cache->buffer(qsizetype(sectorSize()));
    error = 0;
    if (m_active->ReadSectors(n, 1, out.data(), error))
        return true;
    out.fill('\0');
    if (!error)
        error = 1;
    return false;
}

const CachedSector *Storage::sector(std::uint64_t n)
{
    if (!m_active || !sectorSize() || n >= sectorCount())
        return nullptr;
    return load(n);
}

const CachedSector *Storage::load(std::uint64_t n)
{
    if (CachedSector *s = m_cache->find(n))
        return s;
    CachedSector fresh;
    fresh.number = n;
    std::uint32_t error = 0;
    fresh.readOk = readFromKernel(n, fresh.data, error);
    CachedSector *s = m_cache->insert(std::move(fresh));
    if (!s->readOk)
        emit readFailed(readFailureText(n, error));
    return s;
}

ReadResult Storage::readDetailed(const DiskArea &area, bool cache)
{
    ReadResult result;
    const std::uint32_t ss = sectorSize();
    const std::uint64_t total = size();
    if (!m_active || !ss || area.offset >= total)
        return result;
    std::uint64_t left = std::min({area.length, MaxTransfer, total - area.offset});
    std::uint64_t offset = area.offset;
    const std::uint64_t sectors = sectorCount();
    result.firstSector = offset / ss;
    result.bytes.reserve(qsizetype(left));
    result.modified.resize(qsizetype(left));
    qsizetype at = 0;
    while (left) {
        const std::uint64_t n = offset / ss;
        const std::uint32_t start = std::uint32_t(offset % ss);
        const std::uint32_t count = std::uint32_t(std::min<std::uint64_t>(ss - start, left));
        const CachedSector *s = nullptr;
        CachedSector temp;
        if (n >= sectors) {
            s = nullptr;
        } else if (cache) {
            s = load(n);
        } else {
            s = m_cache->peek(n);
            if (!s) {
                std::uint32_t error = 0;
                temp.number = n;
                temp.readOk = readFromKernel(n, temp.data, error);
                s = &temp;
            }
        }
        if (!s) { // past the last whole sector the kernel knows of
            result.bytes.append(QByteArray(qsizetype(count), '\0'));
            result.sectorOk.append(false);
        } else {
            result.bytes.append(s->data.constData() + start, qsizetype(count));
            if (!s->modified.isEmpty()) {
                for (std::uint32_t i = 0; i < count; ++i)
                    if (s->modified.testBit(qsizetype(start + i)))
                        result.modified.setBit(at + qsizetype(i));
            }
            result.sectorOk.append(s->readOk);
        }
        at += qsizetype(count);
        offset += count;
        left -= count;
    }
    return result;
}

QByteArray Storage::read(const DiskArea &area, bool cache)
{
    return readDetailed(area, cache).bytes;
}

QByteArray Storage::readSelection()
{
    return read(m_selection, false);
}

std::uint64_t Storage::write(std::uint64_t offset, const QByteArray &bytes, bool cacheOnly)
{
    if (!m_active || !sectorSize()) {
        emit writeFailed(writeFailureText(sectorSize() ? offset / sectorSize() : 0, NoObjectError));
        return 0;
    }
    const std::uint32_t ss = sectorSize();
    const std::uint64_t total = size();
    if (offset >= total || bytes.isEmpty())
        return 0;
    const std::uint64_t length = std::min({std::uint64_t(bytes.size()), MaxTransfer, total - offset});

    std::unique_ptr<WriteGuard> guard;
    if (!cacheOnly) {
        guard =
            std::make_unique<WriteGuard>(m_active, offset / ss, (offset + length - 1) / ss - offset / ss + 1);
        if (!guard->refusal().isEmpty()) {
            emit writeFailed(guard->refusal());
            return 0;
        }
    }

    std::uint64_t done = 0;
    while (done < length) {
        const std::uint64_t pos = offset + done;
        const std::uint64_t n = pos / ss;
        const std::uint32_t start = std::uint32_t(pos % ss);
        const std::uint32_t count = std::uint32_t(std::min<std::uint64_t>(ss - start, length - done));
        if (cacheOnly) {
            if (!sector(n))
                break;
            CachedSector *s = m_cache->find(n);
            std::memcpy(s->data.data() + start, bytes.constData() + done, count);
            s->mark(qsizetype(start), qsizetype(start + count), true);
            m_cache->refresh(n);
        } else {
            QByteArray data;
            if (const CachedSector *cached = m_cache->peek(n)) {
                data = cached->data;
            } else if (count != ss) {
                std::uint32_t error = 0;
                if (!readFromKernel(n, data, error)) {
                    // A partial sector that cannot be read would be written back with zeros.
                    emit writeFailed(readFailureText(n, error));
                    break;
                }
            } else {
                data = QByteArray(qsizetype(ss), '\0');
            }
            std::memcpy(data.data() + start, bytes.constData() + done, count);
            std::uint32_t error = 0;
            if (!m_active->WriteSectors(n, 1, data.constData(), error)) {
                emit writeFailed(writeFailureText(n, error));
                break;
            }
            m_cache->remove(n);
        }
        done += count;
    }
    // Bytes written to the medium count once they are on it.
    std::uint32_t flushError = 0;
    if (!cacheOnly && done && !m_active->Flush(flushError)) {
        emit writeFailed(flushFailureText(flushError));
        emit dataChanged(DiskArea{offset, done});
        return 0;
    }
    if (done)
        emit dataChanged(DiskArea{offset, done});
    return done;
}

void Storage::setModified(const DiskArea &area, bool flag)
{
    const std::uint32_t ss = sectorSize();
    const std::uint64_t total = size();
    if (!m_active || !ss || area.offset >= total)
        return;
    std::uint64_t left = std::min(area.length, total - area.offset);
    std::uint64_t offset = area.offset;
    while (left) {
        const std::uint64_t n = offset / ss;
        const std::uint32_t start = std::uint32_t(offset % ss);
        const std::uint32_t count = std::uint32_t(std::min<std::uint64_t>(ss - start, left));
        // Clearing marks of a sector not cached changes nothing: don't read it for that.
        if (flag ? sector(n) != nullptr : m_cache->peek(n) != nullptr) {
            CachedSector *s = m_cache->find(n);
            s->mark(qsizetype(start), qsizetype(start + count), flag);
            m_cache->refresh(n);
        }
        offset += count;
        left -= count;
    }
}

bool Storage::isModified() const
{
    return !m_cache->modifiedSectors().empty();
}

bool Storage::isModified(const DiskArea &area) const
{
    const std::uint32_t ss = sectorSize();
    if (!ss || !area.length)
        return false;
    for (const std::uint64_t n : m_cache->modifiedSectors()) {
        const DiskArea sec{n * ss, ss};
        if (!sec.intersects(area))
            continue;
        const CachedSector *s = m_cache->peek(n);
        const std::uint64_t from = std::max(area.offset, sec.offset) - sec.offset;
        const std::uint64_t to = std::min(area.end(), sec.end()) - sec.offset;
        for (std::uint64_t i = from; i < to; ++i)
            if (s->isMarked(qsizetype(i)))
                return true;
    }
    return false;
}

QList<DiskArea> Storage::modifiedRanges() const
{
    QList<DiskArea> ranges;
    const std::uint32_t ss = sectorSize();
    for (const std::uint64_t n : m_cache->modifiedSectors()) {
        const CachedSector *s = m_cache->peek(n);
        for (qsizetype i = 0; i < s->modified.size();) {
            if (!s->modified.testBit(i)) {
                ++i;
                continue;
            }
            qsizetype j = i;
            while (j < s->modified.size() && s->modified.testBit(j))
                ++j;
            appendRange(ranges, n * ss + std::uint64_t(i), std::uint64_t(j - i));
            i = j;
        }
    }
    return ranges;
}

QList<std::uint64_t> Storage::modifiedSectors() const
{
    const std::vector<std::uint64_t> v = m_cache->modifiedSectors();
    return QList<std::uint64_t>(v.begin(), v.end());
}

QList<SaveFailure> Storage::save()
{
    QList<SaveFailure> failures;
    const std::vector<std::uint64_t> sectors = m_cache->modifiedSectors();
    if (sectors.empty())
        return failures;
    const std::uint32_t ss = sectorSize();
    if (!m_active) {
        for (const std::uint64_t n : sectors) {
            failures.append({n, NoObjectError, writeFailureText(n, NoObjectError)});
            emit writeFailed(failures.last().message);
        }
        return failures;
    }
    WriteGuard guard(m_active, sectors.front(), sectors.back() - sectors.front() + 1);
    if (!guard.refusal().isEmpty()) {
        for (const std::uint64_t n : sectors)
            failures.append({n, 0, guard.refusal()});
        emit writeFailed(guard.refusal());
        return failures;
    }
    QList<std::uint64_t> written;
    for (std::size_t i = 0; i < sectors.size(); ++i) {
        const std::uint64_t n = sectors[i];
        CachedSector *s = m_cache->find(n);
        std::uint32_t error = 0;
        if (m_active->WriteSectors(n, 1, s->data.constData(), error)) {
            written.append(n);
        } else if (error == SystemError::AccessDenied || error == SystemError::WriteProtect) {
            // The medium cannot be opened for writing: no other sector would fare better.
            const QString message = writeRefusedText(error);
            for (std::size_t j = i; j < sectors.size(); ++j)
                failures.append({sectors[j], error, message});
            emit writeFailed(message);
            break;
        } else {
            failures.append({n, error, writeFailureText(n, error)});
            emit writeFailed(failures.last().message);
        }
    }
    // Sectors are saved when they are on the medium: a failed flush keeps their edits.
    std::uint32_t flushError = 0;
    if (!written.isEmpty() && !m_active->Flush(flushError)) {
        const QString message = flushFailureText(flushError);
        for (const std::uint64_t n : written)
            failures.append({n, flushError, message});
        emit writeFailed(message);
        return failures;
    }
    QList<DiskArea> areas;
    for (const std::uint64_t n : written) {
        CachedSector *s = m_cache->find(n);
        s->modified.clear();
        // A sector that could not be read was zeros plus edits; it is readable data now.
        s->readOk = true;
        m_cache->refresh(n);
        appendRange(areas, n * ss, ss);
    }
    for (const DiskArea &a : areas)
        emit dataChanged(a);
    return failures;
}

QHash<std::uint64_t, QByteArray> Storage::modifiedSectorData(const DiskArea &area) const
{
    QHash<std::uint64_t, QByteArray> result;
    const std::uint32_t ss = sectorSize();
    if (!ss)
        return result;
    for (const std::uint64_t n : m_cache->modifiedSectors())
        if (DiskArea{n * ss, ss}.intersects(area))
            result.insert(n, m_cache->peek(n)->data);
    return result;
}

void Storage::forget(const DiskArea &area)
{
    const std::uint32_t ss = sectorSize();
    if (!ss || !area.length)
        return;
    const std::uint64_t first = area.offset / ss, last = (area.end() - 1) / ss;
    if (last - first < m_cache->count()) {
        for (std::uint64_t n = first; n <= last; ++n)
            if (const CachedSector *s = m_cache->peek(n); s && !s->isModified())
                m_cache->remove(n);
    } else {
        std::vector<std::uint64_t> drop;
        m_cache->forEach([&](const CachedSector &s) {
            if (s.number >= first && s.number <= last && !s.isModified())
                drop.push_back(s.number);
        });
        for (const std::uint64_t n : drop)
            m_cache->remove(n);
    }
    emit dataChanged(area);
}

void Storage::revert()
{
    const std::uint32_t ss = sectorSize();
    QList<DiskArea> dropped;
    for (const std::uint64_t n : m_cache->modifiedSectors()) {
        m_cache->remove(n);
        appendRange(dropped, n * ss, ss);
    }
    for (const DiskArea &a : dropped)
        emit dataChanged(a);
}

void Storage::clearCache()
{
    m_cache->clear();
}

void Storage::setSelection(const DiskArea &area)
{
    if (area == m_selection)
        return;
    m_selection = area;
    emit selectionChanged(area);
}

const QList<NavigationPoint> &Storage::navigationPoints()
{
    if (!m_pointsBuilt) {
        m_points = buildNavigationPoints();
        m_pointsBuilt = true;
    }
    return m_points;
}

QList<NavigationPoint> Storage::buildNavigationPoints()
{
    return {};
}

void Storage::setKernelObject(cStorage *active)
{
    m_cache->clear();
    m_active = active;
    resetNavigationPoints();
}

void Storage::resetNavigationPoints()
{
    m_points.clear();
    m_pointsBuilt = false;
}

QString Storage::writeRefusal() const
{
    if (!m_active)
        return tr("There is no storage to write to.");
    return QString();
}

std::uint64_t Storage::cacheBound() const
{
    return m_cache->bound();
}

void Storage::setCacheBound(std::uint64_t bytes)
{
    m_cache->setBound(bytes);
}

std::uint64_t Storage::cachedSectorCount() const
{
    return m_cache->count();
}

std::uint64_t Storage::cachedBytes() const
{
    return m_cache->bytes();
}

} // namespace HexEditor
