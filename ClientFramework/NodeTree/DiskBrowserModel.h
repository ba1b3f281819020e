// The file browser's model ("File Browser"): a NodeModel whose folders are populated on demand.
// fetchMore() starts a population worker (Threads::NodeTagged); its result is handed to the
// folder on the interface thread after the worker finished, and the rows appear then.
#pragma once

#include "ClientFramework/NodeTree/NodeModel.h"

#include <QList>
#include <QSet>

namespace Threads {
class NodeTagged;
}

class DiskBrowserModel : public NodeModel
{
    Q_OBJECT
public:
    explicit DiskBrowserModel(NodeCore *root, QObject *parent = nullptr);
    ~DiskBrowserModel() override;

    bool hasChildren(const QModelIndex &parent = QModelIndex()) const override;
    bool canFetchMore(const QModelIndex &parent) const override;
    void fetchMore(const QModelIndex &parent) override;

    // Populations run on a worker (default) or at once on the calling thread.
    void setSynchronous(bool synchronous) { m_synchronous = synchronous; }
    // Whether a population of the node is running.
    bool isPopulating(const NodeCore *node) const;
    // Cancels every running population and waits for the workers.
    void cancelAll();
    // Cancels the populations of the nodes and of nodes below them without waiting: a running one
    // ends cancelled, a queued one ends cancelled as its turn comes. Returns how many it reached
    // (a population already cancelled is not counted again).
    int cancel(const QList<NodeCore *> &nodes);
    // Waits until no population is running, delivering their results (tests, shutdown).
    bool waitForPopulations(int timeoutMs = 30000);

    void childrenAboutToBeRemoved(NodeCore *parent, int first, int last) override;

signals:
    // The population of a node started / ended (cancelled or not); text is "Populating %1".
    void populationStarted(NodeCore *node, const QString &text);
    void populationFinished(NodeCore *node, bool cancelled);

private:
    // Populations that run at once; the others wait in order.
    static constexpr int MaxWorkers = 2;

    void startWorker(NodeCore *node);
    void startQueued();

    QList<Threads::NodeTagged *> m_workers;
    QList<NodeCore *> m_queue;
    // Queued nodes whose population is cancelled as it starts.
    QSet<const NodeCore *> m_cancelOnStart;
    bool m_synchronous = false;
};
