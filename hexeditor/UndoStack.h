// The edit history of an editor control and its storage: one entry per edit (offset, the bytes
// before and after), and a position between 0 and the entry count. Entries before the position
// are applied, those after it were undone and can be redone. Every change goes into the
// storage's sector cache (never to the medium); save() and revert() empty the stack.
#pragma once

#include <QByteArray>
#include <QList>

#include <cstdint>

#include "hexeditor/DiskArea.h"
#include "hexeditor/Storage.h"

namespace HexEditor {

class UndoStack
{
public:
    struct Entry
    {
        std::uint64_t offset = 0;
        QByteArray oldBytes;
        QByteArray newBytes;
        DiskArea area() const { return DiskArea{offset, std::uint64_t(newBytes.size())}; }
    };

    // Longest single edit, in bytes.
    static constexpr std::uint64_t MaxEdit = Storage::MaxTransfer;

    explicit UndoStack(Storage *storage = nullptr) : m_storage(storage) {}

    Storage *storage() const { return m_storage; }
    // A new storage starts a new history.
    void setStorage(Storage *storage);

    // Applies an edit: drops the redo entries, reads the old bytes through the cache, writes the
    // new ones into the cache and appends the entry. The bytes are cut to the storage's end.
    // Returns the changed area; empty (and nothing changed) for no bytes, more than 1 MiB, an
    // offset beyond the end or no storage.
    DiskArea apply(std::uint64_t offset, const QByteArray &bytes);
    // Records an edit the caller has already made in the cache (a typed byte); drops the redo
    // entries and marks the bytes.
    void record(std::uint64_t offset, const QByteArray &oldBytes, const QByteArray &newBytes);

    bool canUndo() const { return m_position > 0; }
    bool canRedo() const { return m_position < m_entries.size(); }
    // Undoes the last applied entry / redoes the next one; returns its area (empty when none).
    DiskArea undo();
    DiskArea redo();

    // Writes back the old bytes of every applied entry (last first) and drops every edit of the
    // storage; empties the stack. Returns the areas touched, in the order they were restored.
    QList<DiskArea> revert();
    // Writes the storage's modified sectors to the medium; the stack is emptied when every
    // sector was written (a failed sector keeps its edits and the history stays).
    QList<SaveFailure> save();
    void clear();

    // Rebuilds the storage's modified marks from the stack: walking from the last entry to the
    // first, entries after the position are unmarked and applied ones marked.
    void rebuildMarks();

    qsizetype position() const { return m_position; }
    qsizetype count() const { return m_entries.size(); }
    bool hasApplied() const { return m_position > 0; }
    const QList<Entry> &entries() const { return m_entries; }

private:
    void dropRedo();

    Storage *m_storage = nullptr;
    QList<Entry> m_entries;
    qsizetype m_position = 0;
};

} // namespace HexEditor
