// Sector routing, clipping, the write split and the byte-access adapter of CDevice, over an
// in-memory back end that logs every transfer.
#include <gtest/gtest.h>

#include <atomic>
#include <cstring>
#include <memory>
#include <random>
#include <set>
#include <thread>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/DeviceVirtualSource.h"
#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/kernel/Devices/DeviceFakeBackend.h"

namespace {

std::vector<std::uint8_t> pattern(std::size_t size, unsigned seed)
{
    std::vector<std::uint8_t> v(size);
    std::mt19937 rng(seed);
    for (auto &b : v)
        b = std::uint8_t(rng());
    // No boot-record signature: the partition scan leaves the disk alone.
    for (std::size_t s = 0; s + 512 <= size; s += 512)
        v[s + 510] = v[s + 511] = 0;
    return v;
}

class DeviceSectorTest : public ::testing::Test
{
protected:
    DeviceFakeBackend backend;
    std::unique_ptr<CRoot> root;

    void SetUp() override { root = std::make_unique<CRoot>(&backend, nullptr); }
    void TearDown() override { root.reset(); }

    std::unique_ptr<CDevice> makeDevice(std::uint64_t sectors, std::uint8_t shift = 9,
                                        const QString &path = QStringLiteral("/fake/disk"))
    {
        backend.disks[path] = pattern(sectors << shift, 7);
        DeviceInfo info;
        info.handle = new CPlatformFile(root.get(), path, PlatformKind::Device);
        info.totalSectors = sectors;
        info.sectorShift = shift;
        info.physicalSectorShift = shift;
        info.ready = 1;
        info.mediaType = MediaType::Fixed;
        auto d = std::make_unique<CDevice>(root.get(), info);
        backend.log.clear();
        return d;
    }
    const std::vector<std::uint8_t> &disk(const QString &path = QStringLiteral("/fake/disk"))
    {
        return backend.disks[path];
    }
};

TEST_F(DeviceSectorTest, ReadRunningPastTheEndKeepsExistingDataAndZeroesTheRest)
{
    auto d = makeDevice(100);
    std::vector<std::uint8_t> buf(8 * 512, 0xCC);
    std::uint32_t error = 77;
    EXPECT_FALSE(d->ReadSectors(98, 8, buf.data(), error));
    EXPECT_EQ(error, 0u);
    EXPECT_EQ(0, std::memcmp(buf.data(), disk().data() + 98 * 512, 2 * 512));
    EXPECT_TRUE(std::all_of(buf.begin() + 2 * 512, buf.end(), [](std::uint8_t b) { return b == 0; }));
    ASSERT_EQ(backend.Reads().size(), 1u);
    EXPECT_EQ(backend.Reads()[0].pos, 98u * 512);
    EXPECT_EQ(backend.Reads()[0].size, 2u * 512);
}

TEST_F(DeviceSectorTest, FirstSectorAtOrPastTheEndFailsWithoutTransfer)
{
    auto d = makeDevice(100);
    std::vector<std::uint8_t> buf(512);
    std::uint32_t error = 5;
    EXPECT_FALSE(d->ReadSectors(100, 1, buf.data(), error));
    EXPECT_FALSE(d->WriteSectors(1000, 1, buf.data(), error));
    EXPECT_EQ(error, 0u);
    EXPECT_TRUE(backend.log.empty());
    EXPECT_TRUE(d->ReadSectors(99, 0, buf.data(), error));
    EXPECT_TRUE(backend.log.empty());
}

TEST_F(DeviceSectorTest, WholeReadAndWriteGoThroughThePlatformHandle)
{
    auto d = makeDevice(64, 12);
    std::vector<std::uint8_t> buf(3 * 4096);
    std::uint32_t error = 0;
    ASSERT_TRUE(d->ReadSectors(10, 3, buf.data(), error));
    EXPECT_EQ(0, std::memcmp(buf.data(), disk().data() + 10 * 4096, buf.size()));
    std::fill(buf.begin(), buf.end(), 0x5A);
    ASSERT_TRUE(d->WriteSectors(63, 1, buf.data(), error));
    EXPECT_EQ(disk()[63 * 4096 + 100], 0x5A);
    EXPECT_EQ(d->GetSize(), 64u * 4096);
    EXPECT_EQ(d->GetBytesPerSector(), 4096u);
}

TEST_F(DeviceSectorTest, PlatformErrorIsPassedOn)
{
    auto d = makeDevice(16);
    backend.failReadsWith = 23;
    std::vector<std::uint8_t> buf(512);
    std::uint32_t error = 0;
    EXPECT_FALSE(d->ReadSectors(0, 1, buf.data(), error));
    EXPECT_EQ(error, 23u);
}

TEST_F(DeviceSectorTest, DeviceWithoutBackEndFailsWithoutErrorCode)
{
    DeviceInfo info;
    info.totalSectors = 10;
    CDevice d(root.get(), info);
    std::vector<std::uint8_t> buf(512);
    std::uint32_t error = 9;
    EXPECT_FALSE(d.ReadSectors(0, 1, buf.data(), error));
    EXPECT_EQ(error, 0u);
    EXPECT_FALSE(d.IsWritable());
    EXPECT_FALSE(d.IsLost());
    EXPECT_TRUE(d.Flush());
}

TEST_F(DeviceSectorTest, ReadBytesAcrossASectorBoundaryReadsEachSectorOnce)
{
    auto d = makeDevice(100);
    std::uint8_t buf[10];
    std::uint32_t error = 0;
    ASSERT_TRUE(d->ReadBytes(510, 10, buf, error));
    EXPECT_EQ(0, std::memcmp(buf, disk().data() + 510, 10));
    const auto reads = backend.Reads();
    ASSERT_EQ(reads.size(), 2u);
    std::set<std::uint64_t> positions{reads[0].pos, reads[1].pos};
    EXPECT_EQ(positions, (std::set<std::uint64_t>{0, 512}));
    EXPECT_EQ(reads[0].size, 512u);
    EXPECT_EQ(reads[1].size, 512u);
}

TEST_F(DeviceSectorTest, ReadBytesServesHeadTailAndWholeSectorsInThreeReads)
{
    auto d = makeDevice(100);
    std::vector<std::uint8_t> buf(2000);
    std::uint32_t error = 0;
    ASSERT_TRUE(d->ReadBytes(100, 2000, buf.data(), error));
    EXPECT_EQ(0, std::memcmp(buf.data(), disk().data() + 100, 2000));
    const auto reads = backend.Reads();
    ASSERT_EQ(reads.size(), 3u);
    // Head sector 0, last partial sector 4, then sectors 1..3 in one transfer.
    EXPECT_EQ(reads[0].pos, 0u);
    EXPECT_EQ(reads[1].pos, 4u * 512);
    EXPECT_EQ(reads[2].pos, 512u);
    EXPECT_EQ(reads[2].size, 3u * 512);
}

TEST_F(DeviceSectorTest, HeldSectorIsReusedAndDroppedAfterASectorWrite)
{
    auto d = makeDevice(100);
    std::uint8_t b = 0;
    std::uint32_t error = 0;
    ASSERT_TRUE(d->ReadBytes(5, 1, &b, error));
    ASSERT_TRUE(d->ReadBytes(6, 1, &b, error));
    EXPECT_EQ(backend.Reads().size(), 1u);
    std::vector<std::uint8_t> sector(512, 0xAB);
    ASSERT_TRUE(d->WriteSectors(0, 1, sector.data(), error));
    ASSERT_TRUE(d->ReadBytes(6, 1, &b, error));
    EXPECT_EQ(b, 0xAB);
}

TEST_F(DeviceSectorTest, ReadBytesPastTheEndDeliversWhatExists)
{
    auto d = makeDevice(4);
    std::vector<std::uint8_t> buf(600, 0xCC);
    std::uint32_t error = 0;
    EXPECT_FALSE(d->ReadBytes(4 * 512 - 100, 600, buf.data(), error));
    EXPECT_EQ(0, std::memcmp(buf.data(), disk().data() + 4 * 512 - 100, 100));
    EXPECT_TRUE(std::all_of(buf.begin() + 100, buf.end(), [](std::uint8_t x) { return x == 0; }));
    EXPECT_FALSE(d->ReadBytes(4 * 512, 1, buf.data(), error));
    std::uint32_t e2 = 0;
    EXPECT_TRUE(d->ReadBytes(0, 0, buf.data(), e2));
}

TEST_F(DeviceSectorTest, WriteBytesInsideASectorIsReadModifyWrite)
{
    auto d = makeDevice(100);
    const std::vector<std::uint8_t> before = disk();
    const std::uint8_t x = std::uint8_t(before[5] ^ 0xFF);
    std::uint32_t error = 0;
    ASSERT_TRUE(d->WriteBytes(5, 1, &x, error));
    ASSERT_EQ(backend.log.size(), 2u);
    EXPECT_TRUE(backend.log[0].read);
    EXPECT_EQ(backend.log[0].pos, 0u);
    EXPECT_FALSE(backend.log[1].read);
    EXPECT_EQ(backend.log[1].pos, 0u);
    EXPECT_EQ(backend.log[1].size, 512u);
    std::vector<std::uint8_t> expect = before;
    expect[5] = x;
    EXPECT_EQ(disk(), expect);
}

TEST_F(DeviceSectorTest, WriteBytesWithHeadWholeAndTail)
{
    auto d = makeDevice(100);
    std::vector<std::uint8_t> expect = disk();
    std::vector<std::uint8_t> data(1500);
    for (std::size_t i = 0; i < data.size(); ++i)
        data[i] = std::uint8_t(i * 7 + 1);
    std::memcpy(expect.data() + 300, data.data(), data.size());
    std::uint32_t error = 0;
    ASSERT_TRUE(d->WriteBytes(300, data.size(), data.data(), error));
    EXPECT_EQ(disk(), expect);
    // A write past the end changes nothing beyond it and reports failure.
    EXPECT_FALSE(d->WriteBytes(100 * 512 - 2, 4, data.data(), error));
    EXPECT_EQ(disk()[100 * 512 - 1], data[1]);
}

TEST_F(DeviceSectorTest, WriteSplitsThroughTheVolumeHandleOfAPartition)
{
    auto d = makeDevice(100);
    const QString volumePath = QStringLiteral("/fake/volume");
    backend.disks[volumePath] = std::vector<std::uint8_t>(40 * 512, 0);
    CPlatformFile volume(root.get(), volumePath, PlatformKind::Volume);
    auto part = std::make_unique<CPartition>(d.get(), d.get(), nullptr, 7, 20, 40);
    part->SetVolumeHandle(&volume);
    d->Partitions().push_back(std::move(part));

    // Sectors 55..64: 55..59 lie in the volume's area (20..59), 60..64 after it.
    std::vector<std::uint8_t> buf(10 * 512);
    for (std::size_t i = 0; i < buf.size(); ++i)
        buf[i] = std::uint8_t(i / 512 + 1);
    std::uint32_t error = 0;
    ASSERT_TRUE(d->WriteSectors(55, 10, buf.data(), error));
    const auto writes = backend.Writes();
    ASSERT_EQ(writes.size(), 2u);
    EXPECT_EQ(writes[0].path, volumePath);
    EXPECT_EQ(writes[0].pos, 35u * 512);
    EXPECT_EQ(writes[0].size, 5u * 512);
    EXPECT_EQ(writes[1].path, QStringLiteral("/fake/disk"));
    EXPECT_EQ(writes[1].pos, 60u * 512);
    EXPECT_EQ(writes[1].size, 5u * 512);
    EXPECT_EQ(backend.disks[volumePath][35 * 512], 1);
    EXPECT_EQ(disk()[60 * 512], 6);

    // A write before, through and after the area: three parts.
    backend.log.clear();
    ASSERT_TRUE(d->WriteSectors(10, 50 + 10, std::vector<std::uint8_t>(60 * 512, 0x22).data(), error));
    ASSERT_EQ(backend.Writes().size(), 3u);
    EXPECT_EQ(backend.Writes()[0].pos, 10u * 512);
    EXPECT_EQ(backend.Writes()[1].path, volumePath);
    EXPECT_EQ(backend.Writes()[1].size, 40u * 512);
    EXPECT_EQ(backend.Writes()[2].pos, 60u * 512);
    // Reads never take the volume's handle.
    backend.log.clear();
    ASSERT_TRUE(d->ReadSectors(30, 1, buf.data(), error));
    EXPECT_EQ(backend.Reads()[0].path, QStringLiteral("/fake/disk"));
}

TEST_F(DeviceSectorTest, GeometryDefaultsAndUserValue)
{
    DeviceInfo info;
    info.totalSectors = 1000000;
    CDevice d(root.get(), info);
    EXPECT_EQ(d.GetSectorsPerTrack(), 63u);
    EXPECT_EQ(d.GetTracksPerCylinder(), 255u);
    EXPECT_EQ(d.GetCylinders(), 0u);
    info.sectorsPerTrack = 32;
    info.tracksPerCylinder = 16;
    CDevice e(root.get(), info);
    EXPECT_EQ(e.GetCylinders(), 1000000u / 16 / 32);

    EXPECT_EQ(d.UserValue(5), 0xFFFFFFFFFFFFFFFFull);
    EXPECT_EQ(d.UserValue(0xFFFFFFFFFFFFFFFFull), 5u);
    EXPECT_EQ(d.UserValue(7), 5u);
}

TEST_F(DeviceSectorTest, SerialShownFallsBackFromIdentifyToControlToManagement)
{
    DeviceInfo info;
    info.serialManagement = QStringLiteral("M1");
    EXPECT_EQ(CDevice(root.get(), info).GetSerial(0), QStringLiteral("M1"));
    info.serialControl = QStringLiteral("C1");
    CDevice d(root.get(), info);
    EXPECT_EQ(d.GetSerial(0), QStringLiteral("C1"));
    EXPECT_EQ(d.GetSerial(1), QStringLiteral("C1"));
    EXPECT_EQ(d.GetSerial(3), QStringLiteral("M1"));
    EXPECT_EQ(d.GetSerial(4), QString());
    d.SetSerial(QStringLiteral("X"));
    EXPECT_EQ(d.GetSerial(0), QStringLiteral("X"));
}

// A virtual device assembled from two partitions of another device.
TEST_F(DeviceSectorTest, VirtualDeviceReadsAcrossMemberPartitions)
{
    auto member = makeDevice(100);
    DeviceInfo info;
    info.partStyle = PartStyle::VirtualManager;
    info.totalSectors = 30;
    CDevice v(root.get(), info);
    // The partitions of a virtual device are ranges of its own sectors; these two read their
    // sectors from the member at the same numbers.
    auto p0 = std::make_unique<CPartition>(nullptr, member.get(), nullptr, 3, 0, 10);
    auto p1 = std::make_unique<CPartition>(nullptr, member.get(), nullptr, 3, 10, 20);
    v.Partitions().push_back(std::move(p0));
    v.Partitions().push_back(std::move(p1));
    std::vector<std::uint8_t> buf(12 * 512);
    std::uint32_t error = 0;
    ASSERT_TRUE(v.ReadSectors(5, 12, buf.data(), error));
    EXPECT_EQ(0, std::memcmp(buf.data(), disk().data() + 5 * 512, 12 * 512));
    // Past the last partition: no partition holds the sector.
    EXPECT_FALSE(v.ReadSectors(29, 2, buf.data(), error));
}

class MemorySource : public cVirtualSource
{
public:
    std::vector<std::uint8_t> data;
    std::uint64_t ReadUnits(std::uint64_t first, std::uint64_t units, void *buffer) override
    {
        const std::uint64_t off = first * UnitSize;
        if (off >= data.size())
            return 0;
        const std::uint64_t n = std::min<std::uint64_t>(units * UnitSize, data.size() - off);
        std::memcpy(buffer, data.data() + off, n);
        return n;
    }
};

TEST_F(DeviceSectorTest, VirtualSourceServesReadsAndRefusesWrites)
{
    DeviceInfo info;
    info.partStyle = PartStyle::VirtualManager;
    info.totalSectors = 8;
    CDevice v(root.get(), info);
    auto *src = new MemorySource;
    src->data = pattern(6 * 512, 3); // shorter than the device
    v.SetVirtualSource(src);
    std::vector<std::uint8_t> buf(2 * 512);
    std::uint32_t error = 0;
    ASSERT_TRUE(v.ReadSectors(1, 2, buf.data(), error));
    EXPECT_EQ(0, std::memcmp(buf.data(), src->data.data() + 512, 1024));
    EXPECT_FALSE(v.ReadSectors(5, 2, buf.data(), error));
    EXPECT_EQ(error, 2u);
    EXPECT_FALSE(v.WriteSectors(0, 1, buf.data(), error));
    EXPECT_EQ(error, 1u);
}

} // namespace

