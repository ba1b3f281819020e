// The partition scan over a device whose first and last megabyte are arbitrary bytes: no read
// outside the device, no unbounded allocation or loop.
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <zlib.h>

#include <QByteArray>

#include "Kernel/Implementation/Partitions/PartScan.h"
#include "Kernel/Implementation/Partitions/PartScanMemory.h"

namespace {

std::uint64_t le(const char *p, int bytes)
{
    std::uint64_t v = 0;
    for (int i = bytes - 1; i >= 0; --i)
        v = v << 8 | std::uint8_t(p[i]);
    return v;
}

void putLe32(char *p, std::uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        p[i] = char(std::uint8_t(v >> (8 * i)));
}

// The device's head and tail as the memory storage holds them.
struct Disk
{
    QByteArray &head, &tail;
    std::uint64_t bytes;

    // The held bytes [offset, offset + length) of the device; null where they are not held.
    char *At(std::uint64_t offset, std::uint64_t length)
    {
        if (offset > bytes || length > bytes - offset)
            return nullptr;
        if (length <= std::uint64_t(head.size()) && offset <= std::uint64_t(head.size()) - length)
            return head.data() + offset;
        const std::uint64_t tailStart = bytes - std::min<std::uint64_t>(bytes, std::uint64_t(tail.size()));
        if (offset >= tailStart && bytes - tailStart == std::uint64_t(tail.size()))
            return tail.data() + (offset - tailStart);
        return nullptr;
    }
};

// Makes the CRC32s of the GPT header at `sector` right again after mutation: the entry array's,
// then the header's, so that the entries behind them are reached.
void RepairGpt(Disk &disk, std::uint64_t sector, std::uint32_t bps)
{
    if (sector > disk.bytes / bps)
        return;
    char *h = disk.At(sector * bps, bps);
    if (!h)
        return;
    const std::uint32_t headerSize = std::uint32_t(le(h + 12, 4));
    if (headerSize < 92 || headerSize > bps)
        return;
    const std::uint64_t arraySector = le(h + 72, 8);
    const std::uint64_t arrayBytes = le(h + 80, 4) * le(h + 84, 4);
    if (arraySector < disk.bytes / bps && arrayBytes <= (1u << 20)) {
        if (const char *array = disk.At(arraySector * bps, arrayBytes))
            putLe32(h + 88,
                    std::uint32_t(crc32(0, reinterpret_cast<const Bytef *>(array), uInt(arrayBytes))));
    }
    putLe32(h + 16, 0);
    putLe32(h + 16, std::uint32_t(crc32(0, reinterpret_cast<const Bytef *>(h), headerSize)));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 10)
        return 0;
    // Bytes 0..7: the device's sector count (bounded to 2^40); byte 8: sector size (bit 0: 512 or
    // 4096) and whether the GPT checksums are repaired (bit 1); byte 9: the split between head and
    // tail. The rest fills the first and last megabyte.
    uint64_t total = 0;
    for (int i = 0; i < 8; ++i)
        total = total << 8 | data[i];
    total &= (uint64_t(1) << 40) - 1;
    const uint32_t bps = (data[8] & 1) ? 4096 : 512;
    const size_t rest = size - 10;
    const size_t split = rest * data[9] / 255;
    const auto *body = reinterpret_cast<const char *>(data + 10);
    QByteArray head(body, qsizetype(split < (1u << 20) ? split : (1u << 20)));
    QByteArray tail(body + split, qsizetype(rest - split < (1u << 20) ? rest - split : (1u << 20)));
    if (data[8] & 2) {
        // The primary header at sector 1, the backup at the last sector.
        Disk disk{head, tail, total * bps};
        RepairGpt(disk, 1, bps);
        if (total > 1)
            RepairGpt(disk, total - 1, bps);
    }
    PartScan::MemoryStorage storage(bps, total, head, tail);
    PartScan::Input in;
    in.storage = &storage;
    in.deviceName = QStringLiteral("fuzz");
    int messages = 0;
    in.message = [&messages](const QString &) { ++messages; };
    PartScan::Result r = PartScan::Scan(in);
    (void)r;
    return 0;
}
