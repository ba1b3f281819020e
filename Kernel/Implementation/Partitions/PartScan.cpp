#include "Kernel/Implementation/Partitions/PartScan.h"

#include <algorithm>
#include <set>

#include "Kernel/Implementation/Partitions/GptReader.h"
#include "Kernel/Implementation/Partitions/LdmReader.h"
#include "Kernel/Implementation/Partitions/MbrTable.h"
#include "Kernel/Implementation/Partitions/PartScanBytes.h"
#include "Kernel/Implementation/Partitions/PartScanKinds.h"

namespace PartScan {

namespace {

constexpr std::uint32_t UnknownKind = 0xFFFFFFFF;
// An extended chain longer than this is treated as damaged (a real disk holds a few dozen).
constexpr std::uint32_t MaxChainRecords = 16384;
// Partitions whose contents are looked at for their kind; the rest stay of unknown kind.
constexpr std::uint32_t MaxSniffed = 1024;

class Scanner
{
public:
    explicit Scanner(const Input &in)
        : m_in(in), m_storage(*in.storage), m_taken(std::size_t(in.volumes.size()))
    {
        m_bps = m_storage.GetBytesPerSector();
        m_total = m_storage.GetTotalSectors();
        m_shift = 0;
        while (m_shift < 31 && (1u << m_shift) < m_bps)
            ++m_shift;
    }

    Result run();

private:
    void message(const QString &text)
    {
        if (m_in.message)
            m_in.message(text);
    }
    QString name() const { return m_in.deviceName; }
    bool readSector(std::uint64_t sector, QByteArray &out);
    // The unmatched platform volume whose single extent is exactly [start, start+count) sectors.
    int findVolume(std::uint64_t start, std::uint64_t count) const;
    std::unique_ptr<CPartition> make(std::uint32_t kind, std::uint64_t start, std::uint64_t length,
                                     int volume);
    void announce(CPartition *p)
    {
        if (m_in.partitionMade)
            m_in.partitionMade(p);
    }
    std::uint32_t kindOf(std::uint32_t fromType, int volume, std::uint64_t start, std::uint64_t length);
    void wholeDevice(std::uint32_t kind, int volume);

    void walkMbr(const QByteArray &sector0);
    std::optional<Mbr::Entry> walkTable(QByteArray &sector, std::uint64_t tableSector, CPartition *extended);
    void walkChain(CPartition *extended);
    void readGpt();
    void readLdm(bool gpt);
    static void addGaps(std::vector<std::unique_ptr<CPartition>> &list, std::uint64_t from, std::uint64_t to,
                        cDevice *device, cStorage *storage, CPartition *parent);

