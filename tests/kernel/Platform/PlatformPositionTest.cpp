// Where a handle of this machine stands after its transfers, and the edges of a transfer at the end of a
// file or a device: the handle transfers at a position without seeking, yet reports and hands out the
// position a seek and a transfer would have left.
#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "tests/common/TestRoot.h"
#include "tests/common/TestUtil.h"

#include <QTemporaryDir>

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>
#include <thread>
#include <unistd.h>
#include <vector>

namespace {

QByteArray numbered(int size)
{
    QByteArray data(size, '\0');
    for (int i = 0; i < size; ++i)
        data[i] = char((i * 7 + i / 4096) & 0xFF);
    return data;
}

uint64_t osPosition(CPlatformFile &file)
{
    return uint64_t(::lseek(int(file.GetHandle()), 0, SEEK_CUR));
}

class PlatformPositionTest : public ::testing::Test
{
protected:
    QTemporaryDir dir;
    QString path;
    QByteArray content = numbered(64 * 1024);
    TestRoot root;

    void SetUp() override
    {
        ASSERT_TRUE(dir.isValid());
        path = dir.filePath("data.bin");
        ASSERT_TRUE(TestUtil::writeFile(path, content));
    }
};

TEST_F(PlatformPositionTest, TransfersLeaveTheHandleAfterTheirBytes)
{
    CPlatformFile file(&root, path, PlatformKind::File);
    QByteArray buffer(4096, '\0');
    uint64_t position = 0;

    ASSERT_TRUE(file.Read(10000, 512, buffer.data()));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, 10512u);
    EXPECT_EQ(osPosition(file), 10512u);

    // The current position follows reads, writes and a handle used directly in between.
    ASSERT_TRUE(file.Read(CPlatformFile::CurrentPosition, 100, buffer.data()));
    EXPECT_EQ(buffer.left(100), content.mid(10512, 100));
    ASSERT_TRUE(file.Write(20000, 8, "ABCDEFGH"));
    EXPECT_EQ(osPosition(file), 20008u);
    ASSERT_EQ(::lseek(int(file.GetHandle()), 30000, SEEK_SET), 30000);
    ASSERT_TRUE(file.Read(CPlatformFile::CurrentPosition, 16, buffer.data()));
    EXPECT_EQ(buffer.left(16), content.mid(30000, 16));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, 30016u);

    // An append does not take the current position, and leaves the handle at the new end.
    ASSERT_TRUE(file.Write(CPlatformFile::CurrentPosition, 4, "tail"));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, uint64_t(content.size()) + 4);

    // A resize positions the handle itself; a reopened handle starts at 0.
    ASSERT_TRUE(file.Read(100, 100, buffer.data()));
    ASSERT_TRUE(file.Resize(50000));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, 50000u);
    ASSERT_TRUE(file.Read(200, 100, buffer.data()));
    ASSERT_TRUE(file.Close());
    ASSERT_TRUE(file.Reopen(true));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, 0u);
    ASSERT_TRUE(file.Read(CPlatformFile::CurrentPosition, 8, buffer.data()));
    EXPECT_EQ(buffer.left(8), content.left(8));
    EXPECT_TRUE(file.Close());
    EXPECT_TRUE(root.platform.isEmpty());
}

TEST_F(PlatformPositionTest, ReadsAtAndPastTheEndOfAFileAreShort)
{
    CPlatformFile file(&root, path, PlatformKind::File);
    QByteArray buffer(4096, '\0');
    const uint64_t size = uint64_t(content.size());
    uint64_t position = 0;

    // Straddling the end: the bytes there are read, the transfer fails with end of file.
    EXPECT_FALSE(file.Read(size - 1000, 4096, buffer.data()));
    EXPECT_EQ(file.GetError(), SystemError::HandleEof);
    EXPECT_EQ(buffer.left(1000), content.right(1000));
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, size);

    // A file may be positioned past its end: nothing is read there.
    EXPECT_FALSE(file.Read(size + 8192, 512, buffer.data()));
    EXPECT_EQ(file.GetError(), SystemError::HandleEof);
    ASSERT_TRUE(file.GetPosition(position));
    EXPECT_EQ(position, size + 8192);

    ASSERT_EQ(root.platform.size(), 2);
    for (const auto &record : root.platform) {
        EXPECT_EQ(record.operation, uint32_t(PlatformOperation::ReadFile));
        EXPECT_EQ(record.error, SystemError::HandleEof);
    }
    EXPECT_EQ(root.platform[0].position, size - 1000);
    EXPECT_EQ(root.platform[0].block, 4096u);
    EXPECT_EQ(root.platform[1].position, size + 8192);

    // A position beyond what a handle can address is refused before any transfer.
    root.platform.clear();
    EXPECT_FALSE(file.Read(uint64_t(INT64_MAX) + 1, 512, buffer.data()));
    EXPECT_EQ(file.GetError(), SystemError::NegativeSeek);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::SetFilePointerEx));
    EXPECT_TRUE(file.Close());
}

