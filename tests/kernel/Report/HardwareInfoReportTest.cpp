// The hardware report over a scripted machine: element order, values, escaping of hostile names,
// sector dumps, and no partial file when a write fails.
#include <gtest/gtest.h>

#include <QTemporaryDir>
#include <QXmlStreamReader>

#include <memory>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Report/HardwareInfo.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/common/RootTestSupport.h"
#include "tests/common/TestUtil.h"

using namespace RootTest;

namespace {

constexpr quint64 DiskBytes = 8u << 20;

// A disk with one active NTFS-type partition at 2048 of 4096 sectors; sector 0 holds a '<'.
QByteArray MbrDisk()
{
    QByteArray d = Disk(DiskBytes, true);
    auto put32 = [&](int at, quint32 v) {
        for (int i = 0; i < 4; ++i)
            d[at + i] = char((v >> (8 * i)) & 0xFF);
    };
    d[446] = char(0x80);
    d[446 + 4] = char(0x07);
    put32(446 + 8, 2048);
    put32(446 + 12, 4096);
    d[0x20] = '<';
    d[0x21] = ']';
    d[0x22] = ']';
    d[0x23] = '>';
    d[63 * 512] = 'Z';
    d[2048 * 512 + 3] = 'N';
    return d;
}

struct Machine
{
    ScriptedBackend backend;
    FakeSource source;
    std::unique_ptr<CRoot> root;

    Machine()
    {
        AnswerGeometry(backend, 512, DeviceControl::PARTITION_STYLE_MBR, DiskBytes);
        backend.AddFile("/dev/sda", MbrDisk());
        EnumCandidate c = Candidate("/dev/sda", 0, EnumSource::PhysicalDrive, DiskBytes);
        c.model = QStringLiteral("Disk & Co <Model> \x01");
        c.firmware = QStringLiteral("1.0&");
        VolumeInfo v;
        v.path = QStringLiteral("/dev/sda1");
        v.mountPoint = QStringLiteral("/mnt/a&b");
        v.label = QStringLiteral("A&B<C>]]>");
        v.fileSystem = FileSystemKind::Ntfs;
        v.sectorSize = 512;
        v.clusterSize = 4096;
        v.totalSize = 4096ull * 512;
        v.freeSize = 1024ull * 512;
        v.partitionNumber = 1;
        VolumeExtent e;
        e.number = 0;
        e.offset = 2048ull * 512;
        e.length = 4096ull * 512;
        v.extents.append(e);
        source.Set({c}, {v});
        root = std::make_unique<CRoot>(&backend, &source);
    }
};

struct Element
{
    QString path;
    QString text;
};

// Every element as its path from the root with its text, in document order.
QList<Element> Flatten(const QByteArray &xml, QString *error)
{
    QList<Element> out;
    QXmlStreamReader reader(xml);
    QStringList stack;
    QList<QString> texts;
    while (!reader.atEnd()) {
        reader.readNext();
        if (reader.isStartElement()) {
            stack << reader.name().toString();
            texts << QString();
        } else if (reader.isCharacters() && !texts.isEmpty()) {
            texts.last() += reader.text();
        } else if (reader.isEndElement()) {
            out << Element{stack.join('/'), texts.takeLast().trimmed()};
            stack.removeLast();
        }
    }
    if (reader.hasError() && error)
        *error = reader.errorString();
    return out;
}

QString Value(const QList<Element> &all, const QString &path)
{
    for (const Element &e : all)
        if (e.path == path)
            return e.text;
    return QStringLiteral("<absent>");
}

} // namespace

