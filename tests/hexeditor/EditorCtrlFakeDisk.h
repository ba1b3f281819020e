// An in-memory disk for the editor control's tests: bytes kept only where written (so a 16 TB disk
// costs nothing), sectors that fail to read or write and a flush that fails on request, and a count
// of kernel requests.
#pragma once

#include <QHash>
#include <QSet>

#include <cstring>

#include "Kernel/Implementation/Common/cStorage.h"

class EditorCtrlFakeDisk : public cStorage
{
public:
    EditorCtrlFakeDisk(std::uint64_t size, std::uint32_t sectorSize = 512)
        : m_size(size), m_sectorSize(sectorSize)
    {
    }

    // Fills the first bytes with a pattern (byte i = i & 0xFF) for easy checks.
    void fillPattern(std::uint64_t bytes)
    {
        for (std::uint64_t s = 0; s * m_sectorSize < bytes; ++s) {
            QByteArray data(int(m_sectorSize), '\0');
            for (std::uint32_t i = 0; i < m_sectorSize; ++i)
                data[i] = char((s * m_sectorSize + i) & 0xFF);
            m_sectors.insert(s, data);
        }
    }
    void setBytes(std::uint64_t offset, const QByteArray &bytes)
    {
        for (int i = 0; i < bytes.size(); ++i) {
            const std::uint64_t o = offset + std::uint64_t(i);
            QByteArray &s = sectorRef(o / m_sectorSize);
            s[int(o % m_sectorSize)] = bytes[i];
        }
    }
    QByteArray bytes(std::uint64_t offset, std::uint64_t length)
    {
        QByteArray out;
        for (std::uint64_t o = offset; o < offset + length; ++o)
            out.append(sectorRef(o / m_sectorSize)[int(o % m_sectorSize)]);
        return out;
    }

    QSet<std::uint64_t> badReads;
    QSet<std::uint64_t> badWrites;
    std::uint32_t flushError = 0; // when not 0, every flush fails with it
    int readRequests = 0;
    int writeRequests = 0;

    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("Fake Disk"); }
    std::uint64_t GetSize() const override { return m_size; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return m_size / m_sectorSize; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        ++readRequests;
        auto *out = static_cast<char *>(buffer);
        for (std::uint32_t k = 0; k < count; ++k) {
            if (badReads.contains(first + k) || first + k >= GetTotalSectors()) {
                error = 5;
                std::memset(out + std::size_t(k) * m_sectorSize, 0, m_sectorSize);
                return false;
            }
            const auto it = m_sectors.constFind(first + k);
            if (it == m_sectors.constEnd())
                std::memset(out + std::size_t(k) * m_sectorSize, 0, m_sectorSize);
            else
                std::memcpy(out + std::size_t(k) * m_sectorSize, it->constData(), m_sectorSize);
        }
        error = 0;
        return true;
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override
    {
        ++writeRequests;
        const auto *in = static_cast<const char *>(buffer);
        for (std::uint32_t k = 0; k < count; ++k) {
            if (badWrites.contains(first + k)) {
                error = 29;
                return false;
            }
            m_sectors.insert(first + k, QByteArray(in + std::size_t(k) * m_sectorSize, int(m_sectorSize)));
        }
        error = 0;
        return true;
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        const QByteArray b = bytes(offset, length);
        std::memcpy(buffer, b.constData(), std::size_t(b.size()));
        error = 0;
        return true;
    }
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override
    {
        setBytes(offset, QByteArray(static_cast<const char *>(buffer), int(length)));
        error = 0;
        return true;
    }

    bool Flush(std::uint32_t &error) override
    {
        error = flushError;
        return !error;
    }

private:
    QByteArray &sectorRef(std::uint64_t s)
    {
        auto it = m_sectors.find(s);
        if (it == m_sectors.end())
            it = m_sectors.insert(s, QByteArray(int(m_sectorSize), '\0'));
        return *it;
    }

    std::uint64_t m_size;
    std::uint32_t m_sectorSize;
    QHash<std::uint64_t, QByteArray> m_sectors;
};
