#include "Kernel/Implementation/Images/ImageHandleTarvo.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageBytes.h"

#include <algorithm>
#include <cstring>
#include <zlib.h>

using namespace ImageBytes;

CImageHandle_Tarvo::CImageHandle_Tarvo(cRoot *root, const QStringList &files)
    : CImageHandle(root, ImageKind::OwnImage, 9)
{
    if (!OpenFiles(files)) {
        Fail(QStringLiteral("image files cannot be opened"));
        return;
    }
    Parse();
}

CImageHandle_Tarvo::CImageHandle_Tarvo(cRoot *root, cStorage *source, const QString &name)
    : CImageHandle(root, ImageKind::OwnImage, 9)
{
    if (!OpenKernelFile(source, name)) {
        Fail(QStringLiteral("image file cannot be opened"));
        return;
    }
    Parse();
}

void CImageHandle_Tarvo::Parse()
{
    const std::uint64_t size = GetConcatenatedSize();
    std::uint32_t error = 0;
    if (size < Tarvo::HeaderSize + 8 + 8 + Tarvo::TrailerSize) {
        Fail(QStringLiteral("file is too small for a Tarvo disk image"));
        return;
    }
    std::uint8_t header[Tarvo::HeaderSize];
    if (!TransferBytes(true, 0, sizeof header, header, error)) {
        Fail(QStringLiteral("header cannot be read"));
        return;
    }
    QString problem;
    if (!Tarvo::ParseHeader(header, m_header, problem)) {
        Fail(problem);
        return;
    }
    if (m_header.checksum != 1) {
        Fail(QStringLiteral("header checksum field is not the start value"));
        return;
    }
    std::uint8_t trailer[Tarvo::TrailerSize];
    if (!TransferBytes(true, size - Tarvo::TrailerSize, sizeof trailer, trailer, error)) {
        Fail(QStringLiteral("trailer cannot be read"));
        return;
    }
    if (le64(trailer + 8) != Tarvo::TrailerMagic) {
        Fail(QStringLiteral("trailer signature is not valid"));
        return;
    }
    const std::uint64_t sums = le64(trailer);
    m_dataAdler = std::uint32_t(sums >> 32);
    putLe32(header + 68, m_dataAdler);
    if (Tarvo::Adler(1, header, sizeof header) != std::uint32_t(sums)) {
        Fail(QStringLiteral("header checksum does not match"));
        return;
    }
    putLe32(header + 68, 1);
    m_headerBytes = QByteArray(reinterpret_cast<const char *>(header), sizeof header);

    // The string block, the group table and the trailer must fit the file in this order.
    const std::uint64_t groups = m_header.Groups();
    m_dataStart = Tarvo::HeaderSize + std::uint64_t(m_header.stringBytes);
    const std::uint64_t room = size - Tarvo::TrailerSize;
    if (m_dataStart > room || groups > (room - m_dataStart) / 8) {
        Fail(QStringLiteral("string block or group table does not fit the file"));
        return;
    }
    m_tableStart = room - groups * 8;
    m_stringBlock.resize(m_header.stringBytes);
    if (!TransferBytes(true, Tarvo::HeaderSize, m_header.stringBytes, m_stringBlock.data(), error)) {
        Fail(QStringLiteral("string block cannot be read"));
        return;
    }
    const auto *units = reinterpret_cast<const std::uint8_t *>(m_stringBlock.constData());
    std::uint64_t at = 0;
    for (int i = 0; i < 4; ++i) {
        const std::uint32_t n = m_header.lengths[i];
        QString text;
        text.reserve(n);
        for (std::uint32_t k = 0; k < n; ++k)
            text.append(QChar(le16(units + (at + k) * 2)));
        if (le16(units + (at + n) * 2) != 0) {
            Fail(QStringLiteral("string %1 is not terminated").arg(i + 1));
            return;
        }
        m_strings[i] = text;
        at += n + 1;
    }
    QByteArray table(qsizetype(groups * 8), '\0');
    for (std::uint64_t done = 0; done < groups * 8;) {
        std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(groups * 8 - done, 1u << 20));
        if (!TransferBytes(true, m_tableStart + done, n, table.data() + done, error)) {
            Fail(QStringLiteral("group table cannot be read"));
            return;
        }
        done += n;
    }
    m_groups.resize(groups);
    for (std::uint64_t g = 0; g < groups; ++g) {
        m_groups[g] = le64(reinterpret_cast<const std::uint8_t *>(table.constData()) + g * 8);
        // A group record (8 bytes at least) lies between the string block and the group table.
        if (m_groups[g] < m_dataStart || m_groups[g] > m_tableStart - 8 || m_tableStart < 8) {
            Fail(QStringLiteral("group table entry %1 points outside the image").arg(g));
            return;
        }
    }
    m_sectorShift = m_header.sectorShift;
    m_totalSectors = m_header.totalSectors;
    m_writable = 0;
}

QByteArray CImageHandle_Tarvo::ImageInformation() const
{
    return m_headerBytes + m_stringBlock;
}

