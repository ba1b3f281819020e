#include "hexeditor/View.h"

#include "hexeditor/EditorCtrl.h"
#include "hexeditor/GotoCatalogNodeDlg.h"
#include "hexeditor/GotoMftDlg.h"
#include "hexeditor/GotoOffsetDlg.h"
#include "hexeditor/GotoSectorDlg.h"
#include "hexeditor/StatusCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/StorageFactory.h"
#include "hexeditor/StorageFile.h"
#include "hexeditor/ViewActions.h"
#include "hexeditor/ViewResources.h"
#include "hexeditor/templates/TemplateType.h"
#include "hexeditor/templates/View.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/GenericError.h"
#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/IStorageGeometry.h"
#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/FS/Volume.h"

#include <QAction>
#include <QApplication>
#include <QActionGroup>
#include <QCloseEvent>
#include <QDockWidget>
#include <QDomElement>
#include <QLabel>
#include <QMenu>
#include <QStatusBar>
#include <QToolBar>
#include <QToolButton>
#include <QVBoxLayout>

namespace HexEditor {

namespace {

// Releases the menu lock when the update is done.
struct MenuLockGuard
{
    QSemaphore &lock;
    bool held;
    explicit MenuLockGuard(QSemaphore &l) : lock(l), held(l.tryAcquire()) {}
    ~MenuLockGuard()
    {
        if (held)
            lock.release();
    }
};

QString paneTitle(const QString &name)
{
    if (name == View::TemplatesPane)
        return View::tr("Templates");
    if (name == View::InspectorPane)
        return View::tr("Data Inspector");
    if (name == View::BookmarksPane)
        return View::tr("Bookmarks");
    if (name == View::FindResultsPane)
        return View::tr("Find Results");
    return View::tr("Cluster Chains");
}

} // namespace

QStringList View::paneNames()
{
    return {TemplatesPane, InspectorPane, BookmarksPane, FindResultsPane, ClusterChainsPane};
}

CVolume *View::volumeOf(NodeCore *node)
{
    auto *kernel = dynamic_cast<IKernelStorage *>(node);
    return kernel ? kernel->kernelVolume() : nullptr;
}

std::unique_ptr<Storage> View::storageFor(NodeCore *node, QString &error)
{
    auto *kernel = dynamic_cast<IKernelStorage *>(node);
    if (!kernel) {
        error = tr("The item has no sectors to show.");
        return nullptr;
    }
    std::unique_ptr<Storage> storage;
    switch (node->kind()) {
    case NodeKind::Partition:
        storage = createPartitionStorage(kernel->kernelStorage(), kernel->kernelVolume());
        break;
    case NodeKind::File:
        storage = createStorage(kernel->kernelEntry() ? static_cast<cStorage *>(kernel->kernelEntry())
                                                      : kernel->kernelStorage());
        break;
    default:
        storage = createStorage(kernel->kernelStorage());
        break;
    }
    if (!storage)
        error = tr("%1 cannot be read.").arg(node->text(NodeAttr::Name));
    return storage;
}

View::View(NodeCore *node, std::unique_ptr<Storage> storage, bool readOnly, QWidget *parent)
    : Framework::GenericView(ViewId, QString(), parent), m_node(node), m_storage(std::move(storage))
{
    initViewResources();
    setWindowIcon(ViewActions::icon(QStringLiteral(":/hexeditor/default")));
    setDockNestingEnabled(true);
    m_runDialog = [](QDialog *dialog) { return dialog->exec(); };

    m_editor = new EditorCtrl(m_storage.get(), readOnly, this);
    m_editor->setObjectName(QStringLiteral("EditorCtrl"));
    setCentralWidget(m_editor);
    m_status = new StatusCtrl(this);
    statusBar()->addWidget(m_status, 1);
    statusBar()->setSizeGripEnabled(false);

    buildActions();
    buildToolBar();
    buildCustomizeMenu();
    buildDocks();
    setPane(TemplatesPane, new Templates::View(m_editor, m_storage.get()));
    connectEditor();

    setWindowTitle(titleText());
    onEditorStateChanged(m_editor->hexOffset(), m_editor->isReadOnly(), m_editor->isBigEndian());
    updateCommandStates();

    if (m_node) {
        m_diskName = m_node->text(NodeAttr::Name);
        for (NodeCore *n = m_node; n; n = n->parent())
            if (n->kind() == NodeKind::Device)
                m_diskName = n->text(NodeAttr::Name);
        m_node->subscribe(this);
    }
}

View::~View()
{
    if (m_node)
        m_node->unsubscribe(this);
}

QString View::titleText() const
{
    const QString name = m_node ? m_node->text(NodeAttr::Name) : (m_storage ? m_storage->name() : QString());
    const QString second = m_node ? m_node->text(NodeAttr::Kind) : tr("File");
    return tr("%1 - %2").arg(name, second);
}

void View::buildActions()
{
    m_actions = new ViewActions(this);
    // The shortcuts work anywhere inside the view.
    addActions(m_actions->actions());
    auto on = [this](const QString &key, auto slot) {
        connect(m_actions->action(key), &QAction::triggered, this, slot);
    };
    on(ViewActions::Back, [this] { goBack(); });
    on(ViewActions::Forward, [this] { goForward(); });
    on(ViewActions::GotoOffset, [this] { gotoOffset(); });
    on(ViewActions::GotoSector, [this] { gotoSector(); });
    on(ViewActions::Save, [this] { m_editor->onSave(); });
    connect(m_actions->action(ViewActions::AllowEdit), &QAction::toggled, this, [this](bool on) {
        if (m_menuLock.available() == 0)
            return;
        m_editor->setEditable(on);
    });
    on(ViewActions::Undo, [this] { m_editor->undo(); });
    on(ViewActions::Redo, [this] { m_editor->redo(); });
    on(ViewActions::Revert, [this] { m_editor->revert(); });
    on(ViewActions::FillBlock, [this] { m_editor->fillBlock(); });
    on(ViewActions::Paste, [this] { m_editor->onPaste(); });
    on(ViewActions::TemplatePosition,
       [this] { emit m_editor->templateOffsetChanged(m_editor->caretOffset(), true); });
    on(ViewActions::TemplateCopyPosition,
       [this] { emit m_editor->templateOffsetChanged(m_editor->caretOffset(), false); });
    on(ViewActions::BlockBegin, [this] { m_editor->setBlockBegin(); });
    on(ViewActions::BlockEnd, [this] { m_editor->setBlockEnd(); });
    on(ViewActions::SaveSelection, [this] { m_editor->onSaveData(); });
    on(ViewActions::InsertFromFile, [this] { m_editor->onInsertData(); });
    on(ViewActions::SelectAll, [this] { m_editor->selectAll(); });
    on(ViewActions::ClearSelection, [this] { m_editor->clearSelection(); });
    on(ViewActions::Copy, [this] { m_editor->onCopy(); });
    on(ViewActions::CopyFormatted, [this] { m_editor->onCopyFormatted(); });

    // The context menu: editing and clipboard commands, bookmarks, then "Navigate ".
    const QStringList context = {ViewActions::Undo,
                                 ViewActions::Redo,
                                 ViewActions::Revert,
                                 ViewActions::Copy,
                                 ViewActions::CopyFormatted,
                                 ViewActions::Paste,
                                 ViewActions::FillBlock,
                                 ViewActions::SelectAll,
                                 ViewActions::ClearSelection,
                                 ViewActions::BlockBegin,
                                 ViewActions::BlockEnd,
                                 ViewActions::SaveSelection,
                                 ViewActions::InsertFromFile,
                                 ViewActions::TemplatePosition,
                                 ViewActions::TemplateCopyPosition,
                                 ViewActions::ToggleBookmark,
                                 ViewActions::NextBookmark,
                                 ViewActions::PreviousBookmark};
    QList<QAction *> contextActions;
    for (const QString &key : context)
        contextActions.append(m_actions->action(key));
    m_editor->setContextActions(contextActions);
    m_editor->setNavigateActions(
        {m_actions->action(ViewActions::Back), m_actions->action(ViewActions::Forward)});
}

void View::buildToolBar()
{
    m_toolBar = addToolBar(tr("Hex Editor"));
    m_toolBar->setObjectName(QStringLiteral("hexeditor-toolbar"));
    m_toolBar->setStyleSheet(QStringLiteral("QToolBar .QToolButton {min-width: 50px;}"));
    m_toolBar->setToolButtonStyle(Qt::ToolButtonTextUnderIcon);
    m_toolBar->setIconSize(QSize(24, 24));
    const QStringList keys = {ViewActions::Back,
                              ViewActions::Forward,
                              ViewActions::GotoOffset,
                              ViewActions::GotoSector,
                              QString(),
                              ViewActions::AllowEdit,
                              ViewActions::Save,
                              ViewActions::Undo,
                              ViewActions::Redo,
                              QString(),
                              ViewActions::Find,
                              ViewActions::FindNext};
    for (const QString &key : keys) {
        if (key.isEmpty())
            m_toolBar->addSeparator();
        else
            m_toolBar->addAction(m_actions->action(key));
    }
}

void View::buildCustomizeMenu()
{
    m_customize = new QMenu(tr("Customize "), this);
    m_customize->setIcon(QIcon(QStringLiteral(":/tools/settings")));

    auto exclusive = [this](QMenu *menu, const QList<QPair<QString, int>> &items, QHash<int, QAction *> &into,
                            std::function<void(int)> apply) {
        auto *group = new QActionGroup(menu);
        group->setExclusive(true);
        for (const auto &[text, value] : items) {
            QAction *a = menu->addAction(text);
            a->setCheckable(true);
            a->setData(value);
            group->addAction(a);
            into.insert(value, a);
            connect(a, &QAction::toggled, this, [this, apply, value = value](bool on) {
                if (on && m_menuLock.available() > 0)
                    apply(value);
            });
        }
    };

    QMenu *size = m_customize->addMenu(tr("Text Size"));
    exclusive(size,
              {{tr("Largest"), 14},
               {tr("Larger"), 12},
               {tr("Medium"), 11},
               {tr("Smaller"), 10},
               {tr("Smallest"), 9}},
              m_fontSizes, [this](int v) { m_editor->setEditorFont(m_editor->fontFamily(), v); });
    QMenu *group = m_customize->addMenu(tr("Column grouping"));
    exclusive(group, {{tr("None"), 0}, {tr("4 bytes"), 4}, {tr("8 bytes"), 8}, {tr("16 bytes"), 16}},
              m_groups, [this](int v) { m_editor->setGrouping(uint32_t(v)); });
    QMenu *bytes = m_customize->addMenu(tr("Bytes per line"));
    exclusive(bytes,
              {{tr("8 bytes"), 8},
               {tr("16 bytes"), 16},
               {tr("32 bytes"), 32},
               {tr("64 bytes"), 64},
               {tr("128 bytes"), 128}},
              m_bytesPerLine, [this](int v) { m_editor->setBytesPerLine(uint32_t(v)); });
    m_customize->addSeparator();

    m_hexOffset = m_customize->addAction(tr("Hexadecimal Offset"));
    m_hexOffset->setCheckable(true);
    m_hexOffset->setToolTip(tr("Change between a hexadecimal and decimal offset representation"));
    connect(m_hexOffset, &QAction::toggled, this, [this](bool on) {
        if (m_menuLock.available() > 0)
            m_editor->setHexOffset(on);
    });
    m_bigEndian = m_customize->addAction(tr("Big Endian"));
    m_bigEndian->setCheckable(true);
    m_bigEndian->setToolTip(tr("Change between Big or Little Endian byte order"));
    connect(m_bigEndian, &QAction::toggled, this, [this](bool on) {
        if (m_menuLock.available() > 0)
            m_editor->setBigEndian(on);
    });

    if (m_storage && m_storage->isFileStorage() && qobject_cast<StorageFile *>(m_storage.get())) {
        m_customize->addSeparator();
        auto *modes = new QActionGroup(m_customize);
        const struct
        {
            QString text;
            QString tip;
            int mode;
        } items[] = {{tr("Disk mode"), tr("Show file in physical drive context"), DiskMode},
                     {tr("Partition mode"), tr("Show file in volume context"), PartitionMode},
                     {tr("File mode"), tr("Show file data only"), FileMode}};
        for (const auto &item : items) {
            QAction *a = m_customize->addAction(item.text);
            a->setToolTip(item.tip);
            a->setCheckable(true);
            modes->addAction(a);
            m_modes.insert(item.mode, a);
            const int mode = item.mode;
            connect(a, &QAction::toggled, this, [this, mode](bool on) {
                if (on && m_menuLock.available() > 0)
                    setFileViewMode(mode);
            });
        }
    }

    m_customize->addSeparator();
    m_ascii = m_customize->addAction(ViewActions::icon(QStringLiteral(":/hexeditor/ascii")), tr("ASCII"));
    m_ascii->setCheckable(true);
    m_unicode =
        m_customize->addAction(ViewActions::icon(QStringLiteral(":/hexeditor/unicode")), tr("Unicode"));
    m_unicode->setCheckable(true);
    connect(m_ascii, &QAction::toggled, this, &View::onSelectColumns);
    connect(m_unicode, &QAction::toggled, this, &View::onSelectColumns);
}

void View::onSelectColumns()
{
    if (m_menuLock.available() == 0)
        return;
    // The other bits of the mask are kept.
    uint32_t mask = m_editor->columnMask() & ~uint32_t(Metrics::PaneAscii | Metrics::PaneUnicode);
    if (m_ascii->isChecked())
        mask |= Metrics::PaneAscii;
    if (m_unicode->isChecked())
        mask |= Metrics::PaneUnicode;
    m_editor->setColumns(mask);
    updateCommandStates();
}

void View::buildDocks()
{
    // The right-hand panes take the full height; the lists below stay under the bytes.
    setCorner(Qt::BottomRightCorner, Qt::RightDockWidgetArea);
    setCorner(Qt::TopRightCorner, Qt::RightDockWidgetArea);
    for (const QString &name : paneNames()) {
        auto *dock = new QDockWidget(paneTitle(name), this);
        dock->setObjectName(name + QStringLiteral("-dock"));
        auto *placeholder = new QLabel(dock);
        placeholder->setObjectName(name);
        placeholder->setAlignment(Qt::AlignCenter);
        placeholder->setEnabled(false);
        dock->setWidget(placeholder);
        const bool right = name == TemplatesPane || name == InspectorPane;
        addDockWidget(right ? Qt::RightDockWidgetArea : Qt::BottomDockWidgetArea, dock);
        m_docks.insert(name, dock);
    }
    tabifyDockWidget(m_docks.value(TemplatesPane), m_docks.value(InspectorPane));
    tabifyDockWidget(m_docks.value(BookmarksPane), m_docks.value(FindResultsPane));
    tabifyDockWidget(m_docks.value(FindResultsPane), m_docks.value(ClusterChainsPane));
    m_docks.value(TemplatesPane)->raise();
    m_docks.value(BookmarksPane)->raise();
    resizeDocks({m_docks.value(TemplatesPane)}, {260}, Qt::Horizontal);
    resizeDocks({m_docks.value(BookmarksPane)}, {100}, Qt::Vertical);
}

void View::setPane(const QString &paneName, QWidget *pane)
{
    QDockWidget *dock = m_docks.value(paneName);
    if (!dock || !pane)
        return;
    QWidget *old = dock->widget();
    pane->setObjectName(paneName);
    dock->setWidget(pane);
    if (old && old != pane)
        old->deleteLater();
}

void View::connectEditor()
{
    connect(m_editor, &EditorCtrl::stateChanged, this, &View::onEditorStateChanged);
    connect(m_editor, &EditorCtrl::stateChanged, m_status, &StatusCtrl::onStateChanged);
    connect(m_editor, &EditorCtrl::selectionChanged, m_status, &StatusCtrl::onSelectionChanged);
    connect(m_editor, &EditorCtrl::cursorMoved, this, [this](const Metrics::Caret &caret) {
        m_status->setCaret(caret.offset(), caret.sector(), caret.line, caret.column);
        updateCommandStates();
    });
    connect(m_editor, &EditorCtrl::selectionChanged, this, [this] { updateCommandStates(); });
    connect(m_editor, &EditorCtrl::commandStateChanged, this, &View::updateCommandStates);
    connect(m_editor, &EditorCtrl::dataChanged, this, [this] { updateCommandStates(); });
    connect(m_editor, &EditorCtrl::jumpRecorded, this, [this](quint64 offset, int type) {
        m_history.add(offset, type);
        updateCommandStates();
    });
    connect(m_editor, &EditorCtrl::mftRecordRequested, this, [this] { gotoMftRecord(); });
    connect(m_editor, &EditorCtrl::catalogNodeRequested, this, [this] { gotoCatalogNode(); });
    // A block transfer in the status bar: progress and the stop button while it runs, its result
    // as the tip when it ends.
    connect(m_editor, &EditorCtrl::progress, m_status, &StatusCtrl::onThreadProgress);
    connect(m_editor, &EditorCtrl::transferFinished, m_status, [this](bool succeeded, const QString &result) {
        m_status->onThreadFinished(succeeded ? 0 : 1, result);
    });
    connect(m_status, &StatusCtrl::stopProcess, m_editor, &EditorCtrl::onThreadStop);
}

void View::onEditorStateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian)
{
    MenuLockGuard guard(m_menuLock);
    if (!guard.held)
        return;
    m_hexOffset->setChecked(isHexOffset);
    m_bigEndian->setChecked(isBigEndian);
    m_actions->action(ViewActions::AllowEdit)->setChecked(!isReadOnly);
    if (QAction *a = m_fontSizes.value(m_editor->fontSize()))
        a->setChecked(true);
    if (QAction *a = m_groups.value(int(m_editor->group())))
        a->setChecked(true);
    if (QAction *a = m_bytesPerLine.value(int(m_editor->bytesPerLine())))
        a->setChecked(true);
    m_ascii->setChecked(m_editor->columnMask() & Metrics::PaneAscii);
    m_unicode->setChecked(m_editor->columnMask() & Metrics::PaneUnicode);
    if (QAction *a = m_modes.value(fileViewMode()))
        a->setChecked(true);
    guard.lock.release();
    guard.held = false;
    updateCommandStates();
}

