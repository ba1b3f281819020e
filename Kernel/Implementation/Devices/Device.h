// One storage device of the kernel, built from an enumeration descriptor. It owns its
// partitions and routes every sector request to what backs it: a RAID assembly, an image
// handle, the platform handle (with writes into a volume's area going through that volume's
// own handle), the volume behind a volume-backed device, or the members of a virtual device.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>
#include <cstdint>
#include <functional>
#include <memory>
#include <vector>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/Devices/DeviceByteAccess.h"
#include "Kernel/Implementation/Partitions/Partition.h"

class cRoot;
class CImageHandle;
namespace Ata {
struct Command;
}
class CPlatformFile;
class cVirtualSource;
class CVolume;

// A partition layout read from a device: the style, the top-level partitions with their volumes,
// or the volume over the whole device when there are none.
struct DeviceLayout
{
    PartStyle partStyle = PartStyle::Raw;
    std::uint32_t diskSignature = 0;
    QList<VolumeInfo> volumes;
    std::vector<std::unique_ptr<CPartition>> partitions;
    std::unique_ptr<CVolume> volume;
    ~DeviceLayout();
};

class CDevice : public cDevice
{
public:
    // The device takes ownership of `image` and `raid` (either may be null) and of the
    // descriptor's platform handle.
    CDevice(cRoot *root, const DeviceInfo &info, CImageHandle *image = nullptr, cStorage *raid = nullptr);
    ~CDevice() override;

    // cStorage
    QString GetDisplayName() const override;
    std::uint64_t GetSize() const override;
    std::uint32_t GetBytesPerSector() const override;
    std::uint64_t GetTotalSectors() const override;
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override;
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override;
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override;
    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override;
    bool Flush(std::uint32_t &error) override;

    // cDevice
    bool IsReady() const override;
    bool IsLost() const override;
    bool IsWritable() override;
    std::uint32_t GetPartitionCount() const override;
    CPartition *GetPartition(std::uint32_t index) const override;
    std::uint64_t UserValue(std::uint64_t value) override;
    std::uint32_t GetPhysicalBytesPerSector() const override;
    bool Flush() override;
    bool Close(bool withPartitions) override;
    MediaType GetMediaType() const override;
    std::int32_t GetRotation() const override;
    QString GetModel() const override;
    QString GetSerial(std::uint8_t which) const override;
    void SetSerial(const QString &serial) override;
    std::uint32_t GetSectorsPerTrack() const override;
    std::uint32_t GetTracksPerCylinder() const override;
    std::uint64_t GetCylinders() const override;
    std::uint8_t GetImageIdentity(std::uint8_t &source, std::uint16_t &number,
                                  QStringList &files) const override;
    cStorage *GetRaidIdentity() const override;
    PartStyle GetPartStyle() const override;
    bool ReadIdentify(std::uint8_t *buffer512) override;
    bool GetNativeSizes(std::uint64_t &accessible, std::uint64_t &hpaNative,
                        std::uint64_t &dcoNative) override;
    bool SetHpa(std::uint64_t hidden) override;
    bool SetDco(std::uint64_t hidden) override;

    // The rest of the device's state, for the kernel root, the partition scan and the
    // image and RAID layers.
    cRoot *GetRoot() const { return m_root; }
    const DeviceInfo &GetDescriptor() const { return m_info; }
    CPlatformFile *GetHandle() const { return m_info.handle; }
    CImageHandle *GetImageHandle() const { return m_image; }
    QString GetFirmware() const { return m_info.firmware; }
    std::uint8_t GetAnnounced() const { return m_announced; }
    void SetAnnounced(std::uint8_t announced) { m_announced = announced; }
    std::uint32_t GetAttributes() const { return m_attributes; }
    void SetAttributes(std::uint32_t attributes) { m_attributes = attributes; }
    void SetPartStyle(PartStyle style) { m_info.partStyle = style; }
    std::uint32_t GetDiskSignature() const { return m_diskSignature; }
    void SetDiskSignature(std::uint32_t signature) { m_diskSignature = signature; }
    CPartMan *GetPartMan() const { return m_partMan.get(); }

