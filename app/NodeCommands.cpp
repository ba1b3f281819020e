#include "app/NodeCommands.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/NodeTree/DiskBrowserModel.h"
#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/Views/GenericView.h"
#include "ClientFramework/Views/UserPrompts.h"
#include "ClientFramework/Views/WindowManager.h"

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Entry.h"
#include "Kernel/Implementation/Images/ImageHandle.h"
#include "Kernel/Implementation/Partitions/Partition.h"

#include <QAbstractItemView>
#include <QApplication>
#include <QFileInfo>
#include <QUrl>

namespace Solution {

namespace {

const QString Update = QStringLiteral("cmdUpdate");
const QString Stop = QStringLiteral("cmdNode_Stop");
const QString StopAll = QStringLiteral("cmdNode_StopAll");
const QString SelectAll = QStringLiteral("cmdNode_SelectAll");
const QString OpenInOS = QStringLiteral("cmdOpenInOSBrowser");
const QString SmartInfo = QStringLiteral("cmdSmartInfo");

// The device node a node lies on (itself for a device), or nullptr.
NodeCore *deviceOf(NodeCore *node)
{
    for (NodeCore *n = node; n; n = n->parent())
        if (n->kind() == NodeKind::Device)
            return n;
    return nullptr;
}

QString existingFolder(const QString &path)
{
    if (path.isEmpty())
        return QString();
    const QFileInfo info(path);
    return info.isDir() ? info.absoluteFilePath() : QString();
}

} // namespace

NodeCommands::NodeCommands(Core::Commander *commander, Framework::WindowManager *windows,
                           std::function<void(NodeCore *)> reloadDevice, const QString &smartPaneId,
                           QObject *parent)
    : QObject(parent), m_commander(commander), m_windows(windows), m_reloadDevice(std::move(reloadDevice)),
      m_smartPaneId(smartPaneId)
{
    m_commander->setHandler(Stop, [this] { stop(m_commander->selection()); });
    m_commander->setHandler(StopAll, [this] { stopAll(); });
    connect(m_commander, &Core::Commander::selectionChanged, this, &NodeCommands::updateCommands);
    connect(m_windows, &Framework::WindowManager::activeViewChanged, this, &NodeCommands::updateCommands);
    connect(m_windows, &Framework::WindowManager::viewCreated, this, &NodeCommands::watchView);
    for (Framework::GenericView *v : m_windows->views())
        watchView(v);
    updateCommands();
}

NodeCommands::~NodeCommands()
{
    if (!m_commander)
        return;
    for (const QString &id : {Update, Stop, StopAll, SelectAll, OpenInOS, SmartInfo})
        m_commander->setHandler(id, {});
}

void NodeCommands::watchView(Framework::GenericView *view)
{
    if (!view)
        return;
    for (DiskBrowserModel *m : view->findChildren<DiskBrowserModel *>())
        watchModel(m);
}

void NodeCommands::watchModel(DiskBrowserModel *model)
{
    for (const QPointer<DiskBrowserModel> &m : std::as_const(m_models))
        if (m == model)
            return;
    m_models.append(model);
    connect(model, &DiskBrowserModel::populationStarted, this,
            [this](NodeCore *node, const QString &) { onStarted(node); });
    connect(model, &DiskBrowserModel::populationFinished, this,
            [this](NodeCore *node, bool) { onFinished(node); });
    // A population under rows that go away ends without a word: forget its node.
    connect(model, &QAbstractItemModel::rowsRemoved, this, &NodeCommands::prune);
    connect(model, &QAbstractItemModel::modelReset, this, &NodeCommands::prune);
    connect(model, &QObject::destroyed, this, [this] { prune(); });
}

QList<DiskBrowserModel *> NodeCommands::models() const
{
    QList<DiskBrowserModel *> list;
    for (const QPointer<DiskBrowserModel> &m : m_models)
        if (m)
            list << m.data();
    return list;
}

bool NodeCommands::anyModelPopulates(const NodeCore *node) const
{
    for (DiskBrowserModel *m : models())
        if (m->isPopulating(node))
            return true;
    return false;
}

void NodeCommands::onStarted(NodeCore *node)
{
    if (!node)
        return;
    m_busy.insert(node);
    node->setFlags(NodeState::Busy, true);
    node->notifyChanged();
    processStateChanged();
}

void NodeCommands::onFinished(NodeCore *node)
{
    if (!m_busy.remove(node))
        return;
    // Another view may still populate the same folder.
    if (!anyModelPopulates(node)) {
        node->setFlags(NodeState::Busy, false);
        node->notifyChanged();
    } else {
        m_busy.insert(node);
    }
    processStateChanged();
}

void NodeCommands::prune()
{
    // Only pointers are compared here: a node whose population was dropped may be gone.
    bool changed = false;
    for (auto it = m_busy.begin(); it != m_busy.end();) {
        if (anyModelPopulates(*it)) {
            ++it;
        } else {
            it = m_busy.erase(it);
            changed = true;
        }
    }
    if (changed)
        processStateChanged();
}

void NodeCommands::processStateChanged()
{
    const bool running = !m_busy.isEmpty();
    if (m_commander->isProcessRunning() != running)
        m_commander->setProcessRunning(running);
    // The selection's state words changed (Busy on or off).
    m_commander->setSelection(m_commander->selection());
}

int NodeCommands::stop(const QList<NodeCore *> &nodes)
{
    int cancelled = 0;
    for (DiskBrowserModel *m : models())
        cancelled += m->cancel(nodes);
    return cancelled;
}

void NodeCommands::stopAll()
{
    for (DiskBrowserModel *m : models())
        m->cancelAll();
    prune();
}

bool NodeCommands::selectAll()
{
    Framework::GenericView *view = m_windows->activeView();
    if (!view || !dynamic_cast<INodeSource *>(view))
        return false;
    QAbstractItemView *target = nullptr;
    if (auto *focused = qobject_cast<QAbstractItemView *>(QApplication::focusWidget()))
        if (view->isAncestorOf(focused))
            target = focused;
    if (!target)
        for (QAbstractItemView *v : view->findChildren<QAbstractItemView *>())
            if (v->selectionMode() == QAbstractItemView::ExtendedSelection ||
                v->selectionMode() == QAbstractItemView::MultiSelection) {
                target = v;
                break;
            }
    if (!target)
        return false;
    target->selectAll();
    return true;
}

void NodeCommands::reload(const QList<NodeCore *> &nodes)
{
    // What each node asks for: a folder read again, or a device (the computer: every device).
    QList<NodeCore *> folders;
    QList<NodeCore *> devices;
    for (NodeCore *n : nodes) {
        if (!n)
            continue;
        switch (n->kind()) {
        case NodeKind::Computer:
        case NodeKind::Device:
            devices << n;
            break;
        case NodeKind::Partition:
        case NodeKind::Drive:
            if (NodeCore *d = deviceOf(n))
                devices << d;
            break;
        case NodeKind::Folder:
            folders << n;
            break;
        case NodeKind::File:
            if (n->parent() && n->parent()->canPopulate())
                folders << n->parent();
            break;
        default:
            break;
        }
    }
    auto coveredBy = [](NodeCore *node, const QList<NodeCore *> &others) {
        for (NodeCore *o : others)
            if (o != node && o->isAncestorOf(node))
                return true;
        return false;
    };
    QList<NodeCore *> all = devices + folders;
    QList<NodeCore *> doFolders;
    for (NodeCore *f : std::as_const(folders))
        if (!coveredBy(f, all) && !doFolders.contains(f) && !anyModelPopulates(f))
            doFolders << f;
    QList<NodeCore *> doDevices;
    for (NodeCore *d : std::as_const(devices))
        if (!coveredBy(d, devices) && !doDevices.contains(d))
            doDevices << d;

    // Folders first: a device read again replaces every node below it.
    for (NodeCore *f : std::as_const(doFolders)) {
        f->clearChildren();
        f->setFlags(NodeState::Populated, false);
        f->notifyChildrenChanged();
        bool started = false;
        for (DiskBrowserModel *m : models()) {
            const QModelIndex index = m->indexOf(f);
            if (index.isValid() && m->canFetchMore(index)) {
                m->fetchMore(index);
                started = true;
                break;
            }
        }
        if (!started)
            f->populateNow(false, true);
    }
    if (m_reloadDevice)
        for (NodeCore *d : std::as_const(doDevices))
            m_reloadDevice(d);
}

QString NodeCommands::osBrowserPath(NodeCore *node)
{
    if (!node)
        return QString();
    if (auto *device = dynamic_cast<NodeDevice *>(node)) {
        CDevice *d = device->device();
        if (d && d->GetImageHandle()) {
            const QStringList files = d->GetImageHandle()->GetFileNames();
            return files.isEmpty() ? QString() : existingFolder(QFileInfo(files.constFirst()).absolutePath());
        }
        return QString();
    }
    auto *storage = dynamic_cast<IKernelStorage *>(node);
    if (!storage)
        return QString();
    // Where the system mounted the volume.
    QString mountPoint;
    if (CPartition *p = storage->kernelPartition()) {
        if (const VolumeInfo *v = p->GetVolumeInfo())
            mountPoint = v->mountPoint;
    } else if (CDevice *d = storage->kernelDevice()) {
        // A device that is one volume as a whole.
        for (const VolumeInfo &v : d->GetDescriptor().volumes)
            if (!v.mountPoint.isEmpty()) {
                mountPoint = v.mountPoint;
                break;
            }
    }
    mountPoint = existingFolder(mountPoint);
    if (mountPoint.isEmpty())
        return QString();
    // A folder opens as itself below the mount point, a file as its folder.
    CEntry *entry = storage->kernelEntry();
    if (entry && node->kind() == NodeKind::File)
        entry = entry->GetParent();
    QStringList names;
    for (CEntry *e = entry; e && e->GetParent(); e = e->GetParent())
        names.prepend(e->GetName());
    return folderBelow(mountPoint, names);
}

QString NodeCommands::folderBelow(const QString &mountPoint, const QStringList &names)
{
    if (names.isEmpty())
        return mountPoint;
    // Names come from the medium: one that would leave its folder keeps the mount point.
    for (const QString &n : names)
        if (n.isEmpty() || n == QLatin1String(".") || n == QLatin1String("..") ||
            n.contains(QLatin1Char('/')) || n.contains(QLatin1Char('\\')) || n.contains(QChar(0)))
            return mountPoint;
    const QString path = existingFolder(mountPoint + QLatin1Char('/') + names.join(QLatin1Char('/')));
    return path.isEmpty() ? mountPoint : path;
}

bool NodeCommands::isSmartDevice(const NodeCore *node)
{
    // A mounted image has no drive to ask; the pane then says the data is not supported.
    return node && node->kind() == NodeKind::Device;
}

void NodeCommands::updateCommands()
{
    const QList<NodeCore *> nodes = m_commander->selection();

    bool anyNode = false;
    bool anyBusy = false;
    bool smart = false;
    QString folder;
    for (NodeCore *n : nodes) {
        if (!n)
            continue;
        anyNode = true;
        anyBusy = anyBusy || (n->state() & NodeState::Busy);
        smart = smart || isSmartDevice(n);
        if (folder.isEmpty())
            folder = osBrowserPath(n);
    }
    m_commander->setHandler(Update, anyNode && !anyBusy
                                        ? std::function<void()>([this] { reload(m_commander->selection()); })
                                        : std::function<void()>());
    m_commander->setHandler(SmartInfo,
                            smart ? std::function<void()>([this] { m_windows->openView(m_smartPaneId); })
                                  : std::function<void()>());
    m_commander->setHandler(OpenInOS, !folder.isEmpty() ? std::function<void()>([folder] {
                                Framework::UserPrompts::current().openUrl(
                                    QUrl::fromLocalFile(folder).toString());
                            })
                                                        : std::function<void()>());
    Framework::GenericView *active = m_windows->activeView();
    const bool nodeView = active && dynamic_cast<INodeSource *>(active);
    m_commander->setHandler(SelectAll, nodeView ? std::function<void()>([this] { selectAll(); })
                                                : std::function<void()>());
}

} // namespace Solution
