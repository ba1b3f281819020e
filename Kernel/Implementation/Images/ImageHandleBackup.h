// A backup image: two arrays of image information and no sectors of its own. It is not writable
// and every transfer fails.
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"

class CImageHandle_Backup : public CImageHandle
{
public:
    CImageHandle_Backup(cRoot *root, const QByteArray &first, const QByteArray &second);

    // The first information array followed by the second.
    QByteArray ImageInformation() const override;
    bool IsWritable() const override { return false; }
    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;

    const QByteArray &GetFirstInformation() const { return m_first; }
    const QByteArray &GetSecondInformation() const { return m_second; }

private:
    QByteArray m_first;
    QByteArray m_second;
};