void View::updateCommandStates()
{
    const bool editable = m_editor->isEditable() && m_storage;
    const bool selection = m_editor->selection().length > 0;
    auto set = [this](const QString &key, bool on) { m_actions->action(key)->setEnabled(on); };
    set(ViewActions::Back, m_history.canGoBack());
    set(ViewActions::Forward, m_history.canGoForward());
    set(ViewActions::GotoOffset, m_storage && m_storage->size() > 0);
    set(ViewActions::GotoSector, m_storage && m_storage->sectorCount() > 0);
    set(ViewActions::AllowEdit, m_storage != nullptr);
    set(ViewActions::Save, m_editor->hasAppliedEdits());
    set(ViewActions::Undo, m_editor->canUndo());
    set(ViewActions::Redo, m_editor->canRedo());
    set(ViewActions::Revert, m_editor->hasAppliedEdits());
    set(ViewActions::Paste, editable);
    set(ViewActions::FillBlock, editable && selection);
    set(ViewActions::InsertFromFile, editable);
    set(ViewActions::Copy, selection);
    set(ViewActions::CopyFormatted, selection);
    set(ViewActions::SaveSelection, selection);
    set(ViewActions::ClearSelection, selection);
    // Bookmarks and search come with their panes.
    for (const QString &key :
         {ViewActions::ToggleBookmark, ViewActions::NextBookmark, ViewActions::PreviousBookmark,
          ViewActions::Find, ViewActions::FindPrevious, ViewActions::FindNext})
        set(key, false);
}

