// The hex editor's command records and the editor's command table: ids, texts, shortcuts, tips.
#include "ClientFramework/Commands/Commander.h"
#include "hexeditor/Commander.h"
#include "hexeditor/ViewActions.h"
#include "hexeditor/ViewResources.h"
#include "hexeditor/templates/TemplateType.h"

#include <QAction>
#include <QFile>
#include <gtest/gtest.h>

using namespace HexEditor;

TEST(HexCommands, OpenCommandsAreRegisteredWithTheirShortcutsAndTexts)
{
    const QList<Core::CommandRecord> &records = Commander::commands();
    ASSERT_EQ(records.size(), 2);
    EXPECT_EQ(records[0].id, "cmdHex_NodeOpen");
    EXPECT_EQ(records[0].text, "Edit");
    EXPECT_EQ(records[0].shortcut, "Ctrl+H");
    EXPECT_EQ(records[0].icon16, ":/hexeditor/edit");
    EXPECT_EQ(records[0].icon32, ":/hexeditor/32/edit");
    EXPECT_EQ(records[0].icon48, ":/hexeditor/48/edit");
    EXPECT_EQ(records[0].tip, "Open selected item(s) in %1.");
    EXPECT_EQ(records[1].id, "cmdHex_FileRecord");
    EXPECT_EQ(records[1].text, "Inspect File Record");
    EXPECT_EQ(records[1].shortcut, "Ctrl+Shift+H");
    EXPECT_EQ(records[1].icon16, ":/hexeditor/record");

    Core::Commander registry;
    Commander hex;
    registry.addFeature(&hex);
    QAction *open = registry.action("cmdHex_NodeOpen");
    ASSERT_NE(open, nullptr);
    EXPECT_EQ(open->text(), "Edit");
    EXPECT_EQ(open->shortcut(), QKeySequence("Ctrl+H"));
    EXPECT_TRUE(open->statusTip().contains("Brindle") || open->toolTip().contains("Brindle"));
    EXPECT_FALSE(open->statusTip().contains("%1"));
    ASSERT_NE(registry.action("cmdHex_FileRecord"), nullptr);
    EXPECT_EQ(registry.action("cmdHex_FileRecord")->shortcut(), QKeySequence("Ctrl+Shift+H"));
    EXPECT_EQ(registry.features().find("hex-editor"), &hex);

    // Nothing selected: nothing to open.
    hex.updateCommands({});
    EXPECT_FALSE(open->isEnabled());
    EXPECT_FALSE(registry.action("cmdHex_FileRecord")->isEnabled());
}

