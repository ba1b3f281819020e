// brindle-cli partitions on loop devices of disks made with sfdisk and sgdisk, compared with mmls.
#include <gtest/gtest.h>

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QProcess>
#include <QTemporaryDir>

#include <algorithm>
#include <tuple>
#include <vector>

#include "tests/common/TestUtil.h"

namespace {

using TestUtil::LoopDevice;

using Row = std::tuple<qint64, qint64, bool>; // start, length, unallocated

// mmls's partitions and unallocated rows (its meta rows left out).
std::vector<Row> mmls(const QString &image, const QStringList &extra = {})
{
    std::vector<Row> rows;
    TestUtil::ToolResult r = TestUtil::run("mmls", extra + QStringList{image});
    for (const QByteArray &line : r.out.split('\n')) {
        const QList<QByteArray> f = line.simplified().split(' ');
        if (f.size() < 5 || !f[0].endsWith(':') || f[1] == "Meta")
            continue;
        bool a = false, b = false;
        const qint64 start = f[2].toLongLong(&a), length = f[4].toLongLong(&b);
        if (a && b)
            rows.emplace_back(start, length, f[1].startsWith("---"));
    }
    return rows;
}

// The listing's leaves (extended partitions replaced by their children), with adjacent unallocated
// rows joined the way mmls shows them.
void collect(const QJsonArray &list, std::vector<Row> &rows)
{
    for (const QJsonValue &v : list) {
        const QJsonObject o = v.toObject();
        if (o["kind"].toInteger() == 1)
            collect(o["children"].toArray(), rows);
        else
            rows.emplace_back(o["start"].toInteger(), o["length"].toInteger(), o["kind"].toInteger() == 0);
    }
}

std::vector<Row> listing(const QJsonObject &doc)
{
    std::vector<Row> rows, out;
    collect(doc["partitions"].toArray(), rows);
    std::sort(rows.begin(), rows.end());
    for (const Row &r : rows) {
        if (!out.empty() && std::get<2>(r) && std::get<2>(out.back()) &&
            std::get<0>(out.back()) + std::get<1>(out.back()) == std::get<0>(r))
            std::get<1>(out.back()) += std::get<1>(r);
        else
            out.push_back(r);
    }
    return out;
}

class PartitionsCli : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!TestUtil::canAttachLoop())
            GTEST_SKIP() << "loop devices cannot be attached (needs root and /dev/loop-control)";
        if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("sgdisk") || !TestUtil::haveTool("mmls"))
            GTEST_SKIP() << "sfdisk, sgdisk and mmls are needed";
        ASSERT_TRUE(dir.isValid());
        image = dir.filePath("disk.img");
        QFile f(image);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly) && f.resize(64 << 20));
    }
    QJsonObject list(const QString &device)
    {
        TestUtil::ToolResult r =
            TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"partitions", device, "--json"});
        EXPECT_EQ(r.exitCode, 0) << r.err.toStdString();
        return QJsonDocument::fromJson(r.out).object();
    }
    bool sfdisk(const QByteArray &script, const QString &target = QString())
    {
        TestUtil::writeFile(image + ".sfdisk", script);
        QProcess p;
        p.setStandardInputFile(image + ".sfdisk");
        p.start("sfdisk", {"--no-reread", "--no-tell-kernel", target.isEmpty() ? image : target});
        return p.waitForFinished(60000) && p.exitCode() == 0;
    }
    QTemporaryDir dir;
    QString image;
};

TEST_F(PartitionsCli, BootRecordDiskMatchesMmls)
{
    ASSERT_TRUE(sfdisk(
        "label: dos\nstart=2048,size=8192,type=83,bootable\nstart=12288,size=100000,type=5\n"
        "start=14336,size=8192,type=83\nstart=24576,size=16384,type=82\nstart=43008,size=4096,type=b\n"));
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    QJsonObject doc = list(loop.Device());
    EXPECT_EQ(doc["partStyle"].toInteger(), 2);
    EXPECT_EQ(doc["sectorSize"].toInteger(), 512);
    EXPECT_EQ(doc["totalSectors"].toInteger(), 131072);
    EXPECT_TRUE(doc["messages"].toArray().isEmpty());
    EXPECT_EQ(listing(doc), mmls(image));
    // The primary partition is active; the extended partition holds the logical ones.
    const QJsonArray parts = doc["partitions"].toArray();
    ASSERT_GE(parts.size(), 3);
    const QJsonObject primary = parts[1].toObject();
    EXPECT_TRUE(primary["active"].toBool());
    EXPECT_EQ(primary["tableSector"].toInteger(), 0);
    const QJsonObject ext = parts[3].toObject();
    EXPECT_EQ(ext["kind"].toInteger(), 1);
    EXPECT_EQ(ext["kindName"].toString(), "Extended");
    EXPECT_GE(ext["children"].toArray().size(), 3);
    for (const char *key : {"index", "kind", "kindName", "start", "length", "active", "tableSector",
                            "typeGuid", "guid", "name", "children"})
        EXPECT_TRUE(primary.contains(key)) << key;
}

