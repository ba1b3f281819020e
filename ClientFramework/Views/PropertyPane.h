// The property pane ("properties"): the property groups of the selection of the active node view.
#pragma once

#include "ClientFramework/Views/GenericView.h"

class QTreeWidget;

namespace Framework {

class PropertyPane : public GenericView
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("properties");

    explicit PropertyPane(QWidget *parent = nullptr);

    QTreeWidget *tree() const { return m_tree; }
    // Shows the groups of one node, the summary of several, or nothing.
    void showNodes(const QList<NodeCore *> &nodes);

private:
    QTreeWidget *m_tree;
};

} // namespace Framework
