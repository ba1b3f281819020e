// One row of a template's field tree; the root is owned by the record, every other node by its
// parent.
#pragma once

#include <QString>

#include <cstdint>
#include <memory>
#include <vector>

#include "hexeditor/templates/core/FieldFormat.h"
#include "hexeditor/templates/core/TemplateType.h"

namespace HexEditor::Templates {

struct Node
{
    Node *parent = nullptr;
    std::vector<std::unique_ptr<Node>> children;
    // Unique within one build: the root is 0, every further node the next number.
    std::uint32_t id = 0;
    QString name;
    FieldFormat format = Group;
    // Byte offset inside the record; a Bit node carries its parent's offset.
    std::uint32_t offset = 0;
    // Byte length; for a Bit node the bit number.
    std::uint32_t size = 0;
    // The value of Text and Note nodes.
    QString text;
    bool isLink = false;
    // Absolute storage offsets a link leads to from the primary and from the copy column.
    std::uint64_t linkOffset = 0;
    std::uint64_t linkCopyOffset = 0;
    // The kind to apply at the target; None only moves the editor.
    Type linkTemplate = None;

    // The position of this node among its parent's children (0 for the root).
    int row() const
    {
        if (!parent)
            return 0;
        for (std::size_t i = 0; i < parent->children.size(); ++i)
            if (parent->children[i].get() == this)
                return int(i);
        return 0;
    }
};

} // namespace HexEditor::Templates
