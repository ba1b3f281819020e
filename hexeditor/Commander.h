// The hex editor's feature commander: the commands that open nodes in hex editor views
// ("cmdHex_NodeOpen", "cmdHex_FileRecord", and the product's "cmdHex_File" for a plain file), the
// openInHexEditor requests of explorers and of the command line, the views it opened, and the
// editor's page of the preferences dialog.
#pragma once

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Commands/FeatureCommander.h"
#include "ClientFramework/Preferences/IPreferencePage.h"

#include <QList>
#include <QObject>
#include <QPointer>

#include <cstdint>
#include <functional>

class cRoot;
class NodeCore;

namespace Framework {
class WindowManager;
}

namespace HexEditor {

class View;

class Commander : public QObject, public IFeatureCommander, public Framework::IPreferencePageSource
{
    Q_OBJECT
public:
    static inline const QString NodeOpen = QStringLiteral("cmdHex_NodeOpen");
    static inline const QString FileRecord = QStringLiteral("cmdHex_FileRecord");
    static inline const QString FileOpen = QStringLiteral("cmdHex_File");

    explicit Commander(QObject *parent = nullptr);
    ~Commander() override;

    // The records of the commands the hex editor owns.
    static const QList<Core::CommandRecord> &commands();

    // IFeatureCommander
    QString featureId() const override { return QStringLiteral("hex-editor"); }
    void registerCommands(Core::Commander &commander) override;
    void registerViews(Framework::WindowManager &windows) override;
    bool execute(const QString &id, const QList<NodeCore *> &nodes) override;
    void updateCommands(const QList<NodeCore *> &selection) override;

    // Framework::IPreferencePageSource: the editor's page, which applies to every open view.
    QList<Framework::IPreferencePage *> createPreferencePages() override;

    // The kernel root plain files are opened through (not owned).
    void setKernelRoot(cRoot *root) { m_root = root; }
    // Where new views go (by default the window manager's tabs; tests keep them themselves).
    void setViewHost(std::function<void(View *)> host) { m_host = std::move(host); }
    // The file name for "Open File..." (a file dialog by default; tests answer it).
    void setFileNameProvider(std::function<QString()> provider) { m_fileName = std::move(provider); }

    // Opens a node in a new view: the caret at offset, the template type at offsetTmpl. Null when
    // the node cannot be shown (reported to the user).
    View *open(NodeCore *node, uint64_t offset = 0, bool readOnly = true, int type = 0,
               uint64_t offsetTmpl = 0);
    // Opens a plain file of the computer.
    View *openFile(const QString &path, uint64_t offset = 0, bool readOnly = true, int type = 0,
                   uint64_t offsetTmpl = 0);
    // Opens the file-system record of a file or folder node in a view of its volume.
    View *openFileRecord(NodeCore *node);
    // The open views, oldest first.
    QList<View *> views() const;

    // Whether a node can be opened (it has a kernel object and is not unallocated or unreadable).
    static bool canOpen(NodeCore *node);
    // The record template of a volume's file-system kind (0 when there is none).
    static int recordTemplate(uint32_t fileSystemKind);

signals:
    void openInHexEditor(NodeCore *node);
    void openInHexEditor(NodeCore *node, quint64 offset, bool readOnly, int type, quint64 offsetTmpl);
    void viewOpened(HexEditor::View *view);

private:
    View *host(View *view, uint64_t offset, int type, uint64_t offsetTmpl);
    void onOpenFileCommand();

    Core::Commander *m_registry = nullptr;
    Framework::WindowManager *m_windows = nullptr;
    cRoot *m_root = nullptr;
    std::function<void(View *)> m_host;
    std::function<QString()> m_fileName;
    QList<QPointer<View>> m_views;
};

} // namespace HexEditor