int View::runDialog(QDialog *dialog)
{
    return m_runDialog ? m_runDialog(dialog) : QDialog::Rejected;
}

bool View::gotoOffset()
{
    if (!m_storage || m_storage->size() == 0)
        return false;
    GotoOffsetDlg dlg(m_storage->size(), m_editor->caretOffset(), this);
    if (runDialog(&dlg) != QDialog::Accepted)
        return false;
    const std::optional<uint64_t> target = dlg.target();
    if (!target)
        return false;
    m_editor->setCaretOffset(*target);
    return true;
}

bool View::gotoSector()
{
    const std::optional<uint64_t> target = runGotoSector();
    if (!target)
        return false;
    m_editor->setCaretOffset(*target);
    return true;
}

std::optional<uint64_t> View::runGotoSector()
{
    if (!m_storage || m_storage->sectorCount() == 0)
        return std::nullopt;
    std::optional<GotoSectorDlg::Clusters> clusters;
    CVolume *volume = volumeOf(m_node);
    uint64_t shift = 0; // the storage's sector of the volume's sector 0
    auto *file = qobject_cast<StorageFile *>(m_storage.get());
    if (file) {
        volume = file->mode() == FileMode ? nullptr : file->volume();
        if (volume && file->mode() == DiskMode)
            if (auto *geometry = dynamic_cast<IStorageGeometry *>(m_node))
                shift = geometry->firstSector();
    } else if (m_storage->kind() == StorageKind::Device) {
        volume = nullptr;
    }
    if (volume && volume->GetClusterSize() > 0) {
        uint64_t first = 0, last = 0, cluster0 = 0;
        volume->GetClusterRange(first, last, cluster0);
        if (last >= first)
            clusters = GotoSectorDlg::Clusters{first, last,
                                               [volume, shift](uint64_t sector) {
                                                   return sector < shift
                                                              ? cStorage::NoSector
                                                              : volume->SectorToCluster(sector - shift);
                                               },
                                               [volume, shift](uint64_t cluster) {
                                                   const uint64_t s = volume->ClusterToSector(cluster);
                                                   return s == cStorage::NoSector ? s : s + shift;
                                               }};
    }
    const uint32_t sectorSize = m_storage->sectorSize();
    GotoSectorDlg dlg(m_storage->sectorCount(), sectorSize, clusters,
                      sectorSize ? m_editor->caretOffset() / sectorSize : 0, this);
    if (runDialog(&dlg) != QDialog::Accepted)
        return std::nullopt;
    return dlg.target();
}

