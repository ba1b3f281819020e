// ATA pass-through requests byte for byte, identify fields, and the device's identify, native
// sizes, SetHpa and SetDco against a scripted drive (never a real one).
#include <gtest/gtest.h>

#include <cstring>
#include <memory>

#include "Kernel/Implementation/Ata/AtaCommand.h"
#include "Kernel/Implementation/Ata/AtaIdentify.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/DeviceControl.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "tests/kernel/Devices/DeviceFakeBackend.h"

namespace {

TEST(AtaCommand, HeaderLayoutMatchesThePassThroughStructure)
{
    using S = DeviceControl::ATA_PASS_THROUGH_EX;
    EXPECT_EQ(offsetof(S, AtaFlags), Ata::Offset::Flags);
    EXPECT_EQ(offsetof(S, DataTransferLength), Ata::Offset::TransferLength);
    EXPECT_EQ(offsetof(S, TimeOutValue), Ata::Offset::TimeOut);
    EXPECT_EQ(offsetof(S, DataBufferOffset), Ata::Offset::DataBufferOffset);
    EXPECT_EQ(offsetof(S, PreviousTaskFile), Ata::Offset::PreviousTaskFile);
    EXPECT_EQ(offsetof(S, CurrentTaskFile), Ata::Offset::CurrentTaskFile);
    EXPECT_EQ(Ata::IoctlAtaPassThrough, DeviceControl::IOCTL_ATA_PASS_THROUGH);
}

TEST(AtaCommand, IdentifyRequestBytes)
{
    Ata::Command c;
    c.command = 0xEC;
    c.direction = Ata::Direction::In;
    const Ata::Request r = Ata::BuildRequest(c);
    const std::uint8_t expect[48] = {
        48, 0, 2, 0, 0,  0,    0,    0, // length, flags data in, path/target/lun
        0,  2, 0, 0, 15, 0,    0,    0, // 512 bytes, 15 seconds
        0,  0, 0, 0, 0,  0,    0,    0, // reserved, padding
        48, 0, 0, 0, 0,  0,    0,    0, // data buffer offset
        0,  0, 0, 0, 0,  0,    0,    0, // previous task file
        0,  0, 0, 0, 0,  0x40, 0xEC, 0  // current: device 0x40, command
    };
    EXPECT_EQ(0, std::memcmp(r.data(), expect, 48));
    EXPECT_TRUE(AtaIdentify::AllZero(r.data() + 48, 512));
}

TEST(AtaCommand, SetMaxAddressExtRequestBytes)
{
    Ata::Command c;
    c.command = 0x37;
    c.ext48 = true;
    c.address = 0x0000123456789ABCull;
    c.device = 0xE0;
    const Ata::Request r = Ata::BuildRequest(c);
    EXPECT_EQ(r[2], 8); // 48-bit, no data
    EXPECT_EQ(r[3], 0);
    EXPECT_EQ(r[8], 0); // no transfer
    EXPECT_EQ(r[9], 0);
    const std::uint8_t prev[8] = {0, 0, 0x56, 0x34, 0x12, 0, 0, 0};
    EXPECT_EQ(0, std::memcmp(r.data() + 32, prev, 8));
    EXPECT_EQ(r[40 + 1], 1);    // sector count 1 with a device value
    EXPECT_EQ(r[40 + 2], 0xBC); // LBA low
    EXPECT_EQ(r[40 + 3], 0x9A); // LBA mid
    EXPECT_EQ(r[40 + 4], 0x78); // LBA high
    EXPECT_EQ(r[40 + 5], 0xE0);
    EXPECT_EQ(r[40 + 6], 0x37);
}

TEST(AtaCommand, DataOutAndTwentyEightBitAddress)
{
    Ata::Command c;
    c.command = 0xF9;
    c.address = 0x0ABCDEF1;
    c.device = 0xE0;
    Ata::Command d;
    d.command = 0xB1;
    d.features = 0xC3;
    d.direction = Ata::Direction::Out;
    std::uint8_t block[512];
    for (int i = 0; i < 512; ++i)
        block[i] = std::uint8_t(i);
    const Ata::Request rc = Ata::BuildRequest(c);
    EXPECT_EQ(rc[2], 0);
    EXPECT_EQ(rc[45], 0xEA); // top four address bits in the device register
    EXPECT_EQ(rc[44], 0xBC);
    const Ata::Request rd = Ata::BuildRequest(d, block);
    EXPECT_EQ(rd[2], 4);
    EXPECT_EQ(rd[40], 0xC3);
    EXPECT_EQ(rd[41], 0); // no device value: count 0, device 0x40
    EXPECT_EQ(rd[45], 0x40);
    EXPECT_EQ(0, std::memcmp(rd.data() + 48, block, 512));
}

TEST(AtaCommand, ReplyChecks)
{
    Ata::Request r{};
    std::uint64_t a = 0;
    r[46] = 0x50;
    r[42] = 0x11;
    r[43] = 0x22;
    r[44] = 0x33;
    r[45] = 0x45;
    r[34] = 0x44;
    r[35] = 0x55;
    r[36] = 0x66;
    EXPECT_TRUE(Ata::CheckReply(r.data(), 48, true, a));
    EXPECT_EQ(a, 0x665544332211ull);
    EXPECT_TRUE(Ata::CheckReply(r.data(), 560, false, a));
    EXPECT_EQ(a, 0x05332211ull);
    EXPECT_FALSE(Ata::CheckReply(r.data(), 100, false, a));
    r[46] = 0x51;
    EXPECT_FALSE(Ata::CheckReply(r.data(), 48, false, a));
    r[46] = 0x58;
    EXPECT_FALSE(Ata::CheckReply(r.data(), 48, false, a));
}

void putWord(std::uint8_t *b, unsigned w, std::uint16_t v)
{
    b[2 * w] = std::uint8_t(v);
    b[2 * w + 1] = std::uint8_t(v >> 8);
}

// A text field as a drive stores it: two characters per word, the first in the high byte.
void putText(std::uint8_t *b, unsigned firstWord, unsigned words, const char *text)
{
    std::string s(text);
    s.resize(2 * words, ' ');
    for (unsigned i = 0; i < words; ++i)
        putWord(b, firstWord + i, std::uint16_t(std::uint8_t(s[2 * i]) << 8 | std::uint8_t(s[2 * i + 1])));
}

std::vector<std::uint8_t> identify48(std::uint64_t accessible)
{
    std::vector<std::uint8_t> id(512, 0);
    putWord(id.data(), 1, 16383);
    putWord(id.data(), 3, 16);
    putWord(id.data(), 6, 63);
    putText(id.data(), 10, 10, "  SER123");
    putText(id.data(), 23, 4, "FW01");
    putText(id.data(), 27, 20, "Acme Drive 9000");
    putWord(id.data(), 49, 1u << 9);
    putWord(id.data(), 60, 0xFFFF);
    putWord(id.data(), 61, 0x0FFF);
    putWord(id.data(), 83, 0x4400);
    putWord(id.data(), 86, 0x0400);
    for (unsigned i = 0; i < 4; ++i)
        putWord(id.data(), 100 + i, std::uint16_t(accessible >> (16 * i)));
    return id;
}

TEST(AtaIdentifyFields, AccessibleSectorsByAddressingMode)
{
    std::vector<std::uint8_t> id = identify48(0x123456789ull);
    bool uses48 = false;
    EXPECT_EQ(AtaIdentify::AccessibleSectors(id.data(), uses48), 0x123456789ull);
    EXPECT_TRUE(uses48);
    putWord(id.data(), 86, 0); // supported but not enabled
    EXPECT_EQ(AtaIdentify::AccessibleSectors(id.data(), uses48), 0x0FFFFFFFull);
    EXPECT_FALSE(uses48);
    putWord(id.data(), 49, 0); // no LBA: current capacity
    putWord(id.data(), 57, 0x1234);
    putWord(id.data(), 58, 0x0001);
    EXPECT_EQ(AtaIdentify::AccessibleSectors(id.data(), uses48), 0x11234ull);
}

TEST(AtaIdentifyFields, StringsAreSwappedUnlessAlreadyInOrder)
{
    std::vector<std::uint8_t> id = identify48(1);
    QString model, fw, serial;
    ASSERT_TRUE(AtaIdentify::Strings(id.data(), model, fw, serial));
    EXPECT_EQ(model, QStringLiteral("Acme Drive 9000"));
    EXPECT_EQ(fw, QStringLiteral("FW01"));
    EXPECT_EQ(serial, QStringLiteral("SER123"));
    // A model already in memory order ("WDC " prefix) is taken as it reads.
    std::memcpy(id.data() + 54, "WDC WD10EZEX-00BN5A0                    ", 40);
    ASSERT_TRUE(AtaIdentify::Strings(id.data(), model, fw, serial));
    EXPECT_EQ(model, QStringLiteral("WDC WD10EZEX-00BN5A0"));
    putWord(id.data(), 3, 0);
    EXPECT_FALSE(AtaIdentify::Strings(id.data(), model, fw, serial));
    EXPECT_TRUE(model.isEmpty());
}

std::vector<std::uint8_t> dcoBlock(std::uint64_t maxAddress)
{
    std::vector<std::uint8_t> d(512, 0);
    putWord(d.data(), 0, 0x0002);
    AtaIdentify::SetDcoMaxAddress(d.data(), maxAddress);
    return d;
}

TEST(AtaIdentifyFields, DcoChecksumAndMaximum)
{
    auto d = dcoBlock(0x0000123456789ABCull);
    EXPECT_TRUE(AtaIdentify::DcoChecksumValid(d.data()));
    EXPECT_EQ(AtaIdentify::DcoMaxAddress(d.data()), 0x123456789ABCull);
    d[100] ^= 1;
    EXPECT_FALSE(AtaIdentify::DcoChecksumValid(d.data()));
}

TEST(AtaIdentifyFields, AtaInformationPage)
{
    const auto req = AtaIdentify::BuildAtaInfoInquiry();
    ASSERT_EQ(req.size(), AtaIdentify::ScsiRequestSize);
    DeviceControl::SCSI_PASS_THROUGH h;
    std::memcpy(&h, req.data(), sizeof h);
    EXPECT_EQ(h.Length, sizeof h);
    EXPECT_EQ(h.CdbLength, 6);
    EXPECT_EQ(h.DataIn, DeviceControl::SCSI_IOCTL_DATA_IN);
    EXPECT_EQ(h.DataTransferLength, 572u);
    EXPECT_EQ(h.SenseInfoOffset, 56u);
    EXPECT_EQ(h.SenseInfoLength, 32);
    EXPECT_EQ(h.DataBufferOffset, 88u);
    EXPECT_EQ(AtaIdentify::ScsiPassThroughCode, DeviceControl::IOCTL_SCSI_PASS_THROUGH);
    EXPECT_EQ(req[36], 0x12);
    EXPECT_EQ(req[37], 0x01);
    EXPECT_EQ(req[38], 0x89);
    EXPECT_EQ(req[39] << 8 | req[40], 572);
    std::vector<std::uint8_t> reply = req;
    std::uint8_t *page = reply.data() + 88;
    page[1] = 0x89;
    page[2] = 0x02;
    page[3] = 0x38;
    const auto id = identify48(99);
    std::memcpy(page + 60, id.data(), 512);
    std::uint8_t out[512];
    ASSERT_TRUE(AtaIdentify::ParseAtaInfoReply(reply.data(), std::uint32_t(reply.size()), out));
    EXPECT_EQ(0, std::memcmp(out, id.data(), 512));
    EXPECT_FALSE(AtaIdentify::ParseAtaInfoReply(reply.data(), 100, out));
    page[1] = 0x80;
    EXPECT_FALSE(AtaIdentify::ParseAtaInfoReply(reply.data(), std::uint32_t(reply.size()), out));
}

// A scripted drive behind the pass-through.
struct ScriptedDrive
{
    std::vector<std::uint8_t> identify;
    bool identifyFails = false;
    bool packetOnly = false;
    std::uint64_t nativeMax = 0; // answer of READ NATIVE MAX ADDRESS (EXT)
    std::vector<std::uint8_t> dco;
    std::vector<std::vector<std::uint8_t>> commands; // every request seen (560 bytes)