    // The volume over the whole device when it has no partitions (a disk or image without a
    // table, a dynamic volume); null when it has partitions, whose volumes they own
    // (`CPartition::Volume`). Made at construction, replaced only with the whole layout
    // (SwapLayout), destroyed first.
    CVolume *Volume() const { return m_volume.get(); }
    // Every volume of the device with the partition it lies on (null for the whole-device one):
    // the whole-device volume, then the partitions' in table order, children after their parent.
    void ForEachVolume(const std::function<void(CPartition *, CVolume *)> &visit) const;

    // Reads the partition tables and volumes again (reads only; the device's own layout is
    // untouched), with the platform facts of `fresh` (its partition style and mounted volumes).
    std::unique_ptr<DeviceLayout> ScanLayout(const DeviceInfo &fresh);
    // Whether `layout` describes what the device holds: style, signature, and for every partition
    // its kind, place, entry, children and the kind, label and serial of its volume.
    bool HasLayout(const DeviceLayout &layout) const;
    // Puts `layout` in place of the device's partitions and volume and gives back the previous ones,
    // which the caller destroys once nothing refers to them any more.
    std::unique_ptr<DeviceLayout> SwapLayout(std::unique_ptr<DeviceLayout> layout);

    // The top-level partitions, filled by the partition scan at construction.
    std::vector<std::unique_ptr<CPartition>> &Partitions() { return m_partitions; }
    const std::vector<std::unique_ptr<CPartition>> &Partitions() const { return m_partitions; }

    // A virtual device (partition style 6) not assembled from partitions reads through a
    // source in 512-byte units; the device takes ownership. Its volume is made then, once.
    void SetVirtualSource(cVirtualSource *source);
    // Devices a virtual device is assembled from (not owned).
    QList<CDevice *> &Members() { return m_members; }

private:
    bool Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                  std::uint32_t &error);
    bool TransferVirtual(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                         std::uint32_t &error);
    bool TransferBackingVolume(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                               std::uint32_t &error);
    bool WriteSplit(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer, std::uint32_t &error,
                    bool &handled);
    bool TransferPlatform(CPlatformFile *handle, bool read, std::uint64_t offset, std::uint64_t length,
                          std::uint8_t *buffer, std::uint32_t &error);

    // One ATA command through the platform's pass-through: `data` is the 512-byte buffer sent
    // or filled (may be null for commands without data); `address` receives the answer's LBA.
    bool RunAta(const Ata::Command &command, std::uint8_t *data, std::uint64_t *address);
    bool ReadHpaNative(bool uses48, std::uint64_t &native);
    bool ReadDco(std::uint8_t *dco);

    // Runs the partition-table scan of a new device.
    void ScanPartitionTables();
    // Makes the volume of every partition (children included) or of the whole device. Reads only.
    void CreateVolumes();
    // Reads model, firmware and serial again from the drive and chooses the serial shown.
    void ReadIdentityStrings();
    void Internal(const QString &text) const;

    cRoot *m_root = nullptr;
    std::uint8_t m_announced = 0;
    std::uint64_t m_userValue = 0xFFFFFFFFFFFFFFFFull;
    DeviceInfo m_info;
    std::vector<std::unique_ptr<CPartition>> m_partitions;
    std::unique_ptr<CVolume> m_volume;
    CByteAccess m_bytes;
    std::unique_ptr<CPartMan> m_partMan;
    CImageHandle *m_image = nullptr;
    std::unique_ptr<cStorage> m_raid;
    std::unique_ptr<cVirtualSource> m_virtual;
    QList<CDevice *> m_members;
    std::uint32_t m_attributes = 0;
    std::uint32_t m_diskSignature = 0;
};
