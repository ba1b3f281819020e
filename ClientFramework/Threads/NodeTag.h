// The tag of a node population: the node being populated, whether sub-folders are populated
// too, whether an already populated node is rebuilt, and the depth of the recursion.
#pragma once

#include "ClientFramework/Threads/Tag.h"

class NodeCore;

namespace Threads {

class NodeTag : public Tag
{
public:
    explicit NodeTag(NodeCore *node = nullptr, bool recursive = false, bool force = false)
        : m_node(node), m_recursive(recursive), m_force(force)
    {
    }

    NodeCore *node() const { return m_node; }
    // "Including sub-folders".
    bool recursive() const { return m_recursive; }
    void setRecursive(bool recursive) { m_recursive = recursive; }
    // Rebuild even when the node is populated and its child count did not change.
    bool force() const { return m_force; }
    void setForce(bool force) { m_force = force; }

    // Nesting depth of a recursive population (0 at the node the population started from).
    int depth() const { return m_depth; }
    void enter() { ++m_depth; }
    void leave() { --m_depth; }

private:
    NodeCore *m_node = nullptr;
    bool m_recursive = false;
    bool m_force = false;
    int m_depth = 0;
};

} // namespace Threads