namespace {

// A sector store that records the requests it serves.
class RecordingStorage : public cStorage
{
public:
    std::vector<std::pair<std::uint64_t, std::uint32_t>> reads, writes;
    StorageKind GetStorageKind() const override { return StorageKind::Raid; }
    QString GetDisplayName() const override { return QStringLiteral("raid"); }
    std::uint64_t GetSize() const override { return 50 * 512; }
    std::uint32_t GetBytesPerSector() const override { return 512; }
    std::uint64_t GetTotalSectors() const override { return 50; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        reads.emplace_back(first, count);
        std::memset(buffer, 0x3C, std::size_t(count) * 512);
        error = 0;
        return true;
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *, std::uint32_t &error) override
    {
        writes.emplace_back(first, count);
        error = 31;
        return false;
    }
    bool ReadBytes(std::uint64_t, std::uint64_t, void *, std::uint32_t &) override { return false; }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &) override { return false; }
};

class RecordingImage : public CImageHandle
{
public:
    explicit RecordingImage(std::vector<std::pair<std::uint64_t, std::uint32_t>> &log)
        : CImageHandle(nullptr, ImageKind::RawImage, 9), m_log(log)
    {
        m_totalSectors = 20;
        m_writable = 1;
    }
    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override
    {
        m_log.emplace_back(first, count);
        if (read)
            std::memset(buffer, 0x77, std::size_t(count) * 512);
        error = 0;
        return true;
    }

private:
    std::vector<std::pair<std::uint64_t, std::uint32_t>> &m_log;
};

