#include "Kernel/Implementation/Platform/DriveLayout.h"

#include "Kernel/Implementation/Common/SystemError.h"

#include <cstring>

QByteArray DriveLayout::Bytes() const
{
    DeviceControl::DRIVE_LAYOUT_INFORMATION_EX h = header;
    h.PartitionCount = uint32_t(entries.size());
    QByteArray bytes(reinterpret_cast<const char *>(&h), sizeof h);
    for (const auto &entry : entries)
        bytes.append(reinterpret_cast<const char *>(&entry), sizeof entry);
    return bytes;
}

uint32_t DriveLayout::Answer(void *out, uint32_t outSize, uint32_t &returned) const
{
    const QByteArray bytes = Bytes();
    returned = 0;
    if (!out || uint64_t(bytes.size()) > outSize)
        return SystemError::InsufficientBuffer;
    std::memcpy(out, bytes.constData(), size_t(bytes.size()));
    returned = uint32_t(bytes.size());
    return 0;
}

DeviceControl::PARTITION_INFORMATION_EX MakePartitionEntry(uint32_t style, uint32_t number, uint64_t offset,
                                                           uint64_t length)
{
    DeviceControl::PARTITION_INFORMATION_EX entry;
    std::memset(&entry, 0, sizeof entry);
    entry.PartitionStyle = style;
    entry.StartingOffset = int64_t(offset);
    entry.PartitionLength = int64_t(length);
    entry.PartitionNumber = number;
    return entry;
}
