// The template pane's field tree: whole-row selection, the field editor delegate, the link cursor
// while the mouse moves over a link, and the selected node reported with its column context.
#pragma once

#include <QTreeView>

#include "hexeditor/templates/core/FieldFormat.h"

namespace HexEditor::Templates {

struct Node;

class TemplateTreeCtrl : public QTreeView
{
    Q_OBJECT
public:
    explicit TemplateTreeCtrl(QWidget *parent = nullptr);

    // The keyboard modifiers of the last mouse press (Ctrl+click follows links).
    Qt::KeyboardModifiers pressModifiers() const { return m_pressModifiers; }

signals:
    void nodeSelected(HexEditor::Templates::Node *const node, HexEditor::Templates::Context context);

protected:
    void currentChanged(const QModelIndex &current, const QModelIndex &previous) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void leaveEvent(QEvent *event) override;

private:
    Qt::KeyboardModifiers m_pressModifiers = Qt::NoModifier;
};

} // namespace HexEditor::Templates