    const Input &m_in;
    cStorage &m_storage;
    Result m_r;
    std::uint32_t m_bps = 0;
    std::uint64_t m_total = 0;
    unsigned m_shift = 9;
    std::vector<bool> m_taken;
    std::uint32_t m_sniffed = 0;
    std::vector<CPartition *> m_extended;
    std::vector<std::pair<Mbr::Entry, int>> m_ldmEntries; // boot-record 0x42 entries, made after the LDM read
    std::optional<Ldm::Area> m_gptMetadata, m_gptData;
};

bool Scanner::readSector(std::uint64_t sector, QByteArray &out)
{
    if (sector >= m_total)
        return false;
    out.resize(m_bps);
    std::uint32_t error = 0;
    return m_storage.ReadSectors(sector, 1, out.data(), error);
}

int Scanner::findVolume(std::uint64_t start, std::uint64_t count) const
{
    for (qsizetype i = 0; i < m_in.volumes.size(); ++i) {
        if (m_taken[std::size_t(i)])
            continue;
        const VolumeInfo &v = m_in.volumes[i];
        if (v.extents.size() != 1)
            continue;
        const VolumeExtent &e = v.extents.first();
        if ((e.offset >> m_shift) == start && (e.length >> m_shift) == count)
            return int(i);
    }
    return -1;
}

std::unique_ptr<CPartition> Scanner::make(std::uint32_t kind, std::uint64_t start, std::uint64_t length,
                                          int volume)
{
    auto p = std::make_unique<CPartition>(m_in.device, m_in.storage, nullptr, kind, start, length);
    if (volume >= 0) {
        p->SetVolume(m_in.volumes[volume]);
        m_taken[std::size_t(volume)] = true;
    }
    return p;
}

std::uint32_t Scanner::kindOf(std::uint32_t fromType, int volume, std::uint64_t start, std::uint64_t length)
{
    if (fromType != UnknownKind)
        return fromType;
    if (volume >= 0) {
        const auto fs = static_cast<std::uint32_t>(m_in.volumes[volume].fileSystem);
        if (fs >= 7 && fs <= 23)
            return fs;
    }
    if (m_sniffed >= MaxSniffed)
        return UnknownKind;
    ++m_sniffed;
    return sniffFileSystem(m_storage, start, length);
}

void Scanner::wholeDevice(std::uint32_t kind, int volume)
{
    auto p = make(kind, 0, m_total, volume);
    CPartition *raw = p.get();
    m_r.partitions.push_back(std::move(p));
    announce(raw);
}

Result Scanner::run()
{
    m_r.partStyle = m_in.partStyle;
    if (m_in.partStyle == PartStyle::VirtualManager)
        return std::move(m_r);

    auto volumeKind = [this](int i) {
        const auto fs = static_cast<std::uint32_t>(m_in.volumes[i].fileSystem);
        return fs >= 7 && fs <= 23 ? fs : UnknownKind;
    };
    if (m_in.source == EnumSource::VolumeBacked && !m_in.ownSectors) {
        if (m_in.volumes.size() == 1)
            wholeDevice(volumeKind(0), 0);
        else
            message(QStringLiteral("Virtual device %1 have invalid count of mounted volumes").arg(name()));
        return std::move(m_r);
    }
    if (!m_in.ready) {
        if (m_in.volumes.size() >= 2)
            message(QStringLiteral("Device %1, having several volumes mounted, is not ready").arg(name()));
        else if (m_in.volumes.size() == 1)
            wholeDevice(volumeKind(0), 0);
        return std::move(m_r);
    }
    if (m_bps < 512 || m_bps > 65536 || (m_bps & (m_bps - 1)) != 0 || m_total == 0)
        return std::move(m_r);

    QByteArray sector0;
    if (!readSector(0, sector0))
        return std::move(m_r);

    // A device formatted as a whole (no table) is one volume.
    std::uint32_t fs =
        m_in.detectFileSystem
            ? m_in.detectFileSystem(reinterpret_cast<const std::uint8_t *>(sector0.constData()), m_bps)
            : bootSectorKind(sector0);
    if (fs >= 7 && fs <= 23) {
        m_r.partStyle = PartStyle::DeviceAsVolume;
        wholeDevice(fs, findVolume(0, m_total));
        return std::move(m_r);
    }

    if (!hasBootSignature(sector0)) {
        if (hasLvm2Label(m_storage))
            m_r.partStyle = PartStyle::Lvm;
        else if (hasZfsLabel(m_storage))
            m_r.partStyle = PartStyle::ZfsComponent;
        else if (m_r.partStyle == PartStyle::Mbr || m_r.partStyle == PartStyle::Gpt)
            m_r.partStyle = PartStyle::Raw;
        return std::move(m_r);
    }

    walkMbr(sector0);
    if (m_r.ldmSector != cStorage::NoSector)
        readLdm(m_r.partStyle == PartStyle::Gpt);
    // Boot-record LDM entries that no database replaced stay as they are.
    for (auto &[entry, volume] : m_ldmEntries) {
        auto p = make(kindOf(UnknownKind, volume, entry.start(), entry.count()), entry.start(), entry.count(),
                      volume);
        p->SetEntry(entry.raw.data());
        p->SetActive(entry.bootIndicator() & 0x80);
        CPartition *raw = p.get();
        m_r.partitions.push_back(std::move(p));
        announce(raw);
    }

    auto byStart = [](const std::unique_ptr<CPartition> &a, const std::unique_ptr<CPartition> &b) {
        return a->GetStart() < b->GetStart();
    };
    std::stable_sort(m_r.partitions.begin(), m_r.partitions.end(), byStart);
    for (CPartition *ext : m_extended) {
        std::stable_sort(ext->Children().begin(), ext->Children().end(), byStart);
        const std::uint64_t end = ext->GetLength() > m_total - std::min(ext->GetStart(), m_total)
                                      ? m_total
                                      : ext->GetStart() + ext->GetLength();
        addGaps(ext->Children(), ext->GetStart(), end, m_in.device, m_in.storage, ext);
    }
    addGaps(m_r.partitions, 0, m_total, m_in.device, m_in.storage, nullptr);
    return std::move(m_r);
}

void Scanner::addGaps(std::vector<std::unique_ptr<CPartition>> &list, std::uint64_t from, std::uint64_t to,
                      cDevice *device, cStorage *storage, CPartition *parent)
{
    std::vector<std::unique_ptr<CPartition>> out;
    out.reserve(list.size() * 2 + 1);
    std::uint64_t cursor = from;
    for (auto &p : list) {
        const std::uint64_t start = p->GetStart();
        if (start > cursor && start <= to)
            out.push_back(std::make_unique<CPartition>(device, storage, parent, 0, cursor, start - cursor));
        const std::uint64_t len = p->GetLength();
        const std::uint64_t end = len > to - std::min(start, to) ? to : start + len;
        cursor = std::max(cursor, end);
        out.push_back(std::move(p));
    }
    if (cursor < to)
        out.push_back(std::make_unique<CPartition>(device, storage, parent, 0, cursor, to - cursor));
    list = std::move(out);
}

void Scanner::walkMbr(const QByteArray &sector0)
{
    m_r.partStyle = PartStyle::Mbr;
    m_r.diskSignature = Mbr::parse(sector0).diskSignature;
    QByteArray sector = sector0;
    walkTable(sector, 0, nullptr);
    if (m_r.partStyle == PartStyle::Gpt)
        return;
    for (CPartition *ext : std::vector<CPartition *>(m_extended))
        walkChain(ext);
}

// One table: the entries sorted, checked and turned into partitions. Returns the link to the next
// extended boot record (inside an extended boot record), else null.
std::optional<Mbr::Entry> Scanner::walkTable(QByteArray &sector, std::uint64_t tableSector,
                                             CPartition *extended)
{
    Mbr::sortEntries(sector);
    const Mbr::Table table = Mbr::parse(sector);

    for (const Mbr::Entry &e : table.entries)
        if (!e.isValid())
            message(
                QStringLiteral("Invalid description for the partition in the partition table, sector %1 on a "
                               "device %2")
                    .arg(tableSector)
                    .arg(name()));

    if (tableSector == 0) {
        bool gpt = false;
        for (const Mbr::Entry &e : table.entries) {
            if (e.type() == Mbr::TypeGptProtective)
                gpt = true;
            if (e.type() == Mbr::TypeLdm && e.start() != 0 && m_r.ldmSector == cStorage::NoSector)
                m_r.ldmSector = m_total - 1;
        }
        if (gpt) {
            m_r.partStyle = PartStyle::Gpt;
            m_r.ldmSector = cStorage::NoSector;
            readGpt();
            return std::nullopt;
        }
    }

    bool big = false, overlap = false;
    for (int i = 0; i < Mbr::EntryCount; ++i) {
        const Mbr::Entry &e = table.entries[i];
        const std::uint64_t end = std::uint64_t(e.start()) + e.count();
        // A protective entry's count stops at 0xFFFFFFFF by definition; it is never too big.
        if (!big && e.type() != Mbr::TypeGptProtective && tableSector + end > 0xFFFFFFFFull) {
            big = true;
            message(QStringLiteral("Very big partition defined in sector %1 on a device %2")
                        .arg(tableSector)
                        .arg(name()));
        }
        const std::uint64_t limit = i + 1 < Mbr::EntryCount ? table.entries[i + 1].start()
                                    : extended              ? extended->GetLength()
                                                            : m_total;
        if (!overlap && end > limit && e.count() != 0) {
            overlap = true;
            message(QStringLiteral("Partition table in sector %1 on a device %2 has overlapped partitions")
                        .arg(tableSector)
                        .arg(name()));
        }
    }

    std::optional<Mbr::Entry> link;
    for (const Mbr::Entry &e : table.entries) {
        if (e.start() == 0)
            continue;
        const std::uint64_t start = tableSector + e.start();
        const int volume = findVolume(start, e.count());
        if (e.isExtended() && volume < 0) {
            if (!extended) {
                auto p = make(1, start, e.count(), -1);
                p->SetEntry(e.raw.data());
                p->SetActive(e.bootIndicator() & 0x80);
                CPartition *raw = p.get();
                m_r.partitions.push_back(std::move(p));
                m_extended.push_back(raw);
                announce(raw);
            } else if (!link) {
                link = e;
            }
            continue;
        }
        if (!extended && e.type() == Mbr::TypeLdm && volume < 0) {
            m_ldmEntries.push_back({e, volume});
            continue;
        }
        auto p = make(kindOf(kindOfMbrType(e.type()), volume, start, e.count()), start, e.count(), volume);
        p->SetEntry(e.raw.data());
        p->SetTableSector(tableSector);
        if (!extended) {
            p->SetActive(e.bootIndicator() & 0x80);
            CPartition *raw = p.get();
            m_r.partitions.push_back(std::move(p));
            announce(raw);
        } else {
            p->SetActive((e.bootIndicator() & 0x80) && extended->GetActive() ? 0x80 : 0);
            CPartition *raw = extended->AddChild(std::move(p));
            announce(raw);
        }
    }
    return link;
}

// The chain of extended boot records of one extended partition. Both kinds of link are relative to
// the extended partition's start. The chain stops at a record already visited.
void Scanner::walkChain(CPartition *extended)
{
    std::set<std::uint64_t> visited{0};
    std::uint64_t sector = extended->GetStart();
    std::uint64_t previous = 0;
    for (std::uint32_t records = 0;; ++records) {
        if (visited.count(sector) || records >= MaxChainRecords) {
            message(
                QStringLiteral("Invalid description for the partition in the partition table, sector %1 on a "
                               "device %2")
                    .arg(previous)
                    .arg(name()));
            return;
        }
        QByteArray table;
        if (!readSector(sector, table) || !hasBootSignature(table))
            return;
        visited.insert(sector);
        const std::optional<Mbr::Entry> link = walkTable(table, sector, extended);
        if (!link)
            return;
        previous = sector;
        sector = extended->GetStart() + link->start();
    }
}

void Scanner::readGpt()
{
    const Gpt::ReadResult g = Gpt::read(m_storage);
    const std::uint32_t headerCode = g.code & 0x7F;
    if (headerCode != 0)
        message(QStringLiteral("Error (%1) in GPT header on a device %2").arg(headerCode).arg(name()));
    if (!g.headerValid)
        return;
    const Gpt::Header &h = g.header;
    if (!g.backupValid)
        message(QStringLiteral("Copy of GPT header on a device %1 not found").arg(name()));
    if (!g.fromLastSector && h.thisSector == 1 && h.otherSector != m_total - 1)
        message(QStringLiteral("Copy of GPT header on a device %1 not in last sector").arg(name()));
    if (g.fromLastSector && h.otherSector != 1)
        message(QStringLiteral("GPT header on a device %1 not in first sector").arg(name()));
    if (!g.entriesFound)
        message(QStringLiteral("GPT entries on a device %1 not found").arg(name()));
    else if (g.backupArraySector == cStorage::NoSector)
        message(QStringLiteral("Copy of GPT entries on a device %1 not found").arg(name()));
    if (g.code & Gpt::EntriesInconsistent)
        message(QStringLiteral("GPT on a device %1 has overlapped partitions").arg(name()));

    for (const Gpt::Entry &e : g.entries) {
        if (!e.used())
            continue;
        if (e.first > e.last || e.last >= m_total) {
            message(QStringLiteral("Invalid partition definition in GPT on device %1").arg(name()));
            continue;
        }
        const std::uint64_t length = e.last - e.first + 1;
        std::uint32_t kind = Gpt::kindOfType(e.typeGuid);
        if (kind == 2) {
            if (m_gptMetadata) {
                message(QStringLiteral("Duplicate MetaData definition in GPT on device %1").arg(name()));
                continue;
            }
            m_gptMetadata = Ldm::Area{e.first, length};
            m_r.ldmSector = e.last;
        } else if (kind == 3) {
            if (m_gptData) {
                message(QStringLiteral("Duplicate Data definition in GPT on device %1").arg(name()));
                continue;
            }
            m_gptData = Ldm::Area{e.first, length};
        }
        const int volume = findVolume(e.first, length);
        auto p = make(kindOf(kind, volume, e.first, length), e.first, length, volume);
        CPartition::GptFields f;
        f.typeGuid = e.typeGuid;
        f.uniqueGuid = e.uniqueGuid;
        f.attributes = e.attributes;
        f.name = e.name;
        p->SetGpt(f);
        CPartition *raw = p.get();
        m_r.partitions.push_back(std::move(p));
        announce(raw);
    }
}

void Scanner::readLdm(bool gpt)
{
    const Ldm::ReadResult l =
        Ldm::read(m_storage, m_r.ldmSector, gpt ? m_gptMetadata : std::nullopt,
                  gpt ? m_gptData : std::nullopt, name(), [this](const QString &t) { message(t); });
    if (gpt || !l.found || !l.areasValid)
        return;
    // On a boot-record disk the database's areas replace the LDM entry.
    m_ldmEntries.clear();
    for (const auto &[area, kind] : {std::pair{l.metadata, 2u}, std::pair{l.data, 3u}}) {
        auto p = make(kind, area.start, area.length, findVolume(area.start, area.length));
        CPartition *raw = p.get();
        m_r.partitions.push_back(std::move(p));
        announce(raw);
    }
}

} // namespace

Result Scan(const Input &input)
{
    if (!input.storage) {
        Result r;
        r.partStyle = input.partStyle;
        return r;
    }
    Scanner s(input);
    return s.run();
}

} // namespace PartScan
