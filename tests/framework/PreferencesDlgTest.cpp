// The preferences dialog: pages contributed by feature commanders, OK / Apply / Cancel / "Restore
// Defaults", what reaches the settings document and the file, and the "Preferences..." command.
#include "tests/common/ScratchHome.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Commands/FeatureCommander.h"
#include "ClientFramework/Preferences/IPreferencePage.h"
#include "ClientFramework/Preferences/PreferencesCommand.h"
#include "ClientFramework/Preferences/PreferencesDlg.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QAction>
#include <QDialogButtonBox>
#include <QFile>
#include <QLabel>
#include <QLineEdit>
#include <QListWidget>
#include <QPointer>
#include <QPushButton>
#include <QVBoxLayout>
#include <gtest/gtest.h>

using Framework::IPreferencePage;
using Framework::PreferencesDlg;
using Framework::SettingsDocument;

namespace {

// A page with one text field kept in the "value" attribute of its own settings element.
class TextPage : public QWidget, public IPreferencePage
{
public:
    TextPage(const QString &name, const QString &fallback = QStringLiteral("default"))
        : m_name(name), m_fallback(fallback), m_field(new QLineEdit(this))
    {
        setObjectName(name);
        (new QVBoxLayout(this))->addWidget(m_field);
    }
    QWidget *pageWidget() override { return this; }
    QString pageTitle() const override { return m_name + " title"; }
    QString pageDescription() const override { return m_name + " description"; }
    QIcon pageIcon() const override { return {}; }
    void loadSettings() override
    {
        ++loads;
        m_field->setText(element().attribute("value", m_fallback));
    }
    void saveSettings() override
    {
        ++saves;
        element().setAttribute("value", m_field->text());
        if (onSave)
            onSave();
    }
    void restoreDefaults() override { m_field->setText(m_fallback); }

    QDomElement element() const { return SettingsDocument::instance().element(m_name); }
    QLineEdit *field() const { return m_field; }

    int loads = 0;
    int saves = 0;
    std::function<void()> onSave;

private:
    QString m_name;
    QString m_fallback;
    QLineEdit *m_field;
};

// A feature commander that brings pages.
class PageFeature : public IFeatureCommander, public Framework::IPreferencePageSource
{
public:
    explicit PageFeature(QStringList names) : m_names(std::move(names)) {}
    QString featureId() const override { return "pages"; }
    void registerCommands(Core::Commander &) override {}
    QList<IPreferencePage *> createPreferencePages() override
    {
        QList<IPreferencePage *> pages;
        for (const QString &n : m_names)
            pages << new TextPage(n);
        ++created;
        return pages;
    }
    int created = 0;

private:
    QStringList m_names;
};

// A feature without pages.
class PlainFeature : public IFeatureCommander
{
public:
    QString featureId() const override { return "plain"; }
    void registerCommands(Core::Commander &) override {}
};

class PreferencesDialog : public ::testing::Test
{
protected:
    void SetUp() override
    {
        ASSERT_TRUE(SettingsDocument::instance().open(home.file("settings-brindle.xml")));
        SettingsDocument::instance().save();
    }
    void TearDown() override { PreferencesDlg::setRunner({}); }

    QByteArray fileBytes() const
    {
        QFile f(SettingsDocument::instance().path());
        return f.open(QIODevice::ReadOnly) ? f.readAll() : QByteArray();
    }
    static TextPage *textPage(PreferencesDlg &dialog, int index)
    {
        return dynamic_cast<TextPage *>(dialog.page(index));
    }

    ScratchHome home;
};

} // namespace

TEST_F(PreferencesDialog, PagesAreListedAndShownWithTheirTitleAndDescription)
{
    PreferencesDlg dialog;
    dialog.addPage(new TextPage("first"));
    dialog.addPage(new TextPage("second"));
    ASSERT_EQ(dialog.pageCount(), 2);
    EXPECT_EQ(dialog.pageList()->count(), 2);
    EXPECT_EQ(dialog.pageList()->item(1)->text(), "second title");
    EXPECT_EQ(dialog.currentPage(), 0);
    EXPECT_EQ(dialog.titleLabel()->text(), "first title");
    dialog.pageList()->setCurrentRow(1);
    EXPECT_EQ(dialog.titleLabel()->text(), "second title");
    EXPECT_EQ(dialog.descriptionLabel()->text(), "second description");
    EXPECT_EQ(dialog.page("second"), dialog.page(1));
    EXPECT_EQ(dialog.page("nothing"), nullptr);
    EXPECT_EQ(textPage(dialog, 0)->loads, 1) << "a page is filled from the settings when it is added";
    for (auto b : {QDialogButtonBox::Ok, QDialogButtonBox::Cancel, QDialogButtonBox::Apply,
                   QDialogButtonBox::RestoreDefaults})
        EXPECT_TRUE(dialog.buttons()->button(b)) << int(b);
}

TEST_F(PreferencesDialog, OkWritesEveryPageAndTheFile)
{
    PreferencesDlg dialog;
    dialog.addPage(new TextPage("first"));
    dialog.addPage(new TextPage("second"));
    textPage(dialog, 0)->field()->setText("alpha");
    textPage(dialog, 1)->field()->setText("beta");
    dialog.buttons()->button(QDialogButtonBox::Ok)->click();
    EXPECT_EQ(dialog.result(), QDialog::Accepted);
    EXPECT_EQ(SettingsDocument::instance().element("first").attribute("value"), "alpha");
    EXPECT_EQ(SettingsDocument::instance().element("second").attribute("value"), "beta");
    const QByteArray file = fileBytes();
    EXPECT_TRUE(file.contains("value=\"alpha\"")) << file.constData();
    EXPECT_TRUE(file.contains("value=\"beta\"")) << file.constData();
}

