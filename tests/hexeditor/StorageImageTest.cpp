// Storages over real images made with the standard tools: a plain file edited and saved (the file
// afterwards differs from the original exactly at the edits), a file of a volume in its three
// modes, and the navigation points of MBR and GPT disks and of FAT32, NTFS and ext4 volumes,
// checked against the bytes the tools wrote there.
#include <gtest/gtest.h>

#include <QLocale>
#include <QRegularExpression>
#include <QTemporaryDir>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/Partitions/Partition.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/StorageFactory.h"
#include "hexeditor/StorageFile.h"
#include "hexeditor/StorageLayout.h"
#include "hexeditor/StorageNavigation.h"
#include "hexeditor/StoragePlainFile.h"
#include "hexeditor/StorageVolume.h"
#include "hexeditor/UndoStack.h"
#include "tests/common/TestUtil.h"
#include "tests/hexeditor/StorageTestMedium.h"

using namespace HexEditor;

namespace {

bool tools(const QStringList &names)
{
    for (const QString &n : names)
        if (!TestUtil::haveTool(n))
            return false;
    return true;
}

// The first point (depth first) whose title starts with `prefix`.
const NavigationPoint *findPoint(const QList<NavigationPoint> &points, const QString &prefix)
{
    for (const NavigationPoint &p : points) {
        if (p.title.startsWith(prefix))
            return &p;
        if (const NavigationPoint *inner = findPoint(p.children, prefix))
            return inner;
    }
    return nullptr;
}

QByteArray bytesAt(const QString &path, qint64 offset, qint64 length)
{
    return TestUtil::readFile(path).mid(offset, length);
}

bool run(const QString &tool, const QStringList &args)
{
    const TestUtil::ToolResult r = TestUtil::run(tool, args);
    if (r.exitCode != 0)
        ADD_FAILURE() << tool.toStdString() << " failed: " << r.err.toStdString();
    return r.exitCode == 0;
}

// Copies a file-system image into a disk image at a byte offset.
bool place(const QString &fs, const QString &disk, qint64 offset)
{
    return run("dd", {"if=" + fs, "of=" + disk, "bs=512", "seek=" + QString::number(offset / 512),
                      "conv=notrunc", "status=none"});
}

// The device's partition that starts at `start` (the list holds the gaps too).
CPartition *findPartition(CDevice &device, std::uint64_t start)
{
    for (std::uint32_t i = 0; i < device.GetPartitionCount(); ++i)
        if (device.GetPartition(i)->GetStart() == start && device.GetPartition(i)->GetKind() != 0)
            return static_cast<CPartition *>(device.GetPartition(i));
    return nullptr;
}

} // namespace

TEST(StorageImage, PlainFileSaveChangesExactlyTheEditedBytes)
{
    QTemporaryDir dir;
    const QString path = dir.filePath("data.bin");
    const QByteArray original = patternBytes(100 * 512 + 123, 21); // a partial last sector
    ASSERT_TRUE(TestUtil::writeFile(path, original));
    CRoot root;
    QString error;
    std::unique_ptr<Storage> s = createPlainFileStorage(path, &root, error);
    ASSERT_TRUE(s) << error.toStdString();
    EXPECT_TRUE(s->isFileStorage());
    EXPECT_EQ(s->size(), std::uint64_t(original.size()));
    UndoStack undo(s.get());
    undo.apply(0, QByteArray("HEAD"));
    undo.apply(511, QByteArray("xy"));
    undo.apply(100 * 512 + 120, QByteArray("TAILTAIL")); // cut at the end of the file
    undo.apply(40 * 512, QByteArray(512, '\x55'));
    undo.undo();
    QByteArray expected = original;
    expected.replace(0, 4, "HEAD");
    expected.replace(511, 2, "xy");
    expected.replace(100 * 512 + 120, 3, "TAI");
    EXPECT_EQ(s->read(DiskArea{0, std::uint64_t(original.size())}), expected);
    EXPECT_EQ(TestUtil::readFile(path), original); // nothing reaches the file before saving

    EXPECT_TRUE(undo.save().isEmpty());
    EXPECT_EQ(TestUtil::readFile(path), expected);
    EXPECT_EQ(TestUtil::run("cmp", {"-l", path, dir.filePath("none")}).exitCode, 2);
    const TestUtil::ToolResult cmp =
        TestUtil::run("sh", {"-c", QStringLiteral("printf 'HEAD' | cmp -n 4 - %1").arg(path)});
    EXPECT_EQ(cmp.exitCode, 0);
    EXPECT_FALSE(s->isModified());
}

