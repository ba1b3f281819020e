#include "hexeditor/templates/Model.h"

#include <QFont>

#include "hexeditor/templates/GptModel.h"
#include "hexeditor/templates/LdmModels.h"
#include "hexeditor/templates/MbrModel.h"
#include "hexeditor/templates/StorageSource.h"
#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/Values.h"

namespace HexEditor::Templates {

Model::Model(Storage *storage, QObject *parent) : Model(storage, nullptr, parent) {}

Model::Model(Storage *storage, std::unique_ptr<Builder> builder, QObject *parent)
    : QAbstractItemModel(parent), m_storage(storage), m_source(std::make_unique<StorageSource>(storage)),
      m_record(m_source.get(), std::move(builder))
{
    m_headers = {tr("Name"), tr("Offset"), tr("Value")};
    if (m_record.hasCopyColumn())
        m_headers.append(tr("Copy Value"));
}

Model::~Model() = default;

std::unique_ptr<Model> Model::create(Storage *storage, int type, QObject *parent)
{
    switch (type) {
    case None:
        return std::make_unique<Model>(storage, parent);
    case MasterBootRecord:
        return std::make_unique<MbrModel>(storage, parent);
    case GuidPartitionTable:
        return std::make_unique<GptModel>(storage, parent);
    case LdmPrivateHeader:
        return std::make_unique<LdmPrivHeadModel>(storage, parent);
    case LdmTocBlock:
        return std::make_unique<LdmTocModel>(storage, parent);
    case LdmVmdbBlock:
        return std::make_unique<LdmVmdbModel>(storage, parent);
    case LdmKLogBlock:
        return std::make_unique<LdmKlogModel>(storage, parent);
    case LdmVblkBlock:
        return std::make_unique<LdmVblkModel>(storage, parent);
    default:
        break;
    }
    // Kinds added later come through the builder table.
    auto builder = createBuilder(type);
    if (!builder)
        return nullptr;
    return std::make_unique<Model>(storage, std::move(builder), parent);
}

bool Model::isTemplate() const
{
    return m_record.isTemplate();
}

std::uint32_t Model::recordSize() const
{
    return m_record.recordSize();
}

QByteArray Model::rawValue(std::uint32_t offset, std::uint32_t size, bool isCopy) const
{
    const QByteArray &b = m_record.buffer(isCopy);
    return Values::inside(b, offset, size) ? b.mid(offset, size) : QByteArray();
}

QString Model::formatValue(FieldFormat format, std::uint32_t offset, std::uint32_t size,
                           std::uint32_t parentSize, bool isCopy) const
{
    return Values::display(format, m_record.buffer(isCopy), offset, size, parentSize, m_record.bigEndian(),
                           m_record.locale());
}

void Model::rebuild()
{
    m_record.rebuild();
}

QVariantList Model::dependentChanges(std::uint32_t offset, std::uint32_t size) const
{
    return m_record.builder() ? m_record.builder()->dependentChanges(m_record, offset, size) : QVariantList();
}

void Model::setTemplateOffset(std::uint64_t offset, bool isPrimary)
{
    beginResetModel();
    if (isPrimary)
        m_record.setOffset(offset, true);
    else
        m_record.setOffset(offset, false);
    endResetModel();
}

void Model::setHexOffsets(bool hex)
{
    if (hex == m_hexOffsets)
        return;
    m_hexOffsets = hex;
    const Node *root = m_record.root();
    if (!root || root->children.empty())
        return;
    // Only the "Offset" column changes: of the top-level rows, or of the first group's children.
    const Node *first = root->children.front().get();
    if (first->format == Group && !first->children.empty()) {
        const QModelIndex parent = indexOf(first);
        emit dataChanged(index(0, 1, parent), index(int(first->children.size()) - 1, 1, parent),
                         {Qt::DisplayRole});
    }
    emit dataChanged(index(0, 1), index(int(root->children.size()) - 1, 1), {Qt::DisplayRole});
}

Node *Model::nodeOf(const QModelIndex &index)
{
    return index.isValid() ? static_cast<Node *>(index.internalPointer()) : nullptr;
}

QModelIndex Model::indexOf(const Node *node, int column) const
{
    if (!node || !node->parent)
        return {};
    return createIndex(node->row(), column, const_cast<Node *>(node));
}

bool Model::columnHasBuffer(int column) const
{
    if (column == 2)
        return !m_record.buffer(false).isEmpty();
    if (column == 3)
        return m_record.hasCopyColumn() && !m_record.buffer(true).isEmpty();
    return true;
}

QModelIndex Model::index(int row, int column, const QModelIndex &parent) const
{
    const Node *root = m_record.root();
    if (!root || row < 0 || column < 0 || column >= columnCount() || !columnHasBuffer(column))
        return {};
    const Node *p = parent.isValid() ? nodeOf(parent) : root;
    if (!p || std::size_t(row) >= p->children.size())
        return {};
    return createIndex(row, column, p->children[std::size_t(row)].get());
}

QModelIndex Model::parent(const QModelIndex &index) const
{
    const Node *n = nodeOf(index);
    if (!n || !n->parent || !n->parent->parent)
        return {};
    return createIndex(n->parent->row(), 0, n->parent);
}

int Model::rowCount(const QModelIndex &parent) const
{
    if (parent.column() > 0)
        return 0;
    const Node *p = parent.isValid() ? nodeOf(parent) : m_record.root();
    return p ? int(p->children.size()) : 0;
}

int Model::columnCount(const QModelIndex &) const
{
    return int(m_headers.size());
}

QVariant Model::headerData(int section, Qt::Orientation orientation, int role) const
{
    if (orientation == Qt::Horizontal && role == Qt::DisplayRole && section >= 0 &&
        section < m_headers.size())
        return m_headers[section];
    return {};
}

Qt::ItemFlags Model::flags(const QModelIndex &index) const
{
    Qt::ItemFlags f = QAbstractItemModel::flags(index);
    const Node *n = nodeOf(index);
    if (n && m_editable && (index.column() == 2 || index.column() == 3) && n->format != Text &&
        n->format != Note && n->format != Group && n->format != Caption)
        f |= Qt::ItemIsEditable;
    return f;
}

QVariant Model::data(const QModelIndex &index, int role) const
{
    const Node *n = nodeOf(index);
    if (!n)
        return {};
    const int column = index.column();
    const bool valueColumn = column == 2 || column == 3;
    const bool isCopy = column == 3;
    const bool link = n->isLink && valueColumn;
    switch (role) {
    case Qt::DisplayRole:
        if (column == 0)
            return n->name;
        if (column == 1)
            return m_record.offsetText(*n, m_hexOffsets, m_hexWidth, m_decimalWidth);
        if (valueColumn && columnHasBuffer(column)) {
            if (n->format == Text || n->format == Note)
                return n->text;
            if (n->format == Group || n->format == Caption)
                return {};
            const std::uint32_t parentSize = n->format == Bit && n->parent ? n->parent->size : 0;
            return formatValue(n->format, n->offset, n->size, parentSize, isCopy);
        }
        return {};
    case Qt::EditRole:
        if (valueColumn && n->format >= UInt8 && n->format <= UnixTime && columnHasBuffer(column))
            return m_record.editValue(*n, isCopy);
        return {};
    case Qt::ToolTipRole:
        return link ? QVariant(tr("Use CTRL + Click to follow the link")) : QVariant();
    case Qt::FontRole:
        if (n->format == Group || n->format == Caption) {
            QFont f;
            f.setBold(true);
            return f;
        }
        if (link) {
            QFont f;
            f.setUnderline(true);
            return f;
        }
        return {};
    case Qt::TextAlignmentRole:
        if (column == 1)
            return QVariant::fromValue(Qt::Alignment(Qt::AlignRight | Qt::AlignVCenter));
        return {};
    case Qt::ForegroundRole:
        return link ? QVariant(m_linkColor) : QVariant();
    case FormatRole:
        return int(n->format);
    case OffsetRole:
        return qulonglong(n->offset);
    case SizeRole:
        return qulonglong(n->size);
    case RawRole:
        return valueColumn ? QVariant(m_record.fieldBytes(*n, isCopy)) : QVariant();
    case ParentIdRole:
        return n->parent ? qint64(n->parent->id) : qint64(-1);
    case CursorRole:
        return link ? QVariant(int(Qt::PointingHandCursor)) : QVariant();
    case IdRole:
        return qint64(n->id);
    default:
        return {};
    }
}

std::optional<QByteArray> Model::parseText(const QModelIndex &index, const QString &text) const
{
    const Node *n = nodeOf(index);
    if (!n || (index.column() != 2 && index.column() != 3))
        return std::nullopt;
    return m_record.parseEdit(*n, text, index.column() == 3);
}

bool Model::setData(const QModelIndex &index, const QVariant &value, int role)
{
    const Node *n = nodeOf(index);
    if (role != Qt::EditRole || !n || (index.column() != 2 && index.column() != 3))
        return false;
    const auto changes = m_record.applyEdit(*n, value.toByteArray(), index.column() == 3);
    if (!changes)
        return false;
    emit dataChanged(index, index);
    emit templateModified(*changes);
    return true;
}

void Model::onDataChanged(const HexEditor::DiskArea &area)
{
    if (!m_record.overlaps(area.offset, area.length))
        return;
    beginResetModel();
    m_record.rebuild();
    endResetModel();
}

} // namespace HexEditor::Templates
