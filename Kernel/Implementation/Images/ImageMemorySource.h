// A byte array seen as a kernel file: lets an image handle read an image held in memory (an
// image found inside another image, a checked copy, a fuzzing input) through CPlatformFileX.
#pragma once

#include "Kernel/Implementation/Common/cStorage.h"

#include <QByteArray>
#include <cstring>

class CImageMemorySource : public cStorage
{
public:
    explicit CImageMemorySource(QByteArray bytes, QString name = QStringLiteral("memory"))
        : m_bytes(std::move(bytes)), m_name(std::move(name))
    {
    }

    StorageKind GetStorageKind() const override { return StorageKind::Entry; }
    QString GetDisplayName() const override { return m_name; }
    std::uint64_t GetSize() const override { return std::uint64_t(m_bytes.size()); }
    std::uint32_t GetBytesPerSector() const override { return 512; }
    std::uint64_t GetTotalSectors() const override { return GetSize() / 512; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        return ReadBytes(first * 512, std::uint64_t(count) * 512, buffer, error);
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &error) override
    {
        error = 1;
        return false;
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        if (offset > GetSize() || length > GetSize() - offset) {
            error = 38; // end of file
            return false;
        }
        if (length)
            std::memcpy(buffer, m_bytes.constData() + offset, std::size_t(length));
        return true;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 1;
        return false;
    }

    QByteArray &Bytes() { return m_bytes; }

private:
    QByteArray m_bytes;
    QString m_name;
};
