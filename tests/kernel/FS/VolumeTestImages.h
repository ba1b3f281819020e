// File-system images made once per test program with the standard tools, in one scratch folder.
#pragma once

#include "tests/common/TestUtil.h"

#include <QDir>
#include <QFile>
#include <QMap>
#include <QProcess>
#include <QProcessEnvironment>
#include <QTemporaryDir>

namespace VolumeImages {

struct Made
{
    QString path;  // empty when the tool is missing or failed
    QString label; // the label asked for
    QString why;   // why it could not be made
};

inline QTemporaryDir &Scratch()
{
    static QTemporaryDir dir;
    return dir;
}

inline bool Sized(const QString &path, qint64 bytes)
{
    QFile f(path);
    return f.open(QIODevice::WriteOnly | QIODevice::Truncate) && f.resize(bytes);
}

inline Made Tool(const QString &file, qint64 size, const QString &program, QStringList args,
                 const QString &label, bool env = false)
{
    Made m;
    m.label = label;
    if (!TestUtil::haveTool(program)) {
        m.why = program + QStringLiteral(" is not installed");
        return m;
    }
    const QString path = Scratch().filePath(file);
    if (size > 0 && !Sized(path, size)) {
        m.why = QStringLiteral("cannot size ") + path;
        return m;
    }
    for (QString &a : args)
        a.replace(QStringLiteral("%IMG%"), path).replace(QStringLiteral("%DIR%"), Scratch().path());
    QProcess p;
    if (env) {
        QProcessEnvironment e = QProcessEnvironment::systemEnvironment();
        e.insert(QStringLiteral("TEST_DIR"), QStringLiteral("1"));
        e.insert(QStringLiteral("TEST_DEV"), QStringLiteral("1"));
        e.insert(QStringLiteral("QA_CHECK_FS"), QStringLiteral("1"));
        p.setProcessEnvironment(e);
    }
    p.start(program, args);
    if (!p.waitForFinished(120000) || p.exitCode() != 0) {
        m.why = program + QStringLiteral(" failed: ") + QString::fromLocal8Bit(p.readAllStandardError());
        return m;
    }
    m.path = path;
    return m;
}

inline QString SourceFolder()
{
    const QString dir = Scratch().filePath(QStringLiteral("src"));
    if (!QDir(dir).exists()) {
        QDir().mkpath(dir);
        QByteArray big(3 * 1024 * 1024, 0);
        for (int i = 0; i < big.size(); ++i)
            big[i] = static_cast<char>((qint64(i) * 7919) >> 3);
        TestUtil::writeFile(dir + QStringLiteral("/big.bin"), big);
        TestUtil::writeFile(dir + QStringLiteral("/a.txt"), "hello\n");
    }
    return dir;
}

// The image of one kind: "fat12", "fat16", "fat32", "exfat", "ntfs", "ext2", "ext3", "ext4",
// "btrfs", "xfs", "jfs", "udf", "iso", "hfsplus", "apfs", "ufs1", "ufs2".
inline Made Get(const QString &kind)
{
    static QMap<QString, Made> made;
    auto it = made.find(kind);
    if (it != made.end())
        return it.value();
    Made m;
    const QString img = kind + QStringLiteral(".img");
    if (kind == QLatin1String("fat12"))
        m = Tool(img, 4 << 20, "mkfs.vfat", {"-F", "12", "-n", "FATLBL12", "-i", "1234ABCD", "%IMG%"},
                 "FATLBL12");
    else if (kind == QLatin1String("fat16"))
        m = Tool(img, 32 << 20, "mkfs.vfat", {"-F", "16", "-n", "FATLBL16", "-i", "2345BCDE", "%IMG%"},
                 "FATLBL16");
    else if (kind == QLatin1String("fat32"))
        m = Tool(img, 40 << 20, "mkfs.vfat", {"-F", "32", "-n", "FATLBL32", "-i", "3456CDEF", "%IMG%"},
                 "FATLBL32");
    else if (kind == QLatin1String("exfat"))
        m = Tool(img, 8 << 20, "mkfs.exfat", {"-L", "EXLBL", "%IMG%"}, "EXLBL");
    else if (kind == QLatin1String("ntfs"))
        m = Tool(img, 16 << 20, "mkntfs", {"-F", "-Q", "-q", "-c", "4096", "-L", "NTLBL", "%IMG%"}, "NTLBL");
    else if (kind.startsWith(QLatin1String("ext")))
        m = Tool(img, 8 << 20, "mke2fs", {"-q", "-F", "-t", kind, "-L", kind.toUpper() + "LBL", "%IMG%"},
                 kind.toUpper() + "LBL");
    else if (kind == QLatin1String("btrfs"))
        m = Tool(img, 128 << 20, "mkfs.btrfs", {"-q", "-f", "-L", "BTLBL", "%IMG%"}, "BTLBL");
    else if (kind == QLatin1String("xfs"))
        m = Tool(img, 80 << 20, "mkfs.xfs", {"-q", "-f", "-L", "XLBL", "%IMG%"}, "XLBL", true);
    else if (kind == QLatin1String("jfs"))
        m = Tool(img, 16 << 20, "jfs_mkfs", {"-q", "-L", "JLBL", "%IMG%"}, "JLBL");
    else if (kind == QLatin1String("udf"))
        m = Tool(img, 8 << 20, "mkudffs", {"--label=ULBL", "%IMG%"}, "ULBL");
    else if (kind == QLatin1String("iso"))
        m = Tool(img, 0, "genisoimage", {"-quiet", "-V", "CDLBL", "-o", "%IMG%", SourceFolder()}, "CDLBL");
    else if (kind == QLatin1String("apfs"))
        m = Tool(img, 128 << 20, "mkapfs", {"-L", "APLBL", "%IMG%"}, "APLBL");
    else if (kind == QLatin1String("ufs1") || kind == QLatin1String("ufs2"))
        m = Tool(img, 0, "makefs",
                 {"-t", "ffs", "-o", QStringLiteral("version=%1,bsize=4096,fsize=512").arg(kind.right(1)),
                  "-B", "le", "-s", "48m", "%IMG%", SourceFolder()},
                 QString());
    else if (kind == QLatin1String("hfsplus")) {
        // The Apple_HFS partition of a hybrid image (2048-byte blocks).
        Made iso = Tool("hfs.iso", 0, "xorriso",
                        {"-outdev", "%IMG%", "-hfsplus", "on", "-volid", "HFSLBL", "-map", SourceFolder(),
                         "/", "-commit"},
                        "HFSLBL");
        m = iso;
        m.path.clear();
        m.label.clear(); // the name lives in the catalog, which the base behaviour does not read
        if (!iso.path.isEmpty()) {
            const TestUtil::ToolResult r = TestUtil::run("mmls", {"-t", "mac", "-b", "2048", iso.path});
            for (const QByteArray &line : r.out.split('\n')) {
                if (!line.contains("Apple_HFS"))
                    continue;
                const QList<QByteArray> f = line.simplified().split(' ');
                if (f.size() < 5)
                    break;
                const qint64 start = f[2].toLongLong(), length = f[4].toLongLong();
                QFile in(iso.path);
                if (in.open(QIODevice::ReadOnly) && in.seek(start * 2048)) {
                    const QString out = Scratch().filePath(img);
                    TestUtil::writeFile(out, in.read(length * 2048));
                    m.path = out;
                }
            }
            if (m.path.isEmpty())
                m.why = QStringLiteral("no Apple_HFS partition in the hybrid image");
        }
    }
    made.insert(kind, m);
    return m;
}

// blkid's low-level probe of a file: its tags.
inline QMap<QString, QString> Blkid(const QString &path, qint64 offset = 0)
{
    QMap<QString, QString> tags;
    QStringList args{"-p", "-o", "export"};
    if (offset)
        args << "-O" << QString::number(offset);
    args << path;
    const TestUtil::ToolResult r = TestUtil::run("blkid", args);
    for (const QByteArray &line : r.out.split('\n')) {
        const int eq = line.indexOf('=');
        if (eq > 0)
            tags.insert(QString::fromUtf8(line.left(eq)), QString::fromUtf8(line.mid(eq + 1)));
    }
    return tags;
}

// A copy of an image in the scratch folder.
inline QString Copy(const QString &path, const QString &name)
{
    const QString out = Scratch().filePath(name);
    QFile::remove(out);
    return QFile::copy(path, out) ? out : QString();
}

// Overwrites `length` bytes at `offset` of a file with zeros.
inline bool Wipe(const QString &path, qint64 offset, qint64 length)
{
    QFile f(path);
    if (!f.open(QIODevice::ReadWrite) || !f.seek(offset))
        return false;
    return f.write(QByteArray(length, 0)) == length;
}

// A BSD disk label in sector 1 of a UFS partition, with slice 'a' over the whole partition.
inline QByteArray BsdLabel(std::uint32_t sectors)
{
    QByteArray l(512, 0);
    auto put32 = [&l](int at, std::uint32_t v) {
        for (int i = 0; i < 4; ++i)
            l[at + i] = static_cast<char>(v >> (8 * i));
    };
    auto put16 = [&l](int at, std::uint16_t v) {
        l[at] = static_cast<char>(v);
        l[at + 1] = static_cast<char>(v >> 8);
    };
    put32(0, 0x82564557u);
    put32(40, 512);
    put32(60, sectors);
    put32(132, 0x82564557u);
    put16(138, 3);
    put32(148 + 0, sectors - 64); // a: UFS
    put32(148 + 4, 0);
    l[148 + 12] = 7;
    put32(148 + 16 + 0, 64); // b: swap at the end
    put32(148 + 16 + 4, sectors - 64);
    l[148 + 16 + 12] = 1;
    put32(148 + 32 + 0, sectors); // c: the whole partition
    l[148 + 32 + 12] = 0;
    std::uint16_t sum = 0;
    for (int i = 0; i < 148 + 3 * 16; i += 2)
        sum ^= static_cast<std::uint16_t>(static_cast<std::uint8_t>(l[i]) |
                                          (static_cast<std::uint8_t>(l[i + 1]) << 8));
    put16(136, sum);
    return l;
}

} // namespace VolumeImages