TEST_F(PlatformPositionTest, UnalignedBuffersOfEverySizeCarryTheirBytes)
{
    CPlatformFile file(&root, path, PlatformKind::File);
    // Empty, growing, shrinking and a size above what the handle keeps between transfers.
    std::vector<char> storage((2 << 20) + 16, '\0');
    char *unaligned = storage.data() + 1;
    for (const uint32_t size : {0u, 512u, 8192u, 100u, 16384u}) {
        ASSERT_TRUE(file.Read(777, size, unaligned)) << size;
        EXPECT_EQ(QByteArray(unaligned, int(size)), content.mid(777, int(size))) << size;
    }
    const QByteArray large = numbered(2 << 20);
    std::memcpy(unaligned, large.constData(), size_t(large.size()));
    ASSERT_TRUE(file.Write(4096, uint32_t(large.size()), unaligned));
    std::memcpy(storage.data() + 2, "xyz", 3);
    ASSERT_TRUE(file.Write(10, 3, storage.data() + 2));
    std::fill(storage.begin(), storage.end(), '\0');
    ASSERT_TRUE(file.Read(4096, uint32_t(large.size()), unaligned));
    EXPECT_EQ(QByteArray(unaligned, large.size()), large);
    EXPECT_TRUE(file.Close());
    const QByteArray written = TestUtil::readFile(path);
    EXPECT_EQ(written.mid(10, 3), QByteArray("xyz"));
    EXPECT_EQ(written.mid(4096), large);
}

TEST_F(PlatformPositionTest, ThreadsSharingAHandleReadTheirOwnPositions)
{
    CPlatformFile file(&root, path, PlatformKind::File);
    ASSERT_TRUE(file.Reopen(true));
    std::vector<int> mismatches(4, 0);
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; ++t) {
        threads.emplace_back([&, t] {
            QByteArray buffer(512, '\0');
            for (int i = 0; i < 400; ++i) {
                const int sector = (i * 5 + t * 31) % 128;
                if (!file.Read(uint64_t(sector) * 512, 512, buffer.data()) ||
                    buffer != content.mid(sector * 512, 512))
                    ++mismatches[size_t(t)];
            }
        });
    }
    for (auto &thread : threads)
        thread.join();
    EXPECT_EQ(mismatches, std::vector<int>(4, 0));
    EXPECT_TRUE(file.Close());
}

TEST_F(PlatformPositionTest, DeviceEndsAsAPositionedTransferWouldMeetThem)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached (needs root and losetup)";
    TestUtil::LoopDevice loop(path);
    ASSERT_FALSE(loop.Device().isEmpty());
    const qint64 size = TestUtil::blockdev("--getsize64", loop.Device());
    ASSERT_EQ(size, content.size());
    CPlatformFile disk(&root, loop.Device(), PlatformKind::Device);
    QByteArray buffer(4096, '\0');
    uint64_t position = 0;

    // The last sectors read as dd reads them.
    ASSERT_TRUE(disk.Read(uint64_t(size) - 4096, 4096, buffer.data()));
    const auto dd =
        TestUtil::run("dd", {"if=" + loop.Device(), "bs=4096", "skip=15", "count=1", "status=none"});
    ASSERT_EQ(dd.exitCode, 0);
    EXPECT_EQ(buffer, dd.out);
    ASSERT_TRUE(disk.GetPosition(position));
    EXPECT_EQ(position, uint64_t(size));

    // Across the end and at the end: a short transfer.
    EXPECT_FALSE(disk.Read(uint64_t(size) - 512, 4096, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::HandleEof);
    EXPECT_EQ(buffer.left(512), content.right(512));
    EXPECT_FALSE(disk.Read(uint64_t(size), 512, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::HandleEof);
    // Past the end a device cannot be positioned at all.
    EXPECT_FALSE(disk.Read(uint64_t(size) + 512, 512, buffer.data()));
    EXPECT_EQ(disk.GetError(), SystemError::InvalidParameter);
    EXPECT_FALSE(disk.IsLost());

    ASSERT_EQ(root.platform.size(), 3);
    EXPECT_EQ(root.platform[0].operation, uint32_t(PlatformOperation::ReadFile));
    EXPECT_EQ(root.platform[0].position, uint64_t(size) - 512);
    EXPECT_EQ(root.platform[1].operation, uint32_t(PlatformOperation::ReadFile));
    EXPECT_EQ(root.platform[2].operation, uint32_t(PlatformOperation::SetFilePointerEx));
    EXPECT_EQ(root.platform[2].position, uint64_t(size) + 512);
    EXPECT_EQ(root.platform[2].block, 512u);
    EXPECT_EQ(root.platform[2].error, SystemError::InvalidParameter);

    // A failed positioning leaves the handle where the last transfer did.
    ASSERT_TRUE(disk.GetPosition(position));
    EXPECT_EQ(position, uint64_t(size));
    EXPECT_TRUE(disk.Close());
}

} // namespace