TEST_F(DeviceSectorTest, RaidAndImageHandlesServeTheirDevices)
{
    DeviceInfo info;
    info.totalSectors = 50;
    info.mediaType = MediaType::RaidAssembly;
    auto *raid = new RecordingStorage;
    CDevice r(root.get(), info, nullptr, raid);
    EXPECT_EQ(r.GetRaidIdentity(), raid);
    raid->reads.clear(); // the partition scan and the volume's probes
    std::vector<std::uint8_t> buf(4 * 512);
    std::uint32_t error = 0;
    ASSERT_TRUE(r.ReadSectors(48, 2, buf.data(), error));
    EXPECT_FALSE(r.WriteSectors(1, 1, buf.data(), error));
    EXPECT_EQ(error, 31u);
    EXPECT_EQ(raid->reads, (std::vector<std::pair<std::uint64_t, std::uint32_t>>{{48, 2}}));
    EXPECT_EQ(raid->writes.size(), 1u);

    std::vector<std::pair<std::uint64_t, std::uint32_t>> log;
    DeviceInfo imageInfo;
    imageInfo.totalSectors = 20;
    imageInfo.sub = 1;
    CDevice im(root.get(), imageInfo, new RecordingImage(log));
    EXPECT_TRUE(im.IsWritable());
    log.clear();
    EXPECT_FALSE(im.ReadSectors(18, 4, buf.data(), error)); // clipped to 2
    EXPECT_EQ(log, (std::vector<std::pair<std::uint64_t, std::uint32_t>>{{18, 2}}));
    EXPECT_EQ(buf[0], 0x77);
    EXPECT_EQ(buf[3 * 512], 0);
    std::uint8_t source = 9;
    std::uint16_t number = 9;
    QStringList files;
    EXPECT_EQ(im.GetImageIdentity(source, number, files), 1);
    EXPECT_EQ(r.GetImageIdentity(source, number, files), 0);
}

} // namespace

namespace {

TEST_F(DeviceSectorTest, ByteReadsFromSeveralThreadsShareTheSectorBufferSafely)
{
    auto d = makeDevice(64);
    const std::vector<std::uint8_t> expect = disk();
    std::atomic<int> mismatches{0};
    std::vector<std::thread> threads;
    for (unsigned t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            std::mt19937 rng(t);
            std::uint8_t buf[700];
            for (int i = 0; i < 400; ++i) {
                const std::uint64_t off = rng() % (64 * 512 - 700);
                const std::uint64_t len = 1 + rng() % 700;
                std::uint32_t error = 0;
                if (!d->ReadBytes(off, len, buf, error) || std::memcmp(buf, expect.data() + off, len) != 0)
                    ++mismatches;
            }
        });
    }
    for (auto &th : threads)
        th.join();
    EXPECT_EQ(mismatches.load(), 0);
}

} // namespace
