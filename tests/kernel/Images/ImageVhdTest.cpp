// VHD images made by qemu-img read back equal to their raw source; the dynamic write path
// allocates blocks that qemu-img reads back; damaged footers and headers are refused.
#include "tests/common/TestUtil.h"
#include "tests/kernel/Images/ImageTestSupport.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "tests/common/TestRoot.h"

#include <QTemporaryDir>

#include <gtest/gtest.h>
#include <random>

using namespace ImageTest;

namespace {

class ImageVhd : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!TestUtil::haveTool("qemu-img"))
            GTEST_SKIP() << "qemu-img is not installed";
        ASSERT_TRUE(dir.isValid());
    }
    // A raw disk of `sectors` and its VHD conversion.
    QString convert(const QByteArray &disk, const QString &subformat, const QString &name)
    {
        const QString raw = dir.filePath(name + ".raw");
        const QString vhd = dir.filePath(name + ".vhd");
        EXPECT_TRUE(TestUtil::writeFile(raw, disk));
        auto r = TestUtil::run("qemu-img", {"convert", "-f", "raw", "-O", "vpc", "-o",
                                            "subformat=" + subformat + ",force_size=on", raw, vhd});
        EXPECT_EQ(r.exitCode, 0) << r.err.constData();
        return vhd;
    }
    bool compare(const QString &raw, const QString &vhd)
    {
        auto r = TestUtil::run("qemu-img", {"compare", "-f", "raw", "-F", "vpc", raw, vhd});
        return r.exitCode == 0;
    }
    QTemporaryDir dir;
    RecordingRoot root;
};

} // namespace

TEST_F(ImageVhd, FixedAndDynamicReadEqualToTheRawDisk)
{
    const QByteArray disk = makeDisk(24576); // 12 MiB
    for (const QString &sub : {QStringLiteral("fixed"), QStringLiteral("dynamic")}) {
        const QString vhd = convert(disk, sub, sub);
        CImageHandle_VirtualPC handle(&root, {vhd});
        ASSERT_TRUE(handle.IsValid()) << sub.toStdString() << ": " << handle.GetProblem().toStdString();
        EXPECT_EQ(handle.IsDynamic(), sub == QLatin1String("dynamic"));
        EXPECT_EQ(handle.GetTotalSectors(), 24576u);
        EXPECT_TRUE(readAll(handle) == disk) << sub.toStdString();
        EXPECT_TRUE(readAll(handle, 4096 + 3) == disk) << sub.toStdString();
        if (handle.IsDynamic()) {
            // The zero areas were left unallocated by qemu-img and read as zeros.
            EXPECT_EQ(handle.AllocatedBlocks(), 4u);
            EXPECT_TRUE(handle.IsWritable());
        }
    }
}

TEST_F(ImageVhd, DiskSizeNotAWholeNumberOfBlocks)
{
    // Without force_size qemu-img rounds to a geometry; the table then covers a partial block.
    const QByteArray disk = makeDisk(10000);
    const QString raw = dir.filePath("odd.raw"), vhd = dir.filePath("odd.vhd");
    ASSERT_TRUE(TestUtil::writeFile(raw, disk));
    ASSERT_EQ(TestUtil::run("qemu-img", {"convert", "-O", "vpc", raw, vhd}).exitCode, 0);
    CImageHandle_VirtualPC handle(&root, {vhd});
    ASSERT_TRUE(handle.IsValid()) << handle.GetProblem().toStdString();
    ASSERT_GE(handle.GetTotalSectors(), 10000u);
    EXPECT_TRUE(readAll(handle).left(disk.size()) == disk);
}

