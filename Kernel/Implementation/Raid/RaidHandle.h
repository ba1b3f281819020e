// A RAID assembly: the sectors of a device of media type 7 computed from several member storages
// (devices or partitions). The handle maps every sector request of the assembly onto its members;
// parity layouts rebuild the data of one missing or unreadable member from the others. One
// recursive lock serialises all transfers, so several threads may share an assembly.
#pragma once

#include <QByteArray>
#include <QList>
#include <QRecursiveMutex>
#include <QString>

#include <cstdint>

#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/Raid/RaidLayout.h"

class CRaidHandle : public cStorage
{
public:
    // Largest stripe buffer (stripe x sector size, or layout 1's block) an assembly may ask for.
    static constexpr std::uint64_t MaxStripeBytes = 64ull << 20;

    // `members` in layout order; an entry may be null (a missing member). `starts` and `lengths`
    // give the first sector and the number of sectors used on each member (a length larger than
    // the member clips to it; all ones means "to the end"). `stripe` is the chunk size in sectors
    // for layouts 3 and 5 to 8 and the block size in bytes for layout 1. `byteOffset` (layout 1)
    // reads the member by byte position from there instead of in blocks; -1 for none.
    // `total` receives the assembly's sector count, 0 when the assembly is not valid.
    CRaidHandle(std::uint64_t owner0, std::uint64_t owner1, std::uint32_t layout,
                const QList<cStorage *> &members, const QList<std::uint64_t> &starts,
                const QList<std::uint64_t> &lengths, std::uint32_t sectorSize, std::uint32_t stripe,
                std::uint64_t &total, std::int64_t byteOffset = -1);
    ~CRaidHandle() override;

    // Transfers `count` assembly sectors from `first` (the device's sector access calls it). A
    // request that runs past the assembly is done for the part inside and reported failed.
    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error);

    bool IsValid() const { return m_totalSectors != 0; }
    std::uint32_t GetLayout() const { return m_layout; }
    std::uint32_t GetStripe() const { return m_stripe; }
    std::uint32_t GetMemberCount() const { return static_cast<std::uint32_t>(m_members.size()); }
    cStorage *GetMember(std::uint32_t index) const;
    std::uint64_t GetMemberStart(std::uint32_t index) const;
    std::uint64_t GetMemberLength(std::uint32_t index) const;
    std::uint64_t GetOwner(int index) const { return m_owner[index ? 1 : 0]; }
    // Free values kept for callers: returns the old value and stores `value`.
    std::uint64_t UserValue(int index, std::uint64_t value);
    // Why the construction refused the assembly (empty when valid).
    QString GetRefusal() const { return m_refusal; }

    // cStorage
    StorageKind GetStorageKind() const override { return StorageKind::Raid; }
    QString GetDisplayName() const override;
    std::uint64_t GetSize() const override { return m_totalSectors * m_sectorSize; }
    std::uint32_t GetBytesPerSector() const override { return m_sectorSize; }
    std::uint64_t GetTotalSectors() const override { return m_totalSectors; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;
    // Flushes every member that is present.
    bool Flush(std::uint32_t &error) override;

private:
    bool Build(const QList<cStorage *> &members, const QList<std::uint64_t> &starts,
               const QList<std::uint64_t> &lengths);
    bool Refuse(const QString &why);

    // One transfer inside the assembly, by layout.
    bool Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                  std::uint32_t &error);
    bool TransferSingle(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer, std::uint32_t &error);
    bool TransferConcatenated(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                              std::uint32_t &error);
    bool TransferStriped(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                         std::uint32_t &error);
    bool TransferMirrored(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                          std::uint32_t &error);
    bool ByteTransfer(bool read, std::uint64_t offset, std::uint64_t length, std::uint8_t *buffer,
                      std::uint32_t &error);
    bool ReadParity(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer, std::uint32_t &error);
    // Reads or writes sectors of one member relative to its start.
    bool MemberTransfer(std::uint32_t member, bool read, std::uint64_t sector, std::uint32_t count,
                        std::uint8_t *buffer, std::uint32_t &error);

    // The data model, in order.
    std::uint64_t m_owner[2] = {0, 0};
    std::uint64_t m_user[2] = {0, 0};
    std::uint64_t m_totalSectors = 0;
    std::uint32_t m_sectorSize = 0;
    QList<cStorage *> m_members;
    QList<std::uint64_t> m_starts;
    QList<std::uint64_t> m_lengths;
    std::uint32_t m_layout = 0;
    std::uint32_t m_stripe = 0;
    std::uint32_t m_currentMember = 0;
    QByteArray m_stripeBuffer;
    std::int64_t m_cachedBlock = -1;
    std::int64_t m_byteOffset = -1;

    QRecursiveMutex m_lock;
    QString m_refusal;
};
