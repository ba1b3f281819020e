// The own image format: what the writer makes, the reader reads back at every block size and
// compression level; damaged headers, trailers and tables are refused, and a flipped byte of
// block data fails verification.
#include "tests/common/TestUtil.h"
#include "tests/kernel/Images/ImageTestSupport.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"
#include "Kernel/Implementation/Images/TarvoWriter.h"
#include "Kernel/Implementation/Platform/ScriptedBackend.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "tests/common/TestRoot.h"

#include <QFileInfo>
#include <QTemporaryDir>

#include <gtest/gtest.h>

using namespace ImageTest;

namespace {

CTarvoWriter::SectorReader readerOf(const QByteArray &disk, std::uint8_t shift)
{
    return [&disk, shift](std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) {
        error = 0;
        std::memcpy(buffer, disk.constData() + (first << shift), std::size_t(count) << shift);
        return true;
    };
}

QByteArray makeImage(const QString &path, const QByteArray &disk, std::uint8_t shift, std::uint32_t spb,
                     int level, RecordingRoot &root)
{
    TarvoWriteOptions o;
    o.level = level;
    o.sectorsPerBlock = spb;
    o.description = QStringLiteral("test image ✓");
    o.model = QStringLiteral("Model X");
    o.identity = QStringLiteral("ident");
    o.serial = QStringLiteral("SN-42");
    o.mediaType = 2;
    o.sectorsPerTrack = 63;
    o.tracksPerCylinder = 255;
    CTarvoWriter writer(&root, o);
    EXPECT_TRUE(writer.Write(path, shift, std::uint64_t(disk.size()) >> shift, readerOf(disk, shift)))
        << writer.Problem().toStdString();
    return TestUtil::readFile(path);
}

bool opensAndVerifies(const QByteArray &image, RecordingRoot &root)
{
    CImageMemorySource source(image);
    CImageHandle_Tarvo handle(&root, &source, QStringLiteral("mem.tdi"));
    if (!handle.IsValid())
        return false;
    QString problem;
    return handle.Verify({}, problem);
}

} // namespace

TEST(ImageTarvo, RoundTripAtSeveralBlockSizesAndLevels)
{
    QTemporaryDir dir;
    RecordingRoot root;
    const QByteArray disk = makeDisk(3001);
    for (std::uint32_t spb : {1u, 7u, 64u, 2048u}) {
        for (int level : {0, 1, 6, 9}) {
            const QString path = dir.filePath(QStringLiteral("img-%1-%2.tdi").arg(spb).arg(level));
            makeImage(path, disk, 9, spb, level, root);
            CImageHandle_Tarvo handle(&root, {path});
            ASSERT_TRUE(handle.IsValid()) << spb << "/" << level << ": " << handle.GetProblem().toStdString();
            EXPECT_EQ(handle.GetTotalSectors(), 3001u);
            EXPECT_FALSE(handle.IsWritable());
            EXPECT_TRUE(readAll(handle) == disk) << spb << "/" << level;
            EXPECT_TRUE(readAll(handle, 5) == disk) << spb << "/" << level;
            QString problem;
            EXPECT_TRUE(handle.Verify({}, problem)) << problem.toStdString();
        }
    }
    // Compression pays on an empty disk.
    const QByteArray empty(3001 * 512, '\0');
    makeImage(dir.filePath("empty.tdi"), empty, 9, 64, 6, root);
    EXPECT_LT(QFileInfo(dir.filePath("empty.tdi")).size(), 8192);
}

TEST(ImageTarvo, HeaderStringsAndLargeSectors)
{
    QTemporaryDir dir;
    RecordingRoot root;
    const QByteArray disk = makeDisk(2000, 9).left(4096 * 250); // 250 sectors of 4096 bytes
    const QString path = dir.filePath("big.img");
    makeImage(path, disk, 12, 3, 6, root);
    EXPECT_EQ(ImageOpen::IdentifyFile(&root, path), ImageKind::OwnImage);
    CImageHandle_Tarvo handle(&root, {path});
    ASSERT_TRUE(handle.IsValid()) << handle.GetProblem().toStdString();
    EXPECT_EQ(handle.GetBytesPerSector(), 4096u);
    EXPECT_EQ(handle.GetTotalSectors(), 250u);
    EXPECT_TRUE(readAll(handle) == disk);
    EXPECT_EQ(handle.GetString(0), QStringLiteral("test image ✓"));
    EXPECT_EQ(handle.GetString(1), QStringLiteral("Model X"));
    EXPECT_EQ(handle.GetString(3), QStringLiteral("SN-42"));
    EXPECT_EQ(handle.GetHeader().version, QByteArray("14.04.23"));
    EXPECT_EQ(handle.GetHeader().mediaType, 2u);
    DeviceInfo info;
    handle.Describe(info);
    EXPECT_EQ(info.model, QStringLiteral("Model X"));
    EXPECT_EQ(info.sectorShift, 12);
    EXPECT_EQ(info.sectorsPerTrack, 63u);
    const QByteArray information = handle.ImageInformation();
    ASSERT_GE(information.size(), 128);
    EXPECT_EQ(ImageBytes::le32(reinterpret_cast<const std::uint8_t *>(information.constData()) + 68), 1u);
}