TEST(StorageImage, PlainFileRangesPastTheEndReadZerosAndNeverLengthenTheFile)
{
    QTemporaryDir dir;
    const QString path = dir.filePath("data.bin");
    const QByteArray original = patternBytes(3 * 512 + 100, 5);
    ASSERT_TRUE(TestUtil::writeFile(path, original));
    CRoot root;
    QString error;
    std::unique_ptr<Storage> s = createPlainFileStorage(path, &root, error);
    ASSERT_TRUE(s) << error.toStdString();
    cStorage *object = s->kernelObject();
    ASSERT_TRUE(object);
    EXPECT_EQ(object->GetTotalSectors(), 4u);

    // Inside the partial last sector: the file's bytes, then zeros.
    QByteArray buffer(512, '\xEE');
    std::uint32_t code = 1;
    EXPECT_TRUE(object->ReadSectors(3, 1, buffer.data(), code));
    EXPECT_EQ(code, 0u);
    EXPECT_EQ(buffer.left(100), original.mid(3 * 512));
    EXPECT_EQ(buffer.mid(100), QByteArray(412, '\0'));

    // Past the last sector: what exists is read, the rest is zeros, and the end is reported.
    QByteArray past(1024, '\xEE');
    EXPECT_FALSE(object->ReadBytes(3 * 512 + 90, 1024, past.data(), code));
    EXPECT_EQ(code, SystemError::HandleEof);
    EXPECT_EQ(past.left(10), original.right(10));
    EXPECT_EQ(past.mid(10), QByteArray(1014, '\0'));

    // A write past the last sector writes what lies inside the file and reports the end.
    const QByteArray bytes(600, 'W');
    EXPECT_FALSE(object->WriteBytes(3 * 512 + 80, 600, bytes.constData(), code));
    EXPECT_EQ(code, SystemError::HandleEof);
    QByteArray expected = original;
    expected.replace(3 * 512 + 80, 20, QByteArray(20, 'W'));
    EXPECT_EQ(TestUtil::readFile(path), expected);

    // A whole last sector writes the file's part only.
    const QByteArray sector(512, 'S');
    EXPECT_TRUE(object->WriteSectors(3, 1, sector.constData(), code));
    expected.replace(3 * 512, 100, QByteArray(100, 'S'));
    EXPECT_EQ(TestUtil::readFile(path), expected);
}

TEST(StorageImage, MissingPlainFileIsRefused)
{
    CRoot root;
    QString error;
    EXPECT_FALSE(createPlainFileStorage(QStringLiteral("/no/such/file.bin"), &root, error));
    EXPECT_FALSE(error.isEmpty());
}

