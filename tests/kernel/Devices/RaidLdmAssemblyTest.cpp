// Dynamic volumes assembled from database records over in-memory disks: simple, spanned, striped,
// mirrored and RAID-5, with missing disks and records that do not decode.
#include <gtest/gtest.h>

#include <memory>
#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/LdmAssembly.h"
#include "tests/kernel/Devices/LdmTestDisks.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

using namespace RaidTest;

namespace {

constexpr std::uint64_t DataStart = 63;

using LdmTestDisks::Be64;
using LdmTestDisks::Num;
using LdmTestDisks::Txt;

Ldm::Record Rec(std::uint8_t type, const QByteArray &body, std::uint8_t flags = 0)
{
    Ldm::Record r;
    r.type = type;
    QByteArray data(0x18, '\0');
    data.replace(0, 4, "VBLK");
    data[0x12] = char(flags);
    data[0x13] = char(type);
    const auto n = std::uint32_t(body.size());
    for (int i = 0; i < 4; ++i)
        data[0x14 + i] = char((n >> (8 * (3 - i))) & 0xFF);
    r.data = data + body;
    return r;
}

struct Group
{
    std::vector<Ldm::Record> records;
    std::vector<std::unique_ptr<MemStorage>> storages;
    QList<LdmAssembly::Disk> disks;

    // A disk record and, unless `absent`, a present disk of `sectors` sectors.
    MemStorage *AddDisk(std::uint64_t id, bool absent = false, std::uint64_t sectors = 2048)
    {
        const QByteArray guid = QStringLiteral("0000000%1-aaaa-bbbb-cccc-ddddeeeeffff").arg(id).toLatin1();
        records.push_back(Rec(0x34, Num(id) + Txt("Disk" + QByteArray::number(id)) + Txt(guid)));
        storages.push_back(std::make_unique<MemStorage>(sectors));
        if (!absent) {
            LdmAssembly::Disk d;
            d.storage = storages.back().get();
            d.diskGuid = QString::fromLatin1(guid).toUpper();
            d.dataStart = DataStart;
            d.dataLength = sectors - DataStart - 64;
            disks.append(d);
        }
        return storages.back().get();
    }
    void Volume(std::uint64_t id, const QByteArray &name)
    {
        records.push_back(Rec(0x51, Num(id) + Txt(name) + Txt("gen") + Txt("") + Txt("ACTIVE")));
    }
    void Component(std::uint64_t id, std::uint64_t volume, int arrayType, std::uint64_t stripe = 0,
                   std::uint64_t columns = 0)
    {
        QByteArray body = Num(id) + Txt("Comp") + Txt("ACTIVE") + char(arrayType) + QByteArray(4, '\0') +
                          Num(1) + QByteArray(16, '\0') + Num(volume) + QByteArray(1, '\0');
        if (stripe)
            body += Num(stripe) + Num(columns);
        records.push_back(Rec(0x32, body, stripe ? 0x10 : 0));
    }
    void Piece(std::uint64_t id, std::uint64_t component, std::uint64_t disk, std::uint64_t start,
               std::uint64_t volumeOffset, std::uint64_t size, int index = -1)
    {
        QByteArray body = Num(id) + Txt("Piece") + QByteArray(12, '\0') + Be64(start) + Be64(volumeOffset) +
                          Num(size) + Num(component) + Num(disk);
        if (index >= 0)
            body += Num(std::uint64_t(index));
        records.push_back(Rec(0x33, body, index >= 0 ? 0x08 : 0));
    }

    std::vector<std::unique_ptr<LdmAssembly::Volume>> Assemble(QStringList *messages = nullptr)
    {
        auto say = [messages](const QString &t) {
            if (messages)
                *messages << t;
        };
        return LdmAssembly::Assemble(LdmAssembly::Decode(records, say), disks, say);
    }
};

QByteArray ReadVolume(cStorage &s, std::uint64_t first, std::uint32_t count, bool *ok = nullptr)
{
    QByteArray out(int(count * 512), '\x55');
    std::uint32_t error = 0;
    const bool r = s.ReadSectors(first, count, out.data(), error);
    if (ok)
        *ok = r;
    return out;
}

} // namespace

