// The hex editor's navigation layout over arbitrary boot sectors and superblocks: every file-system
// kind, any volume size; no offset may be computed from an unchecked field into a crash.
#include <QByteArray>

#include <cstddef>
#include <cstdint>

#include "hexeditor/StorageLayout.cpp"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    if (size < 9)
        return 0;
    const std::uint32_t kind = data[0] % 32;
    std::uint64_t volumeSize = 0;
    for (int i = 1; i < 9; ++i)
        volumeSize = (volumeSize << 8) | data[i];
    const QByteArray image(reinterpret_cast<const char *>(data + 9), qsizetype(size - 9));
    auto reader = [&image](std::uint64_t offset, std::uint32_t length) {
        if (offset >= std::uint64_t(image.size()))
            return QByteArray();
        return image.mid(qsizetype(offset), qsizetype(length));
    };
    const auto points = HexEditor::Layout::volumePoints(kind, volumeSize, 512u << (data[1] % 4), reader);
    for (const auto &p : points)
        if (p.offset >= volumeSize && p.kind == 1)
            __builtin_trap();
    HexEditor::Layout::extInodeSize(image);
    HexEditor::Layout::ntfsRecordSize(std::int8_t(data[2]), 512u << (data[3] % 8));
    return 0;
}
