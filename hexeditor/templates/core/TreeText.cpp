#include "hexeditor/templates/core/TreeText.h"

#include <QJsonArray>

#include "hexeditor/templates/core/Record.h"

namespace HexEditor::Templates {

namespace {

bool hasValue(const Node &n)
{
    return n.format != Group && n.format != Caption;
}

void appendLines(const Record &r, const Node &n, int depth, bool hex, const QString &rootName,
                 QStringList &lines)
{
    const QString indent(4 * depth, QLatin1Char(' '));
    if (!n.parent) {
        lines.append(indent + rootName);
    } else {
        const QString head = QStringLiteral("%1%2 (%3)").arg(indent, n.name, r.offsetText(n, hex));
        if (hasValue(n) && !r.buffer(false).isEmpty())
            lines.append(QStringLiteral("%1%2").arg(head.leftJustified(60, QLatin1Char('.')),
                                                    r.displayValue(n, false)));
        else
            lines.append(head);
    }
    for (const auto &c : n.children)
        appendLines(r, *c, depth + 1, hex, rootName, lines);
}

void appendListing(const Record &r, const Node &n, int depth, QStringList &lines)
{
    QString line = QStringLiteral("%1%2 %3  %4")
                       .arg(QString(2 * depth, QLatin1Char(' ')))
                       .arg(n.offset, 6)
                       .arg(n.size, 5)
                       .arg(n.name);
    if (hasValue(n)) {
        line += QStringLiteral(" = %1").arg(r.displayValue(n, false));
        if (r.hasCopyColumn())
            line += QStringLiteral(" | copy = %1").arg(r.displayValue(n, true));
    }
    if (n.isLink)
        line += QStringLiteral("  -> %1").arg(n.linkOffset);
    lines.append(line);
    for (const auto &c : n.children)
        appendListing(r, *c, depth + 1, lines);
}

QJsonObject nodeJson(const Record &r, const Node &n)
{
    QJsonObject o;
    o.insert(QStringLiteral("name"), n.name);
    o.insert(QStringLiteral("offset"), qint64(n.offset));
    o.insert(QStringLiteral("size"), qint64(n.size));
    o.insert(QStringLiteral("value"), hasValue(n) ? QJsonValue(r.displayValue(n, false)) : QJsonValue());
    o.insert(QStringLiteral("copyValue"),
             hasValue(n) && r.hasCopyColumn() ? QJsonValue(r.displayValue(n, true)) : QJsonValue());
    if (n.isLink) {
        o.insert(QStringLiteral("link"), QString::number(n.linkOffset));
        if (n.linkTemplate != None)
            o.insert(QStringLiteral("linkTemplate"), int(n.linkTemplate));
    }
    QJsonArray children;
    for (const auto &c : n.children)
        children.append(nodeJson(r, *c));
    o.insert(QStringLiteral("children"), children);
    return o;
}

} // namespace

QString treeText(const Record &record, const Node *node, const QString &rootName, bool hexOffsets)
{
    const Node *start = node ? node : record.root();
    if (!start)
        return {};
    QStringList lines;
    appendLines(record, *start, 0, hexOffsets, rootName, lines);
    return lines.join(QLatin1Char('\n'));
}

QString listingText(const Record &record)
{
    QStringList lines;
    lines.append(QStringLiteral("%1 (%2) at offset %3")
                     .arg(typeName(record.type()))
                     .arg(int(record.type()))
                     .arg(record.primaryOffset()));
    if (record.hasCopyColumn())
        lines.append(QStringLiteral("copy at offset %1").arg(record.copyOffset()));
    if (!record.root()) {
        lines.append(QStringLiteral("(no record: it does not fit on the source)"));
        return lines.join(QLatin1Char('\n')) + QLatin1Char('\n');
    }
    if (record.buffer(false).isEmpty())
        lines.append(QStringLiteral("(the record could not be read)"));
    for (const auto &c : record.root()->children)
        appendListing(record, *c, 0, lines);
    return lines.join(QLatin1Char('\n')) + QLatin1Char('\n');
}

QJsonObject listingJson(const Record &record)
{
    QJsonObject o;
    o.insert(QStringLiteral("type"), int(record.type()));
    o.insert(QStringLiteral("name"), typeName(record.type()));
    o.insert(QStringLiteral("offset"), QString::number(record.primaryOffset()));
    if (record.hasCopyColumn())
        o.insert(QStringLiteral("copyOffset"), QString::number(record.copyOffset()));
    QJsonArray fields;
    if (record.root())
        for (const auto &c : record.root()->children)
            fields.append(nodeJson(record, *c));
    o.insert(QStringLiteral("fields"), fields);
    return o;
}

} // namespace HexEditor::Templates
