// Holds the system's volumes out of the way while something writes to the medium: every volume
// of the system that overlaps the sectors to be written is locked through the kernel (on Linux an
// exclusive open of its block device, which fails while it is mounted). When a lock cannot be
// had, refusal() says why and nothing may be written. Header-only (kernel and Qt Core): the
// headless tool's write command uses it too.
#pragma once

#include <QCoreApplication>
#include <QString>
#include <QStringList>

#include <cstdint>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"

namespace HexEditor {

class WriteGuard
{
public:
    // `first` and `count` are sectors of `object`.
    WriteGuard(cStorage *object, std::uint64_t first, std::uint64_t count);
    ~WriteGuard();

    WriteGuard(const WriteGuard &) = delete;
    WriteGuard &operator=(const WriteGuard &) = delete;

    const QString &refusal() const { return m_refusal; }

private:
    void lockRange(cStorage *object, std::uint64_t first, std::uint64_t count);

    QString m_refusal;
    std::vector<std::unique_ptr<CPlatformFile>> m_locks;
};

namespace WriteGuardDetail {

inline QString tr(const char *text)
{
    return QCoreApplication::translate("HexEditor::Storage", text);
}

struct Candidate
{
    QString path;
    QString mountPoint;
    std::uint64_t offset = 0; // bytes on the device
    std::uint64_t length = 0;
};

inline void collectPartitions(cPartition *p, std::uint64_t sectorSize,
                              std::vector<WriteGuardDetail::Candidate> &out)
{
    if (!p)
        return;
    if (const VolumeInfo *v = p->GetVolumeInfo(); v && !v->path.isEmpty())
        out.push_back({v->path, v->mountPoint, p->GetStart() * sectorSize, p->GetLength() * sectorSize});
    for (std::uint32_t i = 0; i < p->GetChildCount(); ++i)
        collectPartitions(p->GetChild(i), sectorSize, out);
}

} // namespace WriteGuardDetail

inline WriteGuard::WriteGuard(cStorage *object, std::uint64_t first, std::uint64_t count)
{
    if (!object) {
        m_refusal = WriteGuardDetail::tr("There is no storage to write to.");
        return;
    }
    lockRange(object, first, count);
}

inline WriteGuard::~WriteGuard()
{
    for (auto &lock : m_locks)
        lock->Unlock();
}

inline void WriteGuard::lockRange(cStorage *object, std::uint64_t first, std::uint64_t count)
{
    if (!count)
        return;
    const std::uint64_t ss = object->GetBytesPerSector();
    switch (object->GetStorageKind()) {
    case StorageKind::Entry: {
        // A file's bytes may lie anywhere in its volume.
        if (auto *entry = dynamic_cast<CEntry *>(object); entry && entry->GetVolume())
            lockRange(entry->GetVolume(), 0, entry->GetVolume()->GetTotalSectors());
        return;
    }
    case StorageKind::Volume: {
        auto *volume = dynamic_cast<CVolume *>(object);
        cStorage *medium = volume ? volume->GetMedium() : nullptr;
        if (!medium || !medium->GetBytesPerSector())
            return;
        const std::uint64_t mss = medium->GetBytesPerSector();
        const std::uint64_t from = first * ss / mss;
        const std::uint64_t to = ((first + count) * ss + mss - 1) / mss;
        lockRange(medium, from, to - from);
        return;
    }
    case StorageKind::Partition: {
        auto *partition = dynamic_cast<cPartition *>(object);
        if (!partition || !partition->GetDevice())
            return;
        lockRange(partition->GetDevice(), partition->GetStart() + first, count);
        return;
    }
    case StorageKind::Device:
        break;
    default:
        return;
    }

    auto *device = dynamic_cast<CDevice *>(object);
    if (!device)
        return;
    std::vector<WriteGuardDetail::Candidate> candidates;
    for (const VolumeInfo &v : device->GetDescriptor().volumes) {
        if (v.path.isEmpty())
            continue;
        if (v.extents.isEmpty() || v.partitionNumber == 0) {
            candidates.push_back({v.path, v.mountPoint, 0, device->GetSize()});
        } else {
            for (const VolumeExtent &e : v.extents)
                candidates.push_back({v.path, v.mountPoint, e.offset, e.length});
        }
    }
    bool partitioned = false;
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i) {
        partitioned = partitioned || device->GetPartition(i)->GetKind() != 0;
        WriteGuardDetail::collectPartitions(device->GetPartition(i), ss, candidates);
    }
    // A file system over the whole device (no table) is held by the device itself.
    if (!partitioned && device->GetHandle() && device->GetHandle()->GetKind() == PlatformKind::Device)
        candidates.push_back({device->GetHandle()->GetName(), QString(), 0, device->GetSize()});

    const std::uint64_t from = first * ss, to = (first + count) * ss;
    QStringList locked;
    for (const WriteGuardDetail::Candidate &c : candidates) {
        if (!(c.offset < to && from < c.offset + c.length) || locked.contains(c.path))
            continue;
        // The kernel root's own volume handle may be the one holding the lock already.
        auto lock = std::make_unique<CPlatformFile>(device->GetRoot(), c.path, PlatformKind::Volume);
        lock->SetWritable(false);
        if (lock->Lock()) {
            locked << c.path;
            m_locks.push_back(std::move(lock));
            continue;
        }
        // A volume path that no longer exists holds nothing that could be disturbed.
        const std::uint32_t error = lock->GetError();
        if (c.mountPoint.isEmpty() &&
            (error == SystemError::FileNotFound || error == SystemError::PathNotFound ||
             error == SystemError::DevNotExist))
            continue;
        m_refusal =
            c.mountPoint.isEmpty()
                ? WriteGuardDetail::tr(
                      "%1 is in use by the system and cannot be locked for writing. Close what uses it "
                      "and try again.")
                      .arg(c.path)
                : WriteGuardDetail::tr(
                      "%1 is mounted by the system at %2 and cannot be locked for writing. Unmount "
                      "it and try again.")
                      .arg(c.path, c.mountPoint);
        return;
    }
}

} // namespace HexEditor
