// The command registry: lookup and replacement, handlers, the enabling rules, feature commanders and
// context-menu building.
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Commands/FeatureCommander.h"

#include <QAction>
#include <QMenu>
#include <gtest/gtest.h>

namespace {

constexpr uint32_t Busy = Core::Commander::StateBusy;
constexpr uint32_t Waiting = Core::Commander::StateWaiting;

class HexFeature : public IFeatureCommander
{
public:
    QString featureId() const override { return "hex-editor"; }
    void registerCommands(Core::Commander &c) override
    {
        c.registerCommand({"cmdHex_NodeOpen", {}, {}, {}, "Ctrl+H", "Edit", "Open selected item(s) in %1."});
        commander = &c;
    }
    QStringList contextCommands(const QList<NodeCore *> &nodes) const override
    {
        return nodes.isEmpty() ? QStringList() : QStringList{"cmdHex_NodeOpen", "cmdNotThere"};
    }
    bool execute(const QString &id, const QList<NodeCore *> &nodes) override
    {
        if (id != "cmdHex_NodeOpen")
            return false;
        executed += nodes.size();
        return true;
    }
    void updateCommands(const QList<NodeCore *> &selection) override { lastSelection = selection.size(); }

    Core::Commander *commander = nullptr;
    int executed = 0;
    int lastSelection = -1;
};

NodeCore *fakeNode(int i)
{
    // Node pointers are only compared and passed on here.
    return reinterpret_cast<NodeCore *>(quintptr(0x1000 + 16 * i));
}

} // namespace

TEST(Commander, LookupAndReplacement)
{
    Core::Commander commander;
    EXPECT_EQ(Core::Commander::current(), &commander);
    EXPECT_EQ(commander.action("cmdNoSuchThing"), nullptr);
    QAction *exit = commander.action("cmdExitApp");
    ASSERT_NE(exit, nullptr);
    EXPECT_EQ(exit->shortcut(), QKeySequence("Ctrl+Q"));
    EXPECT_EQ(exit->statusTip(), "Exit Brindle.");
    EXPECT_EQ(commander.action("cmdWebHome")->text(), "Brindle On-Line");
    EXPECT_EQ(commander.action("cmdWebHelp")->shortcut(), QKeySequence("Alt+F1"));
    EXPECT_EQ(commander.action("cmdHelpContents")->shortcut(), QKeySequence("Ctrl+F1"));
    EXPECT_EQ(commander.action("cmdNode_Browse")->shortcut(), QKeySequence("Ctrl+B"));
    EXPECT_EQ(commander.action("cmdShutdown")->statusTip(),
              "Closes all opened programs, shutdown and turn of the computer.");
    commander.registerCommand({"cmdExitApp", {}, {}, {}, {}, "Quit", "Leave %1."});
    EXPECT_EQ(commander.action("cmdExitApp"), exit); // replaced in place
    EXPECT_EQ(exit->text(), "Quit");
    EXPECT_EQ(exit->statusTip(), "Leave Brindle.");
    EXPECT_EQ(Core::Commander::frameworkCommands().size(), 33);
}

TEST(Commander, HandlersEnableAndReplace)
{
    Core::Commander commander;
    QAction *about = commander.action("cmdAbout");
    EXPECT_FALSE(about->isEnabled());
    int first = 0, second = 0;
    commander.setHandler("cmdAbout", [&] { ++first; });
    EXPECT_TRUE(about->isEnabled());
    about->trigger();
    commander.setHandler("cmdAbout", [&] { ++second; });
    about->trigger();
    EXPECT_EQ(first, 1);
    EXPECT_EQ(second, 1);
    commander.setHandler("cmdAbout", nullptr);
    EXPECT_FALSE(about->isEnabled());
    EXPECT_FALSE(commander.execute("cmdAbout", {}));
    EXPECT_FALSE(commander.execute("cmdNoSuchThing", {}));
}

