// Raw images (single and split), fragmented images and the opening rules common to all handles.
#include "tests/common/TestUtil.h"
#include "tests/kernel/Images/ImageTestSupport.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageHandleBackup.h"
#include "Kernel/Implementation/Images/ImageHandleFragmented.h"
#include "Kernel/Implementation/Images/ImageHandleRaw.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

#include <gtest/gtest.h>

using namespace ImageTest;

namespace {

QByteArray sectors(int count, char fill)
{
    QByteArray b(count * 512, fill);
    for (int s = 0; s < count; ++s)
        b[s * 512] = char(s);
    return b;
}

} // namespace

TEST(ImageRaw, SplitFilesReadAcrossTheBoundary)
{
    QTemporaryDir dir;
    const QByteArray a = sectors(1000, 'a'), b = sectors(24, 'b');
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("disk.001"), a));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("disk.002"), b));
    const QStringList files = ImageOpen::SplitFiles(dir.filePath("disk.001"));
    ASSERT_EQ(files.size(), 2);

    RecordingRoot root;
    CImageHandle_Raw raw(&root, files);
    ASSERT_TRUE(raw.IsValid());
    EXPECT_EQ(raw.GetTotalSectors(), 1024u);
    EXPECT_TRUE(raw.IsWritable());
    QByteArray buf(4 * 512, '\0');
    std::uint32_t error = 99;
    ASSERT_TRUE(raw.ReadWrite(true, 998, 4, buf.data(), error));
    EXPECT_EQ(error, 0u);
    EXPECT_EQ(buf.left(1024), a.mid(998 * 512, 1024));
    EXPECT_EQ(buf.mid(1024), b.left(1024));

    // A write across the boundary lands in both files.
    QByteArray w(4 * 512, 'w');
    ASSERT_TRUE(raw.ReadWrite(false, 998, 4, w.data(), error));
    QByteArray back(4 * 512, '\0');
    ASSERT_TRUE(raw.ReadWrite(true, 998, 4, back.data(), error));
    EXPECT_EQ(back, w);
}

TEST(ImageRaw, RequestOutsideTheImageIsRecordedAndFails)
{
    QTemporaryDir dir;
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("a.001"), sectors(10, 'a')));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("a.002"), sectors(6, 'b')));
    RecordingRoot root;
    CImageHandle_Raw raw(&root, ImageOpen::SplitFiles(dir.filePath("a.001")));
    ASSERT_EQ(raw.GetTotalSectors(), 16u);
    QByteArray buf(3 * 512, '\0');
    std::uint32_t error = 0;
    EXPECT_FALSE(raw.ReadWrite(true, 15, 2, buf.data(), error));
    EXPECT_EQ(error, SystemError::InvalidFunction);
    ASSERT_EQ(root.platform.size(), 1);
    EXPECT_EQ(root.platform[0].operation, 20u);
    EXPECT_EQ(root.platform[0].position, 15u * 512);
    EXPECT_EQ(root.platform[0].block, 2u * 512);
    EXPECT_EQ(root.platform[0].error, 1u);
    EXPECT_EQ(root.platform[0].name,
              QStringLiteral("Image (%1,...,%2)").arg(dir.filePath("a.001"), dir.filePath("a.002")));
}

TEST(ImageRaw, MissingFileLeavesTheHandleEmpty)
{
    QTemporaryDir dir;
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("x.img"), sectors(4, 'x')));
    RecordingRoot root;
    CImageHandle_Raw raw(&root, {dir.filePath("x.img"), dir.filePath("missing.img")});
    EXPECT_FALSE(raw.IsValid());
    EXPECT_EQ(raw.GetTotalSectors(), 0u);
    EXPECT_TRUE(raw.GetFiles().isEmpty());
    // A file shorter than one sector holds no sector.
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("tiny.img"), QByteArray(100, 't')));
    CImageHandle_Raw tiny(&root, {dir.filePath("tiny.img")});
    EXPECT_FALSE(tiny.IsValid());
}

TEST(ImageFragmented, HoleReadsZerosAndSucceeds)
{
    QTemporaryDir dir;
    const QByteArray a = sectors(8, 'a'), b = sectors(4, 'b');
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("p1"), a));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("p2"), b));
    RecordingRoot root;
    CImageHandle_Fragmented frag(&root, {{dir.filePath("p1"), 2}, {dir.filePath("p2"), 20}}, 30);
    ASSERT_TRUE(frag.IsValid());
    EXPECT_EQ(frag.GetKind(), ImageKind::FragmentedRaw);
    QByteArray all(30 * 512, 'q');
    std::uint32_t error = 0;
    ASSERT_TRUE(frag.ReadWrite(true, 0, 30, all.data(), error));
    QByteArray expected(30 * 512, '\0');
    expected.replace(2 * 512, a.size(), a);
    expected.replace(20 * 512, b.size(), b);
    EXPECT_EQ(all, expected);

    // Overlapping pieces are refused.
    CImageHandle_Fragmented bad(&root, {{dir.filePath("p1"), 0}, {dir.filePath("p2"), 4}});
    EXPECT_FALSE(bad.IsValid());
}

TEST(ImageBackup, HoldsInformationOnly)
{
    RecordingRoot root;
    CImageHandle_Backup backup(&root, "first", "second");
    EXPECT_EQ(backup.ImageInformation(), QByteArray("firstsecond"));
    EXPECT_FALSE(backup.IsWritable());
    EXPECT_FALSE(backup.IsValid());
    char buf[512];
    std::uint32_t error = 0;
    EXPECT_FALSE(backup.ReadWrite(true, 0, 1, buf, error));
}
