#include "Kernel/Implementation/Images/TarvoWriter.h"

#include "Kernel/Implementation/Common/KernelVersion.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Images/TarvoFormat.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <QDateTime>

#include <cstring>
#include <vector>
#include <zlib.h>

using namespace ImageBytes;

namespace {

// Output gathered into large writes.
class Output
{
public:
    explicit Output(CPlatformFile &file) : m_file(file) { m_buffer.reserve(Capacity); }

    bool Append(const void *data, std::size_t size)
    {
        const auto *p = static_cast<const std::uint8_t *>(data);
        while (size > 0) {
            std::size_t n = std::min(size, Capacity - m_buffer.size());
            m_buffer.insert(m_buffer.end(), p, p + n);
            p += n;
            size -= n;
            if (m_buffer.size() == Capacity && !Flush())
                return false;
        }
        return true;
    }
    bool Flush()
    {
        if (m_buffer.empty())
            return true;
        if (!m_file.Write(m_flushed, std::uint32_t(m_buffer.size()), m_buffer.data()))
            return false;
        m_flushed += m_buffer.size();
        m_buffer.clear();
        return true;
    }
    std::uint64_t Position() const { return m_flushed + m_buffer.size(); }

private:
    static constexpr std::size_t Capacity = 4u << 20;
    CPlatformFile &m_file;
    std::vector<std::uint8_t> m_buffer;
    std::uint64_t m_flushed = 0;
};

bool deflateInto(int level, const std::uint8_t *in, std::size_t size, std::vector<std::uint8_t> &out,
                 std::size_t &produced)
{
    uLongf n = uLongf(out.size());
    if (compress2(out.data(), &n, in, uLong(size), level) != Z_OK)
        return false;
    produced = n;
    return true;
}

void appendString(std::vector<std::uint8_t> &block, const QString &text)
{
    for (QChar c : text) {
        block.push_back(std::uint8_t(c.unicode()));
        block.push_back(std::uint8_t(c.unicode() >> 8));
    }
    block.push_back(0);
    block.push_back(0);
}

} // namespace

CTarvoWriter::CTarvoWriter(cRoot *root, const TarvoWriteOptions &options) : m_root(root), m_options(options)
{
}

