// Pieces of a disk placed at given sectors: sectors that no piece covers read as zeros.
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"

class CImageHandle_Fragmented : public CImageHandle
{
public:
    struct Piece
    {
        QString file;
        std::uint64_t startSector = 0; // where the piece begins on the virtual disk
    };

    // The pieces must be in ascending order of start and must not overlap; totalSectors 0 takes
    // the end of the last piece as the size of the disk.
    CImageHandle_Fragmented(cRoot *root, const QList<Piece> &pieces, std::uint64_t totalSectors = 0,
                            std::uint8_t sectorShift = 9);

    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;

private:
    QList<std::uint64_t> m_starts;
    QList<std::uint64_t> m_lengths; // sectors
};
