// The interface of one storage device of the kernel: a physical or optical drive, a floppy
// volume, a volume-backed device, an opened disk image, a RAID assembly or a virtual device
// assembled from partitions. Partitions, volumes, templates and the hex editor reach the
// device's sectors only through it.
#pragma once

#include <QString>
#include <QStringList>
#include <cstdint>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cStorage.h"

class cPartition;

class cDevice : public cStorage
{
public:
    StorageKind GetStorageKind() const override { return StorageKind::Device; }

    virtual bool IsReady() const = 0;
    // The platform handle's lost state (false without a handle).
    virtual bool IsLost() const = 0;
    // The platform handle's, else the image handle's writability; false with neither.
    virtual bool IsWritable() = 0;

    // Top-level partitions in table order.
    virtual std::uint32_t GetPartitionCount() const = 0;
    virtual cPartition *GetPartition(std::uint32_t index) const = 0;

    // A free value kept for callers: returns the old value and stores `value` unless it is
    // all bits set (that value only reads).
    virtual std::uint64_t UserValue(std::uint64_t value) = 0;

    virtual std::uint32_t GetPhysicalBytesPerSector() const = 0;

    // Flushes whatever the device writes through (platform, volume and image handles, members).
    using cStorage::Flush;
    virtual bool Flush() = 0;
    // Closes the platform handle, and with `withPartitions` the handles of all partitions.
    virtual bool Close(bool withPartitions) = 0;

    virtual MediaType GetMediaType() const = 0;
    // -1 unknown, 0 solid state, 1 rotating at unknown speed, else revolutions per minute.
    virtual std::int32_t GetRotation() const = 0;
    virtual QString GetModel() const = 0;
    // 0 the serial shown, 1 device control, 2 identify data, 3 management; above 3 empty.
    virtual QString GetSerial(std::uint8_t which) const = 0;
    // Replaces the serial shown.
    virtual void SetSerial(const QString &serial) = 0;

    // Stored geometry; 63 and 255 stand in for values of 0.
    virtual std::uint32_t GetSectorsPerTrack() const = 0;
    virtual std::uint32_t GetTracksPerCylinder() const = 0;
    virtual std::uint64_t GetCylinders() const = 0;

    // Image identity: the sub byte of the descriptor (not 0 for an image-backed device), with
    // the descriptor's source and number and the image's files.
    virtual std::uint8_t GetImageIdentity(std::uint8_t &source, std::uint16_t &number,
                                          QStringList &files) const = 0;
    // The RAID assembly this device represents, or null.
    virtual cStorage *GetRaidIdentity() const = 0;

    virtual PartStyle GetPartStyle() const = 0;

    // ATA identify data (512 bytes); false when no method returned anything but zeros.
    virtual bool ReadIdentify(std::uint8_t *buffer512) = 0;
    // Accessible sectors and the native counts behind a host-protected area and a device
    // configuration overlay (0 where unknown); true when the drive uses 48-bit addressing.
    virtual bool GetNativeSizes(std::uint64_t &accessible, std::uint64_t &hpaNative,
                                std::uint64_t &dcoNative) = 0;
    // Permanent changes of the drive: hide `hidden` sectors at the end behind a host-protected
    // area or a configuration overlay (SetDco with 0 restores the factory overlay).
    virtual bool SetHpa(std::uint64_t hidden) = 0;
    virtual bool SetDco(std::uint64_t hidden) = 0;
};
