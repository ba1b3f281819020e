// Identity texts of drives: serial cleaning, the byte order of identify strings, and the bounds of
// the storage descriptor's offsets.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Root/RootIdentity.h"
#include "Kernel/Implementation/Root/RootStatus.h"
#include "tests/common/RootTestSupport.h"

#include <cstring>

using namespace RootIdentity;

namespace {

// An identify block with the three required words set and the strings stored as given (memory order).
QByteArray IdentifyBlock(const QByteArray &model, const QByteArray &firmware, const QByteArray &serial,
                         quint16 word217 = 0)
{
    QByteArray b(512, '\0');
    auto word = [&](int index, quint16 v) {
        b[index * 2] = char(v & 0xFF);
        b[index * 2 + 1] = char(v >> 8);
    };
    word(1, 16383);
    word(3, 16);
    word(6, 63);
    word(217, word217);
    std::memcpy(b.data() + 27 * 2, model.leftJustified(40, ' ').constData(), 40);
    std::memcpy(b.data() + 23 * 2, firmware.leftJustified(8, ' ').constData(), 8);
    std::memcpy(b.data() + 10 * 2, serial.leftJustified(20, ' ').constData(), 20);
    return b;
}

QByteArray Swapped(const QByteArray &text)
{
    QByteArray s = text;
    if (s.size() % 2)
        s += ' ';
    for (qsizetype i = 0; i + 1 < s.size(); i += 2)
        std::swap(s[i], s[i + 1]);
    return s;
}

const uint8_t *Bytes(const QByteArray &b)
{
    return reinterpret_cast<const uint8_t *>(b.constData());
}

} // namespace

TEST(RootIdentity, SerialCleaning)
{
    // Four digits are two packed characters.
    EXPECT_EQ(CleanSerial(QStringLiteral("3132")), QStringLiteral("12"));
    // Packed bytes that are not printable are cut: "0041" packs to "\0A" and the cut leaves nothing.
    EXPECT_EQ(CleanSerial(QStringLiteral("0041")), QString());
    // An odd count of digits, or digits with blanks around them, is taken as text.
    EXPECT_EQ(CleanSerial(QStringLiteral("313")), QStringLiteral("313"));
    EXPECT_EQ(CleanSerial(QStringLiteral(" 3132 ")), QStringLiteral("3132"));
    // Text is trimmed and cut at the first character outside the serial set.
    EXPECT_EQ(CleanSerial(QStringLiteral("  WD-WCC4E1234567  ")), QStringLiteral("WD-WCC4E1234567"));
    EXPECT_EQ(CleanSerial(QStringLiteral("AB12_34")), QStringLiteral("AB12"));
    EXPECT_EQ(CleanSerial(QString()), QString());
}

TEST(RootIdentity, ReadingOrderRule)
{
    EXPECT_TRUE(ModelInReadingOrder(QStringLiteral("WDC WD10EZEX-08WN4A0")));
    EXPECT_TRUE(ModelInReadingOrder(QStringLiteral("  st31000528as ")));
    EXPECT_TRUE(ModelInReadingOrder(QStringLiteral("SAMSUNG HD103SJ")));
    // "ST" without digits in places 3 and 4, and swapped vendor texts, are not in reading order.
    EXPECT_FALSE(ModelInReadingOrder(QStringLiteral("STXA1000")));
    EXPECT_FALSE(ModelInReadingOrder(QStringLiteral("DW CDW01ZEXE")));
    EXPECT_FALSE(ModelInReadingOrder(QStringLiteral("QEMU HARDDISK")));
}

TEST(RootIdentity, IdentifyStringsByteOrder)
{
    // A drive that stores its strings the ATA way (pairs swapped in memory).
    IdentifyStrings swapped =
        ParseIdentify(Bytes(IdentifyBlock(Swapped("QEMU HARDDISK"), Swapped("2.5+"), Swapped("QM00001"), 1)));
    ASSERT_TRUE(swapped.valid);
    EXPECT_EQ(swapped.model, QStringLiteral("QEMU HARDDISK"));
    EXPECT_EQ(swapped.firmware, QStringLiteral("2.5+"));
    EXPECT_EQ(swapped.serial, QStringLiteral("QM00001"));
    EXPECT_EQ(swapped.rotation, 0);

    // Models already in reading order are taken as they read, with firmware and serial.
    IdentifyStrings wdc =
        ParseIdentify(Bytes(IdentifyBlock("WDC WD5000AAKX", "15.01H15", "WD-WMAYUS123456", 7200)));
    EXPECT_EQ(wdc.model, QStringLiteral("WDC WD5000AAKX"));
    EXPECT_EQ(wdc.firmware, QStringLiteral("15.01H15"));
    EXPECT_EQ(wdc.serial, QStringLiteral("WD-WMAYUS123456"));
    EXPECT_EQ(wdc.rotation, 7200);
    IdentifyStrings st = ParseIdentify(Bytes(IdentifyBlock("ST3500418AS", "CC38", "5VM12345")));
    EXPECT_EQ(st.model, QStringLiteral("ST3500418AS"));
    EXPECT_EQ(st.serial, QStringLiteral("5VM12345"));
    EXPECT_EQ(st.rotation, -1);

    // Without words 1, 3 and 6 the strings are not taken; rotation values outside the rules are unknown.
    QByteArray empty = IdentifyBlock("X", "Y", "Z", 1024);
    empty[2] = empty[3] = 0;
    IdentifyStrings none = ParseIdentify(Bytes(empty));
    EXPECT_FALSE(none.valid);
    EXPECT_TRUE(none.model.isEmpty());
    EXPECT_EQ(none.rotation, -1);
}

