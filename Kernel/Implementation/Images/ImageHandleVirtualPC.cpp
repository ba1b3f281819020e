#include "Kernel/Implementation/Images/ImageHandleVirtualPC.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <QFileInfo>

#include <algorithm>
#include <cstring>

using namespace ImageBytes;

namespace {

constexpr std::uint64_t AllOnes = 0xFFFFFFFFFFFFFFFFull;
// Largest table accepted: 2^24 blocks of 2 MiB (32 TiB), a table of 64 MiB.
constexpr std::uint32_t MaxTableEntries = 1u << 24;

} // namespace

CImageHandle_VirtualPC::CImageHandle_VirtualPC(cRoot *root, const QStringList &files)
    : CImageHandle(root, ImageKind::VirtualPc, 9)
{
    if (!OpenFiles(files)) {
        Fail(QStringLiteral("image files cannot be opened"));
        return;
    }
    Parse();
}

CImageHandle_VirtualPC::CImageHandle_VirtualPC(cRoot *root, cStorage *source, const QString &name)
    : CImageHandle(root, ImageKind::VirtualPc, 9)
{
    if (!OpenKernelFile(source, name)) {
        Fail(QStringLiteral("image file cannot be opened"));
        return;
    }
    Parse();
}

std::uint32_t CImageHandle_VirtualPC::Checksum(const std::uint8_t *data, std::size_t size,
                                               std::size_t checksumAt)
{
    std::uint32_t sum = 0;
    for (std::size_t i = 0; i < size; ++i) {
        if (i >= checksumAt && i < checksumAt + 4)
            continue;
        sum += data[i];
    }
    return ~sum;
}

bool CImageHandle_VirtualPC::CheckFooter(const std::uint8_t *f)
{
    if (std::memcmp(f, "conectix", 8) != 0)
        return false;
    if (be32(f + 8) != 2 || be32(f + 12) != 0x00010000)
        return false;
    std::uint32_t type = be32(f + 60);
    if (type != 2 && type != 3)
        return false;
    if (be32(f + 64) != Checksum(f, FooterSize, 64))
        return false;
    return f[84] == 0;
}

QString CImageHandle_VirtualPC::OverflowName(const QString &first, int number)
{
    QFileInfo info(first);
    QString base = info.completeBaseName();
    QString dir = info.path();
    QString name = base + QStringLiteral(".v%1").arg(number);
    return dir == QLatin1String(".") && !first.startsWith(QLatin1String("./"))
               ? name
               : dir + QLatin1Char('/') + name;
}

QStringList CImageHandle_VirtualPC::ImageFiles(const QString &first)
{
    QStringList files{first};
    for (int n = 1; n < 1000; ++n) {
        QString next = OverflowName(first, n);
        if (!QFileInfo::exists(next))
            break;
        files << next;
    }
    return files;
}

void CImageHandle_VirtualPC::Parse()
{
    const std::uint64_t size = GetConcatenatedSize();
    if (m_files.size() == 1) {
        if (size < 2048) {
            Fail(QStringLiteral("file is too small for a VHD image"));
            return;
        }
    } else if (GetFileSize(0) < 1536 || GetFileSize(int(m_files.size()) - 1) < 512) {
        Fail(QStringLiteral("files are too small for a VHD image"));
        return;
    }
    m_footerStart = size - FooterSize;
    std::uint32_t error = 0;
    if (!TransferBytes(true, m_footerStart, FooterSize, m_footer, error)) {
        Fail(QStringLiteral("footer cannot be read"));
        return;
    }
    if (!CheckFooter(m_footer)) {
        Fail(QStringLiteral("footer is not valid (cookie, version, type or checksum)"));
        return;
    }
    m_heads = m_footer[58];
    m_sectorsPerTrack = m_footer[59];
    bool filesWritable = true;
    for (CPlatformFile *f : m_files)
        filesWritable = filesWritable && f->IsWritable();

    const std::uint32_t type = be32(m_footer + 60);
    const std::uint64_t original = be64(m_footer + 40);
    if (type == 2) {
        if (be64(m_footer + 16) != AllOnes) {
            Fail(QStringLiteral("fixed image has a data offset"));
            return;
        }
        if (original == 0 || original > m_footerStart) {
            Fail(QStringLiteral("disk size does not fit the image file"));
            return;
        }
        m_totalSectors = original >> 9;
        m_writable = filesWritable ? 1 : 0;
        if (m_totalSectors == 0)
            Fail(QStringLiteral("disk size is zero"));
        return;
    }
    m_dynamic = true;
    if (!ParseDynamic(m_footer))
        return;
    m_totalSectors = original >> 9;
    if (m_totalSectors == 0) {
        Fail(QStringLiteral("disk size is zero"));
        return;
    }
    // New blocks go where the footer is: that is sound only when the footer follows the last
    // block (or the metadata when no block is allocated) and every block lies in between.
    bool layout = (m_footerStart % 512) == 0 && m_footerStart >= m_metadataEnd;
    std::uint64_t lastEnd = 0;
    for (std::uint32_t entry : m_bat) {
        if (entry == Unallocated)
            continue;
        std::uint64_t start = std::uint64_t(entry) * 512;
        std::uint64_t end = start + 512 + BlockSize;
        if (start < m_metadataEnd || end > m_footerStart)
            layout = false;
        lastEnd = std::max(lastEnd, end);
    }
    if (lastEnd != 0 && lastEnd != m_footerStart)
        layout = false;
    m_writable = filesWritable && layout ? 1 : 0;
}

