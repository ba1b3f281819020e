#include "app/KernelHost.h"

#include "app/MainView.h"

#include <QApplication>
#include <QDir>
#include <QFileInfo>

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/NodeTree/IStorageGeometry.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodePartition.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Views/MainView.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Report/HardwareInfo.h"
#include "Kernel/Implementation/Root/ImageOpen.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/Commander.h"

namespace CLI {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("KernelHost", text);
}

} // namespace

// A plain file of the computer named on the command line.
class KernelHost::FileNode : public NodeCore
{
public:
    explicit FileNode(const QString &path) : m_path(path) { setFlags(NodeState::Ready); }
    NodeKind kind() const override { return NodeKind::Other; }
    const QString &path() const { return m_path; }

protected:
    QString name() const override { return QFileInfo(m_path).fileName(); }
    QString typeKey() const override { return QStringLiteral("file"); }
    QString key() const override { return QStringLiteral("file-") + m_path; }

private:
    QString m_path;
};

KernelHost::KernelHost(CRoot &root) : m_root(root)
{
    // The host's own node tree points into the kernel: it goes with the kernel root.
    m_rootGone = QObject::connect(&m_root, &QObject::destroyed, [this] { m_ownNodes.reset(); });
    // The explorer's nodes open in the hex editor from the start, not only after a request.
    ensureAttached();
}

KernelHost::~KernelHost()
{
    QObject::disconnect(m_rootGone);
}

bool KernelHost::saveHardwareInfo(const QString &fileName)
{
    auto &log = Framework::ApplicationLog::instance();
    // The report describes the devices the tree shows: they are enumerated only when nothing has
    // been yet (a full refresh would drop and add every disk under the open views).
    if (!m_root.HasRefreshed())
        m_root.RefreshAndWait(false);
    const QString application =
        QStringLiteral("%1 %2").arg(Framework::Identity::FullName, Framework::Identity::FileVersion);
    std::uint32_t error = 0;
    if (!HardwareInfo::Write(m_root, fileName, QString(), application, log.lines(), error)) {
        log.add(tr("Unable to save hardware information to '%1'").arg(QDir::toNativeSeparators(fileName)),
                Framework::LogEntry::Error);
        return false;
    }
    log.add(tr("Hardware information saved to '%1'").arg(QDir::toNativeSeparators(fileName)),
            Framework::LogEntry::Successful);
    return true;
}

bool KernelHost::mountImage(const QString &path)
{
    auto &log = Framework::ApplicationLog::instance();
    QString problem;
    if (!ImageOpen::OpenImage(&m_root, path, problem)) {
        log.add(tr("Unable to open disk image '%1': %2").arg(QDir::toNativeSeparators(path), problem),
                Framework::LogEntry::Error);
        return false;
    }
    log.add(tr("Disk Image has been opened successfully."), Framework::LogEntry::Successful);
    return true;
}

NodeRoot *KernelHost::nodeRoot()
{
    if (m_nodes)
        return m_nodes;
    if (!m_ownNodes)
        m_ownNodes = std::make_unique<NodeRoot>(&m_root);
    return m_ownNodes.get();
}

void KernelHost::setHexEditor(HexEditor::Commander *commander)
{
    m_hex = commander;
}

HexEditor::Commander *KernelHost::hexEditor() const
{
    return m_hex;
}

HexEditor::Commander *KernelHost::attach(Framework::MainView &window)
{
    Core::Commander *registry = window.commander();
    if (registry)
        if (auto *existing =
                dynamic_cast<HexEditor::Commander *>(registry->features().find(QStringLiteral("hex-editor"))))
            m_hex = existing;
    if (!m_hex) {
        m_ownHex = std::make_unique<HexEditor::Commander>();
        m_hex = m_ownHex.get();
        window.addFeature(m_ownHex.get());
    }
    m_hex->setKernelRoot(&m_root);
    // Requests name the nodes the window's explorer shows.
    if (auto *product = qobject_cast<Solution::MainView *>(&window); product && product->nodeRoot())
        m_nodes = product->nodeRoot();
    return m_hex;
}

