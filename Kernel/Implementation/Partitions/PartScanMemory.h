// A device held in memory for the scan's tests and fuzzing: a sector size, a sector count and the
// bytes of its head and tail; everything between reads as zeros. Writes change the held bytes
// where they are held and are refused elsewhere.
#pragma once

#include <QByteArray>

#include "Kernel/Implementation/Common/cStorage.h"

namespace PartScan {

class MemoryStorage : public cStorage
{
public:
    // `head` lies at byte 0, `tail` ends at the device's last byte (both are cut to the device).
    MemoryStorage(std::uint32_t bytesPerSector, std::uint64_t totalSectors, QByteArray head,
                  QByteArray tail = QByteArray());

    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return m_name; }
    void SetDisplayName(const QString &name) { m_name = name; }
    std::uint64_t GetSize() const override { return m_total * m_bps; }
    std::uint32_t GetBytesPerSector() const override { return m_bps; }
    std::uint64_t GetTotalSectors() const override { return m_total; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;

    // Sector reads made so far (the scan's tests count them).
    std::uint64_t ReadCount() const { return m_reads; }

private:
    std::uint32_t m_bps;
    std::uint64_t m_total;
    QByteArray m_head;
    QByteArray m_tail;
    std::uint64_t m_tailStart = 0; // byte offset of the tail
    std::uint64_t m_reads = 0;
    QString m_name = QStringLiteral("Memory Disk");
};

} // namespace PartScan
