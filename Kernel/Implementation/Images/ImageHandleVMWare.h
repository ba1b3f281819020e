// VMware virtual disks (VMDK), 512-byte sectors: a single sparse extent (its header may carry an
// embedded descriptor), or a text descriptor naming several sparse extents that follow each other
// on the virtual disk.
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"

#include <vector>

class CImageHandle_VMWare : public CImageHandle
{
public:
    static constexpr std::uint32_t SparseMagic = 0x564D444B; // "KDMV"
    static constexpr std::uint32_t GrainTableEntries = 512;

    // Access of an extent line.
    enum Access : std::uint8_t { AccessReadWrite = 1, AccessReadOnly = 2, AccessNone = 3 };

    struct ExtentLine
    {
        Access access = AccessReadWrite;
        std::uint64_t sectors = 0;
        QString file;
    };
    struct Descriptor
    {
        bool version1 = false; // the line "version=1" is present
        std::uint32_t sectorsPerTrack = 0;
        std::uint32_t heads = 0;
        QList<ExtentLine> extents;
    };

    // The first file: a sparse extent or a text descriptor (whose extents are opened in its folder).
    CImageHandle_VMWare(cRoot *root, const QString &file);
    // A single sparse extent on a kernel volume (read-only).
    CImageHandle_VMWare(cRoot *root, cStorage *source, const QString &name);

    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;
    void Describe(DeviceInfo &info) const override;

    int ExtentCount() const { return int(m_extents.size()); }

    // Parses descriptor text: lines end at CR or LF; extent lines begin with an access word.
    static Descriptor ParseDescriptor(const QByteArray &text);
    // True when the bytes start like a text descriptor ("version=1" and at least one extent).
    static bool LooksLikeDescriptor(const QByteArray &text);

private:
    struct Extent
    {
        int file = 0;              // index into the files
        std::uint64_t start = 0;   // first sector on the virtual disk
        std::uint64_t sectors = 0; // sectors of the virtual disk it holds
        Access access = AccessReadWrite;
        std::uint64_t grainSize = 0; // sectors per grain
        std::vector<std::uint32_t> directory;
        std::int64_t cachedTable = -1; // directory index of the cached grain table
        std::vector<std::uint32_t> table;
    };

    void OpenSparse(cStorage *source, const QString &name);
    void OpenFirst(const QString &file);
    // Reads and checks the sparse header of file `index`; false (with a problem) when unsound.
    bool ReadSparse(int index, Extent &extent, std::uint64_t &capacity, std::uint64_t &descOffset,
                    std::uint64_t &descSize);
    bool ReadFileBytes(int index, std::uint64_t offset, std::uint32_t size, void *buffer,
                       std::uint32_t &error);
    bool ReadExtent(Extent &extent, std::uint64_t sector, std::uint32_t count, std::uint8_t *buffer,
                    std::uint32_t &error);
    void Finish(const Descriptor &descriptor);

    std::vector<Extent> m_extents;
    std::uint32_t m_heads = 0, m_sectorsPerTrack = 0;
};