NodeCore *KernelHost::findFileNode(const QString &path, bool *ready)
{
    if (ready)
        *ready = true;
    const QFileInfo info(path);
    if (!info.isFile())
        return nullptr;
    const QString canonical = info.canonicalFilePath();
    for (const auto &node : m_files)
        if (node->path() == canonical)
            return node.get();
    return nullptr;
}

void KernelHost::prepareNode(NodeCore *, std::function<void()> done)
{
    if (done)
        done();
}

NodeCore *KernelHost::openFileNode(const QString &path)
{
    bool ready = false;
    if (NodeCore *known = findFileNode(path, &ready))
        return known;
    const QFileInfo info(path);
    if (!info.isFile() || !info.isReadable())
        return nullptr;
    m_files.push_back(std::make_unique<FileNode>(info.canonicalFilePath()));
    return m_files.back().get();
}

int KernelHost::prefixOf(NodeCore *deviceNode)
{
    auto *node = dynamic_cast<NodeDevice *>(deviceNode);
    CDevice *device = node ? node->device() : nullptr;
    if (!device)
        return 1;
    if (device->GetImageHandle())
        return 3;
    switch (device->GetMediaType()) {
    case MediaType::Floppy:
        return 0;
    case MediaType::CdRom:
        return 2;
    case MediaType::VirtualDevice:
    case MediaType::VirtualManager:
        return 3;
    default:
        return 1;
    }
}

void KernelHost::ensureAttached()
{
    if (m_hex)
        return;
    for (QWidget *w : QApplication::topLevelWidgets())
        if (auto *window = qobject_cast<Framework::MainView *>(w)) {
            attach(*window);
            return;
        }
}

QList<ContextDevice> KernelHost::devices()
{
    ensureAttached();
    if (!m_root.HasRefreshed())
        m_root.RefreshAndWait(false);
    NodeRoot *nodes = nodeRoot();
    nodes->synchronize();
    QList<ContextDevice> list;
    for (NodeDevice *node : nodes->deviceNodes()) {
        ContextDevice d;
        d.node = node;
        d.prefix = prefixOf(node);
        if (CDevice *device = node->device(); device && device->GetImageHandle()) {
            const QStringList files = device->GetImageHandle()->GetFileNames();
            if (!files.isEmpty())
                d.imagePath = files.constFirst();
        }
        list.append(d);
    }
    return list;
}

NodeCore *KernelHost::volumeAt(NodeCore *device, uint64_t offset)
{
    if (!device)
        return nullptr;
    NodeCore *partitionMatch = nullptr;
    // Depth-first over the partitions (extended ones nest their logical partitions).
    QList<NodeCore *> pending = device->children();
    while (!pending.isEmpty()) {
        NodeCore *node = pending.takeFirst();
        if (node->kind() != NodeKind::Partition && node->kind() != NodeKind::Drive)
            continue;
        auto *geometry = dynamic_cast<IStorageGeometry *>(node);
        const bool here = geometry && uint64_t(geometry->firstSector()) * geometry->sectorSize() == offset;
        if (here && node->kind() == NodeKind::Drive)
            return node;
        if (here && !partitionMatch && !static_cast<NodePartition *>(node)->isUnallocated() &&
            !static_cast<NodePartition *>(node)->isExtended())
            partitionMatch = node;
        pending = node->children() + pending;
    }
    return partitionMatch;
}

void KernelHost::openInHexEditor(NodeCore *node, uint64_t offset, bool readOnly, int type,
                                 uint64_t offsetTmpl)
{
    ensureAttached();
    if (!m_hex || !node)
        return;
    for (const auto &file : m_files)
        if (file.get() == node) {
            m_hex->openFile(file->path(), offset, readOnly, type, offsetTmpl);
            return;
        }
    emit m_hex->openInHexEditor(node, offset, readOnly, type, offsetTmpl);
}

} // namespace CLI
