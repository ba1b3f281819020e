// Shared pieces of the partition-scan tests: a device over an image file, running the scan, disks
// made with sfdisk and sgdisk, and mmls's view of the same disk.
#pragma once

#include <QFile>
#include <QProcess>
#include <QString>
#include <QStringList>

#include <algorithm>
#include <cstring>
#include <ostream>
#include <vector>

#include "Kernel/Implementation/Partitions/PartScan.h"
#include "tests/common/TestUtil.h"

namespace PartitionTest {

// A device read from an image file (the file's size gives the sector count).
class FileStorage : public cStorage
{
public:
    explicit FileStorage(const QString &path, std::uint32_t bps = 512) : m_file(path), m_bps(bps)
    {
        m_file.open(QIODevice::ReadOnly);
    }
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("Test Disk"); }
    std::uint64_t GetSize() const override { return std::uint64_t(m_file.size()); }
    std::uint32_t GetBytesPerSector() const override { return m_bps; }
    std::uint64_t GetTotalSectors() const override { return std::uint64_t(m_file.size()) / m_bps; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        ++reads;
        std::memset(buffer, 0, std::size_t(count) * m_bps);
        if (first >= GetTotalSectors() || !m_file.seek(qint64(first * m_bps)))
            return false;
        const qint64 want = qint64(count) * m_bps;
        return m_file.read(static_cast<char *>(buffer), want) == want;
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &) override { return false; }
    bool ReadBytes(std::uint64_t, std::uint64_t, void *, std::uint32_t &) override { return false; }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &) override { return false; }
    std::uint64_t reads = 0;

private:
    mutable QFile m_file;
    std::uint32_t m_bps;
};

struct Scanned
{
    PartScan::Result result;
    QStringList messages;
    int made = 0;
};

inline Scanned scan(cStorage &storage, QList<VolumeInfo> volumes = {})
{
    Scanned s;
    PartScan::Input in;
    in.storage = &storage;
    in.deviceName = QStringLiteral("Test Disk");
    in.volumes = volumes;
    in.message = [&s](const QString &t) { s.messages << t; };
    in.partitionMade = [&s](CPartition *) { ++s.made; };
    s.result = PartScan::Scan(in);
    return s;
}

// One row of a disk's layout: start, length and whether it is unallocated space.
struct Row
{
    std::uint64_t start = 0;
    std::uint64_t length = 0;
    bool unallocated = false;
    bool operator==(const Row &o) const
    {
        return start == o.start && length == o.length && unallocated == o.unallocated;
    }
};

// The scan's partitions as mmls lists them: extended partitions replaced by their children.
inline std::vector<Row> leaves(const std::vector<std::unique_ptr<CPartition>> &list)
{
    std::vector<Row> rows;
    for (const auto &p : list) {
        if (p->GetKind() == 1) {
            auto sub = leaves(p->Children());
            rows.insert(rows.end(), sub.begin(), sub.end());
        } else {
            rows.push_back({p->GetStart(), p->GetLength(), p->GetKind() == 0});
        }
    }
    std::sort(rows.begin(), rows.end(), [](const Row &a, const Row &b) { return a.start < b.start; });
    return rows;
}

// mmls shows adjacent unallocated space as one row; the scan keeps the gaps inside an extended
// partition apart from those outside it.
inline std::vector<Row> merged(std::vector<Row> rows)
{
    std::vector<Row> out;
    for (const Row &r : rows) {
        if (!out.empty() && r.unallocated && out.back().unallocated &&
            out.back().start + out.back().length == r.start)
            out.back().length += r.length;
        else
            out.push_back(r);
    }
    return out;
}

inline void PrintTo(const Row &r, std::ostream *os)
{
    *os << (r.unallocated ? "gap " : "part ") << r.start << "+" << r.length;
}

// mmls's rows without its meta entries (tables, extended containers).
inline std::vector<Row> mmlsRows(const QString &image, const QStringList &extra = {})
{
    std::vector<Row> rows;
    TestUtil::ToolResult r = TestUtil::run(QStringLiteral("mmls"), extra + QStringList{image});
    for (const QByteArray &line : r.out.split('\n')) {
        const QList<QByteArray> f = line.simplified().split(' ');
        if (f.size() < 5 || !f[0].endsWith(':') || f[1] == "Meta")
            continue;
        bool ok1 = false, ok2 = false;
        const std::uint64_t start = f[2].toULongLong(&ok1);
        const std::uint64_t length = f[4].toULongLong(&ok2);
        if (!ok1 || !ok2)
            continue;
        rows.push_back({start, length, f[1].startsWith("---")});
    }
    std::sort(rows.begin(), rows.end(), [](const Row &a, const Row &b) { return a.start < b.start; });
    return rows;
}

// An empty image file of `mib` MiB.
inline bool makeImage(const QString &path, int mib)
{
    QFile f(path);
    return f.open(QIODevice::WriteOnly | QIODevice::Truncate) && f.resize(qint64(mib) << 20);
}

inline bool sfdisk(const QString &image, const QByteArray &script)
{
    const QString scriptPath = image + QStringLiteral(".sfdisk");
    TestUtil::writeFile(scriptPath, script);
    QProcess p;
    p.setStandardInputFile(scriptPath);
    p.start(QStringLiteral("sfdisk"),
            {QStringLiteral("--no-reread"), QStringLiteral("--no-tell-kernel"), image});
    return p.waitForFinished(60000) && p.exitCode() == 0;
}

inline bool sgdisk(const QString &image, const QStringList &args)
{
    return TestUtil::run(QStringLiteral("sgdisk"), args + QStringList{image}).exitCode == 0;
}

// Patches bytes of an image file in place.
inline bool patch(const QString &image, qint64 offset, const QByteArray &bytes)
{
    QFile f(image);
    return f.open(QIODevice::ReadWrite) && f.seek(offset) && f.write(bytes) == bytes.size();
}

inline QByteArray readAt(const QString &image, qint64 offset, qint64 size)
{
    QFile f(image);
    if (!f.open(QIODevice::ReadOnly) || !f.seek(offset))
        return {};
    return f.read(size);
}

} // namespace PartitionTest

namespace PartitionTest {

// A boot-record entry with plausible CHS bytes (so that it passes the entry check).
inline QByteArray mbrEntry(std::uint8_t boot, std::uint8_t type, std::uint32_t start, std::uint32_t count)
{
    QByteArray e(16, '\0');
    e[0] = char(boot);
    e[1] = char(0xFE);
    e[2] = char(0xFF);
    e[3] = char(0xFF);
    e[4] = char(type);
    e[5] = char(0xFE);
    e[6] = char(0xFF);
    e[7] = char(0xFF);
    for (int i = 0; i < 4; ++i) {
        e[8 + i] = char(start >> (8 * i));
        e[12 + i] = char(count >> (8 * i));
    }
    return e;
}

// A table sector with up to four entries and the boot signature.
inline QByteArray mbrSector(const QList<QByteArray> &entries, std::uint32_t bps = 512)
{
    QByteArray s(bps, '\0');
    for (qsizetype i = 0; i < entries.size() && i < 4; ++i)
        s.replace(446 + i * 16, 16, entries[i]);
    s[510] = char(0x55);
    s[511] = char(0xAA);
    return s;
}

} // namespace PartitionTest
