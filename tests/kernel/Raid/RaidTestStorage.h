// Member storages for the RAID tests: sectors in memory or in a file, with reads that can be made
// to fail and a count of the transfers each member served.
#pragma once

#include <QByteArray>
#include <QFile>
#include <QString>

#include <atomic>
#include <cstring>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cStorage.h"

namespace RaidTest {

class TestStorage : public cStorage
{
public:
    TestStorage(std::uint64_t sectors, std::uint32_t sectorSize = 512)
        : m_sectors(sectors), m_sectorSize(sectorSize)
    {
    }

    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("test member"); }
    std::uint64_t GetSize() const override { return m_sectors * m_sectorSize; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return m_sectors; }

    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        ++reads;
        error = 0;
        if (failReads) {
            error = SystemError::Crc;
            return false;
        }
        if (first > m_sectors || count > m_sectors - first) {
            error = SystemError::HandleEof;
            return false;
        }
        return Load(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override
    {
        ++writes;
        error = 0;
        if (failWrites) {
            error = SystemError::WriteFault;
            return false;
        }
        if (first > m_sectors || count > m_sectors - first) {
            error = SystemError::HandleEof;
            return false;
        }
        return Store(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        ++reads;
        error = 0;
        if (failReads || offset > GetSize() || length > GetSize() - offset) {
            error = SystemError::Crc;
            return false;
        }
        return Load(offset, length, buffer, error);
    }
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override
    {
        ++writes;
        error = 0;
        if (offset > GetSize() || length > GetSize() - offset) {
            error = SystemError::HandleEof;
            return false;
        }
        return Store(offset, length, buffer, error);
    }

    std::atomic<int> reads{0};
    std::atomic<int> writes{0};
    std::atomic<bool> failReads{false};
    std::atomic<bool> failWrites{false};

protected:
    virtual bool Load(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) = 0;
    virtual bool Store(std::uint64_t offset, std::uint64_t length, const void *buffer,
                       std::uint32_t &error) = 0;

    std::uint64_t m_sectors;
    std::uint32_t m_sectorSize;
};

// Sectors in memory; `Data()` gives the bytes for the test to fill and inspect.
class MemStorage : public TestStorage
{
public:
    MemStorage(std::uint64_t sectors, std::uint32_t sectorSize = 512)
        : TestStorage(sectors, sectorSize), m_data(static_cast<qsizetype>(sectors * sectorSize), '\0')
    {
    }
    QByteArray &Data() { return m_data; }
    std::uint8_t *Sector(std::uint64_t n)
    {
        return reinterpret_cast<std::uint8_t *>(m_data.data()) + n * m_sectorSize;
    }

protected:
    bool Load(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &) override
    {
        std::memcpy(buffer, m_data.constData() + offset, length);
        return true;
    }
    bool Store(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &) override
    {
        std::memcpy(m_data.data() + offset, buffer, length);
        return true;
    }

private:
    QByteArray m_data;
};

// Sectors in a file the test made; the whole file is the member.
class FileStorage : public TestStorage
{
public:
    FileStorage(const QString &path, std::uint32_t sectorSize = 512)
        : TestStorage(0, sectorSize), m_file(path)
    {
        if (m_file.open(QIODevice::ReadWrite))
            m_sectors = static_cast<std::uint64_t>(m_file.size()) / sectorSize;
    }

protected:
    bool Load(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        if (!m_file.seek(static_cast<qint64>(offset)) ||
            m_file.read(static_cast<char *>(buffer), static_cast<qint64>(length)) != qint64(length)) {
            error = SystemError::ReadFault;
            return false;
        }
        return true;
    }
    bool Store(std::uint64_t offset, std::uint64_t length, const void *buffer, std::uint32_t &error) override
    {
        if (!m_file.seek(static_cast<qint64>(offset)) ||
            m_file.write(static_cast<const char *>(buffer), static_cast<qint64>(length)) != qint64(length)) {
            error = SystemError::WriteFault;
            return false;
        }
        return m_file.flush();
    }

private:
    QFile m_file;
};

// The content the tests give assembly sector `sector`: its number and a running byte pattern.
inline void FillSector(std::uint8_t *out, std::uint64_t sector, std::uint32_t size = 512)
{
    for (std::uint32_t i = 0; i < size; ++i)
        out[i] = static_cast<std::uint8_t>((sector * 131 + i * 7 + (sector >> 8)) & 0xFF);
    std::memcpy(out, &sector, sizeof sector);
}
inline QByteArray ExpectedSectors(std::uint64_t first, std::uint32_t count, std::uint32_t size = 512)
{
    QByteArray out(static_cast<qsizetype>(std::uint64_t(count) * size), '\0');
    for (std::uint32_t i = 0; i < count; ++i)
        FillSector(reinterpret_cast<std::uint8_t *>(out.data()) + std::uint64_t(i) * size, first + i, size);
    return out;
}

} // namespace RaidTest
