// CDevice over real loop devices attached to image files made here: bytes read through the
// device equal the image's bytes at every offset, for 512- and 4096-byte sectors.
#include <gtest/gtest.h>

#include <QTemporaryDir>
#include <cstring>
#include <memory>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/common/TestUtil.h"

namespace {

class DeviceLoopTest : public ::testing::TestWithParam<unsigned>
{
};

TEST_P(DeviceLoopTest, ReadBytesEqualsTheImageAtManyOffsets)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    const unsigned ss = GetParam();
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    const QByteArray data = TestUtil::randomBytes(int(64 * ss + 0), 11 + ss);
    ASSERT_TRUE(TestUtil::writeFile(image, data));
    TestUtil::LoopDevice loop(image, {"-b", QString::number(ss)});
    ASSERT_FALSE(loop.Device().isEmpty()) << "losetup failed";

    CRoot root;
    DeviceInfo info;
    info.handle = new CPlatformFile(&root, loop.Device(), PlatformKind::Device);
    info.source = EnumSource::VolumeBacked;
    info.totalSectors = std::uint64_t(data.size()) / ss;
    info.sectorShift = std::uint8_t(ss == 4096 ? 12 : 9);
    info.physicalSectorShift = info.sectorShift;
    info.ready = 1;
    CDevice device(&root, info);
    ASSERT_EQ(device.GetSize(), std::uint64_t(data.size()));

    const std::uint64_t size = std::uint64_t(data.size());
    const std::uint64_t offsets[] = {0,         1,         ss - 1,  ss, ss + 7, 3 * ss - 5, size / 2 + 3,
                                     size - ss, size - 10, size - 1};
    const std::uint64_t lengths[] = {1, 10, ss - 1, ss, ss + 1, 2 * ss + 3, 5 * ss};
    std::vector<char> buf;
    for (std::uint64_t off : offsets) {
        for (std::uint64_t len : lengths) {
            buf.assign(std::size_t(len), char(0x55));
            std::uint32_t error = 0;
            const bool ok = device.ReadBytes(off, len, buf.data(), error);
            const std::uint64_t exist = std::min(len, size - off);
            EXPECT_EQ(ok, exist == len) << off << "+" << len;
            EXPECT_EQ(0, std::memcmp(buf.data(), data.constData() + off, std::size_t(exist)))
                << off << "+" << len;
            for (std::uint64_t i = exist; i < len; ++i)
                ASSERT_EQ(buf[std::size_t(i)], 0) << "beyond the end at " << off << "+" << len;
        }
    }

    // Whole sectors straight, and a request clipped at the end.
    std::vector<char> sectors(8 * ss, char(0x55));
    std::uint32_t error = 0;
    EXPECT_FALSE(device.ReadSectors(62, 8, sectors.data(), error));
    EXPECT_EQ(0, std::memcmp(sectors.data(), data.constData() + 62 * ss, 2 * ss));
    EXPECT_EQ(sectors[2 * ss], 0);
}

TEST_P(DeviceLoopTest, WriteBytesReachesTheImage)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    const unsigned ss = GetParam();
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    QByteArray data = TestUtil::randomBytes(int(16 * ss), 5);
    ASSERT_TRUE(TestUtil::writeFile(image, data));
    {
        TestUtil::LoopDevice loop(image, {"-b", QString::number(ss)});
        ASSERT_FALSE(loop.Device().isEmpty());
        CRoot root;
        DeviceInfo info;
        info.handle = new CPlatformFile(&root, loop.Device(), PlatformKind::Device);
        info.totalSectors = 16;
        info.sectorShift = std::uint8_t(ss == 4096 ? 12 : 9);
        info.ready = 1;
        CDevice device(&root, info);
        const QByteArray patch(ss + 20, char(0x7E));
        std::uint32_t error = 0;
        ASSERT_TRUE(device.WriteBytes(ss - 10, std::uint64_t(patch.size()), patch.constData(), error))
            << error;
        ASSERT_TRUE(device.Close(true));
        data.replace(int(ss - 10), patch.size(), patch);
    }
    EXPECT_EQ(TestUtil::readFile(image), data);
}

INSTANTIATE_TEST_SUITE_P(SectorSizes, DeviceLoopTest, ::testing::Values(512u, 4096u));

} // namespace