void CImageHandle_Tarvo::Describe(DeviceInfo &info) const
{
    CImageHandle::Describe(info);
    info.sectorsPerTrack = m_header.sectorsPerTrack;
    info.tracksPerCylinder = m_header.tracksPerCylinder;
    if (m_header.mediaType != 0)
        info.mediaType = MediaType(m_header.mediaType);
    info.model = m_strings[1];
    info.serialControl = m_strings[3];
}

bool CImageHandle_Tarvo::Inflate(const QByteArray &in, std::uint8_t *out, std::uint64_t capacity,
                                 std::uint64_t &produced)
{
    produced = 0;
    z_stream z{};
    if (inflateInit(&z) != Z_OK)
        return false;
    z.next_in = reinterpret_cast<Bytef *>(const_cast<char *>(in.constData()));
    z.avail_in = uInt(in.size());
    z.next_out = out;
    z.avail_out = uInt(capacity);
    int rc = inflate(&z, Z_FINISH);
    produced = z.total_out;
    inflateEnd(&z);
    // The stream must end inside the room given and use all of its input.
    return rc == Z_STREAM_END && z.avail_in == 0;
}

bool CImageHandle_Tarvo::LoadGroup(std::uint64_t group, QString *problem)
{
    if (m_groupNumber == std::int64_t(group))
        return true;
    m_groupNumber = -1;
    const std::uint64_t g = m_groups[group];
    const std::uint64_t blockSize = m_header.BlockSize();
    std::uint8_t head[8];
    std::uint32_t error = 0;
    if (!TransferBytes(true, g, 8, head, error)) {
        if (problem)
            *problem = QStringLiteral("group %1 cannot be read").arg(group);
        return false;
    }
    const std::uint32_t length = le32(head);
    const std::uint32_t adler = le32(head + 4);
    if (length == 0 || length > 2 * blockSize || length > m_tableStart - g - 8) {
        if (problem)
            *problem = QStringLiteral("group %1 has a bad length").arg(group);
        return false;
    }
    QByteArray packed(qsizetype(length), '\0');
    if (!TransferBytes(true, g + 8, length, packed.data(), error)) {
        if (problem)
            *problem = QStringLiteral("group %1 cannot be read").arg(group);
        return false;
    }
    const std::uint64_t perGroup = m_header.BlocksPerGroup();
    const std::uint64_t blocks = m_header.Blocks();
    const std::uint64_t count = std::min(perGroup, blocks - group * perGroup);
    std::vector<std::uint8_t> raw(blockSize);
    std::uint64_t produced = 0;
    if (!Inflate(packed, raw.data(), blockSize, produced) || produced != count * 8) {
        if (problem)
            *problem = QStringLiteral("group %1 does not inflate to its index").arg(group);
        return false;
    }
    if (Tarvo::Adler(1, raw.data(), produced) != adler) {
        if (problem)
            *problem = QStringLiteral("group %1 index checksum does not match").arg(group);
        return false;
    }
    m_index.resize(count + 1);
    for (std::uint64_t i = 0; i < count; ++i)
        m_index[i] = le64(raw.data() + i * 8);
    m_index[count] = g; // the record follows the group's last block
    for (std::uint64_t i = 0; i < count; ++i) {
        if (m_index[i] < m_dataStart || m_index[i] >= m_index[i + 1] ||
            m_index[i + 1] - m_index[i] > 2 * blockSize) {
            if (problem)
                *problem = QStringLiteral("group %1 places block %2 badly").arg(group).arg(i);
            return false;
        }
    }
    m_groupNumber = std::int64_t(group);
    return true;
}

bool CImageHandle_Tarvo::LoadBlock(std::uint64_t block, QString *problem)
{
    if (m_blockNumber == std::int64_t(block))
        return true;
    m_blockNumber = -1;
    const std::uint64_t perGroup = m_header.BlocksPerGroup();
    const std::uint64_t group = block / perGroup;
    if (!LoadGroup(group, problem))
        return false;
    const std::uint64_t i = block % perGroup;
    const std::uint64_t at = m_index[i], length = m_index[i + 1] - m_index[i];
    QByteArray packed(qsizetype(length), '\0');
    std::uint32_t error = 0;
    if (!TransferBytes(true, at, std::uint32_t(length), packed.data(), error)) {
        if (problem)
            *problem = QStringLiteral("block %1 cannot be read").arg(block);
        return false;
    }
    const std::uint64_t blockSize = m_header.BlockSize();
    // The last block may hold fewer sectors than a whole block.
    const std::uint64_t sectors = std::min<std::uint64_t>(
        m_header.sectorsPerBlock, m_header.totalSectors - block * m_header.sectorsPerBlock);
    const std::uint64_t needed = sectors << m_header.sectorShift;
    m_block.resize(blockSize);
    std::uint64_t produced = 0;
    if (!Inflate(packed, m_block.data(), blockSize, produced) || produced < needed) {
        if (problem)
            *problem = QStringLiteral("block %1 does not inflate").arg(block);
        return false;
    }
    m_blockBytes = produced;
    m_blockNumber = std::int64_t(block);
    return true;
}

