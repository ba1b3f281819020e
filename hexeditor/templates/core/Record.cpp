#include "hexeditor/templates/core/Record.h"

#include "hexeditor/templates/core/Source.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

namespace {

// No record is larger than one read of the storage.
constexpr std::uint32_t MaxRecordSize = 1u << 20;

} // namespace

Record::Record(Source *source, std::unique_ptr<Builder> builder, const QLocale &locale)
    : m_source(source), m_builder(std::move(builder)), m_locale(locale)
{
}

Record::~Record() = default;

std::uint32_t Record::recordSize() const
{
    if (!m_builder || !m_source)
        return 0;
    const std::uint32_t size = m_builder->recordSize(*m_source);
    return size <= MaxRecordSize ? size : 0;
}

void Record::setOffset(std::uint64_t offset, bool isPrimary)
{
    (isPrimary ? m_primaryOffset : m_copyOffset) = offset;
    rebuild();
}

void Record::clear()
{
    m_expandRows.clear();
    m_root.reset();
    m_primary.clear();
    m_copy.clear();
    m_nextId = 0;
}

bool Record::readInto(QByteArray &buffer, std::uint64_t offset, std::uint32_t size)
{
    const std::uint64_t total = m_source->size();
    if (offset > total || size > total - offset)
        return false;
    buffer = m_source->read(offset, size);
    if (buffer.size() != qsizetype(size))
        buffer.clear();
    return true;
}

void Record::rebuild()
{
    clear();
    const std::uint32_t size = recordSize();
    if (size == 0)
        return;
    if (!readInto(m_primary, m_primaryOffset, size))
        return;
    if (m_builder->readsCopy() && !readInto(m_copy, m_copyOffset, size)) {
        m_primary.clear();
        return;
    }
    m_root = std::make_unique<Node>();
    m_root->id = m_nextId++;
    m_root->format = Group;
    m_root->size = size;
    m_builder->build(*this);
}

bool Record::overlaps(std::uint64_t offset, std::uint64_t length) const
{
    const std::uint64_t last =
        length == 0 ? offset : (offset + (length - 1) < offset ? UINT64_MAX : offset + length - 1);
    auto touches = [&](std::uint64_t start, qsizetype bytes) {
        if (bytes <= 0)
            return false;
        const std::uint64_t end =
            start + std::uint64_t(bytes) - 1 < start ? UINT64_MAX : start + std::uint64_t(bytes) - 1;
        return offset <= end && last >= start;
    };
    return touches(m_primaryOffset, m_primary.size()) || touches(m_copyOffset, m_copy.size());
}

QString Record::displayValue(const Node &node, bool isCopy) const
{
    if (node.format == Text || node.format == Note)
        return node.text;
    const std::uint32_t parentSize = node.format == Bit && node.parent ? node.parent->size : 0;
    return Values::display(node.format, buffer(isCopy), node.offset, node.size, parentSize, bigEndian(),
                           m_locale);
}

QVariant Record::editValue(const Node &node, bool isCopy) const
{
    const std::uint32_t parentSize = node.format == Bit && node.parent ? node.parent->size : 0;
    return Values::edit(node.format, buffer(isCopy), node.offset, node.size, parentSize, bigEndian(),
                        m_locale);
}

QByteArray Record::fieldBytes(const Node &node, bool isCopy) const
{
    const Node &field = node.format == Bit && node.parent ? *node.parent : node;
    const QByteArray &b = buffer(isCopy);
    if (!Values::inside(b, field.offset, field.size))
        return {};
    return b.mid(field.offset, field.size);
}

QString Record::offsetText(const Node &node, bool hex, int hexWidth, int decimalWidth) const
{
    if (node.format == Caption)
        return {};
    if (node.format == Bit)
        return QStringLiteral(":%1").arg(node.size);
    if (hex)
        return QStringLiteral("%1").arg(node.offset, hexWidth, 16, QLatin1Char('0')).toUpper();
    return QStringLiteral("%1").arg(node.offset, decimalWidth, 10, QLatin1Char('0'));
}

std::optional<QByteArray> Record::parseEdit(const Node &node, const QString &text, bool isCopy) const
{
    if (node.format == Bit) {
        if (!node.parent)
            return std::nullopt;
        return Values::parse(Bit, text, node.size, bigEndian(), m_locale, fieldBytes(node, isCopy));
    }
    return Values::parse(node.format, text, node.size, bigEndian(), m_locale);
}

std::optional<QVariantList> Record::applyEdit(const Node &node, const QByteArray &bytes, bool isCopy)
{
    if (node.format == Text || node.format == Note || node.format == Group || node.format == Caption ||
        node.format == Bit)
        return std::nullopt;
    QByteArray &b = isCopy ? m_copy : m_primary;
    if (b.isEmpty() || bytes.size() != qsizetype(node.size) || !Values::inside(b, node.offset, node.size))
        return std::nullopt;
    if (b.mid(node.offset, node.size) == bytes)
        return std::nullopt;
    b.replace(node.offset, node.size, bytes);
    const std::uint64_t base = isCopy ? m_copyOffset : m_primaryOffset;
    QVariantList changes{QVariant::fromValue<quint64>(base + node.offset), bytes};
    if (m_builder)
        changes += m_builder->dependentChanges(*this, node.offset, node.size);
    return changes;
}

Node *Record::add(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
                  std::uint32_t size)
{
    if (!parent)
        parent = m_root.get();
    if (!parent)
        return nullptr;
    auto node = std::make_unique<Node>();
    node->parent = parent;
    node->id = m_nextId++;
    node->name = name;
    node->format = format;
    node->offset = offset;
    node->size = size;
    parent->children.push_back(std::move(node));
    return parent->children.back().get();
}

Node *Record::addText(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
                      std::uint32_t size, const QString &text)
{
    Node *n = add(parent, name, format, offset, size);
    if (n)
        n->text = text;
    return n;
}

Node *Record::addLink(Node *parent, const QString &name, FieldFormat format, std::uint32_t offset,
                      std::uint32_t size, std::uint64_t linkOffset, std::uint64_t linkCopyOffset,
                      Type linkTemplate)
{
    Node *n = add(parent, name, format, offset, size);
    if (n) {
        n->isLink = true;
        n->linkOffset = linkOffset;
        n->linkCopyOffset = linkCopyOffset;
        n->linkTemplate = linkTemplate;
    }
    return n;
}

} // namespace HexEditor::Templates
