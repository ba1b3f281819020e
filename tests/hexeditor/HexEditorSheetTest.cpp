// The hex editor's preferences page: what it reads from and writes to the editor settings, the
// choices it offers, restoring the defaults, and applying a save to the open hex editor views.
#include "tests/common/RecordingDialogs.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Preferences/PreferencesCommand.h"
#include "ClientFramework/Preferences/PreferencesDlg.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "Kernel/Implementation/Root/Root.h"
#include "hexeditor/Commander.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/HexEditorSheet.h"
#include "hexeditor/View.h"

#include <QAction>
#include <QCheckBox>
#include <QComboBox>
#include <QDialogButtonBox>
#include <QDomDocument>
#include <QFile>
#include <QLabel>
#include <QListWidget>
#include <QMenu>
#include <QPushButton>
#include <QSpinBox>
#include <QTemporaryDir>
#include <gtest/gtest.h>

#include <memory>
#include <ostream>

using HexEditor::HexEditorSheet;

namespace {

// A settings document of its own with the "hex-editor" element the page works on.
class SheetDoc
{
public:
    explicit SheetDoc(const QString &xml = QStringLiteral("<hex-editor/>")) { doc.setContent(xml); }
    std::function<QDomElement()> provider()
    {
        return [this] { return doc.documentElement(); };
    }
    QString font(const QString &name) const
    {
        return doc.documentElement().firstChildElement("font").attribute(name);
    }
    QString viewport(const QString &name) const
    {
        return doc.documentElement().firstChildElement("viewport").attribute(name);
    }
    QDomDocument doc;
};

QStringList comboTexts(QComboBox *box)
{
    QStringList texts;
    for (int i = 0; i < box->count(); ++i)
        texts << box->itemText(i);
    return texts;
}

QString anotherFamily()
{
    const QStringList families = HexEditorSheet::fontFamilies();
    for (const QString &f : families)
        if (f != HexEditor::Metrics::defaultFontFamily())
            return f;
    return {};
}

// What the page's fields show, compared as one.
struct Fields
{
    bool hexOffset;
    int wheel;
    int pages;
    bool ascii;
    bool unicode;
    uint bytesPerLine;
    QString fontName;
    int fontSize;
    QString fontSizeText;
    bool operator==(const Fields &) const = default;
};

[[maybe_unused]] void PrintTo(const Fields &f, std::ostream *out)
{
    *out << f.hexOffset << " " << f.wheel << " " << f.pages << " " << f.ascii << " " << f.unicode << " "
         << f.bytesPerLine << " " << f.fontName.toStdString() << " " << f.fontSize << " "
         << f.fontSizeText.toStdString();
}

Fields fieldsOf(HexEditorSheet &sheet)
{
    return {sheet.hexOffsetBox()->isChecked(),   sheet.wheelField()->value(),
            sheet.pagesField()->value(),         sheet.asciiBox()->isChecked(),
            sheet.unicodeBox()->isChecked(),     sheet.bytesPerLineList()->currentData().toUInt(),
            sheet.fontNameList()->currentText(), sheet.fontSizeList()->currentData().toInt(),
            sheet.fontSizeList()->currentText()};
}

// The fields of a page over no stored settings.
Fields defaultFields()
{
    return {false, 3, 1, true, false, 16, HexEditor::Metrics::defaultFontFamily(), 11, "Medium"};
}

} // namespace

TEST(HexEditorSheet, PageIdentityAndChoices)
{
    HexEditorSheet sheet([] { return QDomElement(); });
    EXPECT_EQ(sheet.objectName(), "prefHexEditor");
    EXPECT_EQ(sheet.pageTitle(), "Brindle");
    EXPECT_EQ(sheet.pageDescription(),
              "Brindle allows to inspect low-level disk's sectors and file system structures");
    EXPECT_FALSE(sheet.pageIcon().isNull()) << "the :/hexeditor/32/default resource is missing";
    EXPECT_EQ(comboTexts(sheet.bytesPerLineList()), QStringList({"8", "16", "32", "64", "128"}));
    EXPECT_EQ(comboTexts(sheet.fontSizeList()),
              QStringList({"Largest", "Large", "Medium", "Smaller", "Smallest"}));
    QList<int> sizes;
    for (int i = 0; i < sheet.fontSizeList()->count(); ++i)
        sizes << sheet.fontSizeList()->itemData(i).toInt();
    EXPECT_EQ(sizes, QList<int>({14, 12, 11, 10, 9}));
    // The editor's default family is always offered, even where it is not installed.
    EXPECT_TRUE(comboTexts(sheet.fontNameList()).contains(HexEditor::Metrics::defaultFontFamily()));
    EXPECT_EQ(sheet.hexOffsetBox()->text(), "&Hexadecimal offsets");
    EXPECT_EQ(sheet.asciiBox()->text(), "Show A&SCII column");
    EXPECT_EQ(sheet.unicodeBox()->text(), "Show &UNICODE column");
    // The labels of the number and list fields, with their buddies.
    QStringList labels;
    for (QLabel *label : sheet.findChildren<QLabel *>())
        if (label->buddy())
            labels << label->text();
    for (const char *text : {"Lines to scroll on a &wheel roll:", "&Pages to scroll on a PgUp/PgDown:",
                             "&Bytes per line:", "&Font name:", "F&ont size:"})
        EXPECT_TRUE(labels.contains(QString::fromLatin1(text))) << text;
}

