// The help pop-up dialog shows the filled-in page and its footer.
#include "app/CliArguments.h"

#include "ClientFramework/Help/PopupDlg.h"

#include <QTextBrowser>
#include <gtest/gtest.h>

TEST(HelpPopup, ShowsPageAndFooter)
{
    CLI::Arguments args({"brindle", "-help"});
    Framework::Help::PopupDlg dlg("Command Line Interface", args.helpPage(), args.helpFooter());
    EXPECT_EQ(dlg.windowTitle(), "Command Line Interface");
    auto *browser = dlg.findChild<QTextBrowser *>();
    ASSERT_NE(browser, nullptr);
    const QString text = browser->toPlainText();
    EXPECT_TRUE(text.contains("brindle [options]"));
    EXPECT_TRUE(text.contains("33 - XFS AG Inode"));
    EXPECT_TRUE(dlg.footer().contains("<b>brindle -?</b>"));
}
