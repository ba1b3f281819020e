#include "Kernel/Implementation/Ata/AtaIdentify.h"

#include "Kernel/Implementation/Common/ByteOrder.h"

#include <QByteArray>
#include <cstring>

namespace AtaIdentify {

std::uint16_t Word(const std::uint8_t *block, unsigned index)
{
    if (index >= Size / 2)
        return 0;
    return ByteOrder::le16(block + 2 * index);
}

bool AllZero(const std::uint8_t *data, std::size_t size)
{
    for (std::size_t i = 0; i < size; ++i)
        if (data[i])
            return false;
    return true;
}

std::uint64_t AccessibleSectors(const std::uint8_t *id, bool &uses48)
{
    uses48 = false;
    if (!(Word(id, 49) & (1u << 9)))
        return std::uint64_t(Word(id, 57)) | std::uint64_t(Word(id, 58)) << 16;
    const std::uint16_t w83 = Word(id, 83);
    if ((w83 & 0xC000) == 0x4000 && (w83 & (1u << 10)) && (Word(id, 86) & (1u << 10))) {
        uses48 = true;
        return std::uint64_t(Word(id, 100)) | std::uint64_t(Word(id, 101)) << 16 |
               std::uint64_t(Word(id, 102)) << 32 | std::uint64_t(Word(id, 103)) << 48;
    }
    return std::uint64_t(Word(id, 60)) | std::uint64_t(Word(id, 61)) << 16;
}

namespace {

// The bytes of words [first, first + words) as they lie in memory, optionally swapped in pairs.
QByteArray field(const std::uint8_t *id, unsigned first, unsigned words, bool swap)
{
    QByteArray b(reinterpret_cast<const char *>(id + 2 * first), int(2 * words));
    if (swap)
        for (int i = 0; i + 1 < b.size(); i += 2)
            std::swap(b[i], b[i + 1]);
    const int nul = b.indexOf('\0');
    if (nul >= 0)
        b.truncate(nul);
    return b;
}

bool readsInOrder(const QByteArray &rawModel)
{
    const QByteArray m = rawModel.trimmed().toUpper();
    for (const char *maker : {"KING", "WDC ", "HITA", "SAMS", "MAXT", "TOSH", "FUJI", "SPCC", "GOOD"})
        if (m.contains(maker))
            return true;
    auto digit = [](char c) { return c >= '0' && c <= '9'; };
    return m.size() >= 4 && m.contains("ST") && digit(m[2]) && digit(m[3]);
}

} // namespace

bool Strings(const std::uint8_t *id, QString &model, QString &firmware, QString &serial)
{
    model.clear();
    firmware.clear();
    serial.clear();
    if (!Word(id, 1) || !Word(id, 3) || !Word(id, 6))
        return false;
    const bool swap = !readsInOrder(field(id, 27, 20, false));
    model = QString::fromLatin1(field(id, 27, 20, swap)).trimmed();
    firmware = QString::fromLatin1(field(id, 23, 4, swap)).trimmed();
    serial = QString::fromLatin1(field(id, 10, 10, swap)).trimmed();
    return true;
}

bool DcoChecksumValid(const std::uint8_t *dco)
{
    std::uint8_t sum = 0;
    for (std::size_t i = 0; i < Size; ++i)
        sum = std::uint8_t(sum + dco[i]);
    return sum == 0;
}

std::uint64_t DcoMaxAddress(const std::uint8_t *dco)
{
    return std::uint64_t(Word(dco, 3)) | std::uint64_t(Word(dco, 4)) << 16 |
           std::uint64_t(Word(dco, 5)) << 32;
}

void SetDcoMaxAddress(std::uint8_t *dco, std::uint64_t maxAddress)
{
    for (unsigned i = 0; i < 6; ++i)
        dco[6 + i] = std::uint8_t(maxAddress >> (8 * i));
    std::uint8_t sum = 0;
    for (std::size_t i = 0; i + 1 < Size; ++i)
        sum = std::uint8_t(sum + dco[i]);
    dco[Size - 1] = std::uint8_t(0x100 - sum);
}

std::vector<std::uint8_t> BuildAtaInfoInquiry()
{
    std::vector<std::uint8_t> r(ScsiRequestSize, 0);
    std::uint8_t *h = r.data();
    h[0] = std::uint8_t(ScsiHeaderSize);            // length
    h[6] = 6;                                       // CDB length
    h[7] = std::uint8_t(ScsiSenseSize);             // sense length
    h[8] = 1;                                       // data in
    const std::uint32_t transfer = AtaInfoPageSize; // data transfer length @12
    std::memcpy(h + 12, &transfer, 4);
    const std::uint32_t timeOut = 15; // seconds @16
    std::memcpy(h + 16, &timeOut, 4);
    const std::uint64_t dataOffset = ScsiHeaderSize + ScsiSenseSize; // @24
    for (int i = 0; i < 8; ++i)
        h[24 + i] = std::uint8_t(dataOffset >> (8 * i));
    const std::uint32_t senseOffset = ScsiHeaderSize; // @32
    for (int i = 0; i < 4; ++i)
        h[32 + i] = std::uint8_t(senseOffset >> (8 * i));
    std::uint8_t *cdb = h + 36;
    cdb[0] = 0x12; // INQUIRY
    cdb[1] = 0x01; // vital product data
    cdb[2] = 0x89; // ATA information
    cdb[3] = std::uint8_t(AtaInfoPageSize >> 8);
    cdb[4] = std::uint8_t(AtaInfoPageSize);
    return r;
}

bool ParseAtaInfoReply(const std::uint8_t *reply, std::uint32_t returned, std::uint8_t *identify)
{
    std::memset(identify, 0, Size);
    if (returned < ScsiRequestSize)
        return false;
    if (reply[2] != 0) // SCSI status
        return false;
    const std::uint8_t *page = reply + ScsiHeaderSize + ScsiSenseSize;
    if (page[1] != 0x89)
        return false;
    const unsigned pageLength = unsigned(page[2]) << 8 | page[3];
    if (pageLength + 4 < 60 + Size)
        return false;
    std::memcpy(identify, page + 60, Size);
    return true;
}

} // namespace AtaIdentify