TEST(HardwareInfoReport, ScriptedMachineIsWellFormedAndComplete)
{
    Machine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    ASSERT_EQ(m.root->GetDeviceCount(), 1u);

    HardwareInfo::Header header;
    header.application = QStringLiteral("Brindle & <friends>");
    header.platform = QStringLiteral("Test Platform");
    header.stylesheet = QStringLiteral("report.xsl?a=1&b=\"2\"");
    header.created = QDateTime::currentDateTime();
    const QByteArray xml = HardwareInfo::Build(m.root->Devices(), header);
    ASSERT_FALSE(xml.isEmpty());

    QString error;
    const QList<Element> all = Flatten(xml, &error);
    ASSERT_TRUE(error.isEmpty()) << error.toStdString() << "\n" << xml.constData();
    if (TestUtil::haveTool("xmllint")) {
        QTemporaryDir dir;
        const QString path = dir.filePath("hddinfo.xml");
        ASSERT_TRUE(TestUtil::writeFile(path, xml));
        auto lint = TestUtil::run("xmllint", {"--noout", path});
        EXPECT_EQ(lint.exitCode, 0) << lint.err.constData();
    }

    // The declaration, the stylesheet instruction and the root, each on its own CR LF line.
    const QList<QByteArray> lines = xml.split('\n');
    ASSERT_GT(lines.size(), 5);
    EXPECT_TRUE(lines[0].startsWith("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\r")) << lines[0].constData();
    EXPECT_TRUE(lines[1].startsWith(
        "<?xml-stylesheet type=\"text/xsl\" href=\"report.xsl?a=1&amp;b=&quot;2&quot;\"?>"))
        << lines[1].constData();
    EXPECT_EQ(lines[2], "<hardware_info>\r");
    EXPECT_EQ(lines[3], "<main>\r");
    EXPECT_EQ(xml.count("\r\n"), xml.count("\n"));

    // Element order of the main part and of a ready device.
    QStringList order;
    for (const Element &e : all)
        if (e.path.startsWith("hardware_info/main/") ||
            (e.path.count('/') == 3 && e.path.startsWith("hardware_info/devices/device/")))
            order << e.path.section('/', -1);
    EXPECT_EQ(order,
              (QStringList{
                  "application",     "kernel",     "created",        "platform",         "display_name",
                  "platform_name",   "bios_name",  "bios_version",   "bios_serial_DIOC", "bios_serial_SMART",
                  "bios_serial_WMI", "media_type", "is_ready",       "part_style",       "has_ldm",
                  "has_lvm",         "has_wss",    "is_initialized", "geometry",         "ata",
                  "sector",          "sector",     "partitions"}));

    const QString dev = QStringLiteral("hardware_info/devices/device/");
    EXPECT_EQ(Value(all, "hardware_info/main/application"), header.application);
    EXPECT_EQ(Value(all, "hardware_info/main/kernel"), QStringLiteral("14.04.23"));
    EXPECT_EQ(Value(all, dev + "platform_name"), QStringLiteral("/dev/sda"));
    EXPECT_EQ(Value(all, dev + "bios_name"), QStringLiteral("80h"));
    EXPECT_EQ(Value(all, dev + "bios_version"), QStringLiteral("1.0&"));
    EXPECT_TRUE(Value(all, dev + "display_name").contains(QStringLiteral("Disk & Co <Model>")))
        << Value(all, dev + "display_name").toStdString();
    EXPECT_EQ(Value(all, dev + "media_type"), QStringLiteral("Fixed Disk"));
    EXPECT_EQ(Value(all, dev + "is_ready"), QStringLiteral("1"));
    EXPECT_EQ(Value(all, dev + "is_initialized"), QStringLiteral("1"));
    EXPECT_EQ(Value(all, dev + "geometry/total_sectors"), QString::number(DiskBytes / 512));
    EXPECT_EQ(Value(all, dev + "geometry/bytes_per_sector"), QStringLiteral("512"));
    EXPECT_EQ(Value(all, dev + "geometry/total_size"), QStringLiteral("8.00 MB"));
    // Without ATA answers all three native sizes are unknown.
    EXPECT_EQ(Value(all, dev + "ata/accessible_sectors"), QStringLiteral("Not supported"));
    EXPECT_EQ(Value(all, dev + "ata/native_sectors_hpa"), QStringLiteral("Not supported"));
    EXPECT_EQ(Value(all, dev + "ata/native_sectors_dco"), QStringLiteral("Not supported"));
    EXPECT_EQ(Value(all, "hardware_info/log_info"), QStringLiteral("No log info"));

    // Sector 0: 32 lines, the '<' shown as '.', the "]]>" in the data kept apart from the markup.
    QXmlStreamReader reader(xml);
    QStringList dumps;
    while (reader.readNextStartElement() || !reader.atEnd()) {
        if (reader.isStartElement() && reader.name() == QLatin1String("sector")) {
            const QString number = reader.attributes().value("number").toString();
            dumps << number + ":" + reader.readElementText();
        } else
            reader.readNext();
    }
    ASSERT_GE(dumps.size(), 3);
    EXPECT_TRUE(dumps[0].startsWith("0:"));
    EXPECT_TRUE(dumps[1].startsWith("63:"));
    const QStringList sector0 = dumps[0].mid(2).split('\n', Qt::SkipEmptyParts);
    EXPECT_EQ(sector0.size(), 32);
    EXPECT_TRUE(sector0[2].trimmed().endsWith(QStringLiteral(".]]>............")))
        << sector0[2].toStdString();
    EXPECT_TRUE(dumps[1].contains(QStringLiteral("00000000    5A 00"))) << dumps[1].toStdString();
    EXPECT_TRUE(dumps[2].startsWith("2048:")) << dumps[2].toStdString();
}

