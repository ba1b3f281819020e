#include "Kernel/Implementation/FS/Detect.h"

#include "Kernel/Implementation/Common/cDevice.h"
#include "Kernel/Implementation/Common/cPartition.h"
#include "Kernel/Implementation/FS/DetectBytes.h"

#include <vector>

using namespace DiskBytes;

namespace Detect {

namespace {

bool SectorSizeOk(std::uint32_t v)
{
    return v == 512 || v == 1024 || v == 2048 || v == 4096;
}

bool ClusterOk(std::uint32_t v)
{
    return PowerOfTwo(v, 1, 128);
}

bool BootSignature(const std::uint8_t *b, std::size_t size)
{
    return size >= 512 && b[510] == 0x55 && b[511] == 0xAA;
}

} // namespace

bool IsFat(const std::uint8_t *b, std::size_t size)
{
    if (!b || !BootSignature(b, size))
        return false;
    const std::uint32_t bps = U16(b, size, 11);
    const std::uint32_t spc = b[13];
    const std::uint32_t reserved = U16(b, size, 14);
    const std::uint32_t fats = b[16];
    const std::uint32_t rootEntries = U16(b, size, 17);
    const std::uint32_t total16 = U16(b, size, 19);
    const std::uint32_t spf = U16(b, size, 22);
    const std::uint32_t total32 = U32(b, size, 32);
    if (!SectorSizeOk(bps) || !ClusterOk(spc) || reserved == 0 || fats < 1 || fats > 16)
        return false;
    if (rootEntries == 0 || (rootEntries * 32u) % bps != 0 || spf == 0)
        return false;
    if (total16 == 0 && total32 == 0)
        return false;
    if (total16 != 0 && total32 != 0 && total16 != total32)
        return false;
    const std::uint64_t total = total32 != 0 ? total32 : total16;
    const std::uint64_t rootSectors = (std::uint64_t(rootEntries) * 32 + bps - 1) / bps;
    return total > std::uint64_t(reserved) + std::uint64_t(fats) * spf + rootSectors;
}

bool IsFat32(const std::uint8_t *b, std::size_t size)
{
    if (!b || !BootSignature(b, size))
        return false;
    const std::uint32_t bps = U16(b, size, 11);
    const std::uint32_t spc = b[13];
    const std::uint32_t reserved = U16(b, size, 14);
    const std::uint32_t fats = b[16];
    if (!SectorSizeOk(bps) || !ClusterOk(spc) || reserved == 0 || fats < 1 || fats > 16)
        return false;
    if (U16(b, size, 17) != 0 || U16(b, size, 19) != 0 || U16(b, size, 22) != 0)
        return false;
    const std::uint64_t total = U32(b, size, 32);
    const std::uint64_t spf = U32(b, size, 36);
    if (total == 0 || spf == 0)
        return false;
    const std::uint16_t flags = U16(b, size, 40);
    if ((flags & 0x80) && (flags & 0x0F) >= fats)
        return false;
    const std::uint64_t rootCluster = U32(b, size, 44);
    if (rootCluster < 2)
        return false;
    const std::uint32_t fsInfo = U16(b, size, 48);
    const std::uint32_t backup = U16(b, size, 50);
    if (backup != 0) {
        if (fsInfo >= backup || backup >= reserved)
            return false;
    } else if (fsInfo >= reserved) {
        return false;
    }
    const std::uint64_t meta = std::uint64_t(reserved) + std::uint64_t(fats) * spf;
    if (total <= meta)
        return false;
    return rootCluster <= (total - meta) / spc + 1;
}

bool IsExFat(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 512)
        return false;
    static const char name[] = "EXFAT   ";
    for (int i = 0; i < 8; ++i) {
        char c = static_cast<char>(b[3 + i]);
        if (c >= 'a' && c <= 'z')
            c = static_cast<char>(c - 'a' + 'A');
        if (c != name[i])
            return false;
    }
    for (std::size_t i = 11; i < 64; ++i)
        if (b[i] != 0)
            return false;
    const std::uint64_t volumeLength = U64(b, size, 72);
    const std::uint64_t fatOffset = U32(b, size, 80);
    const std::uint64_t fatLength = U32(b, size, 84);
    const std::uint64_t heapOffset = U32(b, size, 88);
    const std::uint64_t clusterCount = U32(b, size, 92);
    const std::uint64_t rootCluster = U32(b, size, 96);
    const unsigned bpsShift = b[108];
    const unsigned spcShift = b[109];
    const unsigned fatCount = b[110];
    if (bpsShift < 9 || bpsShift > 12 || bpsShift + spcShift > 25 || fatCount == 0)
        return false;
    if (volumeLength == 0 || fatOffset < 24)
        return false;
    if (fatOffset + fatLength > heapOffset || heapOffset >= volumeLength)
        return false;
    if (volumeLength - heapOffset < (clusterCount << spcShift))
        return false;
    if (clusterCount * 4 > (fatLength << bpsShift))
        return false;
    return rootCluster >= 2 && clusterCount >= 1 && rootCluster <= clusterCount - 1;
}

