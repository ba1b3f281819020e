#include "hexeditor/templates/core/GptBuilder.h"

#include <QCoreApplication>

#include "Kernel/Implementation/Partitions/GptReader.h"
#include "Kernel/Implementation/Report/HardwareInfo.h"
#include "hexeditor/templates/core/Record.h"
#include "hexeditor/templates/core/SizeMath.h"
#include "hexeditor/templates/core/Source.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("HexEditor::Templates::GptModel", text);
}

struct TypeRow
{
    const char *guid;
    const char *name;
};

// Searched in order; the first matching GUID wins.
const TypeRow TypeRows[] = {
    {"024DEE41-33E7-11D3-9D69-0008C781F39F", "MBR partition scheme"},
    {"C12A7328-F81F-11D2-BA4B-00A0C93EC93B", "EFI System Partition"},
    {"21686148-6449-6E6F-744E-656564454649", "BIOS Boot Partition"},
    {"E3C9E316-0B5C-4DB8-817D-F92DF00215AE", "Microsoft Reserved Partition"},
    {"EBD0A0A2-B9E5-4433-87C0-68B6B72699C7", "Basic Data Partition"},
    {"5808C8AA-7E8F-42E0-85D2-E1E90434CFB3", "Logical Disk Manager metadata partition"},
    {"AF9B60A0-1431-4F62-BC68-3311714A69AD", "Logical Disk Manager data partition"},
    {"DE94BBA4-06D1-4D40-A16A-BFD50179D6AC", "Windows Recovery Environment"},
    {"37AFFC90-EF7D-4E96-91C3-2D7AE055B174", "IBM General Parallel File System (GPFS) partition"},
    {"75894C1E-3AEB-11D3-B7C1-7B03A0000000", "HP-UX Data partition"},
    {"E2A1E728-32E3-11D6-A682-7B03A0000000", "HP-UX Service Partition"},
    {"EBD0A0A2-B9E5-4433-87C0-68B6B72699C7", "Linux Data partition"},
    {"A19D880F-05FC-4D3B-A006-743F0F84911E", "Linux RAID partition"},
    {"0657FD6D-A4AB-43C4-84E5-0933C84B4F4F", "Linux Swap partition"},
    {"E6D6D379-F507-44C2-A23C-238F2A3DF928", "Linux Logical Volume Manager partition"},
    {"8DA63339-0007-60C0-C436-083AC8230908", "Linux Reserved partition"},
    {"83BD6B9D-7F41-11DC-BE0B-001560B84F0F", "FreeBSD Boot partition"},
    {"516E7CB4-6ECF-11D6-8FF8-00022D09712B", "FreeBSD Data partition"},
    {"516E7CB5-6ECF-11D6-8FF8-00022D09712B", "FreeBSD Swap partition"},
    {"516E7CB6-6ECF-11D6-8FF8-00022D09712B", "FreeBSD Unix File System (UFS) partition"},
    {"516E7CB8-6ECF-11D6-8FF8-00022D09712B", "FreeBSD Vinum volume manager partition"},
    {"516E7CBA-6ECF-11D6-8FF8-00022D09712B", "FreeBSD ZFS partition"},
    {"48465300-0000-11AA-AA11-00306543ECAC", "HFS+ partition"},
    {"55465300-0000-11AA-AA11-00306543ECAC", "Apple UFS"},
    {"6A898CC3-1DD2-11B2-99A6-080020736631", "ZFS"},
    {"52414944-0000-11AA-AA11-00306543ECAC", "Apple RAID partition"},
    {"52414944-5F4F-11AA-AA11-00306543ECAC", "Apple RAID partition, off-line"},
    {"426F6F74-0000-11AA-AA11-00306543ECAC", "Apple Boot partition"},
    {"4C616265-6C00-11AA-AA11-00306543ECAC", "Apple Label"},
    {"5265636F-7665-11AA-AA11-00306543ECAC", "Apple TV Recovery partition"},
    {"6A82CB45-1DD2-11B2-99A6-080020736631", "Solaris Boot partition"},
    {"6A85CF4D-1DD2-11B2-99A6-080020736631", "Solaris Root partition"},
    {"6A87C46F-1DD2-11B2-99A6-080020736631", "Solaris Swap partition"},
    {"6A8B642B-1DD2-11B2-99A6-080020736631", "Solaris Backup partition"},
    {"6A898CC3-1DD2-11B2-99A6-080020736631", "Solaris /usr partition"},
    {"6A8EF2E9-1DD2-11B2-99A6-080020736631", "Solaris /var partition"},
    {"6A90BA39-1DD2-11B2-99A6-080020736631", "Solaris /var partition"},
    {"6A9283A5-1DD2-11B2-99A6-080020736631", "Solaris Alternate sector"},
    {"6A945A3B-1DD2-11B2-99A6-080020736631", "Solaris Reserved partition"},
    {"6A9630D1-1DD2-11B2-99A6-080020736631", "Solaris Reserved partition"},
    {"6A980767-1DD2-11B2-99A6-080020736631", "Solaris Reserved partition"},
    {"6A96237F-1DD2-11B2-99A6-080020736631", "Solaris Reserved partition"},
    {"6A8D2AC7-1DD2-11B2-99A6-080020736631", "Solaris Reserved partition"},
    {"49F48D32-B10E-11DC-B99B-0019D1879648", "NetBSD Swap partition"},
    {"49F48D5A-B10E-11DC-B99B-0019D1879648", "NetBSD FFS partition"},
    {"49F48D82-B10E-11DC-B99B-0019D1879648", "NetBSD LFS partition"},
    {"49F48DAA-B10E-11DC-B99B-0019D1879648", "NetBSD RAID partition"},
    {"2DB519C4-B10F-11DC-B99B-0019D1879648", "NetBSD concatenated partition"},
    {"2DB519EC-B10F-11DC-B99B-0019D1879648", "NetBSD encrypted partition"},
};