TEST(HexEditorSheet, LoadAndSaveRoundTripKeepsOtherAttributes)
{
    const QString family = anotherFamily();
    SheetDoc settings(
        QStringLiteral("<hex-editor><font name='%1' size='9'/>"
                       "<viewport hex-offset='true' bytes='64' columns='15' group='4' wheel='7' "
                       "page='2'/></hex-editor>")
            .arg(family));
    HexEditorSheet sheet(settings.provider());
    sheet.loadSettings();
    EXPECT_EQ(fieldsOf(sheet), (Fields{true, 7, 2, true, true, 64, family, 9, "Smallest"}));

    sheet.hexOffsetBox()->setChecked(false);
    sheet.wheelField()->setValue(5);
    sheet.pagesField()->setValue(3);
    sheet.unicodeBox()->setChecked(false);
    sheet.bytesPerLineList()->setCurrentIndex(4);
    sheet.fontSizeList()->setCurrentIndex(1);
    sheet.saveSettings();
    EXPECT_EQ(settings.font("name"), family);
    EXPECT_EQ(settings.font("size"), "12");
    EXPECT_EQ(settings.viewport("hex-offset"), "false");
    EXPECT_EQ(settings.viewport("wheel"), "5");
    EXPECT_EQ(settings.viewport("page"), "3");
    EXPECT_EQ(settings.viewport("columns"), "11");
    EXPECT_EQ(settings.viewport("bytes"), "128");
    // Grouping is not on the page: it stays as stored.
    EXPECT_EQ(settings.viewport("group"), "4");

    // A second page over the written element shows what the first one saved.
    HexEditorSheet again(settings.provider());
    again.loadSettings();
    EXPECT_EQ(fieldsOf(again), (Fields{false, 5, 3, true, false, 128, family, 12, "Large"}));
}

TEST(HexEditorSheet, StoredValuesOutsideTheListsSelectTheFirstEntry)
{
    SheetDoc settings(
        QStringLiteral("<hex-editor><font name='No Such Family 1234' size='13'/>"
                       "<viewport bytes='17' wheel='abc' page='-4' columns='x'/></hex-editor>"));
    HexEditorSheet sheet(settings.provider());
    sheet.loadSettings();
    EXPECT_EQ(sheet.bytesPerLineList()->currentIndex(), 0);
    EXPECT_EQ(sheet.bytesPerLineList()->currentData().toUInt(), 8u);
    EXPECT_EQ(sheet.fontSizeList()->currentIndex(), 0);
    EXPECT_EQ(sheet.fontSizeList()->currentData().toInt(), 14);
    EXPECT_EQ(sheet.fontNameList()->currentIndex(), 0);
    // Numbers that are not numbers fall back to the defaults; out of range ones are clamped.
    EXPECT_EQ(sheet.wheelField()->value(), 3);
    EXPECT_EQ(sheet.pagesField()->value(), 1);
    EXPECT_TRUE(sheet.asciiBox()->isChecked());
    EXPECT_FALSE(sheet.unicodeBox()->isChecked());

    SheetDoc huge(QStringLiteral("<hex-editor><font size='99999999999999999999'/>"
                                 "<viewport bytes='4294967312' wheel='99999999'/></hex-editor>"));
    HexEditorSheet big(huge.provider());
    big.loadSettings();
    EXPECT_EQ(big.fontSizeList()->currentIndex(), 0);
    EXPECT_EQ(big.bytesPerLineList()->currentIndex(), 0) << "16 + 2^32 must not wrap to 16";
    EXPECT_EQ(big.wheelField()->value(), 1000);
}

