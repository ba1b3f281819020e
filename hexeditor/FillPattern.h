// Fill patterns of the fill-block command: 1 to 32 bytes, repeated over a block of at most 1 MiB.
#pragma once

#include <QByteArray>
#include <QString>

#include <cstdint>

namespace HexEditor::FillPattern {

inline constexpr int MaxLength = 32;
inline constexpr std::uint64_t MaxBlock = 1u << 20;

// A pattern of 1 to 32 bytes.
bool isValid(const QByteArray &pattern);

// The pattern repeated length / size times, followed by its first length % size bytes. Empty when
// the pattern is not valid or the block is longer than 1 MiB.
QByteArray fill(const QByteArray &pattern, std::uint64_t length);

// The pattern field's two forms: text as Latin-1 bytes (characters beyond Latin-1 give no
// pattern), and hexadecimal digit pairs (blanks between pairs allowed; an odd digit count or
// any other character gives ok false).
QByteArray fromText(const QString &text, bool *ok = nullptr);
QString toText(const QByteArray &pattern);
QByteArray fromHex(const QString &hex, bool *ok = nullptr);
QString toHex(const QByteArray &pattern);

} // namespace HexEditor::FillPattern
