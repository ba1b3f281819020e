// The hex editor control: shows a storage as lines of bytes (offset, hexadecimal, ASCII and Unicode
// columns below a header row), owns the caret and the selection anchor, turns keyboard and mouse
// input into caret moves, selections and edits, paints the layers other parts ask for, and
// reports its state through signals. Edits stay in the storage's sector cache, marked as modified,
// until saved or reverted; every edit is one undo step.
#pragma once

#include <QAbstractScrollArea>
#include <QByteArray>
#include <QList>
#include <QPointer>
#include <QString>

#include <cstdint>
#include <functional>
#include <memory>

#include "ClientFramework/Settings/PersistenceXML.h"
#include "hexeditor/DiskArea.h"
#include "hexeditor/Metrics.h"
#include "hexeditor/NavigationPoint.h"
#include "hexeditor/PaintPalette.h"
#include "hexeditor/Storage.h" // declares DiskArea as a meta type
#include "hexeditor/UndoStack.h"

class QMenu;
class QAction;
class QThread;

namespace HexEditor {

class Storage;
class Painter;

class EditorCtrl : public QAbstractScrollArea, public Metrics, public IPersistenceXML
{
    Q_OBJECT

public:
    // A bookmark as the control paints it.
    struct BookmarkMark
    {
        DiskArea area;
        QString name;
        bool enabled = true;
    };
    // A coloured field of the current template; `field` is the template's own id of the field.
    struct TemplateArea
    {
        DiskArea area;
        int colorIndex = 0;
        int field = -1;
        bool link = false;
    };
    // Which file a bulk transfer reads or writes: asked through a seam so tests never block.
    enum class FileRequest { SaveSelection, InsertFile };
    using FileNameProvider = std::function<QString(FileRequest request, const QString &title,
                                                   const QString &filter, const QString &initial)>;
    // Starts a bulk transfer; the view or the transfer module installs it.
    struct BulkRequest
    {
        FileRequest mode = FileRequest::SaveSelection;
        bool copyBetweenStorages = false;
        QString fileName;
        Storage *source = nullptr;
        DiskArea sourceArea;
        Storage *target = nullptr;
        uint64_t targetOffset = 0;
    };
    using BulkStarter = std::function<bool(const BulkRequest &request)>;

    static constexpr uint64_t NoAnchor = ~uint64_t(0);
    static constexpr uint64_t JumpDistance = 1025;
    static constexpr int AutoScrollInterval = 50;
    static constexpr uint64_t MaxEdit = 1u << 20;

    explicit EditorCtrl(Storage *storage = nullptr, bool readOnly = true, QWidget *parent = nullptr);
    ~EditorCtrl() override;

    Storage *storage() const { return m_storage; }
    // Shows another storage (or none); the edit history is dropped.
    void setStorage(Storage *storage);

    // --- caret and selection ----------------------------------------------------------------------
    const Caret &caret() const { return m_caret; }
    uint64_t caretOffset() const { return m_caret.offset(); }
    // Moves the caret to an offset (clamped into the data), scrolls it into view.
    void setCaretOffset(uint64_t offset);
    // Puts the caret in another shown pane (the hexadecimal pane when that one is hidden).
    void setCaretPane(Pane pane);
    uint64_t anchor() const { return m_anchor; }
    DiskArea selection() const;
    void setSelection(const DiskArea &area);
    void clearSelection();
    void selectAll();
    // "Beginning of Block" / "End of Block" at the caret.
    void setBlockBegin();
    void setBlockEnd();

    // --- view settings -----------------------------------------------------------------------------
    void setEditorFont(const QString &family, int pointSize);
    void setColumns(uint32_t mask);
    void setBytesPerLine(uint32_t n);
    void setGrouping(uint32_t n);
    void setHexOffset(bool on);
    void setBigEndian(bool on);
    void setEditable(bool on);
    bool isEditable() const { return m_editable; }
    bool isReadOnly() const { return !m_editable; }
    bool isBigEndian() const { return m_bigEndian; }
    void setPaintPalette(const PaintPalette &palette);
    const PaintPalette &paintPalette() const { return m_palette; }