bool IsCdfs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 2048)
        return false;
    if ((b[0] != 1 && b[0] != 2) || !Equals(b, size, 1, "CD001", 5) || b[6] != 1)
        return false;
    const std::uint32_t space = U32(b, size, 80);
    if (space <= 22 || space != B32(b, size, 84))
        return false;
    if (U16(b, size, 128) != 2048 || U16(b, size, 130) != 0x0008)
        return false;
    if (U32(b, size, 132) != B32(b, size, 136))
        return false;
    return b[156] == 34 && b[157] == 0 && b[881] == 1;
}

std::uint16_t ReFsChecksum(const std::uint8_t *b, std::size_t size)
{
    std::uint16_t c = 0;
    for (std::size_t i = 3; i < 512 && i < size; ++i) {
        if (i == 22 || i == 23)
            continue;
        c = static_cast<std::uint16_t>(((c >> 1) | (c << 15)) + b[i]);
    }
    return c;
}

bool IsReFs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 512)
        return false;
    if (!Equals(b, size, 3, "ReFS\0\0\0\0", 8) || !Equals(b, size, 16, "FSRS", 4))
        return false;
    if (U16(b, size, 20) != 512 || ReFsChecksum(b, size) != U16(b, size, 22))
        return false;
    const std::uint64_t sectors = U64(b, size, 24);
    const std::uint32_t bps = U32(b, size, 32);
    const std::uint32_t spc = U32(b, size, 36);
    if (sectors == 0 || !SectorSizeOk(bps) || !ClusterOk(spc))
        return false;
    const std::uint64_t cluster = std::uint64_t(bps) * spc;
    const std::uint8_t major = b[40];
    if (major == 1) {
        if (cluster != 65536)
            return false;
    } else if (major == 3) {
        if (cluster != 4096 && cluster != 65536)
            return false;
    } else {
        return false;
    }
    return sectors % spc == 0;
}

std::uint64_t ApFsChecksum(const std::uint8_t *b, std::size_t blockSize)
{
    const std::uint64_t mod = 0xFFFFFFFFull;
    std::uint64_t sum1 = 0, sum2 = 0;
    for (std::size_t i = 8; i + 4 <= blockSize; i += 4) {
        sum1 = (sum1 + U32(b, blockSize, i)) % mod;
        sum2 = (sum2 + sum1) % mod;
    }
    const std::uint64_t low = mod - ((sum1 + sum2) % mod);
    const std::uint64_t high = mod - ((sum1 + low) % mod);
    return (high << 32) | low;
}

