// A ready volume in memory for tests of the node views: a FAT volume of 1 MiB over zeros whose
// entries a test builds with `add` and hands over with `SetRootEntry`.
#pragma once

#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <cstdint>
#include <cstring>
#include <memory>

namespace TestVolumes {

// Zeros in memory as the medium of a volume; nothing can be written.
class ZeroStorage : public cStorage
{
public:
    StorageKind GetStorageKind() const override { return StorageKind::Partition; }
    QString GetDisplayName() const override { return QStringLiteral("memory"); }
    std::uint64_t GetSize() const override { return 1 << 20; }
    std::uint32_t GetBytesPerSector() const override { return 512; }
    std::uint64_t GetTotalSectors() const override { return GetSize() / 512; }
    bool ReadSectors(std::uint64_t, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        std::memset(buffer, 0, std::size_t(count) * 512);
        error = 0;
        return true;
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
    bool ReadBytes(std::uint64_t, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        std::memset(buffer, 0, std::size_t(length));
        error = 0;
        return true;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
};

// The medium is a base ahead of the volume, so it stands before the volume is built on it.
struct ZeroMedium
{
    ZeroStorage medium;
};

class MemoryVolume : private ZeroMedium, public CVolume
{
public:
    MemoryVolume() : CVolume(&medium, description(), nullptr)
    {
        m_kind = static_cast<std::uint32_t>(FileSystemKind::Fat);
    }

protected:
    std::unique_ptr<CEntry> newRoot()
    {
        return std::make_unique<CEntry>(this, nullptr, QString(), 0, CEntry::AttrFolder, 0);
    }
    // An entry below `parent`; every entry gets the next record number.
    CEntry *add(CEntry *parent, const QString &name, std::uint32_t attributes, std::uint64_t size)
    {
        ++m_index;
        auto e = std::make_unique<CEntry>(this, parent, name, m_index * 32, attributes, m_index);
        e->SetSize(size);
        return parent->AddChild(std::move(e));
    }

private:
    static VolumeDescription description()
    {
        VolumeDescription d;
        d.size = 1 << 20;
        d.ready = 1;
        d.name = QStringLiteral("memvol");
        return d;
    }
    std::uint64_t m_index = 0;
};

} // namespace TestVolumes
