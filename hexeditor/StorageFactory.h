// Makes the storage that fits a kernel object: a device, a partition, a volume or a file entry of
// a volume; or a plain file of the computer through the platform file.
#pragma once

#include <QObject>
#include <QString>

#include <memory>

#include "hexeditor/Storage.h"

class cRoot;
class CVolume;

namespace HexEditor {

// StorageDevice, StoragePartition (with the partition's own volume), StorageVolume or StorageFile
// by the object's kind. Null for no object. createPartitionStorage names the volume itself.
std::unique_ptr<Storage> createStorage(cStorage *object, QObject *parent = nullptr);
std::unique_ptr<Storage> createPartitionStorage(cStorage *partition, CVolume *volume,
                                                QObject *parent = nullptr);

// A plain file opened read-only through the platform file (written only by save()). Null with a
// reason when it cannot be opened.
std::unique_ptr<Storage> createPlainFileStorage(const QString &path, cRoot *root, QString &error,
                                                QObject *parent = nullptr);

} // namespace HexEditor
