// The handlers of the commands that act on the selected nodes or on the node views: "Reload"
// (cmdUpdate), "Stop" and "Stop All" (the populations of folders), "Select All" in the active node
// view, "Open in File Explorer" (a mounted volume's folder or an image file's folder) and
// "SMART Info". Each selection-bound command has its handler only while the selection gives it
// something to act on, so it is disabled otherwise. Folders under population are marked Busy, and
// the registry hears that a process runs while any population does.
#pragma once

#include <QList>
#include <QObject>
#include <QPointer>
#include <QSet>
#include <QString>

#include <functional>

class DiskBrowserModel;
class NodeCore;

namespace Core {
class Commander;
}

namespace Framework {
class GenericView;
class WindowManager;
} // namespace Framework

namespace Solution {

class NodeCommands : public QObject
{
    Q_OBJECT
public:
    // reloadDevice brings a device node (or the computer node: every device) up to date from the
    // kernel; smartPaneId is the pane "SMART Info" opens.
    NodeCommands(Core::Commander *commander, Framework::WindowManager *windows,
                 std::function<void(NodeCore *)> reloadDevice, const QString &smartPaneId,
                 QObject *parent = nullptr);
    // Takes its handlers out of the registry.
    ~NodeCommands() override;

    // Re-populates the nodes: folders are read again from their volume (files through their
    // folder); disks, partitions and volumes through their device; the computer lists every device
    // again. A node below another of the list goes with that one.
    void reload(const QList<NodeCore *> &nodes);
    // Cancels the populations of the nodes and below them in every view, running or waiting for
    // a worker; the number cancelled.
    int stop(const QList<NodeCore *> &nodes);
    // Cancels every population of every node view.
    void stopAll();
    // Selects every item of the active node view; false when it has no node list.
    bool selectAll();
    // Whether any population runs.
    bool isPopulating() const { return !m_busy.isEmpty(); }

    // The folder "Open in File Explorer" opens for a node ("" for none): an image file's folder for
    // a mounted image, the mount point for a volume the system mounted, the folder itself below it
    // for a folder of that volume (a file: its folder).
    static QString osBrowserPath(NodeCore *node);
    // The folder of the names below a mount point; the mount point itself when a name could leave
    // its folder ("..", a separator) or the folder does not exist.
    static QString folderBelow(const QString &mountPoint, const QStringList &names);
    // Whether "SMART Info" applies: a disk.
    static bool isSmartDevice(const NodeCore *node);

private:
    void watchView(Framework::GenericView *view);
    void watchModel(DiskBrowserModel *model);
    void onStarted(NodeCore *node);
    void onFinished(NodeCore *node);
    void prune();
    void processStateChanged();
    void updateCommands();
    bool anyModelPopulates(const NodeCore *node) const;
    QList<DiskBrowserModel *> models() const;

    QPointer<Core::Commander> m_commander;
    Framework::WindowManager *m_windows;
    std::function<void(NodeCore *)> m_reloadDevice;
    QString m_smartPaneId;
    QList<QPointer<DiskBrowserModel>> m_models;
    // Folders this object marked Busy while their population runs.
    QSet<NodeCore *> m_busy;
};

} // namespace Solution