TEST(ImageTarvo, WriterReportsProgressAndCancels)
{
    QTemporaryDir dir;
    RecordingRoot root;
    const QByteArray disk = makeDisk(1000);
    TarvoWriteOptions o;
    o.sectorsPerBlock = 16;
    CTarvoWriter writer(&root, o);
    std::uint64_t last = 0, calls = 0;
    ASSERT_TRUE(writer.Write(dir.filePath("p.tdi"), 9, 1000, readerOf(disk, 9),
                             [&](std::uint64_t done, std::uint64_t total) {
                                 EXPECT_GT(done, last);
                                 EXPECT_EQ(total, 1000u);
                                 last = done;
                                 ++calls;
                                 return true;
                             }));
    EXPECT_EQ(last, 1000u);
    EXPECT_EQ(calls, 63u);
    EXPECT_EQ(writer.BytesWritten(), std::uint64_t(QFileInfo(dir.filePath("p.tdi")).size()));
    // Cancelled, and on a failing source, no file is left behind.
    EXPECT_FALSE(writer.Write(dir.filePath("c.tdi"), 9, 1000, readerOf(disk, 9),
                              [](std::uint64_t done, std::uint64_t) { return done < 500; }));
    EXPECT_FALSE(QFileInfo::exists(dir.filePath("c.tdi")));
    auto failing = [](std::uint64_t first, std::uint32_t, void *, std::uint32_t &error) {
        error = 23;
        return first < 300;
    };
    EXPECT_FALSE(writer.Write(dir.filePath("f.tdi"), 9, 1000, failing));
    EXPECT_FALSE(QFileInfo::exists(dir.filePath("f.tdi")));

    // An image is made when it is on the medium: one whose flush fails is not left behind.
    ScriptedBackend backend;
    TestRoot scripted(&backend);
    CTarvoWriter onScripted(&scripted, o);
    backend.ScriptFlush(SystemError::WriteFault);
    EXPECT_FALSE(onScripted.Write("/img/s.tdi", 9, 1000, readerOf(disk, 9)));
    EXPECT_FALSE(backend.HasFile("/img/s.tdi"));
    EXPECT_TRUE(onScripted.Write("/img/s.tdi", 9, 1000, readerOf(disk, 9)));
    EXPECT_EQ(backend.CallCount("flush /img/s.tdi"), 2);
}

TEST(ImageTarvo, DamagedHeaderTrailerAndTableAreRefused)
{
    QTemporaryDir dir;
    RecordingRoot root;
    const QByteArray disk = makeDisk(600);
    const QByteArray good = makeImage(dir.filePath("g.tdi"), disk, 9, 8, 6, root);
    ASSERT_TRUE(opensAndVerifies(good, root));
    const qsizetype n = good.size();
    struct Damage
    {
        const char *what;
        qsizetype offset;
        QByteArray bytes;
    };
    const QList<Damage> damages = {
        {"magic", 0, QByteArray(1, '\x09')},
        {"total sectors 0", 16, QByteArray(8, '\0')},
        {"total sectors past the table", 16, QByteArray::fromHex("0000000000000100")},
        {"sector shift 3", 28, QByteArray(1, '\x03')},
        {"sector shift 16", 28, QByteArray(1, '\x10')},
        {"sectors per block 0", 64, QByteArray(4, '\0')},
        {"huge block", 64, QByteArray::fromHex("00000100")},
        {"checksum field not 1", 68, QByteArray::fromHex("02000000")},
        {"string block size", 72, QByteArray::fromHex("ff000000")},
        {"string length", 40, QByteArray::fromHex("ffffff00")},
        {"creation time (header checksum)", 60, QByteArray::fromHex("01020304")},
        {"signature", 126, QByteArray(1, '\x54')},
        {"trailer magic without bit 63", n - 1, QByteArray(1, '\x03')},
        {"header checksum in the trailer", n - 16, QByteArray(1, '\x00')},
        {"group table entry", n - 24, QByteArray::fromHex("ffffffffffff0000")},
        {"group table entry into the header", n - 24, QByteArray::fromHex("1000000000000000")},
    };
    for (const Damage &d : damages) {
        QByteArray bytes = good;
        bytes.replace(d.offset, d.bytes.size(), d.bytes);
        ASSERT_NE(bytes, good) << d.what;
        CImageMemorySource source(bytes);
        CImageHandle_Tarvo handle(&root, &source, QStringLiteral("bad"));
        EXPECT_FALSE(handle.IsValid()) << d.what;
        EXPECT_EQ(handle.GetTotalSectors(), 0u) << d.what;
    }
    // Truncated images are refused at every length.
    for (qsizetype len : {qsizetype(0), qsizetype(100), qsizetype(160), n / 2, n - 1}) {
        CImageMemorySource source(good.left(len));
        CImageHandle_Tarvo handle(&root, &source, QStringLiteral("short"));
        EXPECT_FALSE(handle.IsValid()) << len;
    }
}

TEST(ImageTarvo, EveryFlippedByteOfBlockDataFailsVerification)
{
    QTemporaryDir dir;
    RecordingRoot root;
    const QByteArray disk = makeDisk(24, 11);
    const QByteArray good = makeImage(dir.filePath("v.tdi"), disk, 9, 8, 1, root);
    ASSERT_TRUE(opensAndVerifies(good, root));
    const auto *b = reinterpret_cast<const std::uint8_t *>(good.constData());
    const qsizetype dataStart = 128 + qsizetype(ImageBytes::le32(b + 72));
    // 3 blocks of 8 sectors: one group; its table entry is just before the trailer.
    const qsizetype tableStart = good.size() - 16 - 8;
    int failures = 0, flips = 0;
    for (qsizetype i = dataStart; i < tableStart; ++i) {
        QByteArray bytes = good;
        bytes[i] = char(bytes[i] ^ 0xFF);
        ++flips;
        if (!opensAndVerifies(bytes, root))
            ++failures;
        else
            ADD_FAILURE() << "flip at " << i << " passed";
    }
    EXPECT_EQ(failures, flips);
    EXPECT_GT(flips, 500);
}