bool IsApFs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 1384)
        return false;
    const std::uint32_t blockSize = U32(b, size, 36);
    if (blockSize > 65536 || !PowerOfTwo(blockSize, 4096, 65536) || blockSize > size)
        return false;
    if (!Equals(b, size, 32, "NXSB", 4))
        return false;
    if (ApFsChecksum(b, blockSize) != U64(b, size, 0))
        return false;
    if (U64(b, size, 8) == 0 || U64(b, size, 16) == 0)
        return false;
    const std::uint16_t type = U16(b, size, 24);
    const std::uint16_t flags = U16(b, size, 26);
    if (type != 1 || (flags & 0x07FF) != 0 || (flags & 0xC000) != 0x8000 || U32(b, size, 28) != 0)
        return false;
    const std::uint64_t blocks = U64(b, size, 40);
    if (blocks > (~0ull) / blockSize || blocks * blockSize < (1ull << 20))
        return false;
    if ((U64(b, size, 48) & ~3ull) != 0 || U64(b, size, 56) != 0)
        return false;
    const std::uint64_t incompat = U64(b, size, 64);
    if ((incompat & 2) && (incompat & ~0x102ull))
        return false;
    const std::uint32_t descBlocks = U32(b, size, 104);
    const std::uint32_t dataBlocks = U32(b, size, 108);
    if ((descBlocks & 0x80000000u) || (descBlocks & 0x7FFFFFFFu) < 2)
        return false;
    if ((dataBlocks & 0x80000000u) || (dataBlocks & 0x7FFFFFFFu) == 0)
        return false;
    const std::int64_t descBase = static_cast<std::int64_t>(U64(b, size, 112));
    const std::int64_t dataBase = static_cast<std::int64_t>(U64(b, size, 120));
    if (descBase < 1 || std::uint64_t(descBase) > blocks || descBlocks > blocks - std::uint64_t(descBase))
        return false;
    if (dataBase < 1 || std::uint64_t(dataBase) > blocks || dataBlocks > blocks - std::uint64_t(dataBase))
        return false;
    if (U64(b, size, 160) == 0 || U32(b, size, 176) != 0)
        return false;
    const std::uint32_t maxFs = U32(b, size, 180);
    return maxFs >= 1 && maxFs <= 100 && U64(b, size, 1344) == 0;
}

namespace {

// NTFS size fields (record and index block): clusters when small, 2^n bytes when negative.
std::uint64_t NtfsSizeField(std::uint32_t v, std::uint64_t clusterBytes)
{
    if (v >= 255)
        return 0;
    if (v <= 127) {
        const std::uint64_t bytes = std::uint64_t(v) * clusterBytes;
        return PowerOfTwo(bytes, 1024, 65536) ? bytes : 0;
    }
    const unsigned n = 256 - v;
    return n < 17 ? (1ull << n) : 0;
}

} // namespace

std::uint32_t NtfsCheckWord(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 512)
        return 0;
    std::uint32_t word = 0;
    if (Equals(b, size, 3, "NTFS    ", 8))
        word |= 0x2;
    if (BootSignature(b, size))
        word |= 0x1000000;
    const std::uint32_t bps = U16(b, size, 11);
    if (PowerOfTwo(bps, 512, 4096))
        word |= 0x4;
    const std::uint32_t raw = b[13];
    std::uint64_t spc = 0;
    if (raw > 128) {
        if (256 - raw < 22)
            spc = 1ull << (256 - raw);
    } else {
        spc = raw;
    }
    if (PowerOfTwo(spc, 1, 4096))
        word |= 0x8;
    else
        spc = 0;
    const std::uint64_t total = U64(b, size, 40);
    if (total > 4096)
        word |= 0x80;
    const std::uint64_t clusterBytes = spc * bps;
    std::uint64_t record = NtfsSizeField(U32(b, size, 64), clusterBytes);
    if (PowerOfTwo(record, 1024, 4096))
        word |= 0x100000;
    else
        record = 1024;
    const std::uint64_t index = NtfsSizeField(U32(b, size, 68), clusterBytes);
    if (PowerOfTwo(index, 1024, 65536))
        word |= 0x200000;
    if (spc != 0 && clusterBytes != 0) {
        const std::uint64_t clusters = total / spc;
        const std::uint64_t mftClusters = (16 * record + clusterBytes - 1) / clusterBytes;
        const std::uint64_t mft = U64(b, size, 48);
        const std::uint64_t mirror = U64(b, size, 56);
        if (mft != 0 && clusters > mftClusters && mft < clusters - mftClusters)
            word |= 0x40000;
        if (mirror != 0 && mirror < clusters && mirror != mft)
            word |= 0x80000;
    }
    return word;
}

bool IsNtfs(const std::uint8_t *b, std::size_t size)
{
    return (NtfsCheckWord(b, size) & NtfsValidMask) == NtfsValidMask;
}

