#include "ClientFramework/Views/PropertyPane.h"

#include "ClientFramework/NodeTree/NodeCoreList.h"

#include <QHeaderView>
#include <QTreeWidget>

namespace Framework {

PropertyPane::PropertyPane(QWidget *parent)
    : GenericView(ViewId, tr("Properties"), parent), m_tree(new QTreeWidget)
{
    m_tree->setObjectName(QStringLiteral("propertyTree"));
    m_tree->setColumnCount(2);
    m_tree->setHeaderLabels({tr("Property"), tr("Value")});
    m_tree->setRootIsDecorated(true);
    m_tree->setAlternatingRowColors(true);
    m_tree->setUniformRowHeights(true);
    m_tree->header()->setSectionResizeMode(0, QHeaderView::ResizeToContents);
    m_tree->header()->setStretchLastSection(true);
    setCentralWidget(m_tree);
}

void PropertyPane::showNodes(const QList<NodeCore *> &nodes)
{
    m_tree->clear();
    QList<PropertyGroup> groups;
    if (nodes.size() == 1 && nodes.first())
        groups = nodes.first()->properties();
    else if (nodes.size() > 1)
        groups = NodeCoreList(nodes.cbegin(), nodes.cend()).properties();
    for (const PropertyGroup &g : std::as_const(groups)) {
        auto *top = new QTreeWidgetItem(m_tree, {g.title});
        QFont bold = top->font(0);
        bold.setBold(true);
        top->setFont(0, bold);
        top->setFirstColumnSpanned(true);
        for (const PropertyItem &item : g.items) {
            auto *row = new QTreeWidgetItem(top, {item.label, item.value});
            if (!item.tip.isEmpty())
                row->setToolTip(0, item.tip);
            row->setToolTip(1, item.value);
        }
    }
    m_tree->expandAll();
}

} // namespace Framework
