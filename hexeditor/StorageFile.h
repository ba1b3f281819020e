// The storage of a file of a volume, in one of three modes: 0 the file shown in its device
// ("Disk mode"), 1 in its partition ("Partition mode"), 2 the file's own data ("File mode").
#pragma once

#include <QMap>

#include "hexeditor/StorageVolumeBase.h"

class cDevice;
class cPartition;
class CEntry;

namespace HexEditor {

class StorageFile : public StorageVolumeBase
{
    Q_OBJECT

public:
    enum Mode { DiskMode = 0, PartitionMode = 1, FileMode = 2 };

    explicit StorageFile(CEntry *entry, QObject *parent = nullptr);

    CEntry *entry() const { return m_entry; }
    int mode() const { return m_mode; }
    // Empties the cache, makes the device, the partition or the entry the kernel object and
    // rebuilds the navigation points. False for a mode without its object (then nothing changes).
    bool setMode(int mode);
    // Where the file's first byte lies in the current mode (0 in file mode).
    std::uint64_t fileStartOffset() const;
    // Whether sector s (of the current mode's object) holds bytes of the file.
    bool isFileSector(std::uint64_t s) const;
    // The file's extents as first sector -> last sector (inclusive) of the partition.
    const QMap<std::uint64_t, std::uint64_t> &extents() const { return m_extents; }

    bool isFileStorage() const override { return true; }

protected:
    QList<NavigationPoint> buildNavigationPoints() override;
    // The partition's first byte in disk mode, 0 in partition mode; no placement in file mode.
    bool volumeBase(std::uint64_t &base) const override;

private:
    cDevice *m_device = nullptr;
    cPartition *m_partition = nullptr;
    CEntry *m_entry = nullptr;
    int m_mode = DiskMode;
    std::uint64_t m_partitionFirstSector = 0;
    std::uint64_t m_startInPartition = ~0ull;
    QMap<std::uint64_t, std::uint64_t> m_extents;
    bool m_extentsInSectors = false;
};

} // namespace HexEditor
