// The settings file: creation, corrupt files, found-or-created elements, saving, path macros.
#include "tests/common/LogTestUtil.h"
#include "tests/common/ScratchHome.h"
#include "tests/common/TestUtil.h"

#include "ClientFramework/Settings/PathMacros.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QCoreApplication>
#include <QDir>
#include <QFile>
#include <gtest/gtest.h>

using Framework::SettingsDocument;

TEST(SettingsDocument, MissingFileIsCreatedWithOneEntry)
{
    ScratchHome home;
    const QString path = home.file("cfg/settings-brindle.xml");
    LogWatch watch;
    SettingsDocument doc;
    EXPECT_TRUE(doc.open(path));
    EXPECT_EQ(watch.texts(), QStringList{QString("Application settings file created: '%1'").arg(path)});
    EXPECT_EQ(doc.root().tagName(), "settings");
    EXPECT_FALSE(doc.root().hasChildNodes());
    const QByteArray text = TestUtil::readFile(path);
    EXPECT_TRUE(text.startsWith("<?xml")) << text.constData();
    EXPECT_TRUE(text.contains("<settings/>")) << text.constData();
}

TEST(SettingsDocument, CorruptFileIsReportedThenReplaced)
{
    ScratchHome home;
    const QString path = home.file("settings-brindle.xml");
    ASSERT_TRUE(
        TestUtil::writeFile(path, "<?xml version=\"1.0\"?>\n<settings>\n  <log attr=\"1\">\n</settings>\n"));
    LogWatch watch;
    SettingsDocument doc;
    EXPECT_TRUE(doc.open(path));
    const QStringList texts = watch.texts();
    ASSERT_EQ(texts.size(), 2) << texts.join('\n').toStdString();
    EXPECT_TRUE(texts[0].startsWith(QString("Error parsing settings file '%1' (Line: 4, column: ").arg(path)))
        << texts[0].toStdString();
    EXPECT_EQ(texts[1], QString("Application settings file created: '%1'").arg(path));
    EXPECT_EQ(watch.newErrors(), 1);
    // The damaged file is kept for the user.
    EXPECT_TRUE(TestUtil::readFile(path + ".bad").contains("<log attr"));
    EXPECT_FALSE(TestUtil::readFile(path).contains("<log"));
}

TEST(SettingsDocument, ExistingFileIsAccessed)
{
    ScratchHome home;
    const QString path = home.file("settings-brindle.xml");
    ASSERT_TRUE(
        TestUtil::writeFile(path, "<?xml version=\"1.0\"?>\n<settings><log attr=\"5\"/></settings>\n"));
    LogWatch watch;
    SettingsDocument doc;
    EXPECT_TRUE(doc.open(path));
    EXPECT_EQ(watch.texts(), QStringList{QString("Application settings file accessed: '%1'").arg(path)});
    EXPECT_EQ(doc.element("log").attribute("attr"), "5");
}

TEST(SettingsDocument, ElementsAreFoundOrCreatedAndSaved)
{
    ScratchHome home;
    const QString path = home.file("settings-brindle.xml");
    {
        SettingsDocument doc;
        doc.open(path);
        QDomElement general = doc.element("general");
        EXPECT_EQ(doc.element("general"), general); // the same element the second time
        SettingsDocument::child(general, "triggers").setAttribute("final-action", 3);
        EXPECT_TRUE(doc.save());
    }
    SettingsDocument again;
    again.open(path);
    EXPECT_EQ(again.root().elementsByTagName("general").size(), 1);
    EXPECT_EQ(again.element("general").firstChildElement("triggers").attribute("final-action"), "3");
}

TEST(SettingsDocument, DefaultPathIsInTheConfigurationFolder)
{
    ScratchHome home;
    EXPECT_TRUE(SettingsDocument::defaultPath().startsWith(home.path() + "/config/"));
    EXPECT_TRUE(SettingsDocument::defaultPath().endsWith("/settings-brindle.xml"));
}

TEST(PathMacros, AllMacrosInOrder)
{
    ScratchHome home;
    using Framework::PathMacros::resolve;
    EXPECT_EQ(resolve("%APP%/folder"), QDir(QCoreApplication::applicationDirPath()).filePath("folder"));
    EXPECT_EQ(resolve("%TEMP%/x"), QDir::tempPath() + "/x");
    EXPECT_EQ(resolve("%USER%/x"), QDir::homePath() + "/x");
    EXPECT_EQ(resolve("%CURRENT%"), QDir::currentPath());
    EXPECT_EQ(resolve("%APPDATA%/logs"), Framework::PathMacros::applicationDataFolder() + "/logs");
    // "%APPDATA%" is not mistaken for "%APP%" followed by text.
    EXPECT_FALSE(resolve("%APPDATA%").startsWith(QCoreApplication::applicationDirPath() + "DATA"));
    // Case-sensitive: a lower-case macro stays.
    EXPECT_EQ(resolve("%app%/x"), "%app%/x");
}