    int count(std::uint8_t command, int features = -1) const
    {
        int n = 0;
        for (const auto &c : commands)
            if (c[46] == command && (features < 0 || c[40] == features))
                ++n;
        return n;
    }

    bool operator()(std::uint32_t code, const std::uint8_t *in, std::uint32_t inSize, std::uint8_t *out,
                    std::uint32_t outSize, std::uint32_t &returned, std::uint32_t &error)
    {
        if (code != Ata::IoctlAtaPassThrough || inSize != 560 || outSize != 560) {
            error = 1;
            return false;
        }
        commands.emplace_back(in, in + inSize);
        std::memcpy(out, in, 560);
        out[46] = 0x50;
        returned = 48;
        const std::uint8_t cmd = in[46];
        if ((cmd == 0xEC && !packetOnly) || (cmd == 0xA1 && packetOnly)) {
            if (identifyFails) {
                out[46] = 0x51;
                return true;
            }
            std::memcpy(out + 48, identify.data(), 512);
            returned = 560;
        } else if (cmd == 0xEC || cmd == 0xA1) {
            out[46] = 0x51;
        } else if (cmd == 0x27 || cmd == 0xF8) {
            out[42] = std::uint8_t(nativeMax);
            out[43] = std::uint8_t(nativeMax >> 8);
            out[44] = std::uint8_t(nativeMax >> 16);
            if (cmd == 0x27) {
                out[34] = std::uint8_t(nativeMax >> 24);
                out[35] = std::uint8_t(nativeMax >> 32);
                out[36] = std::uint8_t(nativeMax >> 40);
            } else {
                out[45] = std::uint8_t(0x40 | ((nativeMax >> 24) & 0x0F));
            }
        } else if (cmd == 0xB1 && in[40] == 0xC2) {
            if (dco.empty()) {
                out[46] = 0x51;
                return true;
            }
            std::memcpy(out + 48, dco.data(), 512);
            returned = 560;
        }
        return true;
    }
};

class DeviceAtaTest : public ::testing::Test
{
protected:
    DeviceFakeBackend backend;
    ScriptedDrive drive;
    std::unique_ptr<CRoot> root;

