#include "Kernel/Implementation/Raid/RaidHandle.h"

#include "Kernel/Implementation/Common/SystemError.h"

#include <QMutexLocker>

#include <algorithm>
#include <cstring>
#include <limits>

namespace {

bool MulOverflows(std::uint64_t a, std::uint64_t b, std::uint64_t &result)
{
    if (a != 0 && b > std::numeric_limits<std::uint64_t>::max() / a)
        return true;
    result = a * b;
    return false;
}

bool IsPowerOfTwo(std::uint32_t v)
{
    return v != 0 && (v & (v - 1)) == 0;
}

void XorInto(std::uint8_t *target, const std::uint8_t *source, std::size_t size)
{
    for (std::size_t i = 0; i < size; ++i)
        target[i] ^= source[i];
}

// A failed member transfer that left no code of its own.
std::uint32_t FailureCode(bool read, std::uint32_t error)
{
    if (error != 0)
        return error;
    return read ? SystemError::ReadFault : SystemError::WriteFault;
}

} // namespace

CRaidHandle::CRaidHandle(std::uint64_t owner0, std::uint64_t owner1, std::uint32_t layout,
                         const QList<cStorage *> &members, const QList<std::uint64_t> &starts,
                         const QList<std::uint64_t> &lengths, std::uint32_t sectorSize, std::uint32_t stripe,
                         std::uint64_t &total, std::int64_t byteOffset)
    : m_sectorSize(sectorSize), m_layout(layout), m_stripe(stripe), m_byteOffset(byteOffset)
{
    m_owner[0] = owner0;
    m_owner[1] = owner1;
    if (!Build(members, starts, lengths)) {
        m_totalSectors = 0;
        m_stripeBuffer.clear();
    }
    total = m_totalSectors;
}

CRaidHandle::~CRaidHandle() = default;

bool CRaidHandle::Refuse(const QString &why)
{
    m_refusal = why;
    return false;
}