TEST_F(PartitionsCli, FourKilobyteSectorsCountInDeviceSectors)
{
    LoopDevice loop(image, {"-b", "4096"});
    ASSERT_FALSE(loop.Device().isEmpty());
    ASSERT_TRUE(sfdisk("label: dos\nstart=256,size=2048,type=83\nstart=4096,size=4096,type=5\n"
                       "start=4352,size=1024,type=83\n",
                       loop.Device()));
    QJsonObject doc = list(loop.Device());
    EXPECT_EQ(doc["sectorSize"].toInteger(), 4096);
    EXPECT_EQ(doc["totalSectors"].toInteger(), 16384);
    EXPECT_EQ(listing(doc), mmls(image, {"-b", "4096"}));
}

TEST_F(PartitionsCli, GptDiskMatchesMmlsAndSgdisk)
{
    ASSERT_EQ(
        TestUtil::run("sgdisk", {"-n", "1:2048:+8M", "-t", "1:8300", "-c", "1:root", "-n", "2:0:+4M", "-t",
                                 "2:0700", "-c", "2:data", "-n", "3:40960:+16M", "-t", "3:8200", image})
            .exitCode,
        0);
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    QJsonObject doc = list(loop.Device());
    EXPECT_EQ(doc["partStyle"].toInteger(), 3);
    EXPECT_EQ(listing(doc), mmls(image));
    const QString info = QString::fromUtf8(TestUtil::run("sgdisk", {"-i", "1", image}).out);
    const QJsonObject first = doc["partitions"].toArray()[1].toObject();
    EXPECT_EQ(first["name"].toString(), "root");
    EXPECT_TRUE(info.contains("Partition unique GUID: " + first["guid"].toString())) << info.toStdString();
    EXPECT_EQ(first["typeGuid"].toString(), "0FC63DAF-8483-4772-8E79-3D69D8477DE4");
}

TEST_F(PartitionsCli, LoopingExtendedChainIsListedWithItsMessage)
{
    ASSERT_TRUE(sfdisk("label: dos\nstart=2048,size=8192,type=83\nstart=12288,size=100000,type=5\n"
                       "start=14336,size=8192,type=83\nstart=24576,size=16384,type=83\n"));
    // The second extended boot record's link is made to point at the first record again.
    QFile f(image);
    ASSERT_TRUE(f.open(QIODevice::ReadWrite));
    const qint64 second = 24576 - 2048;
    ASSERT_TRUE(f.seek(second * 512 + 446 + 16));
    QByteArray link(16, '\0');
    link[1] = char(0xFE);
    link[2] = char(0xFF);
    link[3] = char(0xFF);
    link[4] = 0x05;
    link[5] = char(0xFE);
    link[6] = char(0xFF);
    link[7] = char(0xFF);
    link[12] = 1; // a count of one sector; the start names the record itself
    const quint32 rel = quint32(second - 12288);
    for (int i = 0; i < 4; ++i)
        link[8 + i] = char(rel >> (8 * i));
    ASSERT_EQ(f.write(link), 16);
    f.close();
    LoopDevice loop(image);
    ASSERT_FALSE(loop.Device().isEmpty());
    QJsonObject doc = list(loop.Device());
    // The chain ends at the record already visited, reported once; the two logical partitions stay.
    const QJsonArray messages = doc["messages"].toArray();
    const QString loopMessage =
        QStringLiteral("Invalid description for the partition in the partition table, sector %1").arg(second);
    int count = 0;
    for (const QJsonValue &m : messages)
        count += m.toString().startsWith(loopMessage);
    EXPECT_EQ(count, 1);
    const QJsonArray children = doc["partitions"].toArray()[3].toObject()["children"].toArray();
    int logicals = 0;
    for (const QJsonValue &c : children)
        logicals += c.toObject()["kind"].toInteger() != 0;
    EXPECT_EQ(logicals, 2);
}

} // namespace