TEST(StorageImage, FileOfAVolumeInItsThreeModes)
{
    if (!tools({"sfdisk"}))
        GTEST_SKIP() << "sfdisk is not installed";
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    ASSERT_TRUE(TestUtil::writeFile(image, patternBytes(8 << 20, 31)));
    ASSERT_TRUE(run("sh", {"-c", "echo '2048,8192,83' | sfdisk -q " + image}));
    CRoot root;
    QString problem;
    CDevice *device = ImageOpen::OpenImage(&root, image, problem);
    ASSERT_TRUE(device) << problem.toStdString();
    CPartition *partition = findPartition(*device, 2048);
    ASSERT_TRUE(partition);

    VolumeDescription d;
    d.start = 2048 * 512;
    d.size = 8192 * 512;
    d.kind = 24;
    d.ready = 1;
    CVolume volume(partition, d);
    CEntry entry(&volume, nullptr, QStringLiteral("file.bin"), 0, 0);
    entry.GetHandle().AddRun(4096, 1024);
    entry.GetHandle().AddRun(CEntryHandle::Sparse, 512);
    entry.GetHandle().AddRun(10240, 2048);
    entry.SetSize(1024 + 512 + 2048);

    StorageFile file(&entry);
    EXPECT_EQ(file.mode(), StorageFile::DiskMode);
    // No file system the storage knows: the record and inode sizes are the storages' defaults.
    EXPECT_EQ(file.fileSystemKind(), 24u);
    EXPECT_EQ(file.mftRecordSize(), 1024u);
    EXPECT_EQ(file.inodeSize(), 128u);
    EXPECT_EQ(file.mftRecordCount(), 0u);
    EXPECT_EQ(file.extents(), (QMap<std::uint64_t, std::uint64_t>{{8, 9}, {20, 23}}));
    const QByteArray disk = TestUtil::readFile(image);
    EXPECT_EQ(file.fileStartOffset(), 2048u * 512 + 4096);
    EXPECT_EQ(file.read(DiskArea{file.fileStartOffset(), 16}), disk.mid(2048 * 512 + 4096, 16));
    EXPECT_TRUE(file.isFileSector(2048 + 9));
    EXPECT_FALSE(file.isFileSector(2048 + 10));
    EXPECT_FALSE(file.isFileSector(9));

    ASSERT_TRUE(file.setMode(StorageFile::PartitionMode));
    EXPECT_EQ(file.fileStartOffset(), 4096u);
    EXPECT_EQ(file.size(), 8192u * 512);
    EXPECT_TRUE(file.isFileSector(20));
    EXPECT_FALSE(file.isFileSector(24));

    ASSERT_TRUE(file.setMode(StorageFile::FileMode));
    EXPECT_EQ(file.fileStartOffset(), 0u);
    EXPECT_EQ(file.size(), 1024u + 512 + 2048);
    const QByteArray content = file.read(DiskArea{0, file.size()});
    EXPECT_EQ(content.left(1024), disk.mid(2048 * 512 + 4096, 1024));
    EXPECT_EQ(content.mid(1024, 512), QByteArray(512, '\0'));
    EXPECT_EQ(content.mid(1536), disk.mid(2048 * 512 + 10240, 2048));
}