bool CImageHandle_Tarvo::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                                   std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    if (!CheckRange(first, count, error))
        return false;
    if (!read) {
        error = SystemError::AccessDenied;
        return false;
    }
    auto *out = static_cast<std::uint8_t *>(buffer);
    const std::uint32_t spb = m_header.sectorsPerBlock;
    while (count > 0) {
        const std::uint64_t block = first / spb;
        const std::uint32_t inBlock = std::uint32_t(first % spb);
        const std::uint32_t n = std::min(count, spb - inBlock);
        if (!LoadBlock(block, nullptr)) {
            error = 0;
            return false;
        }
        const std::size_t bytes = std::size_t(n) << m_sectorShift;
        std::memcpy(out, m_block.data() + (std::size_t(inBlock) << m_sectorShift), bytes);
        out += bytes;
        first += n;
        count -= n;
    }
    return true;
}

bool CImageHandle_Tarvo::Canonical(const QByteArray &packed, const std::uint8_t *data, std::size_t size,
                                   int &level)
{
    if (packed.size() < 2)
        return false;
    // The levels that give the header's level field.
    static const QList<int> byField[4] = {{1, 0}, {2, 3, 4, 5}, {6}, {7, 8, 9}};
    const QList<int> &candidates = byField[(std::uint8_t(packed[1]) >> 6) & 3];
    QList<int> order = candidates;
    if (candidates.contains(level)) {
        order.removeAll(level);
        order.prepend(level);
    }
    std::vector<std::uint8_t> again(compressBound(uLong(size)));
    for (int l : order) {
        uLongf n = uLongf(again.size());
        if (compress2(again.data(), &n, data, uLong(size), l) != Z_OK)
            continue;
        if (n == uLongf(packed.size()) && std::memcmp(again.data(), packed.constData(), n) == 0) {
            level = l;
            return true;
        }
    }
    return false;
}

bool CImageHandle_Tarvo::VerifyGroupRecord(std::uint64_t group, int &level, QString &problem)
{
    // The group index as stored: its inflated offsets are in m_index (the last entry is the
    // record's own offset).
    const std::uint64_t g = m_groups[group];
    std::uint8_t head[8];
    std::uint32_t error = 0;
    QByteArray packed;
    std::vector<std::uint8_t> index((m_index.size() - 1) * 8);
    for (std::size_t k = 0; k + 1 < m_index.size(); ++k)
        putLe64(index.data() + k * 8, m_index[k]);
    if (!TransferBytes(true, g, 8, head, error) || !ReadPacked(g + 8, le32(head), packed) ||
        !Canonical(packed, index.data(), index.size(), level)) {
        problem = QStringLiteral("group %1 is not stored as it was written").arg(group);
        return false;
    }
    return true;
}

bool CImageHandle_Tarvo::ReadPacked(std::uint64_t offset, std::uint64_t length, QByteArray &packed)
{
    packed.resize(qsizetype(length));
    std::uint32_t error = 0;
    return TransferBytes(true, offset, std::uint32_t(length), packed.data(), error);
}

bool CImageHandle_Tarvo::Verify(const std::function<bool(std::uint64_t, std::uint64_t)> &progress,
                                QString &problem)
{
    QMutexLocker locker(&m_lock);
    if (!IsValid()) {
        problem = m_problem.isEmpty() ? QStringLiteral("image is not valid") : m_problem;
        return false;
    }
    const std::uint64_t blocks = m_header.Blocks();
    std::uint32_t adler = 1;
    int level = -1;
    for (std::uint64_t b = 0; b < blocks; ++b) {
        // Every block is inflated afresh, so that its checksum is computed from the file.
        m_blockNumber = -1;
        if (b % m_header.BlocksPerGroup() == 0)
            m_groupNumber = -1;
        if (!LoadBlock(b, &problem))
            return false;
        adler = Tarvo::Adler(adler, m_block.data(), m_blockBytes);
        const std::uint64_t i = b % m_header.BlocksPerGroup();
        QByteArray packed;
        if (!ReadPacked(m_index[i], m_index[i + 1] - m_index[i], packed) ||
            !Canonical(packed, m_block.data(), std::size_t(m_blockBytes), level)) {
            problem = QStringLiteral("block %1 is not stored as it was written").arg(b);
            return false;
        }
        if (i + 1 == m_index.size() - 1 && !VerifyGroupRecord(b / m_header.BlocksPerGroup(), level, problem))
            return false;
        if (progress && (b % 64 == 0 || b + 1 == blocks) && !progress(b + 1, blocks)) {
            problem = QStringLiteral("verification stopped");
            return false;
        }
    }
    if (adler != m_dataAdler) {
        problem = QStringLiteral("data checksum does not match (image %1, data %2)")
                      .arg(m_dataAdler, 8, 16, QLatin1Char('0'))
                      .arg(adler, 8, 16, QLatin1Char('0'));
        return false;
    }
    return true;
}