bool CRaidHandle::Build(const QList<cStorage *> &members, const QList<std::uint64_t> &starts,
                        const QList<std::uint64_t> &lengths)
{
    if (m_layout == 0 || m_layout > 8)
        return Refuse(QStringLiteral("layout %1 holds no data").arg(m_layout));
    if (members.isEmpty() || starts.size() != members.size() || lengths.size() != members.size())
        return Refuse(QStringLiteral("member, start and length lists differ in size or are empty"));
    if (members.size() > 1024)
        return Refuse(QStringLiteral("too many members"));
    if (!IsPowerOfTwo(m_sectorSize) || m_sectorSize < 512 || m_sectorSize > 65536)
        return Refuse(QStringLiteral("sector size %1 is not usable").arg(m_sectorSize));

    const std::uint32_t n = static_cast<std::uint32_t>(members.size());
    std::uint32_t missing = 0;
    QList<std::uint64_t> usable;
    for (std::uint32_t i = 0; i < n; ++i) {
        cStorage *member = members[i];
        if (!member) {
            ++missing;
            usable.append(lengths[i]); // nothing to clip a missing member to
            continue;
        }
        if (member == this)
            return Refuse(QStringLiteral("the assembly cannot be its own member"));
        for (std::uint32_t j = 0; j < i; ++j)
            if (members[j] == member)
                return Refuse(QStringLiteral("member %1 occurs twice").arg(i));
        if (m_layout != 1 && member->GetBytesPerSector() != m_sectorSize)
            return Refuse(QStringLiteral("member %1 has %2-byte sectors, the assembly %3")
                              .arg(i)
                              .arg(member->GetBytesPerSector())
                              .arg(m_sectorSize));
        const std::uint64_t size = member->GetTotalSectors();
        if (starts[i] >= size)
            return Refuse(QStringLiteral("start of member %1 lies beyond its end").arg(i));
        const std::uint64_t length = std::min(lengths[i], size - starts[i]);
        if (length == 0)
            return Refuse(QStringLiteral("member %1 has no sectors to use").arg(i));
        usable.append(length);
    }

    switch (m_layout) {
    case 1:
    case 2:
        if (missing)
            return Refuse(QStringLiteral("a member is missing"));
        break;
    case 3:
    case 4:
        if (n < 2 || missing)
            return Refuse(QStringLiteral("the layout needs two or more members, all present"));
        break;
    default:
        if (n < 3 || missing > 1)
            return Refuse(QStringLiteral("the layout needs three or more members, one missing at most"));
        break;
    }

    m_members = members;
    m_starts = starts;
    m_lengths = usable;
    m_currentMember = n - 1;

    if (m_layout == 1) {
        // One member read by byte position, either from a byte offset or in blocks of `stripe` bytes.
        cStorage *member = members[0];
        const std::uint32_t mss = member->GetBytesPerSector();
        if (mss == 0)
            return Refuse(QStringLiteral("the member has no sector size"));
        std::uint64_t bytes = 0;
        if (m_byteOffset >= 0) {
            const std::uint64_t memberBytes = member->GetSize();
            if (static_cast<std::uint64_t>(m_byteOffset) >= memberBytes)
                return Refuse(QStringLiteral("the byte offset lies beyond the member"));
            bytes = memberBytes - static_cast<std::uint64_t>(m_byteOffset);
            std::uint64_t given = 0;
            if (!MulOverflows(lengths[0], mss, given))
                bytes = std::min(bytes, given);
        } else {
            if (m_stripe == 0 || m_stripe % mss != 0 || m_stripe > MaxStripeBytes)
                return Refuse(
                    QStringLiteral("block size %1 is not a whole number of member sectors").arg(m_stripe));
            if (MulOverflows(usable[0], mss, bytes))
                return Refuse(QStringLiteral("the member is too large"));
            m_stripeBuffer.resize(static_cast<qsizetype>(m_stripe));
        }
        m_totalSectors = bytes / m_sectorSize;
        if (m_totalSectors == 0)
            return Refuse(QStringLiteral("the member holds less than one sector"));
        return true;
    }

    if (m_layout == 2) {
        std::uint64_t sum = 0;
        for (std::uint64_t l : usable) {
            if (l > std::numeric_limits<std::uint64_t>::max() - sum)
                return Refuse(QStringLiteral("the assembly is too large"));
            sum += l;
        }
        m_totalSectors = sum;
        return true;
    }

    // Layouts 3 to 8 use the common length on every member.
    std::uint64_t common = std::numeric_limits<std::uint64_t>::max();
    for (std::uint32_t i = 0; i < n; ++i)
        if (members[i] || usable[i] != cStorage::NoSector)
            common = std::min(common, usable[i]);
    if (common == std::numeric_limits<std::uint64_t>::max() || common == 0)
        return Refuse(QStringLiteral("the members have no common length"));
    if (m_layout != 4) {
        std::uint64_t stripeBytes = 0;
        if (m_stripe == 0 || MulOverflows(m_stripe, m_sectorSize, stripeBytes) ||
            stripeBytes > MaxStripeBytes)
            return Refuse(QStringLiteral("stripe of %1 sectors is not usable").arg(m_stripe));
        common -= common % m_stripe;
        if (common == 0)
            return Refuse(QStringLiteral("the members hold less than one stripe"));
        if (IsParityLayout(m_layout))
            m_stripeBuffer.resize(static_cast<qsizetype>(stripeBytes));
    }
    for (auto &l : m_lengths)
        l = common;
    std::uint64_t total = 0;
    if (m_layout == 3 && MulOverflows(common, n, total))
        return Refuse(QStringLiteral("the assembly is too large"));
    if (m_layout == 4)
        total = common;
    if (IsParityLayout(m_layout) && MulOverflows(common, n - 1, total))
        return Refuse(QStringLiteral("the assembly is too large"));
    m_totalSectors = total;
    return true;
}

cStorage *CRaidHandle::GetMember(std::uint32_t index) const
{
    return index < GetMemberCount() ? m_members[index] : nullptr;
}

std::uint64_t CRaidHandle::GetMemberStart(std::uint32_t index) const
{
    return index < GetMemberCount() ? m_starts[index] : NoSector;
}

std::uint64_t CRaidHandle::GetMemberLength(std::uint32_t index) const
{
    return index < GetMemberCount() ? m_lengths[index] : 0;
}

std::uint64_t CRaidHandle::UserValue(int index, std::uint64_t value)
{
    QMutexLocker lock(&m_lock);
    std::uint64_t &slot = m_user[index ? 1 : 0];
    const std::uint64_t old = slot;
    slot = value;
    return old;
}