bool CImageHandle_VirtualPC::ParseDynamic(const std::uint8_t *footer)
{
    const std::uint64_t dataOffset = be64(footer + 16);
    if (dataOffset < 512 || dataOffset > m_footerStart || m_footerStart - dataOffset < DynamicHeaderSize) {
        Fail(QStringLiteral("dynamic header lies outside the image"));
        return false;
    }
    std::uint8_t copy[FooterSize];
    std::uint32_t error = 0;
    if (!TransferBytes(true, 0, FooterSize, copy, error) || std::memcmp(copy, footer, FooterSize) != 0) {
        Fail(QStringLiteral("footer copy at the start differs from the footer"));
        return false;
    }
    std::uint8_t h[DynamicHeaderSize];
    if (!TransferBytes(true, dataOffset, DynamicHeaderSize, h, error)) {
        Fail(QStringLiteral("dynamic header cannot be read"));
        return false;
    }
    if (std::memcmp(h, "cxsparse", 8) != 0 || be64(h + 8) != AllOnes || be32(h + 24) != 0x00010000 ||
        be32(h + 32) != BlockSize || be32(h + 36) != Checksum(h, DynamicHeaderSize, 36)) {
        Fail(QStringLiteral("dynamic header is not valid"));
        return false;
    }
    const std::uint32_t entries = be32(h + 28);
    const std::uint64_t original = be64(footer + 40);
    // The table covers the disk: its last block holds the disk's last byte.
    if (entries == 0 || entries > MaxTableEntries || (original + BlockSize - 1) / BlockSize != entries) {
        Fail(QStringLiteral("block table does not match the disk size"));
        return false;
    }
    m_tableOffset = be64(h + 16);
    const std::uint64_t tableBytes = std::uint64_t(entries) * 4;
    if (m_tableOffset < FooterSize || m_tableOffset > m_footerStart ||
        m_footerStart - m_tableOffset < tableBytes) {
        Fail(QStringLiteral("block table lies outside the image"));
        return false;
    }
    std::vector<std::uint8_t> raw(tableBytes);
    for (std::uint64_t done = 0; done < tableBytes;) {
        std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(tableBytes - done, 1u << 20));
        if (!TransferBytes(true, m_tableOffset + done, n, raw.data() + done, error)) {
            Fail(QStringLiteral("block table cannot be read"));
            return false;
        }
        done += n;
    }
    m_bat.resize(entries);
    for (std::uint32_t i = 0; i < entries; ++i)
        m_bat[i] = be32(raw.data() + std::size_t(i) * 4);
    m_metadataEnd =
        std::max({std::uint64_t(FooterSize), dataOffset + DynamicHeaderSize, m_tableOffset + tableBytes});
    return true;
}

std::uint32_t CImageHandle_VirtualPC::AllocatedBlocks() const
{
    return std::uint32_t(
        std::count_if(m_bat.begin(), m_bat.end(), [](std::uint32_t e) { return e != Unallocated; }));
}

void CImageHandle_VirtualPC::Describe(DeviceInfo &info) const
{
    CImageHandle::Describe(info);
    info.sectorsPerTrack = m_sectorsPerTrack;
    info.tracksPerCylinder = m_heads;
}

bool CImageHandle_VirtualPC::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                                       std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    if (!CheckRange(first, count, error))
        return false;
    if (count == 0)
        return true;
    if (!read && !m_writable) {
        error = SystemError::AccessDenied;
        return false;
    }
    auto *bytes = static_cast<std::uint8_t *>(buffer);
    if (m_dynamic)
        return TransferDynamic(read, first, count, bytes, error);
    // Fixed: the data starts at byte 0; transfers of at most 1 GiB each.
    for (std::uint32_t done = 0; done < count;) {
        std::uint32_t n = std::min<std::uint32_t>(count - done, 1u << 21);
        if (!TransferBytes(read, (first + done) * 512, n * 512, bytes + std::uint64_t(done) * 512, error))
            return false;
        done += n;
    }
    return true;
}