TEST(HexEditorSheet, MissingSettingsShowTheDefaults)
{
    SheetDoc settings;
    HexEditorSheet sheet(settings.provider());
    sheet.loadSettings();
    EXPECT_EQ(fieldsOf(sheet), defaultFields());
    // Loading writes nothing.
    EXPECT_TRUE(settings.doc.documentElement().firstChildElement().isNull());
}

TEST(HexEditorSheet, ColumnCheckBoxesChangeOnlyBitsTwoAndFour)
{
    // 0x1F9: offset column and bits the page does not know, ASCII off, Unicode off.
    SheetDoc settings(QStringLiteral("<hex-editor><viewport columns='%1'/></hex-editor>").arg(0x1F9));
    HexEditorSheet sheet(settings.provider());
    sheet.loadSettings();
    EXPECT_FALSE(sheet.asciiBox()->isChecked());
    EXPECT_FALSE(sheet.unicodeBox()->isChecked());
    sheet.unicodeBox()->setChecked(true);
    sheet.saveSettings();
    EXPECT_EQ(settings.viewport("columns").toUInt(), 0x1F9u | 4u);
    sheet.asciiBox()->setChecked(true);
    sheet.unicodeBox()->setChecked(false);
    sheet.saveSettings();
    EXPECT_EQ(settings.viewport("columns").toUInt(), (0x1F9u | 2u) & ~4u);
}

TEST(HexEditorSheet, RestoreDefaultsSetsTheFieldsAndWritesNothingUntilSaved)
{
    const QString family = anotherFamily();
    SheetDoc settings(QStringLiteral("<hex-editor><font name='%1' size='14'/>"
                                     "<viewport hex-offset='true' bytes='128' columns='%2' wheel='9' "
                                     "page='4'/></hex-editor>")
                          .arg(family)
                          .arg(0x100 | 8 | 4 | 1));
    HexEditorSheet sheet(settings.provider());
    sheet.loadSettings();
    sheet.restoreDefaults();
    EXPECT_EQ(fieldsOf(sheet), defaultFields());
    EXPECT_EQ(settings.viewport("bytes"), "128");
    EXPECT_EQ(settings.viewport("hex-offset"), "true");

    sheet.saveSettings();
    EXPECT_EQ(settings.viewport("bytes"), "16");
    EXPECT_EQ(settings.viewport("wheel"), "3");
    EXPECT_EQ(settings.viewport("page"), "1");
    EXPECT_EQ(settings.font("size"), "11");
    EXPECT_EQ(settings.font("name"), HexEditor::Metrics::defaultFontFamily());
    // ASCII on, Unicode off, the offset column and the unknown bit kept.
    EXPECT_EQ(settings.viewport("columns").toUInt(), 0x100u | 8u | 2u | 1u);
}

// Hex editor views over a plain file, opened through the commander, with the settings document in
// a scratch home.
class HexEditorSheetViews : public ::testing::Test
{
protected:
    void SetUp() override
    {
        ASSERT_TRUE(dir.isValid());
        path = dir.filePath("data.bin");
        ASSERT_TRUE(TestUtil::writeFile(path, QByteArray(64 * 1024, 'x')));
        ASSERT_TRUE(Framework::SettingsDocument::instance().open(home.file("settings-brindle.xml")));
        commander.setKernelRoot(&root);
        commander.setViewHost([this](HexEditor::View *view) { held.emplace_back(view); });
        registry.addFeature(&commander);
    }
    void TearDown() override
    {
        Framework::PreferencesDlg::setRunner({});
        held.clear();
    }
    HexEditor::View *openView()
    {
        HexEditor::View *view = commander.openFile(path);
        if (view)
            view->load(Framework::SettingsDocument::child(
                Framework::SettingsDocument::child(
                    Framework::SettingsDocument::instance().element(QStringLiteral("main-view")),
                    QStringLiteral("views")),
                HexEditor::View::ViewId));
        return view;
    }
    HexEditorSheet *sheetOf(Framework::PreferencesDlg &dialog)
    {
        return dynamic_cast<HexEditorSheet *>(dialog.page(HexEditorSheet::ObjectName));
    }

    ScratchHome home;
    RecordingDialogs dialogs;
    QTemporaryDir dir;
    QString path;
    CRoot root;
    Core::Commander registry;
    HexEditor::Commander commander;
    std::vector<std::unique_ptr<HexEditor::View>> held;
};

