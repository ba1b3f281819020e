// Observation of nodes: a subscriber registered on a node hears of changes of that node and of
// every node below it (notifications travel up the parent chain).
#pragma once

class NodeCore;

class INodeSubscriber
{
public:
    virtual ~INodeSubscriber() = default;

    // The node's texts or state changed; recursive: its descendants' too.
    virtual void nodeChanged(NodeCore *node, bool recursive) { (void)node, (void)recursive; }
    // Rows first..last of parent's children are inserted / removed.
    virtual void childrenAboutToBeInserted(NodeCore *parent, int first, int last)
    {
        (void)parent, (void)first, (void)last;
    }
    virtual void childrenInserted(NodeCore *parent, int first, int last)
    {
        (void)parent, (void)first, (void)last;
    }
    virtual void childrenAboutToBeRemoved(NodeCore *parent, int first, int last)
    {
        (void)parent, (void)first, (void)last;
    }
    virtual void childrenRemoved(NodeCore *parent, int first, int last)
    {
        (void)parent, (void)first, (void)last;
    }
    // The node the subscriber is registered on is being destroyed.
    virtual void publisherDestroyed(NodeCore *node) { (void)node; }
};

class IPublisher
{
public:
    virtual ~IPublisher() = default;

    virtual void subscribe(INodeSubscriber *subscriber) = 0;
    virtual void unsubscribe(INodeSubscriber *subscriber) = 0;
};
