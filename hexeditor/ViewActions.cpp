#include "hexeditor/ViewActions.h"

#include "hexeditor/ViewResources.h"

#include <QAction>
#include <QCoreApplication>
#include <QFile>
#include <QIcon>

namespace HexEditor {

namespace {

using K = QKeySequence;

QList<EditorCommand> buildTable()
{
    using V = ViewActions;
    return {
        {V::Back, QT_TRANSLATE_NOOP("HexEditor::View", "Back"), {}, nullptr, ":/navigate/backward"},
        {V::Forward, QT_TRANSLATE_NOOP("HexEditor::View", "Forward"), {}, nullptr, ":/navigate/forward"},
        {V::GotoOffset,
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to Offset..."),
         {K(QStringLiteral("Ctrl+Shift+G"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to offset"),
         ":/navigate/shift"},
        {V::GotoSector,
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to Sector..."),
         {K(QStringLiteral("Ctrl+G"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to sector or cluster"),
         ":/navigate/dblshift"},
        {V::Save,
         QT_TRANSLATE_NOOP("HexEditor::View", "Save"),
         {K(QStringLiteral("Ctrl+S"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Save changes"),
         ":/edit/save"},
        {V::AllowEdit,
         QT_TRANSLATE_NOOP("HexEditor::View", "Allow Edit"),
         {K(QStringLiteral("Ctrl+Alt+E"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Allow edit content"),
         QString(),
         true},
        {V::Undo,
         QT_TRANSLATE_NOOP("HexEditor::View", "Undo"),
         {K(QStringLiteral("Ctrl+Z"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Undo last changes"),
         ":/edit/undo"},
        {V::Redo,
         QT_TRANSLATE_NOOP("HexEditor::View", "Redo"),
         {K(QStringLiteral("Ctrl+Y"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Redo last changes"),
         ":/edit/redo"},
        {V::Revert,
         QT_TRANSLATE_NOOP("HexEditor::View", "Revert changes"),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Revert all changes made since the last save"),
         ":/edit/revert"},
        {V::FillBlock,
         QT_TRANSLATE_NOOP("HexEditor::View", "Fill block..."),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Fill selected block with text or hex data"),
         QString()},
        {V::Paste,
         QT_TRANSLATE_NOOP("HexEditor::View", "Paste"),
         {K(QStringLiteral("Ctrl+V"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Paste data from the clipboard at the cursor position"),
         ":/edit/paste"},
        {V::TemplatePosition,
         QT_TRANSLATE_NOOP("HexEditor::View", "Set Template Position"),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Set template offset at the cursor position"),
         ":/navigate/pin/green"},
        {V::TemplateCopyPosition,
         QT_TRANSLATE_NOOP("HexEditor::View", "Set Template Copy Position"),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Set template copy offset at the cursor position"),
         ":/navigate/pin/orange"},
        {V::BlockBegin,
         QT_TRANSLATE_NOOP("HexEditor::View", "Beginning of Block"),
         {K(QStringLiteral("Ctrl+1")), K(QStringLiteral("Ctrl+Shift+1"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Set the beginning of selection block at the cursor position"),
         ":/block/begin"},
        {V::BlockEnd,
         QT_TRANSLATE_NOOP("HexEditor::View", "End of Block"),
         {K(QStringLiteral("Ctrl+2")), K(QStringLiteral("Ctrl+Shift+2"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Set the end of selection block at the cursor position"),
         ":/block/end"},
        {V::SaveSelection,
         QT_TRANSLATE_NOOP("HexEditor::View", "Save selection"),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Save selected data to binary file"),
         ":/edit/save_bulk"},
        {V::InsertFromFile,
         QT_TRANSLATE_NOOP("HexEditor::View", "Insert from file"),
         {},
         QT_TRANSLATE_NOOP("HexEditor::View", "Insert data at current position from binary file"),
         ":/edit/paste_bulk"},
        {V::SelectAll,
         QT_TRANSLATE_NOOP("HexEditor::View", "Select All"),
         {K(QStringLiteral("Ctrl+A"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Select all"),
         QString()},
        {V::ClearSelection,
         QT_TRANSLATE_NOOP("HexEditor::View", "Clear selection"),
         {K(Qt::Key_Escape)},
         nullptr,
         QString()},
        {V::Copy,
         QT_TRANSLATE_NOOP("HexEditor::View", "Copy"),
         {K(QStringLiteral("Ctrl+C"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Copy selection to the clipboard"),
         ":/edit/copy"},
        {V::CopyFormatted,
         QT_TRANSLATE_NOOP("HexEditor::View", "Copy Formatted"),
         {K(QStringLiteral("Ctrl+Shift+C"))},
         QT_TRANSLATE_NOOP("HexEditor::View",
                           "Copy selection to the clipboard as formatted text with offset, "
                           "hexadecimal and ASCII values"),
         QString()},
        {V::ToggleBookmark,
         QT_TRANSLATE_NOOP("HexEditor::View", "Toggle Bookmark"),
         {K(QStringLiteral("Ctrl+F6"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Toggle a bookmark at cursor position"),
         QString()},
        {V::NextBookmark,
         QT_TRANSLATE_NOOP("HexEditor::View", "Next Bookmark"),
         {K(QStringLiteral("F6"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to the next bookmark"),
         ":/hexeditor/bookmarks/next"},
        {V::PreviousBookmark,
         QT_TRANSLATE_NOOP("HexEditor::View", "Previous Bookmark"),
         {K(QStringLiteral("Shift+F6"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Go to the previous bookmark"),
         ":/hexeditor/bookmarks/prev"},
        {V::Find,
         QT_TRANSLATE_NOOP("HexEditor::View", "Find..."),
         {K(QStringLiteral("Ctrl+F"))},
         QT_TRANSLATE_NOOP("HexEditor::View", "Find the specified text or hexadecimal data"),
         ":/hexeditor/find/default"},
        {V::FindPrevious,
         QT_TRANSLATE_NOOP("HexEditor::View", "Find Previous"),
         {K(QStringLiteral("Shift+F3"))},
         QT_TRANSLATE_NOOP("HexEditor::View",
                           "Find the previous occurrence of the specified text or hexadecimal data"),
         ":/hexeditor/find/prev"},
        {V::FindNext,
         QT_TRANSLATE_NOOP("HexEditor::View", "Find Next"),
         {K(QStringLiteral("F3"))},
         QT_TRANSLATE_NOOP("HexEditor::View",
                           "Find the next occurrence of the specified text or hexadecimal data"),
         ":/hexeditor/find/next"},
    };
}

} // namespace

const QList<EditorCommand> &ViewActions::table()
{
    static const QList<EditorCommand> commands = buildTable();
    return commands;
}

QIcon ViewActions::icon(const QString &path)
{
    initViewResources();
    QIcon result;
    if (path.isEmpty())
        return result;
    if (QFile::exists(path))
        result.addFile(path, QSize(16, 16));
    const int slash = static_cast<int>(path.indexOf(QLatin1Char('/'), 2));
    if (slash > 0) {
        const QString large = path.left(slash) + QStringLiteral("/32") + path.mid(slash);
        if (QFile::exists(large))
            result.addFile(large, QSize(32, 32));
    }
    return result;
}

ViewActions::ViewActions(QObject *parent) : QObject(parent)
{
    for (const EditorCommand &c : table()) {
        auto *a = new QAction(QCoreApplication::translate("HexEditor::View", c.text), this);
        a->setObjectName(c.key);
        a->setShortcuts(c.shortcuts);
        a->setShortcutContext(Qt::WidgetWithChildrenShortcut);
        if (c.tip) {
            const QString tip = QCoreApplication::translate("HexEditor::View", c.tip);
            a->setToolTip(tip);
            a->setStatusTip(tip);
        }
        a->setIcon(icon(c.icon));
        a->setCheckable(c.checkable);
        m_actions.insert(c.key, a);
        m_ordered.append(a);
    }
}

QList<QAction *> ViewActions::actions() const
{
    return m_ordered;
}

} // namespace HexEditor
