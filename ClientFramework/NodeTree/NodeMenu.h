// Builds a context menu from a list of command ids and separators. Each id is looked up in the
// command registry and left out when it is not registered; separators never lead, trail or
// repeat. A menu entry is a proxy action (its objectName is the command id) that triggers the
// registry's action, so enabling it for one node leaves the registry's action alone.
#pragma once

#include <QString>
#include <QStringList>
#include <QVariant>

#include <functional>

class QAction;
class QMenu;
class NodeCore;

namespace Core {
class Commander;
}

class NodeMenu
{
public:
    // The separator marker and the place of the feature commands in an id list.
    static const QString Separator;   // "|"
    static const QString Placeholder; // "*"
    static const QString ActiveTable; // "@ActiveTable"

    NodeMenu(QMenu *menu, const NodeCore *node);

    // Adds the command (when registered); returns the menu's proxy action or null.
    QAction *addCommand(const QString &id, bool enabled = true, const QString &text = QString(),
                        const QVariant &data = QVariant());
    void addSeparator();
    // Adds a sub-menu (owned by the menu) after a pending separator.
    void addSubMenu(QMenu *sub);
    // The feature commands of the node (NodeCore::featureHook()).
    void addPlaceholder();
    // Adds every id of the list; `enabled` decides per id.
    void addAll(const QStringList &ids, const std::function<bool(const QString &)> &enabled = {});
    // Drops a separator at the end of the menu.
    void finish();

    QMenu *menu() const { return m_menu; }

private:
    QMenu *m_menu = nullptr;
    const NodeCore *m_node = nullptr;
    bool m_pendingSeparator = false;
};
