#include "Kernel/Implementation/Images/ImageHandleVMWare.h"

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Images/ImageBytes.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

#include <QFileInfo>

#include <algorithm>
#include <cstring>

using namespace ImageBytes;

namespace {

constexpr std::uint32_t HeaderSize = 512;
constexpr std::uint64_t MaxDescriptorBytes = 1u << 20;
constexpr int MaxExtents = 4096;
constexpr std::uint64_t MaxGrainSectors = 1u << 20;
constexpr std::uint64_t MaxDirectoryEntries = 1u << 24;

// "ddb.geometry.sectors="63"" (spaces already removed) -> 63; 0 when malformed.
std::uint32_t quotedNumber(const QByteArray &value)
{
    if (value.size() < 3 || !value.startsWith('"') || !value.endsWith('"'))
        return 0;
    bool ok = false;
    std::uint32_t v = value.mid(1, value.size() - 2).toUInt(&ok);
    return ok ? v : 0;
}

} // namespace

CImageHandle_VMWare::Descriptor CImageHandle_VMWare::ParseDescriptor(const QByteArray &text)
{
    Descriptor d;
    QByteArray normal = text;
    normal.replace('\r', '\n');
    const QList<QByteArray> lines = normal.split('\n');
    for (const QByteArray &raw : lines) {
        const QByteArray line = raw.trimmed();
        QByteArray compact = line;
        compact.replace(' ', QByteArray()).replace('\t', QByteArray());
        if (compact == "version=1")
            d.version1 = true;
        else if (compact.startsWith("ddb.geometry.sectors="))
            d.sectorsPerTrack = quotedNumber(compact.mid(21));
        else if (compact.startsWith("ddb.geometry.heads="))
            d.heads = quotedNumber(compact.mid(19));

        const QByteArray upper = line.toUpper();
        ExtentLine extent;
        int at = 0;
        if (upper.startsWith("RW ")) {
            extent.access = AccessReadWrite;
            at = 3;
        } else if (upper.startsWith("RDONLY ")) {
            extent.access = AccessReadOnly;
            at = 7;
        } else if (upper.startsWith("NOACCESS ")) {
            extent.access = AccessNone;
            at = 9;
        } else {
            continue;
        }
        // size in sectors, "SPARSE", the file name in double quotes
        QByteArray rest = line.mid(at).trimmed();
        int space = rest.indexOf(' ');
        bool ok = false;
        extent.sectors = space > 0 ? rest.left(space).toULongLong(&ok) : 0;
        if (!ok || extent.sectors == 0)
            break;
        rest = rest.mid(space + 1).trimmed();
        if (!rest.toUpper().startsWith("SPARSE "))
            break;
        rest = rest.mid(7).trimmed();
        int close = rest.indexOf('"', 1);
        if (!rest.startsWith('"') || close < 2)
            break;
        extent.file = QString::fromUtf8(rest.mid(1, close - 1));
        if (d.extents.size() >= MaxExtents)
            break;
        d.extents.append(extent);
    }
    return d;
}

bool CImageHandle_VMWare::LooksLikeDescriptor(const QByteArray &text)
{
    // Text, possibly padded with zeros to a whole sector.
    const qsizetype end = text.indexOf('\0');
    if (end >= 0) {
        for (qsizetype i = end; i < text.size(); ++i)
            if (text[i] != '\0')
                return false;
    }
    Descriptor d = ParseDescriptor(end >= 0 ? text.left(end) : text);
    return d.version1 && !d.extents.isEmpty();
}

CImageHandle_VMWare::CImageHandle_VMWare(cRoot *root, const QString &file)
    : CImageHandle(root, ImageKind::VmWare, 9)
{
    if (!OpenFiles({file})) {
        Fail(QStringLiteral("image file cannot be opened"));
        return;
    }
    OpenFirst(file);
}

CImageHandle_VMWare::CImageHandle_VMWare(cRoot *root, cStorage *source, const QString &name)
    : CImageHandle(root, ImageKind::VmWare, 9)
{
    if (!OpenKernelFile(source, name)) {
        Fail(QStringLiteral("image file cannot be opened"));
        return;
    }
    OpenFirst(QString());
}

bool CImageHandle_VMWare::ReadFileBytes(int index, std::uint64_t offset, std::uint32_t size, void *buffer,
                                        std::uint32_t &error)
{
    error = 0;
    const std::uint64_t fileSize = GetFileSize(index);
    if (offset > fileSize || size > fileSize - offset) {
        error = SystemError::HandleEof;
        return false;
    }
    if (!m_files[index]->Read(offset, size, buffer)) {
        error = m_files[index]->GetError();
        return false;
    }
    return true;
}