TEST_F(HexEditorSheetViews, SavingAppliesToEveryOpenEditorAndToViewsOpenedLater)
{
    HexEditor::View *first = openView();
    HexEditor::View *second = openView();
    ASSERT_TRUE(first && second);
    // The second view has grouping of its own, which the page does not touch.
    second->editor()->setGrouping(4);

    std::unique_ptr<Framework::PreferencesDlg> dialog(
        Framework::Preferences::createDialog(registry, nullptr));
    HexEditorSheet *sheet = sheetOf(*dialog);
    ASSERT_TRUE(sheet);
    sheet->hexOffsetBox()->setChecked(true);
    sheet->bytesPerLineList()->setCurrentIndex(sheet->bytesPerLineList()->findData(32u));
    sheet->unicodeBox()->setChecked(true);
    sheet->wheelField()->setValue(6);
    sheet->pagesField()->setValue(2);
    sheet->fontSizeList()->setCurrentIndex(sheet->fontSizeList()->findData(14));
    ASSERT_TRUE(dialog->apply());

    for (HexEditor::View *view : {first, second}) {
        HexEditor::EditorCtrl *editor = view->editor();
        EXPECT_TRUE(editor->hexOffset());
        EXPECT_EQ(editor->bytesPerLine(), 32u);
        EXPECT_TRUE(editor->columnMask() & HexEditor::Metrics::PaneUnicode);
        EXPECT_TRUE(editor->columnMask() & HexEditor::Metrics::PaneAscii);
        EXPECT_EQ(editor->wheelLines(), 6);
        EXPECT_EQ(editor->pageCount(), 2);
        EXPECT_EQ(editor->fontSize(), 14);
        // The view's "Customize " menu follows.
        bool unicodeChecked = false;
        for (QAction *a : view->customizeMenu()->actions())
            if (a->text() == "Unicode")
                unicodeChecked = a->isChecked();
        EXPECT_TRUE(unicodeChecked);
    }
    EXPECT_EQ(second->editor()->group(), 4u);

    // The file holds the values, below the view's element.
    QFile file(Framework::SettingsDocument::instance().path());
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    QDomDocument written;
    ASSERT_TRUE(written.setContent(&file));
    const QDomElement viewport = written.documentElement()
                                     .firstChildElement("main-view")
                                     .firstChildElement("views")
                                     .firstChildElement("view-hexeditor")
                                     .firstChildElement("hex-editor")
                                     .firstChildElement("viewport");
    EXPECT_EQ(viewport.attribute("bytes"), "32");
    EXPECT_EQ(viewport.attribute("hex-offset"), "true");

    // A view opened afterwards starts with them.
    HexEditor::View *third = openView();
    ASSERT_TRUE(third);
    EXPECT_EQ(third->editor()->bytesPerLine(), 32u);
    EXPECT_TRUE(third->editor()->hexOffset());
}

TEST_F(HexEditorSheetViews, CancelLeavesEditorsAndTheFileAlone)
{
    HexEditor::View *view = openView();
    ASSERT_TRUE(view);
    Framework::SettingsDocument::instance().save();
    QFile file(Framework::SettingsDocument::instance().path());
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    const QByteArray before = file.readAll();
    file.close();

    Framework::PreferencesDlg::setRunner([](Framework::PreferencesDlg &dialog) {
        auto *sheet = dynamic_cast<HexEditorSheet *>(dialog.page(HexEditorSheet::ObjectName));
        sheet->bytesPerLineList()->setCurrentIndex(4);
        sheet->hexOffsetBox()->setChecked(true);
        dialog.buttons()->button(QDialogButtonBox::Cancel)->click();
        return dialog.result();
    });
    registry.action("cmdSettings")->trigger();
    EXPECT_EQ(view->editor()->bytesPerLine(), 16u);
    EXPECT_FALSE(view->editor()->hexOffset());
    ASSERT_TRUE(file.open(QIODevice::ReadOnly));
    EXPECT_EQ(file.readAll(), before);
}

TEST_F(HexEditorSheetViews, ViewSettingsLiveInTheHexEditorChildOfTheViewElement)
{
    HexEditor::View *view = openView();
    ASSERT_TRUE(view);
    view->editor()->setBytesPerLine(64);
    QDomDocument doc;
    QDomElement element = doc.createElement("view-hexeditor");
    doc.appendChild(element);
    view->save(element);
    EXPECT_EQ(element.firstChildElement("hex-editor").firstChildElement("viewport").attribute("bytes"), "64");
    EXPECT_TRUE(element.firstChildElement("viewport").isNull());

    // The page reads what the view wrote.
    HexEditorSheet sheet([&] { return element.firstChildElement("hex-editor"); });
    sheet.loadSettings();
    EXPECT_EQ(sheet.bytesPerLineList()->currentData().toUInt(), 64u);
}
