// The registry of commands: one record and one QAction per command id, from which menus, toolbars and
// context menus take their actions.
#pragma once

#include <QHash>
#include <QList>
#include <QObject>
#include <QString>

class QAction;

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

    // The action of a command, or nullptr when the id is not registered.
    QAction *action(const QString &id) const;
    // Adds a command; a record with an id already registered replaces the old one.
    void registerCommand(const CommandRecord &record);
    bool isRegistered(const QString &id) const { return m_actions.contains(id); }

    // The commands every product of the framework has.
    static const QList<CommandRecord> &frameworkCommands();

private:
    QHash<QString, QAction *> m_actions;
};

} // namespace Core
