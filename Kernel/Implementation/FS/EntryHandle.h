// The run list of one entry: which volume positions hold the entry's bytes. Runs are kept in a
// packed byte string, each a header byte (low nibble: bytes of the length, high nibble: bytes
// of the start, 0 for a sparse run) followed by the little-endian length and the absolute start,
// all counted in units of 1 << unit shift bytes; a zero byte ends the list.
#pragma once

#include <QByteArray>

#include <cstdint>

class cStorage;

class CEntryHandle
{
public:
    static constexpr std::uint64_t Sparse = 0xFFFFFFFFFFFFFFFFull;
    static constexpr std::uint64_t None = 0xFFFFFFFFFFFFFFFFull;

    // `owner` is the storage the runs refer to (the volume), read and written in bytes.
    explicit CEntryHandle(cStorage *owner = nullptr, std::uint8_t unitShift = 0);
    virtual ~CEntryHandle();

    CEntryHandle(const CEntryHandle &) = delete;
    CEntryHandle &operator=(const CEntryHandle &) = delete;

    cStorage *GetOwner() const { return m_owner; }
    void SetOwner(cStorage *owner) { m_owner = owner; }

    // Appends a run of `length` units at unit `start` (Sparse for a hole). A run that continues
    // the last one (contiguous, or sparse after sparse) is merged into it. False when length is 0
    // or the total would no longer fit in 64 bits.
    bool AddRun(std::uint64_t start, std::uint64_t length);
    // Copies the other handle's runs after this one's (same unit shift only).
    bool AppendRuns(const CEntryHandle &other);

    // The volume byte position of `offset`, or None in a sparse run or past the last run.
    std::uint64_t MapOffset(std::uint64_t offset) const;

    std::uint64_t GetTotalBytes() const { return m_totalBytes; }
    std::uint8_t GetUnitShift() const { return m_unitShift; }
    // Changing the unit drops the runs (they would mean something else).
    void SetUnitShift(std::uint8_t shift);
    std::uint8_t GetCacheShift() const { return m_cacheShift; }
    void SetCacheShift(std::uint8_t shift);
    void Clear();

    // The packed run string (without the terminating zero), and the runs decoded.
    const QByteArray &GetRuns() const { return m_runs; }
    int GetRunCount() const;
    // Run `index`: start (Sparse for a hole) and length in units.
    bool GetRun(int index, std::uint64_t &start, std::uint64_t &length) const;
    // Replaces the runs by a packed string from elsewhere (a stored handle); false, and no runs,
    // when the string does not decode or its lengths overflow.
    bool SetRuns(const QByteArray &packed);

    // Byte transfers through the runs; a sparse run reads as zeros and refuses writes.
    bool Read(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error);
    bool Write(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error);

protected:
    bool Transfer(bool read, std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error);

private:
    static int Bytes(std::uint64_t v);
    void DropCache();

    cStorage *m_owner = nullptr;
    QByteArray m_runs;
    std::uint64_t m_totalBytes = 0;
    std::uint8_t m_unitShift = 0;
    std::uint8_t m_cacheShift = 20;
    QByteArray m_cache;
    std::uint64_t m_cacheIndex = None;
    // Where the last run starts in m_runs, for merging.
    int m_lastRun = -1;
};
