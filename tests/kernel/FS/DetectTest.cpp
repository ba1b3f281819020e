// File-system detection over volumes made by the standard tools, over their backup copies when
// the primary is wiped, and over structures built here from their published layouts.
#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"
#include "tests/kernel/FS/VolumeTestImages.h"
#include "tests/kernel/FS/VolumeTestStorage.h"

#include <gtest/gtest.h>

#include <cstring>

namespace {

std::uint32_t DetectFile(const QString &path, bool *backup = nullptr, std::uint32_t sectorSize = 512)
{
    FileStorage storage(path, sectorSize);
    EXPECT_TRUE(storage.IsOpen()) << path.toStdString();
    bool used = false;
    const std::uint32_t kind = Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, used);
    if (backup)
        *backup = used;
    return kind;
}

struct KindCase
{
    const char *image;
    std::uint32_t kind;
    const char *blkidType;
};

class DetectMade : public ::testing::TestWithParam<KindCase>
{
};

TEST_P(DetectMade, KindAgreesWithBlkid)
{
    const KindCase c = GetParam();
    const VolumeImages::Made m = VolumeImages::Get(QString::fromLatin1(c.image));
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    bool backup = true;
    EXPECT_EQ(DetectFile(m.path, &backup), c.kind);
    EXPECT_FALSE(backup);
    if (TestUtil::haveTool("blkid")) {
        const auto tags = VolumeImages::Blkid(m.path);
        EXPECT_EQ(tags.value("TYPE"), QString::fromLatin1(c.blkidType));
    }
}

INSTANTIATE_TEST_SUITE_P(Tools, DetectMade,
                         ::testing::Values(KindCase{"fat12", 7, "vfat"}, KindCase{"fat16", 7, "vfat"},
                                           KindCase{"fat32", 8, "vfat"}, KindCase{"exfat", 9, "exfat"},
                                           KindCase{"ntfs", 10, "ntfs"}, KindCase{"ext2", 14, "ext2"},
                                           KindCase{"ext3", 15, "ext3"}, KindCase{"ext4", 16, "ext4"},
                                           KindCase{"btrfs", 20, "btrfs"}, KindCase{"xfs", 21, "xfs"},
                                           KindCase{"jfs", 22, "jfs"}, KindCase{"hfsplus", 13, "hfsplus"},
                                           KindCase{"apfs", 23, "apfs"}, KindCase{"ufs1", 17, "ufs"},
                                           KindCase{"ufs2", 17, "ufs"}),
                         [](const auto &info) { return std::string(info.param.image); });

TEST(DetectMadeUdf, ProbeFindsTheRecognitionSequence)
{
    const VolumeImages::Made m = VolumeImages::Get("udf");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    // Detection proper does not know UDF; the probe that volume creation runs does.
    EXPECT_EQ(DetectFile(m.path), Detect::KindUnknown);
    FileStorage storage(m.path);
    EXPECT_TRUE(Detect::ProbeUdf(storage));
    const VolumeImages::Made iso = VolumeImages::Get("iso");
    if (!iso.path.isEmpty()) {
        FileStorage plain(iso.path);
        EXPECT_FALSE(Detect::ProbeUdf(plain));
    }
}

struct BackupCase
{
    const char *image;
    qint64 wipeAt; // -1: the last 1024 bytes
    qint64 wipeLength;
    std::uint32_t kind;
    bool usedBackup;
};

class DetectBackup : public ::testing::TestWithParam<BackupCase>
{
};

TEST_P(DetectBackup, WipedPrimaryIsFoundThroughTheCopy)
{
    const BackupCase c = GetParam();
    const VolumeImages::Made m = VolumeImages::Get(QString::fromLatin1(c.image));
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    const QString copy = VolumeImages::Copy(m.path, QStringLiteral("wiped-%1.img").arg(c.image));
    ASSERT_FALSE(copy.isEmpty());
    ASSERT_TRUE(VolumeImages::Wipe(copy, c.wipeAt, c.wipeLength));
    bool backup = false;
    EXPECT_EQ(DetectFile(copy, &backup), c.kind);
    EXPECT_EQ(backup, c.usedBackup);
}

INSTANTIATE_TEST_SUITE_P(Copies, DetectBackup,
                         ::testing::Values(BackupCase{"ntfs", 0, 512, 10, true},
                                           BackupCase{"fat32", 0, 512, 8, false},
                                           BackupCase{"exfat", 0, 512, 9, false},
                                           BackupCase{"hfsplus", 1024, 512, 13, false}),
                         [](const auto &info) { return std::string(info.param.image); });

