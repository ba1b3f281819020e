// VMDK images made by qemu-img (one sparse file, a descriptor with split extents, and a
// descriptor naming several sparse extents) read back equal to their raw source; damaged sparse
// headers and descriptors are refused.
#include "tests/common/TestUtil.h"
#include "tests/kernel/Images/ImageTestSupport.h"

#include "Kernel/Implementation/Images/ImageHandleVMWare.h"
#include "Kernel/Implementation/Root/ImageOpen.h"

#include <QFileInfo>
#include <QTemporaryDir>

#include <gtest/gtest.h>

using namespace ImageTest;

namespace {

class ImageVmdk : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!TestUtil::haveTool("qemu-img"))
            GTEST_SKIP() << "qemu-img is not installed";
    }
    QString convert(const QByteArray &disk, const QString &subformat, const QString &name)
    {
        const QString raw = dir.filePath(name + ".raw");
        const QString vmdk = dir.filePath(name + ".vmdk");
        EXPECT_TRUE(TestUtil::writeFile(raw, disk));
        auto r = TestUtil::run(
            "qemu-img", {"convert", "-f", "raw", "-O", "vmdk", "-o", "subformat=" + subformat, raw, vmdk});
        EXPECT_EQ(r.exitCode, 0) << r.err.constData();
        return vmdk;
    }
    QTemporaryDir dir;
    RecordingRoot root;
};

} // namespace

TEST_F(ImageVmdk, MonolithicSparseReadsEqual)
{
    const QByteArray disk = makeDisk(20000);
    const QString vmdk = convert(disk, "monolithicSparse", "mono");
    CImageHandle_VMWare handle(&root, vmdk);
    ASSERT_TRUE(handle.IsValid()) << handle.GetProblem().toStdString();
    EXPECT_EQ(handle.GetTotalSectors(), 20000u);
    EXPECT_EQ(handle.ExtentCount(), 1);
    EXPECT_TRUE(readAll(handle) == disk);
    EXPECT_TRUE(readAll(handle, 1) == disk);
    EXPECT_EQ(ImageOpen::IdentifyFile(&root, vmdk), ImageKind::VmWare);
}

TEST_F(ImageVmdk, SplitExtentsThroughTheDescriptorReadEqual)
{
    const QByteArray disk = makeDisk(16384, 3);
    const QString vmdk = convert(disk, "twoGbMaxExtentSparse", "split");
    EXPECT_LT(QFileInfo(vmdk).size(), 4096); // the descriptor is text
    EXPECT_EQ(ImageOpen::IdentifyFile(&root, vmdk), ImageKind::VmWare);
    CImageHandle_VMWare handle(&root, vmdk);
    ASSERT_TRUE(handle.IsValid()) << handle.GetProblem().toStdString();
    EXPECT_EQ(handle.GetFiles().size(), 2);
    EXPECT_TRUE(readAll(handle) == disk);
    EXPECT_EQ(ImageKindName(handle.GetKind()), QStringLiteral("Virtual Machine (VMWare) Disk Image"));
}

TEST_F(ImageVmdk, DescriptorNamingSeveralExtents)
{
    const QByteArray disk = makeDisk(12000, 5);
    // Three sparse extents of different sizes, each made from its part of the disk.
    const int sizes[3] = {5000, 3000, 4000};
    QByteArray descriptor =
        "# Disk DescriptorFile\nversion=1\nCID=fffffffe\ncreateType=\"twoGbMaxExtentSparse\"\n\n";
    int at = 0;
    for (int i = 0; i < 3; ++i) {
        const QString name = QStringLiteral("part%1").arg(i);
        convert(disk.mid(at * 512, sizes[i] * 512), "monolithicSparse", name);
        descriptor += QStringLiteral("%1 %2 SPARSE \"%3.vmdk\"\r\n")
                          .arg(i == 1 ? "rdonly" : "RW")
                          .arg(sizes[i])
                          .arg(name)
                          .toUtf8();
        at += sizes[i];
    }
    descriptor += "\nddb.geometry.heads = \"16\"\nddb.geometry.sectors = \"63\"\n";
    const QString path = dir.filePath("multi.vmdk");
    ASSERT_TRUE(TestUtil::writeFile(path, descriptor));
    CImageHandle_VMWare handle(&root, path);
    ASSERT_TRUE(handle.IsValid()) << handle.GetProblem().toStdString();
    EXPECT_EQ(handle.ExtentCount(), 3);
    EXPECT_EQ(handle.GetTotalSectors(), 12000u);
    EXPECT_TRUE(readAll(handle) == disk);
    EXPECT_TRUE(readAll(handle, 4999) == disk);
    DeviceInfo info;
    handle.Describe(info);
    EXPECT_EQ(info.sectorsPerTrack, 63u);
    EXPECT_EQ(info.tracksPerCylinder, 16u);

    // An extent that claims more sectors than its capacity is refused.
    QByteArray bad = descriptor;
    bad.replace("RW 5000", "RW 5001");
    ASSERT_TRUE(TestUtil::writeFile(path, bad));
    CImageHandle_VMWare refused(&root, path);
    EXPECT_FALSE(refused.IsValid());
    // A missing extent file is refused.
    bad = descriptor;
    bad.replace("part2.vmdk", "gone.vmdk");
    ASSERT_TRUE(TestUtil::writeFile(path, bad));
    CImageHandle_VMWare missing(&root, path);
    EXPECT_FALSE(missing.IsValid());
}

