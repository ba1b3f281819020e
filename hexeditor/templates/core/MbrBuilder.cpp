#include "hexeditor/templates/core/MbrBuilder.h"

#include <QCoreApplication>

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Partitions/MbrTable.h"
#include "Kernel/Implementation/Partitions/PartScanKinds.h"
#include "Kernel/Implementation/Report/HardwareInfo.h"
#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/Record.h"
#include "hexeditor/templates/core/SizeMath.h"
#include "hexeditor/templates/core/Source.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("HexEditor::Templates::MbrModel", text);
}

// What the type byte alone says when the partition's contents tell nothing.
std::uint32_t kindOfTypeByte(std::uint8_t type)
{
    switch (type) {
    case 0x01:
    case 0x04:
    case 0x06:
    case 0x0E:
    case 0x11:
    case 0x14:
    case 0x16:
    case 0x1E:
        return 7;
    case 0x0B:
    case 0x0C:
    case 0x1B:
    case 0x1C:
        return 8;
    case 0x07:
    case 0x17:
        return 10;
    case Mbr::TypeLdm:
        return 2;
    case 0xAF:
        return 13;
    default:
        return PartScan::kindOfMbrType(type);
    }
}

// Enough of a partition's start for the superblocks that lie furthest in (BtrFS at 64 KiB).
constexpr std::uint32_t SniffBytes = 68 * 1024;

} // namespace

std::uint32_t MbrBuilder::entryKind(Source &source, std::uint8_t type, std::uint64_t start,
                                    std::uint64_t count)
{
    if (type == 0)
        return 0;
    if (type == Mbr::TypeExtendedChs || type == Mbr::TypeExtendedLba || type == 0x85)
        return 1;
    const std::uint32_t bps = source.sectorSize();
    const std::uint64_t begin = SizeMath::mul(start, bps);
    const std::uint64_t length = SizeMath::mul(count, bps);
    const std::uint64_t total = source.size();
    if (bps != 0 && start != 0 && begin < total) {
        const std::uint64_t want = std::min<std::uint64_t>({SniffBytes, length, total - begin});
        if (want >= 512) {
            const QByteArray head = source.read(begin, std::uint32_t(want));
            const std::uint32_t found = PartScan::bootSectorKind(head);
            if (found != 0xFFFFFFFF)
                return found;
        }
    }
    return kindOfTypeByte(type);
}

void MbrBuilder::build(Record &r)
{
    const QByteArray &b = r.buffer(false);
    const std::uint32_t bps = r.source()->sectorSize();
    r.add(nullptr, tr("Bootstrap code"), HexBytes, 0, 440);
    r.add(nullptr, tr("Disk serial number"), HexBytes, 440, 4);
    r.add(nullptr, tr("(reserved)"), HexBytes, 444, 2);
    for (int n = 1; n <= 4; ++n) {
        const std::uint32_t e = 446 + 16 * std::uint32_t(n - 1);
        std::uint64_t start = 0, count = 0, type = 0;
        const bool have = Values::readUnsigned(b, e + 4, 1, false, type) &&
                          Values::readUnsigned(b, e + 8, 4, false, start) &&
                          Values::readUnsigned(b, e + 12, 4, false, count);
        // The partitions' contents are looked at only behind a boot record signature.
        const bool signed55AA =
            b.size() >= 512 && std::uint8_t(b[510]) == 0x55 && std::uint8_t(b[511]) == 0xAA;
        std::uint32_t kind = 0;
        if (have)
            kind = signed55AA ? entryKind(*r.source(), std::uint8_t(type), start, count)
                              : entryKind(*r.source(), std::uint8_t(type), 0, count);
        QString name;
        if (kind == 0) {
            name = tr("Partition %1 (Unused)").arg(n);
        } else {
            name = tr("Partition %1 (%2, %3)")
                       .arg(n)
                       .arg(FileSystemKindName(kind), HardwareInfo::SizeText(SizeMath::mul(count, bps)));
            r.expand(n + 2, 0);
        }
        Node *g = r.add(nullptr, name, Group, e, 16);
        r.add(g, tr("Active partition flag (80 = active)"), HexBytes, e, 1);
        r.add(g, tr("Start head"), UInt8, e + 1, 1);
        r.add(g, tr("Start sector (bits 0-5), cylinder (bits 6-7)"), HexBytes, e + 2, 1);
        r.add(g, tr("Start cylinder (lower 8 bits)"), HexBytes, e + 3, 1);
        r.add(g, tr("File system ID"), HexBytes, e + 4, 1);
        r.add(g, tr("End head"), UInt8, e + 5, 1);
        r.add(g, tr("End sector (bits 0-5), cylinder (bits 6-7)"), HexBytes, e + 6, 1);
        r.add(g, tr("End cylinder (lower 8 bits)"), HexBytes, e + 7, 1);
        const std::uint64_t target = have ? SizeMath::mul(start, bps) : SizeMath::None;
        // The protective entry of a GUID partition table points at the table's header.
        const Type linked =
            type == Mbr::TypeGptProtective ? GuidPartitionTable : kindOfFileSystem(kind, false);
        r.addLink(g, tr("First sector"), UInt32, e + 8, 4, target, target, linked);
        r.add(g, tr("Total sectors"), UInt32, e + 12, 4);
    }
    r.add(nullptr, tr("Signature (55 AA)"), HexBytes, 510, 2);
}

} // namespace HexEditor::Templates
