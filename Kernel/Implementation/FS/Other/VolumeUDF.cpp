#include "Kernel/Implementation/FS/Other/VolumeUDF.h"

#include "Kernel/Implementation/FS/DetectBytes.h"
#include "Kernel/Implementation/FS/VolumeText.h"

using namespace DiskBytes;

CVolumeUDF::CVolumeUDF(cStorage *medium, const VolumeDescription &description, cRoot *root)
    : CVolumeOther(medium, description, root)
{
    Initialize();
}

std::unique_ptr<CEntry> CVolumeUDF::CreateEntry(CEntry *parent)
{
    return std::make_unique<CEntryUDF>(this, parent, QString(), 0, 0);
}

bool CVolumeUDF::TagValid(const std::uint8_t *b, std::size_t size, std::uint16_t id, std::uint32_t location)
{
    if (!b || size < 16 || U16(b, size, 0) != id)
        return false;
    std::uint8_t sum = 0;
    for (int i = 0; i < 16; ++i)
        if (i != 4)
            sum = static_cast<std::uint8_t>(sum + b[i]);
    return sum == b[4] && U32(b, size, 12) == location;
}

QString CVolumeUDF::DString(const std::uint8_t *b, std::size_t size, std::size_t offset, std::size_t length)
{
    if (length < 2 || !Fits(size, offset, length))
        return QString();
    const std::size_t used = b[offset + length - 1];
    if (used < 1 || used > length - 1)
        return QString();
    const std::uint8_t comp = b[offset];
    if (comp == 8)
        return VolumeText::Latin1(b, size, offset + 1, used - 1);
    if (comp == 16)
        return VolumeText::Utf16(b, size, offset + 1, (used - 1) / 2, true).trimmed();
    return QString();
}

void CVolumeUDF::Initialize()
{
    m_validItems = 0;
    m_checkedItems = 7;
    ClearEntries();
    std::vector<std::uint8_t> a, c;
    for (std::uint32_t bs : {512u, 1024u, 2048u, 4096u}) {
        if (ReadBlock(256ull * bs, 512, a) && TagValid(a.data(), a.size(), 2, 256)) {
            m_blockSize = bs;
            break;
        }
    }
    if (m_blockSize == 0) {
        // Without an anchor at block 256 the copy at the end may still tell the block size.
        for (std::uint32_t bs : {512u, 1024u, 2048u, 4096u}) {
            const std::uint64_t last = m_size / bs;
            if (last > 257 && ReadBlock((last - 1) * bs, 512, c) &&
                TagValid(c.data(), c.size(), 2, static_cast<std::uint32_t>(last - 1))) {
                m_blockSize = bs;
                break;
            }
        }
        if (m_blockSize == 0) {
            Message(QStringLiteral("Anchor volume descriptor not found"));
            return;
        }
        ReadBlock(256ull * m_blockSize, 512, a);
    }
    UseSectorSize(m_blockSize);
    const std::uint64_t blocks = m_size / m_blockSize;
    const bool primary = TagValid(a.data(), a.size(), 2, 256);
    if (primary)
        m_validItems |= 1;
    bool copy = false;
    for (std::uint64_t at : {blocks - 1, blocks - 257}) {
        if (at > 256 && at < blocks && at <= 0xFFFFFFFFu && ReadBlock(at * m_blockSize, 512, c) &&
            TagValid(c.data(), c.size(), 2, static_cast<std::uint32_t>(at))) {
            copy = true;
            break;
        }
    }
    if (copy)
        m_validItems |= 2;
    if (primary && copy && std::memcmp(a.data() + 16, c.data() + 16, 16) == 0)
        m_validItems |= 4;
    const std::vector<std::uint8_t> &anchor = primary ? a : c;
    const std::uint64_t vdsLength = U32(anchor.data(), anchor.size(), 16);
    const std::uint64_t vdsStart = U32(anchor.data(), anchor.size(), 20);
    BlockGeometry(m_blockSize, blocks);
    MakeService<CEntryUDF>(QStringLiteral("$AVDP"), 256, 1);
    MakeService<CEntryUDF>(QStringLiteral("$VDS"), vdsStart, (vdsLength + m_blockSize - 1) / m_blockSize);
    // The descriptor sequence: primary volume descriptor (1), logical volume descriptor (6),
    // terminator (8).
    std::vector<std::uint8_t> d;
    const std::uint64_t count = std::min<std::uint64_t>(vdsLength / m_blockSize, 64);
    for (std::uint64_t i = 0; i < count; ++i) {
        const std::uint64_t block = vdsStart + i;
        if (block > 0xFFFFFFFFu || !ReadBlock(block * m_blockSize, m_blockSize, d))
            break;
        const std::uint16_t id = U16(d.data(), d.size(), 0);
        if (!TagValid(d.data(), d.size(), id, static_cast<std::uint32_t>(block)) || id == 8)
            break;
        if (id == 1) {
            // The volume set identifier begins with 16 hexadecimal digits; the first eight serve
            // as the serial number.
            const QString set = DString(d.data(), d.size(), 72, 128);
            bool ok = false;
            const std::uint32_t serial = set.left(8).toUInt(&ok, 16);
            if (ok)
                m_serial = serial;
            if (m_label.isEmpty())
                m_label = DString(d.data(), d.size(), 24, 32);
        } else if (id == 6) {
            const QString logical = DString(d.data(), d.size(), 84, 128);
            if (!logical.isEmpty())
                m_label = logical;
        }
    }
    MakeRoot<CEntryUDF>(QStringLiteral("Root"), 0);
}
