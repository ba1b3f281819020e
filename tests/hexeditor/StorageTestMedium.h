// A kernel storage in memory for the storage tests: sectors that fail to read or write on
// request, a flush that fails on request, counters of the kernel requests, and an optional delay
// per write.
#pragma once

#include <QByteArray>
#include <QThread>

#include <atomic>
#include <cstring>
#include <mutex>
#include <set>

#include "Kernel/Implementation/Common/cStorage.h"

class MemoryMedium : public cStorage
{
public:
    MemoryMedium(QByteArray data, std::uint32_t sectorSize = 512) : m_data(std::move(data)), m_ss(sectorSize)
    {
    }

    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("Memory"); }
    std::uint64_t GetSize() const override { return std::uint64_t(m_data.size()); }
    std::uint32_t GetBytesPerSector() const override { return m_ss; }
    std::uint64_t GetTotalSectors() const override { return (GetSize() + m_ss - 1) / m_ss; }

    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        ++reads;
        for (std::uint32_t i = 0; i < count; ++i)
            if (badReads.count(first + i)) {
                error = 23;
                return false;
            }
        return copy(true, first, count, buffer, error);
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override
    {
        if (writeDelayMs)
            QThread::msleep(writeDelayMs);
        std::lock_guard<std::mutex> lock(m_mutex);
        ++writes;
        sectorsWritten += count;
        for (std::uint32_t i = 0; i < count; ++i)
            if (badWrites.count(first + i)) {
                error = writeError;
                return false;
            }
        return copy(false, first, count, const_cast<void *>(buffer), error);
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        if (offset > GetSize() || length > GetSize() - offset) {
            error = 38;
            return false;
        }
        std::memcpy(buffer, m_data.constData() + offset, std::size_t(length));
        return true;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 1;
        return false;
    }

    bool Flush(std::uint32_t &error) override
    {
        ++flushes;
        error = flushError;
        return !error;
    }

    QByteArray data() const
    {
        std::lock_guard<std::mutex> lock(m_mutex);
        return m_data;
    }

    std::set<std::uint64_t> badReads, badWrites;
    std::uint32_t writeError = 29; // the error of a bad write
    std::uint32_t flushError = 0;  // when not 0, every flush fails with it
    std::atomic<int> flushes{0};
    std::atomic<int> reads{0}, writes{0};
    std::atomic<std::uint64_t> sectorsWritten{0};
    unsigned writeDelayMs = 0;

private:
    bool copy(bool read, std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
    {
        const std::uint64_t offset = first * m_ss, length = std::uint64_t(count) * m_ss;
        auto *b = static_cast<char *>(buffer);
        std::uint64_t inside = offset >= GetSize() ? 0 : std::min(length, GetSize() - offset);
        if (read) {
            std::memcpy(b, m_data.constData() + offset, std::size_t(inside));
            std::memset(b + inside, 0, std::size_t(length - inside));
        } else {
            std::memcpy(m_data.data() + offset, b, std::size_t(inside));
        }
        if (first + count > GetTotalSectors()) {
            error = 38;
            return false;
        }
        return true;
    }

    mutable std::mutex m_mutex;
    QByteArray m_data;
    std::uint32_t m_ss;
};

inline QByteArray patternBytes(qsizetype size, unsigned seed = 1)
{
    QByteArray b(size, Qt::Uninitialized);
    std::uint32_t x = seed * 2654435761u + 1;
    for (qsizetype i = 0; i < size; ++i) {
        x = x * 1664525u + 1013904223u;
        b[i] = char(x >> 24);
    }
    return b;
}
