#include "hexeditor/StorageVolumeInfo.h"

#include <QByteArray>
#include <QtEndian>

#include "Kernel/Implementation/FS/Volume.h"
#include "hexeditor/StorageLayout.h"

namespace HexEditor::VolumeInfoQuery {

namespace {

QByteArray request(std::uint32_t code, std::uint64_t argument)
{
    QByteArray r(12, '\0');
    qToLittleEndian(code, r.data());
    qToLittleEndian(argument, r.data() + 4);
    return r;
}

// The response's code, or all ones for an empty answer.
std::uint32_t code(const QByteArray &answer)
{
    return answer.size() >= 4 ? qFromLittleEndian<std::uint32_t>(answer.constData()) : 0xFFFFFFFFu;
}

bool word64(const QByteArray &answer, std::uint64_t &value)
{
    if (answer.size() < 12)
        return false;
    value = qFromLittleEndian<std::uint64_t>(answer.constData() + 4);
    return true;
}

bool isNtfs(CVolume *v)
{
    return v && v->GetKind() == 10;
}

bool isHfs(CVolume *v)
{
    return v && v->GetKind() == 13;
}

} // namespace

std::uint64_t mftRecordCount(CVolume *volume)
{
    if (!isNtfs(volume))
        return 0;
    const QByteArray answer = volume->QueryInfo(request(0, 0));
    std::uint64_t last = 0;
    if (code(answer) != 5 || !word64(answer, last) || last == UINT64_MAX)
        return 1;
    return last + 1;
}

std::uint64_t mftRecordOffset(CVolume *volume, std::uint64_t index, std::uint64_t base,
                              std::uint64_t sectorCount)
{
    if (!isNtfs(volume))
        return 0;
    const QByteArray answer = volume->QueryInfo(request(1, index));
    std::uint64_t sector = 0;
    if (code(answer) != 4 || !word64(answer, sector) || sector == UINT64_MAX)
        return 0;
    const std::uint64_t ss = volume->GetBytesPerSector();
    if (sector > (UINT64_MAX - base) / ss)
        return 0;
    const std::uint64_t offset = base + sector * ss;
    cStorage *medium = volume->GetMedium();
    const std::uint64_t mss = medium ? medium->GetBytesPerSector() : ss;
    return mss && offset / mss < sectorCount ? offset : 0;
}

std::uint64_t catalogNodeCount(CVolume *volume)
{
    if (!isHfs(volume))
        return 0;
    const QByteArray answer = volume->QueryInfo(QByteArray());
    if (code(answer) != 2 || answer.size() < 32)
        return 0;
    return qFromLittleEndian<std::uint32_t>(answer.constData() + 28);
}

std::uint64_t catalogNodeOffset(CVolume *volume, std::uint64_t index, std::uint64_t base)
{
    if (!isHfs(volume))
        return 0;
    const QByteArray answer = volume->QueryInfo(request(2, index));
    std::uint64_t position = 0;
    if (code(answer) != 7 || !word64(answer, position) || position > UINT64_MAX - base)
        return 0;
    return base + position;
}

std::uint32_t mftRecordSize(CVolume *volume)
{
    cStorage *medium = volume ? volume->GetMedium() : nullptr;
    if (!medium || !medium->GetBytesPerSector())
        return 1024;
    QByteArray sector(qsizetype(medium->GetBytesPerSector()), '\0');
    std::uint32_t error = 0;
    if (!medium->ReadSectors(0, 1, sector.data(), error) || sector.size() <= 0x40)
        return 1024;
    const std::uint32_t size = Layout::ntfsRecordSize(std::int8_t(sector[0x40]), volume->GetClusterSize());
    return size ? size : 1024;
}

std::uint32_t inodeSize(CVolume *volume, std::uint32_t fallback)
{
    cStorage *medium = volume ? volume->GetMedium() : nullptr;
    if (!medium || volume->GetKind() < 14 || volume->GetKind() > 16 || medium->GetSize() < 2048)
        return fallback;
    QByteArray sb(1024, '\0');
    std::uint32_t error = 0;
    if (!medium->ReadBytes(1024, 1024, sb.data(), error))
        return fallback;
    const std::uint32_t size = Layout::extInodeSize(sb);
    return size ? size : fallback;
}

} // namespace HexEditor::VolumeInfoQuery
