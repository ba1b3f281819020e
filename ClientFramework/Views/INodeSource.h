// A view that shows nodes: the nodes it has selected. The view announces changes through
// GenericView::nodeSelectionChanged; the window manager forwards those of the active view.
#pragma once

#include <QList>

#include "ClientFramework/NodeTree/NodeCore.h"

class INodeSource
{
public:
    virtual ~INodeSource() = default;
    virtual QList<NodeCore *> selectedNodes() const = 0;
    // The node with the keyboard focus, or nullptr.
    virtual NodeCore *currentNode() const
    {
        const QList<NodeCore *> nodes = selectedNodes();
        return nodes.isEmpty() ? nullptr : nodes.constFirst();
    }
};