bool IsHfsPlus(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 284)
        return false;
    const std::uint16_t version = U16(b, size, 2);
    if (b[0] == 'H' && b[1] == '+') {
        if (version != 0x0400)
            return false;
    } else if (b[0] == 'H' && b[1] == 'X') {
        if (version < 0x0500)
            return false;
    } else {
        return false; // "BD" (plain HFS) is recognised and rejected like anything else
    }
    const std::uint32_t blockSize = B32(b, size, 40);
    if (B32(b, size, 44) < 1024 || !PowerOfTwo(blockSize, 512, 0x80000000ull))
        return false;
    return B32(b, size, 120) % blockSize == 0 && B32(b, size, 200) % blockSize == 0 &&
           B32(b, size, 280) % blockSize == 0;
}

std::uint32_t ExtKind(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 512 || U16(b, size, 56) != 0xEF53)
        return KindUnknown;
    const std::uint32_t revision = U32(b, size, 76);
    const std::uint32_t logBlock = U32(b, size, 24);
    if (revision > 1 || logBlock > 6)
        return KindUnknown;
    const std::uint64_t blockSize = 1024ull << logBlock;
    std::uint64_t blocks = U32(b, size, 4);
    const std::uint32_t incompat = U32(b, size, 96);
    if (incompat & 0x80)
        blocks |= std::uint64_t(U32(b, size, 336)) << 32;
    const std::uint64_t inodes = U32(b, size, 0);
    const std::uint64_t firstData = U32(b, size, 20);
    const std::uint64_t perGroup = U32(b, size, 32);
    const std::uint64_t inodesPerGroup = U32(b, size, 40);
    if (blocks == 0 || blockSize * blocks == 0)
        return KindUnknown;
    if (inodes == 0 || inodes > blocks || perGroup == 0 || firstData >= perGroup)
        return KindUnknown;
    const std::uint64_t groups = (blocks + perGroup - 1) / perGroup;
    if (inodesPerGroup > perGroup || inodesPerGroup * groups < inodes)
        return KindUnknown;
    const std::uint32_t compat = U32(b, size, 92);
    const std::uint32_t roCompat = U32(b, size, 100);
    // Features an ext3 driver does not know make the volume ext4.
    const std::uint32_t ext4Incompat =
        0x40 | 0x80 | 0x200 | 0x400 | 0x1000 | 0x2000 | 0x4000 | 0x8000 | 0x10000;
    const std::uint32_t ext4RoCompat = 0x8 | 0x10 | 0x20 | 0x40 | 0x200 | 0x400 | 0x1000 | 0x2000 | 0x8000;
    if ((incompat & ext4Incompat) || (roCompat & ext4RoCompat))
        return static_cast<std::uint32_t>(FileSystemKind::Ext4);
    if (compat & 0x4)
        return static_cast<std::uint32_t>(FileSystemKind::Ext3);
    return static_cast<std::uint32_t>(FileSystemKind::Ext2);
}

bool IsUfs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 1376)
        return false;
    const std::uint32_t magic = U32(b, size, 1372);
    if (magic != 0x19540119 && magic != 0x00011954)
        return false;
    const std::uint32_t blockSize = U32(b, size, 48);
    const std::uint32_t fragSize = U32(b, size, 52);
    if (!PowerOfTwo(blockSize, 4096, 65536) || U32(b, size, 44) < 4 || U32(b, size, 156) < 1)
        return false;
    if (fragSize == 0 || fragSize > blockSize)
        return false;
    return U32(b, size, 184) > 0 && U32(b, size, 188) >= 1 && U32(b, size, 1080) >= 1;
}

bool IsBtrFs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 555 || !Equals(b, size, 64, "_BHRfS_M", 8))
        return false;
    // The primary copy records 64 KiB as its own position, the mirror at 64 MiB its own.
    const std::uint64_t own = U64(b, size, 48);
    if (own != 65536 && own != 67108864)
        return false;
    if (U64(b, size, 72) < 1)
        return false;
    const std::uint32_t sector = U32(b, size, 144);
    if (!PowerOfTwo(sector, 4096, 65536))
        return false;
    if (U32(b, size, 148) < sector || U32(b, size, 152) < sector || U32(b, size, 156) < sector)
        return false;
    const std::uint64_t total = U64(b, size, 112);
    if (!(total > 0xFFFFF || (total >> 63)) || total < U64(b, size, 120))
        return false;
    return U64(b, size, 136) >= 1;
}

