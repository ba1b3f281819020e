// The template pane ("view-hex-templates", title "Templates"): the chooser, the field tree and the
// toolbar to colour, copy, step and place templates, wired to the hex editor control both ways.
// The hex editor view only constructs it with its editor control and storage and docks it:
//     auto *pane = new Templates::View(editor, storage);
//     setPane(TemplatesPane, pane);
#pragma once

#include <QList>
#include <QSemaphore>
#include <QWidget>

#include <cstdint>

#include "ClientFramework/Settings/PersistenceXML.h"
#include "hexeditor/DiskArea.h"
#include "hexeditor/Metrics.h"
#include "hexeditor/Storage.h" // declares the DiskArea meta type the slots use
#include "hexeditor/templates/SelectorCtrl.h"
#include "hexeditor/templates/core/FieldFormat.h"

class QAction;
class QToolBar;

namespace HexEditor {
class EditorCtrl;
class Storage;
} // namespace HexEditor

namespace HexEditor::Templates {

class Model;
class OffsetEditCtrl;
class TemplateTreeCtrl;
struct Node;

class View : public QWidget, public IPersistenceXML
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("view-hex-templates");
    enum Action {
        Coloring,
        CopyValue,
        CopyField,
        CopyAll,
        MoveUp,
        MoveDown,
        SetPrimary,
        SetCopy,
        ActionCount
    };

    // Connects itself to the editor (when given) and attaches the storage.
    explicit View(EditorCtrl *editor, Storage *storage, QWidget *parent = nullptr);
    ~View() override;

    // Creates the chooser's models over the storage and makes the automatic choice.
    void setStorage(Storage *storage);
    Storage *storage() const { return m_storage; }
    Model *currentModel() const { return m_model; }
    SelectorCtrl *selector() const { return m_selector; }
    TemplateTreeCtrl *tree() const { return m_tree; }
    QAction *action(Action a) const { return m_actions[a]; }
    OffsetEditCtrl *offsetEdit(bool isPrimary) const { return isPrimary ? m_primaryEdit : m_copyEdit; }
    std::uint64_t cursorOffset() const { return m_cursorOffset; }
    bool coloringOn() const;
    bool autoload() const { return m_autoload; }
    void setAutoload(bool on) { m_autoload = on; }
    QList<int> columnWidths() const { return m_columns; }

    // The text "Copy Field" (node) or "Copy All" (null) puts on the clipboard.
    QString fieldText(const Node *node) const;
    // Selects the row of the node with that id (a field clicked in the hex view).
    void selectField(int id);

    // Settings below the "hex-editor" element: its "templates" child.
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

signals:
    void templateSelected(HexEditor::Templates::Model *model);
    void templateModified(const QVariantList &changes);
    void templateOffsetChanged(quint64 offset, bool isPrimary);
    void nodeSelected(HexEditor::Templates::Node *const node, HexEditor::Templates::Context context);
    void nodeActivated(quint64 address);
    void coloringChanged(bool on);

public slots:
    void onEditorStateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian);
    void onEditorCursorMoved(const HexEditor::Metrics::Caret &caret);
    void onDataChanged(const HexEditor::DiskArea &area);
    void onTemplateRequest(int type);
    void onTemplateOffsetChanged(quint64 offset, bool isPrimary);
    void onTemplateNodeSelected(HexEditor::Templates::Node *const node,
                                HexEditor::Templates::Context context);
    void onTemplateSelected(const HexEditor::Templates::SelectorCtrl::Template &tmpl);
    void onSaveColumnSizes();
    void onActivateItem(const QModelIndex &index);
    void onClickItem(const QModelIndex &index);
    void onCopy();
    void onContextMenu(const QPoint &pos);

private:
    void buildToolBar();
    void connectEditor();
    void setOffset(std::uint64_t offset, bool isPrimary);
    void expandDefaultRows();
    void updateActions();
    void restoreColumns();
    void pushColoring();
    void loadSettings();
    void storeSettings();

    EditorCtrl *m_editor = nullptr;
    Storage *m_storage = nullptr;
    Model *m_model = nullptr;
    SelectorCtrl *m_selector = nullptr;
    TemplateTreeCtrl *m_tree = nullptr;
    QToolBar *m_toolBar = nullptr;
    OffsetEditCtrl *m_primaryEdit = nullptr;
    OffsetEditCtrl *m_copyEdit = nullptr;
    QAction *m_actions[ActionCount] = {};
    std::uint64_t m_cursorOffset = 0;
    bool m_hexOffsets = true;
    bool m_autoload = true;
    bool m_restoringColumns = false;
    // Widths: three for 3-column templates, then four for 4-column ones.
    QList<int> m_columns = {200, 50, 80, 200, 50, 80, 80};
    QSemaphore m_offsetGuard{1};
};

} // namespace HexEditor::Templates
