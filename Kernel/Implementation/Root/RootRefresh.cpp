// The refresh of the device list: what vanished leaves, what appeared joins, what stayed is kept.
#include "Kernel/Implementation/Root/Root.h"

#include "Kernel/Implementation/Common/RootEnumSource.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/RootEnumerate.h"

#include <QMutexLocker>
#include <QThread>

bool CRoot::IsIncluded(const DeviceInfo &info, bool full, const RefreshKinds &kinds, bool kept)
{
    if (info.sub != 0)
        return !kinds.removeImages;
    if (kept && full && info.source == EnumSource::PhysicalDrive)
        return false;
    if (info.source == EnumSource::VolumeBacked)
        return kinds.volumeBacked;
    switch (info.mediaType) {
    case MediaType::Floppy:
        return kinds.floppy;
    case MediaType::Fixed:
        return kinds.fixed;
    case MediaType::Removable:
        return kinds.removable;
    case MediaType::CdRom:
        return kinds.optical;
    case MediaType::Unknown:
        return kinds.unknown;
    default:
        return true;
    }
}

bool CRoot::SameMedium(const DeviceInfo &known, const DeviceInfo &fresh)
{
    if (known.number != fresh.number || known.source != fresh.source || known.sub != fresh.sub)
        return false;
    // The same number can name another medium: a loop device attached to another image, a card
    // swapped in its reader. Such a device is replaced rather than kept with stale geometry.
    if (known.diskSequence && fresh.diskSequence && known.diskSequence != fresh.diskSequence)
        return false;
    return known.ready == fresh.ready && known.totalSectors == fresh.totalSectors &&
           known.sectorShift == fresh.sectorShift && known.backingFile == fresh.backingFile;
}

void CRoot::RunRefresh(bool full, const RefreshKinds &kinds)
{
    QMutexLocker serial(&m_secondMutex);
    StorageEvent(nullptr, _event_storage::EnumerationStarted);

    const QList<CDevice *> known = Devices();
    for (CDevice *d : known)
        d->Close(true);

    CEnumerator enumerator(this, *m_source);
    QList<DeviceInfo> fresh = enumerator.Enumerate();
    QList<bool> used(fresh.size(), false);

    for (qsizetype i = known.size() - 1; i >= 0; --i) {
        CDevice *d = known[i];
        const DeviceInfo &info = d->GetDescriptor();
        bool keep = IsIncluded(info, full, kinds, true);
        if (keep && (info.sub != 0 || info.mediaType == MediaType::VirtualDevice ||
                     info.mediaType == MediaType::RaidAssembly))
            continue;
        if (keep) {
            bool present = false;
            for (qsizetype j = 0; j < fresh.size(); ++j) {
                if (!used[j] && SameMedium(info, fresh[j])) {
                    used[j] = true;
                    present = true;
                    break;
                }
            }
            if (present)
                continue;
        }
        // A virtual device still assembled from members stays until they are gone.
        if (info.partStyle == PartStyle::VirtualManager && !d->Members().isEmpty())
            continue;
        TakeDevice(d);
    }

    for (qsizetype j = 0; j < fresh.size(); ++j) {
        DeviceInfo &info = fresh[j];
        // A device whose identity is still listed (its medium changed but the old one could not be
        // removed) is not added twice.
        if (used[j] || !IsIncluded(info, full, kinds, false) ||
            FindDevice(info.number, info.source, info.sub)) {
            delete info.handle;
            info.handle = nullptr;
            continue;
        }
        CDevice *device = MakeDevice(info);
        if (device)
            InsertDevice(device);
    }
    // Dynamic volumes over the disks now listed; those already assembled stay as they are.
    AssembleDynamicVolumes();
    m_refreshed = true;
    StorageEvent(nullptr, _event_storage::EnumerationCompleted);
}

void CRoot::RunDeviceRefresh(CDevice *device)
{
    QMutexLocker serial(&m_secondMutex);
    if (!Devices().contains(device))
        return;
    const DeviceInfo &known = device->GetDescriptor();
    if (known.sub != 0) {
        // An image has no platform identity to check: its tables are read again.
        StorageEvent(device, _event_storage::ChangeStarted);
        RefreshLayout(device, known);
        return;
    }
    EnumCandidate candidate;
    if (!m_source->Resolve(DevicePath(device), candidate)) {
        // The listing no longer names it (unplugged, a loop device detached): the device left.
        TakeDevice(device);
        return;
    }
    StorageEvent(device, _event_storage::ChangeStarted);
    device->Close(true);
    CEnumerator enumerator(this, *m_source);
    DeviceInfo fresh;
    bool found = enumerator.IdentifyWithVolumes(candidate, fresh);
    if (found && SameMedium(known, fresh)) {
        delete fresh.handle;
        // The same medium: the device, and everything that shows it, stays.
        RefreshLayout(device, fresh);
        return;
    }
    StorageEvent(device, _event_storage::ChangeCompleted);
    TakeDevice(device);
    if (found && fresh.totalSectors) {
        CDevice *replacement = MakeDevice(fresh);
        if (replacement)
            InsertDevice(replacement);
        // The dynamic volumes that went with the old medium come back when the new one has them.
        AssembleDynamicVolumes();
    } else if (found) {
        delete fresh.handle;
    }
}

void CRoot::RefreshLayout(CDevice *device, const DeviceInfo &fresh)
{
    // A table written meanwhile brings its partitions in place of the old ones.
    std::unique_ptr<DeviceLayout> layout;
    if (device->GetDescriptor().partStyle != PartStyle::VirtualManager)
        layout = device->ScanLayout(fresh);
    if (layout && !device->HasLayout(*layout))
        ReplaceLayout(device, std::move(layout));
    else
        StorageEvent(device, _event_storage::ChangeCompleted);
}

void CRoot::ReplaceLayout(CDevice *device, std::unique_ptr<DeviceLayout> layout)
{
    auto pending = std::make_shared<std::unique_ptr<DeviceLayout>>(std::move(layout));
    auto apply = [this, device, pending] {
        // A device taken out meanwhile keeps its old layout; the new one goes with `pending`.
        if (!Devices().contains(device) || !IsAnnounced(device))
            return;
        auto volumes = [device](uint32_t code) {
            QList<_event_volume> list;
            device->ForEachVolume([&list, device, code](CPartition *partition, CVolume *volume) {
                list.append(_event_volume{device, partition, volume, code});
            });
            return list;
        };
        for (const _event_volume &v : volumes(_event_volume::VolumeRemoved))
            emit kernelVolume(v);
        const std::unique_ptr<DeviceLayout> previous = device->SwapLayout(std::move(*pending));
        emit kernelStorage(_event_storage{device, _event_storage::ChangeCompleted, 1});
        for (const _event_volume &v : volumes(_event_volume::VolumeAdded))
            emit kernelVolume(v);
    };
    if (QThread::currentThread() == thread())
        apply();
    else
        QMetaObject::invokeMethod(this, apply, Qt::QueuedConnection);
}