QString CRaidHandle::GetDisplayName() const
{
    return QStringLiteral("RAID Assembly (%1, %2 Members)")
        .arg(RaidLayoutName(m_layout))
        .arg(m_members.size());
}

bool CRaidHandle::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                            std::uint32_t &error)
{
    error = SystemError::Success;
    if (count == 0)
        return true;
    if (m_totalSectors == 0) {
        error = SystemError::InvalidFunction;
        return false;
    }
    if (!buffer) {
        error = SystemError::InvalidParameter;
        return false;
    }
    if (first >= m_totalSectors) {
        error = SystemError::HandleEof;
        return false;
    }
    auto *bytes = static_cast<std::uint8_t *>(buffer);
    const std::uint64_t left = m_totalSectors - first;
    const std::uint32_t inside = left < count ? static_cast<std::uint32_t>(left) : count;

    QMutexLocker lock(&m_lock);
    bool ok = Transfer(read, first, inside, bytes, error);
    if (inside < count) {
        // The part past the end exists nowhere: reads see zeros, and the request is reported failed.
        if (read)
            std::memset(bytes + std::uint64_t(inside) * m_sectorSize, 0,
                        std::uint64_t(count - inside) * m_sectorSize);
        if (ok)
            error = SystemError::HandleEof;
        ok = false;
    }
    return ok;
}

bool CRaidHandle::Transfer(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                           std::uint32_t &error)
{
    switch (m_layout) {
    case 1:
        if (!read) {
            error = SystemError::AccessDenied;
            return false;
        }
        return TransferSingle(first, count, buffer, error);
    case 2:
        return TransferConcatenated(read, first, count, buffer, error);
    case 3:
        return TransferStriped(read, first, count, buffer, error);
    case 4:
        return TransferMirrored(read, first, count, buffer, error);
    case 5:
    case 6:
    case 7:
    case 8:
        if (!read) {
            error = SystemError::InvalidFunction;
            return false;
        }
        return ReadParity(first, count, buffer, error);
    default:
        error = SystemError::InvalidFunction;
        return false;
    }
}

bool CRaidHandle::MemberTransfer(std::uint32_t member, bool read, std::uint64_t sector, std::uint32_t count,
                                 std::uint8_t *buffer, std::uint32_t &error)
{
    cStorage *storage = m_members[member];
    if (!storage) {
        error = SystemError::DevNotExist;
        return false;
    }
    std::uint32_t code = 0;
    const bool ok = read ? storage->ReadSectors(m_starts[member] + sector, count, buffer, code)
                         : storage->WriteSectors(m_starts[member] + sector, count, buffer, code);
    if (!ok)
        error = FailureCode(read, code);
    return ok;
}

bool CRaidHandle::TransferSingle(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                                 std::uint32_t &error)
{
    cStorage *member = m_members[0];
    const std::uint64_t pos = first * m_sectorSize;
    const std::uint64_t length = std::uint64_t(count) * m_sectorSize;
    if (m_byteOffset >= 0) {
        std::uint32_t code = 0;
        if (member->ReadBytes(static_cast<std::uint64_t>(m_byteOffset) + pos, length, buffer, code))
            return true;
        error = FailureCode(true, code);
        return false;
    }

    // Blocks of `stripe` bytes through the block buffer.
    const std::uint32_t mss = member->GetBytesPerSector();
    const std::uint64_t blockSectors = m_stripe / mss;
    std::uint64_t done = 0;
    while (done < length) {
        const std::uint64_t at = pos + done;
        const std::int64_t block = static_cast<std::int64_t>(at / m_stripe);
        const std::uint64_t within = at % m_stripe;
        const std::uint64_t n = std::min<std::uint64_t>(length - done, m_stripe - within);
        if (block != m_cachedBlock) {
            const std::uint64_t blockFirst = std::uint64_t(block) * blockSectors;
            const std::uint64_t available = m_lengths[0] - std::min(m_lengths[0], blockFirst);
            const std::uint64_t sectors = std::min(blockSectors, available);
            auto *blockBuffer = reinterpret_cast<std::uint8_t *>(m_stripeBuffer.data());
            std::memset(blockBuffer, 0, m_stripe);
            std::uint32_t code = 0;
            if (sectors == 0 ||
                !member->ReadSectors(m_starts[0] + blockFirst, static_cast<std::uint32_t>(sectors),
                                     blockBuffer, code)) {
                m_cachedBlock = -1;
                error = FailureCode(true, code);
                return false;
            }
            m_cachedBlock = block;
        }
        std::memcpy(buffer + done, m_stripeBuffer.constData() + within, n);
        done += n;
    }
    return true;
}