bool CImageHandle_VirtualPC::TransferDynamic(bool read, std::uint64_t first, std::uint32_t count,
                                             std::uint8_t *buffer, std::uint32_t &error)
{
    while (count > 0) {
        const std::uint64_t block = first / SectorsPerBlock;
        const std::uint32_t inBlock = std::uint32_t(first % SectorsPerBlock);
        const std::uint32_t n = std::min(count, SectorsPerBlock - inBlock);
        const std::size_t bytes = std::size_t(n) * 512;
        if (block >= m_bat.size()) {
            // Sectors past the table (a disk size that is not a whole number of blocks).
            error = 0;
            return false;
        }
        std::uint32_t entry = m_bat[block];
        if (read) {
            if (entry == Unallocated) {
                std::memset(buffer, 0, bytes);
            } else if (!TransferBytes(true, (std::uint64_t(entry) + 1) * 512 + std::uint64_t(inBlock) * 512,
                                      std::uint32_t(bytes), buffer, error)) {
                return false;
            }
        } else if (entry != Unallocated || !allZero(buffer, bytes)) {
            // Zeros into an unallocated block change nothing that a read would see.
            if (entry == Unallocated) {
                if (!AllocateBlock(std::uint32_t(block), error))
                    return false;
                entry = m_bat[block];
            }
            if (!TransferBytes(false, (std::uint64_t(entry) + 1) * 512 + std::uint64_t(inBlock) * 512,
                               std::uint32_t(bytes), buffer, error))
                return false;
            if (!MarkSectors(entry, inBlock, n, error))
                return false;
        }
        first += n;
        count -= n;
        buffer += bytes;
    }
    return true;
}

bool CImageHandle_VirtualPC::MarkSectors(std::uint32_t entry, std::uint32_t from, std::uint32_t count,
                                         std::uint32_t &error)
{
    // The block's sector bitmap: one bit per sector, the first sector in the top bit of byte 0.
    std::uint8_t bitmap[512];
    const std::uint64_t at = std::uint64_t(entry) * 512;
    if (!TransferBytes(true, at, sizeof bitmap, bitmap, error))
        return false;
    bool changed = false;
    for (std::uint32_t s = from; s < from + count; ++s) {
        std::uint8_t bit = std::uint8_t(0x80 >> (s & 7));
        if (!(bitmap[s >> 3] & bit)) {
            bitmap[s >> 3] |= bit;
            changed = true;
        }
    }
    return !changed || TransferBytes(false, at, sizeof bitmap, bitmap, error);
}

bool CImageHandle_VirtualPC::AllocateBlock(std::uint32_t block, std::uint32_t &error)
{
    // A failure part-way leaves the layout unknown: no further writes.
    struct Guard
    {
        std::uint8_t &writable;
        bool done = false;
        ~Guard()
        {
            if (!done)
                writable = 0;
        }
    } guard{m_writable};
    error = 0;
    const std::uint64_t blockStart = m_footerStart; // the new block takes the footer's place
    if (blockStart / 512 >= Unallocated) {
        error = SystemError::DiskFull;
        return false;
    }
    const int last = int(m_files.size()) - 1;
    const std::uint64_t inLast = blockStart - GetFileStart(last);
    const std::uint64_t grown = inLast + 512 + BlockSize + FooterSize;
    static const std::uint8_t zeros[512] = {};

    if (grown > m_fileLimit && inLast > 0) {
        // A further file holds the block and the footer; the footer leaves the old last file
        // only after the new one is complete and on the medium.
        QString name = OverflowName(m_files.first()->GetName(), int(m_files.size()));
        auto *file = new CPlatformFile(m_root, name, PlatformKind::File);
        const std::uint64_t size = 512 + BlockSize + FooterSize;
        if (!file->Create() || !file->Resize(512 + BlockSize) ||
            !file->Write(512 + BlockSize, FooterSize, m_footer) || !file->Flush(error)) {
            error = error ? error : file->GetError();
            if (file->IsOpened())
                file->Close(true);
            delete file;
            return false;
        }
        if (!m_files[last]->Resize(inLast)) {
            error = m_files[last]->GetError();
            file->Close(true);
            delete file;
            return false;
        }
        SetFileSize(last, inLast);
        AdoptFile(file, size);
    } else {
        // The footer first goes to its new place past the block and reaches the medium; only then
        // does the block (a zero bitmap and zero data, a hole in the file) take the old footer's
        // place, so the image keeps a footer whatever is interrupted.
        CPlatformFile *file = m_files[last];
        if (!file->Write(inLast + 512 + BlockSize, FooterSize, m_footer) || !file->Flush(error)) {
            error = error ? error : file->GetError();
            return false;
        }
        SetFileSize(last, grown);
        if (!file->Write(inLast, 512, zeros)) {
            error = file->GetError();
            return false;
        }
    }
    m_footerStart = blockStart + 512 + BlockSize;
    const std::uint32_t entry = std::uint32_t(blockStart / 512);
    std::uint8_t be[4];
    putBe32(be, entry);
    // The allocation is complete when the table entry is on the medium.
    if (!TransferBytes(false, m_tableOffset + std::uint64_t(block) * 4, 4, be, error) || !Flush(error))
        return false;
    m_bat[block] = entry;
    guard.done = true;
    return true;
}
