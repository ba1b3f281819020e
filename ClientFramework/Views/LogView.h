// The "Application Log" view: the entries of the application log in a tree with the columns
// "Event" and "Message", following the newest entry.
#pragma once

#include "ClientFramework/Views/GenericView.h"

class QTreeView;

namespace Framework {

class LogView : public GenericView
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("view-log");

    explicit LogView(QWidget *parent = nullptr);
    QTreeView *tree() const { return m_tree; }

private:
    QTreeView *m_tree;
};

} // namespace Framework
