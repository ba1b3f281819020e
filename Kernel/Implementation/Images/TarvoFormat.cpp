#include "Kernel/Implementation/Images/TarvoFormat.h"

#include "Kernel/Implementation/Images/ImageBytes.h"

#include <cstring>
#include <zlib.h>

using namespace ImageBytes;

namespace Tarvo {

namespace {
const char *const MediaCodes[4] = {"FLP", "FIX", "REM", "CDR"};
}

std::uint32_t MediaTypeFromCode(const std::uint8_t *code)
{
    for (int i = 0; i < 4; ++i)
        if (std::memcmp(code, MediaCodes[i], 3) == 0)
            return std::uint32_t(i + 1);
    return 0;
}

std::uint32_t Adler(std::uint32_t start, const void *data, std::size_t size)
{
    const auto *p = static_cast<const Bytef *>(data);
    uLong sum = start;
    while (size > 0) {
        uInt n = size > 0x40000000u ? 0x40000000u : uInt(size);
        sum = adler32(sum, p, n);
        p += n;
        size -= n;
    }
    return std::uint32_t(sum);
}

bool ParseHeader(const std::uint8_t *b, Header &h, QString &problem)
{
    if (le64(b) != Magic) {
        problem = QStringLiteral("not a Tarvo disk image (magic)");
        return false;
    }
    if (b[126] != 0x55 || b[127] != 0xAA) {
        problem = QStringLiteral("header signature 0x55 0xAA is missing");
        return false;
    }
    h.firstSector = le64(b + 8);
    h.totalSectors = le64(b + 16);
    h.lengths[0] = le32(b + 24);
    h.sectorShift = b[28];
    h.mediaType = MediaTypeFromCode(b + 29);
    h.sectorsPerTrack = le32(b + 32);
    h.tracksPerCylinder = le32(b + 36);
    h.lengths[1] = le32(b + 40);
    h.lengths[2] = le32(b + 44);
    h.lengths[3] = le32(b + 48);
    h.version = QByteArray(reinterpret_cast<const char *>(b + 52), 8);
    int zero = h.version.indexOf('\0');
    if (zero >= 0)
        h.version.truncate(zero);
    h.created = le32(b + 60);
    h.sectorsPerBlock = le32(b + 64);
    h.checksum = le32(b + 68);
    h.stringBytes = le32(b + 72);
    if (h.totalSectors == 0 || h.sectorsPerBlock == 0) {
        problem = QStringLiteral("header gives no sectors or no block size");
        return false;
    }
    if (h.sectorShift < 4 || h.sectorShift > 15) {
        problem = QStringLiteral("sector size is not valid");
        return false;
    }
    if (h.BlockSize() > MaxBlockSize) {
        problem = QStringLiteral("block size is too large");
        return false;
    }
    std::uint64_t units = 4;
    for (std::uint32_t l : h.lengths)
        units += l;
    if (units * 2 != h.stringBytes) {
        problem = QStringLiteral("string block size does not match the string lengths");
        return false;
    }
    return true;
}

void BuildHeader(const Header &h, std::uint8_t *b)
{
    std::memset(b, 0, HeaderSize);
    putLe64(b, Magic);
    putLe64(b + 8, h.firstSector);
    putLe64(b + 16, h.totalSectors);
    putLe32(b + 24, h.lengths[0]);
    b[28] = h.sectorShift;
    if (h.mediaType >= 1 && h.mediaType <= 4)
        std::memcpy(b + 29, MediaCodes[h.mediaType - 1], 3);
    putLe32(b + 32, h.sectorsPerTrack);
    putLe32(b + 36, h.tracksPerCylinder);
    putLe32(b + 40, h.lengths[1]);
    putLe32(b + 44, h.lengths[2]);
    putLe32(b + 48, h.lengths[3]);
    std::memcpy(b + 52, h.version.constData(), std::min<qsizetype>(h.version.size(), 8));
    putLe32(b + 60, h.created);
    putLe32(b + 64, h.sectorsPerBlock);
    putLe32(b + 68, h.checksum);
    putLe32(b + 72, h.stringBytes);
    b[126] = 0x55;
    b[127] = 0xAA;
}

} // namespace Tarvo
