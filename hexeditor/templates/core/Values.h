// Display, edit and parse of field values. Every read checks the field against the buffer: a field
// that does not lie wholly inside it has no value (empty text, null edit value).
#pragma once

#include <QByteArray>
#include <QLocale>
#include <QString>
#include <QVariant>

#include <cstdint>
#include <optional>

#include "hexeditor/templates/core/FieldFormat.h"

namespace HexEditor::Templates::Values {

// Seconds from 1904-01-01 to 1970-01-01.
inline constexpr std::int64_t HfsEpochShift = 2082844800;

// True when [offset, offset + size) lies inside `buffer`.
bool inside(const QByteArray &buffer, std::uint32_t offset, std::uint32_t size);

// An unsigned number of 1 to 8 bytes; false when the field is not inside the buffer.
bool readUnsigned(const QByteArray &buffer, std::uint32_t offset, std::uint32_t size, bool bigEndian,
                  std::uint64_t &value);
// The `size` low bytes of `value` in the given order.
QByteArray writeUnsigned(std::uint64_t value, std::uint32_t size, bool bigEndian);

// The byte width of a number format (0 for the others).
std::uint32_t numberWidth(FieldFormat format);

// The text of the "Value" column. `parentSize` is the width of the field a Bit node tests.
QString display(FieldFormat format, const QByteArray &buffer, std::uint32_t offset, std::uint32_t size,
                std::uint32_t parentSize, bool bigEndian, const QLocale &locale);

// The text an editor starts from; null for formats without one.
QVariant edit(FieldFormat format, const QByteArray &buffer, std::uint32_t offset, std::uint32_t size,
              std::uint32_t parentSize, bool bigEndian, const QLocale &locale);

// The bytes a typed text stands for: `size` bytes (for a Bit node the parent's new bytes, built
// from `parentBytes` with bit `size` set or cleared). Nothing when the text is rejected.
std::optional<QByteArray> parse(FieldFormat format, const QString &text, std::uint32_t size, bool bigEndian,
                                const QLocale &locale, const QByteArray &parentBytes = {});

// A number as typed: optional "0x" for hex, group separators and blanks ignored, no sign.
std::optional<std::uint64_t> parseNumber(const QString &text, const QLocale &locale);

// Text in the local 8-bit encoding and back.
QString fromLocal8(const QByteArray &bytes);
QByteArray toLocal8(const QString &text);

// Upper-case hex pairs, separated by `separator`.
QString hexPairs(const QByteArray &bytes, const QString &separator);

} // namespace HexEditor::Templates::Values
