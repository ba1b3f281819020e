// Device-control codes and the layouts of their requests and answers. The kernel above the back end
// speaks these codes and layouts on every platform; a back end answers them from its own system.
// All structures are little-endian and packed to the byte layout given in the size checks.
#pragma once

#include <cstdint>

namespace DeviceControl {

// Codes.
inline constexpr uint32_t IOCTL_DISK_GET_DRIVE_GEOMETRY = 0x00070000;
inline constexpr uint32_t IOCTL_DISK_IS_WRITABLE = 0x00070024;
inline constexpr uint32_t IOCTL_DISK_GET_PARTITION_INFO_EX = 0x00070048;
inline constexpr uint32_t IOCTL_DISK_GET_DRIVE_LAYOUT_EX = 0x00070050;
inline constexpr uint32_t IOCTL_DISK_GET_DRIVE_GEOMETRY_EX = 0x000700A0;
inline constexpr uint32_t IOCTL_DISK_UPDATE_PROPERTIES = 0x00070140;
inline constexpr uint32_t IOCTL_DISK_GET_PARTITION_INFO = 0x00074004;
inline constexpr uint32_t IOCTL_DISK_GET_LENGTH_INFO = 0x0007405C;
inline constexpr uint32_t SMART_GET_VERSION = 0x00074080;
inline constexpr uint32_t SMART_SEND_DRIVE_COMMAND = 0x0007C084;
inline constexpr uint32_t SMART_RCV_DRIVE_DATA = 0x0007C088;
inline constexpr uint32_t IOCTL_STORAGE_GET_DEVICE_NUMBER = 0x002D1080;
inline constexpr uint32_t IOCTL_STORAGE_QUERY_PROPERTY = 0x002D1400;
inline constexpr uint32_t IOCTL_SCSI_PASS_THROUGH = 0x0004D004;
inline constexpr uint32_t IOCTL_SCSI_PASS_THROUGH_DIRECT = 0x0004D014;
inline constexpr uint32_t IOCTL_ATA_PASS_THROUGH = 0x0004D02C;
inline constexpr uint32_t IOCTL_VOLUME_GET_VOLUME_DISK_EXTENTS = 0x00560000;
inline constexpr uint32_t FSCTL_LOCK_VOLUME = 0x00090018;
inline constexpr uint32_t FSCTL_UNLOCK_VOLUME = 0x0009001C;
inline constexpr uint32_t FSCTL_DISMOUNT_VOLUME = 0x00090020;
inline constexpr uint32_t FSCTL_ALLOW_EXTENDED_DASD_IO = 0x00090083;

// Media types of DISK_GEOMETRY.
inline constexpr uint32_t RemovableMedia = 11;
inline constexpr uint32_t FixedMedia = 12;

// Partition styles.
inline constexpr uint32_t PARTITION_STYLE_MBR = 0;
inline constexpr uint32_t PARTITION_STYLE_GPT = 1;
inline constexpr uint32_t PARTITION_STYLE_RAW = 2;

// Storage property ids and query types of IOCTL_STORAGE_QUERY_PROPERTY.
inline constexpr uint32_t StorageDeviceProperty = 0;
inline constexpr uint32_t StorageAccessAlignmentProperty = 6;
inline constexpr uint32_t StorageDeviceSeekPenaltyProperty = 7;
inline constexpr uint32_t PropertyStandardQuery = 0;

// Bus types of STORAGE_DEVICE_DESCRIPTOR.
inline constexpr uint32_t BusTypeUnknown = 0;
inline constexpr uint32_t BusTypeScsi = 1;
inline constexpr uint32_t BusTypeAtapi = 2;
inline constexpr uint32_t BusTypeAta = 3;
inline constexpr uint32_t BusTypeUsb = 7;
inline constexpr uint32_t BusTypeSata = 11;
inline constexpr uint32_t BusTypeSd = 12;
inline constexpr uint32_t BusTypeMmc = 13;
inline constexpr uint32_t BusTypeVirtual = 14;
inline constexpr uint32_t BusTypeFileBackedVirtual = 15;
inline constexpr uint32_t BusTypeNvme = 17;

// Device types of STORAGE_DEVICE_NUMBER.
inline constexpr uint32_t FILE_DEVICE_CD_ROM = 0x02;
inline constexpr uint32_t FILE_DEVICE_DISK = 0x07;

// ATA_PASS_THROUGH_EX flags.
inline constexpr uint16_t ATA_FLAGS_DRDY_REQUIRED = 0x01;
inline constexpr uint16_t ATA_FLAGS_DATA_IN = 0x02;
inline constexpr uint16_t ATA_FLAGS_DATA_OUT = 0x04;
inline constexpr uint16_t ATA_FLAGS_48BIT_COMMAND = 0x08;

#pragma pack(push, 1)

struct Guid
{
    uint32_t data1;
    uint16_t data2;
    uint16_t data3;
    uint8_t data4[8];
};
static_assert(sizeof(Guid) == 16);

struct DISK_GEOMETRY
{
    int64_t Cylinders;
    uint32_t MediaType;
    uint32_t TracksPerCylinder;
    uint32_t SectorsPerTrack;
    uint32_t BytesPerSector;
};
static_assert(sizeof(DISK_GEOMETRY) == 24);

struct DISK_GEOMETRY_EX
{
    DISK_GEOMETRY Geometry;
    int64_t DiskSize;
};
static_assert(sizeof(DISK_GEOMETRY_EX) == 32);

struct GET_LENGTH_INFORMATION
{
    int64_t Length;
};

// The old partition query (IOCTL_DISK_GET_PARTITION_INFO).
struct PARTITION_INFORMATION
{
    int64_t StartingOffset;
    int64_t PartitionLength;
    uint32_t HiddenSectors;
    uint32_t PartitionNumber;
    uint8_t PartitionType;
    uint8_t BootIndicator;
    uint8_t RecognizedPartition;
    uint8_t RewritePartition;
    uint8_t pad[4];
};
static_assert(sizeof(PARTITION_INFORMATION) == 32);

struct PARTITION_INFORMATION_MBR
{
    uint8_t PartitionType;
    uint8_t BootIndicator;
    uint8_t RecognizedPartition;
    uint8_t pad;
    uint32_t HiddenSectors;
    Guid PartitionId;
};

struct PARTITION_INFORMATION_GPT
{
    Guid PartitionType;
    Guid PartitionId;
    uint64_t Attributes;
    char16_t Name[36];
};
static_assert(sizeof(PARTITION_INFORMATION_GPT) == 112);

struct PARTITION_INFORMATION_EX
{
    uint32_t PartitionStyle;
    uint32_t pad0;
    int64_t StartingOffset;
    int64_t PartitionLength;
    uint32_t PartitionNumber;
    uint8_t RewritePartition;
    uint8_t IsServicePartition;
    uint8_t pad1[2];
    union {
        PARTITION_INFORMATION_MBR Mbr;
        PARTITION_INFORMATION_GPT Gpt;
    };
};
static_assert(sizeof(PARTITION_INFORMATION_EX) == 144);

struct DRIVE_LAYOUT_INFORMATION_MBR
{
    uint32_t Signature;
    uint32_t CheckSum;
};

struct DRIVE_LAYOUT_INFORMATION_GPT
{
    Guid DiskId;
    int64_t StartingUsableOffset;
    int64_t UsableLength;
    uint32_t MaxPartitionCount;
    uint32_t pad;
};
static_assert(sizeof(DRIVE_LAYOUT_INFORMATION_GPT) == 40);

// Header of the drive layout; PartitionCount entries of PARTITION_INFORMATION_EX follow it.
struct DRIVE_LAYOUT_INFORMATION_EX
{
    uint32_t PartitionStyle;
    uint32_t PartitionCount;
    union {
        DRIVE_LAYOUT_INFORMATION_MBR Mbr;
        DRIVE_LAYOUT_INFORMATION_GPT Gpt;
    };
};
static_assert(sizeof(DRIVE_LAYOUT_INFORMATION_EX) == 48);

struct STORAGE_DEVICE_NUMBER
{
    uint32_t DeviceType;
    uint32_t DeviceNumber;
    uint32_t PartitionNumber;
};

struct DISK_EXTENT
{
    uint32_t DiskNumber;
    uint32_t pad;
    int64_t StartingOffset;
    int64_t ExtentLength;
};
static_assert(sizeof(DISK_EXTENT) == 24);

// Header of the disk extents; NumberOfDiskExtents entries follow it at offset 8.
struct VOLUME_DISK_EXTENTS
{
    uint32_t NumberOfDiskExtents;
    uint32_t pad;
};

struct STORAGE_PROPERTY_QUERY
{
    uint32_t PropertyId;
    uint32_t QueryType;
    uint8_t AdditionalParameters[1];
    uint8_t pad[3];
};
static_assert(sizeof(STORAGE_PROPERTY_QUERY) == 12);

// Texts follow the descriptor; their offsets count from the start of the descriptor (0: none).
struct STORAGE_DEVICE_DESCRIPTOR
{
    uint32_t Version;
    uint32_t Size;
    uint8_t DeviceType;
    uint8_t DeviceTypeModifier;
    uint8_t RemovableMedia;
    uint8_t CommandQueueing;
    uint32_t VendorIdOffset;
    uint32_t ProductIdOffset;
    uint32_t ProductRevisionOffset;
    uint32_t SerialNumberOffset;
    uint32_t BusType;
    uint32_t RawPropertiesLength;
    uint8_t RawDeviceProperties[1];
    uint8_t pad[3];
};
static_assert(sizeof(STORAGE_DEVICE_DESCRIPTOR) == 40);

struct STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR
{
    uint32_t Version;
    uint32_t Size;
    uint32_t BytesPerCacheLine;
    uint32_t BytesOffsetForCacheAlignment;
    uint32_t BytesPerLogicalSector;
    uint32_t BytesPerPhysicalSector;
    uint32_t BytesOffsetForSectorAlignment;
};
static_assert(sizeof(STORAGE_ACCESS_ALIGNMENT_DESCRIPTOR) == 28);

struct DEVICE_SEEK_PENALTY_DESCRIPTOR
{
    uint32_t Version;
    uint32_t Size;
    uint8_t IncursSeekPenalty;
    uint8_t pad[3];
};
static_assert(sizeof(DEVICE_SEEK_PENALTY_DESCRIPTOR) == 12);

// The 48-byte request header of IOCTL_ATA_PASS_THROUGH (the 64-bit layout); the data buffer follows
// at DataBufferOffset (48 for the 560-byte request). Registers: [0] features, [1] sector count,
// [2] LBA low, [3] LBA mid, [4] LBA high, [5] device, [6] command (status on return), [7] reserved.
struct ATA_PASS_THROUGH_EX
{
    uint16_t Length;
    uint16_t AtaFlags;
    uint8_t PathId;
    uint8_t TargetId;
    uint8_t Lun;
    uint8_t ReservedAsUchar;
    uint32_t DataTransferLength;
    uint32_t TimeOutValue;
    uint32_t ReservedAsUlong;
    uint32_t pad;
    uint64_t DataBufferOffset;
    uint8_t PreviousTaskFile[8];
    uint8_t CurrentTaskFile[8];
};
static_assert(sizeof(ATA_PASS_THROUGH_EX) == 48);

// IOCTL_SCSI_PASS_THROUGH (buffered: the data lies in the request at DataBufferOffset) and
// IOCTL_SCSI_PASS_THROUGH_DIRECT (DataBuffer is the address of the caller's data), the 64-bit layout.
struct SCSI_PASS_THROUGH
{
    uint16_t Length;
    uint8_t ScsiStatus;
    uint8_t PathId;
    uint8_t TargetId;
    uint8_t Lun;
    uint8_t CdbLength;
    uint8_t SenseInfoLength;
    uint8_t DataIn; // 0 out, 1 in, 2 none
    uint8_t pad0[3];
    uint32_t DataTransferLength;
    uint32_t TimeOutValue;
    uint32_t pad1;
    uint64_t DataBufferOffset; // the data's address for the direct form
    uint32_t SenseInfoOffset;
    uint8_t Cdb[16];
    uint8_t pad2[4];
};
static_assert(sizeof(SCSI_PASS_THROUGH) == 56);

inline constexpr uint8_t SCSI_IOCTL_DATA_OUT = 0;
inline constexpr uint8_t SCSI_IOCTL_DATA_IN = 1;
inline constexpr uint8_t SCSI_IOCTL_DATA_UNSPECIFIED = 2;

// SMART_GET_VERSION answer.
struct GETVERSIONINPARAMS
{
    uint8_t bVersion;
    uint8_t bRevision;
    uint8_t bReserved;
    uint8_t bIDEDeviceMap;
    uint32_t fCapabilities;
    uint32_t dwReserved[4];
};
static_assert(sizeof(GETVERSIONINPARAMS) == 24);

// Registers of a SMART request: features, sector count, LBA low, mid, high, device, command.
struct IDEREGS
{
    uint8_t bFeaturesReg;
    uint8_t bSectorCountReg;
    uint8_t bSectorNumberReg;
    uint8_t bCylLowReg;
    uint8_t bCylHighReg;
    uint8_t bDriveHeadReg;
    uint8_t bCommandReg;
    uint8_t bReserved;
};

// SMART_RCV_DRIVE_DATA / SMART_SEND_DRIVE_COMMAND request (32 bytes before the buffer).
struct SENDCMDINPARAMS
{
    uint32_t cBufferSize;
    IDEREGS irDriveRegs;
    uint8_t bDriveNumber;
    uint8_t bReserved[3];
    uint32_t dwReserved[4];
};
static_assert(sizeof(SENDCMDINPARAMS) == 32);

// SMART answer: 16 bytes, then the 512-byte sector of data commands.
struct SENDCMDOUTPARAMS
{
    uint32_t cBufferSize;
    uint8_t bDriverError;
    uint8_t bIDEError;
    uint8_t bReserved[2];
    uint32_t dwReserved[2];
};
static_assert(sizeof(SENDCMDOUTPARAMS) == 16);

#pragma pack(pop)

} // namespace DeviceControl
