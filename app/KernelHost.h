// The command-line action's host over the disk kernel, the node tree and the hex editor: the
// hardware report, mounted images, the devices in kernel order with their prefixes, volumes by
// start offset, files by path, and the request that opens a node in the hex editor.
#pragma once

#include "app/RequestHost.h"

#include <QPointer>

#include <memory>
#include <vector>

class CRoot;
class NodeRoot;

namespace Framework {
class MainView;
}

namespace HexEditor {
class Commander;
}

namespace CLI {

class KernelHost : public IRequestHost
{
public:
    explicit KernelHost(CRoot &root);
    ~KernelHost() override;

    // Writes the report of the listed devices (enumerated first when nothing has been yet) with
    // the application log's lines; the outcome is logged.
    bool saveHardwareInfo(const QString &fileName) override;

    // Opens an image file (any supported format) and adds it to the kernel as a virtual disk.
    bool mountImage(const QString &path);

    // The node tree requests are answered from (not owned). Without one the host keeps its own
    // tree over the kernel root.
    void setNodeRoot(NodeRoot *nodes) { m_nodes = nodes; }
    NodeRoot *nodeRoot();
    // The hex editor that carries out openInHexEditor (not owned).
    void setHexEditor(HexEditor::Commander *commander);
    HexEditor::Commander *hexEditor() const;
    // Adds the hex editor's commands and views to the main window (a hex editor of the host's own
    // unless the window has one already) and takes it for the requests. A request that finds no
    // hex editor attaches to the application's main window itself.
    HexEditor::Commander *attach(Framework::MainView &window);

    // A path names a plain file of the computer: its node is ready at once.
    NodeCore *findFileNode(const QString &path, bool *ready) override;
    void prepareNode(NodeCore *node, std::function<void()> done) override;
    NodeCore *openFileNode(const QString &path) override;

    // The kernel's devices in order (enumerated first when the kernel has not listed them yet).
    QList<ContextDevice> devices() override;
    // The volume (else the partition) of a device that starts at `offset` bytes.
    NodeCore *volumeAt(NodeCore *device, uint64_t offset) override;

    void openInHexEditor(NodeCore *node, uint64_t offset, bool readOnly, int type,
                         uint64_t offsetTmpl) override;

    // The prefix of a device: 0 floppy, 1 physical disk, 2 CD/DVD drive, 3 virtual disk.
    static int prefixOf(NodeCore *deviceNode);

private:
    class FileNode;
    // Attaches to the application's main window when no hex editor was given.
    void ensureAttached();

    CRoot &m_root;
    NodeRoot *m_nodes = nullptr;
    std::unique_ptr<NodeRoot> m_ownNodes;
    QPointer<HexEditor::Commander> m_hex;
    std::unique_ptr<HexEditor::Commander> m_ownHex;
    std::vector<std::unique_ptr<FileNode>> m_files;
    QMetaObject::Connection m_rootGone;
};

} // namespace CLI
