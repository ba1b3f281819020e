// Bounded field reads for the partition-table parsers: the byte-order readers of ByteOrder.h (a
// field outside the buffer reads as 0), text and boot-signature checks.
#pragma once

#include <QByteArray>

#include <cstddef>
#include <cstdint>

#include "Kernel/Implementation/Common/ByteOrder.h"

namespace PartScan {

using ByteOrder::be16;
using ByteOrder::be32;
using ByteOrder::be64;
using ByteOrder::le16;
using ByteOrder::le32;
using ByteOrder::le64;
using ByteOrder::readBe;
using ByteOrder::readLe;

// True when the buffer holds `text` at `offset`.
inline bool hasText(const QByteArray &b, qsizetype offset, const char *text)
{
    const qsizetype n = static_cast<qsizetype>(qstrlen(text));
    return offset >= 0 && offset <= b.size() - n && b.mid(offset, n) == QByteArray(text, n);
}

// True when bytes 510..511 hold 0x55 0xAA.
inline bool hasBootSignature(const QByteArray &sector)
{
    return sector.size() >= 512 && static_cast<std::uint8_t>(sector[510]) == 0x55 &&
           static_cast<std::uint8_t>(sector[511]) == 0xAA;
}

} // namespace PartScan