bool CImageHandle_VMWare::ReadSparse(int index, Extent &extent, std::uint64_t &capacity,
                                     std::uint64_t &descOffset, std::uint64_t &descSize)
{
    std::uint8_t h[HeaderSize];
    std::uint32_t error = 0;
    if (!ReadFileBytes(index, 0, HeaderSize, h, error)) {
        Fail(QStringLiteral("sparse header cannot be read"));
        return false;
    }
    const std::uint64_t fileSize = GetFileSize(index);
    capacity = le64(h + 12);
    extent.grainSize = le64(h + 20);
    descOffset = le64(h + 28);
    descSize = le64(h + 36);
    const std::uint32_t tableEntries = le32(h + 44);
    const std::uint64_t redundant = le64(h + 48);
    const std::uint64_t directory = le64(h + 56);
    if (le32(h) != SparseMagic || le32(h + 4) != 1 || le32(h + 8) != 3) {
        Fail(QStringLiteral("sparse header is not valid (magic, version or flags)"));
        return false;
    }
    if (h[72] != 0) {
        Fail(QStringLiteral("extent was not shut down cleanly"));
        return false;
    }
    if (le16(h + 77) != 0) {
        Fail(QStringLiteral("compressed extents are not supported"));
        return false;
    }
    if (capacity == 0 || !isPowerOfTwo(extent.grainSize) || extent.grainSize > MaxGrainSectors ||
        tableEntries != GrainTableEntries || redundant == 0 || directory == 0) {
        Fail(QStringLiteral("sparse header is not valid (capacity, grain or tables)"));
        return false;
    }
    if ((descOffset != 0) != (descSize != 0) || descOffset > fileSize / 512 ||
        descSize > fileSize / 512 - descOffset) {
        Fail(QStringLiteral("embedded descriptor lies outside the file"));
        return false;
    }
    const std::uint64_t grains = capacity / extent.grainSize + (capacity % extent.grainSize ? 1 : 0);
    const std::uint64_t entries = grains / GrainTableEntries + (grains % GrainTableEntries ? 1 : 0);
    if (entries > MaxDirectoryEntries || directory > fileSize / 512 ||
        entries * 4 > fileSize - directory * 512) {
        Fail(QStringLiteral("grain directory lies outside the file"));
        return false;
    }
    std::vector<std::uint8_t> raw(entries * 4);
    if (!ReadFileBytes(index, directory * 512, std::uint32_t(raw.size()), raw.data(), error)) {
        Fail(QStringLiteral("grain directory cannot be read"));
        return false;
    }
    extent.directory.resize(entries);
    for (std::size_t i = 0; i < entries; ++i)
        extent.directory[i] = le32(raw.data() + i * 4);
    extent.file = index;
    return true;
}

void CImageHandle_VMWare::OpenFirst(const QString &file)
{
    const std::uint64_t size = GetFileSize(0);
    QByteArray head(int(std::min<std::uint64_t>(size, HeaderSize)), '\0');
    std::uint32_t error = 0;
    if (head.isEmpty() || !ReadFileBytes(0, 0, std::uint32_t(head.size()), head.data(), error)) {
        Fail(QStringLiteral("image file cannot be read"));
        return;
    }
    if (head.size() >= 4 && le32(reinterpret_cast<const std::uint8_t *>(head.constData())) == SparseMagic) {
        // One sparse extent; an embedded descriptor describes it.
        Extent extent;
        std::uint64_t capacity = 0, descOffset = 0, descSize = 0;
        if (!ReadSparse(0, extent, capacity, descOffset, descSize))
            return;
        Descriptor descriptor;
        extent.sectors = capacity;
        if (descSize != 0) {
            if (descSize * 512 > MaxDescriptorBytes) {
                Fail(QStringLiteral("embedded descriptor is too large"));
                return;
            }
            QByteArray text(int(descSize * 512), '\0');
            if (!ReadFileBytes(0, descOffset * 512, std::uint32_t(text.size()), text.data(), error)) {
                Fail(QStringLiteral("embedded descriptor cannot be read"));
                return;
            }
            int end = text.indexOf('\0');
            if (end >= 0)
                text.truncate(end);
            descriptor = ParseDescriptor(text);
            if (descriptor.extents.size() != 1) {
                Fail(QStringLiteral("embedded descriptor must name exactly one extent"));
                return;
            }
            extent.access = descriptor.extents.first().access;
            extent.sectors = descriptor.extents.first().sectors;
            if (extent.sectors > capacity) {
                Fail(QStringLiteral("extent is larger than its capacity"));
                return;
            }
        }
        m_extents.push_back(std::move(extent));
        Finish(descriptor);
        return;
    }
    // A text descriptor naming the extents, opened beside it.
    if (file.isEmpty() || size > MaxDescriptorBytes) {
        Fail(QStringLiteral("not a sparse extent nor a descriptor"));
        return;
    }
    QByteArray text(int(size), '\0');
    if (!ReadFileBytes(0, 0, std::uint32_t(size), text.data(), error) || !LooksLikeDescriptor(text)) {
        Fail(QStringLiteral("not a sparse extent nor a descriptor"));
        return;
    }
    const qsizetype end = text.indexOf('\0');
    const Descriptor descriptor = ParseDescriptor(end >= 0 ? text.left(end) : text);
    const QString folder = QFileInfo(file).path();
    std::uint64_t start = 0;
    for (const ExtentLine &line : descriptor.extents) {
        QString path = QFileInfo(line.file).isAbsolute() ||
                               (folder == QLatin1String(".") && !file.startsWith(QLatin1String("./")))
                           ? line.file
                           : folder + QLatin1Char('/') + line.file;
        if (!AddFile(path)) {
            Fail(QStringLiteral("extent %1 cannot be opened").arg(line.file));
            return;
        }
        Extent extent;
        std::uint64_t capacity = 0, descOffset = 0, descSize = 0;
        if (!ReadSparse(int(m_files.size()) - 1, extent, capacity, descOffset, descSize))
            return;
        if (line.sectors > capacity || start > ~std::uint64_t(0) - line.sectors) {
            Fail(QStringLiteral("extent %1 is larger than its capacity").arg(line.file));
            return;
        }
        extent.start = start;
        extent.sectors = line.sectors;
        extent.access = line.access;
        start += line.sectors;
        m_extents.push_back(std::move(extent));
    }
    Finish(descriptor);
}