bool CRaidHandle::TransferConcatenated(bool read, std::uint64_t first, std::uint32_t count,
                                       std::uint8_t *buffer, std::uint32_t &error)
{
    bool ok = true;
    std::uint64_t base = 0;
    std::uint64_t sector = first;
    std::uint32_t left = count;
    for (std::uint32_t m = 0; m < GetMemberCount() && left; ++m) {
        const std::uint64_t length = m_lengths[m];
        if (sector < base + length) {
            const std::uint64_t inMember = base + length - sector;
            const std::uint32_t n = inMember < left ? static_cast<std::uint32_t>(inMember) : left;
            std::uint32_t code = 0;
            if (!MemberTransfer(m, read, sector - base, n, buffer, code)) {
                if (ok)
                    error = code;
                ok = false;
            }
            buffer += std::uint64_t(n) * m_sectorSize;
            sector += n;
            left -= n;
        }
        base += length;
    }
    return ok && left == 0;
}

bool CRaidHandle::TransferStriped(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                                  std::uint32_t &error)
{
    const std::uint32_t members = GetMemberCount();
    const std::uint64_t common = m_lengths[0];
    bool ok = true;
    std::uint64_t sector = first;
    std::uint32_t left = count;
    while (left) {
        const RaidPlace place = PlaceStriped(sector, members, m_stripe);
        const std::uint32_t n = std::min(left, place.leftInChunk);
        std::uint32_t inside = n;
        if (place.memberSector + n > common)
            inside =
                place.memberSector >= common ? 0 : static_cast<std::uint32_t>(common - place.memberSector);
        std::uint32_t code = 0;
        if (inside && !MemberTransfer(place.member, read, place.memberSector, inside, buffer, code)) {
            if (ok)
                error = code;
            ok = false;
        }
        if (inside < n) {
            if (read)
                std::memset(buffer + std::uint64_t(inside) * m_sectorSize, 0,
                            std::uint64_t(n - inside) * m_sectorSize);
            if (ok)
                error = SystemError::HandleEof;
            ok = false;
        }
        buffer += std::uint64_t(n) * m_sectorSize;
        sector += n;
        left -= n;
    }
    return ok;
}

bool CRaidHandle::TransferMirrored(bool read, std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                                   std::uint32_t &error)
{
    const std::uint32_t members = GetMemberCount();
    if (!read) {
        // Every copy is written; one failing member fails the write, the others are still written.
        bool ok = true;
        for (std::uint32_t m = 0; m < members; ++m) {
            std::uint32_t code = 0;
            if (!MemberTransfer(m, false, first, count, buffer, code)) {
                if (ok)
                    error = code;
                ok = false;
            }
        }
        return ok;
    }
    // Reads take turns over the members; a member that is missing or fails hands the read on to the
    // next, until every copy has been tried.
    m_currentMember = (m_currentMember + 1) % members;
    const std::uint32_t turn = m_currentMember;
    for (std::uint32_t i = 0; i < members; ++i) {
        const std::uint32_t m = (turn + i) % members;
        std::uint32_t code = 0;
        if (MemberTransfer(m, true, first, count, buffer, code)) {
            error = SystemError::Success;
            return true;
        }
        if (i == 0)
            error = code;
    }
    return false;
}