TEST(HardwareInfoReport, PartitionsCarryTheirVolumeAndLogLinesArePrefixed)
{
    Machine m;
    ASSERT_TRUE(m.root->RefreshAndWait());
    HardwareInfo::Header header;
    header.logLines = {QStringLiteral("first & <line>"), QStringLiteral("second")};
    const QByteArray xml = HardwareInfo::Build(m.root->Devices(), header);
    QString error;
    const QList<Element> all = Flatten(xml, &error);
    ASSERT_TRUE(error.isEmpty()) << error.toStdString();
    EXPECT_EQ(Value(all, "hardware_info/log_info"), QStringLiteral(">>first & <line>\n>>second"));

    const QString part = QStringLiteral("hardware_info/devices/device/partitions/partition/");
    QStringList firstSectors;
    for (const Element &e : all)
        if (e.path == part + "first_sector")
            firstSectors << e.text;
    EXPECT_TRUE(firstSectors.contains(QStringLiteral("2048"))) << firstSectors.join(',').toStdString();
    if (Value(all, part + "drive/volume_label") == QStringLiteral("<absent>"))
        GTEST_SKIP() << "the platform volume was not matched to the partition";
    EXPECT_EQ(Value(all, part + "drive/volume_label"), QStringLiteral("A&B<C>]]>"));
    EXPECT_EQ(Value(all, part + "drive/system_name"), QStringLiteral("/mnt/a&b"));
    EXPECT_EQ(Value(all, part + "drive/used_space"), QStringLiteral("1.50 MB"));
    EXPECT_EQ(Value(all, part + "drive/sectors_per_cluster"), QStringLiteral("8"));
}

TEST(HardwareInfoReport, FailedWriteLeavesNoFile)
{
    ScriptedBackend backend;
    FakeSource source;
    CRoot root(&backend, &source);
    std::uint32_t error = 0;
    backend.ScriptWrite({SystemError::DiskFull, -1});
    EXPECT_FALSE(HardwareInfo::WriteDocument(&root, "/reports/hddinfo.xml", "<a/>", error));
    EXPECT_EQ(error, SystemError::DiskFull);
    EXPECT_FALSE(backend.HasFile("/reports/hddinfo.xml"));

    EXPECT_TRUE(HardwareInfo::WriteDocument(&root, "/reports/hddinfo.xml", "<a/>\r\n", error));
    EXPECT_EQ(backend.FileData("/reports/hddinfo.xml"), QByteArray("<a/>\r\n"));
    // A shorter report replaces a longer one completely.
    EXPECT_TRUE(HardwareInfo::WriteDocument(&root, "/reports/hddinfo.xml", "<b/>", error));
    EXPECT_EQ(backend.FileData("/reports/hddinfo.xml"), QByteArray("<b/>"));
    EXPECT_EQ(HardwareInfo::SizeText(512), QStringLiteral("512 B"));
    EXPECT_EQ(HardwareInfo::SizeText(1536), QStringLiteral("1.50 KB"));
}
