// Field values of the templates: display, edit text and parsing of every format family, and the
// validators of the field editors.
#include <gtest/gtest.h>

#include <QLocale>

#include "Kernel/Implementation/Common/cStorage.h"
#include "hexeditor/templates/Validators.h"
#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/Values.h"

namespace {

namespace T = HexEditor::Templates;
namespace V = HexEditor::Templates::Values;

QByteArray bytes(std::initializer_list<int> list)
{
    QByteArray b;
    for (int v : list)
        b.append(char(v));
    return b;
}

const QLocale c = QLocale::c();

TEST(TemplateValues, NumbersInBothByteOrders)
{
    const QByteArray b = bytes({0x12, 0x34, 0x56, 0x78, 0x9A, 0xBC, 0xDE, 0xF0});
    EXPECT_EQ(V::display(T::UInt16, b, 0, 2, 0, false, c), "13330");
    EXPECT_EQ(V::display(T::UInt16, b, 0, 2, 0, true, c), "4660");
    EXPECT_EQ(V::display(T::Hex16, b, 0, 2, 0, true, c), "0x1234");
    EXPECT_EQ(V::display(T::Hex8, b, 1, 1, 0, false, c), "0x34");
    EXPECT_EQ(V::display(T::Hex32, b, 0, 4, 0, false, c), "0x78563412");
    EXPECT_EQ(V::display(T::UInt48, b, 0, 6, 0, true, c), QString::number(0xBC9A78563412ull)); // always LE
    EXPECT_EQ(V::display(T::UInt64, b, 0, 8, 0, true, c), QString::number(0x123456789ABCDEF0ull));
    // The user's locale groups digits; the edit value is the plain number.
    const QLocale de(QLocale::German);
    EXPECT_EQ(V::display(T::UInt32, bytes({0x40, 0x42, 0x0F, 0x00}), 0, 4, 0, false, de), "1.000.000");
    EXPECT_EQ(V::edit(T::UInt32, bytes({0x40, 0x42, 0x0F, 0x00}), 0, 4, 0, false, de).toULongLong(),
              1000000u);
    EXPECT_EQ(V::parse(T::UInt32, "1.000.000", 4, false, de), bytes({0x40, 0x42, 0x0F, 0x00}));
    // A field beyond the buffer has no value.
    EXPECT_TRUE(V::display(T::UInt32, b, 6, 4, 0, false, c).isEmpty());
    EXPECT_FALSE(V::edit(T::UInt64, b, 1, 8, 0, false, c).isValid());
}

TEST(TemplateValues, NumberParsing)
{
    EXPECT_EQ(V::parse(T::UInt8, "0x1F", 1, false, c), bytes({0x1F}));
    EXPECT_EQ(V::parse(T::UInt8, "255", 1, false, c), bytes({0xFF}));
    EXPECT_FALSE(V::parse(T::UInt8, "256", 1, false, c));
    EXPECT_FALSE(V::parse(T::UInt8, "-1", 1, false, c));
    EXPECT_FALSE(V::parse(T::UInt16, "12a", 2, false, c));
    EXPECT_FALSE(V::parse(T::UInt16, "", 2, false, c));
    EXPECT_EQ(V::parse(T::UInt16, "0x1234", 2, true, c), bytes({0x12, 0x34}));
    EXPECT_EQ(V::parse(T::UInt16, " 4 660 ", 2, false, c), bytes({0x34, 0x12}));
    EXPECT_EQ(V::parse(T::UInt48, "0x010203040506", 6, true, c), bytes({6, 5, 4, 3, 2, 1}));
    EXPECT_FALSE(V::parse(T::UInt48, "281474976710656", 6, false, c));
    EXPECT_EQ(V::parse(T::UInt64, "18446744073709551615", 8, false, c), QByteArray(8, char(0xFF)));
    EXPECT_FALSE(V::parse(T::UInt64, "18446744073709551616", 8, false, c));
}

TEST(TemplateValues, BitsFollowTheParentFieldAndItsByteOrder)
{
    const QByteArray b = bytes({0x01, 0x80});
    EXPECT_EQ(V::display(T::Bit, b, 0, 0, 2, false, c), "true");
    EXPECT_EQ(V::display(T::Bit, b, 0, 15, 2, false, c), "true");
    EXPECT_EQ(V::display(T::Bit, b, 0, 15, 2, true, c), "false");
    EXPECT_EQ(V::display(T::Bit, b, 0, 7, 2, true, c), "true");
    EXPECT_EQ(V::display(T::Bit, b, 0, 0, 3, false, c), "false"); // no such parent width
    EXPECT_EQ(V::parse(T::Bit, "1", 9, false, c, b), bytes({0x01, 0x82}));
    EXPECT_EQ(V::parse(T::Bit, "0", 0, false, c, b), bytes({0x00, 0x80}));
    EXPECT_EQ(V::parse(T::Bit, "1", 0, true, c, b), bytes({0x01, 0x81}));
    EXPECT_FALSE(V::parse(T::Bit, "1", 16, false, c, b));
}

TEST(TemplateValues, Texts)
{
    QByteArray ansi("AB\x01"
                    "C\0ZZ",
                    7);
    EXPECT_EQ(V::display(T::AnsiZeroPadded, ansi, 0, 7, 0, false, c), "AB.C");
    EXPECT_EQ(V::parse(T::AnsiSpacePadded, "ab", 4, false, c), QByteArray("ab  "));
    EXPECT_EQ(V::parse(T::AnsiZeroPadded, "ab", 4, false, c), QByteArray("ab\0\0", 4));
    EXPECT_FALSE(V::parse(T::AnsiZeroPadded, "abcde", 4, false, c));
    EXPECT_EQ(V::parse(T::DosName, "read me", 11, false, c), QByteArray("READ ME    "));

    // UTF-16: a field whose last unit is set is shown whole; else up to the first zero unit.
    const QByteArray full = bytes({'A', 0, 0, 0, 'B', 0});
    EXPECT_EQ(V::display(T::Utf16Fixed, full, 0, 6, 0, false, c), QString::fromUtf16(u"A\0B", 3));
    EXPECT_EQ(V::display(T::Utf16Fixed, bytes({'A', 0, 'B', 0, 0, 0}), 0, 6, 0, false, c), "AB");
    EXPECT_EQ(V::display(T::Utf16Fixed, bytes({0, 'A', 0, 'B'}), 0, 4, 0, true, c), "AB");
    EXPECT_TRUE(V::display(T::Utf16Fixed, bytes({'A'}), 0, 1, 0, false, c).isEmpty());
    EXPECT_EQ(V::parse(T::Utf16Fixed, "AB", 6, false, c), bytes({'A', 0, 'B', 0, 0, 0}));
    EXPECT_EQ(V::parse(T::Utf16Fixed, "AB", 4, true, c), bytes({0, 'A', 0, 'B'}));
    EXPECT_FALSE(V::parse(T::Utf16Fixed, "ABC", 4, false, c));
    // Long names: terminator after a short text, then 0xFF padding.
    EXPECT_EQ(V::parse(T::LongName, "A", 8, false, c), bytes({'A', 0, 0, 0, 0xFF, 0xFF, 0xFF, 0xFF}));
    EXPECT_EQ(V::parse(T::LongName, "ABCD", 8, false, c), bytes({'A', 0, 'B', 0, 'C', 0, 'D', 0}));
    EXPECT_EQ(V::display(T::LongName, bytes({'A', 0, 0, 0, 0xFF, 0xFF}), 0, 6, 0, false, c), "A");
    EXPECT_EQ(V::display(T::Utf8Text, QByteArray("h\xC3\xA9\0x", 5), 0, 5, 0, false, c),
              QString::fromUtf8("hé"));
}

TEST(TemplateValues, HexBytes)
{
    EXPECT_EQ(V::display(T::HexBytes, bytes({0xAB}), 0, 1, 0, false, c), "0xAB");
    EXPECT_EQ(V::display(T::HexBytes, bytes({0xAB, 0x01}), 0, 2, 0, false, c), "AB 01");
    EXPECT_EQ(V::edit(T::HexBytes, bytes({0xAB, 0x01}), 0, 2, 0, false, c).toString(), "AB01");
    EXPECT_EQ(V::parse(T::HexBytes, "ab 01", 2, false, c), bytes({0xAB, 0x01}));
    EXPECT_FALSE(V::parse(T::HexBytes, "ab", 2, false, c));
    EXPECT_FALSE(V::parse(T::HexBytes, "ab0102", 2, false, c));
    EXPECT_FALSE(V::parse(T::HexBytes, "zz01", 2, false, c));
}

TEST(TemplateValues, DosDatesAndTimes)
{
    // 2024-03-15 13:45:58: date (44 << 9 | 3 << 5 | 15), time (13 << 11 | 45 << 5 | 29).
    const std::uint32_t date = 44u << 9 | 3u << 5 | 15u, time = 13u << 11 | 45u << 5 | 29u;
    const QByteArray stored = V::writeUnsigned(date << 16 | time, 4, false);
    EXPECT_EQ(V::parse(T::DosDateTime, "2024-03-15 13:45:58", 4, false, c), stored);
    EXPECT_FALSE(V::parse(T::DosDateTime, "2024-03-15 13:45:59", 4, false, c));
    EXPECT_FALSE(V::parse(T::DosDateTime, "1979-03-15 13:45:58", 4, false, c));
    EXPECT_EQ(V::edit(T::DosDateTime, stored, 0, 4, 0, false, c).toString(), "2024-03-15 13:45:58");
    EXPECT_EQ(V::parse(T::DosDate, "2107-12-31", 2, false, c),
              V::writeUnsigned(127u << 9 | 12u << 5 | 31u, 2, false));
    EXPECT_FALSE(V::parse(T::DosDate, "2108-01-01", 2, false, c));
    EXPECT_FALSE(V::parse(T::DosDate, "2000-13-01", 2, false, c));
    EXPECT_FALSE(V::parse(T::DosDate, "2000-1-1", 2, false, c));
    EXPECT_EQ(V::edit(T::DosDate, V::writeUnsigned(date, 2, false), 0, 2, 0, false, c).toString(),
              "2024-03-15");
    EXPECT_EQ(V::display(T::DosDate, V::writeUnsigned(date, 2, false), 0, 2, 0, false, c),
              c.toString(QDate(2024, 3, 15), QLocale::ShortFormat));
}

TEST(TemplateValues, WindowsAndUnixTimes)
{
    // 2001-02-03 04:05:06 UTC as 100-ns ticks since 1601.
    const QByteArray ticks = V::parse(T::FileTime, "2001-02-03 04:05:06", 8, false, c).value();
    std::uint64_t v = 0;
    ASSERT_TRUE(V::readUnsigned(ticks, 0, 8, false, v));
    EXPECT_EQ(v, (981173106ull + 11644473600ull) * 10000000ull);
    EXPECT_EQ(V::edit(T::FileTime, ticks, 0, 8, 0, false, c).toString(), "2001-02-03 04:05:06");
    // A value the conversion refuses shows nothing.
    EXPECT_TRUE(V::display(T::FileTime, QByteArray(8, char(0xFF)), 0, 8, 0, false, c).isEmpty());
    EXPECT_TRUE(V::edit(T::FileTime, QByteArray(8, char(0xFF)), 0, 8, 0, false, c).toString().isEmpty());
    EXPECT_TRUE(V::display(T::NtTime, QByteArray(8, '\0'), 0, 8, 0, false, c).isEmpty());
    EXPECT_FALSE(V::parse(T::FileTime, "2001-02-30 04:05:06", 8, false, c));
    EXPECT_FALSE(V::parse(T::FileTime, "2001-02-03 24:05:06", 8, false, c));
    // Unix and HFS+ times round-trip through local time.
    const QByteArray unix = V::parse(T::UnixTime, "2020-06-01 12:00:00", 4, true, c).value();
    EXPECT_EQ(V::edit(T::UnixTime, unix, 0, 4, 0, true, c).toString(), "2020-06-01 12:00:00");
    const QByteArray hfs = V::parse(T::HfsTime, "2020-06-01 12:00:00", 4, true, c).value();
    std::uint64_t u = 0, h = 0;
    V::readUnsigned(unix, 0, 4, true, u);
    V::readUnsigned(hfs, 0, 4, true, h);
    EXPECT_EQ(h - u, std::uint64_t(V::HfsEpochShift));
    EXPECT_FALSE(V::edit(T::UnixNanoTime, QByteArray(8, '\1'), 0, 8, 0, false, c).isValid());
}

TEST(TemplateValues, Validators)
{
    T::HexPatternValidator pattern(2);
    T::HexDosTimeValidator dos(false);
    T::HexDosFileNameValidator shortName(8);
    T::HexLongFileNameValidator longName(8);
    T::HexExFatFileNameValidator exfat(8);
    T::HexUInt64Validator number(0, 255);
    using S = QValidator::State;
    const struct
    {
        const QValidator *validator;
        QString text;
        S state;
        QString shown; // the text as the validator leaves it, where it rewrites it
    } cases[] = {
        {&pattern, "ab0", S::Intermediate, "AB 0"},
        {&pattern, "ab01", S::Acceptable, "AB 01"},
        {&pattern, "ab0102", S::Invalid, {}},
        {&pattern, "xy", S::Invalid, {}},
        {&dos, "2024-03-15 13:45:58", S::Acceptable, {}},
        {&dos, "2024-03-15 13:45:59", S::Invalid, {}},
        {&dos, "2108-03-15 13:45:00", S::Invalid, {}},
        {&dos, "1979-03-15 13:45:00", S::Intermediate, {}},
        {&dos, "2024-  -15 13:45:00", S::Intermediate, {}},
        {&shortName, "", S::Intermediate, {}},
        {&longName, "", S::Acceptable, {}},
        {&shortName, "A B", S::Invalid, {}},
        {&longName, "A B", S::Acceptable, {}},
        {&exfat, "A:B", S::Invalid, {}},
        {&shortName, "toolongname", S::Invalid, {}},
        {&number, "0x1F", S::Acceptable, {}},
        {&number, "256", S::Invalid, {}},
        {&number, "-1", S::Invalid, {}},
    };
    for (const auto &c : cases) {
        QString text = c.text;
        int pos = int(text.size());
        EXPECT_EQ(c.validator->validate(text, pos), c.state) << c.text.toStdString();
        if (!c.shown.isEmpty()) {
            EXPECT_EQ(text, c.shown);
        }
    }
}

TEST(TemplateCatalog, KindsAndAutomaticChoice)
{
    EXPECT_EQ(T::typeFromText("GUID Partition Table"), 18);
    EXPECT_EQ(T::typeFromText("ldm vblk block"), 15);
    EXPECT_EQ(T::typeFromText("34"), int(T::Automatic));
    EXPECT_EQ(T::typeFromText("35"), -1);
    EXPECT_EQ(T::kindOfFileSystem(10, false), T::NtfsBootSector);
    EXPECT_EQ(T::kindOfFileSystem(1, false), T::None);
    EXPECT_EQ(T::kindOfFileSystem(1, true), T::MasterBootRecord);
    EXPECT_EQ(T::kindOfFileSystem(20, false), T::None);
    EXPECT_EQ(T::kindOfFileSystem(16, false), T::ExtSuperBlock);

    const auto gpt = T::automaticChoice(StorageKind::Device, 24, 3, 4096);
    EXPECT_EQ(gpt.type, T::GuidPartitionTable);
    EXPECT_EQ(gpt.offset, 4096u);
    EXPECT_EQ(T::automaticChoice(StorageKind::Device, 24, 2, 512).type, T::MasterBootRecord);
    EXPECT_EQ(T::automaticChoice(StorageKind::Device, 24, 0, 512).type, T::None);
    const auto ext = T::automaticChoice(StorageKind::Partition, 16, 0, 4096);
    EXPECT_EQ(ext.type, T::ExtSuperBlock);
    EXPECT_EQ(ext.offset, 1024u); // the superblock's place does not depend on the sector size
    EXPECT_EQ(T::automaticChoice(StorageKind::Volume, 20, 0, 512).offset, 65536u);
    EXPECT_EQ(T::automaticChoice(StorageKind::Volume, 22, 0, 512).offset, 32768u);
    EXPECT_EQ(T::automaticChoice(StorageKind::Volume, 24, 0, 512).type, T::None);
    EXPECT_EQ(T::availableTypes(),
              (QList<T::Type>{T::MasterBootRecord, T::LdmPrivateHeader, T::LdmTocBlock, T::LdmVmdbBlock,
                              T::LdmKLogBlock, T::LdmVblkBlock, T::GuidPartitionTable}));
}

} // namespace