TEST(DetectLimits, SmallOrOddPartitionsAreNeverProbed)
{
    const VolumeImages::Made m = VolumeImages::Get("fat12");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    QFile f(m.path);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    const QByteArray head = f.read(64 * 512);
    bool backup = false;
    MemoryStorage small(head.left(31 * 512));
    small.reads = 0;
    EXPECT_EQ(Detect::DetectFileSystem(small, 0, small.GetSize(), false, backup), Detect::KindUnknown);
    EXPECT_EQ(small.reads, 0);
    MemoryStorage enough(head.left(32 * 512));
    EXPECT_EQ(Detect::DetectFileSystem(enough, 0, enough.GetSize(), false, backup), 7u);
    MemoryStorage tiny(head, 256);
    EXPECT_EQ(Detect::DetectFileSystem(tiny, 0, tiny.GetSize(), false, backup), Detect::KindUnknown);
    // A range that passes the end is refused.
    EXPECT_EQ(Detect::DetectFileSystem(enough, 512, enough.GetSize(), false, backup), Detect::KindUnknown);
}

TEST(DetectLimits, BootRecordSignatureStopsOnlyWhenAsked)
{
    const VolumeImages::Made m = VolumeImages::Get("ext4");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    QFile f(m.path);
    ASSERT_TRUE(f.open(QIODevice::ReadOnly));
    QByteArray bytes = f.read(4 << 20);
    bytes[510] = char(0x55);
    bytes[511] = char(0xAA);
    MemoryStorage storage(bytes);
    bool backup = false;
    EXPECT_EQ(Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, backup), 16u);
    EXPECT_EQ(Detect::DetectFileSystem(storage, 0, storage.GetSize(), true, backup), Detect::KindUnknown);
}

TEST(DetectLimits, OpticalMediaReadOnlyTheDescriptor)
{
    const VolumeImages::Made m = VolumeImages::Get("iso");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    FileStorage storage(m.path);
    bool backup = false;
    EXPECT_EQ(Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, backup, MediaType::CdRom), 12u);
    const VolumeImages::Made fat = VolumeImages::Get("fat16");
    if (!fat.path.isEmpty()) {
        FileStorage other(fat.path);
        EXPECT_EQ(Detect::DetectFileSystem(other, 0, other.GetSize(), false, backup, MediaType::CdRom),
                  Detect::KindUnknown);
    }
}

// ReFS boot sector from the published layout.
QByteArray ReFsBoot(std::uint8_t major, std::uint32_t spc, std::uint64_t sectors)
{
    QByteArray b(512, 0);
    auto *p = reinterpret_cast<std::uint8_t *>(b.data());
    std::memcpy(p + 3, "ReFS\0\0\0\0", 8);
    std::memcpy(p + 16, "FSRS", 4);
    p[20] = 0x00;
    p[21] = 0x02; // 512
    for (int i = 0; i < 8; ++i)
        p[24 + i] = static_cast<std::uint8_t>(sectors >> (8 * i));
    p[32] = 0x00;
    p[33] = 0x02; // 512 bytes per sector
    p[36] = static_cast<std::uint8_t>(spc);
    p[40] = major;
    p[56] = 0x78;
    p[57] = 0x56;
    p[58] = 0x34;
    p[59] = 0x12;
    const std::uint16_t sum = Detect::ReFsChecksum(p, 512);
    p[22] = static_cast<std::uint8_t>(sum);
    p[23] = static_cast<std::uint8_t>(sum >> 8);
    return b;
}

TEST(DetectBuilt, ReFsBootSectorAndItsCopy)
{
    const QByteArray boot = ReFsBoot(3, 8, 4096);
    EXPECT_EQ(Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(boot.constData()), 512), 18u);
    QByteArray bad = boot;
    bad[100] = char(1); // checksum no longer matches
    EXPECT_EQ(Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(bad.constData()), 512), 24u);
    const QByteArray v1 = ReFsBoot(1, 8, 4096); // version 1 needs 64 KiB clusters
    EXPECT_EQ(Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(v1.constData()), 512), 24u);
    const QByteArray odd = ReFsBoot(3, 8, 4095); // not a whole number of clusters
    EXPECT_EQ(Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(odd.constData()), 512), 24u);

    QByteArray disk(4096 * 512, 0);
    disk.replace(disk.size() - 512, 512, boot);
    MemoryStorage storage(disk);
    bool backup = false;
    EXPECT_EQ(Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, backup), 18u);
    EXPECT_TRUE(backup);
}