bool CRaidHandle::ReadParity(std::uint64_t first, std::uint32_t count, std::uint8_t *buffer,
                             std::uint32_t &error)
{
    const std::uint32_t members = GetMemberCount();
    const std::uint64_t common = m_lengths[0];
    auto *scratch = reinterpret_cast<std::uint8_t *>(m_stripeBuffer.data());
    bool ok = true;
    std::uint64_t sector = first;
    std::uint32_t left = count;
    while (left) {
        const RaidPlace place = PlaceParity(m_layout, sector, members, m_stripe);
        const std::uint32_t n = std::min(left, place.leftInChunk);
        std::uint32_t inside = n;
        if (place.memberSector + n > common)
            inside =
                place.memberSector >= common ? 0 : static_cast<std::uint32_t>(common - place.memberSector);
        const std::size_t bytes = std::size_t(inside) * m_sectorSize;
        std::uint32_t code = 0;
        if (inside && !MemberTransfer(place.member, true, place.memberSector, inside, buffer, code)) {
            // Rebuild the chunk: parity XOR every other data member of the row.
            bool rebuilt = MemberTransfer(place.parity, true, place.memberSector, inside, buffer, code);
            for (std::uint32_t m = 0; rebuilt && m < members; ++m) {
                if (m == place.parity || m == place.member)
                    continue;
                rebuilt = MemberTransfer(m, true, place.memberSector, inside, scratch, code);
                if (rebuilt)
                    XorInto(buffer, scratch, bytes);
            }
            if (!rebuilt) {
                if (ok)
                    error = code;
                ok = false;
            }
        }
        if (inside < n) {
            std::memset(buffer + bytes, 0, std::size_t(n - inside) * m_sectorSize);
            if (ok)
                error = SystemError::HandleEof;
            ok = false;
        }
        buffer += std::uint64_t(n) * m_sectorSize;
        sector += n;
        left -= n;
    }
    return ok;
}

bool CRaidHandle::ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error)
{
    return ReadWrite(true, first, count, buffer, error);
}

bool CRaidHandle::WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                               std::uint32_t &error)
{
    return ReadWrite(false, first, count, const_cast<void *>(buffer), error);
}

bool CRaidHandle::ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error)
{
    return ByteTransfer(true, offset, length, static_cast<std::uint8_t *>(buffer), error);
}

bool CRaidHandle::WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                             std::uint32_t &error)
{
    return ByteTransfer(false, offset, length, static_cast<std::uint8_t *>(const_cast<void *>(buffer)),
                        error);
}

bool CRaidHandle::Flush(std::uint32_t &error)
{
    QMutexLocker lock(&m_lock);
    error = 0;
    bool ok = true;
    for (cStorage *member : m_members) {
        std::uint32_t e = 0;
        if (member && !member->Flush(e) && ok) {
            ok = false;
            error = e;
        }
    }
    return ok;
}

bool CRaidHandle::ByteTransfer(bool read, std::uint64_t offset, std::uint64_t length, std::uint8_t *buffer,
                               std::uint32_t &error)
{
    error = SystemError::Success;
    if (length == 0)
        return true;
    if (!buffer) {
        error = SystemError::InvalidParameter;
        return false;
    }
    const std::uint64_t size = GetSize();
    const std::uint64_t inside = offset >= size ? 0 : std::min(length, size - offset);
    bool ok = true;

    QMutexLocker lock(&m_lock);
    const std::uint32_t ss = m_sectorSize;
    QByteArray sectorBuffer;
    std::uint64_t done = 0;
    while (ok && done < inside) {
        const std::uint64_t pos = offset + done;
        const std::uint64_t sector = pos / ss;
        const std::uint64_t within = pos % ss;
        std::uint32_t code = 0;
        if (within == 0 && inside - done >= ss) {
            // Whole sectors straight from or into the caller's buffer.
            const std::uint64_t whole = std::min<std::uint64_t>((inside - done) / ss, 1u << 16);
            ok = ReadWrite(read, sector, static_cast<std::uint32_t>(whole), buffer + done, code);
            done += whole * ss;
        } else {
            // A part of one sector: read it, and for a write change it and write it back.
            const std::uint64_t n = std::min<std::uint64_t>(inside - done, ss - within);
            sectorBuffer.resize(ss);
            auto *sb = reinterpret_cast<std::uint8_t *>(sectorBuffer.data());
            ok = ReadWrite(true, sector, 1, sb, code);
            if (ok && read)
                std::memcpy(buffer + done, sb + within, n);
            if (ok && !read) {
                std::memcpy(sb + within, buffer + done, n);
                ok = ReadWrite(false, sector, 1, sb, code);
            }
            done += n;
        }
        if (!ok)
            error = code;
    }
    if (read && done < length)
        std::memset(buffer + std::min(done, length), 0, length - std::min(done, length));
    if (ok && inside < length) {
        error = SystemError::HandleEof;
        ok = false;
    }
    return ok;
}
