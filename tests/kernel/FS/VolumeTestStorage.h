// Sector readers for the volume tests: over bytes in memory or over an image file.
#pragma once

#include "Kernel/Implementation/Common/cStorage.h"

#include <QByteArray>
#include <QFile>
#include <QString>

#include <algorithm>
#include <cstring>

// Bytes in memory with a chosen sector size; writes change the bytes.
class MemoryStorage : public cStorage
{
public:
    explicit MemoryStorage(QByteArray bytes, std::uint32_t sectorSize = 512)
        : m_bytes(std::move(bytes)), m_sectorSize(sectorSize)
    {
    }
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("memory"); }
    std::uint64_t GetSize() const override { return GetTotalSectors() * m_sectorSize; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return std::uint64_t(m_bytes.size()) / m_sectorSize; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        ++reads;
        return ReadBytes(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override
    {
        return WriteBytes(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        const std::uint64_t size = GetSize();
        if (offset > size || length > size - offset) {
            error = 38;
            return false;
        }
        std::memcpy(buffer, m_bytes.constData() + offset, length);
        return true;
    }
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override
    {
        error = 0;
        ++writes;
        const std::uint64_t size = GetSize();
        if (offset > size || length > size - offset)
            return false;
        std::memcpy(m_bytes.data() + offset, buffer, length);
        return true;
    }
    QByteArray &Bytes() { return m_bytes; }
    int reads = 0;
    int writes = 0;

private:
    QByteArray m_bytes;
    std::uint32_t m_sectorSize;
};

// An image file read on demand (never written).
class FileStorage : public cStorage
{
public:
    explicit FileStorage(const QString &path, std::uint32_t sectorSize = 512)
        : m_file(path), m_sectorSize(sectorSize)
    {
        m_open = m_file.open(QIODevice::ReadOnly);
    }
    bool IsOpen() const { return m_open; }
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return m_file.fileName(); }
    std::uint64_t GetSize() const override { return GetTotalSectors() * m_sectorSize; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return std::uint64_t(m_file.size()) / m_sectorSize; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        return ReadBytes(first * m_sectorSize, std::uint64_t(count) * m_sectorSize, buffer, error);
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        const std::uint64_t size = GetSize();
        if (!m_open || offset > size || length > size - offset) {
            error = 38;
            return false;
        }
        if (!m_file.seek(qint64(offset)))
            return false;
        return m_file.read(static_cast<char *>(buffer), qint64(length)) == qint64(length);
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }

private:
    mutable QFile m_file;
    std::uint32_t m_sectorSize;
    bool m_open = false;
};
