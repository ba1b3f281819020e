// Theme documents: the light theme's node palette, a dark theme with the same entries, lookups
// of missing entries and palettes, and documents that are not themes.
#include "ClientFramework/Themes/Theme.h"

#include <gtest/gtest.h>

using Framework::Theme;

TEST(Theme, LightNodePalette)
{
    Theme light;
    ASSERT_TRUE(light.load(Theme::resourcePath("light")));
    EXPECT_EQ(light.name(), "light");
    const QList<QPair<QString, QString>> expected = {
        {"default", "#000000"}, {"critical", "#F33"},   {"warning", "#C67000"}, {"success", "#008800"},
        {"ghost", "#C8C8C8"},   {"invalid", "#808080"}, {"busy", "#03A"},       {"system", "#A22"},
        {"virtual", "#0066BB"}, {"image", "#283CAA"},   {"raid", "#0066BB"},
    };
    for (const auto &e : expected)
        EXPECT_EQ(light.color("node", e.first), QColor(e.second)) << e.first.toStdString();
}

TEST(Theme, DarkThemeHasEveryNodeEntry)
{
    Theme light;
    Theme dark;
    ASSERT_TRUE(light.load(Theme::resourcePath("light")));
    ASSERT_TRUE(dark.load(Theme::resourcePath("dark")));
    EXPECT_EQ(dark.paletteEntries("node"), light.paletteEntries("node"));
    EXPECT_FALSE(dark.styleSheet().isEmpty());
    EXPECT_NE(dark.color("node", "default"), light.color("node", "default"));
    for (const QString &name : Theme::available()) {
        Theme t;
        EXPECT_TRUE(t.load(Theme::resourcePath(name))) << name.toStdString();
    }
}

TEST(Theme, MissingEntriesAndPalettes)
{
    Theme t;
    ASSERT_TRUE(t.parse(R"(<theme name="t"><node default="#123456"><success color="#00FF00"/></node>
                           <hex><text>#010203</text></hex></theme>)"));
    EXPECT_EQ(t.color("node", "success"), QColor("#00FF00"));
    EXPECT_EQ(t.color("node", "nothing"), QColor("#123456")); // the palette's default
    EXPECT_EQ(t.color("hex", "text"), QColor("#010203"));
    EXPECT_FALSE(t.color("hex", "nothing").isValid()); // no default given
    EXPECT_EQ(t.color("hex", "nothing", Qt::red), QColor(Qt::red));
    EXPECT_FALSE(t.color("log", "x").isValid());
    EXPECT_EQ(t.color("log", "x", Qt::blue), QColor(Qt::blue));
    EXPECT_TRUE(t.hasPalette("hex"));

    QString error;
    EXPECT_FALSE(t.parse("<theme", &error));
    EXPECT_FALSE(error.isEmpty());
    EXPECT_FALSE(t.parse("<palette/>"));
    EXPECT_FALSE(t.load(":/themes/none.xml"));
}

TEST(Theme, ActiveThemeSwitches)
{
    ASSERT_TRUE(Theme::setActive("dark"));
    EXPECT_EQ(Theme::active().name(), "dark");
    EXPECT_FALSE(Theme::setActive("no-such-theme"));
    EXPECT_EQ(Theme::active().name(), "dark");
    ASSERT_TRUE(Theme::setActive("light"));
    EXPECT_EQ(Theme::active().color("node", "success"), QColor("#008800"));
}