TEST(Commander, EnablingWhileAProcessRuns)
{
    Core::Commander commander;
    for (const char *id :
         {"cmdRefresh", "cmdSettings", "cmdExitApp", "cmdNode_Stop", "cmdNode_StopAll", "cmdNode_Browse"})
        commander.setHandler(id, [] {});
    auto enabled = [&](const char *id) { return commander.action(id)->isEnabled(); };
    EXPECT_TRUE(enabled("cmdRefresh"));
    EXPECT_TRUE(enabled("cmdSettings"));
    EXPECT_TRUE(enabled("cmdExitApp"));
    EXPECT_FALSE(enabled("cmdNode_Stop"));
    EXPECT_FALSE(enabled("cmdNode_StopAll"));

    commander.setProcessRunning(true);
    EXPECT_FALSE(enabled("cmdRefresh"));
    EXPECT_FALSE(enabled("cmdSettings"));
    EXPECT_FALSE(enabled("cmdExitApp"));
    EXPECT_TRUE(enabled("cmdNode_StopAll"));
    // Stop needs a selected node that is busy or waiting.
    EXPECT_FALSE(enabled("cmdNode_Stop"));
    commander.setSelectionStates({0, Waiting});
    EXPECT_TRUE(enabled("cmdNode_Stop"));
    EXPECT_TRUE(enabled("cmdNode_Browse"));
    commander.setSelectionStates({0, Busy});
    EXPECT_TRUE(enabled("cmdNode_Stop"));
    EXPECT_FALSE(enabled("cmdNode_Browse")); // not on a busy node

    commander.setProcessRunning(false);
    EXPECT_FALSE(enabled("cmdNode_Stop"));
    EXPECT_TRUE(enabled("cmdExitApp"));
}

TEST(Commander, SelectionStatesThroughTheReader)
{
    Core::Commander commander;
    commander.setHandler("cmdNode_Browse", [] {});
    commander.setStateReader([](NodeCore *n) { return n == fakeNode(2) ? Busy : 0u; });
    commander.setSelection({fakeNode(1)});
    EXPECT_TRUE(commander.action("cmdNode_Browse")->isEnabled());
    commander.setSelection({fakeNode(1), fakeNode(2)});
    EXPECT_FALSE(commander.action("cmdNode_Browse")->isEnabled());
    EXPECT_EQ(commander.selection().size(), 2);
}

TEST(Commander, FeatureCommandersAddCommandsAndRunThem)
{
    Core::Commander commander;
    HexFeature hex;
    commander.addFeature(&hex);
    commander.addFeature(&hex); // once only
    ASSERT_EQ(commander.features().size(), 1);
    EXPECT_EQ(commander.features().find("hex-editor"), &hex);
    EXPECT_EQ(commander.features().find("disk-manager"), nullptr);
    QAction *edit = commander.action("cmdHex_NodeOpen");
    ASSERT_NE(edit, nullptr);
    EXPECT_TRUE(edit->isEnabled()); // a feature's own commands count as handled
    EXPECT_EQ(edit->statusTip(), "Open selected item(s) in Brindle.");

    EXPECT_TRUE(commander.execute("cmdHex_NodeOpen", {fakeNode(1), fakeNode(2)}));
    EXPECT_EQ(hex.executed, 2);
    EXPECT_EQ(hex.lastSelection, 2); // told of the selection the command ran on
    EXPECT_EQ(commander.selection().size(), 2);

    // Context menu: the placeholder receives the registered feature commands only.
    QMenu menu;
    commander.addActions(&menu, {"", "cmdRefresh", "", "", "cmdNoSuchThing", "cmdProperties", ""});
    EXPECT_EQ(commander.addFeatureCommands(&menu, {fakeNode(1)}), 1);
    QStringList names;
    for (QAction *a : menu.actions())
        names << (a->isSeparator() ? QString("|") : a->objectName());
    EXPECT_EQ(names, QStringList({"cmdRefresh", "|", "cmdProperties", "cmdHex_NodeOpen"}));
}

TEST(FeatureCommanderList, JoinsFeaturesWithSeparators)
{
    HexFeature a, b;
    FeatureCommanderList list;
    list << &a << &b;
    EXPECT_EQ(list.contextCommands({fakeNode(1)}),
              QStringList({"cmdHex_NodeOpen", "cmdNotThere", "", "cmdHex_NodeOpen", "cmdNotThere"}));
    EXPECT_TRUE(list.contextCommands({}).isEmpty());
    EXPECT_TRUE(list.execute("cmdHex_NodeOpen", {fakeNode(1)}));
    EXPECT_EQ(a.executed + b.executed, 1); // the first feature that owns it
    EXPECT_FALSE(list.execute("cmdOther", {}));
}