void CImageHandle_VMWare::Finish(const Descriptor &descriptor)
{
    m_heads = descriptor.heads;
    m_sectorsPerTrack = descriptor.sectorsPerTrack;
    std::uint64_t total = 0;
    for (const Extent &e : m_extents)
        total += e.sectors;
    m_totalSectors = total;
    // Extents are read here; writes are not carried out.
    m_writable = 0;
    if (total == 0)
        Fail(QStringLiteral("image holds no sectors"));
}

void CImageHandle_VMWare::Describe(DeviceInfo &info) const
{
    CImageHandle::Describe(info);
    info.sectorsPerTrack = m_sectorsPerTrack;
    info.tracksPerCylinder = m_heads;
}

bool CImageHandle_VMWare::ReadExtent(Extent &extent, std::uint64_t sector, std::uint32_t count,
                                     std::uint8_t *buffer, std::uint32_t &error)
{
    if (extent.access == AccessNone) {
        error = SystemError::AccessDenied;
        return false;
    }
    while (count > 0) {
        const std::uint64_t grain = sector / extent.grainSize;
        const std::uint64_t inGrain = sector % extent.grainSize;
        std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(count, extent.grainSize - inGrain));
        const std::uint64_t index = grain / GrainTableEntries;
        if (index >= extent.directory.size()) {
            error = 0;
            return false;
        }
        std::uint32_t entry = 0;
        const std::uint32_t tableSector = extent.directory[index];
        if (tableSector != 0) {
            if (extent.cachedTable != std::int64_t(index)) {
                std::uint8_t raw[GrainTableEntries * 4];
                extent.cachedTable = -1;
                if (!ReadFileBytes(extent.file, std::uint64_t(tableSector) * 512, sizeof raw, raw, error))
                    return false;
                extent.table.resize(GrainTableEntries);
                for (std::uint32_t i = 0; i < GrainTableEntries; ++i)
                    extent.table[i] = le32(raw + i * 4);
                extent.cachedTable = std::int64_t(index);
            }
            entry = extent.table[grain % GrainTableEntries];
        }
        if (entry == 0) {
            std::memset(buffer, 0, std::size_t(n) * 512);
        } else {
            // Grains that follow each other in the file are read in one go.
            std::uint64_t at = (std::uint64_t(entry) + inGrain) * 512;
            std::uint64_t g = grain;
            std::uint32_t want = count;
            while (n < want && (g + 1) / GrainTableEntries == index && n <= (1u << 20)) {
                const std::uint32_t next = extent.table[(g + 1) % GrainTableEntries];
                if (next == 0 ||
                    std::uint64_t(next) != std::uint64_t(entry) + (g + 1 - grain) * extent.grainSize)
                    break;
                n = std::uint32_t(std::min<std::uint64_t>(want, n + extent.grainSize));
                ++g;
            }
            if (!ReadFileBytes(extent.file, at, n * 512, buffer, error))
                return false;
        }
        sector += n;
        count -= n;
        buffer += std::size_t(n) * 512;
    }
    return true;
}

bool CImageHandle_VMWare::ReadWrite(bool read, std::uint64_t first, std::uint32_t count, void *buffer,
                                    std::uint32_t &error)
{
    QMutexLocker locker(&m_lock);
    if (!CheckRange(first, count, error))
        return false;
    if (!read) {
        error = SystemError::AccessDenied;
        return false;
    }
    auto *bytes = static_cast<std::uint8_t *>(buffer);
    for (Extent &e : m_extents) {
        if (count == 0)
            break;
        if (first >= e.start + e.sectors)
            continue;
        std::uint32_t n = std::uint32_t(std::min<std::uint64_t>(count, e.start + e.sectors - first));
        if (!ReadExtent(e, first - e.start, n, bytes, error))
            return false;
        first += n;
        count -= n;
        bytes += std::size_t(n) * 512;
    }
    return count == 0;
}
