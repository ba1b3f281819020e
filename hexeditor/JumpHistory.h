// The editor's jump history: the positions the caret jumped to (and templates selected there), with
// Back and Forward through them.
#pragma once

#include <QList>

#include <cstdint>
#include <optional>

namespace HexEditor {

class JumpHistory
{
public:
    struct Entry
    {
        uint64_t offset = 0;
        int32_t type = 0; // the template requested at the offset, 0 for none
        bool operator==(const Entry &) const = default;
    };

    // Entries kept besides the one appended last.
    static constexpr int Limit = 60;

    // Records a jump to offset (with the template type there, or 0).
    void add(uint64_t offset, int32_t type = 0);
    void clear();

    bool canGoBack() const;
    bool canGoForward() const;
    // The entry to apply for Back / Forward; none when the move is not possible.
    std::optional<Entry> back();
    std::optional<Entry> forward();

    const QList<Entry> &entries() const { return m_entries; }
    // Index of the current entry; equal to the entry count when past the last one.
    int index() const { return m_index; }

private:
    QList<Entry> m_entries;
    int m_index = 0;
};

} // namespace HexEditor