TEST_F(PreferencesDialog, CancelWritesNothing)
{
    const QByteArray before = fileBytes();
    PreferencesDlg dialog;
    dialog.addPage(new TextPage("first"));
    textPage(dialog, 0)->field()->setText("changed");
    dialog.buttons()->button(QDialogButtonBox::Cancel)->click();
    EXPECT_EQ(dialog.result(), QDialog::Rejected);
    EXPECT_EQ(textPage(dialog, 0)->saves, 0);
    EXPECT_FALSE(SettingsDocument::instance().root().firstChildElement("first").hasAttribute("value"));
    EXPECT_EQ(fileBytes(), before);
}

TEST_F(PreferencesDialog, ApplyWritesAndKeepsTheDialogOpenThenCancelKeepsWhatWasApplied)
{
    PreferencesDlg dialog;
    dialog.addPage(new TextPage("first"));
    dialog.show();
    textPage(dialog, 0)->field()->setText("applied");
    dialog.buttons()->button(QDialogButtonBox::Apply)->click();
    EXPECT_TRUE(dialog.isVisible());
    EXPECT_TRUE(fileBytes().contains("value=\"applied\""));
    textPage(dialog, 0)->field()->setText("dropped");
    dialog.buttons()->button(QDialogButtonBox::Cancel)->click();
    EXPECT_FALSE(dialog.isVisible());
    EXPECT_EQ(SettingsDocument::instance().element("first").attribute("value"), "applied");
    EXPECT_TRUE(fileBytes().contains("value=\"applied\""));
    EXPECT_FALSE(fileBytes().contains("dropped"));
}

TEST_F(PreferencesDialog, RestoreDefaultsChangesOnlyThePageShownAndWritesNothing)
{
    SettingsDocument::instance().element("first").setAttribute("value", "one");
    SettingsDocument::instance().element("second").setAttribute("value", "two");
    SettingsDocument::instance().save();
    const QByteArray before = fileBytes();
    PreferencesDlg dialog;
    dialog.addPage(new TextPage("first"));
    dialog.addPage(new TextPage("second"));
    dialog.setCurrentPage(1);
    dialog.buttons()->button(QDialogButtonBox::RestoreDefaults)->click();
    EXPECT_EQ(textPage(dialog, 0)->field()->text(), "one");
    EXPECT_EQ(textPage(dialog, 1)->field()->text(), "default");
    EXPECT_EQ(SettingsDocument::instance().element("second").attribute("value"), "two");
    EXPECT_EQ(fileBytes(), before);
}

TEST_F(PreferencesDialog, ApplyDoesNotRunAgainFromInsideItself)
{
    PreferencesDlg dialog;
    auto *page = new TextPage("first");
    bool inner = true;
    page->onSave = [&] { inner = dialog.apply(); };
    dialog.addPage(page);
    EXPECT_TRUE(dialog.apply());
    EXPECT_FALSE(inner);
    EXPECT_EQ(page->saves, 1);
    // The permit is back afterwards.
    page->onSave = nullptr;
    EXPECT_TRUE(dialog.apply());
    EXPECT_EQ(page->saves, 2);
}

TEST_F(PreferencesDialog, DialogTakesPagesFromFeaturesThatBringThemThenFromExtraSources)
{
    Core::Commander commander;
    PlainFeature plain;
    PageFeature hex({"alpha", "beta"});
    PageFeature extra({"gamma"});
    commander.addFeature(&plain);
    commander.addFeature(&hex);
    QPointer<PreferencesDlg> dialog = Framework::Preferences::createDialog(commander, nullptr, {&extra});
    ASSERT_EQ(dialog->pageCount(), 3);
    EXPECT_EQ(dialog->page(0)->pageWidget()->objectName(), "alpha");
    EXPECT_EQ(dialog->page(1)->pageWidget()->objectName(), "beta");
    EXPECT_EQ(dialog->page(2)->pageWidget()->objectName(), "gamma");
    // The pages go with the dialog.
    QPointer<QWidget> page = dialog->page(0)->pageWidget();
    delete dialog.data();
    EXPECT_TRUE(page.isNull());
}

TEST_F(PreferencesDialog, SettingsCommandOpensANewDialogEachTimeAndIsDisabledWhileAProcessRuns)
{
    Core::Commander commander;
    PageFeature feature({"first"});
    commander.addFeature(&feature);
    QAction *settings = commander.action("cmdSettings");
    ASSERT_TRUE(settings);
    EXPECT_FALSE(settings->isEnabled()) << "no handler yet";
    Framework::Preferences::installCommand(commander, nullptr);
    EXPECT_TRUE(settings->isEnabled());

    int runs = 0;
    PreferencesDlg::setRunner([&](PreferencesDlg &dialog) {
        ++runs;
        EXPECT_EQ(dialog.windowTitle(), "Preferences");
        auto *page = dynamic_cast<TextPage *>(dialog.page(0));
        EXPECT_TRUE(page);
        if (page)
            page->field()->setText(QString("run %1").arg(runs));
        dialog.buttons()->button(QDialogButtonBox::Ok)->click();
        return dialog.result();
    });
    settings->trigger();
    settings->trigger();
    EXPECT_EQ(runs, 2);
    EXPECT_EQ(feature.created, 2);
    EXPECT_EQ(SettingsDocument::instance().element("first").attribute("value"), "run 2");

    commander.setProcessRunning(true);
    EXPECT_FALSE(settings->isEnabled());
    settings->trigger();
    EXPECT_EQ(runs, 2);
    commander.setProcessRunning(false);
    EXPECT_TRUE(settings->isEnabled());
}