    // --- layers other parts ask for -------------------------------------------------------------------
    void setBookmarks(const QList<BookmarkMark> &marks);
    void setSearchHits(const QList<DiskArea> &hits);
    // The template pane's field colouring (painted while switched on) and the selected field outline.
    void setTemplateColoring(const QList<TemplateArea> &areas);
    void setTemplateColoringEnabled(bool on);
    bool templateColoringEnabled() const { return m_coloringOn; }
    void setTemplateOutline(const DiskArea &area);
    DiskArea templateOutline() const { return m_outline; }
    // The current template and where it stands (for the jump history).
    void setCurrentTemplate(int type, uint64_t offset);

    // --- editing ------------------------------------------------------------------------------------
    // Overwrites bytes at offset as one undo step; false when refused (read-only, no storage, empty,
    // longer than 1 MiB, beyond the data).
    bool applyEdit(uint64_t offset, const QByteArray &bytes);
    bool canUndo() const { return m_undo.canUndo(); }
    bool canRedo() const { return m_undo.canRedo(); }
    bool hasAppliedEdits() const { return m_undo.hasApplied(); }
    const UndoStack &undoStack() const { return m_undo; }
    void undo();
    void redo();
    // "Revert changes", after a confirmation.
    void revert();
    // Delete: the selection becomes zeros (at most 1 MiB).
    bool deleteSelection();
    // "Fill block...": asks for the pattern (the dialog is skipped when `pattern` is given).
    bool fillBlock(const QByteArray &pattern = {});
    // Whether the view may close (asks to save applied edits; Yes saves, No discards).
    bool queryClose();
    // The switch of a file storage's mode: asks to save first; false for Cancel.
    bool queryModeChange();

    void setFileNameProvider(FileNameProvider provider) { m_fileNames = std::move(provider); }
    void setBulkStarter(BulkStarter starter) { m_bulkStarter = std::move(starter); }
    bool isTransferRunning() const;
    void setTransferRunning(bool on) { m_transferRunning = on; }
    // Stops the running block transfer and waits for its end (closing, destruction).
    void stopTransfer();
    // Starts a block transfer on the worker thread (through the installed starter, if any).
    bool startTransfer(const BulkRequest &request);

    // --- menus ------------------------------------------------------------------------------------------
    // The commands shown in the context menu above "Navigate ", and Back / Forward inside it.
    void setContextActions(const QList<QAction *> &actions) { m_contextActions = actions; }
    void setNavigateActions(const QList<QAction *> &actions) { m_navigateActions = actions; }
    // A new context menu (owned by the caller) with the commands and the "Navigate " submenu.
    QMenu *createContextMenu(QWidget *parent = nullptr);
    // Adds the storage's navigation points to a menu.
    void fillNavigateMenu(QMenu *menu);
    // What choosing a navigation point does.
    void activateNavigationPoint(const NavigationPoint &point);

    // --- persistence ("hex-editor" element with "font" and "viewport") -------------------------------
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

