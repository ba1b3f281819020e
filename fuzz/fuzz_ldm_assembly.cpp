// Dynamic-volume assembly from arbitrary database records over three small in-memory disks: the
// records decide the layouts, stripes, piece positions and sizes; every volume made is read.
#include <QByteArray>

#include <cstddef>
#include <cstdint>
#include <cstring>
#include <vector>

#include "Kernel/Implementation/Devices/LdmAssembly.h"

namespace {

class FuzzDisk : public cStorage
{
public:
    explicit FuzzDisk(std::uint8_t seed) : m_data(Sectors * 512, char(seed)) {}
    StorageKind GetStorageKind() const override { return StorageKind::Device; }
    QString GetDisplayName() const override { return QStringLiteral("fuzz disk"); }
    std::uint64_t GetSize() const override { return Sectors * 512; }
    std::uint32_t GetBytesPerSector() const override { return 512; }
    std::uint64_t GetTotalSectors() const override { return Sectors; }
    bool ReadSectors(std::uint64_t first, std::uint32_t count, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        if (first > Sectors || count > Sectors - first) {
            error = 38;
            return false;
        }
        std::memcpy(buffer, m_data.constData() + first * 512, std::size_t(count) * 512);
        return true;
    }
    bool WriteSectors(std::uint64_t, std::uint32_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }
    bool ReadBytes(std::uint64_t offset, std::uint64_t length, void *buffer, std::uint32_t &error) override
    {
        error = 0;
        if (offset > GetSize() || length > GetSize() - offset) {
            error = 38;
            return false;
        }
        std::memcpy(buffer, m_data.constData() + offset, length);
        return true;
    }
    bool WriteBytes(std::uint64_t, std::uint64_t, const void *, std::uint32_t &error) override
    {
        error = 5;
        return false;
    }

    static constexpr std::uint64_t Sectors = 256;

private:
    QByteArray m_data;
};

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t *data, std::size_t size)
{
    // Records: type, flags, body length, body.
    std::vector<Ldm::Record> records;
    std::size_t pos = 0;
    while (pos + 3 <= size && records.size() < 64) {
        const std::uint8_t type = data[pos], flags = data[pos + 1], length = data[pos + 2];
        pos += 3;
        const std::size_t n = std::min<std::size_t>(length, size - pos);
        Ldm::Record r;
        r.type = type;
        QByteArray rec(0x18, '\0');
        rec[0x12] = char(flags);
        rec[0x13] = char(type);
        rec += QByteArray(reinterpret_cast<const char *>(data + pos), qsizetype(n));
        r.data = rec;
        records.push_back(r);
        pos += n;
    }
    FuzzDisk a(1), b(2), c(3);
    QList<LdmAssembly::Disk> disks;
    const char *guids[] = {"01", "02", "03"};
    FuzzDisk *storages[] = {&a, &b, &c};
    for (int i = 0; i < 3; ++i) {
        LdmAssembly::Disk d;
        d.storage = storages[i];
        d.diskGuid = QString::fromLatin1(guids[i]);
        d.dataStart = 8;
        d.dataLength = FuzzDisk::Sectors - 16;
        disks.append(d);
    }
    auto volumes = LdmAssembly::Assemble(LdmAssembly::Decode(records, {}), disks, {});
    QByteArray buffer(8 * 512, '\0');
    for (auto &v : volumes) {
        const std::uint64_t total = v->storage->GetTotalSectors();
        std::uint32_t error = 0;
        v->storage->ReadSectors(0, 8, buffer.data(), error);
        if (total > 8)
            v->storage->ReadSectors(total - 8, 8, buffer.data(), error);
        v->storage->ReadBytes(v->storage->GetSize() / 2, 1000, buffer.data(), error);
    }
    return 0;
}
