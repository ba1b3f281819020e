// The system's own read-only, block-compressed disk image ("Tarvo Disk Image").
#pragma once

#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Images/TarvoFormat.h"

#include <functional>
#include <vector>

class CImageHandle_Tarvo : public CImageHandle
{
public:
    CImageHandle_Tarvo(cRoot *root, const QStringList &files);
    CImageHandle_Tarvo(cRoot *root, cStorage *source, const QString &name);

    // The header (128 bytes) followed by the string block.
    QByteArray ImageInformation() const override;
    bool IsWritable() const override { return false; }
    bool ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                   std::uint32_t &error) override;
    void Describe(DeviceInfo &info) const override;

    const Tarvo::Header &GetHeader() const { return m_header; }
    // The four strings: description, source model, second identity text, source serial.
    QString GetString(int index) const { return m_strings[index & 3]; }

    // Inflates every group index and block and checks both Adler-32 sums against the trailer.
    // Different zlib streams can inflate to the same bytes (a damaged distance inside a run of
    // zeros), so every stream must also be exactly what compressing its bytes again at the
    // image's level gives.
    // progress(done, total blocks) may return false to stop (the result is then false).
    bool Verify(const std::function<bool(std::uint64_t, std::uint64_t)> &progress, QString &problem);

private:
    void Parse();
    bool LoadGroup(std::uint64_t group, QString *problem);
    bool LoadBlock(std::uint64_t block, QString *problem);
    // True when `packed` is what compressing `data` gives at the level its zlib header names
    // (the level found is kept in `level` for the next stream).
    static bool Canonical(const QByteArray &packed, const std::uint8_t *data, std::size_t size, int &level);
    bool VerifyGroupRecord(std::uint64_t group, int &level, QString &problem);
    bool ReadPacked(std::uint64_t offset, std::uint64_t length, QByteArray &packed);
    bool Inflate(const QByteArray &in, std::uint8_t *out, std::uint64_t capacity, std::uint64_t &produced);

    Tarvo::Header m_header;
    QByteArray m_headerBytes;
    QByteArray m_stringBlock;
    QString m_strings[4];
    std::uint32_t m_dataAdler = 0;
    std::uint64_t m_dataStart = 0;  // first byte after the string block
    std::uint64_t m_tableStart = 0; // the group table
    std::vector<std::uint64_t> m_groups;

    std::int64_t m_groupNumber = -1; // the inflated group index
    std::vector<std::uint64_t> m_index;
    std::int64_t m_blockNumber = -1; // the inflated block
    std::vector<std::uint8_t> m_block;
    std::uint64_t m_blockBytes = 0;
};