TEST(RootIdentity, DescriptorOffsetsStayInsideTheAnswer)
{
    QByteArray d = RootTest::Descriptor("ATA", "Samsung SSD 860", "RVT01B6Q", "3132");
    DescriptorStrings s = ParseDeviceDescriptor(Bytes(d), uint32_t(d.size()));
    ASSERT_TRUE(s.valid);
    EXPECT_EQ(s.model, QStringLiteral("ATA Samsung SSD 860"));
    EXPECT_EQ(s.firmware, QStringLiteral("RVT01B6Q"));
    EXPECT_EQ(s.serial, QStringLiteral("12"));

    // Fewer than 41 bytes: nothing.
    EXPECT_FALSE(ParseDeviceDescriptor(Bytes(d), 40).valid);

    // Offsets below 40 or past the answer are ignored; an unterminated text ends with the answer.
    QByteArray bad = d;
    quint32 small = 8, huge = 100000;
    std::memcpy(bad.data() + 12, &small, 4);
    std::memcpy(bad.data() + 24, &huge, 4);
    DescriptorStrings b = ParseDeviceDescriptor(Bytes(bad), uint32_t(bad.size()));
    EXPECT_EQ(b.model, QStringLiteral("Samsung SSD 860"));
    EXPECT_TRUE(b.serial.isEmpty());
    DescriptorStrings cut = ParseDeviceDescriptor(Bytes(d), 44);
    EXPECT_EQ(cut.model, QStringLiteral("ATA"));

    // A serial whose first byte is below 32 is UTF-16 from the next byte, cut at a foreign character.
    QByteArray wide(40, '\0');
    quint32 at = 40;
    std::memcpy(wide.data() + 24, &at, 4);
    wide += char(0x01);
    for (char c : QByteArray("AB-9*Z"))
        wide += c, wide += '\0';
    wide += QByteArray(2, '\0');
    DescriptorStrings w = ParseDeviceDescriptor(Bytes(wide), uint32_t(wide.size()));
    EXPECT_EQ(w.serial, QStringLiteral("AB-9"));
}

TEST(RootIdentity, ManagementSerialAndSectorSizes)
{
    EXPECT_EQ(ManagementSerial(QStringLiteral("3132")), QStringLiteral("12"));
    EXPECT_EQ(ManagementSerial(QStringLiteral("AB") + QChar(0x4E00) + QStringLiteral("CD")),
              QStringLiteral("AB"));
    EXPECT_EQ(SectorShift(512), 9);
    EXPECT_EQ(SectorShift(4096), 12);
    EXPECT_EQ(SectorShift(520), -1);
    EXPECT_EQ(SectorShift(8192), -1);
}

TEST(RootIdentity, StatusAndEventTexts)
{
    EXPECT_EQ(KernelStatus::Text(0, 0, QString()), QStringLiteral("Valid"));
    // The system text loses its line breaks.
    EXPECT_EQ(KernelStatus::Text(6, 23, QStringLiteral("Data error\r\n(cyclic redundancy check)\r\n")),
              QStringLiteral("Error reading device (Data error (cyclic redundancy check))"));
    EXPECT_EQ(KernelStatus::Text(28, 0, QString()),
              QStringLiteral(
                  "Partition has been created, however for some reason still cannot be found on a device"));
    EXPECT_EQ(KernelStatus::Text(29, 0, QStringLiteral("x")), QStringLiteral("Unknown status"));
    EXPECT_EQ(KernelStatus::Text(99, 5, QStringLiteral("Access is denied.")),
              QStringLiteral("Unknown status (Access is denied.)"));
    EXPECT_EQ(StorageEventText(1, QStringLiteral("Disk sda")),
              QStringLiteral("Data storage detected Disk sda"));
    EXPECT_EQ(StorageEventText(4, QStringLiteral("Disk sda")), QStringLiteral("Storage removed Disk sda"));
    EXPECT_EQ(StorageEventText(0, QString()), QStringLiteral("Accessing local devices..."));
    EXPECT_EQ(StorageEventText(5, QString()), QStringLiteral("Local devices enumeration completed"));
    EXPECT_TRUE(StorageEventText(2, QStringLiteral("x")).isEmpty());
}
