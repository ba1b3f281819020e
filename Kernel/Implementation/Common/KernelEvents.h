// Payloads of the kernel root's signals. Each is registered with the meta-type system by cRoot so it
// crosses threads through queued connections.
#pragma once

#include <QMetaType>
#include <QString>
#include <QStringList>

#include <cstdint>

class CDevice;
class CPartition;
class CVolume;

// A trace record of the kernel (level 1 error .. 4 verbose; 2 opening, 3 closing of handles).
struct _event_debug
{
    QString file;
    uint32_t line = 0;
    uint32_t level = 0;
    QString text;
};

// A misuse of a kernel object by its caller; the text begins with "Attempt".
struct _event_internal
{
    QString text;
};

// A failed operating-system call: operation code (PlatformOperation), handle name, position and block
// size of the transfer (0 where not meaningful) and the system error code.
struct _event_platform
{
    uint32_t operation = 0;
    QString name;
    uint64_t position = 0;
    uint64_t block = 0;
    uint32_t error = 0;
};

// Storage events: 0 enumeration started (null device), 1 device added, 2 change started,
// 3 change completed, 4 device removed, 5 enumeration completed (null device). Event 3 with flag 1:
// the device stayed but its partitions and volumes were replaced by a new layout read from it.
struct _event_storage
{
    enum Code : uint32_t {
        EnumerationStarted = 0,
        DeviceAdded = 1,
        ChangeStarted = 2,
        ChangeCompleted = 3,
        DeviceRemoved = 4,
        EnumerationCompleted = 5,
    };
    CDevice *device = nullptr;
    uint32_t code = 0;
    uint8_t flag = 0;
};

// The file-system volumes of a device, announced by the kernel root through `kernelVolume`: code 1
// for each volume of a device right after the device's own event 1 (the whole-device volume first,
// then the partitions' in table order, a partition's children after it), code 4 for each of them
// right before the device's event 4. The device builds and owns its volumes before it is listed and
// destroys them with itself, so a volume stays valid until its code 4 has been delivered; after that
// it must not be used. A layout replaced in place sends code 4 for the old volumes before its event 3
// and code 1 for the new ones after it. `partition` is null for the volume over a whole device without partitions.
struct _event_volume
{
    enum Code : uint32_t {
        VolumeAdded = 1,
        VolumeRemoved = 4,
    };
    CDevice *device = nullptr;
    CPartition *partition = nullptr;
    CVolume *volume = nullptr;
    uint32_t code = 0;
};

// A volume is being locked or unlocked by a long operation. Content follows with volume locking.
struct _event_volumelocking
{
    QString name;
    uint32_t state = 0;
};

// A question to the application (passed by reference: the receiver fills in the answer).
// Content follows with the processing framework.
struct _event_action
{
    uint32_t code = 0;
    QString text;
    uint32_t answer = 0;
};

// A text request (passed by reference: the receiver fills in the text). Content follows later.
struct _event_string
{
    uint32_t code = 0;
    QString text;
};

// Progress of a long operation: current and total units and a status text.
struct _event_progress
{
    uint32_t operation = 0;
    uint64_t current = 0;
    uint64_t total = 0;
    QString text;
};

// A found item of a search (passed by reference). Content follows with the search operations.
struct _event_finddata
{
    uint32_t code = 0;
    uint64_t position = 0;
    QString text;
};

// Progress of a volume scan. Content follows with the scan.
struct _event_scanvolume
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

// Erase and recovery operations. Content follows with those operations.
struct _event_erasedevice
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};
struct _event_erasefreespace
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};
struct _event_recoverentries
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};
struct _event_recoverpartitions
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

// A found entry of an entry search. Content follows with the search.
struct _event_searchentry
{
    uint32_t state = 0;
    QString text;
};

// Progress of image creation and verification. Content follows with the image workers.
struct _event_createimage
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};
struct _event_checkimage
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

// Progress of a device scan. Content follows with the scan.
struct _event_scandevice
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

// Progress of a volume resize. Content follows with the resize operation.
struct _event_resizevolume
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

// Progress of a readability check. Content follows with the check.
struct _event_checkreadable
{
    uint32_t state = 0;
    uint64_t current = 0;
    uint64_t total = 0;
};

Q_DECLARE_METATYPE(_event_debug)
Q_DECLARE_METATYPE(_event_internal)
Q_DECLARE_METATYPE(_event_platform)
Q_DECLARE_METATYPE(_event_storage)
Q_DECLARE_METATYPE(_event_volume)
Q_DECLARE_METATYPE(_event_volumelocking)
Q_DECLARE_METATYPE(_event_action)
Q_DECLARE_METATYPE(_event_string)
Q_DECLARE_METATYPE(_event_progress)
Q_DECLARE_METATYPE(_event_finddata)
Q_DECLARE_METATYPE(_event_scanvolume)
Q_DECLARE_METATYPE(_event_erasedevice)
Q_DECLARE_METATYPE(_event_erasefreespace)
Q_DECLARE_METATYPE(_event_recoverentries)
Q_DECLARE_METATYPE(_event_recoverpartitions)
Q_DECLARE_METATYPE(_event_searchentry)
Q_DECLARE_METATYPE(_event_createimage)
Q_DECLARE_METATYPE(_event_checkimage)
Q_DECLARE_METATYPE(_event_scandevice)
Q_DECLARE_METATYPE(_event_resizevolume)
Q_DECLARE_METATYPE(_event_checkreadable)
