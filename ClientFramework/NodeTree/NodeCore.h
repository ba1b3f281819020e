// The abstract node of the node tree: parent, ordered children, the 32-bit state word, attribute
// texts, the status text and colour, properties, the context menu and the default command.
// Nodes live on the interface thread; a worker thread only builds a node's new children (see
// populate()), which the interface thread hands over with applyPopulation().
#pragma once

#include "ClientFramework/NodeTree/Attributes.h"
#include "ClientFramework/NodeTree/IProperty.h"
#include "ClientFramework/NodeTree/IPublisher.h"
#include "ClientFramework/NodeTree/NodeAttr.h"

#include <QColor>
#include <QList>
#include <QMetaType>
#include <QPair>
#include <QString>
#include <QVariant>

#include <cstdint>
#include <functional>

class QMenu;

namespace Core {
class Commander;
}
namespace Threads {
class NodeTag;
}

class NodeCore : public IPublisher, public IProperty, public Attributes<NodeAttr>
{
public:
    // Counters summed over a folder's children during population.
    struct Counters
    {
        std::uint64_t folders = 0;
        std::uint64_t files = 0;
        std::uint64_t size = 0;
        std::uint64_t deleted = 0;
    };

    explicit NodeCore(NodeCore *parent = nullptr);
    ~NodeCore() override;
    NodeCore(const NodeCore &) = delete;
    NodeCore &operator=(const NodeCore &) = delete;

    virtual NodeKind kind() const = 0;

    // Tree.
    NodeCore *parent() const { return m_parent; }
    int childCount() const { return int(m_children.size()); }
    NodeCore *child(int row) const { return row >= 0 && row < m_children.size() ? m_children[row] : nullptr; }
    int indexOf(const NodeCore *child) const;
    const QList<NodeCore *> &children() const { return m_children; }
    // Whether `node` is this node or below it.
    bool isAncestorOf(const NodeCore *node) const;
    // The first node of this subtree (this node included) whose Key text equals key.
    NodeCore *findByKey(const QString &key);

    // Tree edits on the interface thread; subscribers hear of them. The node takes ownership.
    void appendChild(NodeCore *child);
    void insertChild(int row, NodeCore *child);
    // Removes and destroys the child at row.
    void removeChild(int row);
    void clearChildren();
    // Appends several children with one notification.
    void appendChildren(const QList<NodeCore *> &children);

    // State word.
    std::uint32_t state() const { return m_state; }
    void setState(std::uint32_t state) { m_state = state; }
    void setFlags(std::uint32_t flags, bool on = true);
    bool hasFlags(std::uint32_t flags) const { return (m_state & flags) == flags; }
    bool isReady() const { return hasFlags(NodeState::Ready); }
    bool isPopulated() const { return hasFlags(NodeState::Populated); }
    bool isInvalid() const { return hasFlags(NodeState::Invalid); }

    const Counters &counters() const { return m_counters; }

    // IPublisher
    void subscribe(INodeSubscriber *subscriber) override;
    void unsubscribe(INodeSubscriber *subscriber) override;

    // Population. canPopulate(): the node builds its children on request (folders). populate()
    // runs on a worker thread (or on the interface thread when called directly) and must not
    // touch the live child list: it prepares the new children; applyPopulation() hands them over
    // on the interface thread. populate() answers false when the tag was cancelled.
    virtual bool canPopulate() const { return false; }
    virtual bool populate(Threads::NodeTag *tag);
    virtual void applyPopulation() {}
    // populate() then applyPopulation() on the calling (interface) thread.
    bool populateNow(bool recursive = false, bool force = false);

    // Notifications to the subscribers of this node and of its ancestors.
    void notifyChanged(bool recursive = false);
    void notifyChildrenChanged();

    // Attributes.
    QString text(NodeAttr attr) const override;
    QVariant data(NodeAttr attr, int role) const override;
    // A label and value for the property pane.
    virtual QPair<QString, QString> property(NodeAttr attr) const;
    QList<PropertyGroup> properties() const override;

    // The status text by the state-flag precedence, and the status colour from the active
    // theme's node palette.
    virtual QString statusText() const;
    QColor statusColor() const;
    // The node palette entry the status colour is taken from ("success", "ghost", ...).
    QString statusColorEntry() const;

    // Fills `menu` with the node kind's commands from the command registry (an id that is not
    // registered is left out; separators never lead, trail or repeat).
    virtual void contextMenu(QMenu *menu) const;
    // The command run on double-click or Enter ("" for none).
    virtual QString defaultCommand() const { return QString(); }

    // The command registry context menus take their actions from (not owned).
    static void setCommander(Core::Commander *commander);
    static Core::Commander *commander();
    // Feature commands: called where a node's menu has its placeholder.
    using FeatureHook = std::function<void(const NodeCore &node, QMenu *menu)>;
    static void setFeatureHook(FeatureHook hook);
    static const FeatureHook &featureHook();

    // Shows a byte count as "512 bytes", "1.5 KB", "64.0 MB", "2.00 GB".
    static QString sizeText(std::uint64_t bytes);

protected:
    // What an attribute answers; text() falls back to this for the common attributes.
    virtual QString name() const = 0;
    virtual QString typeKey() const = 0;
    virtual QString key() const = 0;
    virtual QString kindText() const { return QString(); }
    virtual QString sourceText() const { return QString(); }
    // Further attributes of a node kind (empty by default).
    virtual QString extraText(NodeAttr attr) const;

    Counters &mutableCounters() { return m_counters; }

    // Notifications to the subscribers of this node and of its ancestors.
    void emitAboutToInsert(int first, int last);
    void emitInserted(int first, int last);
    void emitAboutToRemove(int first, int last);
    void emitRemoved(int first, int last);

    // The children list, for subclasses that swap in prepared children themselves.
    QList<NodeCore *> &childList() { return m_children; }

private:
    NodeCore *m_parent = nullptr;
    // Set once the parent lists the node: only then do notifications travel up to the parent's
    // subscribers (a node being built is not known to them yet).
    bool m_linked = false;
    QList<NodeCore *> m_children;
    std::uint32_t m_state = 0;
    Counters m_counters;
    QList<INodeSubscriber *> m_subscribers;
};

Q_DECLARE_METATYPE(NodeCore *)

// Intermediate base of every node kind except files and containers.
class NodeStatic : public NodeCore
{
public:
    using NodeCore::NodeCore;
};
