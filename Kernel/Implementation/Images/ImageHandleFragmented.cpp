#include "Kernel/Implementation/Images/ImageHandleFragmented.h"

#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <cstring>

CImageHandle_Fragmented::CImageHandle_Fragmented(cRoot *root, const QList<Piece> &pieces,
                                                 std::uint64_t totalSectors, std::uint8_t sectorShift)
    : CImageHandle(root, ImageKind::FragmentedRaw, sectorShift)
{
    if (sectorShift < 9 || sectorShift > 15 || pieces.isEmpty()) {
        Fail(QStringLiteral("no pieces"));
        return;
    }
    QStringList names;
    for (const Piece &p : pieces)
        names << p.file;
    if (!OpenFiles(names)) {
        Fail(QStringLiteral("image files cannot be opened"));
        return;
    }
    std::uint64_t end = 0;
    bool writable = true;
    for (int i = 0; i < pieces.size(); ++i) {
        std::uint64_t length = GetFileSize(i) >> sectorShift;
        if (pieces[i].startSector < end || pieces[i].startSector > ~std::uint64_t(0) - length) {
            Fail(QStringLiteral("pieces overlap or are out of order"));
            return;
        }
        m_starts.append(pieces[i].startSector);
        m_lengths.append(length);
        end = pieces[i].startSector + length;
        writable = writable && m_files[i]->IsWritable();
    }
    if (totalSectors != 0 && totalSectors < end) {
        Fail(QStringLiteral("a piece lies past the end of the disk"));
        return;
    }
    m_totalSectors = totalSectors ? totalSectors : end;
    m_writable = writable ? 1 : 0;
}

bool CImageHandle_Fragmented::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                                        std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    if (!CheckRange(first, count, error))
        return false;
    if (!read && !m_writable) {
        error = 5;
        return false;
    }
    auto *bytes = static_cast<std::uint8_t *>(buffer);
    // One platform transfer carries less than 4 GiB: larger requests go in parts.
    const std::uint32_t maxCount = 0x40000000u >> m_sectorShift;
    if (count > maxCount) {
        bool ok = true;
        for (std::uint32_t done = 0; done < count;) {
            std::uint32_t n = std::min(count - done, maxCount);
            std::uint32_t e = 0;
            if (!ReadWrite(read, first + done, n, bytes + (std::uint64_t(done) << m_sectorShift), e)) {
                ok = false;
                error = e;
            }
            done += n;
        }
        return ok;
    }
    if (read)
        std::memset(bytes, 0, std::size_t(count) << m_sectorShift);
    bool ok = true;
    std::uint64_t last = first + count;
    for (int i = 0; i < m_files.size(); ++i) {
        std::uint64_t s = m_starts[i], e = m_starts[i] + m_lengths[i];
        if (e <= first || s >= last)
            continue;
        std::uint64_t from = std::max(s, first), to = std::min(e, last);
        std::uint32_t n = std::uint32_t(to - from);
        if (!m_files[i]->ReadWrite(read, (from - s) << m_sectorShift, n << m_sectorShift,
                                   bytes + ((from - first) << m_sectorShift))) {
            error = m_files[i]->GetError();
            ok = false;
        }
    }
    return ok;
}
