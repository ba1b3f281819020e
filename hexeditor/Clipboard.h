// The hex editor's clipboard formats: the raw bytes ("application/hexeditor.binary"), the text form
// of the pane the caret is in ("text/plain"), the formatted dump, and the reference to a block of
// another storage ("application/hexeditor.bulk", valid within the running process only).
#pragma once

#include <QByteArray>
#include <QString>

#include <cstdint>

#include "hexeditor/DiskArea.h"
#include "hexeditor/Metrics.h"

class QMimeData;

namespace HexEditor {

class Storage;

namespace Clipboard {

inline constexpr const char *BinaryFormat = "application/hexeditor.binary";
inline constexpr const char *BulkFormat = "application/hexeditor.bulk";
inline constexpr const char *TextFormat = "text/plain";
// The largest block put on the clipboard (and the largest single edit).
inline constexpr uint64_t MaxBytes = 1u << 20;

// The text of copied bytes in a pane: hexadecimal pairs without separators, one character per byte
// (below 32 as "."), or one character per little-endian code unit from an even offset.
QString copyText(const QByteArray &bytes, Metrics::Pane pane, uint64_t firstOffset = 0);

// The formatted dump of bytes starting at `firstOffset`, laid out like the editor's lines.
QString formattedText(const QByteArray &bytes, uint64_t firstOffset, uint32_t bytesPerLine, bool hexOffset,
                      int offsetDigits);

// Mime data holding the raw bytes and the text.
QMimeData *copyData(const QByteArray &bytes, const QString &text);

// The bytes a paste applies: the raw format, or else the text as UTF-8; empty when neither.
QByteArray pasteBytes(const QMimeData *data);

// A block of a storage of this process.
struct BulkReference
{
    Storage *storage = nullptr;
    DiskArea area;
};

// Mime data naming a block of a storage (the storage must be registered as alive).
QMimeData *bulkData(Storage *storage, const DiskArea &area);
// The block a bulk format names, when it was made by this process and its storage is still alive.
bool bulkReference(const QMimeData *data, BulkReference &out);

// Storages that a bulk reference may name: the editor registers its storage while it shows it.
void registerStorage(Storage *storage);
void unregisterStorage(Storage *storage);
bool isRegistered(const Storage *storage);

} // namespace Clipboard
} // namespace HexEditor
