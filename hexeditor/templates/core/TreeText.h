// A field tree as text: the lines the pane copies to the clipboard, and the headless tool's text
// and JSON output.
#pragma once

#include <QJsonObject>
#include <QString>

namespace HexEditor::Templates {

class Record;
struct Node;

// One line per node: an indent of four blanks per level, the name and " (offset)"; a node with a
// value has the name and offset padded with dots to 60 characters, then the value. `node` null
// renders the whole tree, the root's line being `rootName`.
QString treeText(const Record &record, const Node *node, const QString &rootName, bool hexOffsets);

// The headless tool's listing: a heading, then per node its offset (record-relative), size, name
// and values, indented by depth.
QString listingText(const Record &record);

// {"type", "name", "offset", "copyOffset"?, "fields": [{"name", "offset", "size", "value",
// "copyValue", "children"}]}
QJsonObject listingJson(const Record &record);

} // namespace HexEditor::Templates
