#include "ImageHandle.h"

CImageHandle::CImageHandle(cRoot *root, ImageKind kind, std::uint8_t sectorShift)
    : m_root(root), m_kind(kind), m_sectorShift(sectorShift)
{
}

CImageHandle::~CImageHandle() = default;

QByteArray CImageHandle::ImageInformation() const
{
    return {};
}

bool CImageHandle::IsWritable() const
{
    return m_writable != 0 && m_totalSectors != 0;
}

QStringList CImageHandle::GetFileNames() const
{
    return {};
}

QString CImageHandle::GetRecordName() const
{
    return {};
}

bool CImageHandle::OpenFiles(const QStringList &)
{
    return false;
}

bool CImageHandle::OpenKernelFile(cStorage *, const QString &)
{
    return false;
}

void CImageHandle::AdoptFile(CPlatformFile *, std::uint64_t) {}

void CImageHandle::CloseFiles() {}

bool CImageHandle::TransferBytes(bool, std::uint64_t, std::uint32_t, void *, std::uint32_t &error)
{
    error = 1;
    return false;
}

void CImageHandle::SetFileSize(int, std::uint64_t) {}

bool CImageHandle::CheckRange(std::uint64_t first, std::uint32_t count, std::uint32_t &error) const
{
    error = 0;
    if (count == 0 || first >= m_totalSectors || count > m_totalSectors - first) {
        error = 1;
        return false;
    }
    return true;
}

void CImageHandle::Fail(const QString &problem)
{
    m_problem = problem;
    m_totalSectors = 0;
    m_writable = 0;
}
