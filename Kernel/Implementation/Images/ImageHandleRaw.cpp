#include "Kernel/Implementation/Images/ImageHandleRaw.h"

#include "Kernel/Implementation/Platform/PlatformFile.h"

CImageHandle_Raw::CImageHandle_Raw(cRoot *root, const QStringList &files, std::uint8_t sectorShift)
    : CImageHandle(root, ImageKind::RawImage, sectorShift)
{
    if (sectorShift < 9 || sectorShift > 15) {
        Fail(QStringLiteral("sector size is not supported"));
        return;
    }
    if (!OpenFiles(files)) {
        Fail(QStringLiteral("image files cannot be opened"));
        return;
    }
    Setup();
}

CImageHandle_Raw::CImageHandle_Raw(cRoot *root, cStorage *source, const QString &name,
                                   std::uint8_t sectorShift)
    : CImageHandle(root, ImageKind::RawImage, sectorShift)
{
    if (sectorShift < 9 || sectorShift > 15 || !OpenKernelFile(source, name)) {
        Fail(QStringLiteral("image file cannot be opened"));
        return;
    }
    Setup();
}

void CImageHandle_Raw::Setup()
{
    std::uint64_t total = 0;
    bool writable = true;
    for (int i = 0; i < m_files.size(); ++i) {
        m_starts.append(total);
        total += GetFileSize(i) >> m_sectorShift;
        writable = writable && m_files[i]->IsWritable();
    }
    m_totalSectors = total;
    m_writable = writable ? 1 : 0;
    if (total == 0)
        Fail(QStringLiteral("image holds no whole sector"));
}

bool CImageHandle_Raw::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                                 std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    if (!CheckRange(first, count, error))
        return false;
    if (count == 0)
        return true;
    if (!read && !m_writable) {
        error = 5; // access denied: the image files are read-only
        return false;
    }
    // The file that holds the first sector.
    int index = 0;
    while (index + 1 < m_starts.size() && m_starts[index + 1] <= first)
        ++index;
    return Transfer(read, first, count, static_cast<std::uint8_t *>(buffer), index, error);
}

bool CImageHandle_Raw::Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                                int index, std::uint32_t &error)
{
    // Files too small to hold a whole sector hold nothing of the disk.
    while (index < m_files.size() && first - m_starts[index] >= (GetFileSize(index) >> m_sectorShift))
        ++index;
    if (index >= m_files.size())
        return false;
    std::uint64_t inFile = first - m_starts[index];
    std::uint64_t avail = (GetFileSize(index) >> m_sectorShift) - inFile;
    std::uint32_t part = avail < count ? std::uint32_t(avail) : count;
    CPlatformFile *file = m_files[index];
    // The platform transfers at most 4 GiB - 1 bytes at a time.
    std::uint32_t maxPart = 0x80000000u >> m_sectorShift;
    std::uint32_t done = 0;
    while (done < part) {
        std::uint32_t n = std::min(part - done, maxPart);
        if (!file->ReadWrite(read, (inFile + done) << m_sectorShift, n << m_sectorShift,
                             buffer + (std::uint64_t(done) << m_sectorShift))) {
            error = file->GetError();
            return false;
        }
        done += n;
    }
    if (part == count)
        return true;
    return Transfer(read, first + part, count - part, buffer + (std::uint64_t(part) << m_sectorShift),
                    index + 1, error);
}
