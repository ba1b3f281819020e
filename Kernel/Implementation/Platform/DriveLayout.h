// Builds the answer of the drive layout query (DRIVE_LAYOUT_INFORMATION_EX and its entries), as a back
// end gives it: the answer fits the caller's buffer or the call fails with "buffer too small".
#pragma once

#include "Kernel/Implementation/Platform/DeviceControl.h"

#include <QByteArray>
#include <QList>

#include <cstdint>

struct DriveLayout
{
    DeviceControl::DRIVE_LAYOUT_INFORMATION_EX header{};
    QList<DeviceControl::PARTITION_INFORMATION_EX> entries;

    // The whole answer: the header with PartitionCount set, then the entries.
    QByteArray Bytes() const;

    // Copies the answer into out: when it does not fit, returns 122 (buffer too small) with returned 0;
    // otherwise returns 0 with returned the answer's size.
    uint32_t Answer(void *out, uint32_t outSize, uint32_t &returned) const;
};

// A partition entry with the given style, number and byte range.
DeviceControl::PARTITION_INFORMATION_EX MakePartitionEntry(uint32_t style, uint32_t number, uint64_t offset,
                                                           uint64_t length);
