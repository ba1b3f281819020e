// brindle-cli image info, create and verify, and image files as SOURCE of the other commands,
// run as the program itself.
#include <gtest/gtest.h>

#include <QFile>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTemporaryDir>

#include <random>

#include "tests/common/TestUtil.h"

namespace {

TestUtil::ToolResult cli(const QStringList &args)
{
    return TestUtil::run(TestUtil::builtProgram("brindle-cli"), args);
}

QByteArray makeDisk(int sectors)
{
    QByteArray d(sectors * 512, '\0');
    std::mt19937 rng(3);
    for (int s = 0; s < sectors; ++s) {
        if ((s / 512) % 2)
            continue;
        for (int i = 0; i < 512; ++i)
            d[s * 512 + i] = char(rng() % 16);
    }
    return d;
}

class ImageCli : public ::testing::Test
{
protected:
    void SetUp() override
    {
        ASSERT_TRUE(dir.isValid());
        disk = makeDisk(6000);
        raw = dir.filePath("disk.raw");
        ASSERT_TRUE(TestUtil::writeFile(raw, disk));
    }
    QTemporaryDir dir;
    QByteArray disk;
    QString raw;
};

} // namespace

TEST_F(ImageCli, CreateInfoVerifyAndReadBack)
{
    const QString image = dir.filePath("copy.tdi");
    auto c = cli({"image", "create", raw, image, "--level", "1", "--sectors-per-block", "32", "--description",
                  "nightly copy"});
    ASSERT_EQ(c.exitCode, 0) << c.err.constData();
    EXPECT_TRUE(c.err.contains("100%"));

    auto info = cli({"image", "info", image});
    ASSERT_EQ(info.exitCode, 0) << info.err.constData();
    EXPECT_TRUE(info.out.contains("Format: Tarvo Disk Image"));
    EXPECT_TRUE(info.out.contains("Total sectors: 6000"));
    EXPECT_TRUE(info.out.contains("Writable: no"));
    EXPECT_TRUE(info.out.contains("Description: nightly copy"));
    EXPECT_TRUE(info.out.contains("Source model: disk.raw"));

    auto json = cli({"image", "info", image, "--json"});
    ASSERT_EQ(json.exitCode, 0);
    QJsonObject o = QJsonDocument::fromJson(json.out).object();
    EXPECT_EQ(o["format"].toString(), QStringLiteral("Tarvo Disk Image"));
    EXPECT_EQ(o["sectorsPerBlock"].toInt(), 32);
    EXPECT_EQ(o["sectorSize"].toInt(), 512);
    EXPECT_FALSE(o["writable"].toBool());

    auto verify = cli({"image", "verify", image});
    EXPECT_EQ(verify.exitCode, 0) << verify.out.constData();
    EXPECT_TRUE(verify.out.contains("sound"));

    // The image is a SOURCE like any device.
    auto read = cli({"read", image, "--offset", "0", "--length", QString::number(disk.size()), "--raw"});
    ASSERT_EQ(read.exitCode, 0) << read.err.constData();
    EXPECT_TRUE(read.out == disk);
}

TEST_F(ImageCli, FlippedByteFailsVerify)
{
    const QString image = dir.filePath("flip.tdi");
    ASSERT_EQ(cli({"image", "create", raw, image, "--level", "6"}).exitCode, 0);
    const QByteArray good = TestUtil::readFile(image);
    // Bytes inside the block data: after the header and strings, before the last group record.
    for (qsizetype at : {qsizetype(300), good.size() / 3, good.size() / 2}) {
        QByteArray bad = good;
        bad[at] = char(bad[at] ^ 0x10);
        ASSERT_TRUE(TestUtil::writeFile(image, bad));
        auto verify = cli({"image", "verify", image});
        EXPECT_NE(verify.exitCode, 0) << at;
        EXPECT_TRUE(verify.out.contains("damaged") || verify.err.contains("damaged")) << at;
    }
    // A file of another format is not verified.
    EXPECT_NE(cli({"image", "verify", raw}).exitCode, 0);
}

TEST_F(ImageCli, InfoOfQemuImagesAndRefusals)
{
    if (!TestUtil::haveTool("qemu-img"))
        GTEST_SKIP() << "qemu-img is not installed";
    const QString vhd = dir.filePath("d.vhd"), vmdk = dir.filePath("d.vmdk");
    ASSERT_EQ(
        TestUtil::run("qemu-img", {"convert", "-O", "vpc", "-o", "subformat=dynamic,force_size=on", raw, vhd})
            .exitCode,
        0);
    ASSERT_EQ(TestUtil::run("qemu-img", {"convert", "-O", "vmdk", raw, vmdk}).exitCode, 0);
    auto info = cli({"image", "info", vhd});
    EXPECT_TRUE(info.out.contains("Format: Virtual PC Disk Image")) << info.out.constData();
    EXPECT_TRUE(info.out.contains("Writable: yes"));
    info = cli({"image", "info", vmdk});
    EXPECT_TRUE(info.out.contains("Format: Virtual Machine (VMWare) Disk Image")) << info.out.constData();
    info = cli({"image", "info", raw});
    EXPECT_TRUE(info.out.contains("Format: RAW Data (Binary) Disk Image")) << info.out.constData();

    // An own-format image of a VHD source equals the raw disk.
    const QString image = dir.filePath("fromvhd.tdi");
    ASSERT_EQ(cli({"image", "create", vhd, image}).exitCode, 0);
    auto read = cli({"read", image, "--offset", "0", "--length", QString::number(disk.size()), "--raw"});
    EXPECT_TRUE(read.out == disk);

    // A damaged footer is refused with a reason.
    QByteArray bytes = TestUtil::readFile(vhd);
    bytes[bytes.size() - 512 + 70] = char(bytes[bytes.size() - 512 + 70] ^ 1);
    ASSERT_TRUE(TestUtil::writeFile(vhd, bytes));
    info = cli({"image", "info", vhd});
    EXPECT_EQ(info.exitCode, 1);
    EXPECT_TRUE(info.err.contains("refused")) << info.err.constData();
    EXPECT_EQ(cli({"image", "info", dir.filePath("missing.vhd")}).exitCode, 1);
    EXPECT_EQ(cli({"image"}).exitCode, 2);
}
