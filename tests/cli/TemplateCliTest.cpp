// brindle-cli template over disks made with sfdisk and sgdisk, compared field by field with what
// sfdisk -d and sgdisk -p / -i print, and over LDM records written by the test.
#include <gtest/gtest.h>

#include <QFile>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QRegularExpression>
#include <QTemporaryDir>

#include <zlib.h>

#include "tests/common/TestUtil.h"

namespace {

struct CliRun
{
    int exitCode = -1;
    QByteArray out;
    QByteArray err;
};

CliRun cli(const QStringList &args)
{
    TestUtil::ToolResult r = TestUtil::run(TestUtil::builtProgram("brindle-cli"), args);
    return {r.exitCode, r.out, r.err};
}

QJsonObject templateJson(const QStringList &args)
{
    CliRun r = cli(QStringList{"template"} + args + QStringList{"--json"});
    EXPECT_EQ(r.exitCode, 0) << r.err.constData();
    return QJsonDocument::fromJson(r.out).object();
}

// The child of `fields` named `name` (first match).
QJsonObject field(const QJsonArray &fields, const QString &name)
{
    for (const QJsonValue &v : fields)
        if (v.toObject().value("name").toString() == name)
            return v.toObject();
    ADD_FAILURE() << "no field " << name.toStdString();
    return {};
}

QJsonObject childAt(const QJsonArray &fields, int index)
{
    return fields.at(index).toObject();
}

QString value(const QJsonObject &parent, const QString &name)
{
    return field(parent.value("children").toArray(), name).value("value").toString();
}

// On-disk GUID bytes ("28 73 2A C1 ...") as the text sgdisk prints.
QString guidOfBytes(const QString &hex)
{
    const QByteArray b = QByteArray::fromHex(hex.toLatin1().replace(' ', ""));
    if (b.size() != 16)
        return {};
    auto h = [&](int i) { return QString::asprintf("%02X", std::uint8_t(b[i])); };
    return h(3) + h(2) + h(1) + h(0) + "-" + h(5) + h(4) + "-" + h(7) + h(6) + "-" + h(8) + h(9) + "-" +
           h(10) + h(11) + h(12) + h(13) + h(14) + h(15);
}

// The text of `sgdisk -i N` after a label ("First sector: 2048 (at 1024.0 KiB)" -> "2048 (...").
QString sgdiskInfo(const QString &text, const QString &label)
{
    const QRegularExpression re(QRegularExpression::escape(label) + ": ([^\n]*)");
    return re.match(text).captured(1).trimmed();
}

class TemplateCli : public ::testing::Test
{
protected:
    void SetUp() override
    {
        ASSERT_TRUE(dir.isValid());
        image = dir.filePath("disk.img");
    }
    void makeImage(qint64 bytes)
    {
        QFile f(image);
        ASSERT_TRUE(f.open(QIODevice::WriteOnly));
        ASSERT_TRUE(f.resize(bytes));
    }
    QTemporaryDir dir;
    QString image;
};

TEST_F(TemplateCli, GptHeaderAndEveryEntryAgreeWithSgdisk)
{
    if (!TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "sgdisk is not installed";
    makeImage(64ll << 20);
    ASSERT_EQ(TestUtil::run("sgdisk", {"-n1:2048:+8M", "-t1:EF00", "-c1:EFI system", "-n2:0:+16M", "-t2:0700",
                                       "-c2:Data volume", "-n3:0:+4M", "-t3:8200", "-c3:swap", image})
                  .exitCode,
              0);
    const QJsonObject doc = templateJson({image, "--auto"});
    EXPECT_EQ(doc.value("type").toInt(), 18);
    EXPECT_EQ(doc.value("name").toString(), "GUID Partition Table");
    EXPECT_EQ(doc.value("offset").toString(), "512");
    const QJsonArray fields = doc.value("fields").toArray();
    ASSERT_EQ(fields.size(), 129); // the header and 128 entries

    const QByteArray disk = TestUtil::readFile(image);
    const QJsonObject header = childAt(fields, 0);
    EXPECT_EQ(header.value("name").toString(), "GPT Header");
    EXPECT_EQ(value(header, "Signature (EFI PART)"), "45 46 49 20 50 41 52 54");
    EXPECT_EQ(value(header, "Header size"), "92");
    EXPECT_EQ(value(header, "Current LBA"), "1");
    EXPECT_EQ(value(header, "Backup LBA"), QString::number((64ll << 20) / 512 - 1));
    EXPECT_EQ(value(header, "Starting LBA of entries"), "2");
    EXPECT_EQ(value(header, "Number of entries"), "128");
    EXPECT_EQ(value(header, "Entry size"), "128");
    EXPECT_EQ(field(header.value("children").toArray(), "(reserved)").value("size").toInt(), 4);

    const QString print = QString::fromUtf8(TestUtil::run("sgdisk", {"-p", image}).out);
    EXPECT_EQ(guidOfBytes(value(header, "Disk GUID")), sgdiskInfo(print, "Disk identifier (GUID)"));
    const QRegularExpression usable("First usable sector is (\\d+), last usable sector is (\\d+)");
    const auto u = usable.match(print);
    ASSERT_TRUE(u.hasMatch());
    EXPECT_EQ(value(header, "First usable LBA"), u.captured(1));
    EXPECT_EQ(value(header, "Last usable LBA"), u.captured(2));

    // The CRCs as zlib computes them over the image's own bytes.
    QByteArray hdr = disk.mid(512, 92);
    hdr.replace(16, 4, QByteArray(4, '\0'));
    const uLong headerCrc = crc32(0, reinterpret_cast<const Bytef *>(hdr.constData()), 92);
    const uLong arrayCrc = crc32(0, reinterpret_cast<const Bytef *>(disk.constData() + 1024), 128 * 128);
    auto le32Hex = [](uLong v) {
        return QString::asprintf("%02X %02X %02X %02X", unsigned(v & 0xFF), unsigned(v >> 8 & 0xFF),
                                 unsigned(v >> 16 & 0xFF), unsigned(v >> 24 & 0xFF));
    };
    EXPECT_EQ(value(header, "Header CRC"), le32Hex(headerCrc));
    EXPECT_EQ(value(header, "CRC of partition array"), le32Hex(arrayCrc));

    const QStringList typeNames = {"EFI System Partition", "Basic Data Partition", "Linux Swap partition"};
    const QStringList names = {"EFI system", "Data volume", "swap"};
    for (int n = 1; n <= 3; ++n) {
        SCOPED_TRACE(n);
        const QString info =
            QString::fromUtf8(TestUtil::run("sgdisk", {"-i", QString::number(n), image}).out);
        const QJsonObject entry = childAt(fields, n);
        const QString first = sgdiskInfo(info, "First sector").section(' ', 0, 0);
        const QString last = sgdiskInfo(info, "Last sector").section(' ', 0, 0);
        EXPECT_TRUE(entry.value("name").toString().startsWith(QStringLiteral("Entry %1 (").arg(n)));
        EXPECT_FALSE(entry.value("name").toString().contains("unused"));
        EXPECT_EQ(value(entry, "Partition type GUID"), typeNames[n - 1]);
        EXPECT_EQ(guidOfBytes(value(entry, "Unique partition GUID")),
                  sgdiskInfo(info, "Partition unique GUID"));
        EXPECT_EQ(value(entry, "First LBA"), first);
        EXPECT_EQ(value(entry, "Last LBA"), last);
        EXPECT_EQ(value(entry, "Partition name"), sgdiskInfo(info, "Partition name").remove('\''));
        EXPECT_EQ(value(entry, "Partition name"), names[n - 1]);
        const QJsonObject firstLba = field(entry.value("children").toArray(), "First LBA");
        EXPECT_EQ(firstLba.value("link").toString(), QString::number(first.toLongLong() * 512));
    }
    // The rest of the array, record by record.
    for (int n = 4; n <= 128; ++n) {
        const QJsonObject entry = childAt(fields, n);
        EXPECT_EQ(entry.value("name").toString(), QStringLiteral("Entry %1 (unused)").arg(n));
        EXPECT_EQ(entry.value("offset").toInt(), 512 + 128 * (n - 1));
    }
}

TEST_F(TemplateCli, GptTypeWithoutNameShowsItsBytes)
{
    if (!TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "sgdisk is not installed";
    makeImage(16ll << 20);
    ASSERT_EQ(TestUtil::run("sgdisk", {"-n1:2048:+4M", "-t1:8300", image}).exitCode, 0);
    const QJsonObject doc = templateJson({image, "--type", "GUID Partition Table", "--offset", "512"});
    const QJsonObject entry = childAt(doc.value("fields").toArray(), 1);
    EXPECT_EQ(guidOfBytes(value(entry, "Partition type GUID")), "0FC63DAF-8483-4772-8E79-3D69D8477DE4");
}

TEST_F(TemplateCli, MbrEntriesAgreeWithSfdisk)
{
    if (!TestUtil::haveTool("sfdisk"))
        GTEST_SKIP() << "sfdisk is not installed";
    makeImage(32ll << 20);
    const QByteArray script = "label: dos\nlabel-id: 0x1a2b3c4d\n"
                              "start=2048, size=8192, type=83, bootable\n"
                              "start=10240, size=16384, type=7\n";
    QFile scriptFile(dir.filePath("layout"));
    ASSERT_TRUE(scriptFile.open(QIODevice::WriteOnly));
    scriptFile.write(script);
    scriptFile.close();
    ASSERT_EQ(
        TestUtil::run("sh", {"-c", QStringLiteral("sfdisk '%1' < '%2'").arg(image, scriptFile.fileName())})
            .exitCode,
        0);

    const QJsonObject doc = templateJson({image, "--auto"});
    EXPECT_EQ(doc.value("type").toInt(), 1);
    const QJsonArray fields = doc.value("fields").toArray();
    ASSERT_EQ(fields.size(), 8);
    EXPECT_EQ(childAt(fields, 1).value("value").toString(), "4D 3C 2B 1A"); // label-id, little-endian
    EXPECT_EQ(childAt(fields, 7).value("name").toString(), "Signature (55 AA)");
    EXPECT_EQ(childAt(fields, 7).value("value").toString(), "55 AA");

    // sfdisk -d: "disk.img1 : start=        2048, size=        8192, type=83, bootable"
    const QString dump = QString::fromUtf8(TestUtil::run("sfdisk", {"-d", image}).out);
    const QRegularExpression line("start=\\s*(\\d+), size=\\s*(\\d+), type=(\\w+)(, bootable)?");
    auto it = line.globalMatch(dump);
    int n = 0;
    while (it.hasNext()) {
        const auto m = it.next();
        ++n;
        SCOPED_TRACE(n);
        const QJsonObject entry = childAt(fields, 2 + n);
        EXPECT_EQ(value(entry, "First sector"), m.captured(1));
        EXPECT_EQ(value(entry, "Total sectors"), m.captured(2));
        EXPECT_EQ(value(entry, "File system ID"), "0x" + m.captured(3).toUpper().rightJustified(2, '0'));
        EXPECT_EQ(value(entry, "Active partition flag (80 = active)"),
                  m.captured(4).isEmpty() ? "0x00" : "0x80");
        EXPECT_TRUE(entry.value("name").toString().startsWith(QStringLiteral("Partition %1 (").arg(n)));
        EXPECT_FALSE(entry.value("name").toString().contains("Unused"));
        const QJsonObject first = field(entry.value("children").toArray(), "First sector");
        EXPECT_EQ(first.value("link").toString(), QString::number(m.captured(1).toLongLong() * 512));
    }
    EXPECT_EQ(n, 2);
    EXPECT_EQ(childAt(fields, 5).value("name").toString(), "Partition 3 (Unused)");
    EXPECT_EQ(childAt(fields, 6).value("name").toString(), "Partition 4 (Unused)");
}

TEST_F(TemplateCli, MbrEntryOfAnNtfsPartitionLinksToTheNtfsBootSector)
{
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("mkntfs"))
        GTEST_SKIP() << "sfdisk or mkntfs is not installed";
    makeImage(32ll << 20);
    ASSERT_EQ(
        TestUtil::run("sh", {"-c", QStringLiteral("echo 'start=2048, type=7' | sfdisk '%1'").arg(image)})
            .exitCode,
        0);
    QString part = dir.filePath("part.img");
    ASSERT_EQ(TestUtil::run("dd", {"if=/dev/zero", "of=" + part, "bs=1M", "count=31"}).exitCode, 0);
    if (TestUtil::run("mkntfs", {"-F", "-Q", "-p", "2048", "-S", "63", "-H", "255", part}).exitCode != 0)
        GTEST_SKIP() << "mkntfs failed";
    ASSERT_EQ(
        TestUtil::run("dd", {"if=" + part, "of=" + image, "bs=512", "seek=2048", "conv=notrunc"}).exitCode,
        0);
    const QJsonObject doc = templateJson({image, "--type", "1", "--offset", "0"});
    const QJsonObject entry = childAt(doc.value("fields").toArray(), 3);
    EXPECT_TRUE(entry.value("name").toString().startsWith("Partition 1 (NTFS, "))
        << entry.value("name").toString().toStdString();
    const QJsonObject first = field(entry.value("children").toArray(), "First sector");
    EXPECT_EQ(first.value("linkTemplate").toInt(), 2);
}

// A big-endian LDM private header and VBLK records written by the test.
QByteArray be(std::uint64_t v, int size)
{
    QByteArray out(size, '\0');
    for (int i = 0; i < size; ++i)
        out[size - 1 - i] = char(v >> (8 * i) & 0xFF);
    return out;
}

TEST_F(TemplateCli, LdmPrivateHeaderWithItsCopy)
{
    QByteArray disk(64 * 512, '\0');
    auto privhead = [](std::uint64_t logStart) {
        QByteArray s(512, '\0');
        s.replace(0, 8, "PRIVHEAD");
        s.replace(12, 2, be(2, 2));
        s.replace(14, 2, be(12, 2));
        s.replace(48, 36, "1b77da20-c717-11d0-a5be-00a0c91db73c");
        s.replace(240, 6, "Dg0Dg0");
        s.replace(283, 8, be(63, 8));
        s.replace(291, 8, be(123456789, 8));
        s.replace(347, 8, be(logStart, 8));
        return s;
    };
    disk.replace(6 * 512, 512, privhead(0x800));
    disk.replace(40 * 512, 512, privhead(0x801));
    ASSERT_TRUE(TestUtil::writeFile(image, disk));
    const QJsonObject doc =
        templateJson({image, "--type", "LDM Private Header", "--offset", "3072", "--copy-offset", "20480"});
    EXPECT_EQ(doc.value("type").toInt(), 11);
    const QJsonArray fields = doc.value("fields").toArray();
    ASSERT_EQ(fields.size(), 21);
    EXPECT_EQ(field(fields, "Signature").value("value").toString(), "PRIVHEAD");
    EXPECT_EQ(field(fields, "Minor version").value("value").toString(), "12");
    EXPECT_EQ(field(fields, "Disk Id GUID (string)").value("value").toString(),
              "1b77da20-c717-11d0-a5be-00a0c91db73c");
    EXPECT_EQ(field(fields, "Disk group name").value("value").toString(), "Dg0Dg0");
    EXPECT_EQ(field(fields, "Data partition size").value("value").toString(), "123456789");
    EXPECT_EQ(field(fields, "Log size").value("value").toString(), "2048");
    EXPECT_EQ(field(fields, "Log size").value("copyValue").toString(), "2049");
    EXPECT_EQ(field(fields, "Data partition start").value("offset").toInt(), 283);
}

TEST_F(TemplateCli, LdmVblkDataFieldOnlyForALengthThatFits)
{
    QByteArray disk(4096, '\0');
    auto vblk = [](std::uint8_t type, std::uint32_t length) {
        QByteArray r(128, '\0');
        r.replace(0, 4, "VBLK");
        r.replace(4, 4, be(7, 4));
        r[19] = char(type);
        r.replace(20, 4, be(length, 4));
        for (int i = 24; i < 128; ++i)
            r[i] = char(i);
        return r;
    };
    disk.replace(0, 128, vblk(0x33, 8));
    disk.replace(128, 128, vblk(0x51, 0));
    disk.replace(256, 128, vblk(0x34, 105));
    disk.replace(384, 128, vblk(0x99, 104));
    ASSERT_TRUE(TestUtil::writeFile(image, disk));
    struct Case
    {
        int offset;
        QString group;
        int dataSize; // 0: no field
    } cases[] = {{0, "Partition", 8}, {128, "Volume", 0}, {256, "Disk", 0}, {384, "Data", 104}};
    for (const Case &c : cases) {
        SCOPED_TRACE(c.offset);
        const QJsonObject doc = templateJson({image, "--type", "15", "--offset", QString::number(c.offset)});
        const QJsonArray fields = doc.value("fields").toArray();
        ASSERT_EQ(fields.size(), 2);
        EXPECT_EQ(value(childAt(fields, 0), "Sequence number"), "7");
        const QJsonObject group = childAt(fields, 1);
        EXPECT_EQ(group.value("name").toString(), c.group);
        const QJsonArray children = group.value("children").toArray();
        EXPECT_EQ(children.size(), c.dataSize ? 5 : 4);
        if (c.dataSize) {
            EXPECT_EQ(childAt(children, 4).value("size").toInt(), c.dataSize);
            EXPECT_TRUE(childAt(children, 4).value("value").toString().startsWith("18 19 1A"));
        }
    }
}

TEST_F(TemplateCli, RecordBeyondTheSourceAndUnknownKinds)
{
    QByteArray disk(1024, '\0');
    ASSERT_TRUE(TestUtil::writeFile(image, disk));
    CliRun past = cli({"template", image, "--type", "1", "--offset", "600", "--json"});
    EXPECT_EQ(past.exitCode, 1);
    EXPECT_TRUE(QJsonDocument::fromJson(past.out).object().value("fields").toArray().isEmpty());
    EXPECT_EQ(cli({"template", image, "--type", "no such kind", "--offset", "0"}).exitCode, 2);
    EXPECT_EQ(cli({"template", image, "--type", "1"}).exitCode, 2);
    // The kind exists but has no template here yet.
    CliRun later = cli({"template", image, "--type", "8", "--offset", "0"});
    EXPECT_EQ(later.exitCode, 1);
    EXPECT_TRUE(later.err.contains("NTFS MFT File Record"));
    // A disk without a table: the automatic choice finds nothing.
    EXPECT_EQ(cli({"template", image, "--auto"}).exitCode, 1);
}

TEST_F(TemplateCli, GptWith4096ByteSectorsHasAFiveSectorRecord)
{
    if (!TestUtil::canAttachLoop() || !TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "needs root with loop devices and sgdisk";
    makeImage(32ll << 20);
    TestUtil::LoopDevice loop(image, {"-b", "4096"});
    if (loop.Device().isEmpty())
        GTEST_SKIP() << "could not attach a loop device with 4096-byte sectors";
    ASSERT_EQ(TestUtil::run("sgdisk", {"-n1:256:+4M", "-c1:four k", loop.Device()}).exitCode, 0);
    const QJsonObject doc = templateJson({loop.Device(), "--auto"});
    EXPECT_EQ(doc.value("offset").toString(), "4096");
    const QJsonArray fields = doc.value("fields").toArray();
    ASSERT_EQ(fields.size(), 129);
    const QJsonObject header = childAt(fields, 0);
    const QJsonArray hc = header.value("children").toArray();
    EXPECT_EQ(childAt(hc, hc.size() - 1).value("size").toInt(), 4004);
    EXPECT_EQ(childAt(fields, 128).value("offset").toInt(), 4096 + 127 * 128); // inside the 5 sectors
    EXPECT_EQ(value(childAt(fields, 1), "First LBA"), "256");
    EXPECT_EQ(value(childAt(fields, 1), "Partition name"), "four k");
    EXPECT_EQ(field(childAt(fields, 1).value("children").toArray(), "First LBA").value("link").toString(),
              QString::number(256ll * 4096));
}

} // namespace
