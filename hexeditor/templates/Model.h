// The item model of one template kind over the hex editor's storage: the field tree of the record
// at the primary offset (and of its copy), the values rendered per column, in-place editing that
// reports the bytes to write as `templateModified`, and link data for Ctrl+click navigation.
// The tree itself is built by the widget-free Record (core/), which the headless tool shares.
#pragma once

#include <QAbstractItemModel>
#include <QColor>
#include <QVariantList>

#include <memory>

#include "hexeditor/DiskArea.h"
#include "hexeditor/Storage.h" // declares the DiskArea meta type the slots use
#include "hexeditor/templates/core/Record.h"

namespace HexEditor {
class Storage;
}

namespace HexEditor::Templates {

class StorageSource;

class Model : public QAbstractItemModel
{
    Q_OBJECT

public:
    // User roles of data().
    enum Role {
        FormatRole = Qt::UserRole + 1,
        OffsetRole = Qt::UserRole + 2,
        SizeRole = Qt::UserRole + 3,
        RawRole = Qt::UserRole + 4,
        ParentIdRole = Qt::UserRole + 5,
        CursorRole = Qt::UserRole + 6,
        IdRole = Qt::UserRole + 7,
    };

    // The "No template" model (nothing is ever built).
    explicit Model(Storage *storage, QObject *parent = nullptr);
    // A template of the builder's kind.
    Model(Storage *storage, std::unique_ptr<Builder> builder, QObject *parent = nullptr);
    ~Model() override;

    // Makes the model of a kind (null for kinds without a template).
    static std::unique_ptr<Model> create(Storage *storage, int type, QObject *parent = nullptr);

    virtual bool isTemplate() const;
    virtual std::uint32_t recordSize() const;
    virtual QByteArray rawValue(std::uint32_t offset, std::uint32_t size, bool isCopy) const;
    virtual QString formatValue(FieldFormat format, std::uint32_t offset, std::uint32_t size,
                                std::uint32_t parentSize, bool isCopy) const;
    virtual void rebuild();
    virtual QVariantList dependentChanges(std::uint32_t offset, std::uint32_t size) const;

    Storage *storage() const { return m_storage; }
    Type type() const { return m_record.type(); }
    bool hasCopyColumn() const { return m_record.hasCopyColumn(); }
    std::uint64_t primaryOffset() const { return m_record.primaryOffset(); }
    std::uint64_t copyOffset() const { return m_record.copyOffset(); }
    const Record &record() const { return m_record; }
    Node *rootNode() const { return m_record.root(); }
    const QList<QPair<int, int>> &expandRows() const { return m_record.expandRows(); }

    // Stores the offset and rebuilds, inside a model reset.
    void setTemplateOffset(std::uint64_t offset, bool isPrimary);

    bool hexOffsets() const { return m_hexOffsets; }
    void setHexOffsets(bool hex);
    bool editable() const { return m_editable; }
    void setEditable(bool editable) { m_editable = editable; }
    void setLinkColor(const QColor &color) { m_linkColor = color; }

    // The node of an index (null for an invalid one) and the index of a node.
    static Node *nodeOf(const QModelIndex &index);
    QModelIndex indexOf(const Node *node, int column = 0) const;
    // The bytes a typed text stands for in a value column (for a Bit node the parent's bytes).
    std::optional<QByteArray> parseText(const QModelIndex &index, const QString &text) const;

    // QAbstractItemModel
    QModelIndex index(int row, int column, const QModelIndex &parent = QModelIndex()) const override;
    QModelIndex parent(const QModelIndex &index) const override;
    int rowCount(const QModelIndex &parent = QModelIndex()) const override;
    int columnCount(const QModelIndex &parent = QModelIndex()) const override;
    QVariant headerData(int section, Qt::Orientation orientation, int role = Qt::DisplayRole) const override;
    Qt::ItemFlags flags(const QModelIndex &index) const override;
    QVariant data(const QModelIndex &index, int role = Qt::DisplayRole) const override;
    bool setData(const QModelIndex &index, const QVariant &value, int role = Qt::EditRole) override;

signals:
    // [absolute offset (quint64), bytes, ...]: the edited field first, then its dependent changes.
    void templateModified(const QVariantList &changes);

public slots:
    // Rebuilds when the area touches the primary or the copy record.
    void onDataChanged(const HexEditor::DiskArea &area);

private:
    bool columnHasBuffer(int column) const;

    Storage *m_storage;
    std::unique_ptr<StorageSource> m_source;
    Record m_record;
    QStringList m_headers;
    bool m_hexOffsets = true;
    int m_hexWidth = 3;
    int m_decimalWidth = 3;
    bool m_editable = false;
    QColor m_linkColor = QColor(0, 0, 238);
};

} // namespace HexEditor::Templates
