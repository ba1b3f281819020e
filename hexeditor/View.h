// The hex editor's document view ("view-hexeditor"), one per opened node: it owns the storage that
// fits the node, hosts the editor control with its status bar, toolbar, "Customize " menu and the
// dock places of the editor's panes, runs the go-to dialogs and the jump history, and asks before
// closing with unsaved changes.
#pragma once

#include "hexeditor/JumpHistory.h"

#include "ClientFramework/NodeTree/IPublisher.h"
#include "ClientFramework/Views/GenericView.h"

#include <QHash>
#include <QSemaphore>

#include <cstdint>
#include <functional>
#include <memory>

class QActionGroup;
class QDialog;
class QDockWidget;
class QMenu;
class QToolBar;
class CVolume;
class NodeCore;
class NodeDevice;

namespace HexEditor {

class EditorCtrl;
class GotoSectorDlg;
class StatusCtrl;
class Storage;
class ViewActions;

class View : public Framework::GenericView, private INodeSubscriber
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("view-hexeditor");
    // The child of the view's settings element that holds the editor control's settings.
    static inline const QString EditorSettingsElement = QStringLiteral("hex-editor");
    // Object names of the docked panes; each dock is named after its pane with "-dock".
    static inline const QString TemplatesPane = QStringLiteral("view-hex-templates");
    static inline const QString InspectorPane = QStringLiteral("view-hex-inspector");
    static inline const QString BookmarksPane = QStringLiteral("view-hex-bookmarks");
    static inline const QString FindResultsPane = QStringLiteral("view-hex-find-results");
    static inline const QString ClusterChainsPane = QStringLiteral("view-hex-cluster-chains");
    static QStringList paneNames();

    enum FileViewMode { DiskMode = 0, PartitionMode = 1, FileMode = 2 };

    // Shows `storage` (owned) of `node` (null for a plain file of the computer).
    View(NodeCore *node, std::unique_ptr<Storage> storage, bool readOnly = true, QWidget *parent = nullptr);
    ~View() override;

    // The storage that fits a node: its device, partition (with its volume), volume or file entry.
    // Null with a reason when the node has no kernel object.
    static std::unique_ptr<Storage> storageFor(NodeCore *node, QString &error);
    // The volume behind a node, when it has one.
    static CVolume *volumeOf(NodeCore *node);

    NodeCore *node() const { return m_node; }
    Storage *storage() const { return m_storage.get(); }
    EditorCtrl *editor() const { return m_editor; }
    StatusCtrl *statusCtrl() const { return m_status; }
    ViewActions *viewActions() const { return m_actions; }
    JumpHistory &jumpHistory() { return m_history; }
    QToolBar *toolBar() const { return m_toolBar; }
    QMenu *customizeMenu() const { return m_customize; }
    QDockWidget *paneDock(const QString &paneName) const { return m_docks.value(paneName); }
    // Puts a pane's widget into its dock place (the widget takes the pane's object name).
    void setPane(const QString &paneName, QWidget *pane);

    // The request of an explorer or of the command line: the caret to offset; a template type
    // (not 0 and not automatic) is requested at offsetTmpl.
    void applyRequest(uint64_t offset, int type, uint64_t offsetTmpl);
    // Sets the template position and requests the template there (an entry of the jump history).
    void requestTemplate(uint64_t offset, int type, bool primary = true);

    // Dialogs go through the runner (its answer is QDialog's result); tests answer them themselves.
    using DialogRunner = std::function<int(QDialog *dialog)>;
    void setDialogRunner(DialogRunner runner) { m_runDialog = std::move(runner); }
    // The go-to commands; false when cancelled or nothing changed.
    bool gotoOffset();
    bool gotoSector();
    bool gotoMftRecord();
    bool gotoCatalogNode();
    void goBack();
    void goForward();

    // The file view mode of a file storage (disk, partition or file); false when refused.
    bool setFileViewMode(int mode);
    int fileViewMode() const;

    // Whether the view may close now (unsaved changes and running threads are asked about).
    bool queryClose();
    // Refreshes the enabled state and check marks of the commands.
    void updateCommandStates();

    QList<QAction *> widgetActions(Menu menu) const override;
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

signals:
    void openInHexEditor(NodeCore *node);
    void colorIndexChanged(int index);
    void fileViewModeChanged(int mode);

public slots:
    // The device leaves: a view over it or anything on it lets go of its storage and closes.
    void onDeviceRemoved(NodeDevice *device);
    void onEditorStateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian);
    void onSelectColumns();

protected:
    void closeEvent(QCloseEvent *event) override;

private:
    // INodeSubscriber: the node shown is destroyed (its device left, or its partition was
    // replaced by a new layout), and with it the kernel object read.
    void publisherDestroyed(NodeCore *node) override;
    // Stops everything that reads the kernel object, drops the storage, tells the user whether
    // unsaved edits were lost, and closes the view. Nothing reads the medium afterwards.
    void releaseMedium();
    void buildActions();
    void buildToolBar();
    void buildCustomizeMenu();
    void buildDocks();
    void connectEditor();
    std::optional<uint64_t> runGotoSector();
    int runDialog(QDialog *dialog);
    void applyJump(const JumpHistory::Entry &entry);
    QString titleText() const;

    NodeCore *m_node;
    // The disk the node lies on, named for the message when it leaves.
    QString m_diskName;
    bool m_released = false;
    std::unique_ptr<Storage> m_storage;
    EditorCtrl *m_editor = nullptr;
    StatusCtrl *m_status = nullptr;
    ViewActions *m_actions = nullptr;
    QToolBar *m_toolBar = nullptr;
    QMenu *m_customize = nullptr;
    QHash<QString, QDockWidget *> m_docks;
    QHash<int, QAction *> m_fontSizes;
    QHash<int, QAction *> m_groups;
    QHash<int, QAction *> m_bytesPerLine;
    QAction *m_hexOffset = nullptr;
    QAction *m_bigEndian = nullptr;
    QAction *m_ascii = nullptr;
    QAction *m_unicode = nullptr;
    QHash<int, QAction *> m_modes;
    JumpHistory m_history;
    DialogRunner m_runDialog;
    // Held while the view updates its own menu check marks, so their toggles do nothing.
    QSemaphore m_menuLock{1};
};

} // namespace HexEditor