TEST(RaidLdmAssembly, SpannedVolumeReadsThroughAVirtualDevice)
{
    Group g;
    MemStorage *a = g.AddDisk(1);
    MemStorage *b = g.AddDisk(2);
    g.Volume(10, "Volume1");
    g.Component(11, 10, 2);
    // Listed out of order: the volume offset decides.
    g.Piece(13, 11, 2, 10, 50, 30);
    g.Piece(12, 11, 1, 100, 0, 50);
    for (std::uint64_t s = 0; s < 50; ++s)
        FillSector(a->Sector(DataStart + 100 + s), s);
    for (std::uint64_t s = 0; s < 30; ++s)
        FillSector(b->Sector(DataStart + 10 + s), 50 + s);

    auto volumes = g.Assemble();
    ASSERT_EQ(volumes.size(), 1u);
    EXPECT_EQ(volumes[0]->name, "Volume1");
    EXPECT_EQ(volumes[0]->kind, "Spanned");
    ASSERT_EQ(volumes[0]->storage->GetTotalSectors(), 80u);
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 0, 80), ExpectedSectors(0, 80));

    std::unique_ptr<CDevice> device(LdmAssembly::MakeDevice(nullptr, std::move(volumes[0]), 40));
    ASSERT_TRUE(device);
    EXPECT_EQ(device->GetPartStyle(), PartStyle::VirtualManager);
    EXPECT_EQ(device->GetMediaType(), MediaType::RaidAssembly);
    EXPECT_EQ(device->GetTotalSectors(), 80u);
    bool ok = false;
    EXPECT_EQ(ReadVolume(*device, 45, 10, &ok), ExpectedSectors(45, 10));
    EXPECT_TRUE(ok);
    std::uint32_t error = 0;
    QByteArray data(512, 'x');
    EXPECT_FALSE(device->WriteSectors(0, 1, data.constData(), error));
    EXPECT_EQ(a->writes + b->writes, 0);
}

TEST(RaidLdmAssembly, StripedAndRaid5FollowTheColumnIndex)
{
    constexpr std::uint32_t Stripe = 16, Rows = 4;
    Group g;
    std::vector<MemStorage *> disks;
    for (int i = 1; i <= 3; ++i)
        disks.push_back(g.AddDisk(i));
    // Striped volume 20: column c on disk 3 - c, at data sector 0.
    g.Component(21, 20, 1, Stripe, 3);
    for (int c = 2; c >= 0; --c)
        g.Piece(22 + c, 21, 3 - c, 0, 0, Rows * Stripe, c);
    for (std::uint64_t s = 0; s < 3 * Rows * Stripe; ++s) {
        const std::uint64_t chunk = s / Stripe;
        FillSector(disks[2 - chunk % 3]->Sector(DataStart + (chunk / 3) * Stripe + s % Stripe), s);
    }
    // RAID-5 volume 30 at data sector 200: parity from the last column down, data in column order.
    g.Component(31, 30, 3, Stripe, 3);
    for (int c = 0; c < 3; ++c)
        g.Piece(32 + c, 31, c + 1, 200, 0, Rows * Stripe, c);
    for (std::uint64_t row = 0; row < Rows; ++row) {
        const std::uint32_t parity = 2 - row % 3;
        for (std::uint32_t d = 0; d < 2; ++d) {
            const std::uint32_t column = d < parity ? d : d + 1;
            for (std::uint32_t o = 0; o < Stripe; ++o) {
                std::uint8_t *data = disks[column]->Sector(DataStart + 200 + row * Stripe + o);
                FillSector(data, (row * 2 + d) * Stripe + o);
                std::uint8_t *p = disks[parity]->Sector(DataStart + 200 + row * Stripe + o);
                for (int i = 0; i < 512; ++i)
                    p[i] ^= data[i];
            }
        }
    }

    auto volumes = g.Assemble();
    ASSERT_EQ(volumes.size(), 2u);
    EXPECT_EQ(volumes[0]->kind, "Striped");
    EXPECT_EQ(volumes[1]->kind, "RAID-5");
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 0, 3 * Rows * Stripe), ExpectedSectors(0, 3 * Rows * Stripe));
    EXPECT_EQ(ReadVolume(*volumes[1]->storage, 0, 2 * Rows * Stripe), ExpectedSectors(0, 2 * Rows * Stripe));

    // Without disk 2 the RAID-5 volume still reads everything; the striped one cannot be assembled.
    g.disks.removeAt(1);
    QStringList messages;
    volumes = g.Assemble(&messages);
    ASSERT_EQ(volumes.size(), 1u);
    EXPECT_EQ(volumes[0]->kind, "RAID-5");
    EXPECT_TRUE(volumes[0]->degraded);
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 0, 2 * Rows * Stripe), ExpectedSectors(0, 2 * Rows * Stripe));
    ASSERT_EQ(messages.size(), 1);
    EXPECT_TRUE(messages[0].startsWith("Dynamic volume Volume 20 cannot be assembled: "))
        << messages[0].toStdString();
}