bool View::gotoMftRecord()
{
    if (!m_storage || m_storage->mftRecordCount() == 0)
        return false;
    GotoMftDlg dlg(m_storage->mftRecordCount(), this);
    if (runDialog(&dlg) != QDialog::Accepted)
        return false;
    const std::optional<uint64_t> index = dlg.index();
    if (!index)
        return false;
    requestTemplate(m_storage->mftRecordOffset(*index), Templates::NtfsMftFileRecord);
    return true;
}

bool View::gotoCatalogNode()
{
    if (!m_storage || m_storage->catalogNodeCount() == 0)
        return false;
    GotoCatalogNodeDlg dlg(m_storage->catalogNodeCount(), this);
    if (runDialog(&dlg) != QDialog::Accepted)
        return false;
    const std::optional<uint64_t> index = dlg.index();
    if (!index)
        return false;
    requestTemplate(m_storage->catalogNodeOffset(*index), Templates::HfsPlusCatalogNode);
    return true;
}

void View::requestTemplate(uint64_t offset, int type, bool primary)
{
    m_editor->setCaretOffset(offset);
    emit m_editor->templateOffsetChanged(offset, primary);
    emit m_editor->templateRequest(type);
    m_history.add(offset, type);
    updateCommandStates();
}

void View::applyJump(const JumpHistory::Entry &entry)
{
    if (entry.type != 0) {
        m_editor->setCaretOffset(entry.offset);
        emit m_editor->templateOffsetChanged(entry.offset, true);
        emit m_editor->templateRequest(entry.type);
    } else {
        m_editor->setCaretOffset(entry.offset);
    }
    updateCommandStates();
}