TEST(StorageImage, NavigationOfAnMbrDiskWithFat32AndExt4)
{
    if (!tools({"sfdisk", "mkfs.fat", "mkfs.ext4", "dumpe2fs", "dd"}))
        GTEST_SKIP() << "sfdisk, mkfs.fat, mkfs.ext4 or dumpe2fs is not installed";
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img"), fat = dir.filePath("fat.img"),
                  ext = dir.filePath("ext.img");
    ASSERT_TRUE(run("truncate", {"-s", "160M", image}));
    ASSERT_TRUE(run("sh", {"-c", "printf '2048,172032,c\\n174080,,83\\n' | sfdisk -q " + image}));
    ASSERT_TRUE(run("truncate", {"-s", QString::number(172032 * 512), fat}));
    ASSERT_TRUE(run("mkfs.fat", {"-F", "32", "-s", "1", "-R", "32", "-n", "BRINDLE", fat}));
    ASSERT_TRUE(run("truncate", {"-s", "40M", ext}));
    ASSERT_TRUE(run("mkfs.ext4", {"-q", "-F", "-I", "256", ext}));
    ASSERT_TRUE(place(fat, image, 2048 * 512));
    ASSERT_TRUE(place(ext, image, 174080ll * 512));

    CRoot root;
    QString problem;
    CDevice *device = ImageOpen::OpenImage(&root, image, problem);
    ASSERT_TRUE(device) << problem.toStdString();
    std::unique_ptr<Storage> s = createStorage(device);
    const QList<NavigationPoint> &points = s->navigationPoints();
    ASSERT_FALSE(points.isEmpty());
    EXPECT_EQ(points[0].title, QStringLiteral("Partition Table (0)"));
    EXPECT_EQ(points[0].templateType, Templates::MasterBootRecord);
    EXPECT_FALSE(findPoint(points, QStringLiteral("Partition Table (1)"))); // no GPT here

    const qint64 base = 2048 * 512;
    const NavigationPoint *fat1 = findPoint(points, QStringLiteral("FAT1"));
    const NavigationPoint *fat2 = findPoint(points, QStringLiteral("FAT2"));
    const NavigationPoint *rootDir = findPoint(points, QStringLiteral("Root Directory"));
    const NavigationPoint *copy = findPoint(points, QStringLiteral("Boot Sector Copy"));
    ASSERT_TRUE(fat1 && fat2 && rootDir && copy);
    EXPECT_EQ(fat1->offset, std::uint64_t(base + 32 * 512));
    EXPECT_EQ(bytesAt(image, qint64(fat1->offset), 4), QByteArray("\xf8\xff\xff\x0f", 4));
    EXPECT_EQ(bytesAt(image, qint64(fat2->offset), 4), QByteArray("\xf8\xff\xff\x0f", 4));
    EXPECT_EQ(bytesAt(image, qint64(rootDir->offset), 11), QByteArray("BRINDLE    "));
    EXPECT_EQ(bytesAt(image, qint64(copy->offset), 512), bytesAt(image, base, 512));
    EXPECT_EQ(copy->primary, 0);
    EXPECT_EQ(fat1->title, QStringLiteral("FAT1 (%1)").arg(QLocale().toString(2048 + 32)));

    const NavigationPoint *sb = findPoint(points, QStringLiteral("Superblock"));
    ASSERT_TRUE(sb);
    EXPECT_EQ(sb->offset, 174080ull * 512 + 1024);
    EXPECT_EQ(bytesAt(image, qint64(sb->offset) + 0x38, 2), QByteArray("\x53\xef", 2));
    const NavigationPoint *last = findPoint(points, QStringLiteral("Last Sector"));
    ASSERT_TRUE(last);
    EXPECT_EQ(last->offset, (2048ull + 172032 - 1) * 512);

    // The ext4 partition's volume answers its inode size as dumpe2fs reads it.
    CPartition *extPartition = findPartition(*device, 174080);
    ASSERT_TRUE(extPartition);
    if (CVolume *v = extPartition->Volume(); v && v->GetKind() >= 14 && v->GetKind() <= 16) {
        StorageVolume volume(v);
        const QString dump = QString::fromUtf8(TestUtil::run("dumpe2fs", {"-h", ext}).out);
        EXPECT_TRUE(
            dump.contains(QRegularExpression(QStringLiteral("Inode size:\\s+%1\\b").arg(volume.inodeSize()))))
            << volume.inodeSize();
        EXPECT_EQ(volume.inodeSize(), 256u);
        EXPECT_EQ(volume.size(), ((160ull << 20) / 512 - 174080) * 512);
    }
}

