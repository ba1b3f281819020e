// Own-format headers, string blocks, group tables, group records and zlib blocks from arbitrary
// bytes: reads and a full verification stay inside the input and end.
#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>
#include <zlib.h>

#include "Kernel/Implementation/Images/ImageHandleTarvo.h"
#include "Kernel/Implementation/Images/ImageMemorySource.h"
#include "Kernel/Implementation/Images/TarvoFormat.h"

namespace {

std::uint64_t le(const std::uint8_t *p, int bytes)
{
    std::uint64_t v = 0;
    for (int i = bytes - 1; i >= 0; --i)
        v = v << 8 | p[i];
    return v;
}

void putLe32(std::uint8_t *p, std::uint32_t v)
{
    for (int i = 0; i < 4; ++i)
        p[i] = std::uint8_t(v >> (8 * i));
}

std::uint32_t Adler(std::uint32_t start, const std::uint8_t *data, std::size_t size)
{
    return std::uint32_t(adler32(start, data, uInt(size)));
}

// Inflates [at, at + length) of the image into out (at most `limit` bytes); false when the bytes
// lie outside the image or are no zlib stream.
bool Inflate(const std::uint8_t *image, std::size_t size, std::uint64_t at, std::uint64_t length,
             std::size_t limit, std::vector<std::uint8_t> &out)
{
    if (at > size || length > size - at || length > (1u << 24))
        return false;
    out.resize(limit);
    uLongf produced = uLongf(limit);
    uLong used = uLong(length);
    if (uncompress2(out.data(), &produced, image + at, &used) != Z_OK)
        return false;
    out.resize(produced);
    return true;
}

// Makes the Adler-32s right again after mutation: each group record's sum of its inflated index,
// the running sum of all inflated blocks in the trailer's high half and the header's sum in its
// low half, so that the groups and blocks behind them are reached.
void Repair(std::uint8_t *image, std::size_t size)
{
    if (size < Tarvo::HeaderSize + Tarvo::TrailerSize + 16)
        return;
    Tarvo::Header h;
    QString problem;
    std::uint8_t *trailer = image + size - Tarvo::TrailerSize;
    std::uint32_t dataAdler = std::uint32_t(le(trailer + 4, 4));
    if (Tarvo::ParseHeader(image, h, problem) && h.Groups() <= 64) {
        const std::uint64_t room = size - Tarvo::TrailerSize;
        const std::uint64_t tableStart = room - std::min<std::uint64_t>(room, h.Groups() * 8);
        const std::uint64_t blockSize = h.BlockSize();
        const std::size_t limit = std::size_t(std::min<std::uint64_t>(blockSize, 1u << 20));
        std::uint32_t adler = 1;
        bool whole = true;
        std::vector<std::uint8_t> index, block;
        for (std::uint64_t g = 0; g < h.Groups() && whole; ++g) {
            const std::uint64_t record = le(image + tableStart + g * 8, 8);
            if (record > tableStart || tableStart - record < 8) {
                whole = false;
                break;
            }
            const std::uint64_t length = le(image + record, 4);
            if (!Inflate(image, size, record + 8, length, limit, index)) {
                whole = false;
                break;
            }
            putLe32(image + record + 4, Adler(1, index.data(), index.size()));
            // The blocks of the group lie between the offsets of the index, the last before the
            // record.
            const std::size_t count = index.size() / 8;
            for (std::size_t i = 0; i < count && i < 256; ++i) {
                const std::uint64_t at = le(index.data() + i * 8, 8);
                const std::uint64_t end = i + 1 < count ? le(index.data() + (i + 1) * 8, 8) : record;
                if (end < at || !Inflate(image, size, at, end - at, limit, block)) {
                    whole = false;
                    break;
                }
                adler = Adler(adler, block.data(), block.size());
            }
        }
        if (whole)
            dataAdler = adler;
    }
    putLe32(trailer + 4, dataAdler);
    std::uint8_t header[Tarvo::HeaderSize];
    std::memcpy(header, image, sizeof header);
    putLe32(header + 68, dataAdler);
    putLe32(trailer, Adler(1, header, sizeof header));
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size)
{
    if (size < 1)
        return 0;
    // Byte 0, bit 0: repair the checksums, so that half of the inputs reach the groups and blocks
    // and half still meet the checks. The rest is the image.
    QByteArray bytes(reinterpret_cast<const char *>(data + 1), qsizetype(size - 1));
    if (data[0] & 1)
        Repair(reinterpret_cast<std::uint8_t *>(bytes.data()), std::size_t(bytes.size()));
    CImageMemorySource source(bytes);
    CImageHandle_Tarvo handle(nullptr, &source, QStringLiteral("fuzz.tdi"));
    if (!handle.IsValid())
        return 0;
    const uint64_t total = handle.GetTotalSectors();
    std::vector<uint8_t> buffer(size_t(32) << handle.GetSectorShift());
    for (uint64_t i = 0; i < 8; ++i) {
        uint64_t first = total / 8 * i;
        uint32_t count = uint32_t(std::min<uint64_t>(32, total - first));
        uint32_t error = 0;
        handle.ReadWrite(true, first, count, buffer.data(), error);
    }
    QString problem;
    handle.Verify({}, problem);
    return 0;
}
