// One partition of a device: a primary, extended or logical partition of a boot-record table, a
// GUID partition table entry, a logical-disk-manager metadata or data area, or unallocated space
// between them. The device owns its top-level partitions; an extended partition owns its logical
// partitions (its children). Sector access goes through the device, relative to the partition's
// first sector and clipped to its length.
#pragma once

#include <QByteArray>
#include <QList>
#include <QString>

#include <array>
#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <vector>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cPartition.h"
#include "Kernel/Implementation/Common/cStorage.h"

class cDevice;
class CPlatformFile;
class CVolume;

class CPartition : public cPartition
{
public:
    // A GUID partition table entry's own fields (all zero for other sources).
    struct GptFields
    {
        std::array<std::uint8_t, 16> typeGuid{};   // on-disk byte order
        std::array<std::uint8_t, 16> uniqueGuid{}; // on-disk byte order
        std::uint64_t attributes = 0;
        QString name;
    };

    // `storage` is the device's sector access (the same object as `device` when there is one).
    CPartition(cDevice *device, cStorage *storage, CPartition *parent, std::uint32_t kind,
               std::uint64_t start, std::uint64_t length);
    ~CPartition() override;

    // cPartition
    cDevice *GetDevice() const override { return m_device; }
    cPartition *GetParent() const override { return m_parent; }
    std::uint32_t GetKind() const override { return m_kind; }
    std::uint8_t GetActive() const override { return m_active; }
    std::uint64_t GetTableSector() const override { return m_tableSector; }
    std::uint64_t GetStart() const override { return m_start; }
    std::uint64_t GetLength() const override { return m_length; }
    std::uint32_t GetChildCount() const override { return static_cast<std::uint32_t>(m_children.size()); }
    cPartition *GetChild(std::uint32_t index) const override;
    const VolumeInfo *GetVolumeInfo() const override { return m_volume ? &*m_volume : nullptr; }
    CPlatformFile *GetVolumeHandle() const override { return m_volumeHandle; }

    // cStorage: sectors relative to the partition's start, clipped to its length.
    QString GetDisplayName() const override;
    std::uint64_t GetSize() const override;
    std::uint32_t GetBytesPerSector() const override;
    std::uint64_t GetTotalSectors() const override { return m_length; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;
    // The device's flush (which takes in the partition's own volume handle).
    bool Flush(std::uint32_t &error) override;

    // The copy of the boot-record entry (16 bytes, zero for other sources).
    const std::array<std::uint8_t, 16> &GetEntry() const { return m_entry; }
    // The entry's type byte (byte 4 of the boot-record entry), 0 for other sources.
    std::uint8_t GetEntryType() const { return m_entry[4]; }
    const GptFields &GetGpt() const { return m_gpt; }
    bool IsGptEntry() const { return m_isGpt; }
    CPartition *GetChildPartition(std::uint32_t index) const;

    // Set by the scan.
    void SetActive(std::uint8_t active) { m_active = active; }
    void SetEntry(const std::uint8_t *entry16);
    void SetTableSector(std::uint64_t sector) { m_tableSector = sector; }
    void SetGpt(const GptFields &gpt);
    void SetVolume(const VolumeInfo &volume) { m_volume = volume; }
    void SetKind(std::uint32_t kind) { m_kind = kind; }
    void SetParent(CPartition *parent) { m_parent = parent; }
    // Takes ownership of a logical partition; keeps them in the order added.
    CPartition *AddChild(std::unique_ptr<CPartition> child);
    std::vector<std::unique_ptr<CPartition>> &Children() { return m_children; }
    // The volume layer opens the partition's own handle and registers it here (not owned).
    void SetVolumeHandle(CPlatformFile *handle) { m_volumeHandle = handle; }

    // The file-system volume on this partition, made with the device (null for unallocated
    // space, an extended partition and a BSD container, whose slices are its children). The
    // partition owns it and destroys it before anything else of its own.
    CVolume *Volume() const { return m_fileSystem.get(); }
    void SetFileSystemVolume(std::unique_ptr<CVolume> volume);

private:
    // The data model, in order.
    cDevice *m_device = nullptr;
    CPartition *m_parent = nullptr;
    std::uint8_t m_active = 0;
    std::array<std::uint8_t, 16> m_entry{};
    std::uint64_t m_tableSector = 0;
    std::uint64_t m_start = 0;
    std::uint64_t m_length = 0;
    std::optional<VolumeInfo> m_volume;
    std::vector<std::unique_ptr<CPartition>> m_children;
    std::uint32_t m_kind = 0;

    // GPT entry fields.
    bool m_isGpt = false;
    GptFields m_gpt;

    cStorage *m_storage = nullptr;
    CPlatformFile *m_volumeHandle = nullptr;
    std::unique_ptr<CVolume> m_fileSystem;

    // Byte access: a one-sector buffer and the number of the sector it holds.
    std::mutex m_byteMutex;
    QByteArray m_byteBuffer;
    std::uint64_t m_byteSector = NoSector;
};

// The partition manager of one device: creates and removes table entries for the disk-manager
// functions. A place-holder: its operations follow with the disk manager.
class CPartMan
{
public:
    explicit CPartMan(cDevice *device = nullptr) : m_device(device) {}
    cDevice *GetDevice() const { return m_device; }

private:
    cDevice *m_device = nullptr;
};
