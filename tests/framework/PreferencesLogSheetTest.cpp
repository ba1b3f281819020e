// The application log's page of the preferences dialog: its fields over the "log" element, the
// option bits it does not own, empty fields, and the running log taking the options over.
#include "tests/common/ScratchHome.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Preferences/LogSheet.h"
#include "ClientFramework/Preferences/PreferencesCommand.h"
#include "ClientFramework/Preferences/PreferencesDlg.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QAction>
#include <QCheckBox>
#include <QDialogButtonBox>
#include <QDomDocument>
#include <QLineEdit>
#include <QPushButton>
#include <gtest/gtest.h>

using Framework::ApplicationLog;
using Framework::LogSheet;

namespace {

struct LogDoc
{
    explicit LogDoc(const QString &xml = QStringLiteral("<log/>")) { doc.setContent(xml); }
    QDomElement element() const { return doc.documentElement(); }
    QString attr(const QString &name) const { return element().attribute(name); }
    QDomDocument doc;
};

} // namespace

TEST(PreferencesLogSheet, FieldsFollowTheStoredOptions)
{
    LogDoc log(QStringLiteral("<log attr='%1' file='x.log' path='/var/tmp' pattern='L-{Date(YYYY)}.log'/>")
                   .arg(ApplicationLog::DetailMaximum | ApplicationLog::UseNamePattern));
    LogSheet sheet([&] { return log.element(); }, [](const QDomElement &) {});
    sheet.loadSettings();
    EXPECT_EQ(sheet.objectName(), "prefLog");
    EXPECT_TRUE(sheet.detailBox()->isChecked());
    EXPECT_FALSE(sheet.createNewBox()->isChecked());
    EXPECT_TRUE(sheet.patternBox()->isChecked());
    EXPECT_EQ(sheet.fileField()->text(), "x.log");
    EXPECT_EQ(sheet.folderField()->text(), "/var/tmp");
    EXPECT_EQ(sheet.patternField()->text(), "L-{Date(YYYY)}.log");
    // With a pattern the fixed name is not used, and the other way round.
    EXPECT_FALSE(sheet.fileField()->isEnabled());
    EXPECT_TRUE(sheet.patternField()->isEnabled());
    sheet.patternBox()->setChecked(false);
    EXPECT_TRUE(sheet.fileField()->isEnabled());
    EXPECT_FALSE(sheet.patternField()->isEnabled());
}

TEST(PreferencesLogSheet, SaveKeepsOtherOptionBitsAndNeverStoresEmptyNames)
{
    LogDoc log(QStringLiteral("<log attr='%1' file='a.log'/>").arg(0x400 | ApplicationLog::DetailMaximum));
    QDomElement applied;
    LogSheet sheet([&] { return log.element(); }, [&](const QDomElement &e) { applied = e; });
    sheet.loadSettings();
    sheet.createNewBox()->setChecked(true);
    sheet.detailBox()->setChecked(false);
    sheet.fileField()->setText("  ");
    sheet.folderField()->clear();
    sheet.saveSettings();
    EXPECT_EQ(log.attr("attr").toUInt(), 0x400u | ApplicationLog::CreateNew);
    EXPECT_EQ(log.attr("file"), "brindle.log");
    EXPECT_EQ(log.attr("path"), "%APPDATA%");
    EXPECT_EQ(log.attr("pattern"), ApplicationLog::DefaultPattern);
    EXPECT_EQ(applied, log.element());
}

TEST(PreferencesLogSheet, MissingOrDamagedOptionsShowTheDefaultsAndRestoreDefaultsToo)
{
    LogDoc log(QStringLiteral("<log attr='junk'/>"));
    LogSheet sheet([&] { return log.element(); }, [](const QDomElement &) {});
    sheet.loadSettings();
    EXPECT_TRUE(sheet.detailBox()->isChecked());
    EXPECT_FALSE(sheet.createNewBox()->isChecked());
    EXPECT_FALSE(sheet.patternBox()->isChecked());
    EXPECT_EQ(sheet.fileField()->text(), "brindle.log");

    sheet.createNewBox()->setChecked(true);
    sheet.fileField()->setText("other.log");
    sheet.restoreDefaults();
    EXPECT_FALSE(sheet.createNewBox()->isChecked());
    EXPECT_EQ(sheet.fileField()->text(), "brindle.log");
    EXPECT_EQ(log.attr("attr"), "junk") << "restoring defaults writes nothing";
}

TEST(PreferencesLogSheet, TheRunningLogTakesTheOptionsOver)
{
    ScratchHome home;
    ASSERT_TRUE(Framework::SettingsDocument::instance().open(home.file("settings-brindle.xml")));
    auto &running = ApplicationLog::instance();
    QDomDocument keep;
    QDomElement before = keep.createElement("log");
    running.save(before);

    LogSheet sheet; // the settings document's "log" element and the running log
    sheet.loadSettings();
    sheet.detailBox()->setChecked(false);
    sheet.fileField()->setText("renamed.log");
    sheet.saveSettings();
    EXPECT_FALSE(running.options() & ApplicationLog::DetailMaximum);
    EXPECT_EQ(running.storedFileName(), "renamed.log");
    // Saving the log's state later keeps what the page set.
    QDomElement after = keep.createElement("log");
    running.save(after);
    EXPECT_EQ(after.attribute("file"), "renamed.log");

    running.load(before);
}

TEST(PreferencesLogSheet, SettingsCommandListsTheLogPageAfterTheFeaturePages)
{
    ScratchHome home;
    ASSERT_TRUE(Framework::SettingsDocument::instance().open(home.file("settings-brindle.xml")));
    Core::Commander commander;
    Framework::Preferences::installCommand(commander, nullptr);
    QStringList names;
    Framework::PreferencesDlg::setRunner([&](Framework::PreferencesDlg &dialog) {
        for (int i = 0; i < dialog.pageCount(); ++i)
            names << dialog.page(i)->pageWidget()->objectName();
        dialog.buttons()->button(QDialogButtonBox::Cancel)->click();
        return dialog.result();
    });
    commander.action("cmdSettings")->trigger();
    Framework::PreferencesDlg::setRunner({});
    EXPECT_EQ(names, QStringList({"prefLog"}));
}
