#include "hexeditor/templates/StorageSource.h"

#include "hexeditor/Storage.h"

namespace HexEditor::Templates {

std::uint64_t StorageSource::size() const
{
    return m_storage ? m_storage->size() : 0;
}

std::uint32_t StorageSource::sectorSize() const
{
    return m_storage ? m_storage->sectorSize() : 0;
}

QByteArray StorageSource::read(std::uint64_t offset, std::uint32_t length)
{
    if (!m_storage)
        return {};
    QByteArray out;
    // The storage reads at most 1 MiB per call.
    while (std::uint64_t(out.size()) < length) {
        const std::uint64_t want =
            std::min<std::uint64_t>(length - std::uint64_t(out.size()), Storage::MaxTransfer);
        const QByteArray piece = m_storage->read(DiskArea{offset + std::uint64_t(out.size()), want});
        if (piece.isEmpty())
            break;
        out += piece;
        if (std::uint64_t(piece.size()) < want)
            break;
    }
    return out;
}

std::uint32_t StorageSource::mftRecordSize() const
{
    return m_storage ? m_storage->mftRecordSize() : 1024;
}

std::uint32_t StorageSource::inodeSize() const
{
    return m_storage ? m_storage->inodeSize() : 128;
}

} // namespace HexEditor::Templates
