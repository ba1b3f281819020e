#include "ClientFramework/NodeTree/NodeMenu.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/NodeTree/NodeCore.h"

#include <QAction>
#include <QMenu>

const QString NodeMenu::Separator = QStringLiteral("|");
const QString NodeMenu::Placeholder = QStringLiteral("*");
const QString NodeMenu::ActiveTable = QStringLiteral("@ActiveTable");

NodeMenu::NodeMenu(QMenu *menu, const NodeCore *node) : m_menu(menu), m_node(node)
{
    // A menu that already has entries gets a separator before the first new one.
    m_pendingSeparator = menu && !menu->actions().isEmpty() && !menu->actions().last()->isSeparator();
}

QAction *NodeMenu::addCommand(const QString &id, bool enabled, const QString &text, const QVariant &data)
{
    Core::Commander *commander = NodeCore::commander();
    if (!m_menu || !commander)
        return nullptr;
    QAction *source = commander->action(id);
    if (!source)
        return nullptr;
    if (m_pendingSeparator) {
        m_menu->addSeparator();
        m_pendingSeparator = false;
    }
    auto *proxy = new QAction(source->icon(), text.isEmpty() ? source->text() : text, m_menu);
    proxy->setObjectName(id);
    proxy->setShortcut(source->shortcut());
    proxy->setToolTip(source->toolTip());
    proxy->setStatusTip(source->statusTip());
    proxy->setCheckable(source->isCheckable());
    proxy->setEnabled(enabled && source->isEnabled());
    proxy->setData(data);
    QObject::connect(proxy, &QAction::triggered, source, [source, data] {
        if (data.isValid())
            source->setData(data);
        source->trigger();
    });
    m_menu->addAction(proxy);
    return proxy;
}

void NodeMenu::addSeparator()
{
    if (m_menu && !m_menu->actions().isEmpty())
        m_pendingSeparator = true;
}

void NodeMenu::addSubMenu(QMenu *sub)
{
    if (!m_menu || !sub)
        return;
    if (m_pendingSeparator) {
        m_menu->addSeparator();
        m_pendingSeparator = false;
    }
    sub->setParent(m_menu, sub->windowFlags());
    m_menu->addMenu(sub);
}

void NodeMenu::addPlaceholder()
{
    const NodeCore::FeatureHook &hook = NodeCore::featureHook();
    if (!hook || !m_menu || !m_node)
        return;
    const qsizetype before = m_menu->actions().size();
    QMenu scratch;
    hook(*m_node, &scratch);
    if (scratch.actions().isEmpty())
        return;
    if (m_pendingSeparator && before > 0) {
        m_menu->addSeparator();
        m_pendingSeparator = false;
    }
    for (QAction *a : scratch.actions()) {
        if (a->isSeparator()) {
            addSeparator();
            continue;
        }
        if (m_pendingSeparator) {
            m_menu->addSeparator();
            m_pendingSeparator = false;
        }
        if (a->parent() == &scratch)
            a->setParent(m_menu);
        m_menu->addAction(a);
    }
}

void NodeMenu::addAll(const QStringList &ids, const std::function<bool(const QString &)> &enabled)
{
    for (const QString &id : ids) {
        if (id == Separator)
            addSeparator();
        else if (id == Placeholder)
            addPlaceholder();
        else
            addCommand(id, enabled ? enabled(id) : true);
    }
}

void NodeMenu::finish()
{
    m_pendingSeparator = false;
    if (!m_menu)
        return;
    while (!m_menu->actions().isEmpty() && m_menu->actions().last()->isSeparator())
        m_menu->removeAction(m_menu->actions().last());
}
