// A template placed on a source: the primary and copy records read at their offsets, and the field
// tree a builder made of them. Widget-free: the item model of the template pane and the headless
// tool show the same tree.
#pragma once

#include <QByteArray>
#include <QList>
#include <QLocale>
#include <QPair>
#include <QString>
#include <QVariantList>

#include <cstdint>
#include <memory>
#include <optional>

#include "hexeditor/templates/core/Builder.h"
#include "hexeditor/templates/core/Node.h"

namespace HexEditor::Templates {

class Source;

class Record
{
public:
    // `source` may be null (nothing is built); `builder` null is the "No template" entry.
    Record(Source *source, std::unique_ptr<Builder> builder, const QLocale &locale = QLocale());
    ~Record();
    Record(const Record &) = delete;
    Record &operator=(const Record &) = delete;

    Source *source() const { return m_source; }
    Builder *builder() const { return m_builder.get(); }
    Type type() const { return m_builder ? m_builder->type() : None; }
    bool isTemplate() const { return m_builder != nullptr; }
    bool hasCopyColumn() const { return m_builder && m_builder->hasCopyColumn(); }
    bool bigEndian() const { return m_builder && m_builder->bigEndian(); }
    std::uint32_t recordSize() const;
    const QLocale &locale() const { return m_locale; }

    std::uint64_t primaryOffset() const { return m_primaryOffset; }
    std::uint64_t copyOffset() const { return m_copyOffset; }
    // Stores the offset and rebuilds.
    void setOffset(std::uint64_t offset, bool isPrimary);

    // Reads the records and builds the tree afresh (the empty tree when the record does not fit).
    void rebuild();
    // Whether an area of the source (a zero length counts as one byte) touches either record.
    bool overlaps(std::uint64_t offset, std::uint64_t length) const;

    const QByteArray &buffer(bool isCopy) const { return isCopy ? m_copy : m_primary; }
    Node *root() const { return m_root.get(); }
    // Top-level (row, column) pairs a view expands after every build.
    const QList<QPair<int, int>> &expandRows() const { return m_expandRows; }

    // The value of a node in a column's buffer.
    QString displayValue(const Node &node, bool isCopy) const;
    QVariant editValue(const Node &node, bool isCopy) const;
    // The bytes of a node (for a Bit node, its parent's) in a column's buffer; empty when outside.
    QByteArray fieldBytes(const Node &node, bool isCopy) const;
    // The "Offset" column: none for a Caption, ":" and the bit number for a Bit, else the offset.
    QString offsetText(const Node &node, bool hex, int hexWidth = 3, int decimalWidth = 3) const;

    // The bytes a typed text stands for; for a Bit node the parent field's new bytes.
    std::optional<QByteArray> parseEdit(const Node &node, const QString &text, bool isCopy) const;
    // Writes `bytes` (exactly the field's size, different from its current bytes) into the column's
    // buffer and returns the changes to apply to the source: [absolute offset, bytes, ...].
    // Nothing when the bytes are refused.
    std::optional<QVariantList> applyEdit(const Node &node, const QByteArray &bytes, bool isCopy);

    // Building: the builders append nodes through these.
    Node *add(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
              std::uint32_t size);
    Node *addText(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
                  std::uint32_t size, const QString &text);
    Node *addLink(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
                  std::uint32_t size, std::uint64_t linkOffset, std::uint64_t linkCopyOffset,
                  Type linkTemplate = None);
    void expand(int row, int column = 0) { m_expandRows.append({row, column}); }

private:
    void clear();
    bool readInto(QByteArray &buffer, std::uint64_t offset, std::uint32_t size);

    Source *m_source = nullptr;
    std::unique_ptr<Builder> m_builder;
    QLocale m_locale;
    std::uint64_t m_primaryOffset = 0;
    std::uint64_t m_copyOffset = 0;
    QByteArray m_primary;
    QByteArray m_copy;
    std::unique_ptr<Node> m_root;
    std::uint32_t m_nextId = 0;
    QList<QPair<int, int>> m_expandRows;
};

} // namespace HexEditor::Templates
