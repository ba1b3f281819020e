// The sector dump lines of the hardware report, checked against od's reading of the same bytes.
#include <gtest/gtest.h>

#include <QRandomGenerator>
#include <QTemporaryDir>

#include "Kernel/Implementation/Report/HexDump.h"
#include "tests/common/TestUtil.h"

TEST(HexDump, SectorOf512BytesMatchesOd)
{
    QByteArray data(512, '\0');
    QRandomGenerator rng(7);
    for (auto &c : data)
        c = static_cast<char>(rng.bounded(256));
    data[0x25] = '<';
    const QString text = HexDump::Lines(data);
    QStringList lines = text.split(QStringLiteral("\r\n"));
    ASSERT_EQ(lines.takeLast(), QString()); // every line ends with CR LF
    ASSERT_EQ(lines.size(), 32);

    if (!TestUtil::haveTool("od"))
        GTEST_SKIP() << "od not available";
    QTemporaryDir dir;
    const QString path = dir.filePath("sector.bin");
    ASSERT_TRUE(TestUtil::writeFile(path, data));
    auto od = TestUtil::run("od", {"-An", "-v", "-tx1", "-w16", path});
    ASSERT_EQ(od.exitCode, 0);
    const QStringList odLines = QString::fromLatin1(od.out).split('\n', Qt::SkipEmptyParts);
    ASSERT_EQ(odLines.size(), 32);
    for (int i = 0; i < 32; ++i) {
        const QString &l = lines[i];
        ASSERT_EQ(l.size(), 8 + 3 + 48 + 2 + 16) << l.toStdString();
        EXPECT_EQ(l.left(8), QStringLiteral("%1").arg(i * 16, 8, 16, QChar('0')).toUpper());
        EXPECT_EQ(l.mid(8, 3), QStringLiteral("   "));
        EXPECT_EQ(l.mid(11, 48), odLines[i].toUpper()) << i;
        EXPECT_EQ(l.mid(59, 2), QStringLiteral("  "));
        const QString chars = l.mid(61);
        for (int b = 0; b < 16; ++b) {
            const auto byte = static_cast<uint8_t>(data[i * 16 + b]);
            const QChar expect = (byte < 0x20 || byte > 0x7F || byte == '<') ? QChar('.') : QChar(byte);
            EXPECT_EQ(chars[b], expect) << "line " << i << " byte " << b;
        }
    }
    EXPECT_EQ(lines[2].mid(61 + 5, 1), QStringLiteral(".")); // the '<' at 0x25
}

TEST(HexDump, ShortLastLineIsPaddedAndOffsetsCarryOn)
{
    const QByteArray data("ABCDEFGHIJKLMNOPQR");
    const QString text = HexDump::Lines(data, 0x1F0, QStringLiteral("\n"));
    const QStringList lines = text.split('\n', Qt::SkipEmptyParts);
    ASSERT_EQ(lines.size(), 2);
    EXPECT_EQ(lines[0], QStringLiteral(
                            "000001F0    41 42 43 44 45 46 47 48 49 4A 4B 4C 4D 4E 4F 50  ABCDEFGHIJKLMNOP"));
    EXPECT_EQ(lines[1], QStringLiteral("00000200    51 52") + QString(14 * 3, ' ') + QStringLiteral("  QR") +
                            QString(14, ' '));
    EXPECT_EQ(HexDump::Line(0x123456789ull, nullptr, 0).left(12), QStringLiteral("123456789   "));
}