QByteArray guidBytes(const char *text)
{
    const Gpt::Guid g = Gpt::guidFromText(QLatin1String(text));
    return QByteArray(reinterpret_cast<const char *>(g.data()), qsizetype(g.size()));
}

std::uint64_t lbaTarget(const QByteArray &b, std::uint32_t offset, std::uint32_t bps)
{
    std::uint64_t v = 0;
    if (!Values::readUnsigned(b, offset, 8, false, v))
        return SizeMath::None;
    return SizeMath::mul(v, bps);
}

} // namespace

std::uint32_t GptBuilder::recordSize(Source &source) const
{
    const std::uint32_t bps = source.sectorSize();
    if (bps < 512 || bps > 65536)
        return 0;
    const std::uint32_t arrayBytes = EntryCount * EntrySize;
    return bps + (arrayBytes + bps - 1) / bps * bps;
}

QString GptBuilder::typeName(const QByteArray &guid)
{
    static const QList<QPair<QByteArray, const char *>> table = [] {
        QList<QPair<QByteArray, const char *>> t;
        for (const TypeRow &row : TypeRows)
            t.append({guidBytes(row.guid), row.name});
        return t;
    }();
    for (const auto &row : table)
        if (row.first == guid)
            return tr(row.second);
    return {};
}

void GptBuilder::build(Record &r)
{
    const QByteArray &b = r.buffer(false);
    const std::uint32_t bps = r.source()->sectorSize();
    Node *h = r.add(nullptr, tr("GPT Header"), Group, 0, bps);
    r.add(h, tr("Signature (EFI PART)"), HexBytes, 0, 8);
    r.add(h, tr("Revision"), HexBytes, 8, 4);
    r.add(h, tr("Header size"), UInt32, 12, 4);
    r.add(h, tr("Header CRC"), HexBytes, 16, 4);
    r.add(h, tr("(reserved)"), HexBytes, 20, 4);
    auto lbaLink = [&](const char *name, std::uint32_t offset, Type kind) {
        const std::uint64_t t = lbaTarget(b, offset, bps);
        r.addLink(h, tr(name), UInt64, offset, 8, t, t, kind);
    };
    lbaLink("Current LBA", 24, GuidPartitionTable);
    lbaLink("Backup LBA", 32, None);
    lbaLink("First usable LBA", 40, None);
    lbaLink("Last usable LBA", 48, None);
    r.add(h, tr("Disk GUID"), HexBytes, 56, 16);
    lbaLink("Starting LBA of entries", 72, None);
    r.add(h, tr("Number of entries"), UInt32, 80, 4);
    r.add(h, tr("Entry size"), UInt32, 84, 4);
    r.add(h, tr("CRC of partition array"), HexBytes, 88, 4);
    r.add(h, tr("(reserved)"), HexBytes, 92, bps - 92);

    for (std::uint32_t n = 1; n <= EntryCount; ++n) {
        const std::uint32_t e = bps + EntrySize * (n - 1);
        const QByteArray typeGuid = Values::inside(b, e, 16) ? b.mid(e, 16) : QByteArray();
        std::uint64_t first = 0, last = 0;
        const bool have = Values::readUnsigned(b, e + 32, 8, false, first) &&
                          Values::readUnsigned(b, e + 40, 8, false, last);
        const bool unused = !have || typeGuid.count('\0') == 16 || (first == 0 && last == 0);
        QString name = tr("Entry %1").arg(n);
        if (unused) {
            name += tr(" (unused)");
        } else {
            const std::uint64_t sectors = last >= first ? SizeMath::add(last - first, 1) : 0;
            name += tr(" (%1)").arg(HardwareInfo::SizeText(SizeMath::mul(sectors, bps)));
            r.expand(int(n), 0);
        }
        Node *g = r.add(nullptr, name, Group, e, EntrySize);
        const QString known = typeName(typeGuid);
        if (known.isEmpty())
            r.add(g, tr("Partition type GUID"), HexBytes, e, 16);
        else
            r.addText(g, tr("Partition type GUID"), Text, e, 16, known);
        r.add(g, tr("Unique partition GUID"), HexBytes, e + 16, 16);
        const std::uint64_t firstTarget = lbaTarget(b, e + 32, bps);
        const std::uint64_t lastTarget = lbaTarget(b, e + 40, bps);
        r.addLink(g, tr("First LBA"), UInt64, e + 32, 8, firstTarget, firstTarget);
        r.addLink(g, tr("Last LBA"), UInt64, e + 40, 8, lastTarget, lastTarget);
        r.add(g, tr("Attribute flags"), HexBytes, e + 48, 8);
        r.add(g, tr("Partition name"), Utf16Fixed, e + 56, 72);
    }
}

} // namespace HexEditor::Templates
