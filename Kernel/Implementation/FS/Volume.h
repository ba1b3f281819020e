// The volume of a partition (or of a whole device without a table): geometry in sectors and
// clusters, the transfer path down to the partition and device, the boot-sector overlay, the
// root and service entries and the integrity assessment. File systems derive from CVolume.
#pragma once

#include <QByteArray>
#include <QDateTime>
#include <QString>
#include <QStringList>

#include <cstdint>
#include <memory>
#include <mutex>
#include <vector>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/FS/Entry.h"

class cRoot;
class cPartition;
class CPlatformFile;

class cVolume : public cStorage
{
public:
    StorageKind GetStorageKind() const override { return StorageKind::Volume; }

    virtual QString GetName() const = 0;
    virtual std::uint32_t GetDriveId() const = 0;
    virtual QString GetLabel() const = 0;
    virtual std::uint32_t GetSerialNumber() const = 0;
    virtual std::uint32_t GetKind() const = 0;
    virtual QDateTime GetAssessedTime() const = 0;
    virtual std::uint32_t GetClusterSize() const = 0;
    virtual std::uint32_t GetClusterRange(std::uint64_t &firstCluster, std::uint64_t &lastCluster,
                                          std::uint64_t &cluster0Sector) const = 0;
    virtual std::uint64_t SectorToCluster(std::uint64_t sector) const = 0;
    virtual std::uint64_t ClusterToSector(std::uint64_t cluster) const = 0;
    virtual std::uint64_t GetFreeBytes() const = 0;
    virtual bool IsClusterFree(std::uint64_t cluster) = 0;
    virtual bool ReadCluster(std::uint64_t cluster, void *buffer, std::uint32_t &error) = 0;
    virtual bool WriteCluster(std::uint64_t cluster, const void *buffer, std::uint32_t &error) = 0;
    virtual bool ApplyBootSector(const void *buffer, std::uint32_t size) = 0;
    virtual bool SelectFileTableCopy(std::uint8_t index, std::uint8_t &count, std::uint8_t &current) = 0;
    virtual CEntry *GetRootEntry() const = 0;
    virtual std::int32_t GetServiceEntryCount() const = 0;
    virtual CEntry *GetServiceEntry(std::int32_t index) const = 0;
    virtual std::uint32_t GetIntegrity(std::uint64_t &validItems, std::uint64_t &checkedItems) = 0;
    virtual bool IsHealthy() = 0;
    virtual std::unique_ptr<CEntry> CreateEntry(CEntry *parent) = 0;
    virtual QByteArray QueryInfo(const QByteArray &request) = 0;
};

// What a volume is made from: the partition's range and the platform volume that covers it.
struct VolumeDescription
{
    std::uint64_t start = 0; // first byte on the device
    std::uint64_t size = 0;  // bytes
    std::uint32_t sectorSize = 512;
    std::uint32_t kind = 0xFFFFFFFF;
    QString name;               // the platform's volume path (Linux: the block device)
    QString secondName;         // where it is mounted
    std::uint32_t driveId = 26; // 0..25 drive letter, 26 or more none
    std::uint8_t ready = 0;
    std::uint32_t mountId = 0;
    CPlatformFile *handle = nullptr; // the volume's own system handle, not owned
};

class CVolume : public cVolume
{
public:
    static constexpr std::uint64_t AllItems = 0xFFFFFFFFFFFFFFFFull;
    static constexpr std::uint32_t NoLetter = 26;

    // `medium` is what the volume lies on: its partition (or a whole device), read and written
    // in the partition's own sectors from the volume's first byte. Neither is owned.
    CVolume(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);
    ~CVolume() override;

