// What the command-line action needs from the node tree, the kernel and the hex editor. The product
// implements it once those exist; until then NoKernelHost answers that nothing can be found.
#pragma once

#include <QList>
#include <QString>

#include <cstdint>
#include <functional>

class NodeCore;

namespace CLI {

// A device as the kernel lists it, in kernel order.
struct ContextDevice
{
    int prefix = 1; // 0 floppy, 1 physical disk, 2 CD/DVD drive, 3 virtual disk (mounted image)
    NodeCore *node = nullptr;
    QString imagePath; // the image file of a virtual disk
};

class IRequestHost
{
public:
    virtual ~IRequestHost() = default;

    // Writes the hardware-information report; false when it could not be written.
    virtual bool saveHardwareInfo(const QString &fileName) = 0;

    // The node of a path in the node tree, or nullptr; *ready tells whether it has been prepared.
    virtual NodeCore *findFileNode(const QString &path, bool *ready) = 0;
    // Asks the product commander to prepare a node; done runs once it is ready.
    virtual void prepareNode(NodeCore *node, std::function<void()> done) = 0;
    // Opens the path as a file node (the file as it lives in its file system); nullptr when it cannot.
    virtual NodeCore *openFileNode(const QString &path) = 0;

    // The kernel's devices in order.
    virtual QList<ContextDevice> devices() = 0;
    // The volume node of a device whose start offset in bytes equals offset, or nullptr.
    virtual NodeCore *volumeAt(NodeCore *device, uint64_t offset) = 0;

    // Hands the request to the hex editor (its commander's openInHexEditor).
    virtual void openInHexEditor(NodeCore *node, uint64_t offset, bool readOnly, int type,
                                 uint64_t offsetTmpl) = 0;
};

// The host while there is no kernel root and no node tree: nothing is found.
class NoKernelHost : public IRequestHost
{
public:
    bool saveHardwareInfo(const QString &) override { return false; }
    NodeCore *findFileNode(const QString &, bool *ready) override
    {
        if (ready)
            *ready = false;
        return nullptr;
    }
    void prepareNode(NodeCore *, std::function<void()>) override {}
    NodeCore *openFileNode(const QString &) override { return nullptr; }
    QList<ContextDevice> devices() override { return {}; }
    NodeCore *volumeAt(NodeCore *, uint64_t) override { return nullptr; }
    void openInHexEditor(NodeCore *, uint64_t, bool, int, uint64_t) override {}
};

} // namespace CLI
