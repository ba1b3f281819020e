// What the volume and file storages share: the file-system answers of the volume behind them
// (kind, cluster size, MFT records, catalog nodes, inode size), placed where the volume's first
// byte lies in the storage's own bytes.
#pragma once

#include "hexeditor/Storage.h"

class CVolume;

namespace HexEditor {

class StorageVolumeBase : public Storage
{
    Q_OBJECT

public:
    CVolume *volume() const { return m_volume; }

    std::uint32_t fileSystemKind() const override;
    std::uint32_t clusterSize() const override;
    std::uint64_t mftRecordCount() const override;
    std::uint64_t mftRecordOffset(std::uint64_t index) const override;
    std::uint32_t mftRecordSize() const override { return m_mftRecordSize; }
    std::uint64_t catalogNodeCount() const override;
    std::uint64_t catalogNodeOffset(std::uint64_t index) const override;
    std::uint32_t inodeSize() const override { return m_inodeSize; }

protected:
    // `active` is the kernel object of the storage; the record and inode sizes are read here.
    StorageVolumeBase(cStorage *active, CVolume *volume, QObject *parent);
    // Where the volume's first byte lies in this storage; false when the storage does not show the
    // volume's sectors (then records and nodes are at offset 0).
    virtual bool volumeBase(std::uint64_t &base) const
    {
        base = 0;
        return true;
    }

private:
    CVolume *m_volume = nullptr;
    std::uint32_t m_mftRecordSize = 1024;
    std::uint32_t m_inodeSize = 128;
};

} // namespace HexEditor
