#include "ClientFramework/NodeTree/DiskBrowserModel.h"

#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/Threads/NodeTagged.h"

#include <QCoreApplication>
#include <QDeadlineTimer>
#include <QHash>
#include <QPersistentModelIndex>
#include <QPointer>
#include <QThread>

namespace {

// The folders under population by any model of the process, with the model that populates each.
// Two views over the same tree would otherwise run two workers on one folder at once, and both
// would build that folder's pending children together. Touched on the interface thread only.
QHash<const NodeCore *, const DiskBrowserModel *> &claims()
{
    static QHash<const NodeCore *, const DiskBrowserModel *> map;
    return map;
}

bool claimedElsewhere(const NodeCore *node, const DiskBrowserModel *model)
{
    const auto it = claims().constFind(node);
    return it != claims().constEnd() && it.value() != model;
}

// Models that asked for a folder while another model populated it. When that population ends
// without a result (cancelled), they start their own. The node is only a key here: a removed row
// leaves its index invalid, and the entry is dropped.
struct Waiter
{
    QPointer<DiskBrowserModel> model;
    QPersistentModelIndex index;
};

QMultiHash<const NodeCore *, Waiter> &waiters()
{
    static QMultiHash<const NodeCore *, Waiter> map;
    return map;
}

void wait(const NodeCore *node, DiskBrowserModel *model, const QModelIndex &index)
{
    for (auto it = waiters().constFind(node); it != waiters().constEnd() && it.key() == node; ++it)
        if (it.value().model == model)
            return;
    waiters().insert(node, Waiter{model, QPersistentModelIndex(index)});
}

// Ends a model's claim on a node. `node` must still exist unless `retry` is false.
void release(NodeCore *node, const DiskBrowserModel *model, bool retry = true)
{
    const auto it = claims().find(node);
    if (it == claims().end() || it.value() != model)
        return;
    claims().erase(it);
    const QList<Waiter> waiting = waiters().values(node);
    waiters().remove(node);
    if (!retry || node->isPopulated())
        return;
    for (const Waiter &w : waiting)
        if (w.model && w.model != model && w.index.isValid())
            w.model->fetchMore(w.index);
}

} // namespace

DiskBrowserModel::DiskBrowserModel(NodeCore *root, QObject *parent) : NodeModel(root, parent)
{
    qRegisterMetaType<NodeCore *>();
}

DiskBrowserModel::~DiskBrowserModel()
{
    cancelAll();
}

bool DiskBrowserModel::hasChildren(const QModelIndex &parent) const
{
    if (parent.isValid() && parent.column() != 0)
        return false;
    const NodeCore *node = nodeOf(parent);
    if (!node)
        return false;
    if (node->childCount() > 0)
        return true;
    // A folder that was never populated may have children.
    return node->canPopulate() && !node->isPopulated();
}

bool DiskBrowserModel::canFetchMore(const QModelIndex &parent) const
{
    if (parent.isValid() && parent.column() != 0)
        return false;
    const NodeCore *node = nodeOf(parent);
    return node && node->canPopulate() && !node->isPopulated() && !isPopulating(node) &&
           !claimedElsewhere(node, this);
}

bool DiskBrowserModel::isPopulating(const NodeCore *node) const
{
    if (m_queue.contains(const_cast<NodeCore *>(node)))
        return true;
    for (const Threads::NodeTagged *w : m_workers)
        if (w->node() == node)
            return true;
    return false;
}

void DiskBrowserModel::fetchMore(const QModelIndex &parent)
{
    NodeCore *node = nodeOf(parent);
    if (!node || !node->canPopulate() || node->isPopulated() || isPopulating(node))
        return;
    if (claimedElsewhere(node, this)) {
        wait(node, this, parent);
        return;
    }
    if (m_synchronous) {
        emit populationStarted(
            node, QCoreApplication::translate("NodeCore", "Populating %1").arg(node->text(NodeAttr::Name)));
        node->populateNow();
        emit populationFinished(node, false);
        return;
    }
    claims().insert(node, this);
    m_queue.append(node);
    startQueued();
}

