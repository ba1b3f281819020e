// A plain sector dump, possibly split into several files that are read back as one.
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"

class CImageHandle_Raw : public CImageHandle
{
public:
    // Opens the files in order; the sector size is 1 << sectorShift (9 to 15).
    CImageHandle_Raw(cRoot *root, const QStringList &files, std::uint8_t sectorShift = 9);
    // A raw image that lies on a kernel volume (read-only).
    CImageHandle_Raw(cRoot *root, cStorage *source, const QString &name, std::uint8_t sectorShift = 9);

    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;

private:
    void Setup();
    bool Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer, int from,
                  std::uint32_t &error);
    // First sector of each file on the virtual disk.
    QList<std::uint64_t> m_starts;
};
