// Dynamic disks of one logical-disk-manager disk group, built sector by sector for the scripted
// back end: a boot record with one 0x42 entry, the private header in the last sector, the table of
// contents and a database holding two disks and a spanned volume of 100 sectors on each.
#pragma once

#include <QByteArray>
#include <QList>
#include <QPair>

#include <cstdint>

#include "Kernel/Implementation/Partitions/LdmReader.h"
#include "tests/common/RootTestSupport.h"
#include "tests/kernel/Raid/RaidTestStorage.h"

namespace LdmTestDisks {

inline constexpr std::uint64_t Total = 16384;
inline constexpr std::uint64_t ConfigStart = Total - 2048;
inline constexpr std::uint64_t DataStart = 63;
inline const char *GroupGuid = "1a2b3c4d-1111-2222-3333-444455556666";
inline const char *GroupName = "Dsk1Dg0";

inline void Be(QByteArray &b, int offset, std::uint64_t v, int bytes)
{
    for (int i = bytes - 1; i >= 0; --i, v >>= 8)
        b[offset + i] = char(v & 0xFF);
}

inline QByteArray Num(std::uint64_t v)
{
    QByteArray digits;
    while (v) {
        digits.prepend(char(v & 0xFF));
        v >>= 8;
    }
    return char(digits.size()) + digits;
}

inline QByteArray Txt(const QByteArray &t)
{
    return char(t.size()) + t;
}

inline QByteArray Be64(std::uint64_t v)
{
    QByteArray b(8, '\0');
    Be(b, 0, v, 8);
    return b;
}

// One database record of one fragment in slot SLOT: header, type, body.
inline QByteArray Vblk(std::uint32_t slot, std::uint32_t group, std::uint8_t type, const QByteArray &body,
                       std::uint8_t flags = 0)
{
    QByteArray r(128, '\0');
    r.replace(0, 4, "VBLK");
    Be(r, 4, slot, 4);
    Be(r, 8, group, 4);
    Be(r, 14, 1, 2);
    r[0x12] = char(flags);
    r[0x13] = char(type);
    Be(r, 0x14, std::uint32_t(body.size()), 4);
    r.replace(0x18, body.size(), body);
    return r;
}

// The database's header sector and RECORDS after it; the last sequence number is the last slot
// unless LAST_SEQUENCE says otherwise.
inline QByteArray Vmdb(const QList<QByteArray> &records, std::uint32_t lastSequence = 0)
{
    QByteArray db(512, '\0');
    db.replace(0, 4, "VMDB");
    Be(db, 4, lastSequence ? lastSequence : 4 + std::uint32_t(records.size()), 4);
    Be(db, 8, 128, 4);
    Be(db, 12, 512, 4);
    Be(db, 0x10, 1, 2);
    Be(db, 0x12, 4, 2);
    Be(db, 0x14, 10, 2);
    db.replace(0x16, 7, GroupName);
    db.replace(0x35, 36, GroupGuid);
    for (const QByteArray &r : records)
        db += r;
    return db;
}

// The private header of a disk of the group whose data area starts at DataStart and whose
// configuration area starts at CONFIG_START (2048 sectors long), sealed with its checksum.
inline QByteArray PrivHead(const QByteArray &diskGuid, std::uint64_t configStart)
{
    QByteArray ph(512, '\0');
    ph.replace(0, 8, "PRIVHEAD");
    Be(ph, 12, 2, 2);
    Be(ph, 14, 12, 2);
    ph.replace(0x30, 36, diskGuid);
    ph.replace(0xB0, 36, GroupGuid);
    ph.replace(0xF0, 7, GroupName);
    Be(ph, 0x11B, DataStart, 8);
    Be(ph, 0x123, configStart - DataStart, 8);
    Be(ph, 0x12B, configStart, 8);
    Be(ph, 0x133, 2048, 8);
    Be(ph, 8, Ldm::checksum(ph, Ldm::PrivHeadBytes), 4);
    return ph;
}

// The table of contents (the sector after the configuration area's start): the database 17
// sectors in, the log at 1100, sealed with its checksum.
inline QByteArray TocBlock()
{
    QByteArray toc(512, '\0');
    toc.replace(0, 8, "TOCBLOCK");
    toc.replace(0x24, 6, "config");
    Be(toc, 0x2E, 17, 8);
    Be(toc, 0x36, 1000, 8);
    toc.replace(0x46, 3, "log");
    Be(toc, 0x50, 1100, 8);
    Be(toc, 0x58, 200, 8);
    Be(toc, 8, Ldm::checksum(toc, Ldm::TocBlockBytes), 4);
    return toc;
}

inline QByteArray DiskGuid(int n)
{
    return QByteArray("9f8e7d6c-aaaa-bbbb-cccc-ddddeeeeff0") + QByteArray::number(n);
}

// The database every disk of the group carries: group, two disks, a spanned volume of 100 sectors
// on each disk.
inline QByteArray Database()
{
    QList<QByteArray> bodies{
        Num(0x101) + Txt(GroupName) + Txt(GroupGuid),
        Num(0x102) + Txt("Disk1") + Txt(DiskGuid(1)),
        Num(0x103) + Txt("Disk2") + Txt(DiskGuid(2)),
        Num(0x104) + Txt("Volume1") + Txt("gen") + Txt("") + Txt("ACTIVE"),
        Num(0x105) + Txt("Volume1-01") + Txt("ACTIVE") + char(2) + QByteArray(4, '\0') + Num(2) +
            QByteArray(16, '\0') + Num(0x104) + QByteArray(1, '\0'),
    };
    for (int disk = 0; disk < 2; ++disk)
        bodies << Num(0x106 + disk) + Txt("Disk-01") + QByteArray(12, '\0') + Be64(0) + Be64(100 * disk) +
                      Num(100) + Num(0x105) + Num(0x102 + disk);
    const std::uint8_t types[] = {0x35, 0x34, 0x34, 0x51, 0x32, 0x33, 0x33};
    QList<QByteArray> records;
    for (int i = 0; i < bodies.size(); ++i)
        records << Vblk(4 + i, i + 1, types[i], bodies[i]);
    return Vmdb(records);
}

inline QByteArray DynamicDisk(int n)
{
    QByteArray d = RootTest::Disk(Total * 512, true);
    auto put = [&](std::uint64_t sector, const QByteArray &bytes) {
        d.replace(qsizetype(sector * 512), bytes.size(), bytes);
    };
    QByteArray mbr(16, '\0');
    mbr[4] = char(0x42);
    Be(mbr, 8, 0, 4);
    for (int i = 0; i < 4; ++i)
        mbr[8 + i] = char((DataStart >> (8 * i)) & 0xFF),
                mbr[12 + i] = char(((Total - DataStart) >> (8 * i)) & 0xFF);
    put(0, QByteArray(d.mid(0, 446)) + mbr + QByteArray(48, '\0') + QByteArray("\x55\xAA", 2));

    put(Total - 1, PrivHead(DiskGuid(n), ConfigStart));
    put(ConfigStart + 1, TocBlock());
    put(ConfigStart + 17, Database());

    // Volume sectors: disk 1 holds 0..99, disk 2 holds 100..199, from the data area's start.
    for (std::uint64_t s = 0; s < 100; ++s) {
        QByteArray sector(512, '\0');
        RaidTest::FillSector(reinterpret_cast<std::uint8_t *>(sector.data()), s + 100 * (n - 1));
        put(DataStart + s, sector);
    }
    return d;
}

} // namespace LdmTestDisks