void DiskBrowserModel::startQueued()
{
    while (m_workers.size() < MaxWorkers && !m_queue.isEmpty())
        startWorker(m_queue.takeFirst());
}

void DiskBrowserModel::startWorker(NodeCore *node)
{
    auto *worker = new Threads::NodeTagged(node, false, false, this);
    m_workers.append(worker);
    if (m_cancelOnStart.remove(node))
        worker->cancel(); // before its thread starts: the population ends at once, cancelled
    connect(worker, &Threads::NodeTagged::populated, this, [this, worker](NodeCore *n, bool cancelled) {
        m_workers.removeOne(worker);
        worker->deleteLater();
        release(n, this);
        emit populationFinished(n, cancelled);
        startQueued();
    });
    emit populationStarted(
        node, QCoreApplication::translate("NodeCore", "Populating %1").arg(node->text(NodeAttr::Name)));
    worker->start();
}

int DiskBrowserModel::cancel(const QList<NodeCore *> &nodes)
{
    const auto reached = [&nodes](const NodeCore *target) {
        for (const NodeCore *n : nodes)
            if (n && n->isAncestorOf(target))
                return true;
        return false;
    };
    int count = 0;
    for (Threads::NodeTagged *w : std::as_const(m_workers))
        if (!w->tag().isCancelled() && reached(w->node())) {
            w->cancel();
            ++count;
        }
    for (const NodeCore *n : std::as_const(m_queue))
        if (!m_cancelOnStart.contains(n) && reached(n)) {
            m_cancelOnStart.insert(n);
            ++count;
        }
    return count;
}

void DiskBrowserModel::cancelAll()
{
    for (NodeCore *n : std::as_const(m_queue))
        release(n, this);
    m_queue.clear();
    m_cancelOnStart.clear();
    const QList<Threads::NodeTagged *> workers = m_workers;
    for (Threads::NodeTagged *w : workers)
        w->cancel();
    for (Threads::NodeTagged *w : workers)
        w->wait();
    for (Threads::NodeTagged *w : workers)
        w->apply(); // a cancelled population leaves its folder unpopulated
    for (Threads::NodeTagged *w : workers) {
        release(w->node(), this);
        m_workers.removeOne(w);
        w->deleteLater();
    }
}

bool DiskBrowserModel::waitForPopulations(int timeoutMs)
{
    QDeadlineTimer deadline(timeoutMs);
    while (!m_workers.isEmpty() || !m_queue.isEmpty()) {
        if (deadline.hasExpired())
            return false;
        if (m_workers.isEmpty()) {
            startQueued();
            continue;
        }
        Threads::NodeTagged *w = m_workers.first();
        w->wait(QDeadlineTimer(50));
        if (w->isFinished())
            w->apply(); // emits populated(): the handler takes the worker out and starts the next
        QCoreApplication::processEvents();
    }
    return true;
}

void DiskBrowserModel::childrenAboutToBeRemoved(NodeCore *parent, int first, int last)
{
    // A population under a node that goes away is stopped first: its result would belong to
    // nodes that no longer exist.
    for (int r = first; r <= last; ++r) {
        NodeCore *gone = parent->child(r);
        for (qsizetype i = m_queue.size() - 1; i >= 0; --i)
            if (gone && gone->isAncestorOf(m_queue[i])) {
                release(m_queue[i], this, false);
                m_cancelOnStart.remove(m_queue[i]);
                m_queue.removeAt(i);
            }
    }
    const QList<Threads::NodeTagged *> workers = m_workers;
    for (Threads::NodeTagged *w : workers) {
        for (int r = first; r <= last; ++r) {
            NodeCore *gone = parent->child(r);
            if (gone && gone->isAncestorOf(w->node())) {
                w->abandon();
                w->cancel();
                w->wait();
                release(w->node(), this, false);
                m_workers.removeOne(w);
                w->disconnect(this);
                w->deleteLater();
                break;
            }
        }
    }
    NodeModel::childrenAboutToBeRemoved(parent, first, last);
}