bool CTarvoWriter::Write(const QString &path, std::uint8_t sectorShift, std::uint64_t totalSectors,
                         const SectorReader &read, const Progress &progress)
{
    m_problem.clear();
    m_written = 0;
    const TarvoWriteOptions &o = m_options;
    if (totalSectors == 0 || sectorShift < 4 || sectorShift > 15 || o.sectorsPerBlock == 0 || o.level < 0 ||
        o.level > 9) {
        m_problem = QStringLiteral("parameter is not valid");
        return false;
    }
    Tarvo::Header h;
    h.firstSector = o.firstSector;
    h.totalSectors = totalSectors;
    h.sectorShift = sectorShift;
    h.mediaType = o.mediaType;
    h.sectorsPerTrack = o.sectorsPerTrack;
    h.tracksPerCylinder = o.tracksPerCylinder;
    h.version = Kernel::version().toLatin1().left(8);
    h.created = o.created ? o.created : std::uint32_t(QDateTime::currentSecsSinceEpoch());
    h.sectorsPerBlock = o.sectorsPerBlock;
    h.checksum = 1;
    const QString strings[4] = {o.description, o.model, o.identity, o.serial};
    std::vector<std::uint8_t> stringBlock;
    for (int i = 0; i < 4; ++i) {
        h.lengths[i] = std::uint32_t(strings[i].size());
        appendString(stringBlock, strings[i]);
    }
    h.stringBytes = std::uint32_t(stringBlock.size());
    const std::uint64_t blockSize = h.BlockSize();
    if (blockSize > Tarvo::MaxBlockSize || blockSize < 16) {
        m_problem = QStringLiteral("block size is not valid");
        return false;
    }

    CPlatformFile file(m_root, path, PlatformKind::File);
    if (!file.Create()) {
        m_problem = QStringLiteral("cannot create %1").arg(path);
        return false;
    }
    auto failWrite = [&]() {
        m_problem = QStringLiteral("cannot write %1").arg(path);
        file.Close(true);
        return false;
    };
    Output out(file);
    std::uint8_t header[Tarvo::HeaderSize];
    Tarvo::BuildHeader(h, header);
    if (!out.Append(header, sizeof header) || !out.Append(stringBlock.data(), stringBlock.size()))
        return failWrite();

    const std::uint64_t blocks = h.Blocks();
    const std::uint64_t perGroup = h.BlocksPerGroup();
    std::vector<std::uint8_t> data(blockSize);
    // Room for any zlib stream of one block (never more than twice the block).
    std::vector<std::uint8_t> packed(compressBound(uLong(blockSize)));
    std::vector<std::uint8_t> index;
    index.reserve(std::size_t(std::min(perGroup, blocks) * 8));
    std::vector<std::uint64_t> groups;
    std::uint32_t adler = 1;
    const std::uint32_t readChunk = std::max<std::uint32_t>(1, std::uint32_t((1u << 20) >> sectorShift));

    for (std::uint64_t b = 0; b < blocks; ++b) {
        const std::uint64_t first = b * o.sectorsPerBlock;
        const std::uint32_t sectors =
            std::uint32_t(std::min<std::uint64_t>(o.sectorsPerBlock, totalSectors - first));
        const std::size_t bytes = std::size_t(sectors) << sectorShift;
        for (std::uint32_t done = 0; done < sectors;) {
            std::uint32_t n = std::min(sectors - done, readChunk);
            std::uint32_t error = 0;
            if (!read(first + done, n, data.data() + (std::size_t(done) << sectorShift), error)) {
                m_problem = QStringLiteral("cannot read sectors %1 to %2 of the source (error %3)")
                                .arg(first + done)
                                .arg(first + done + n - 1)
                                .arg(error);
                file.Close(true);
                return false;
            }
            done += n;
        }
        adler = Tarvo::Adler(adler, data.data(), bytes);
        std::size_t produced = 0;
        if (!deflateInto(o.level, data.data(), bytes, packed, produced) || produced > 2 * blockSize) {
            m_problem = QStringLiteral("compression failed");
            file.Close(true);
            return false;
        }
        std::uint8_t offset[8];
        putLe64(offset, out.Position());
        index.insert(index.end(), offset, offset + 8);
        if (!out.Append(packed.data(), produced))
            return failWrite();

        if (index.size() == perGroup * 8 || b + 1 == blocks) {
            // The group record: its index of block offsets, checked and compressed.
            std::size_t length = 0;
            if (!deflateInto(o.level, index.data(), index.size(), packed, length) || length > 2 * blockSize) {
                m_problem = QStringLiteral("compression failed");
                file.Close(true);
                return false;
            }
            std::uint8_t head[8];
            putLe32(head, std::uint32_t(length));
            putLe32(head + 4, Tarvo::Adler(1, index.data(), index.size()));
            groups.push_back(out.Position());
            if (!out.Append(head, 8) || !out.Append(packed.data(), length))
                return failWrite();
            index.clear();
        }
        if (progress && !progress(first + sectors, totalSectors)) {
            m_problem = QStringLiteral("creation cancelled");
            file.Close(true);
            return false;
        }
    }
    for (std::uint64_t g : groups) {
        std::uint8_t entry[8];
        putLe64(entry, g);
        if (!out.Append(entry, 8))
            return failWrite();
    }
    // The trailer: the data checksum, and the header's checksum with the data checksum at 68.
    putLe32(header + 68, adler);
    std::uint8_t trailer[Tarvo::TrailerSize];
    putLe64(trailer, (std::uint64_t(adler) << 32) | Tarvo::Adler(1, header, sizeof header));
    putLe64(trailer + 8, Tarvo::TrailerMagic);
    // The image is complete only when all of it is on the medium.
    std::uint32_t flushError = 0;
    if (!out.Append(trailer, sizeof trailer) || !out.Flush() || !file.Flush(flushError))
        return failWrite();
    m_written = out.Position();
    if (!file.Close(false)) {
        m_problem = QStringLiteral("cannot close %1").arg(path);
        return false;
    }
    return true;
}
