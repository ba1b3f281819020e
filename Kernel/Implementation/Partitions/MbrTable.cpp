#include "Kernel/Implementation/Partitions/MbrTable.h"

#include <cstring>

namespace Mbr {

bool Entry::isZero() const
{
    for (std::uint8_t b : raw)
        if (b != 0)
            return false;
    return true;
}

bool Entry::isValid() const
{
    if (start() == 0)
        return isZero();
    const std::uint16_t chsStart = ByteOrder::le16(raw.data() + 2);
    const std::uint16_t chsEnd = ByteOrder::le16(raw.data() + 6);
    return chsStart != 0 && type() != 0 && chsEnd != 0 && count() != 0;
}

Table parse(const QByteArray &sector)
{
    Table t;
    if (sector.size() < 512)
        return t;
    const auto *p = reinterpret_cast<const std::uint8_t *>(sector.constData());
    for (int i = 0; i < EntryCount; ++i)
        std::memcpy(t.entries[i].raw.data(), p + EntryOffset + i * EntrySize, EntrySize);
    t.diskSignature = ByteOrder::le32(p + 440);
    return t;
}

void sortEntries(QByteArray &sector)
{
    if (sector.size() < 512)
        return;
    auto *p = reinterpret_cast<std::uint8_t *>(sector.data()) + EntryOffset;
    auto startOf = [p](int i) {
        const std::uint8_t *e = p + i * EntrySize;
        return ByteOrder::le32(e + 8);
    };
    for (int i = 0; i < EntryCount - 1; ++i) {
        int min = i;
        for (int j = i + 1; j < EntryCount; ++j)
            if (startOf(j) < startOf(min))
                min = j;
        if (min != i) {
            std::uint8_t tmp[EntrySize];
            std::memcpy(tmp, p + i * EntrySize, EntrySize);
            std::memcpy(p + i * EntrySize, p + min * EntrySize, EntrySize);
            std::memcpy(p + min * EntrySize, tmp, EntrySize);
        }
    }
}

} // namespace Mbr
