// The field editor of the template tree: a line edit with the validator and input mask of the
// field's format; the typed text is parsed into the field's bytes and handed to the model.
#pragma once

#include <QStyledItemDelegate>

namespace HexEditor::Templates {

class Delegate : public QStyledItemDelegate
{
    Q_OBJECT
public:
    using QStyledItemDelegate::QStyledItemDelegate;

    QWidget *createEditor(QWidget *parent, const QStyleOptionViewItem &option,
                          const QModelIndex &index) const override;
    void setEditorData(QWidget *editor, const QModelIndex &index) const override;
    void setModelData(QWidget *editor, QAbstractItemModel *model, const QModelIndex &index) const override;

    // Parses `text` for the field at `index` and writes it through the model (for a bit, the parent
    // field's bytes through the parent's index). False when the text is refused or nothing changed.
    static bool commitText(QAbstractItemModel *model, const QModelIndex &index, const QString &text);
};

} // namespace HexEditor::Templates
