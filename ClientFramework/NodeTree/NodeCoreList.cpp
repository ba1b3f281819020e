#include "ClientFramework/NodeTree/NodeCoreList.h"

#include "ClientFramework/NodeTree/NodeMenu.h"

#include <QCoreApplication>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

QString NodeCoreList::summary() const
{
    for (const NodeCore *n : *this)
        if (!n || n->isInvalid())
            return tr("Invalid item(s)");
    return tr("<b>%1</b> item(s)").arg(size());
}

QList<PropertyGroup> NodeCoreList::properties() const
{
    PropertyGroup g{tr("General Information"), {}};
    g.items.append({tr("Selection"), summary(), QString()});
    return {g};
}

void NodeCoreList::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, isEmpty() ? nullptr : first());
    bool ready = !isEmpty();
    bool running = false;
    for (const NodeCore *n : *this) {
        if (!n || !n->isReady())
            ready = false;
        if (n && (n->state() & (NodeState::Busy | NodeState::Waiting)))
            running = true;
    }
    m.addCommand(QStringLiteral("cmdHex_NodeOpen"), ready);
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdNode_Stop"), running, tr("Stop"));
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdRefresh"));
    m.addCommand(QStringLiteral("cmdNode_StopAll"));
    m.addSeparator();
    m.addCommand(QStringLiteral("cmdProperties"));
    m.finish();
}
