// Virtual PC disk images (VHD), fixed and dynamic, 512-byte sectors. A dynamic image grows by
// whole 2 MiB blocks; when its last file would pass the largest file size, the image goes on in
// a further file named like the first with the extension ".v%1".
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"

#include <vector>

class CImageHandle_VirtualPC : public CImageHandle
{
public:
    static constexpr std::uint32_t FooterSize = 512;
    static constexpr std::uint32_t DynamicHeaderSize = 1024;
    static constexpr std::uint32_t BlockSize = 0x200000;
    static constexpr std::uint32_t SectorsPerBlock = BlockSize / 512;
    static constexpr std::uint32_t Unallocated = 0xFFFFFFFF;
    static constexpr std::uint64_t DefaultFileLimit = 0xFFFFFE00ull;

    // The files in order (a first file and its overflow files).
    CImageHandle_VirtualPC(cRoot *root, const QStringList &files);
    // An image on a kernel volume (read-only).
    CImageHandle_VirtualPC(cRoot *root, cStorage *source, const QString &name);

    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;
    void Describe(DeviceInfo &info) const override;

    bool IsDynamic() const { return m_dynamic; }
    std::uint32_t AllocatedBlocks() const;
    // The largest size one image file may reach before a further file is started.
    void SetFileLimit(std::uint64_t limit) { m_fileLimit = limit; }

    // True when the 512 bytes are a sound footer (cookie, version, type, checksum, saved state).
    static bool CheckFooter(const std::uint8_t *footer);
    // Ones' complement of the byte sum with the 4 bytes at checksumAt taken as 0.
    static std::uint32_t Checksum(const std::uint8_t *data, std::size_t size, std::size_t checksumAt);
    // The name of overflow file `number` (1, 2, ...) of an image whose first file is `first`.
    static QString OverflowName(const QString &first, int number);
    // The first file followed by the overflow files that exist beside it.
    static QStringList ImageFiles(const QString &first);

private:
    void Parse();
    bool ParseDynamic(const std::uint8_t *footer);
    bool TransferDynamic(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                         std::uint32_t &error);
    bool MarkSectors(std::uint32_t entry, std::uint32_t from, std::uint32_t count, std::uint32_t &error);
    bool AllocateBlock(std::uint32_t block, std::uint32_t &error);

    bool m_dynamic = false;
    std::uint8_t m_footer[FooterSize] = {};
    std::uint64_t m_footerStart = 0;  // byte offset of the footer in the concatenated files
    std::uint64_t m_tableOffset = 0;  // byte offset of the block allocation table
    std::uint64_t m_metadataEnd = 0;  // first byte after the headers and the table
    std::vector<std::uint32_t> m_bat; // block allocation table in host order
    std::uint64_t m_fileLimit = DefaultFileLimit;
    std::uint32_t m_heads = 0, m_sectorsPerTrack = 0;
};
