// "Help" and "Help Contents": the built-in guide, its contents page and the commands that show them
// through the dialog seam, in a main window.
#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Help/HelpDocument.h"
#include "ClientFramework/Help/PopupDlg.h"
#include "ClientFramework/Views/MainView.h"
#include "hexeditor/ViewActions.h"

#include <QAction>
#include <QRegularExpression>
#include <QTextBrowser>
#include <gtest/gtest.h>

namespace Help = Framework::Help;

namespace {

QStringList anchorsOf(const QString &html)
{
    QStringList ids;
    static const QRegularExpression id(QStringLiteral("\\bid=\"([^\"]+)\""));
    for (auto it = id.globalMatch(html); it.hasNext();)
        ids << it.next().captured(1);
    return ids;
}

} // namespace

TEST(HelpDocument, GuideCoversTheTopicsAndItsContentsLinkIntoIt)
{
    const QString guide = Help::guide();
    ASSERT_FALSE(guide.isEmpty()) << "the guide resource is missing";
    QStringList ids;
    QStringList titles;
    for (const auto &[id, title] : Help::sections(guide)) {
        ids << id;
        titles << title;
    }
    EXPECT_EQ(ids, QStringList({"explorer", "hexeditor", "keys", "commandline", "cli", "preferences"}));
    EXPECT_EQ(titles.first(), "Disk Explorer");
    EXPECT_FALSE(titles.contains(QString())) << "a section heading without text";

    // Every link of the contents page names the guide and an anchor that is there.
    const QString contents = Help::contents();
    const QStringList anchors = anchorsOf(guide);
    static const QRegularExpression link(QStringLiteral("href=\"([^\"]+)\""));
    int links = 0;
    for (auto it = link.globalMatch(contents); it.hasNext();) {
        const QUrl url(it.next().captured(1));
        EXPECT_EQ(url.adjusted(QUrl::RemoveFragment).toString(), Help::GuideUrl);
        if (url.hasFragment()) {
            EXPECT_TRUE(anchors.contains(url.fragment())) << url.toString().toStdString();
        }
        ++links;
    }
    EXPECT_EQ(links, ids.size() + 1);
}

TEST(HelpDocument, GuideListsEveryShortcutOfTheHexEditor)
{
    const QString guide = Help::guide();
    int checked = 0;
    for (const auto &command : HexEditor::ViewActions::table())
        for (const QKeySequence &key : command.shortcuts) {
            const QString text = key.toString(QKeySequence::PortableText);
            // Ctrl+Shift+1 and Ctrl+Shift+2 are the second keys of the block marks.
            if (text.startsWith("Ctrl+Shift+") && text.size() == 12 && text.back().isDigit())
                continue;
            const QString name = text == "Esc" ? QStringLiteral("Escape") : text;
            EXPECT_TRUE(guide.contains("<kbd>" + name + "</kbd>")) << name.toStdString();
            ++checked;
        }
    EXPECT_GE(checked, 15);
}

TEST(HelpDocument, ContentsLinksOpenTheGuideInTheHelpPopup)
{
    Help::PopupDlg popup("Help", Help::contents(), Help::footer());
    auto *browser = popup.findChild<QTextBrowser *>();
    ASSERT_TRUE(browser);
    EXPECT_TRUE(browser->toPlainText().contains("Hex editor keys"));
    browser->setSource(QUrl(Help::GuideUrl + "#keys"));
    EXPECT_TRUE(browser->toPlainText().contains("Go to Offset"));
    EXPECT_TRUE(browser->toPlainText().contains("brindle-cli"));
}

TEST(HelpCommands, HelpAndHelpContentsShowTheGuideThroughTheSeam)
{
    ScratchHome home;
    RecordingDialogs dialogs;
    Core::Commander commander;
    Framework::MainView window(&commander);
    window.build();
    QAction *help = commander.action("cmdHelp");
    QAction *contents = commander.action("cmdHelpContents");
    ASSERT_TRUE(help && contents);
    EXPECT_TRUE(help->isEnabled());
    EXPECT_TRUE(contents->isEnabled());
    // Help Contents is in no menu: its Ctrl+F1 belongs to the window.
    EXPECT_TRUE(window.actions().contains(contents));
    EXPECT_EQ(contents->shortcut(), QKeySequence("Ctrl+F1"));

    help->trigger();
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_TRUE(dialogs.calls[0].help);
    EXPECT_EQ(dialogs.calls[0].title, "Brindle Help");
    EXPECT_EQ(dialogs.calls[0].text, Help::guide());
    EXPECT_TRUE(dialogs.calls[0].footer.contains(Framework::Identity::Version));

    contents->trigger();
    ASSERT_EQ(dialogs.calls.size(), 2);
    EXPECT_EQ(dialogs.calls[1].title, "Brindle Help Contents");
    EXPECT_TRUE(dialogs.calls[1].text.contains(Help::GuideUrl + "#keys"));
    EXPECT_TRUE(dialogs.calls[1].text.contains("Hex editor keys"));

    // Preferences... has its handler in the same window and follows the process rule.
    QAction *settings = commander.action("cmdSettings");
    ASSERT_TRUE(settings);
    EXPECT_TRUE(settings->isEnabled());
    commander.setProcessRunning(true);
    EXPECT_FALSE(settings->isEnabled());
    EXPECT_TRUE(help->isEnabled());
}
