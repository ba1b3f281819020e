#include "hexeditor/StorageFactory.h"

#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "hexeditor/StorageDevice.h"
#include "hexeditor/StorageFile.h"
#include "hexeditor/StoragePartition.h"
#include "hexeditor/StoragePlainFile.h"
#include "hexeditor/StorageVolume.h"

namespace HexEditor {

std::unique_ptr<Storage> createStorage(cStorage *object, QObject *parent)
{
    if (!object)
        return nullptr;
    switch (object->GetStorageKind()) {
    case StorageKind::Device:
        if (auto *device = dynamic_cast<cDevice *>(object))
            return std::make_unique<StorageDevice>(device, parent);
        break;
    case StorageKind::Partition: {
        auto *partition = dynamic_cast<CPartition *>(object);
        return createPartitionStorage(object, partition ? partition->Volume() : nullptr, parent);
    }
    case StorageKind::Volume:
        if (auto *volume = dynamic_cast<CVolume *>(object))
            return std::make_unique<StorageVolume>(volume, parent);
        break;
    case StorageKind::Entry:
        if (auto *entry = dynamic_cast<CEntry *>(object))
            return std::make_unique<StorageFile>(entry, parent);
        break;
    default:
        break;
    }
    // Anything else that holds sectors is shown as it is.
    return std::make_unique<Storage>(object, parent);
}

std::unique_ptr<Storage> createPartitionStorage(cStorage *partition, CVolume *volume, QObject *parent)
{
    auto *p = dynamic_cast<cPartition *>(partition);
    if (!p)
        return nullptr;
    return std::make_unique<StoragePartition>(p, volume, parent);
}

std::unique_ptr<Storage> createPlainFileStorage(const QString &path, cRoot *root, QString &error,
                                                QObject *parent)
{
    auto storage = std::make_unique<StoragePlainFile>(path, root, parent);
    if (!storage->isOpen()) {
        error = storage->openError();
        return nullptr;
    }
    error.clear();
    return storage;
}

} // namespace HexEditor
