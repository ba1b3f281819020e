#include "hexeditor/templates/TemplateTreeCtrl.h"

#include <QMouseEvent>

#include "hexeditor/templates/Delegate.h"
#include "hexeditor/templates/Model.h"

namespace HexEditor::Templates {

TemplateTreeCtrl::TemplateTreeCtrl(QWidget *parent) : QTreeView(parent)
{
    setSelectionBehavior(QAbstractItemView::SelectRows);
    setSelectionMode(QAbstractItemView::SingleSelection);
    setMinimumHeight(100);
    setMouseTracking(true);
    setContextMenuPolicy(Qt::CustomContextMenu);
    setItemDelegate(new Delegate(this));
    setEditTriggers(QAbstractItemView::DoubleClicked | QAbstractItemView::EditKeyPressed);
    setAlternatingRowColors(true);
}

void TemplateTreeCtrl::currentChanged(const QModelIndex &current, const QModelIndex &previous)
{
    QTreeView::currentChanged(current, previous);
    Node *node = Model::nodeOf(current);
    Context context = ContextNone;
    if (node && (node->format == Bit || node->format == Caption))
        node = nullptr;
    if (node)
        context = current.column() == 2 ? ContextPrimary : current.column() == 3 ? ContextCopy : ContextNone;
    emit nodeSelected(node, context);
}

void TemplateTreeCtrl::mouseMoveEvent(QMouseEvent *event)
{
    const QModelIndex i = indexAt(event->position().toPoint());
    const QVariant shape = i.data(Model::CursorRole);
    viewport()->setCursor(shape.isValid() ? Qt::CursorShape(shape.toInt()) : Qt::ArrowCursor);
    QTreeView::mouseMoveEvent(event);
}

void TemplateTreeCtrl::mousePressEvent(QMouseEvent *event)
{
    m_pressModifiers = event->modifiers();
    QTreeView::mousePressEvent(event);
}

void TemplateTreeCtrl::leaveEvent(QEvent *event)
{
    viewport()->setCursor(Qt::ArrowCursor);
    QTreeView::leaveEvent(event);
}

} // namespace HexEditor::Templates