void View::goBack()
{
    if (const std::optional<JumpHistory::Entry> entry = m_history.back())
        applyJump(*entry);
}

void View::goForward()
{
    if (const std::optional<JumpHistory::Entry> entry = m_history.forward())
        applyJump(*entry);
}

void View::applyRequest(uint64_t offset, int type, uint64_t offsetTmpl)
{
    if (!m_storage)
        return;
    if (type != Templates::None && type != Templates::Automatic && type > 0 && type < Templates::TypeCount) {
        emit m_editor->templateOffsetChanged(offsetTmpl, true);
        emit m_editor->templateRequest(type);
    }
    m_editor->setCaretOffset(offset);
}

int View::fileViewMode() const
{
    auto *file = qobject_cast<StorageFile *>(m_storage.get());
    return file ? file->mode() : -1;
}

bool View::setFileViewMode(int mode)
{
    auto *file = qobject_cast<StorageFile *>(m_storage.get());
    if (!file || mode == file->mode())
        return false;
    if (!m_editor->queryModeChange() || !file->setMode(mode)) {
        onEditorStateChanged(m_editor->hexOffset(), m_editor->isReadOnly(), m_editor->isBigEndian());
        return false;
    }
    m_editor->setStorage(file);
    m_history.clear();
    m_editor->resetJumpTracking();
    m_editor->setCaretOffset(file->fileStartOffset());
    emit fileViewModeChanged(mode);
    onEditorStateChanged(m_editor->hexOffset(), m_editor->isReadOnly(), m_editor->isBigEndian());
    return true;
}

