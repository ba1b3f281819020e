// A worker thread that populates one node under a NodeTag. The node's new children are built
// on the worker and handed over on the interface thread once the tag has finished: connect to
// populated() (queued), or call apply() after wait().
#pragma once

#include "ClientFramework/Threads/NodeTag.h"

#include <QThread>

class NodeCore;

namespace Threads {

class NodeTagged : public QThread
{
    Q_OBJECT
public:
    explicit NodeTagged(NodeCore *node, bool recursive = false, bool force = false,
                        QObject *parent = nullptr);
    ~NodeTagged() override;

    NodeTag &tag() { return m_tag; }
    const NodeTag &tag() const { return m_tag; }
    NodeCore *node() const { return m_tag.node(); }

    void cancel() { m_tag.cancel(); }

    // On the interface thread, after the worker ended: hands the children built by the worker
    // to the node (nothing after a cancel). Called by the finished handler; safe to call twice.
    void apply();
    // The node is going away: nothing is handed over any more.
    void abandon() { m_applied = true; }

signals:
    // Emitted on the interface thread after apply(); cancelled tells whether it was cancelled.
    void populated(NodeCore *node, bool cancelled);

protected:
    void run() override;

private:
    NodeTag m_tag;
    bool m_applied = false;
};

} // namespace Threads
