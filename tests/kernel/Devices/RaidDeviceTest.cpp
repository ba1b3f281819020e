// A striped assembly as a device of media type 7: its partition table is scanned through the
// assembly, and sectors of the device and its partitions land on the members by the stripe.
#include <gtest/gtest.h>

#include <memory>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/RaidDevice.h"
#include "Kernel/Implementation/Raid/RaidHandle.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

using namespace RaidTest;

TEST(RaidDevice, StripedAssemblyIsAScannedDevice)
{
    MemStorage a(64), b(64);
    // Assembly sector 0 (member 0, sector 0) holds a boot record with one partition at 16 of 32.
    std::uint8_t *mbr = a.Sector(0);
    mbr[446 + 4] = 0x83;
    mbr[446 + 8] = 16;
    mbr[446 + 12] = 32;
    mbr[510] = 0x55;
    mbr[511] = 0xAA;
    // Assembly sector 16 is chunk 2: member 0, row 1.
    FillSector(a.Sector(8), 16);

    std::uint64_t total = 0;
    auto handle = std::make_unique<CRaidHandle>(
        0, 0, 3, QList<cStorage *>{&a, &b}, QList<std::uint64_t>{0, 0},
        QList<std::uint64_t>{cStorage::NoSector, cStorage::NoSector}, 512, 8, total);
    ASSERT_EQ(total, 128u);
    CRaidHandle *raw = handle.get();
    std::unique_ptr<CDevice> device(RaidDevice::Make(nullptr, std::move(handle), 7, "Array"));
    ASSERT_TRUE(device);
    EXPECT_EQ(device->GetMediaType(), MediaType::RaidAssembly);
    EXPECT_EQ(device->GetRaidIdentity(), raw);
    EXPECT_EQ(device->GetTotalSectors(), 128u);
    EXPECT_EQ(device->GetPartStyle(), PartStyle::Mbr);
    EXPECT_TRUE(device->GetAttributes() & DeviceAttribute::Raid);

    CPartition *part = nullptr;
    for (std::uint32_t i = 0; i < device->GetPartitionCount(); ++i)
        if (device->GetPartition(i)->GetKind() != 0)
            part = device->GetPartition(i);
    ASSERT_TRUE(part);
    EXPECT_EQ(part->GetStart(), 16u);
    QByteArray sector(512, '\0');
    std::uint32_t error = 0;
    EXPECT_TRUE(part->ReadSectors(0, 1, sector.data(), error));
    EXPECT_EQ(sector, ExpectedSectors(16, 1));

    // Device sector 9 is chunk 1, offset 1: member 1, sector 1.
    QByteArray data(512, '\x5A');
    EXPECT_TRUE(device->WriteSectors(9, 1, data.constData(), error));
    EXPECT_EQ(b.Data().mid(512, 512), data);

    // An assembly that is not valid makes no device.
    auto invalid = std::make_unique<CRaidHandle>(0, 0, 3, QList<cStorage *>{&a}, QList<std::uint64_t>{0},
                                                 QList<std::uint64_t>{cStorage::NoSector}, 512, 8, total);
    EXPECT_EQ(RaidDevice::Make(nullptr, std::move(invalid), 8), nullptr);
}