bool View::queryClose()
{
    // The editor asks about a running transfer (and stops it) and about unsaved edits.
    return m_editor->queryClose();
}

void View::closeEvent(QCloseEvent *event)
{
    if (!queryClose()) {
        event->ignore();
        return;
    }
    event->accept();
}

void View::onDeviceRemoved(NodeDevice *device)
{
    if (device && m_node && device->isAncestorOf(m_node))
        releaseMedium();
}

void View::publisherDestroyed(NodeCore *node)
{
    if (node != m_node)
        return;
    // The node took its subscribers with it.
    m_node = nullptr;
    releaseMedium();
}

void View::releaseMedium()
{
    if (m_released)
        return;
    m_released = true;
    if (m_node)
        m_node->unsubscribe(this);
    m_node = nullptr;
    const bool lost = m_storage && m_storage->isModified();
    // A transfer thread reads and writes the object itself: it ends before the object does.
    m_editor->stopTransfer();
    if (auto *dock = paneDock(TemplatesPane))
        if (auto *templates = qobject_cast<Templates::View *>(dock->widget()))
            templates->setStorage(nullptr);
    m_editor->setStorage(nullptr);
    m_storage.reset();
    updateCommandStates();

    QString text = tr("%1 was removed; its hex editor view is closed.").arg(m_diskName);
    if (lost)
        text += QLatin1Char(' ') + tr("Unsaved changes were lost.");
    // The view goes first; the user is told once the removal is over (no box opens inside the node
    // tree's update, and none keeps the emptied view on screen).
    deleteLater();
    QMetaObject::invokeMethod(
        qApp, [text, lost] { GenericError(text, lost ? GenericError::Warning : GenericError::Information).report(); },
        Qt::QueuedConnection);
}

