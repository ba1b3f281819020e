// The volume base: sector transfers with clipping and the boot-sector overlay, cluster
// conversions and their messages, display names, integrity grades and item lists.
#include "Kernel/Implementation/FS/Volume.h"
#include "Kernel/Implementation/FS/VolumeIntegrity.h"
#include "tests/kernel/FS/VolumeTestStorage.h"

#include <gtest/gtest.h>

namespace {

// A volume with a chosen cluster layout and access to the overlay.
class TestVolume : public CVolume
{
public:
    TestVolume(cStorage *medium, const VolumeDescription &d) : CVolume(medium, d) {}
    using CVolume::Message;
    using CVolume::SetClusterGeometry;
    using CVolume::SetOverlay;
    void SetLabel(const QString &label) { m_label = label; }
    void SetMasks(std::uint64_t valid, std::uint64_t checked)
    {
        m_validItems = valid;
        m_checkedItems = checked;
    }
    std::uint32_t grade = 3;

protected:
    std::uint32_t GradeIntegrity() override { return grade; }
};

QByteArray Numbered(int sectors, int sectorSize = 512)
{
    QByteArray b(sectors * sectorSize, 0);
    for (int i = 0; i < b.size(); ++i)
        b[i] = static_cast<char>(i / sectorSize + 1);
    return b;
}

VolumeDescription Describe(std::uint64_t size, std::uint32_t sectorSize = 512)
{
    VolumeDescription d;
    d.size = size;
    d.sectorSize = sectorSize;
    d.ready = 1;
    d.mountId = 7;
    return d;
}

TEST(VolumeTransfer, ReadsPastTheEndAreCutZeroFilledAndFail)
{
    MemoryStorage medium(Numbered(64));
    TestVolume v(&medium, Describe(64 * 512));
    QByteArray out(8 * 512, 'x');
    std::uint32_t error = 0;
    EXPECT_FALSE(v.ReadSectors(60, 8, out.data(), error));
    EXPECT_EQ(out[0], char(61));
    EXPECT_EQ(out[4 * 512 - 1], char(64));
    EXPECT_EQ(out[4 * 512], char(0));
    EXPECT_EQ(out[8 * 512 - 1], char(0));
    EXPECT_FALSE(v.ReadSectors(64, 1, out.data(), error));
    EXPECT_TRUE(v.ReadSectors(63, 1, out.data(), error));
    // A write past the end writes what exists and reports failure.
    const QByteArray data(2 * 512, 'w');
    EXPECT_FALSE(v.WriteSectors(63, 2, data.constData(), error));
    EXPECT_EQ(medium.Bytes().at(63 * 512), 'w');
    EXPECT_EQ(medium.Bytes().size(), 64 * 512);
}

TEST(VolumeTransfer, OverlayServesItsSectorsWithoutWritingThem)
{
    MemoryStorage medium(Numbered(64));
    TestVolume v(&medium, Describe(64 * 512));
    const QByteArray boot(512, 'B');
    v.SetOverlay(0, 6, boot);
    QByteArray out(8 * 512, 0);
    std::uint32_t error = 0;
    ASSERT_TRUE(v.ReadSectors(0, 8, out.data(), error));
    EXPECT_EQ(out.mid(0, 512), boot);
    EXPECT_EQ(out[512], char(2));
    EXPECT_EQ(out.mid(6 * 512, 512), boot);
    EXPECT_EQ(medium.Bytes().at(0), char(1)); // the medium keeps its own sector
    // A write into an overlaid sector changes the overlay too.
    const QByteArray data(512, 'n');
    ASSERT_TRUE(v.WriteSectors(6, 1, data.constData(), error));
    ASSERT_TRUE(v.ReadSectors(0, 1, out.data(), error));
    EXPECT_EQ(out.left(512), data);
    v.SetOverlay(CVolume::NoSector, CVolume::NoSector, QByteArray());
    ASSERT_TRUE(v.ReadSectors(1, 1, out.data(), error));
    EXPECT_EQ(out[0], char(2));
}

TEST(VolumeTransfer, OtherSectorSizeGoesThroughBytes)
{
    MemoryStorage medium(Numbered(64));
    TestVolume v(&medium, Describe(64 * 512, 2048));
    EXPECT_EQ(v.GetBytesPerSector(), 2048u);
    EXPECT_EQ(v.GetTotalSectors(), 16u);
    QByteArray out(2048, 0);
    std::uint32_t error = 0;
    ASSERT_TRUE(v.ReadSectors(3, 1, out.data(), error));
    EXPECT_EQ(out[0], char(13));
    EXPECT_EQ(out[2047], char(16));
    char b = 0;
    ASSERT_TRUE(v.ReadBytes(5 * 512 + 3, 1, &b, error));
    EXPECT_EQ(b, char(6));
}

TEST(VolumeClusters, ConversionsStayInsideTheRange)
{
    MemoryStorage medium(Numbered(1000));
    TestVolume v(&medium, Describe(1000 * 512));
    ASSERT_TRUE(v.SetClusterGeometry(4096, 100, 2, 111));
    EXPECT_EQ(v.GetClusterSize(), 4096u);
    std::uint64_t first = 0, last = 0, cluster0 = 0;
    EXPECT_EQ(v.GetClusterRange(first, last, cluster0), 8u);
    EXPECT_EQ(v.ClusterToSector(2), 116u);
    EXPECT_EQ(v.ClusterToSector(111), 100u + 111 * 8);
    EXPECT_EQ(v.ClusterToSector(1), CVolume::NoSector);
    EXPECT_EQ(v.ClusterToSector(112), CVolume::NoSector);
    EXPECT_EQ(v.ClusterToSector(~0ull >> 1), CVolume::NoSector);
    EXPECT_EQ(v.SectorToCluster(99), CVolume::NoSector);
    EXPECT_EQ(v.SectorToCluster(115), CVolume::NoSector); // cluster 1
    EXPECT_EQ(v.SectorToCluster(123), 2u);
    EXPECT_EQ(v.SectorToCluster(100 + 112 * 8), CVolume::NoSector);
    EXPECT_FALSE(v.SetClusterGeometry(3000, 0, 0, 1));
    EXPECT_FALSE(v.SetClusterGeometry(256, 0, 0, 1));
}

TEST(VolumeClusters, InvalidClusterTransfersNameTheVolume)
{
    MemoryStorage medium(Numbered(100));
    TestVolume v(&medium, Describe(100 * 512));
    v.SetLabel("DATA");
    ASSERT_TRUE(v.SetClusterGeometry(1024, 4, 2, 20));
    QByteArray out(1024, 0);
    std::uint32_t error = 0;
    ASSERT_TRUE(v.ReadCluster(2, out.data(), error));
    EXPECT_EQ(out[0], char(9)); // sector 8
    EXPECT_FALSE(v.ReadCluster(21, out.data(), error));
    EXPECT_FALSE(v.WriteCluster(1, out.constData(), error));
    const QStringList m = v.Messages();
    ASSERT_EQ(m.size(), 2);
    EXPECT_EQ(m[0], "DATA (7:): Attempt to read invalid cluster number 21");
    EXPECT_EQ(m[1], "DATA (7:): Attempt to write invalid cluster number 1");
}

TEST(VolumeNames, DisplayNameRules)
{
    MemoryStorage medium(Numbered(64));
    VolumeDescription d = Describe(64 * 512);
    {
        TestVolume v(&medium, d);
        EXPECT_EQ(v.GetDisplayName(), "Local Disk (7:)");
        EXPECT_EQ(v.GetDriveId(), 7u | 0x80000000u);
        v.SetLabel("Work");
        EXPECT_EQ(v.GetDisplayName(), "Work (7:)");
    }
    d.driveId = 2;
    {
        TestVolume v(&medium, d);
        EXPECT_EQ(v.GetDisplayName(), "Local Disk (C:)");
        EXPECT_EQ(v.GetDriveId(), 2u);
    }
    d.driveId = 26;
    d.name = "/dev/sdb1";
    {
        TestVolume v(&medium, d);
        EXPECT_EQ(v.GetDisplayName(), "Local Disk (sdb1)");
    }
    d.secondName = "/media/user/STICK";
    d.ready = 0;
    {
        TestVolume v(&medium, d);
        v.SetLabel("Ignored");
        EXPECT_EQ(v.GetDisplayName(), "[not ready] (STICK)");
    }
}

TEST(VolumeIntegrityGrades, MasksDecideTheGrade)
{
    MemoryStorage medium(Numbered(64));
    TestVolume v(&medium, Describe(64 * 512));
    std::uint64_t valid = 0, checked = 0;
    EXPECT_EQ(v.GetIntegrity(valid, checked), 0u); // not assessed
    EXPECT_EQ(checked, CVolume::AllItems);
    v.SetMasks(0x29, 0x29);
    EXPECT_EQ(v.GetIntegrity(valid, checked), 8u);
    v.SetMasks(0x21, 0x29);
    EXPECT_EQ(v.GetIntegrity(valid, checked), 3u); // the file system's own grade
    EXPECT_FALSE(v.IsHealthy());
    const QStringList names = {"Invalid",    "Very Bad", "Bad",       "Poor",     "Not Bad",
                               "Acceptable", "Good",     "Very Good", "Excellent"};
    for (int g = 0; g <= 8; ++g)
        EXPECT_EQ(VolumeIntegrity::GradeName(g), names[g]);
    EXPECT_EQ(VolumeIntegrity::GradeClass(6), 0);
    EXPECT_EQ(VolumeIntegrity::GradeClass(5), 1);
    EXPECT_EQ(VolumeIntegrity::GradeClass(2), 2);
    EXPECT_EQ(VolumeIntegrity::GradeClass(1), 3);
}

TEST(VolumeIntegrityItems, SharedTableOrderAndStates)
{
    // FAT: checked 1, 2, 8, 32, 0x10000; valid 1, 8 and an unchecked 64 and 128.
    const auto items = VolumeIntegrity::Items(8, 1 | 8 | 64 | 128, 1 | 2 | 8 | 32 | 0x10000);
    QStringList text;
    for (const auto &i : items)
        text << i.name + "=" + i.state;
    EXPECT_EQ(text, QStringList({"Primary Boot Sector=Valid", "Copy of Boot Sector=Invalid",
                                 "Primary FAT Table=Valid", "Root Folder=Invalid",
                                 "Primary Boot Sector partially matches a Copy=Yes", "0x10000=Invalid"}));
    // Bit 128 is never listed for these kinds; not assessed lists nothing.
    EXPECT_TRUE(VolumeIntegrity::Items(7, 0, CVolume::AllItems).isEmpty());
    // ReFS without a usable copy drops the copy and the comparison.
    const auto refs = VolumeIntegrity::Items(18, 1 | 8, 1 | 2 | 4 | 8);
    ASSERT_EQ(refs.size(), 2);
    EXPECT_EQ(refs[0].name, "Primary Boot Sector");
    EXPECT_EQ(refs[1].name, "SuperBlock");
    // Kinds with their own lists show every bit from the lowest.
    const auto jfs = VolumeIntegrity::Items(22, 1 | 0x20000000000000ull, 1 | 0x100000000000000ull);
    ASSERT_EQ(jfs.size(), 3);
    EXPECT_EQ(jfs[1].name, "FS dirty flag is ON");
    EXPECT_EQ(jfs[1].state, "Yes");
    EXPECT_EQ(jfs[2].name, "Main SB existed & valid");
    EXPECT_EQ(VolumeIntegrity::ItemName(21, 0x400000000ull), "SB are completely valid in all AG.");
    EXPECT_EQ(VolumeIntegrity::ItemName(20, 0x10000), "Chunks datarun collected from a \"chunk_root\"");
    EXPECT_EQ(VolumeIntegrity::ItemName(19, 1024), "Complete Volume");
    EXPECT_EQ(VolumeIntegrity::ItemName(23, 16), "Has Volume(s)");
}

TEST(VolumeBase, UserValueAndQueries)
{
    MemoryStorage medium(Numbered(64));
    TestVolume v(&medium, Describe(64 * 512));
    EXPECT_EQ(v.UserValue(5), 0u);
    EXPECT_EQ(v.UserValue(CVolume::AllItems), 5u);
    EXPECT_EQ(v.UserValue(9), 5u);
    EXPECT_TRUE(v.QueryInfo(QByteArray(4, 0)).isEmpty());
    EXPECT_FALSE(v.ApplyBootSector("x", 1));
    std::uint8_t count = 9, current = 9;
    EXPECT_FALSE(v.SelectFileTableCopy(0, count, current));
    EXPECT_EQ(count, 0);
    std::unique_ptr<CEntry> e = v.CreateEntry(nullptr);
    ASSERT_TRUE(e);
    EXPECT_EQ(e->GetVolume(), &v);
}

} // namespace
