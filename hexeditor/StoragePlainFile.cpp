#include "hexeditor/StoragePlainFile.h"

#include <QFileInfo>

#include <algorithm>
#include <cstring>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"

namespace HexEditor {

// The file as a kernel storage. It is opened read-only; the first write reopens it for writing.
class PlainFileObject : public cStorage
{
public:
    static constexpr std::uint32_t SectorSize = 512;

    PlainFileObject(const QString &path, cRoot *root)
        : m_path(path), m_file(std::make_unique<CPlatformFile>(root, path, PlatformKind::File))
    {
        m_open = m_file->Reopen(false) && m_file->GetSize(m_size);
        if (!m_open)
            m_error = m_file->GetError();
    }

    bool isOpen() const { return m_open; }
    std::uint32_t openError() const { return m_error; }

    StorageKind GetStorageKind() const override { return StorageKind::Entry; }
    QString GetDisplayName() const override { return m_path; }
    std::uint64_t GetSize() const override { return m_size; }
    std::uint32_t GetBytesPerSector() const override { return SectorSize; }
    std::uint64_t GetTotalSectors() const override { return (m_size + SectorSize - 1) / SectorSize; }

    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        return ReadBytes(first * SectorSize, std::uint64_t(count) * SectorSize, buffer, error);
    }
    bool WriteSectors(std::uint64_t first, std::uint32_t count, const void *buffer,
                      std::uint32_t &error) override
    {
        return WriteBytes(first * SectorSize, std::uint64_t(count) * SectorSize, buffer, error);
    }

    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        auto *out = static_cast<std::uint8_t *>(buffer);
        const std::uint64_t inside = insideLength(offset, length);
        std::memset(out + inside, 0, std::size_t(length - inside));
        return transfer(offset, length, SystemError::ReadFault, error,
                        [&](std::uint64_t done, std::uint32_t piece) {
                            return m_file->Read(offset + done, piece, out + done);
                        });
    }

    bool WriteBytes(std::uint64_t offset, std::uint64_t length, const void *buffer,
                    std::uint32_t &error) override
    {
        const auto *in = static_cast<const std::uint8_t *>(buffer);
        // The zeros after the end of the last partial sector are not part of the file.
        return transfer(offset, length, SystemError::WriteFault, error,
                        [&](std::uint64_t done, std::uint32_t piece) {
                            return m_file->Write(offset + done, piece, in + done);
                        });
    }

    bool Flush(std::uint32_t &error) override { return m_file->Flush(error); }

private:
    // The bytes of a range that lie inside the file.
    std::uint64_t insideLength(std::uint64_t offset, std::uint64_t length) const
    {
        return offset >= m_size ? 0 : std::min(length, m_size - offset);
    }

    // Moves the part of a range inside the file in pieces of at most 16 MiB through `step`
    // (offset from the range's start, piece length). A range that runs past the file's last
    // sector is partly there, as with a device, and fails after its part was moved.
    template <typename Step>
    bool transfer(std::uint64_t offset, std::uint64_t length, std::uint32_t fault, std::uint32_t &error,
                  Step step)
    {
        error = 0;
        const std::uint64_t inside = insideLength(offset, length);
        for (std::uint64_t done = 0; done < inside;) {
            const std::uint32_t piece = std::uint32_t(std::min<std::uint64_t>(inside - done, 1u << 24));
            if (!step(done, piece)) {
                error = m_file->GetError() ? m_file->GetError() : fault;
                return false;
            }
            done += piece;
        }
        if (inside < length && (offset + length + SectorSize - 1) / SectorSize > GetTotalSectors()) {
            error = SystemError::HandleEof;
            return false;
        }
        return true;
    }

    QString m_path;
    std::unique_ptr<CPlatformFile> m_file;
    bool m_open = false;
    std::uint64_t m_size = 0;
    std::uint32_t m_error = 0;
};

StoragePlainFile::StoragePlainFile(const QString &path, cRoot *root, QObject *parent)
    : Storage(nullptr, parent), m_object(std::make_unique<PlainFileObject>(path, root))
{
    if (m_object->isOpen())
        setKernelObject(m_object.get());
    setTitle(QFileInfo(path).fileName());
}

StoragePlainFile::~StoragePlainFile()
{
    setKernelObject(nullptr);
}

bool StoragePlainFile::isOpen() const
{
    return m_object->isOpen();
}

QString StoragePlainFile::openError() const
{
    if (m_object->isOpen())
        return QString();
    return tr("Unable to open %1. Error code %2.").arg(m_object->GetDisplayName()).arg(m_object->openError());
}

} // namespace HexEditor
