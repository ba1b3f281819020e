// The dynamic volumes of a logical-disk-manager disk group (simple, spanned, striped, mirrored and
// RAID-5) assembled from the database records over the dynamic disks that are present. Each volume
// becomes a read-only virtual device of partition style 6 whose sectors come from a RAID assembly
// over the volume's pieces on the member disks.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>

#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Common/cStorage.h"
#include "Kernel/Implementation/Partitions/LdmReader.h"

class CDevice;
class cRoot;

namespace LdmAssembly {

// One dynamic disk that is present: its sectors, the disk GUID of its private header and the
// start of its data area (where the pieces of the volumes are counted from).
struct Disk
{
    cStorage *storage = nullptr;
    CDevice *device = nullptr; // the device behind `storage`, when there is one
    QString diskGuid;
    std::uint64_t dataStart = 0;
    std::uint64_t dataLength = 0;
};

// What the database records say, decoded.
struct Extent // a partition record: one piece of a component on one disk
{
    std::uint64_t id = 0;
    QString name;
    std::uint64_t start = 0;        // sectors from the disk's data area
    std::uint64_t volumeOffset = 0; // sectors from the component's start
    std::uint64_t size = 0;
    std::uint64_t component = 0;
    std::uint64_t disk = 0;
    std::int64_t index = -1; // column of a striped or RAID-5 component, -1 when not given
};

struct Component
{
    std::uint64_t id = 0;
    QString name;
    std::uint8_t arrayType = 0; // 1 striped, 2 concatenated, 3 RAID-5
    std::uint64_t volume = 0;
    std::uint64_t stripe = 0; // sectors
    std::uint64_t columns = 0;
};

struct Database
{
    QList<Component> components;
    QList<Extent> extents;
    QList<QPair<std::uint64_t, QString>> disks;   // disk record id and its GUID text
    QList<QPair<std::uint64_t, QString>> volumes; // volume record id and its name
};

// Decodes the component, partition, disk and volume records; records that do not decode are
// reported through `message` and left out.
Database Decode(const std::vector<Ldm::Record> &records, const std::function<void(const QString &)> &message);

// One assembled volume. `storage` reads the volume's sectors; the pieces it is built of are kept in
// `parts`, so the volume owns everything it reads through except the disks.
struct Volume
{
    std::uint64_t id = 0;
    QString name;
    QString kind;          // "Simple", "Spanned", "Striped", "Mirrored", "RAID-5"
    bool degraded = false; // a member is missing and the volume reads through the others
    std::unique_ptr<cStorage> storage;
    std::vector<std::unique_ptr<cStorage>> parts;
    QList<CDevice *> memberDevices;
};

// Every volume of the database that can be read with the disks present. Volumes that cannot are
// reported through `message` ("Dynamic volume %1 cannot be assembled: %2").
std::vector<std::unique_ptr<Volume>> Assemble(const Database &database, const QList<Disk> &disks,
                                              const std::function<void(const QString &)> &message);

// A read-only virtual device (media type 7, partition style 6) over an assembled volume; the device
// owns the volume and lists the disks it reads through as its members. `number` is the device
// number to give it.
CDevice *MakeDevice(cRoot *root, std::unique_ptr<Volume> volume, std::uint16_t number);

// Reads the database of every device that holds a logical-disk-manager metadata area, groups the
// disks by disk group and assembles the volumes of each group as virtual devices numbered from
// `firstNumber` in group and record order. A volume whose number `listed` answers true for is
// already a device and is not made again (its number stays taken). The devices are not yet added
// to the root; the caller adds them.
QList<CDevice *> AssembleDevices(cRoot *root, const QList<CDevice *> &devices, std::uint16_t firstNumber,
                                 const std::function<void(const QString &)> &message,
                                 const std::function<bool(std::uint16_t number)> &listed = {});

} // namespace LdmAssembly
