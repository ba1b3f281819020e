#include "hexeditor/UndoStack.h"

#include <algorithm>

namespace HexEditor {

void UndoStack::setStorage(Storage *storage)
{
    m_storage = storage;
    clear();
}

void UndoStack::dropRedo()
{
    m_entries.resize(m_position);
}

DiskArea UndoStack::apply(std::uint64_t offset, const QByteArray &bytes)
{
    if (!m_storage || bytes.isEmpty() || std::uint64_t(bytes.size()) > MaxEdit)
        return {};
    const std::uint64_t size = m_storage->size();
    if (offset >= size)
        return {};
    const QByteArray fresh =
        bytes.left(qsizetype(std::min<std::uint64_t>(std::uint64_t(bytes.size()), size - offset)));
    dropRedo();
    const QByteArray old = m_storage->read(DiskArea{offset, std::uint64_t(fresh.size())}, true);
    if (old.size() != fresh.size())
        return {};
    const std::uint64_t written = m_storage->write(offset, fresh, true);
    if (written != std::uint64_t(fresh.size())) {
        // Put back what went in; nothing is recorded.
        m_storage->write(offset, old.left(qsizetype(written)), true);
        rebuildMarks();
        return {};
    }
    m_entries.append(Entry{offset, old, fresh});
    m_position = m_entries.size();
    m_storage->setModified(m_entries.last().area(), true);
    return m_entries.last().area();
}

void UndoStack::record(std::uint64_t offset, const QByteArray &oldBytes, const QByteArray &newBytes)
{
    if (!m_storage || newBytes.isEmpty() || oldBytes.size() != newBytes.size())
        return;
    dropRedo();
    m_entries.append(Entry{offset, oldBytes, newBytes});
    m_position = m_entries.size();
    m_storage->setModified(m_entries.last().area(), true);
}

DiskArea UndoStack::undo()
{
    if (!m_storage || !canUndo())
        return {};
    const Entry &e = m_entries[--m_position];
    m_storage->write(e.offset, e.oldBytes, true);
    rebuildMarks();
    return e.area();
}

DiskArea UndoStack::redo()
{
    if (!m_storage || !canRedo())
        return {};
    const Entry &e = m_entries[m_position++];
    m_storage->write(e.offset, e.newBytes, true);
    rebuildMarks();
    return e.area();
}

void UndoStack::rebuildMarks()
{
    if (!m_storage)
        return;
    for (qsizetype i = m_entries.size() - 1; i >= 0; --i)
        m_storage->setModified(m_entries[i].area(), i < m_position);
}

QList<DiskArea> UndoStack::revert()
{
    QList<DiskArea> areas;
    if (!m_storage)
        return areas;
    for (qsizetype i = m_position - 1; i >= 0; --i) {
        m_storage->write(m_entries[i].offset, m_entries[i].oldBytes, true);
        areas.append(m_entries[i].area());
    }
    // What is left in the cache now equals the medium; dropping the edited sectors also drops
    // edits made around the stack.
    m_storage->revert();
    clear();
    return areas;
}

QList<SaveFailure> UndoStack::save()
{
    if (!m_storage)
        return {};
    const QList<SaveFailure> failures = m_storage->save();
    if (failures.isEmpty())
        clear();
    return failures;
}

void UndoStack::clear()
{
    m_entries.clear();
    m_position = 0;
}

} // namespace HexEditor