QList<QAction *> View::widgetActions(Menu menu) const
{
    auto a = [this](const QString &key) { return m_actions->action(key); };
    switch (menu) {
    case ActionsMenu:
        return {a(ViewActions::Back),
                a(ViewActions::Forward),
                a(ViewActions::GotoOffset),
                a(ViewActions::GotoSector),
                nullptr,
                a(ViewActions::Find),
                a(ViewActions::FindPrevious),
                a(ViewActions::FindNext),
                nullptr,
                a(ViewActions::ToggleBookmark),
                a(ViewActions::NextBookmark),
                a(ViewActions::PreviousBookmark)};
    case EditMenu:
        return {a(ViewActions::AllowEdit),
                a(ViewActions::Save),
                nullptr,
                a(ViewActions::Undo),
                a(ViewActions::Redo),
                a(ViewActions::Revert),
                nullptr,
                a(ViewActions::Copy),
                a(ViewActions::CopyFormatted),
                a(ViewActions::Paste),
                a(ViewActions::FillBlock),
                nullptr,
                a(ViewActions::SelectAll),
                a(ViewActions::ClearSelection),
                a(ViewActions::BlockBegin),
                a(ViewActions::BlockEnd),
                nullptr,
                a(ViewActions::SaveSelection),
                a(ViewActions::InsertFromFile)};
    case ViewMenu:
        return {m_customize->menuAction()};
    }
    return {};
}

void View::save(QDomElement &element, bool flush)
{
    QDomElement editor = Framework::SettingsDocument::child(element, EditorSettingsElement);
    m_editor->save(editor, flush);
    if (fileViewMode() >= 0)
        element.setAttribute(QStringLiteral("mode"), fileViewMode());
}

void View::load(const QDomElement &element)
{
    m_editor->load(element.firstChildElement(EditorSettingsElement));
    if (element.hasAttribute(QStringLiteral("mode")) && fileViewMode() >= 0) {
        bool ok = false;
        const int mode = element.attribute(QStringLiteral("mode")).toInt(&ok);
        if (ok && mode >= DiskMode && mode <= FileMode)
            setFileViewMode(mode);
    }
    onEditorStateChanged(m_editor->hexOffset(), m_editor->isReadOnly(), m_editor->isBigEndian());
}

} // namespace HexEditor
