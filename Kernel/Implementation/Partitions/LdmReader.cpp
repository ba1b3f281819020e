#include "Kernel/Implementation/Partitions/LdmReader.h"

#include <map>
#include <set>

#include "Kernel/Implementation/Common/ByteOrder.h"
#include "Kernel/Implementation/Partitions/PartScanBytes.h"

namespace Ldm {

using ByteOrder::be16;
using ByteOrder::be32;
using ByteOrder::be64;
using PartScan::hasText;

namespace {

// Record types of the database.
constexpr std::uint8_t TypeComponent = 0x32;
constexpr std::uint8_t TypePartition = 0x33;
constexpr std::uint8_t TypeDisk3 = 0x34;
constexpr std::uint8_t TypeDiskGroup3 = 0x35;
constexpr std::uint8_t TypeDisk4 = 0x44;
constexpr std::uint8_t TypeDiskGroup4 = 0x45;
constexpr std::uint8_t TypeVolume = 0x51;

constexpr std::uint32_t FragmentHeader = 0x10;
// A record joined from more fragments than this is refused.
constexpr std::uint16_t MaxFragments = 256;

// A zero-terminated text field of at most `size` bytes; `terminated` tells whether the zero was there.
QString fixedText(const QByteArray &b, qsizetype offset, qsizetype size, bool *terminated = nullptr)
{
    QByteArray raw = b.mid(offset, size);
    const qsizetype zero = raw.indexOf('\0');
    if (terminated)
        *terminated = zero >= 0;
    if (zero >= 0)
        raw.truncate(zero);
    return QString::fromLatin1(raw);
}

bool isPrintable(const QString &s)
{
    for (QChar c : s)
        if (c.unicode() < 0x20 || c.unicode() > 0x7E)
            return false;
    return true;
}

bool isGuidText(const QString &s)
{
    static const QString pattern = QStringLiteral("xxxxxxxx-xxxx-xxxx-xxxx-xxxxxxxxxxxx");
    if (s.size() != pattern.size())
        return false;
    for (qsizetype i = 0; i < s.size(); ++i) {
        if (pattern[i] == QLatin1Char('-')) {
            if (s[i] != QLatin1Char('-'))
                return false;
        } else if (!isxdigit(s[i].toLatin1())) {
            return false;
        }
    }
    return true;
}

// The variable-length fields of a record body: a length byte followed by that many bytes.
class Cursor
{
public:
    Cursor(const QByteArray &b, qsizetype offset, qsizetype end) : m_b(b), m_pos(offset), m_end(end) {}
    bool ok() const { return m_ok; }
    qsizetype pos() const { return m_pos; }
    std::uint64_t number()
    {
        const int n = byte();
        if (n > 8 || !need(n))
            return fail();
        const std::uint64_t v = n == 0 ? 0 : ByteOrder::readBe(m_b, m_pos, n);
        m_pos += n;
        return v;
    }
    QString text()
    {
        const int n = byte();
        if (!need(n)) {
            fail();
            return {};
        }
        QString s = QString::fromLatin1(m_b.constData() + m_pos, n);
        m_pos += n;
        return s;
    }
    QByteArray bytes(int n)
    {
        if (!need(n)) {
            fail();
            return {};
        }
        QByteArray r = m_b.mid(m_pos, n);
        m_pos += n;
        return r;
    }
    int byte()
    {
        if (!need(1))
            return int(fail());
        return static_cast<std::uint8_t>(m_b[m_pos++]);
    }
    void skip(int n)
    {
        if (!need(n))
            fail();
        else
            m_pos += n;
    }

private:
    bool need(int n) const { return m_ok && n >= 0 && m_pos <= m_end - n && m_end <= m_b.size(); }
    std::uint64_t fail()
    {
        m_ok = false;
        return 0;
    }
    const QByteArray &m_b;
    qsizetype m_pos;
    qsizetype m_end;
    bool m_ok = true;
};

bool readSectors(cStorage &s, std::uint64_t first, std::uint64_t count, QByteArray &out)
{
    const std::uint32_t bps = s.GetBytesPerSector();
    const std::uint64_t total = s.GetTotalSectors();
    if (bps == 0 || count == 0 || first >= total || count > total - first || count * bps > MaxDatabaseBytes)
        return false;
    out.resize(qsizetype(count * bps));
    std::uint32_t error = 0;
    return s.ReadSectors(first, std::uint32_t(count), out.data(), error);
}

struct PrivHead
{
    QByteArray raw;
    QString diskGuid, groupGuid, groupName;
    Area data, metadata;
};

bool acceptPrivHead(const QByteArray &b, PrivHead &ph)
{
    if (b.size() < qsizetype(PrivHeadBytes) || !hasText(b, 0, "PRIVHEAD"))
        return false;
    if (be16(b, 12) != 2 || be16(b, 14) < 11)
        return false;
    if (checksum(b, PrivHeadBytes) != be32(b, 8))
        return false;
    ph.raw = b.left(PrivHeadBytes);
    ph.diskGuid = fixedText(b, 0x30, 64);
    ph.groupGuid = fixedText(b, 0xB0, 64);
    ph.groupName = fixedText(b, 0xF0, 32);
    ph.data = {be64(b, 0x11B), be64(b, 0x123)};
    ph.metadata = {be64(b, 0x12B), be64(b, 0x133)};
    return true;
}

bool withinDevice(const Area &a, std::uint64_t total)
{
    return a.start != 0 && a.length != 0 && a.start < total && a.length <= total - a.start;
}

} // namespace

std::uint32_t checksum(const QByteArray &bytes, qsizetype length)
{
    std::uint32_t sum = 0;
    for (qsizetype i = 0; i < length && i < bytes.size(); ++i)
        if (i < 8 || i > 11)
            sum += static_cast<std::uint8_t>(bytes[i]);
    return sum;
}

ReadResult read(cStorage &storage, std::uint64_t place, const std::optional<Area> &gptMetadata,
                const std::optional<Area> &gptData, const QString &deviceName,
                const std::function<void(const QString &)> &message)
{
    ReadResult r;
    auto say = [&message](const QString &t) {
        if (message)
            message(t);
    };
    const std::uint64_t total = storage.GetTotalSectors();
    const std::uint32_t bps = storage.GetBytesPerSector();
    if (bps < 512 || total == 0)
        return r;

    // The private header: at the place the walk found, then in sector 6.
    PrivHead ph;
    for (std::uint64_t sector : {place, PrivHeadFallbackSector}) {
        QByteArray b;
        if (sector != cStorage::NoSector && readSectors(storage, sector, 1, b) && acceptPrivHead(b, ph)) {
            r.found = true;
            r.privHeadSector = sector;
            break;
        }
    }
    if (!r.found) {
        say(QStringLiteral("Not valid LDM definition on device %1").arg(deviceName));
        return r;
    }
    r.diskGuid = ph.diskGuid;
    r.diskGroupGuid = ph.groupGuid;
    r.diskGroupName = ph.groupName;
    r.metadata = ph.metadata;
    r.data = ph.data;
    if (gptMetadata || gptData) {
        if (!gptMetadata || !gptData || !(*gptMetadata == ph.metadata) || !(*gptData == ph.data)) {
            say(QStringLiteral("LDM definition in its header and GPT not equal on device %1")
                    .arg(deviceName));
            return r;
        }
    } else if (!withinDevice(ph.data, total) || !withinDevice(ph.metadata, total)) {
        say(QStringLiteral("Not valid LDM definition on device %1").arg(deviceName));
        return r;
    }
    r.areasValid = true;

    // The table of contents follows the first sector of the configuration area.
    const std::uint64_t tocSector = ph.metadata.start + 1;
    QByteArray toc;
    if (tocSector >= total || !readSectors(storage, tocSector, 1, toc))
        return r;
    if (!hasText(toc, 0, "TOCBLOCK")) {
        say(QStringLiteral("Invalid LDM TOCBLOCK signature in sector %1 on device %2")
                .arg(tocSector)
                .arg(deviceName));
        return r;
    }
    if (checksum(toc, TocBlockBytes) != be32(toc, 8)) {
        say(QStringLiteral("Invalid LDM TOCBLOCK checksum in sector %1 on device %2")
                .arg(tocSector)
                .arg(deviceName));
        return r;
    }
    // The "config" bitmap entry locates the database inside the configuration area.
    const std::uint64_t dbOffset = be64(toc, 0x2E);
    const std::uint64_t dbSectors = be64(toc, 0x36);
    if (dbOffset == 0 || dbOffset >= total || ph.metadata.start >= total - dbOffset ||
        ph.metadata.start + dbOffset >= total - 1) {
        say(QStringLiteral("Invalid LDM VMDB position in sector %1 on device %2")
                .arg(tocSector)
                .arg(deviceName));
        return r;
    }
    const std::uint64_t dbStart = ph.metadata.start + dbOffset;
    if (dbSectors == 0 || dbSectors > total - 1 - dbStart || dbSectors > 0xFFFFFFFFull / bps) {
        say(QStringLiteral("Invalid LDM VMDB length in sector %1 on device %2")
                .arg(tocSector)
                .arg(deviceName));
        return r;
    }
    const std::uint64_t dbBytes = dbSectors * bps;

    QByteArray vmdb;
    if (!readSectors(storage, dbStart, 1, vmdb))
        return r;
    if (!hasText(vmdb, 0, "VMDB")) {
        say(QStringLiteral("Invalid LDM VMDB signature on device %1").arg(deviceName));
        return r;
    }
    const std::uint32_t lastSequence = be32(vmdb, 0x04);
    const std::uint32_t vblkSize = be32(vmdb, 0x08);
    const std::uint32_t firstOffset = be32(vmdb, 0x0C);
    const std::uint16_t status = be16(vmdb, 0x10);
    if (vblkSize < 0x20 || vblkSize > bps || bps % vblkSize != 0) {
        say(QStringLiteral("Invalid LDM VBLK size on device %1").arg(deviceName));
        return r;
    }
    if (firstOffset < VmdbBytes || firstOffset % vblkSize != 0 || firstOffset >= dbBytes) {
        say(QStringLiteral("Invalid LDM VBLK position on device %1").arg(deviceName));
        return r;
    }
    if (status != 1)
        say(QStringLiteral("Invalid LDM VMDB status on device %1").arg(deviceName));
    bool terminated = false;
    const QString groupName = fixedText(vmdb, 0x16, 31, &terminated);
    if (!terminated || groupName.isEmpty() || !isPrintable(groupName) ||
        (!ph.groupName.isEmpty() && groupName != ph.groupName))
        say(QStringLiteral("Invalid LDM VMDB disk group name on device %1").arg(deviceName));
    const QString groupGuid = fixedText(vmdb, 0x35, 64);
    if (!isGuidText(groupGuid) ||
        (!ph.groupGuid.isEmpty() && groupGuid.compare(ph.groupGuid, Qt::CaseInsensitive) != 0))
        say(QStringLiteral("Invalid LDM VMDB disk group ident on device %1").arg(deviceName));
    // The records fill the database from the first offset up to the last sequence number.
    const std::uint64_t areaEnd = std::uint64_t(lastSequence) * vblkSize;
    if (lastSequence == 0 || areaEnd <= firstOffset || areaEnd > dbBytes) {
        say(QStringLiteral("Invalid LDM VBLK length on device %1").arg(deviceName));
        return r;
    }
    const std::uint64_t slotCount = (areaEnd - firstOffset) / vblkSize;
    if (slotCount > MaxRecords) {
        say(QStringLiteral("Invalid LDM VBLK length on device %1").arg(deviceName));
        return r;
    }
    QByteArray db;
    if (!readSectors(storage, dbStart, (areaEnd + bps - 1) / bps, db))
        return r;
    r.databaseValid = true;

    // Fragments by group number, joined in record-number order.
    struct Pending
    {
        std::uint16_t count = 0;
        std::uint16_t status = 0;
        std::uint32_t firstSlot = 0;
        std::uint32_t sequence = 0;
        std::map<std::uint16_t, QByteArray> parts;
    };
    std::map<std::uint32_t, Pending> groups;
    for (std::uint32_t i = 0; i < slotCount; ++i) {
        const qsizetype o = qsizetype(firstOffset) + qsizetype(i) * vblkSize;
        const std::uint32_t slot = static_cast<std::uint32_t>(o / vblkSize);
        const std::uint16_t count = be16(db, o + 0x0E);
        if (!hasText(db, o, "VBLK")) {
            say(QStringLiteral("Invalid LDM VBLK signature in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        if (count == 0)
            continue; // an unused slot
        if (be32(db, o + 0x04) != slot) {
            say(QStringLiteral("Invalid LDM VBLK index in record %1 on device %2").arg(slot).arg(deviceName));
            continue;
        }
        if (count > MaxFragments || std::uint64_t(count) * (vblkSize - FragmentHeader) > MaxDatabaseBytes) {
            say(QStringLiteral("Invalid LDM VBLK number of records in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        const std::uint16_t number = be16(db, o + 0x0C);
        if (number >= count) {
            say(QStringLiteral("Invalid LDM VBLK record number in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        const std::uint32_t group = be32(db, o + 0x08);
        Pending &p = groups[group];
        if (p.parts.empty()) {
            p.count = count;
            p.firstSlot = slot;
            p.sequence = be32(db, o + 0x04);
            p.status = be16(db, o + 0x10);
        } else if (p.count != count || p.parts.count(number)) {
            say(QStringLiteral("Invalid LDM VBLK number of records in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        // Only the first fragment carries the record's own header fields.
        p.parts[number] =
            number == 0 ? db.mid(o, vblkSize) : db.mid(o + FragmentHeader, vblkSize - FragmentHeader);
    }

    int diskGroups = 0;
    for (auto &[group, p] : groups) {
        const std::uint32_t slot = p.firstSlot;
        if (p.parts.size() != p.count || !p.parts.count(0))
            continue; // an incomplete record (a fragment was refused above)
        QByteArray rec;
        for (auto &[n, part] : p.parts)
            rec += part;
        if (be16(rec, 0x10) != p.status) {
            say(QStringLiteral("Invalid LDM VBLK update status in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        const std::uint8_t flags = static_cast<std::uint8_t>(rec.size() > 0x12 ? rec[0x12] : 0);
        const std::uint8_t type = static_cast<std::uint8_t>(rec.size() > 0x13 ? rec[0x13] : 0);
        const std::uint32_t length = be32(rec, 0x14);
        if (length == 0 || length > std::uint64_t(rec.size()) - 0x18) {
            say(QStringLiteral("Invalid LDM VBLK group length in record %1 on device %2")
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        const qsizetype end = 0x18 + qsizetype(length);
        Cursor c(rec, 0x18, end);
        Record out;
        out.group = group;
        out.type = type;
        out.sequence = p.sequence;
        out.objectId = c.number();
        out.name = c.text();
        out.data = rec;
        bool use = true;
        switch (type) {
        case TypeVolume: {
            out.volumeType = c.text();
            c.text(); // unknown text
            const QString state = c.text();
            use = state == QLatin1String("ACTIVE");
            if (out.volumeType == QLatin1String("raid5") && use)
                r.hasRaid5 = true;
            break;
        }
        case TypeComponent: {
            const QString state = c.text();
            const int arrayType = c.byte();
            if (c.ok() && (arrayType < 1 || arrayType > 3)) {
                say(QStringLiteral("Invalid LDM VBLK array type in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            c.skip(4);
            c.number(); // children
            c.skip(8);  // log commit id
            c.skip(8);
            c.number(); // parent volume
            c.skip(1);
            if (flags & 0x10) {
                const std::uint64_t stripe = c.number();
                if (c.ok() && (stripe == 0 || stripe > 0xFFFFFFFFull)) {
                    say(QStringLiteral("Invalid LDM VBLK stripe size in record %1 on device %2")
                            .arg(slot)
                            .arg(deviceName));
                    continue;
                }
            }
            use = state == QLatin1String("ACTIVE");
            break;
        }
        case TypeDisk3:
        case TypeDisk4: {
            const QString guid = type == TypeDisk3 ? c.text() : QString();
            const QByteArray bin = type == TypeDisk4 ? c.bytes(16) : QByteArray();
            const bool bad = type == TypeDisk3 ? !isGuidText(guid) : bin == QByteArray(16, '\0');
            if (!c.ok() || bad) {
                say(QStringLiteral("Invalid LDM VBLK disk ident in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            break;
        }
        case TypeDiskGroup3:
        case TypeDiskGroup4: {
            if (out.objectId == 0) {
                say(QStringLiteral("Invalid LDM VBLK group ident in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            if (out.name.isEmpty() || (!groupName.isEmpty() && out.name != groupName)) {
                say(QStringLiteral("Invalid LDM VBLK group name in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            const QString guid = type == TypeDiskGroup3 ? c.text() : QString();
            const QByteArray bin = type == TypeDiskGroup4 ? c.bytes(16) : QByteArray();
            const bool bad = type == TypeDiskGroup3
                                 ? !isGuidText(guid) || (!ph.groupGuid.isEmpty() &&
                                                         guid.compare(ph.groupGuid, Qt::CaseInsensitive) != 0)
                                 : bin == QByteArray(16, '\0');
            if (!c.ok() || bad) {
                say(QStringLiteral("Invalid LDM VBLK group GUID in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            if (++diskGroups > 1) {
                say(QStringLiteral("LDM VBLK have two records per one group in record %1 on device %2")
                        .arg(slot)
                        .arg(deviceName));
                continue;
            }
            break;
        }
        case TypePartition:
            break;
        default:
            say(QStringLiteral("Invalid LDM VBLK type 0x%1 in record %2 on device %3")
                    .arg(type, 2, 16, QLatin1Char('0'))
                    .arg(slot)
                    .arg(deviceName));
            continue;
        }
        if (use)
            r.records.push_back(out);
    }
    if (diskGroups == 0)
        say(QStringLiteral("Invalid LDM VBLK group configuration on device %1").arg(deviceName));
    return r;
}

} // namespace Ldm
