// The storage of a volume: sectors come from the volume's partition (the volume's medium); the
// file-system questions are the volume's.
#pragma once

#include "Storage.h"

class CVolume;

namespace HexEditor {

class StorageVolume : public Storage
{
    Q_OBJECT

public:
    explicit StorageVolume(CVolume *volume, QObject *parent = nullptr);
    CVolume *volume() const { return m_volume; }

    bool isHfsVolume() const override;
    StorageKind kind() const override { return StorageKind::Volume; }
    QString name() const override;
    std::uint32_t fileSystemKind() const override;
    std::uint32_t clusterSize() const override;
    std::uint64_t mftRecordCount() const override;
    std::uint64_t mftRecordOffset(std::uint64_t index) const override;
    std::uint32_t mftRecordSize() const override { return m_mftRecordSize; }
    std::uint64_t catalogNodeCount() const override;
    std::uint64_t catalogNodeOffset(std::uint64_t index) const override;
    std::uint32_t inodeSize() const override { return m_inodeSize; }

protected:
    QList<NavigationPoint> buildNavigationPoints() override;

private:
    CVolume *m_volume = nullptr;
    std::uint32_t m_mftRecordSize = 1024;
    std::uint32_t m_inodeSize = 128;
};

} // namespace HexEditor