TEST_F(ImageVhd, DynamicWritesAllocateBlocksThatQemuReads)
{
    QByteArray disk = makeDisk(32768); // 16 MiB, 8 blocks
    const QString vhd = convert(disk, "dynamic", "w");
    const QString raw = dir.filePath("w.raw");
    std::mt19937 rng(7);
    {
        CImageHandle_VirtualPC handle(&root, {vhd});
        ASSERT_TRUE(handle.IsWritable()) << handle.GetProblem().toStdString();
        const std::uint32_t before = handle.AllocatedBlocks();
        // Writes into unallocated blocks (zero areas), across a block boundary and into
        // allocated blocks.
        const std::pair<std::uint64_t, std::uint32_t> writes[] = {{4096 + 7, 2},          {4096 * 2 + 10, 3},
                                                                  {4096 * 3 - 2, 5},      {5, 1},
                                                                  {4096 * 5 + 4000, 200}, {4096 * 5 - 1, 1}};
        for (auto [first, count] : writes) {
            QByteArray data(int(count) * 512, '\0');
            for (char &c : data)
                c = char(rng());
            std::uint32_t error = 0;
            ASSERT_TRUE(handle.ReadWrite(false, first, count, data.data(), error)) << first << " " << error;
            disk.replace(qsizetype(first * 512), data.size(), data);
        }
        // Zeros into an unallocated block (block 7 is empty on the test disk) allocate nothing.
        const std::uint32_t allocated = handle.AllocatedBlocks();
        EXPECT_GT(allocated, before);
        QByteArray zeros(512, '\0');
        std::uint32_t error = 0;
        ASSERT_TRUE(disk.mid(4096 * 7 * 512, 4096 * 512).count('\0') == 4096 * 512);
        ASSERT_TRUE(handle.ReadWrite(false, 4096 * 7 + 1, 1, zeros.data(), error));
        EXPECT_EQ(handle.AllocatedBlocks(), allocated);
        EXPECT_TRUE(readAll(handle) == disk);
    }
    ASSERT_TRUE(TestUtil::writeFile(raw, disk));
    EXPECT_TRUE(compare(raw, vhd));
    auto check = TestUtil::run("qemu-img", {"check", "-f", "vpc", vhd});
    // vpc has no consistency check in qemu-img (exit 63); anything else must be clean.
    EXPECT_TRUE(check.exitCode == 0 || check.exitCode == 63) << check.err.constData();
    auto info = TestUtil::run("vhdiinfo", {vhd});
    if (info.exitCode != -1) {
        EXPECT_EQ(info.exitCode, 0) << info.out.constData();
    }

    // Reopened, the image is still writable and reads the same.
    CImageHandle_VirtualPC again(&root, {vhd});
    ASSERT_TRUE(again.IsWritable());
    EXPECT_TRUE(readAll(again) == disk);
}

TEST_F(ImageVhd, OverflowFilesContinueTheImage)
{
    QByteArray disk(8192 * 512, '\0'); // 4 MiB, nothing allocated
    const QString vhd = convert(disk, "dynamic", "big");
    const qint64 firstSize = QFileInfo(vhd).size();
    {
        CImageHandle_VirtualPC handle(&root, {vhd});
        ASSERT_TRUE(handle.IsWritable());
        // Every further block goes to a new file.
        handle.SetFileLimit(std::uint64_t(firstSize) + 1024);
        for (std::uint64_t s : {100ull, 5000ull}) {
            QByteArray data(512, char(s));
            std::uint32_t error = 0;
            ASSERT_TRUE(handle.ReadWrite(false, s, 1, data.data(), error)) << error;
            disk.replace(qsizetype(s * 512), 512, data);
        }
        EXPECT_EQ(handle.GetFiles().size(), 3);
        EXPECT_TRUE(readAll(handle) == disk);
    }
    const QStringList files = CImageHandle_VirtualPC::ImageFiles(vhd);
    ASSERT_EQ(files.size(), 3);
    EXPECT_TRUE(files[1].endsWith("big.v1"));
    EXPECT_TRUE(files[2].endsWith("big.v2"));
    CImageHandle_VirtualPC reopened(&root, files);
    ASSERT_TRUE(reopened.IsValid()) << reopened.GetProblem().toStdString();
    EXPECT_TRUE(readAll(reopened) == disk);
    // The concatenation is one ordinary VHD.
    QByteArray joined;
    for (const QString &f : files)
        joined += TestUtil::readFile(f);
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("joined.vhd"), joined));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("big2.raw"), disk));
    EXPECT_TRUE(compare(dir.filePath("big2.raw"), dir.filePath("joined.vhd")));
    // Opening by the first file finds the overflow files.
    QString problem;
    auto handle = ImageOpen::CreateHandle(&root, vhd, problem);
    ASSERT_TRUE(handle) << problem.toStdString();
    EXPECT_EQ(handle->GetFiles().size(), 3);
}