    void SetUp() override
    {
        root = std::make_unique<CRoot>(&backend, nullptr);
        backend.disks[QStringLiteral("/fake/sda")] = std::vector<std::uint8_t>(64 * 512, 0);
        backend.control = [this](std::uint32_t code, const std::uint8_t *in, std::uint32_t inSize,
                                 std::uint8_t *out, std::uint32_t outSize, std::uint32_t &returned,
                                 std::uint32_t &error) {
            return drive(code, in, inSize, out, outSize, returned, error);
        };
    }
    std::unique_ptr<CDevice> makeDevice()
    {
        DeviceInfo info;
        info.handle = new CPlatformFile(root.get(), QStringLiteral("/fake/sda"), PlatformKind::Device);
        info.totalSectors = 64;
        info.ready = 1;
        info.model = QStringLiteral("from enumeration");
        info.serialControl = QStringLiteral("CTRL");
        auto d = std::make_unique<CDevice>(root.get(), info);
        drive.commands.clear();
        return d;
    }
};

TEST_F(DeviceAtaTest, IdentityStringsReplaceTheDescriptorsAtConstruction)
{
    drive.identify = identify48(1000);
    auto d = makeDevice();
    EXPECT_EQ(d->GetModel(), QStringLiteral("Acme Drive 9000"));
    EXPECT_EQ(d->GetFirmware(), QStringLiteral("FW01"));
    EXPECT_EQ(d->GetSerial(2), QStringLiteral("SER123"));
    EXPECT_EQ(d->GetSerial(0), QStringLiteral("SER123"));
    EXPECT_EQ(d->GetSerial(1), QStringLiteral("CTRL"));
}

TEST_F(DeviceAtaTest, IdentifyFallsBackToPacketDeviceAndFailsQuietly)
{
    drive.identify = identify48(1000);
    drive.packetOnly = true;
    auto d = makeDevice();
    std::uint8_t id[512];
    ASSERT_TRUE(d->ReadIdentify(id));
    EXPECT_EQ(0, std::memcmp(id, drive.identify.data(), 512));
    EXPECT_EQ(drive.count(0xEC), 1);
    EXPECT_EQ(drive.count(0xA1), 1);

    drive.identifyFails = true;
    EXPECT_FALSE(d->ReadIdentify(id));
    EXPECT_TRUE(AtaIdentify::AllZero(id, 512));
    EXPECT_EQ(d->GetSerial(0), QStringLiteral("SER123"));
}

TEST_F(DeviceAtaTest, NativeSizesWithHpaAndDco)
{
    drive.identify = identify48(1000000);
    drive.nativeMax = 1999999;     // HPA hides a million sectors
    drive.dco = dcoBlock(2999999); // DCO hides another million
    auto d = makeDevice();
    std::uint64_t acc = 0, hpa = 0, dco = 0;
    EXPECT_TRUE(d->GetNativeSizes(acc, hpa, dco));
    EXPECT_EQ(acc, 1000000u);
    EXPECT_EQ(hpa, 2000000u);
    EXPECT_EQ(dco, 3000000u);
    EXPECT_EQ(drive.count(0x27), 1);
    EXPECT_EQ(drive.count(0xB1, 0xC2), 1);

    // A bad checksum and a native below the accessible count read as 0.
    drive.dco[7] ^= 0x10;
    drive.nativeMax = 500;
    EXPECT_TRUE(d->GetNativeSizes(acc, hpa, dco));
    EXPECT_EQ(hpa, 0u);
    EXPECT_EQ(dco, 0u);

    // 28-bit drive: READ NATIVE MAX ADDRESS and a false result.
    putWord(drive.identify.data(), 86, 0);
    drive.nativeMax = 0x0FFFFFFE;
    EXPECT_FALSE(d->GetNativeSizes(acc, hpa, dco));
    EXPECT_EQ(acc, 0x0FFFFFFFu);
    EXPECT_EQ(hpa, 0x0FFFFFFFu);
    EXPECT_EQ(drive.count(0xF8), 1);

    drive.identifyFails = true;
    EXPECT_FALSE(d->GetNativeSizes(acc, hpa, dco));
    EXPECT_EQ(acc + hpa + dco, 0u);
}

TEST_F(DeviceAtaTest, SetHpaSendsTheNewMaximumAndRefusesToHideEverything)
{
    drive.identify = identify48(1000);
    drive.nativeMax = 999;
    auto d = makeDevice();
    EXPECT_FALSE(d->SetHpa(999));
    EXPECT_FALSE(d->SetHpa(1000));
    EXPECT_FALSE(d->SetHpa(0xFFFFFFFFFFFFFFFFull));
    EXPECT_EQ(drive.count(0x37) + drive.count(0xF9), 0);

    ASSERT_TRUE(d->SetHpa(100));
    ASSERT_EQ(drive.count(0x37), 1);
    const auto &c = drive.commands.back();
    EXPECT_EQ(c[46], 0x37);
    EXPECT_EQ(c[2], 8); // 48-bit
    EXPECT_EQ(c[41], 1);
    EXPECT_EQ(c[45], 0xE0);
    EXPECT_EQ(c[42] | c[43] << 8 | c[44] << 16, 899); // 1000 - 100 - 1
    // The native size was read right before.
    EXPECT_EQ(drive.commands[drive.commands.size() - 2][46], 0x27);

    // A 28-bit drive uses SET MAX ADDRESS.
    putWord(drive.identify.data(), 86, 0);
    drive.nativeMax = 0x0FFFFFFE;
    ASSERT_TRUE(d->SetHpa(1));
    EXPECT_EQ(drive.commands.back()[46], 0xF9);
    EXPECT_EQ(drive.commands.back()[2], 0);
    EXPECT_EQ(drive.commands.back()[45], 0xEF); // address bits 24..27 beside 0xE0
    EXPECT_EQ(drive.commands.back()[42], 0xFD);
}

TEST_F(DeviceAtaTest, SetDcoRewritesTheBlockWithAValidChecksum)
{
    drive.identify = identify48(1000);
    drive.dco = dcoBlock(4999);
    auto d = makeDevice();
    ASSERT_TRUE(d->SetDco(1000));
    ASSERT_EQ(drive.count(0xB1, 0xC3), 1);
    const auto &c = drive.commands.back();
    EXPECT_EQ(c[2], 4); // data out
    const std::uint8_t *block = c.data() + 48;
    EXPECT_TRUE(AtaIdentify::DcoChecksumValid(block));
    EXPECT_EQ(AtaIdentify::DcoMaxAddress(block), 3999u);
    EXPECT_EQ(AtaIdentify::Word(block, 0), 0x0002);

    ASSERT_TRUE(d->SetDco(0));
    EXPECT_EQ(drive.count(0xB1, 0xC0), 1);

    EXPECT_FALSE(d->SetDco(4999)); // nothing would stay
    drive.dco[20] ^= 1;
    EXPECT_FALSE(d->SetDco(10));
    EXPECT_EQ(drive.count(0xB1, 0xC3), 1);
}

} // namespace
