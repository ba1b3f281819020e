// Feature modules (the hex editor, later the disk manager) bring their own commands and views through
// a feature commander. The product commander hosts a list of them: each registers its command records
// in the one registry and its view ids with the window manager, adds its commands at the placeholder
// of a node's context menu, runs the commands it owns for a node selection and keeps their enabled
// state in step with the selection.
#pragma once

#include <QList>
#include <QString>
#include <QStringList>

class NodeCore;

namespace Core {
class Commander;
}
namespace Framework {
class WindowManager;
}

class IFeatureCommander
{
public:
    virtual ~IFeatureCommander() = default;

    // A short lower-case id of the feature ("hex-editor").
    virtual QString featureId() const = 0;

    // Adds the feature's records to the registry and connects their handlers (Commander::setHandler
    // or QAction::triggered). Called once, after the framework's and the product's records.
    virtual void registerCommands(Core::Commander &commander) = 0;

    // Makes the feature's view ids known to the window manager. Called once the main window exists.
    virtual void registerViews(Framework::WindowManager &windows) { (void)windows; }

    // The ids the feature adds at the placeholder of a context menu for these nodes, in menu order
    // ("" is a separator). Ids that are not registered are skipped by the menu.
    virtual QStringList contextCommands(const QList<NodeCore *> &nodes) const
    {
        (void)nodes;
        return {};
    }

    // Runs one of the feature's commands for the nodes; false when the id is not the feature's.
    virtual bool execute(const QString &id, const QList<NodeCore *> &nodes)
    {
        (void)id;
        (void)nodes;
        return false;
    }

    // Sets the enabled state of the feature's commands for the selection of the active node view.
    virtual void updateCommands(const QList<NodeCore *> &selection) { (void)selection; }
};

// The feature commanders of a product, in registration order (not owned).
class FeatureCommanderList : public QList<IFeatureCommander *>
{
public:
    // The commander of a feature id, or nullptr.
    IFeatureCommander *find(const QString &featureId) const;

    // The first feature that runs the command; false when none does.
    bool execute(const QString &id, const QList<NodeCore *> &nodes) const;

    // The placeholder ids of every feature for these nodes, the features separated by "".
    QStringList contextCommands(const QList<NodeCore *> &nodes) const;

    void updateCommands(const QList<NodeCore *> &selection) const;
};
