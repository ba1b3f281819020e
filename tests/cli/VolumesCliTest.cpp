// brindle-cli volumes over a disk image with an MBR of two file systems, checked against blkid
// and fsstat at the partitions' offsets.
#include <gtest/gtest.h>

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QProcess>
#include <QRegularExpression>
#include <QTemporaryDir>

#include "tests/common/TestUtil.h"

namespace {

bool Tools()
{
    for (const char *t : {"sfdisk", "mkfs.vfat", "mke2fs", "blkid"})
        if (!TestUtil::haveTool(t))
            return false;
    return true;
}

QMap<QString, QString> Blkid(const QString &path, qint64 offset)
{
    QMap<QString, QString> tags;
    const TestUtil::ToolResult r =
        TestUtil::run("blkid", {"-p", "-o", "export", "-O", QString::number(offset), path});
    for (const QByteArray &line : r.out.split('\n')) {
        const int eq = line.indexOf('=');
        if (eq > 0)
            tags.insert(QString::fromUtf8(line.left(eq)), QString::fromUtf8(line.mid(eq + 1)));
    }
    return tags;
}

class VolumesCli : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!Tools())
            GTEST_SKIP() << "sfdisk, mkfs.vfat, mke2fs and blkid are needed";
        m_disk = m_dir.filePath("disk.img");
        QFile f(m_disk);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly) && f.resize(48 << 20));
        f.close();
        QProcess p;
        p.start("sfdisk", {"-q", m_disk});
        p.waitForStarted();
        p.write("label: dos\nstart=2048,size=32768,type=6\nstart=36864,size=40960,type=83\n");
        p.closeWriteChannel();
        ASSERT_TRUE(p.waitForFinished() && p.exitCode() == 0);
        const QString fat = m_dir.filePath("fat.img");
        QFile ff(fat);
        ASSERT_TRUE(ff.open(QIODevice::WriteOnly) && ff.resize(qint64(32768) * 512));
        ff.close();
        ASSERT_EQ(TestUtil::run("mkfs.vfat", {"-F", "16", "-n", "CLIFAT", "-i", "0BADF00D", fat}).exitCode,
                  0);
        QFile in(fat), out(m_disk);
        ASSERT_TRUE(in.open(QIODevice::ReadOnly) && out.open(QIODevice::ReadWrite) && out.seek(2048 * 512));
        out.write(in.readAll());
        out.close();
        ASSERT_EQ(TestUtil::run("mke2fs", {"-q", "-F", "-t", "ext4", "-L", "CLIEXT", "-E",
                                           QStringLiteral("offset=%1").arg(36864ll * 512), m_disk, "20480"})
                      .exitCode,
                  0);
    }

    QTemporaryDir m_dir;
    QString m_disk;
};

TEST_F(VolumesCli, JsonListsEveryVolumeWithItsGeometry)
{
    const TestUtil::ToolResult r =
        TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"volumes", m_disk, "--json"});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();
    const QJsonArray list = QJsonDocument::fromJson(r.out).array();
    ASSERT_EQ(list.size(), 2) << r.out.toStdString();
    const QJsonObject fat = list[0].toObject(), ext = list[1].toObject();
    for (const char *key : {"partition", "start", "kind", "kindName", "displayName", "label", "serial",
                            "sectorSize", "sectorCount", "clusterSize", "firstCluster", "lastCluster",
                            "cluster0Sector", "freeBytes", "grade", "gradeName", "items", "messages"})
        EXPECT_TRUE(fat.contains(key)) << key;
    EXPECT_EQ(fat["start"].toInteger(), 2048);
    EXPECT_EQ(fat["kind"].toInteger(), 7);
    EXPECT_EQ(fat["kindName"].toString(), "FAT");
    EXPECT_EQ(fat["label"].toString(), Blkid(m_disk, 2048 * 512).value("LABEL"));
    EXPECT_EQ(fat["serial"].toString(), "0BADF00D");
    EXPECT_EQ(fat["firstCluster"].toInteger(), 2);
    EXPECT_TRUE(fat["displayName"].toString().startsWith("CLIFAT ("));
    EXPECT_EQ(ext["start"].toInteger(), 36864);
    EXPECT_EQ(ext["kind"].toInteger(), 16);
    EXPECT_EQ(ext["label"].toString(), "CLIEXT");
    EXPECT_EQ(ext["sectorCount"].toInteger(), 40960);
    if (TestUtil::haveTool("fsstat")) {
        const TestUtil::ToolResult s = TestUtil::run("fsstat", {"-o", "2048", m_disk});
        const auto m = QRegularExpression("Cluster Size:\\s*(\\d+)").match(QString::fromUtf8(s.out));
        ASSERT_TRUE(m.hasMatch());
        EXPECT_EQ(fat["clusterSize"].toInteger(), m.captured(1).toLongLong());
        const TestUtil::ToolResult e = TestUtil::run("fsstat", {"-o", "36864", m_disk});
        const auto b = QRegularExpression("Block Size:\\s*(\\d+)").match(QString::fromUtf8(e.out));
        ASSERT_TRUE(b.hasMatch());
        EXPECT_EQ(ext["clusterSize"].toInteger(), b.captured(1).toLongLong());
        const auto fb = QRegularExpression("Free Blocks:\\s*(\\d+)").match(QString::fromUtf8(e.out));
        if (fb.hasMatch()) {
            EXPECT_EQ(ext["freeBytes"].toInteger(), fb.captured(1).toLongLong() * b.captured(1).toLongLong());
        }
    }
}

TEST_F(VolumesCli, TextAndUsage)
{
    const QString exe = TestUtil::builtProgram("brindle-cli");
    const TestUtil::ToolResult r = TestUtil::run(exe, {"volumes", m_disk});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();
    EXPECT_TRUE(r.out.contains("Kind: 7 FAT"));
    EXPECT_TRUE(r.out.contains("Label: 'CLIEXT'"));
    EXPECT_TRUE(r.out.contains("Overall Integrity Status:"));
    EXPECT_EQ(TestUtil::run(exe, {"volumes"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(exe, {"volumes", m_disk, "--bogus"}).exitCode, 2);
    EXPECT_EQ(TestUtil::run(exe, {"volumes", m_dir.filePath("missing.img")}).exitCode, 1);
}

} // namespace
