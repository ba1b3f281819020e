// The hex editor's window onto one kernel object (a device, a partition, a volume, a file of a
// volume, or a plain file): byte ranges become one-sector kernel transfers through a bounded sector
// cache that keeps per-byte "modified" marks; edits stay in the cache until save() writes every
// modified sector whole to the medium. Reads and writes are capped at 1 MiB per call.
//
// The editor control, the view, the template pane, the search and the inspector use only this
// interface; they never call the kernel for bytes themselves. Make a storage with
// HexEditor::createStorage (StorageFactory.h).
#pragma once

#include <QBitArray>
#include <QByteArray>
#include <QHash>
#include <QList>
#include <QObject>
#include <QString>

#include <cstdint>
#include <memory>

#include "Kernel/Implementation/Common/cStorage.h"
#include "hexeditor/DiskArea.h"
#include "hexeditor/NavigationPoint.h"

namespace HexEditor {

class SectorCache;

// One sector as the cache holds it.
struct CachedSector
{
    std::uint64_t number = 0;
    bool readOk = true;
    QByteArray data;    // exactly one sector; zeros when the read failed
    QBitArray modified; // one bit per byte of data once a byte was marked; empty before
    bool isModified() const { return !modified.isEmpty() && modified.count(true) != 0; }
    bool isMarked(qsizetype i) const { return !modified.isEmpty() && modified.testBit(i); }
    // Sets or clears the marks of bytes [from, to).
    void mark(qsizetype from, qsizetype to, bool flag)
    {
        if (modified.isEmpty()) {
            if (!flag)
                return;
            modified = QBitArray(data.size());
        }
        modified.fill(flag, from, to);
    }
};

// What a range read gives: the bytes, one modified mark per byte, and for every sector the range
// touches (from firstSector on) whether the kernel could read it.
struct ReadResult
{
    QByteArray bytes;
    QBitArray modified;
    std::uint64_t firstSector = 0;
    QList<bool> sectorOk;

    // Whether the byte at `index` of bytes lies in a readable sector (given the sector size).
    bool byteReadOk(std::uint64_t offset, std::uint32_t sectorSize, std::uint64_t index) const;
};

// A sector whose write failed during save(): its edits stay marked as modified.
struct SaveFailure
{
    std::uint64_t sector = 0;
    std::uint32_t error = 0;
    QString message;
};

class Storage : public QObject
{
    Q_OBJECT

public:
    // Longest single read or write, in bytes.
    static constexpr std::uint64_t MaxTransfer = 1u << 20;
    // The error code of every write when the storage has no kernel object.
    static constexpr std::uint32_t NoObjectError = 666;
    // Unmodified, readable sectors beyond this many bytes are evicted, least recently used first.
    static constexpr std::uint64_t DefaultCacheBound = 64ull << 20;

    // `active` is the kernel object sectors are transferred through (not owned; may be null).
    explicit Storage(cStorage *active, QObject *parent = nullptr);
    ~Storage() override;

    // Geometry and file-system questions.
    virtual bool isHfsVolume() const;
    virtual StorageKind kind() const;
    virtual QString name() const;
    virtual std::uint32_t fileSystemKind() const; // 24: unknown
    virtual std::uint32_t clusterSize() const;
    virtual std::uint32_t sectorSize() const;
    virtual std::uint64_t sectorCount() const;
    virtual std::uint64_t size() const;
    virtual std::uint64_t mftRecordCount() const;
    virtual std::uint64_t mftRecordOffset(std::uint64_t index) const;
    virtual std::uint32_t mftRecordSize() const;
    virtual std::uint64_t catalogNodeCount() const;
    virtual std::uint64_t catalogNodeOffset(std::uint64_t index) const;
    virtual std::uint32_t inodeSize() const;
    // True for a storage of a file (the save and close questions differ).
    virtual bool isFileStorage() const { return false; }

    QString title() const { return m_title; }
    void setTitle(const QString &title) { m_title = title; }

    // The kernel object transfers go through (null without one).
    cStorage *kernelObject() const { return m_active; }

    // The sector `n` through the cache, read on first use; null without a kernel object or past
    // the last sector. The pointer is valid until the next call that may touch the cache.
    const CachedSector *sector(std::uint64_t n);

