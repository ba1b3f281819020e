#include "Kernel/Implementation/FS/Other/VolumeZFS.h"

#include "Kernel/Implementation/FS/Detect.h"
#include "Kernel/Implementation/FS/DetectBytes.h"

#include <cstring>

using namespace DiskBytes;

CVolumeZFS::CVolumeZFS(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeZFS::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryZFS>(this, parent, QString(), 0, 0);
}

QString CVolumeZFS::NvString(const std::uint8_t *b, std::size_t size, const char *name)
{
    // Header: encoding (1 = XDR), endianness, two reserved bytes; then version and flags (u32 each),
    // then pairs: encoded size, decoded size, name (length + padded bytes), type, count, value.
    if (!b || size < 12 || b[0] != 1)
        return QString();
    const std::size_t nameLength = std::strlen(name);
    std::size_t at = 12;
    for (int guard = 0; guard < 4096 && at + 8 <= size; ++guard) {
        const std::uint32_t encoded = B32(b, size, at);
        if (encoded == 0 || encoded > size - at)
            break;
        const std::uint32_t keyLength = B32(b, size, at + 8);
        const std::size_t keyAt = at + 12;
        const std::size_t keyPadded = (std::size_t(keyLength) + 3) & ~std::size_t(3);
        if (keyLength <= encoded && keyAt + keyPadded + 12 <= at + encoded) {
            const std::uint32_t type = B32(b, size, keyAt + keyPadded);
            // Type 9 is a string: count, then length and bytes.
            if (type == 9 && keyLength == nameLength && std::memcmp(b + keyAt, name, nameLength) == 0) {
                const std::uint32_t valueLength = B32(b, size, keyAt + keyPadded + 8);
                const std::size_t valueAt = keyAt + keyPadded + 12;
                if (valueLength <= 1024 && Fits(size, valueAt, valueLength) &&
                    valueAt + valueLength <= at + encoded)
                    return QString::fromUtf8(reinterpret_cast<const char *>(b + valueAt), valueLength);
                return QString();
            }
        }
        at += encoded;
    }
    return QString();
}

void CVolumeZFS::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 7 | 16;
    ClearEntries();
    const std::uint64_t labelSize = 262144;
    std::vector<std::uint8_t> l0, l2;
    const bool a = ReadBlock(0, labelSize, l0) && Detect::IsZfsLabel(l0.data(), l0.size());
    // The end labels sit in the last 512 KiB, aligned down to 256 KiB.
    const std::uint64_t end = m_size & ~(labelSize - 1);
    const bool c = end >= 2 * labelSize && ReadBlock(end - 2 * labelSize, labelSize, l2) &&
                   Detect::IsZfsLabel(l2.data(), l2.size());
    if (a)
        m_validItems |= 1 | 16;
    if (c)
        m_validItems |= 2 | 16;
    if (a && c && std::memcmp(l0.data() + 16384, l2.data() + 16384, 114688) == 0)
        m_validItems |= 4;
    if (!a && !c) {
        Message(QStringLiteral("Vdev label not found"));
        return;
    }
    const std::vector<std::uint8_t> &label = a ? l0 : l2;
    m_label = NvString(label.data() + 16384, 114688 - 40, "name");
    BlockGeometry(512, m_sectorCount);
    MakeService<CEntryZFS>(QStringLiteral("$Label0"), 0, labelSize >> m_sectorShift);
    MakeService<CEntryZFS>(QStringLiteral("$Label1"), labelSize >> m_sectorShift, labelSize >> m_sectorShift);
    if (end >= 2 * labelSize) {
        MakeService<CEntryZFS>(QStringLiteral("$Label2"), (end - 2 * labelSize) >> m_sectorShift,
                               labelSize >> m_sectorShift);
        MakeService<CEntryZFS>(QStringLiteral("$Label3"), (end - labelSize) >> m_sectorShift,
                               labelSize >> m_sectorShift);
    }
    MakeRoot<CEntryZFS>(QStringLiteral("Root"), 0);
}
