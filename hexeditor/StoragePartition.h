// The storage of a partition: the partition is the kernel object; the file-system questions are
// answered by the partition's volume when there is one.
#pragma once

#include "hexeditor/Storage.h"

class cPartition;
class CVolume;

namespace HexEditor {

class StoragePartition : public Storage
{
    Q_OBJECT

public:
    StoragePartition(cPartition *partition, CVolume *volume, QObject *parent = nullptr);
    cPartition *partition() const { return m_partition; }
    CVolume *volume() const { return m_volume; }

    std::uint32_t fileSystemKind() const override;
    std::uint64_t mftRecordCount() const override;
    std::uint64_t mftRecordOffset(std::uint64_t index) const override;

protected:
    QList<NavigationPoint> buildNavigationPoints() override;

private:
    cPartition *m_partition = nullptr;
    CVolume *m_volume = nullptr;
};

} // namespace HexEditor