bool IsXfs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 512 || !Equals(b, size, 0, "XFSB", 4))
        return false;
    const std::uint32_t blockSize = B32(b, size, 4);
    const std::uint32_t sectorSize = B16(b, size, 102);
    if (!PowerOfTwo(blockSize, 512, 65536) || !PowerOfTwo(sectorSize, 512, 4096))
        return false;
    const std::uint64_t blocks = B64(b, size, 8);
    if (blocks < (64ull << 20) / blockSize)
        return false;
    const std::uint32_t inodeSize = B16(b, size, 104);
    const std::uint32_t perBlock = B16(b, size, 106);
    if (inodeSize == 0 || perBlock == 0)
        return false;
    return static_cast<std::uint32_t>(inodeSize * perBlock) <= blockSize;
}

bool IsJfs(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 184 || !Equals(b, size, 0, "JFS1", 4))
        return false;
    const std::uint32_t version = U32(b, size, 4);
    if (version != 1 && version != 2)
        return false;
    const std::uint32_t bsize = U32(b, size, 16);
    const std::uint32_t pbsize = U32(b, size, 24);
    if (!PowerOfTwo(bsize, 512, 4096) || !PowerOfTwo(pbsize, 512, 4096) || bsize < pbsize)
        return false;
    if (U16(b, size, 20) != Log2(bsize) || U16(b, size, 28) != Log2(pbsize) ||
        U16(b, size, 22) != Log2(bsize / pbsize))
        return false;
    return U32(b, size, 32) != 0 && U64(b, size, 8) != 0;
}