TEST_F(ImageVhd, DamagedFieldsAreRefused)
{
    const QByteArray disk = makeDisk(8192);
    const QString fixed = convert(disk, "fixed", "f");
    const QString dynamic = convert(disk, "dynamic", "d");
    const QByteArray fixedBytes = TestUtil::readFile(fixed);
    const QByteArray dynamicBytes = TestUtil::readFile(dynamic);
    const qint64 footer = fixedBytes.size() - 512;

    struct Damage
    {
        const char *what;
        bool dynamicImage;
        qint64 offset; // negative: from the footer
        QByteArray bytes;
    };
    const qint64 dyn = 512; // dynamic header
    const QList<Damage> damages = {
        {"footer byte (checksum)", false, -512 + 100, QByteArray(1, '\x5A')},
        {"cookie", false, -512, "conectiy"},
        {"disk type", false, -512 + 63, QByteArray(1, '\x04')},
        {"saved state", false, -512 + 84, QByteArray(1, '\x01')},
        {"size past the file", false, -512 + 40, QByteArray::fromHex("0000000100000000")},
        {"footer copy", true, 10, QByteArray(1, '\x01')},
        {"sparse cookie", true, dyn, "cxsparsf"},
        {"block size", true, dyn + 32, QByteArray::fromHex("00100000")},
        {"table entries", true, dyn + 28, QByteArray::fromHex("00001000")},
        {"table offset", true, dyn + 16, QByteArray::fromHex("0000001000000000")},
    };
    for (const Damage &d : damages) {
        QByteArray bytes = d.dynamicImage ? dynamicBytes : fixedBytes;
        qint64 at = d.offset < 0 ? bytes.size() + d.offset : d.offset;
        bytes.replace(at, d.bytes.size(), d.bytes);
        const QString path = dir.filePath("damaged.vhd");
        ASSERT_TRUE(TestUtil::writeFile(path, bytes));
        CImageHandle_VirtualPC handle(&root, {path});
        EXPECT_FALSE(handle.IsValid()) << d.what;
        EXPECT_EQ(handle.GetTotalSectors(), 0u) << d.what;
        // Opened by content, such a file is a VHD refused, or (without its cookie) a raw image.
        QString problem;
        auto opened = ImageOpen::CreateHandle(&root, path, problem);
        if (opened) {
            EXPECT_EQ(opened->GetKind(), ImageKind::RawImage) << d.what;
        } else {
            EXPECT_FALSE(problem.isEmpty());
        }
    }
    (void)footer;
    // A table entry that points past the end fails that read only, and the image is read-only.
    QByteArray bytes = dynamicBytes;
    const auto *h = reinterpret_cast<const std::uint8_t *>(bytes.constData());
    const std::uint64_t table = ImageBytes::be64(h + 512 + 16);
    bytes.replace(qsizetype(table), 4, QByteArray::fromHex("00FFFFF0"));
    ASSERT_TRUE(TestUtil::writeFile(dir.filePath("entry.vhd"), bytes));
    CImageHandle_VirtualPC handle(&root, {dir.filePath("entry.vhd")});
    ASSERT_TRUE(handle.IsValid());
    EXPECT_FALSE(handle.IsWritable());
    char buf[512];
    std::uint32_t error = 0;
    EXPECT_FALSE(handle.ReadWrite(true, 0, 1, buf, error));
}

// A new block moves the footer past itself: the footer is on the medium before its old place is
// overwritten, and the table entry before the block is used; a failed flush stops further writes
// and leaves an image that still opens.
TEST_F(ImageVhd, BlockAllocationFlushesTheFooterAndTheTable)
{
    const QString vhd = convert(QByteArray(8192 * 512, '\0'), "dynamic", "alloc");
    ScriptedBackend backend;
    TestRoot scripted(&backend);
    backend.AddFile("/img/a.vhd", TestUtil::readFile(vhd));
    CImageHandle_VirtualPC handle(&scripted, {"/img/a.vhd"});
    ASSERT_TRUE(handle.IsWritable());
    QByteArray data(512, 'A');
    std::uint32_t error = 0;
    backend.ClearCalls();
    ASSERT_TRUE(handle.ReadWrite(false, 100, 1, data.data(), error)) << error;
    QStringList order;
    for (const QString &call : backend.Calls())
        if (call.startsWith("write") || call.startsWith("flush"))
            order << call;
    EXPECT_EQ(order.mid(0, 5),
              (QStringList{"write 512", "flush /img/a.vhd", "write 512", "write 4", "flush /img/a.vhd"}));

    backend.ScriptFlush(SystemError::WriteFault);
    EXPECT_FALSE(handle.ReadWrite(false, 5000, 1, data.data(), error));
    EXPECT_EQ(error, SystemError::WriteFault);
    EXPECT_FALSE(handle.IsWritable());
    CImageHandle_VirtualPC again(&scripted, {"/img/a.vhd"});
    EXPECT_TRUE(again.IsValid()) << again.GetProblem().toStdString();
}
