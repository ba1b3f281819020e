// The template pane's offset fields: a byte offset typed in decimal, in hexadecimal after "0x", or
// as "sector:offset"; shown in hex or decimal after the editor's setting.
#pragma once

#include <QLineEdit>

#include <cstdint>
#include <optional>

namespace HexEditor::Templates {

class OffsetEditCtrl : public QLineEdit
{
    Q_OBJECT
public:
    explicit OffsetEditCtrl(QWidget *parent = nullptr);

    void setSectorSize(std::uint32_t bytes) { m_sectorSize = bytes; }
    void setHexOffsets(bool hex);
    // Shows `offset` without emitting offsetEdited.
    void setOffset(std::uint64_t offset);
    std::uint64_t offset() const { return m_offset; }

    // The byte offset of a typed text; none when it is no offset.
    std::optional<std::uint64_t> parse(const QString &text) const;

signals:
    void offsetEdited(quint64 offset);

private:
    void onEditingFinished();

    std::uint32_t m_sectorSize = 512;
    bool m_hex = true;
    std::uint64_t m_offset = 0;
};

} // namespace HexEditor::Templates
