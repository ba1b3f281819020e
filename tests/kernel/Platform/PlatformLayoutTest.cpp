// The drive layout answer as GetLayoutInfo reads it: the growth loop, the acceptance checks and the
// ordering by partition number.
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/DriveLayout.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "tests/common/TestRoot.h"

#include <gtest/gtest.h>

namespace {

using namespace DeviceControl;

class PlatformLayoutTest : public ::testing::Test
{
protected:
    ScriptedBackend backend;
    TestRoot root{&backend};
    CPlatformFile disk{&root, "/dev/disk0", PlatformKind::Device};

    void SetUp() override { backend.AddFile("/dev/disk0", QByteArray(4096, '\0')); }
    void TearDown() override
    {
        if (disk.IsOpened())
            disk.Close();
    }

    // Answers the layout query like a system does: too small a buffer fails with 122.
    void Serve(const DriveLayout &layout)
    {
        backend.SetControlHandler(IOCTL_DISK_GET_DRIVE_LAYOUT_EX,
                                  [layout](const QByteArray &, QByteArray &out, uint32_t &returned) {
                                      return layout.Answer(out.data(), uint32_t(out.size()), returned);
                                  });
    }
};

TEST_F(PlatformLayoutTest, GrowsTheBufferAndListsOffsetsByPartitionNumber)
{
    DriveLayout layout;
    layout.header.PartitionStyle = PARTITION_STYLE_MBR;
    layout.entries = {MakePartitionEntry(0, 3, 300 * 512, 10 * 512), MakePartitionEntry(0, 0, 0, 0),
                      MakePartitionEntry(0, 1, 2048 * 512, 100 * 512),
                      MakePartitionEntry(0, 2, 50 * 512, 5 * 512)};
    Serve(layout);
    QList<uint64_t> offsets{42};
    ASSERT_TRUE(disk.GetLayoutInfo(offsets));
    EXPECT_EQ(offsets, (QList<uint64_t>{2048 * 512, 50 * 512, 300 * 512}));
    EXPECT_EQ(backend.CallCount("control 0x70050"), 4); // 1, 2, 3, then 4 entries
    EXPECT_TRUE(root.platform.isEmpty());
}

TEST_F(PlatformLayoutTest, DuplicatePartitionNumberFailsWithAnEmptyList)
{
    DriveLayout layout;
    layout.entries = {MakePartitionEntry(1, 1, 1048576, 4096), MakePartitionEntry(1, 1, 2097152, 4096)};
    Serve(layout);
    QList<uint64_t> offsets;
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    EXPECT_TRUE(offsets.isEmpty());
    EXPECT_TRUE(root.platform.isEmpty());
}

TEST_F(PlatformLayoutTest, AnswerMustFillTheBufferExactly)
{
    // A count that disagrees with the bytes returned is refused.
    DriveLayout layout;
    layout.entries = {MakePartitionEntry(0, 1, 512, 512)};
    QByteArray bytes = layout.Bytes();
    bytes[4] = 2; // header claims two entries
    backend.ScriptControl(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, {0, bytes, -1});
    QList<uint64_t> offsets;
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    EXPECT_TRUE(offsets.isEmpty());

    // Fewer bytes than the buffer holds is refused too.
    backend.ScriptControl(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, {0, layout.Bytes(), 100});
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));

    // An empty disk has no answer of one entry's size; a zero-count answer in a 192-byte buffer fails.
    DriveLayout empty;
    Serve(empty);
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    EXPECT_TRUE(root.platform.isEmpty());
}

TEST_F(PlatformLayoutTest, OtherFailuresAreRecordedAndGrowthStopsAfter128Sizes)
{
    backend.ScriptControl(IOCTL_DISK_GET_DRIVE_LAYOUT_EX, {SystemError::InvalidFunction, {}, -1});
    QList<uint64_t> offsets;
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::DiskGetDriveLayoutEx));
    EXPECT_EQ(root.platform[0].error, SystemError::InvalidFunction);

    root.ClearRecords();
    backend.ClearCalls();
    QList<uint32_t> sizes;
    backend.SetControlHandler(IOCTL_DISK_GET_DRIVE_LAYOUT_EX,
                              [&sizes](const QByteArray &, QByteArray &out, uint32_t &) {
                                  sizes.append(uint32_t(out.size()));
                                  return SystemError::InsufficientBuffer;
                              });
    EXPECT_FALSE(disk.GetLayoutInfo(offsets));
    ASSERT_EQ(sizes.size(), 128);
    EXPECT_EQ(sizes.first(), 192u);
    EXPECT_EQ(sizes.at(1), 336u);
    EXPECT_EQ(sizes.last(), 48u + 128u * 144u);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].error, SystemError::InsufficientBuffer);
}

TEST_F(PlatformLayoutTest, ManyPartitionsAreListedInOrder)
{
    DriveLayout layout;
    layout.header.PartitionStyle = PARTITION_STYLE_GPT;
    for (uint32_t n = 128; n >= 1; --n)
        layout.entries.append(MakePartitionEntry(1, n, uint64_t(n) * 1048576, 1048576));
    Serve(layout);
    QList<uint64_t> offsets;
    ASSERT_TRUE(disk.GetLayoutInfo(offsets));
    ASSERT_EQ(offsets.size(), 128);
    for (int i = 0; i < 128; ++i)
        EXPECT_EQ(offsets[i], uint64_t(i + 1) * 1048576);
}

} // namespace
