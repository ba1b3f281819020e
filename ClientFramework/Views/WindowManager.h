// Hosts the views of the main window, each registered under a view id and created on first request:
// document views as tabs, panes as dock widgets of the host window. Forwards the node selection of
// the active view.
#pragma once

#include "ClientFramework/Views/INodeSource.h"

#include <QHash>
#include <QList>
#include <QStringList>
#include <QTabWidget>

#include <functional>

class INodeSource;
class NodeCore;
class QDockWidget;
class QMainWindow;

namespace Framework {

class GenericView;

class WindowManager : public QTabWidget
{
    Q_OBJECT
public:
    using Factory = std::function<GenericView *()>;
    enum class Placement { Tab, DockLeft, DockRight, DockBottom };

    // host receives the dock panes (may be nullptr: every view becomes a tab).
    explicit WindowManager(QMainWindow *host, QWidget *parent = nullptr);
    ~WindowManager() override;

    // Makes a view id known; the factory builds the view when it is first opened.
    void registerView(const QString &viewId, Factory factory, Placement placement = Placement::Tab);
    bool isRegistered(const QString &viewId) const { return m_factories.contains(viewId); }
    QStringList registeredIds() const { return m_order; }
    Placement placement(const QString &viewId) const { return m_placements.value(viewId, Placement::Tab); }

    // Creates the view on first request and activates it afterwards; nullptr for an unknown id.
    GenericView *openView(const QString &viewId);
    // Hosts a view made elsewhere (a document view per node) as a tab or pane and activates it.
    void addView(GenericView *view, Placement placement = Placement::Tab);
    // Closes a tab view or hides a pane; false when it is not open.
    bool closeView(const QString &viewId);
    // The open view of an id (a pane even when hidden), or nullptr.
    GenericView *view(const QString &viewId) const;
    // The open views: tabs in tab order, then panes.
    QList<GenericView *> views() const;
    // Whether the view is shown (a tab is while open; a pane while its dock is visible).
    bool isShown(const GenericView *view) const;
    // The dock of a pane, or nullptr.
    QDockWidget *dock(const QString &viewId) const { return m_docks.value(viewId, nullptr); }
    // The current tab view, or nullptr.
    GenericView *activeView() const;

    // Opens the node in the "browser" view: logs "Opening in File Browser: %1".
    void openInBrowser(NodeCore *node);
    // The display name of a node for messages (set by the product; empty by default).
    void setNodeNamer(std::function<QString(NodeCore *)> namer) { m_nodeName = std::move(namer); }

signals:
    void viewsChanged();
    // A view was made and is about to be shown (its settings may be loaded now).
    void viewCreated(Framework::GenericView *view);
    void activeViewChanged(Framework::GenericView *view);
    // The selection of the active node view changed (source nullptr and no nodes when the active
    // view shows no nodes).
    void selectionChanged(INodeSource *source, const QList<NodeCore *> &nodes);
    // A view asks the browser to show a node.
    void browseRequested(NodeCore *node);

private:
    void adopt(GenericView *view);
    void onCurrentChanged();

    QMainWindow *m_host;
    QHash<QString, Factory> m_factories;
    QHash<QString, Placement> m_placements;
    QStringList m_order;
    QHash<QString, QDockWidget *> m_docks;
    std::function<QString(NodeCore *)> m_nodeName;
};

} // namespace Framework
