#include "ClientFramework/Threads/NodeTagged.h"

#include "ClientFramework/NodeTree/NodeCore.h"

namespace Threads {

NodeTagged::NodeTagged(NodeCore *node, bool recursive, bool force, QObject *parent)
    : QThread(parent), m_tag(node, recursive, force)
{
    qRegisterMetaType<NodeCore *>();
    // The result is handed over on the thread that owns this object (the interface thread).
    connect(this, &QThread::finished, this, &NodeTagged::apply);
}

NodeTagged::~NodeTagged()
{
    m_tag.cancel();
    wait();
}

void NodeTagged::run()
{
    if (NodeCore *node = m_tag.node())
        node->populate(&m_tag);
    // A population that never started its tag (a recursive part, nothing to do) still ends.
    if (m_tag.state() == Tag::State::Idle)
        m_tag.start();
    m_tag.finish();
}

void NodeTagged::apply()
{
    if (m_applied || isRunning())
        return;
    m_applied = true;
    NodeCore *node = m_tag.node();
    const bool cancelled = m_tag.isCancelled();
    if (node)
        node->applyPopulation();
    emit populated(node, cancelled);
}

} // namespace Threads
