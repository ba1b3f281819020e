#include "Kernel/Implementation/Images/ImageHandleBackup.h"

CImageHandle_Backup::CImageHandle_Backup(cRoot *root, const QByteArray &first, const QByteArray &second)
    : CImageHandle(root, ImageKind::OwnBackup, 9), m_first(first), m_second(second)
{
}

QByteArray CImageHandle_Backup::ImageInformation() const
{
    return m_first + m_second;
}

bool CImageHandle_Backup::ReadWrite(bool, std::uint64_t first, std::uint32_t count, void *,
                                    std::uint32_t &error)
{
    // No sectors: every request lies outside the image.
    return CheckRange(first, count, error) && count == 0;
}