    // Records the next caret report in the jump history (when the view's history was cleared).
    void resetJumpTracking() { m_jumpTracked = false; }

public slots:
    void onGoToOffset(quint64 offset);
    void onCopy();
    void onCopyFormatted();
    void onPaste();
    bool onSave();
    void onSaveData();
    void onInsertData();
    // A template pane's change list: alternating offsets (quint64) and byte arrays.
    void onTemplateModified(const QVariantList &changes);
    void onTemplateOffsetChanged(quint64 offset, bool isPrimary);
    void onTemplateNodeActivated(quint64 address);
    void onColoringChanged(bool on) { setTemplateColoringEnabled(on); }
    // A file storage's view mode (disk 0, partition 1, file 2): asks to save applied edits first,
    // then switches and moves the caret to the file's first byte.
    void onFileViewModeChanged(int mode);
    // Asks the running block transfer to stop (the status bar's stop button) and returns at once;
    // the transfer ends with "%1 canceled by user" and transferFinished follows.
    void onThreadStop();

signals:
    void stateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian);
    void cursorMoved(const HexEditor::Metrics::Caret &caret);
    void selectionChanged(const HexEditor::DiskArea &area, uint bytesPerSector);
    void dataChanged(const HexEditor::DiskArea &area);
    void templateOffsetChanged(quint64 offset, bool isPrimary);
    void templateRequest(int type);
    // A click landed on a field of the current template (its id from setTemplateColoring).
    void templateFieldClicked(int field, quint64 offset);
    // The view's jump history gets an entry (offset, template type there or 0).
    void jumpRecorded(quint64 offset, int templateType);
    // "MFT No..." / "Node No..." navigation points: the view opens the dialog.
    void mftRecordRequested();
    void catalogNodeRequested();
    // Command states (save, undo, redo, editing, selection) may have changed.
    void commandStateChanged();
    void progress(int percent);
    // A block transfer ended: whether it succeeded and its result line (already in the log, and
    // a failure shown in a box).
    void transferFinished(bool succeeded, const QString &result);
    // A line of the running transfer's log.
    void transferMessage(const QString &text);

protected:
    void paintEvent(QPaintEvent *event) override;
    void resizeEvent(QResizeEvent *event) override;
    void keyPressEvent(QKeyEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseMoveEvent(QMouseEvent *event) override;
    void mouseReleaseEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;
    void wheelEvent(QWheelEvent *event) override;
    void timerEvent(QTimerEvent *event) override;
    void contextMenuEvent(QContextMenuEvent *event) override;
    bool event(QEvent *event) override;
    void scrollContentsBy(int dx, int dy) override;
    void layoutChanged() override;

private:
    friend class EditorCtrlTestAccess;

    // Caret moves (EditorCtrlInput.cpp).
    bool moveKey(QKeyEvent *event);
    void moveLeft();
    void moveRight();
    void moveLines(int64_t lines);
    void placeCaret(uint64_t offset, int32_t pane, int32_t nibble);
    void extendSelectionTo(uint64_t offset);
    Hit hitAt(const QPoint &pos) const;
    uint64_t hitOffset(const Hit &hit) const;
    void autoScrollTick();
    void stopAutoScroll();
    bool typeKey(QKeyEvent *event);

    // Caret reporting and scrolling (EditorCtrl.cpp).
    void caretChanged(bool force = false);
    void syncScrollBars();
    uint64_t lastOffset() const;
    void refreshStorageMetrics();

    // Edits (EditorCtrlEdit.cpp).
    bool writeEdit(uint64_t offset, const QByteArray &bytes, bool moveCaret);
    void afterEdit(const DiskArea &area);
    void editByte(uint64_t offset, const QByteArray &bytes);
    bool refuseTooBig(uint64_t length, const QString &title);
    QString saveQuestion() const;
    // Saves the edits; a failure is shown and the edits stay (false).
    bool saveEdits();

    std::unique_ptr<Painter> m_painter;
    Storage *m_storage = nullptr;
    QPointer<QObject> m_storageGuard;
    Caret m_caret;
    Caret m_reported;
    bool m_reportedValid = false;
    uint64_t m_anchor = NoAnchor;
    bool m_editable = false;
    bool m_bigEndian = false;
    PaintPalette m_palette;

    UndoStack m_undo;

    QList<BookmarkMark> m_bookmarks;
    QList<DiskArea> m_searchHits;
    QList<TemplateArea> m_coloring;
    bool m_coloringOn = true;
    DiskArea m_outline;
    int m_templateType = 0;
    uint64_t m_templateOffset = 0;

    bool m_jumpTracked = false;
    uint64_t m_lastJumpOffset = 0;

    int m_autoScrollTimer = 0;
    QPoint m_lastMousePos;
    bool m_mouseSelecting = false;
    bool m_syncingScroll = false;

    FileNameProvider m_fileNames;
    BulkStarter m_bulkStarter;
    bool m_transferRunning = false;
    QPointer<QThread> m_transfer;

    QList<QAction *> m_contextActions;
    QList<QAction *> m_navigateActions;
};

} // namespace HexEditor