TEST_F(ImageVmdk, DescriptorParsing)
{
    auto d = CImageHandle_VMWare::ParseDescriptor(
        "version=1\r  rw 100 sparse \"a b.vmdk\"\nNOACCESS 7 SPARSE \"c.vmdk\"\n"
        "RW 5 FLAT \"d.vmdk\" 0\nRW 9 SPARSE \"e.vmdk\"\n");
    EXPECT_TRUE(d.version1);
    // The flat extent line is malformed for this reader and ends the list.
    ASSERT_EQ(d.extents.size(), 2);
    EXPECT_EQ(d.extents[0].file, QStringLiteral("a b.vmdk"));
    EXPECT_EQ(d.extents[0].sectors, 100u);
    EXPECT_EQ(d.extents[1].access, CImageHandle_VMWare::AccessNone);
    EXPECT_FALSE(CImageHandle_VMWare::LooksLikeDescriptor("RW 5 SPARSE \"x\"\n"));
    EXPECT_FALSE(CImageHandle_VMWare::ParseDescriptor("RW 0 SPARSE \"x\"").extents.size());
}

TEST_F(ImageVmdk, DamagedSparseHeadersAreRefused)
{
    const QByteArray disk = makeDisk(4096);
    const QString vmdk = convert(disk, "monolithicSparse", "dmg");
    const QByteArray good = TestUtil::readFile(vmdk);
    struct Damage
    {
        const char *what;
        int offset;
        QByteArray bytes;
    };
    const QList<Damage> damages = {
        {"magic", 0, "XDMV"},
        {"version", 4, QByteArray::fromHex("02000000")},
        {"flags", 8, QByteArray::fromHex("07000000")},
        {"capacity zero", 12, QByteArray(8, '\0')},
        {"grain size not a power of two", 20, QByteArray::fromHex("0300000000000000")},
        {"grain table entries", 44, QByteArray::fromHex("00040000")},
        {"redundant directory", 48, QByteArray(8, '\0')},
        {"directory past the end", 56, QByteArray::fromHex("00000000ffff0000")},
        {"capacity past the directory", 12, QByteArray::fromHex("00000000ffff0000")},
        {"unclean shutdown", 72, QByteArray(1, '\x01')},
        {"compression algorithm 1", 77, QByteArray::fromHex("0100")},
        {"descriptor past the end", 28, QByteArray::fromHex("00000000ffff0000")},
    };
    for (const Damage &d : damages) {
        QByteArray bytes = good;
        bytes.replace(d.offset, d.bytes.size(), d.bytes);
        const QString path = dir.filePath("bad.vmdk");
        ASSERT_TRUE(TestUtil::writeFile(path, bytes));
        CImageHandle_VMWare handle(&root, path);
        EXPECT_FALSE(handle.IsValid()) << d.what;
    }
    // A compressed (stream-optimised) image made by qemu-img is refused too.
    const QString stream = convert(disk, "streamOptimized", "stream");
    CImageHandle_VMWare compressed(&root, stream);
    EXPECT_FALSE(compressed.IsValid());
    QString problem;
    EXPECT_FALSE(ImageOpen::CreateHandle(&root, stream, problem));
}