std::uint32_t ClassifyBootBlock(const std::uint8_t *buffer, std::size_t size)
{
    if (!buffer)
        return KindUnknown;
    if (IsFat(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Fat);
    if (IsFat32(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Fat32);
    if (IsExFat(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::ExFat);
    if (IsCdfs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Cdfs);
    if (IsReFs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::ReFs);
    if (IsApFs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::ApFs);
    if (IsNtfs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Ntfs);
    if (IsHfsPlus(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::HfsPlus);
    const std::uint32_t ext = ExtKind(buffer, size);
    if (ext != KindUnknown)
        return ext;
    if (IsUfs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Ufs);
    if (IsBtrFs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::BtrFs);
    if (IsXfs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Xfs);
    if (IsJfs(buffer, size))
        return static_cast<std::uint32_t>(FileSystemKind::Jfs);
    return KindUnknown;
}

bool IsZfsUberblock(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 16)
        return false;
    const std::uint64_t magic = 0x00BAB10Cull;
    std::uint64_t version;
    if (U64(b, size, 0) == magic)
        version = U64(b, size, 8);
    else if (B64(b, size, 0) == magic)
        version = B64(b, size, 8);
    else
        return false;
    // Pool versions 1..5000 (5000 stands for "feature flags").
    return version >= 1 && version <= 5000;
}

bool IsZfsLabel(const std::uint8_t *b, std::size_t size)
{
    if (!b || size < 262144)
        return false;
    const std::uint64_t tail = U64(b, size, 131032);
    if (tail != 0x0210DA7AB10C7A11ull && B64(b, size, 131032) != 0x0210DA7AB10C7A11ull)
        return false;
    bool found = false;
    for (std::size_t i = 1; i <= 254; ++i) {
        const std::uint8_t *slot = b + 131072 + i * 512;
        bool zero = true;
        for (std::size_t k = 0; k < 472; ++k) {
            if (slot[k] != 0) {
                zero = false;
                break;
            }
        }
        if (zero)
            continue;
        if (!IsZfsUberblock(slot, 512))
            return false;
        found = true;
    }
    return found;
}

namespace {

bool ReadAt(cStorage &storage, std::uint64_t offset, std::vector<std::uint8_t> &buffer, std::size_t size)
{
    buffer.assign(size, 0);
    std::uint32_t error = 0;
    return storage.ReadBytes(offset, size, buffer.data(), error);
}

} // namespace

bool ProbeUdf(cStorage &storage, std::uint64_t start)
{
    const std::uint64_t size = storage.GetSize();
    int state = 3;
    std::vector<std::uint8_t> d;
    // The recognition sequence is short; 64 descriptors bound the walk.
    for (std::uint64_t i = 0; i < 64; ++i) {
        const std::uint64_t at = start + 32768 + i * 2048;
        if (at + 2048 > size || !ReadAt(storage, at, d, 2048))
            return false;
        const std::uint8_t *id = d.data() + 1;
        auto is = [id](const char *s) { return std::memcmp(id, s, 5) == 0; };
        if (is("BEA01")) {
            if (state != 3)
                return false;
            state = 2;
        } else if (is("NSR02") || is("NSR03")) {
            if (state != 2)
                return false;
            state = 1;
        } else if (is("TEA01")) {
            if (state != 1)
                return false;
            state = 0;
        } else if (is("CD001") || is("BOOT2") || is("CDW02")) {
            continue;
        } else {
            break;
        }
    }
    return state == 0;
}

std::uint32_t DetectFileSystem(cStorage &storage, std::uint64_t start, std::uint64_t length,
                               bool stopAtSignature, bool &usedBackup, MediaType mediaType)
{
    usedBackup = false;
    const std::uint64_t size = storage.GetSize();
    const std::uint32_t sectorSize = storage.GetBytesPerSector();
    if (storage.GetTotalSectors() < 32 || sectorSize < 512 || start > size || length > size - start)
        return KindUnknown;
    std::vector<std::uint8_t> buf;
    if (mediaType == MediaType::CdRom) {
        if (!ReadAt(storage, start + 32768, buf, 2048))
            return KindUnknown;
        const std::uint32_t k = ClassifyBootBlock(buf.data(), buf.size());
        return (k == 11 || k == 12) ? k : KindUnknown;
    }
    const std::uint64_t end = start + length;
    // One probe: read `bytes` at `offset` from the start when the range holds them.
    auto probe = [&](std::uint64_t offset, std::size_t bytes) -> std::uint32_t {
        if (offset > length || bytes > length - offset)
            return 0xFFFFFFFEu;
        if (!ReadAt(storage, start + offset, buf, bytes))
            return 0xFFFFFFFEu;
        return ClassifyBootBlock(buf.data(), buf.size());
    };
    std::uint32_t k = probe(0, 512); // a
    if (k != 0xFFFFFFFEu) {
        if (k != KindUnknown)
            return k;
        if (stopAtSignature && buf[510] == 0x55 && buf[511] == 0xAA)
            return KindUnknown;
    }
    if (probe(0, 65536) == 23) // b
        return 23;
    k = probe(1024, 512); // c
    if (k == 13 || k == 14 || k == 15 || k == 16)
        return k;
    if (length >= sectorSize) { // d
        k = probe(length - sectorSize, 512);
        if (k == 10 || k == 18) {
            usedBackup = true;
            return k;
        }
    }
    if (length >= 262144 && ReadAt(storage, start, buf, 262144) && IsZfsLabel(buf.data(), buf.size())) // e
        return 19;
    if (probe(12ull * sectorSize, 512) == 9) // f
        return 9;
    if (probe(6ull * sectorSize, 512) == 8) // g
        return 8;
    if (end - start >= 1024 && probe(length - 1024, 512) == 13) // h
        return 13;
    if (probe(8192, 1376) == 17) // i
        return 17;
    if (probe(65536, 1376) == 17) // j
        return 17;
    if (probe(65536, 555) == 20) // k
        return 20;
    if (probe(262144, 1376) == 17) // l
        return 17;
    if (probe(67108864, 555) == 20) // m
        return 20;
    if (probe(32768, 184) == 22) // n
        return 22;
    if (probe(61440, 184) == 22) // o
        return 22;
    return KindUnknown;
}

std::uint32_t DetectFileSystem(cPartition &partition, std::uint64_t start, std::uint64_t length,
                               bool stopAtSignature, bool &usedBackup)
{
    const cDevice *device = partition.GetDevice();
    const MediaType media = device ? device->GetMediaType() : MediaType::Unknown;
    return DetectFileSystem(partition, start, length, stopAtSignature, usedBackup, media);
}

} // namespace Detect
