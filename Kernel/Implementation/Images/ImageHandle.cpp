#include "Kernel/Implementation/Images/ImageHandle.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/PlatformFileX.h"

#include <QMutexLocker>

CImageHandle::CImageHandle(cRoot *root, ImageKind kind, std::uint8_t sectorShift)
    : m_root(root), m_kind(kind), m_sectorShift(sectorShift)
{
}

CImageHandle::~CImageHandle()
{
    CloseFiles();
}

QByteArray CImageHandle::ImageInformation() const
{
    return {};
}

void CImageHandle::Describe(DeviceInfo &info) const
{
    info.sectorShift = m_sectorShift;
    info.physicalSectorShift = m_sectorShift;
    info.totalSectors = m_totalSectors;
}

bool CImageHandle::IsWritable() const
{
    return m_writable != 0 && m_totalSectors != 0;
}

bool CImageHandle::Flush(std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    error = 0;
    bool ok = true;
    for (CPlatformFile *f : m_files) {
        std::uint32_t e = 0;
        if (!f->Flush(e) && ok) {
            ok = false;
            error = e;
        }
    }
    return ok;
}

QStringList CImageHandle::GetFileNames() const
{
    QStringList names;
    for (CPlatformFile *f : m_files)
        names << f->GetName();
    return names;
}

QString CImageHandle::GetRecordName() const
{
    QStringList names = GetFileNames();
    QString inner;
    if (names.size() == 1)
        inner = names.first();
    else if (names.size() > 1)
        inner = names.first() + QStringLiteral(",...,") + names.last();
    return QStringLiteral("Image (") + inner + QStringLiteral(")");
}

bool CImageHandle::OpenFiles(const QStringList &names)
{
    CloseFiles();
    if (names.isEmpty())
        return false;
    for (const QString &name : names) {
        if (!AddFile(name)) {
            CloseFiles();
            m_problem = QStringLiteral("cannot open %1").arg(name);
            return false;
        }
    }
    return true;
}

bool CImageHandle::AddFile(const QString &name)
{
    auto *file = new CPlatformFile(m_root, name, PlatformKind::File);
    std::uint64_t size = 0;
    if (!file->Reopen(true) || !file->GetSize(size)) {
        if (file->IsOpened())
            file->Close(false);
        delete file;
        return false;
    }
    AdoptFile(file, size);
    return true;
}

bool CImageHandle::OpenKernelFile(cStorage *source, const QString &name)
{
    CloseFiles();
    if (!source)
        return false;
    auto *file = new CPlatformFileX(m_root, name, source);
    std::uint64_t size = 0;
    if (!file->Reopen(true) || !file->GetSize(size)) {
        delete file;
        m_problem = QStringLiteral("cannot open %1").arg(name);
        return false;
    }
    AdoptFile(file, size);
    return true;
}

void CImageHandle::AdoptFile(CPlatformFile *file, std::uint64_t size)
{
    m_files.append(file);
    m_fileStarts.append(m_totalBytes);
    m_fileSizes.append(size);
    m_totalBytes += size;
}

void CImageHandle::CloseFiles()
{
    for (CPlatformFile *f : m_files) {
        if (f->IsOpened())
            f->Close(false);
        delete f;
    }
    m_files.clear();
    m_fileSizes.clear();
    m_fileStarts.clear();
    m_totalBytes = 0;
}

void CImageHandle::SetFileSize(int index, std::uint64_t size)
{
    if (index < 0 || index >= m_fileSizes.size())
        return;
    m_fileSizes[index] = size;
    std::uint64_t start = 0;
    for (int i = 0; i < m_fileSizes.size(); ++i) {
        m_fileStarts[i] = start;
        start += m_fileSizes[i];
    }
    m_totalBytes = start;
}

bool CImageHandle::TransferBytes(bool read, std::uint64_t offset, std::uint32_t size, void *buffer,
                                 std::uint32_t &error)
{
    error = 0;
    if (size == 0)
        return true;
    if (offset >= m_totalBytes || size > m_totalBytes - offset) {
        error = SystemError::HandleEof;
        return false;
    }
    // The file that holds the first byte: the last one whose start is not past it.
    int index = 0;
    int lo = 0, hi = int(m_fileStarts.size()) - 1;
    while (lo <= hi) {
        int mid = (lo + hi) / 2;
        if (m_fileStarts[mid] <= offset) {
            index = mid;
            lo = mid + 1;
        } else {
            hi = mid - 1;
        }
    }
    auto *bytes = static_cast<std::uint8_t *>(buffer);
    while (size > 0) {
        // Empty files hold nothing: skip them.
        while (index < m_files.size() && offset - m_fileStarts[index] >= m_fileSizes[index])
            ++index;
        if (index >= m_files.size()) {
            error = SystemError::HandleEof;
            return false;
        }
        std::uint64_t inFile = offset - m_fileStarts[index];
        std::uint64_t avail = m_fileSizes[index] - inFile;
        std::uint32_t part = avail < size ? std::uint32_t(avail) : size;
        CPlatformFile *file = m_files[index];
        if (!file->ReadWrite(read, inFile, part, bytes)) {
            error = file->GetError();
            return false;
        }
        bytes += part;
        offset += part;
        size -= part;
        ++index;
    }
    return true;
}

bool CImageHandle::CheckRange(std::uint64_t first, std::uint32_t count, std::uint32_t &error) const
{
    error = 0;
    if (first < m_totalSectors && count <= m_totalSectors - first)
        return true;
    error = SystemError::InvalidFunction;
    if (m_root) {
        std::uint64_t position = first << m_sectorShift;
        std::uint64_t block = std::uint64_t(count) << m_sectorShift;
        m_root->EmitPlatform(std::uint32_t(PlatformOperation::SetFilePointerEx), GetRecordName(), position,
                             block, SystemError::InvalidFunction);
    }
    return false;
}

void CImageHandle::Fail(const QString &problem)
{
    if (m_problem.isEmpty())
        m_problem = problem;
    m_totalSectors = 0;
    m_writable = 0;
}
