// The registry of commands: one record and one QAction per command id, from which menus, toolbars and
// context menus take their actions; the handlers of the commands and the rules that enable them; and
// the feature commanders that add their own commands.
#pragma once

#include "ClientFramework/Commands/FeatureCommander.h"

#include <QHash>
#include <QList>
#include <QObject>
#include <QSet>
#include <QString>

#include <cstdint>
#include <functional>

class QAction;
class QMenu;
class NodeCore;

namespace Core {

struct CommandRecord
{
    QString id;
    QString icon16;
    QString icon32;
    QString icon48;
    QString shortcut;
    QString text; // "%1" is replaced by the application's short name
    QString tip;
};

class Commander : public QObject
{
    Q_OBJECT
public:
    explicit Commander(QObject *parent = nullptr);
    ~Commander() override;

    // The registry of the running window (the one made last), or nullptr. Node context menus take
    // their actions from it.
    static Commander *current();

    // The action of a command, or nullptr when the id is not registered.
    QAction *action(const QString &id) const;
    // Adds a command; a record with an id already registered replaces the old one.
    void registerCommand(const CommandRecord &record);
    bool isRegistered(const QString &id) const { return m_actions.contains(id); }
    QStringList ids() const { return m_actions.keys(); }

    // Connects the handler of a command (replacing an earlier one); a command without a handler,
    // not owned by a feature, stays disabled.
    void setHandler(const QString &id, std::function<void()> handler);
    bool hasHandler(const QString &id) const { return m_handled.contains(id); }

    // Runs a command for nodes: a feature that owns the id runs it, else the action is triggered
    // with the nodes as the selection. False when the id is unknown or disabled.
    bool execute(const QString &id, const QList<NodeCore *> &nodes);
    // The nodes the commands act on (the selection of the active node view).
    const QList<NodeCore *> &selection() const { return m_selection; }
    // Sets the selection and updates the enabled state of the commands from the nodes' state flags.
    void setSelection(const QList<NodeCore *> &nodes);

    // Adds the actions of the ids to a menu in order: "" is a separator (never two in a row, none
    // first), ids without a command are skipped. Returns the number of actions added.
    int addActions(QMenu *menu, const QStringList &ids) const;
    // Adds the feature commands for the nodes at the current end of the menu (the placeholder).
    int addFeatureCommands(QMenu *menu, const QList<NodeCore *> &nodes) const;

    // Feature commanders: registered in order, their commands added now (not owned).
    void addFeature(IFeatureCommander *feature);
    const FeatureCommanderList &features() const { return m_features; }

    // Command enabling. While a process runs, cmdRefresh, cmdSettings and cmdExitApp are disabled
    // and cmdNode_Stop and cmdNode_StopAll enabled; otherwise the reverse. For the selection,
    // cmdNode_Stop needs a node that is Busy or Waiting, cmdNode_Browse no node that is Busy.
    void setProcessRunning(bool running);
    bool isProcessRunning() const { return m_processRunning; }
    // The selection's state flag words (set by setSelection through stateOf, or directly by tests).
    void setSelectionStates(const QList<uint32_t> &states);
    // The state word of a node; the product sets it (the node tree's flags).
    void setStateReader(std::function<uint32_t(NodeCore *)> reader) { m_stateOf = std::move(reader); }
    // Recomputes every action's enabled state.
    void updateEnabled();

    // The commands every product of the framework has.
    static const QList<CommandRecord> &frameworkCommands();

    static constexpr uint32_t StateWaiting = 0x200000;
    static constexpr uint32_t StateBusy = 0x400000;

signals:
    // The selection the commands act on changed.
    void selectionChanged();

private:
    bool ruleAllows(const QString &id) const;

    QHash<QString, QAction *> m_actions;
    QSet<QString> m_handled;
    QHash<QString, QMetaObject::Connection> m_connections;
    FeatureCommanderList m_features;
    IFeatureCommander *m_registering = nullptr;
    QList<NodeCore *> m_selection;
    QList<uint32_t> m_selectionStates;
    std::function<uint32_t(NodeCore *)> m_stateOf;
    bool m_processRunning = false;
};

} // namespace Core