    // cStorage
    QString GetDisplayName() const override;
    std::uint64_t GetSize() const override;
    std::uint32_t GetBytesPerSector() const override { return 1u << m_sectorShift; }
    std::uint64_t GetTotalSectors() const override { return m_sectorCount; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;
    // The volume's own handle and the medium below.
    bool Flush(std::uint32_t &error) override;

    // cVolume
    QString GetName() const override { return m_name; }
    std::uint32_t GetDriveId() const override;
    QString GetLabel() const override { return m_label; }
    std::uint32_t GetSerialNumber() const override { return m_serial; }
    std::uint32_t GetKind() const override { return m_kind; }
    QDateTime GetAssessedTime() const override { return m_assessed; }
    std::uint32_t GetClusterSize() const override;
    std::uint32_t GetClusterRange(std::uint64_t &firstCluster, std::uint64_t &lastCluster,
                                  std::uint64_t &cluster0Sector) const override;
    std::uint64_t SectorToCluster(std::uint64_t sector) const override;
    std::uint64_t ClusterToSector(std::uint64_t cluster) const override;
    std::uint64_t GetFreeBytes() const override;
    bool IsClusterFree(std::uint64_t cluster) override;
    bool ReadCluster(std::uint64_t cluster, void *buffer, std::uint32_t &error) override;
    bool WriteCluster(std::uint64_t cluster, const void *buffer, std::uint32_t &error) override;
    bool ApplyBootSector(const void *buffer, std::uint32_t size) override;
    bool SelectFileTableCopy(std::uint8_t index, std::uint8_t &count, std::uint8_t &current) override;
    CEntry *GetRootEntry() const override { return m_root.get(); }
    std::int32_t GetServiceEntryCount() const override;
    CEntry *GetServiceEntry(std::int32_t index) const override;
    std::uint32_t GetIntegrity(std::uint64_t &validItems, std::uint64_t &checkedItems) override;
    bool IsHealthy() override { return false; }
    std::unique_ptr<CEntry> CreateEntry(CEntry *parent) override;
    QByteArray QueryInfo(const QByteArray &request) override;

    // A free value kept for callers: returns the old value, stores `value` unless all ones.
    std::uint64_t UserValue(std::uint64_t value);

    std::uint8_t GetSectorShift() const { return m_sectorShift; }
    std::uint8_t GetClusterShift() const { return m_clusterShift; }
    std::uint32_t GetMountId() const { return m_mountId; }
    bool IsReady() const { return m_ready != 0; }
    // Whether the free cluster count has been established.
    bool IsFreeKnown() const { return m_freeKnown; }
    cStorage *GetMedium() const { return m_medium; }
    cRoot *GetRootObject() const { return m_rootObject; }
    CPlatformFile *GetSystemHandle() const { return m_handle; }
    QString GetSecondName() const { return m_secondName; }
    // The overlay's sector positions (NoSector when none is installed).
    std::uint64_t GetOverlaySector(int which) const { return m_overlaySector[which & 1]; }

    // Messages the volume raised ("%1: ..." with its display name), in order.
    QStringList Messages() const;

protected:
    // Parses the boot area, sets geometry, creates the entries, assesses integrity. The base
    // keeps the geometry of the constructor (one sector per cluster).
    virtual void Initialize();
    // The grade when some checked item is not valid; the base answers 0.
    virtual std::uint32_t GradeIntegrity();

    // Raises an internal message "<display name>: text".
    void Message(const QString &text);
    // Installs `size` bytes as overlay at two volume sectors (NoSector for none); an empty buffer
    // removes it.
    void SetOverlay(std::uint64_t primary, std::uint64_t copy, const QByteArray &bytes);
    void SetRootEntry(std::unique_ptr<CEntry> root) { m_root = std::move(root); }
    CEntry *AddServiceEntry(std::unique_ptr<CEntry> entry);
    void ClearEntries();
    // A service entry over `count` volume sectors from `sector`.
    CEntry *AddServiceArea(const QString &name, std::uint64_t sector, std::uint64_t count);
    // Sets the cluster geometry: cluster size in bytes (a power of two not below the sector
    // size), cluster-0 sector, first and last cluster.
    bool SetClusterGeometry(std::uint64_t clusterBytes, std::uint64_t cluster0Sector,
                            std::uint64_t firstCluster, std::uint64_t lastCluster);

    // Reads bytes from the start of the volume without the sector count's limit (a boot area
    // may lie in the last sector of the partition beyond the last whole cluster).
    bool ReadRaw(std::uint64_t offset, std::uint64_t length, void *buffer);

    // The data model.
    std::uint64_t m_validItems = AllItems;
    std::uint64_t m_checkedItems = AllItems;
    std::uint64_t m_userValue = 0;
    cStorage *m_medium = nullptr;
    QString m_name;
    QString m_secondName;
    std::uint32_t m_driveId = NoLetter;
    std::uint8_t m_ready = 0;
    std::uint64_t m_size = 0;
    CPlatformFile *m_handle = nullptr;
    std::uint32_t m_kind = 24;
    QString m_label;
    std::uint32_t m_serial = 0;
    std::uint8_t m_sectorShift = 9;
    std::uint32_t m_mountId = 0;
    QDateTime m_assessed;
    std::uint64_t m_sectorCount = 0;
    std::uint64_t m_cluster0Sector = 0;
    std::uint8_t m_clusterShift = 0;
    std::uint64_t m_firstCluster = 0;
    std::uint64_t m_lastCluster = 0;
    std::uint64_t m_freeClusters = 0;
    bool m_freeKnown = false;

private:
    bool Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                  std::uint32_t &error);

    cRoot *m_rootObject = nullptr;
    std::unique_ptr<CEntry> m_root;
    std::vector<std::unique_ptr<CEntry>> m_service;
    std::uint64_t m_overlaySector[2] = {NoSector, NoSector};
    QByteArray m_overlay;
    mutable std::mutex m_messageMutex;
    QStringList m_messages;
};

// Everything not recognised (and the kinds whose own classes follow): the base behaviour with
// the geometry the boot sector or superblock gives, where it is one of the common kinds.
class CVolumeXXX : public CVolume
{
public:
    CVolumeXXX(cStorage *medium, const VolumeDescription &description, cRoot *root = nullptr);

protected:
    void Initialize() override;
};