TEST(StorageImage, NavigationOfAGptDiskAndAnNtfsVolume)
{
    if (!tools({"sgdisk", "mkfs.ntfs", "dd"}))
        GTEST_SKIP() << "sgdisk or mkfs.ntfs is not installed";
    QTemporaryDir dir;
    const QString image = dir.filePath("gpt.img"), ntfs = dir.filePath("ntfs.img");
    ASSERT_TRUE(run("truncate", {"-s", "80M", image}));
    ASSERT_TRUE(run("sgdisk", {"-n", "1:2048:+64M", "-t", "1:0700", image}));
    ASSERT_TRUE(run("truncate", {"-s", "64M", ntfs}));
    ASSERT_TRUE(run("mkfs.ntfs", {"-q", "-F", "-Q", "-s", "512", "-c", "4096", ntfs}));
    ASSERT_TRUE(place(ntfs, image, 2048 * 512));

    CRoot root;
    QString problem;
    CDevice *device = ImageOpen::OpenImage(&root, image, problem);
    ASSERT_TRUE(device) << problem.toStdString();
    std::unique_ptr<Storage> s = createStorage(device);
    const QList<NavigationPoint> &points = s->navigationPoints();
    const NavigationPoint *gpt = findPoint(points, QStringLiteral("Partition Table (1)"));
    ASSERT_TRUE(gpt);
    EXPECT_EQ(gpt->templateType, Templates::GuidPartitionTable);
    EXPECT_EQ(bytesAt(image, qint64(gpt->offset), 8), QByteArray("EFI PART"));

    const NavigationPoint *mft = findPoint(points, QStringLiteral("$MFT ("));
    const NavigationPoint *mirror = findPoint(points, QStringLiteral("$MFT Mirror"));
    const NavigationPoint *copy = findPoint(points, QStringLiteral("Boot Sector Copy"));
    ASSERT_TRUE(mft && mirror && copy);
    EXPECT_EQ(bytesAt(image, qint64(mft->offset), 4), QByteArray("FILE"));
    EXPECT_EQ(bytesAt(image, qint64(mirror->offset), 4), QByteArray("FILE"));
    EXPECT_EQ(bytesAt(image, qint64(copy->offset), 512), bytesAt(image, 2048 * 512, 512));
    EXPECT_TRUE(findPoint(points, QStringLiteral("MFT No...")));

    // The volume's MFT record size comes from the boot sector's byte 0x40 (0xF6: 1024 bytes).
    CPartition *ntfsPartition = findPartition(*device, 2048);
    ASSERT_TRUE(ntfsPartition);
    if (CVolume *v = ntfsPartition->Volume(); v && v->GetKind() == 10) {
        StorageVolume volume(v);
        EXPECT_EQ(volume.mftRecordSize(), 1024u);

        // A file of the volume answers the volume's file-system questions in every mode; its own
        // data holds no records.
        CEntry entry(v, nullptr, QStringLiteral("file.bin"), 0, 0);
        entry.GetHandle().AddRun(4096, 4096);
        entry.SetSize(4096);
        StorageFile file(&entry);
        ASSERT_EQ(file.mode(), StorageFile::DiskMode);
        EXPECT_EQ(file.fileSystemKind(), 10u);
        EXPECT_EQ(file.clusterSize(), volume.clusterSize());
        EXPECT_EQ(file.clusterSize(), 4096u);
        EXPECT_EQ(file.mftRecordSize(), 1024u);
        EXPECT_EQ(file.mftRecordCount(), volume.mftRecordCount());
        EXPECT_EQ(file.mftRecordOffset(0),
                  volume.mftRecordOffset(0) ? 2048 * 512 + volume.mftRecordOffset(0) : 0);
        ASSERT_TRUE(file.setMode(StorageFile::PartitionMode));
        EXPECT_EQ(file.mftRecordOffset(0), volume.mftRecordOffset(0));
        EXPECT_EQ(file.mftRecordSize(), 1024u);
        ASSERT_TRUE(file.setMode(StorageFile::FileMode));
        EXPECT_EQ(file.mftRecordOffset(0), 0u);
        EXPECT_EQ(file.catalogNodeOffset(0), 0u);
    }
}

TEST(StorageLayout, NtfsRecordSizeFromTheBootByte)
{
    EXPECT_EQ(Layout::ntfsRecordSize(std::int8_t(0xF6), 4096), 1024u);
    EXPECT_EQ(Layout::ntfsRecordSize(2, 4096), 8192u);
    EXPECT_EQ(Layout::ntfsRecordSize(std::int8_t(0x80), 4096), 0u); // 2^128 does not exist
}
