#include "hexeditor/JumpHistory.h"

namespace HexEditor {

void JumpHistory::add(uint64_t offset, int32_t type)
{
    // Applying an entry moves the caret onto it again: that is no new jump.
    if (m_index < m_entries.size() && m_entries[m_index].offset == offset)
        return;
    if (m_index < m_entries.size())
        m_entries.erase(m_entries.begin() + m_index + 1, m_entries.end());
    while (m_entries.size() > Limit)
        m_entries.removeFirst();
    if (!m_entries.isEmpty() && m_entries.last().offset == offset)
        m_entries.last().type = type;
    else
        m_entries.append({offset, type});
    m_index = static_cast<int>(m_entries.size());
}

void JumpHistory::clear()
{
    m_entries.clear();
    m_index = 0;
}

bool JumpHistory::canGoBack() const
{
    return m_entries.size() >= 2 && m_index > 0;
}

bool JumpHistory::canGoForward() const
{
    return m_index + 1 < m_entries.size();
}

std::optional<JumpHistory::Entry> JumpHistory::back()
{
    if (!canGoBack())
        return std::nullopt;
    if (m_index >= m_entries.size())
        m_index = static_cast<int>(m_entries.size()) - 1; // the position we are at
    --m_index;
    return m_entries[m_index];
}

std::optional<JumpHistory::Entry> JumpHistory::forward()
{
    if (!canGoForward())
        return std::nullopt;
    ++m_index;
    return m_entries[m_index];
}

} // namespace HexEditor
