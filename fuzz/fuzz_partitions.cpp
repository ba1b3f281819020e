// The partition scan over a device whose first and last megabyte are arbitrary bytes: no read
// outside the device, no unbounded allocation or loop.
#include <cstddef>
#include <cstdint>

#include <QByteArray>

#include "Kernel/Implementation/Partitions/PartScan.h"
#include "Kernel/Implementation/Partitions/PartScanMemory.h"

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 10)
        return 0;
    // Bytes 0..7: the device's sector count (bounded to 2^40); byte 8: sector size (512 or 4096);
    // byte 9: the split between head and tail. The rest fills the first and last megabyte.
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