TEST(RaidLdmAssembly, MirrorReadsEitherCopyAndSurvivesAMissingDisk)
{
    Group g;
    MemStorage *a = g.AddDisk(1);
    MemStorage *b = g.AddDisk(2);
    g.Volume(40, "Mirror");
    g.Component(41, 40, 2);
    g.Component(42, 40, 2);
    g.Piece(43, 41, 1, 0, 0, 64);
    g.Piece(44, 42, 2, 500, 0, 64);
    for (std::uint64_t s = 0; s < 64; ++s) {
        FillSector(a->Sector(DataStart + s), s);
        FillSector(b->Sector(DataStart + 500 + s), s);
    }
    auto volumes = g.Assemble();
    ASSERT_EQ(volumes.size(), 1u);
    EXPECT_EQ(volumes[0]->kind, "Mirrored");
    EXPECT_FALSE(volumes[0]->degraded);
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 0, 64), ExpectedSectors(0, 64));
    a->failReads = true;
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 3, 7), ExpectedSectors(3, 7));
    a->failReads = false;

    g.disks.removeAt(0);
    volumes = g.Assemble();
    ASSERT_EQ(volumes.size(), 1u);
    EXPECT_TRUE(volumes[0]->degraded);
    EXPECT_EQ(ReadVolume(*volumes[0]->storage, 0, 64), ExpectedSectors(0, 64));
}

TEST(RaidLdmAssembly, DamagedRecordsAndPiecesOutsideTheDiskAreRefused)
{
    Group g;
    g.AddDisk(1, false, 1024);
    g.Component(51, 50, 2);
    g.Piece(52, 51, 1, 2000, 0, 64); // beyond the data area
    g.Component(61, 60, 1, 0, 2);    // striped without a stripe
    g.Piece(62, 61, 1, 0, 0, 64, 0);
    g.Piece(63, 61, 1, 64, 0, 64, 1);
    // Truncated records decode to nothing.
    Ldm::Record cut = Rec(0x33, Num(70) + Txt("Cut") + QByteArray(5, '\0'));
    g.records.push_back(cut);
    Ldm::Record huge = Rec(0x32, QByteArray(1, char(200)));
    g.records.push_back(huge);
    QStringList messages;
    auto volumes = g.Assemble(&messages);
    EXPECT_TRUE(volumes.empty());
    EXPECT_GE(messages.size(), 3) << messages.join('\n').toStdString();
}