TEST(HexCommands, EditorCommandTable)
{
    struct Expect
    {
        QString key;
        QString text;
        QList<QKeySequence> keys;
        QString tip;
        QString icon;
    };
    const QList<Expect> expected = {
        {ViewActions::Back, "Back", {}, "", ":/navigate/backward"},
        {ViewActions::Forward, "Forward", {}, "", ":/navigate/forward"},
        {ViewActions::GotoOffset,
         "Go to Offset...",
         {QKeySequence("Ctrl+Shift+G")},
         "Go to offset",
         ":/navigate/shift"},
        {ViewActions::GotoSector,
         "Go to Sector...",
         {QKeySequence("Ctrl+G")},
         "Go to sector or cluster",
         ":/navigate/dblshift"},
        {ViewActions::Save, "Save", {QKeySequence("Ctrl+S")}, "Save changes", ":/edit/save"},
        {ViewActions::AllowEdit, "Allow Edit", {QKeySequence("Ctrl+Alt+E")}, "Allow edit content", ""},
        {ViewActions::Undo, "Undo", {QKeySequence("Ctrl+Z")}, "Undo last changes", ":/edit/undo"},
        {ViewActions::Redo, "Redo", {QKeySequence("Ctrl+Y")}, "Redo last changes", ":/edit/redo"},
        {ViewActions::Revert,
         "Revert changes",
         {},
         "Revert all changes made since the last save",
         ":/edit/revert"},
        {ViewActions::FillBlock, "Fill block...", {}, "Fill selected block with text or hex data", ""},
        {ViewActions::Paste,
         "Paste",
         {QKeySequence("Ctrl+V")},
         "Paste data from the clipboard at the cursor position",
         ":/edit/paste"},
        {ViewActions::TemplatePosition,
         "Set Template Position",
         {},
         "Set template offset at the cursor position",
         ":/navigate/pin/green"},
        {ViewActions::TemplateCopyPosition,
         "Set Template Copy Position",
         {},
         "Set template copy offset at the cursor position",
         ":/navigate/pin/orange"},
        {ViewActions::BlockBegin,
         "Beginning of Block",
         {QKeySequence("Ctrl+1"), QKeySequence("Ctrl+Shift+1")},
         "Set the beginning of selection block at the cursor position",
         ":/block/begin"},
        {ViewActions::BlockEnd,
         "End of Block",
         {QKeySequence("Ctrl+2"), QKeySequence("Ctrl+Shift+2")},
         "Set the end of selection block at the cursor position",
         ":/block/end"},
        {ViewActions::SaveSelection,
         "Save selection",
         {},
         "Save selected data to binary file",
         ":/edit/save_bulk"},
        {ViewActions::InsertFromFile,
         "Insert from file",
         {},
         "Insert data at current position from binary file",
         ":/edit/paste_bulk"},
        {ViewActions::SelectAll, "Select All", {QKeySequence("Ctrl+A")}, "Select all", ""},
        {ViewActions::ClearSelection, "Clear selection", {QKeySequence(Qt::Key_Escape)}, "", ""},
        {ViewActions::Copy,
         "Copy",
         {QKeySequence("Ctrl+C")},
         "Copy selection to the clipboard",
         ":/edit/copy"},
        {ViewActions::CopyFormatted,
         "Copy Formatted",
         {QKeySequence("Ctrl+Shift+C")},
         "Copy selection to the clipboard as formatted text with offset, hexadecimal and ASCII values",
         ""},
        {ViewActions::ToggleBookmark,
         "Toggle Bookmark",
         {QKeySequence("Ctrl+F6")},
         "Toggle a bookmark at cursor position",
         ""},
        {ViewActions::NextBookmark,
         "Next Bookmark",
         {QKeySequence("F6")},
         "Go to the next bookmark",
         ":/hexeditor/bookmarks/next"},
        {ViewActions::PreviousBookmark,
         "Previous Bookmark",
         {QKeySequence("Shift+F6")},
         "Go to the previous bookmark",
         ":/hexeditor/bookmarks/prev"},
        {ViewActions::Find,
         "Find...",
         {QKeySequence("Ctrl+F")},
         "Find the specified text or hexadecimal data",
         ":/hexeditor/find/default"},
        {ViewActions::FindPrevious,
         "Find Previous",
         {QKeySequence("Shift+F3")},
         "Find the previous occurrence of the specified text or hexadecimal data",
         ":/hexeditor/find/prev"},
        {ViewActions::FindNext,
         "Find Next",
         {QKeySequence("F3")},
         "Find the next occurrence of the specified text or hexadecimal data",
         ":/hexeditor/find/next"},
    };
    const QList<EditorCommand> &table = ViewActions::table();
    ASSERT_EQ(table.size(), expected.size());
    ViewActions actions;
    for (int i = 0; i < expected.size(); ++i) {
        SCOPED_TRACE(expected[i].text.toStdString());
        EXPECT_EQ(table[i].key, expected[i].key);
        EXPECT_EQ(QString::fromLatin1(table[i].text), expected[i].text);
        EXPECT_EQ(table[i].shortcuts, expected[i].keys);
        EXPECT_EQ(table[i].tip ? QString::fromLatin1(table[i].tip) : QString(), expected[i].tip);
        EXPECT_EQ(table[i].icon, expected[i].icon);
        QAction *a = actions.action(expected[i].key);
        ASSERT_NE(a, nullptr);
        EXPECT_EQ(a->text(), expected[i].text);
        EXPECT_EQ(a->shortcuts(), expected[i].keys);
        EXPECT_EQ(a->isCheckable(), expected[i].key == ViewActions::AllowEdit);
    }
    // Shortcuts are unique within the view.
    QSet<QString> seen;
    for (QAction *a : actions.actions())
        for (const QKeySequence &k : a->shortcuts())
            EXPECT_TRUE(!seen.contains(k.toString()) && (seen.insert(k.toString()), true))
                << k.toString().toStdString();
}

TEST(HexCommands, FileRecordTemplatesByFileSystem)
{
    EXPECT_EQ(Commander::recordTemplate(10), Templates::NtfsMftFileRecord);
    EXPECT_EQ(Commander::recordTemplate(7), Templates::FatDirectoryEntry);
    EXPECT_EQ(Commander::recordTemplate(8), Templates::FatDirectoryEntry);
    EXPECT_EQ(Commander::recordTemplate(9), Templates::ExFatDirectoryEntry);
    EXPECT_EQ(Commander::recordTemplate(13), Templates::HfsPlusFileRecord);
    EXPECT_EQ(Commander::recordTemplate(15), Templates::ExtInode);
    EXPECT_EQ(Commander::recordTemplate(17), Templates::UfsInode);
    EXPECT_EQ(Commander::recordTemplate(24), Templates::None);
}

TEST(HexCommands, EveryIconOfTheTablesIsCompiledIn)
{
    HexEditor::initViewResources();
    QStringList paths = {":/hexeditor/default",  ":/hexeditor/32/default", ":/hexeditor/stop",
                         ":/hexeditor/ascii",    ":/hexeditor/unicode",    ":/navigate/32/backward",
                         ":/navigate/32/forward"};
    for (const Core::CommandRecord &r : Commander::commands())
        for (const QString &icon : {r.icon16, r.icon32, r.icon48})
            if (!icon.isEmpty())
                paths << icon;
    for (const EditorCommand &c : ViewActions::table())
        if (!c.icon.isEmpty())
            paths << c.icon;
    for (const QString &path : paths)
        EXPECT_TRUE(QFile::exists(path)) << path.toStdString();
    EXPECT_FALSE(ViewActions::icon(":/navigate/backward").availableSizes().isEmpty());
    EXPECT_TRUE(ViewActions::icon(":/navigate/backward").availableSizes().contains(QSize(32, 32)));
}
