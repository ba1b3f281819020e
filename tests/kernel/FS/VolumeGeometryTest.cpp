// Volumes over images made by the standard tools: kind, sector and cluster sizes, label and
// serial number against blkid and fsstat; partitions inside MBR and GPT disks; BSD disk labels.
#include "Kernel/Implementation/Devices/VolumeCreate.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "tests/kernel/FS/VolumeTestImages.h"
#include "tests/kernel/FS/VolumeTestStorage.h"

#include <gtest/gtest.h>

#include <QRegularExpression>

namespace {

// The number fsstat prints after `field` ("Cluster Size: 4096").
qint64 Fsstat(const QString &path, const QString &field)
{
    if (!TestUtil::haveTool("fsstat"))
        return -1;
    const TestUtil::ToolResult r = TestUtil::run("fsstat", {path});
    const QRegularExpression re(QRegularExpression::escape(field) + QStringLiteral(":\\s*(\\d+)"));
    const auto m = re.match(QString::fromUtf8(r.out));
    return m.hasMatch() ? m.captured(1).toLongLong() : -1;
}

QString Hex8(std::uint32_t v)
{
    return QStringLiteral("%1").arg(v, 8, 16, QLatin1Char('0')).toUpper();
}

struct GeometryCase
{
    const char *image;
    std::uint32_t kind;
    const char *clusterFrom; // "fsstat:Field", "blkid", or a number
    const char *serialFrom;  // "uuid" (first 8 hex digits), "uuidlow" (last 8), "none"
    bool labelFromBlkid;
};

class VolumeMade : public ::testing::TestWithParam<GeometryCase>
{
};

TEST_P(VolumeMade, GeometryLabelAndSerialAgreeWithIndependentReaders)
{
    const GeometryCase c = GetParam();
    const VolumeImages::Made m = VolumeImages::Get(QString::fromLatin1(c.image));
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    FileStorage storage(m.path);
    std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(storage, MediaType::Fixed);
    ASSERT_TRUE(v);
    ASSERT_EQ(v->GetKind(), c.kind);
    const auto tags = VolumeImages::Blkid(m.path);
    const QString cluster = QString::fromLatin1(c.clusterFrom);
    qint64 expected = -1;
    if (cluster.startsWith("fsstat:"))
        expected = Fsstat(m.path, cluster.mid(7));
    else if (cluster == "blkid")
        expected = tags.value("BLOCK_SIZE").toLongLong();
    else
        expected = cluster.toLongLong();
    if (expected > 0) {
        EXPECT_EQ(v->GetClusterSize(), expected);
    }
    const qint64 sector = Fsstat(m.path, "Sector Size");
    if (sector > 0 && c.kind <= 10) {
        EXPECT_EQ(v->GetBytesPerSector(), sector);
    }
    if (c.labelFromBlkid) {
        EXPECT_EQ(v->GetLabel(), tags.value("LABEL"));
    } else if (!m.label.isEmpty()) {
        EXPECT_EQ(v->GetLabel(), m.label);
    }
    const QString uuid = tags.value("UUID").remove('-').toUpper();
    const QString serialFrom = QString::fromLatin1(c.serialFrom);
    if (serialFrom == "uuid") {
        EXPECT_EQ(Hex8(v->GetSerialNumber()), uuid.left(8));
    } else if (serialFrom == "uuidlow") {
        EXPECT_EQ(Hex8(v->GetSerialNumber()), uuid.right(8));
    }
    // Clusters stay inside the volume.
    std::uint64_t first = 0, last = 0, cluster0 = 0;
    const std::uint32_t perCluster = v->GetClusterRange(first, last, cluster0);
    EXPECT_LE(first, last);
    EXPECT_LE(cluster0 + (last + 1) * perCluster, v->GetTotalSectors());
    EXPECT_EQ(v->GetSize(), v->GetTotalSectors() * v->GetBytesPerSector());
    EXPECT_TRUE(v->Messages().isEmpty()) << v->Messages().join('\n').toStdString();
}

INSTANTIATE_TEST_SUITE_P(Tools, VolumeMade,
                         ::testing::Values(GeometryCase{"fat12", 7, "fsstat:Cluster Size", "uuid", true},
                                           GeometryCase{"fat16", 7, "fsstat:Cluster Size", "uuid", true},
                                           GeometryCase{"fat32", 8, "fsstat:Cluster Size", "uuid", true},
                                           GeometryCase{"exfat", 9, "fsstat:Cluster Size", "uuid", true},
                                           GeometryCase{"ntfs", 10, "fsstat:Cluster Size", "uuidlow", true},
                                           GeometryCase{"ext2", 14, "fsstat:Block Size", "uuid", true},
                                           GeometryCase{"ext4", 16, "fsstat:Block Size", "uuid", true},
                                           GeometryCase{"btrfs", 20, "blkid", "uuid", true},
                                           GeometryCase{"xfs", 21, "4096", "uuid", true},
                                           GeometryCase{"jfs", 22, "blkid", "uuid", true},
                                           GeometryCase{"udf", 11, "blkid", "uuid", true},
                                           GeometryCase{"iso", 12, "blkid", "none", true},
                                           GeometryCase{"hfsplus", 13, "blkid", "none", false},
                                           GeometryCase{"apfs", 23, "blkid", "uuid", false},
                                           GeometryCase{"ufs1", 17, "blkid", "uuid", false},
                                           GeometryCase{"ufs2", 17, "fsstat:Fragment Size", "uuid", false}),
                         [](const auto &info) { return std::string(info.param.image); });

struct GradeCase
{
    const char *image;
    std::uint32_t grade;
};

class VolumeGrade : public ::testing::TestWithParam<GradeCase>
{
};

TEST_P(VolumeGrade, FreshVolumesAreAssessed)
{
    const GradeCase c = GetParam();
    const VolumeImages::Made m = VolumeImages::Get(QString::fromLatin1(c.image));
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    FileStorage storage(m.path);
    std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(storage, MediaType::Fixed);
    std::uint64_t valid = 0, checked = 0;
    const std::uint32_t grade = v->GetIntegrity(valid, checked);
    EXPECT_EQ(grade, c.grade) << VolumeIntegrity::GradeName(grade).toStdString() << " valid 0x" << std::hex
                              << valid << " checked 0x" << checked;
    EXPECT_NE(checked, CVolume::AllItems);
    EXPECT_FALSE(VolumeIntegrity::Items(v->GetKind(), valid, checked).isEmpty());
    EXPECT_TRUE(v->GetRootEntry());
    EXPECT_GE(v->GetServiceEntryCount(), 1);
    for (int i = 0; i < v->GetServiceEntryCount(); ++i) {
        CEntry *e = v->GetServiceEntry(i);
        ASSERT_TRUE(e);
        EXPECT_EQ(e->GetAttributes() & (CEntry::AttrSystemArea | CEntry::AttrSectorPosition),
                  CEntry::AttrSystemArea | CEntry::AttrSectorPosition);
        // A service entry reads the same bytes as the volume at its sector.
        QByteArray a(512, 0), b(512, 0);
        std::uint32_t error = 0;
        ASSERT_TRUE(e->ReadBytes(0, 512, a.data(), error)) << e->GetName().toStdString();
        ASSERT_TRUE(v->ReadBytes(e->GetPosition() * v->GetBytesPerSector(), 512, b.data(), error));
        EXPECT_EQ(a, b) << e->GetName().toStdString();
    }
}

INSTANTIATE_TEST_SUITE_P(Tools, VolumeGrade,
                         ::testing::Values(GradeCase{"btrfs", 8}, GradeCase{"xfs", 8}, GradeCase{"jfs", 8},
                                           GradeCase{"udf", 8}, GradeCase{"iso", 8}, GradeCase{"apfs", 8},
                                           GradeCase{"ufs1", 8}, GradeCase{"ufs2", 8}),
                         [](const auto &info) { return std::string(info.param.image); });

// A disk image with the volume of `kind` copied to sector `start`.
QString DiskWith(const QString &name, const QStringList &tool, const QByteArray &script, const QString &image,
                 qint64 start)
{
    const QString path = VolumeImages::Scratch().filePath(name);
    if (!VolumeImages::Sized(path, 96ll << 20))
        return QString();
    if (tool.first() == "sfdisk") {
        QProcess p;
        p.start("sfdisk", {"-q", path});
        p.waitForStarted();
        p.write(script);
        p.closeWriteChannel();
        if (!p.waitForFinished() || p.exitCode() != 0)
            return QString();
    } else if (TestUtil::run(tool.first(), tool.mid(1) << path).exitCode != 0) {
        return QString();
    }
    QFile in(image), out(path);
    if (!in.open(QIODevice::ReadOnly) || !out.open(QIODevice::ReadWrite) || !out.seek(start * 512))
        return QString();
    out.write(in.readAll());
    return path;
}

TEST(VolumePartitioned, VolumesInsideMbrAndGptDisks)
{
    if (!TestUtil::haveTool("sfdisk") || !TestUtil::haveTool("sgdisk"))
        GTEST_SKIP() << "sfdisk and sgdisk are needed";
    struct Case
    {
        const char *image;
        bool gpt;
        std::uint32_t kind;
    };
    for (const Case c : {Case{"exfat", false, 9}, Case{"ext3", false, 15}, Case{"ntfs", true, 10},
                         Case{"jfs", true, 22}, Case{"fat16", false, 7}}) {
        const VolumeImages::Made m = VolumeImages::Get(QString::fromLatin1(c.image));
        if (m.path.isEmpty())
            continue;
        const qint64 start = 4096, length = QFileInfo(m.path).size() / 512;
        const QString disk =
            c.gpt ? DiskWith(
                        QStringLiteral("gpt-%1.img").arg(c.image),
                        {"sgdisk", "-n", QStringLiteral("1:%1:+%2").arg(start).arg(length), "-t", "1:0700"},
                        {}, m.path, start)
                  : DiskWith(QStringLiteral("mbr-%1.img").arg(c.image), {"sfdisk"},
                             QStringLiteral("label: dos\nstart=%1,size=%2,type=83\n")
                                 .arg(start)
                                 .arg(length)
                                 .toUtf8(),
                             m.path, start);
        ASSERT_FALSE(disk.isEmpty()) << c.image;
        FileStorage storage(disk);
        CPartition partition(nullptr, &storage, nullptr, 24, start, length);
        std::vector<CVolume *> announced;
        VolumeCreate::Options options;
        options.announceVolume = [&announced](CVolume *v) { announced.push_back(v); };
        std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(partition, options);
        ASSERT_TRUE(v);
        EXPECT_EQ(v->GetKind(), c.kind) << c.image;
        EXPECT_EQ(partition.GetKind(), c.kind);
        ASSERT_EQ(announced.size(), 1u);
        EXPECT_EQ(announced[0], v.get());
        const auto tags = VolumeImages::Blkid(disk, start * 512);
        EXPECT_EQ(v->GetLabel(), tags.value("LABEL")) << c.image;
        // The volume reads what lies at its partition's sectors.
        QByteArray a(512, 0), b(512, 0);
        std::uint32_t error = 0;
        ASSERT_TRUE(v->ReadBytes(1024, 512, a.data(), error));
        ASSERT_TRUE(storage.ReadBytes(start * 512 + 1024, 512, b.data(), error));
        EXPECT_EQ(a, b);
    }
}

TEST(VolumeBsd, LabelledUfsPartitionBecomesAContainer)
{
    const VolumeImages::Made m = VolumeImages::Get("ufs1");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    QFile f(m.path);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    QByteArray bytes = f.readAll();
    const std::uint32_t sectors = static_cast<std::uint32_t>(bytes.size() / 512);
    bytes.replace(512, 512, VolumeImages::BsdLabel(sectors));
    MemoryStorage storage(bytes);
    CPartition partition(nullptr, &storage, nullptr, 24, 0, sectors);
    std::vector<CPartition *> slices;
    VolumeCreate::Options options;
    options.announcePartition = [&slices](CPartition *p) { slices.push_back(p); };
    std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(partition, options);
    EXPECT_FALSE(v);
    EXPECT_EQ(partition.GetKind(), 5u);
    EXPECT_EQ(FileSystemKindName(partition.GetKind()), "Partition BSD");
    ASSERT_EQ(partition.GetChildCount(), 2u);
    ASSERT_EQ(slices.size(), 2u);
    CPartition *a = partition.GetChildPartition(0);
    EXPECT_EQ(a->GetLength(), sectors - 64u);
    std::unique_ptr<CVolume> inner = VolumeCreate::CreateVolume(*a);
    ASSERT_TRUE(inner);
    EXPECT_EQ(inner->GetKind(), 17u); // a slice is not examined for a label again

    // A table entry that already names a BSD container gets its slices the same way.
    MemoryStorage typedStorage(bytes);
    CPartition typed(nullptr, &typedStorage, nullptr, 5, 0, sectors);
    EXPECT_FALSE(VolumeCreate::CreateVolume(typed));
    EXPECT_EQ(typed.GetChildCount(), 2u);

    // A damaged checksum leaves the partition a plain UFS volume.
    bytes[512 + 60] = 1;
    MemoryStorage damaged(bytes);
    CPartition plain(nullptr, &damaged, nullptr, 24, 0, sectors);
    std::unique_ptr<CVolume> u = VolumeCreate::CreateVolume(plain);
    ASSERT_TRUE(u);
    EXPECT_EQ(u->GetKind(), 17u);
    EXPECT_EQ(plain.GetChildCount(), 0u);
}

TEST(VolumeCreation, ReadyDescriptionSkipsDetection)
{
    const VolumeImages::Made m = VolumeImages::Get("fat16");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    FileStorage storage(m.path);
    CPartition partition(nullptr, &storage, nullptr, 24, 0, storage.GetTotalSectors());
    VolumeDescription d = VolumeCreate::DescribePartition(partition);
    d.kind = 21; // what the caller says, right or wrong
    VolumeCreate::Options options;
    options.description = &d;
    std::unique_ptr<CVolume> v = VolumeCreate::CreateVolume(partition, options);
    ASSERT_TRUE(v);
    // The XFS class finds no superblock: its kind stays, its grade is "Invalid".
    EXPECT_EQ(v->GetKind(), 21u);
    std::uint64_t valid = 0, checked = 0;
    EXPECT_EQ(v->GetIntegrity(valid, checked), 0u);
    EXPECT_FALSE(v->Messages().isEmpty());
    EXPECT_TRUE(v->Messages().first().endsWith(": Main SuperBlock is invalid"));
}

} // namespace