// A ZFS label: the name-value area's checksum tail and the uberblock ring.
QByteArray ZfsLabel()
{
    QByteArray l(262144, 0);
    auto *p = reinterpret_cast<std::uint8_t *>(l.data());
    const std::uint64_t tail = 0x0210DA7AB10C7A11ull;
    for (int i = 0; i < 8; ++i)
        p[131032 + i] = static_cast<std::uint8_t>(tail >> (8 * i));
    for (int slot : {2, 4, 6}) {
        std::uint8_t *u = p + 131072 + slot * 512;
        const std::uint64_t magic = 0x00BAB10C, version = 5000;
        for (int i = 0; i < 8; ++i) {
            u[i] = static_cast<std::uint8_t>(magic >> (8 * i));
            u[8 + i] = static_cast<std::uint8_t>(version >> (8 * i));
        }
        // The slot's checksum trailer lies in its second half, beyond the 472 bytes examined.
        u[512 + 480] = 0x11;
    }
    return l;
}

TEST(DetectBuilt, ZfsLabelSlotsDecide)
{
    QByteArray label = ZfsLabel();
    auto check = [](const QByteArray &l) {
        return Detect::IsZfsLabel(reinterpret_cast<const std::uint8_t *>(l.constData()), l.size());
    };
    EXPECT_TRUE(check(label));
    QByteArray stray = label;
    stray[131072 + 9 * 512 + 3] = 1; // a non-zero slot that is not an uberblock
    EXPECT_FALSE(check(stray));
    QByteArray empty = ZfsLabel();
    for (int slot : {2, 4, 6})
        empty.replace(131072 + slot * 512, 16, QByteArray(16, 0));
    EXPECT_FALSE(check(empty)); // only zero slots
    QByteArray noTail = label;
    noTail[131032] = 0;
    EXPECT_FALSE(check(noTail));

    QByteArray disk(2 << 20, 0);
    disk.replace(0, label.size(), label);
    MemoryStorage storage(disk);
    bool backup = false;
    EXPECT_EQ(Detect::DetectFileSystem(storage, 0, storage.GetSize(), false, backup), 19u);
}

QByteArray UdfSequence(std::initializer_list<const char *> ids)
{
    QByteArray disk(1 << 20, 0);
    int at = 32768;
    for (const char *id : ids) {
        disk[at] = 0;
        disk.replace(at + 1, 5, QByteArray(id, 5));
        disk[at + 6] = 1;
        at += 2048;
    }
    return disk;
}

TEST(DetectBuilt, UdfRecognitionSequenceOrder)
{
    auto probe = [](const QByteArray &d) {
        MemoryStorage s(d);
        return Detect::ProbeUdf(s);
    };
    EXPECT_TRUE(probe(UdfSequence({"BEA01", "NSR03", "TEA01"})));
    EXPECT_TRUE(probe(UdfSequence({"CD001", "BEA01", "NSR02", "BOOT2", "TEA01"})));
    EXPECT_FALSE(probe(UdfSequence({"NSR03", "BEA01", "TEA01"})));
    EXPECT_FALSE(probe(UdfSequence({"BEA01", "NSR03"})));
    EXPECT_FALSE(probe(UdfSequence({"BEA01", "TEA01"})));
    EXPECT_FALSE(probe(QByteArray(32768 + 4096, 0).append("\0BEA01", 6)));
}

TEST(DetectBuilt, ClassifierSurvivesShortAndHostileBuffers)
{
    QByteArray junk(70000, char(0xFF));
    for (int size : {0, 1, 183, 184, 511, 512, 555, 1376, 1384, 2048, 65536, 70000})
        EXPECT_EQ(Detect::ClassifyBootBlock(reinterpret_cast<const std::uint8_t *>(junk.constData()), size),
                  24u);
    EXPECT_EQ(Detect::ClassifyBootBlock(nullptr, 512), 24u);
}

TEST(DetectBuilt, BtrFsMirrorCountsAsItsOwnPosition)
{
    const VolumeImages::Made m = VolumeImages::Get("btrfs");
    if (m.path.isEmpty())
        GTEST_SKIP() << m.why.toStdString();
    const QString copy = VolumeImages::Copy(m.path, "btrfs-wiped.img");
    ASSERT_TRUE(VolumeImages::Wipe(copy, 65536, 4096));
    EXPECT_EQ(DetectFile(copy), 20u);
}

} // namespace
