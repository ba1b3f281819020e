// brindle-cli hwinfo over this machine with loop devices attached here: the report is well-formed
// and lists every device, with the sizes blockdev and the partition starts sfdisk give.
#include <gtest/gtest.h>

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QMap>
#include <QTemporaryDir>
#include <QXmlStreamReader>

#include "tests/common/TestUtil.h"

namespace {

struct ReportedDevice
{
    QMap<QString, QString> values; // direct children and geometry values
    QStringList partitionStarts;   // first_sector of the top-level partitions that are not gaps
    int sectors = 0;
};

// The devices of a report by platform name.
QMap<QString, ReportedDevice> ReadReport(const QByteArray &xml, QString &error)
{
    const QString device = QStringLiteral("hardware_info/devices/device");
    QMap<QString, ReportedDevice> out;
    QXmlStreamReader reader(xml);
    QStringList stack, texts;
    ReportedDevice current;
    QString partitionStart, partitionKind;
    while (!reader.atEnd()) {
        reader.readNext();
        if (reader.isStartElement()) {
            stack << reader.name().toString();
            texts << QString();
        } else if (reader.isCharacters() && !texts.isEmpty()) {
            texts.last() += reader.text();
        } else if (reader.isEndElement()) {
            const QString path = stack.join('/');
            const QString text = texts.takeLast().trimmed();
            stack.removeLast();
            if (path == device) {
                out.insert(current.values.value("platform_name"), current);
                current = ReportedDevice();
                continue;
            }
            if (!path.startsWith(device + '/'))
                continue;
            const QString rel = path.mid(device.size() + 1);
            if (!rel.contains('/') || rel.startsWith("geometry/") || rel.startsWith("ata/"))
                current.values.insert(rel, text);
            if (rel == "sector")
                ++current.sectors;
            if (rel == "partitions/partition/first_sector")
                partitionStart = text;
            if (rel == "partitions/partition/file_system")
                partitionKind = text;
            if (rel == "partitions/partition" && partitionKind != "Unallocated")
                current.partitionStarts << partitionStart;
        }
    }
    if (reader.hasError())
        error = reader.errorString();
    return out;
}

} // namespace

TEST(CliHwInfo, ReportOfThisMachineListsLoopDevicesAsBlockdevSeesThem)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("blockdev"))
        GTEST_SKIP() << "sfdisk and blockdev are needed";
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());

    // A boot-record disk with two partitions and a GUID-table disk of 4096-byte sectors.
    const QString mbrImage = dir.filePath("mbr.img"), gptImage = dir.filePath("gpt.img");
    ASSERT_EQ(TestUtil::run("truncate", {"-s", "16M", mbrImage}).exitCode, 0);
    ASSERT_EQ(TestUtil::run("truncate", {"-s", "32M", gptImage}).exitCode, 0);
    TestUtil::ToolResult sf = TestUtil::run(
        "sh",
        {"-c", "printf 'label: dos\\nstart=2048, size=8192, type=7, bootable\\nstart=10240, type=83\\n' | "
               "sfdisk -q " +
                   mbrImage});
    ASSERT_EQ(sf.exitCode, 0) << sf.err.toStdString();
    TestUtil::LoopDevice mbr(mbrImage, {});
    TestUtil::LoopDevice gpt(gptImage, {"-b", "4096"});
    ASSERT_FALSE(mbr.Device().isEmpty());
    ASSERT_FALSE(gpt.Device().isEmpty());
    sf =
        TestUtil::run("sh", {"-c", "printf 'label: gpt\\nstart=256, size=2048\\nstart=2304\\n' | sfdisk -q " +
                                       gpt.Device()});
    ASSERT_EQ(sf.exitCode, 0) << sf.err.toStdString();

    const QString report = dir.filePath("hddinfo.xml");
    TestUtil::ToolResult r = TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"hwinfo", report});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();
    const QByteArray xml = TestUtil::readFile(report);
    ASSERT_FALSE(xml.isEmpty());
    if (TestUtil::haveTool("xmllint")) {
        TestUtil::ToolResult lint = TestUtil::run("xmllint", {"--noout", report});
        EXPECT_EQ(lint.exitCode, 0) << lint.err.toStdString();
    }
    QString error;
    const QMap<QString, ReportedDevice> devices = ReadReport(xml, error);
    ASSERT_TRUE(error.isEmpty()) << error.toStdString();

    // Every device the kernel lists is in the report.
    TestUtil::ToolResult listing =
        TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"devices", "--json"});
    ASSERT_EQ(listing.exitCode, 0);
    QStringList listed;
    for (const QJsonValue &v : QJsonDocument::fromJson(listing.out).array())
        listed << v.toObject().value("path").toString();
    for (const QString &path : listed)
        EXPECT_TRUE(devices.contains(path)) << path.toStdString();
    EXPECT_EQ(devices.size(), listed.size());

    for (const TestUtil::LoopDevice *loop : {&mbr, &gpt}) {
        SCOPED_TRACE(loop->Device().toStdString());
        ASSERT_TRUE(devices.contains(loop->Device()));
        const ReportedDevice &d = devices[loop->Device()];
        const qint64 sectorSize = TestUtil::blockdev("--getss", loop->Device());
        EXPECT_EQ(d.values.value("is_ready"), "1");
        EXPECT_EQ(d.values.value("geometry/bytes_per_sector").toLongLong(), sectorSize);
        EXPECT_EQ(d.values.value("geometry/total_sectors").toLongLong() * sectorSize,
                  TestUtil::blockdev("--getsize64", loop->Device()));
        EXPECT_EQ(d.values.value("bios_name"), QString()); // not a physical disk
        EXPECT_EQ(d.values.value("ata/accessible_sectors"), "Not supported");
        EXPECT_GE(d.sectors, 2); // sectors 0 and 63 at least

        // Partition starts as sfdisk reads them from the device.
        TestUtil::ToolResult dump = TestUtil::run("sfdisk", {"--json", loop->Device()});
        ASSERT_EQ(dump.exitCode, 0);
        QStringList starts;
        const QJsonObject table =
            QJsonDocument::fromJson(dump.out).object().value("partitiontable").toObject();
        for (const QJsonValue &p : table.value("partitions").toArray())
            starts << QString::number(p.toObject().value("start").toInteger());
        EXPECT_EQ(d.partitionStarts, starts);
    }
    EXPECT_EQ(devices[mbr.Device()].values.value("part_style"),
              devices[mbr.Device()].values.value("part_style"));
    EXPECT_EQ(devices[gpt.Device()].values.value("geometry/bytes_per_sector"), "4096");

    // A target that cannot be created fails with the system's reason and leaves nothing.
    TestUtil::ToolResult bad =
        TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"hwinfo", dir.filePath("no/such/dir/x.xml")});
    EXPECT_EQ(bad.exitCode, 1);
    EXPECT_TRUE(bad.err.contains("Error [")) << bad.err.toStdString();
    EXPECT_EQ(TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"hwinfo"}).exitCode, 2);
}