    // The bytes of `area` (cut to 1 MiB and to the storage's end). With `cache` false, sectors
    // not cached already are read into a temporary buffer and not kept.
    QByteArray read(const DiskArea &area, bool cache = true);
    // The same with the modified marks and the readable flags of the sectors.
    ReadResult readDetailed(const DiskArea &area, bool cache = true);
    // read() of the selection without caching.
    QByteArray readSelection();

    // Writes at most 1 MiB of `bytes` at `offset` (cut at the storage's end). cacheOnly: into the
    // cache, marking every byte modified. Otherwise each touched sector is written whole to the
    // medium at once (read-modify-write for a partial sector) and dropped from the cache. Returns
    // the number of bytes taken; on a failed medium write the failure is signalled and the count
    // stops before that sector; a failed flush of the medium is signalled and counts nothing.
    std::uint64_t write(std::uint64_t offset, const QByteArray &bytes, bool cacheOnly = true);

    // Sets or clears the modified marks of `area` (sectors are read into the cache as needed).
    void setModified(const DiskArea &area, bool flag);

    // Whether any cached sector carries a modified mark; whether any byte of `area` does.
    bool isModified() const;
    bool isModified(const DiskArea &area) const;
    // The modified bytes as ascending, non-overlapping ranges.
    QList<DiskArea> modifiedRanges() const;
    // The sectors that carry modified marks, ascending.
    QList<std::uint64_t> modifiedSectors() const;

    // Writes every sector with modified marks whole to the medium, in ascending order, then flushes
    // the medium. A sector written and flushed keeps its data and loses its marks; a sector whose
    // write fails, every sector when the medium cannot be opened for writing, and every written
    // sector when the flush fails keep them and are reported through writeFailed and the result.
    // Refused as a whole (every sector reported) when writeRefusal() gives a reason.
    QList<SaveFailure> save();
    // The data of the modified sectors that overlap `area`, by sector number (a snapshot for a
    // worker thread that reads the medium and lays the edits over it).
    QHash<std::uint64_t, QByteArray> modifiedSectorData(const DiskArea &area) const;
    // Drops the cached copies of the sectors of `area` that carry no edits (their bytes were
    // written to the medium behind the cache) and signals the change.
    void forget(const DiskArea &area);

    // Drops every edit: modified sectors leave the cache (they are read again on next use).
    void revert();
    // Deletes every cached sector and every edit.
    void clearCache();

    // Why writing to the medium is not possible now (empty when it is): no kernel object, or a
    // partition or volume that the system has mounted and the kernel could not lock.
    virtual QString writeRefusal() const;

    DiskArea selection() const { return m_selection; }
    void setSelection(const DiskArea &area);

    // The named structures of the object (a tree), built once on first use.
    const QList<NavigationPoint> &navigationPoints();

    // Cache bookkeeping (for the bound and for tests).
    std::uint64_t cacheBound() const;
    void setCacheBound(std::uint64_t bytes);
    std::uint64_t cachedSectorCount() const;
    std::uint64_t cachedBytes() const;

signals:
    void selectionChanged(const HexEditor::DiskArea &selection);
    void readFailed(const QString &message);
    void writeFailed(const QString &message);
    // Bytes of the storage changed (edit, undo, revert, save, direct write).
    void dataChanged(const HexEditor::DiskArea &area);

protected:
    // Builds the navigation points of the object; the base has none.
    virtual QList<NavigationPoint> buildNavigationPoints();
    // Replaces the kernel object (a file storage's mode change); empties the cache and the points.
    void setKernelObject(cStorage *active);
    void resetNavigationPoints();

private:
    // Reads sector n from the kernel into `out` (zeros and false on failure, with the message).
    bool readFromKernel(std::uint64_t n, QByteArray &out, std::uint32_t &error);
    // sector() for a number already checked against the sector count.
    const CachedSector *load(std::uint64_t n);
    QString readFailureText(std::uint64_t n, std::uint32_t error) const;
    QString writeFailureText(std::uint64_t n, std::uint32_t error) const;
    QString writeRefusedText(std::uint32_t error) const;
    QString flushFailureText(std::uint32_t error) const;

    DiskArea m_selection;
    std::unique_ptr<SectorCache> m_cache;
    QString m_title;
    cStorage *m_active = nullptr;
    QList<NavigationPoint> m_points;
    bool m_pointsBuilt = false;
};

} // namespace HexEditor
