// The product's command line: what the options that name a target read as, and the help page.
#include "app/CliArguments.h"

#include <QRegularExpression>
#include <gtest/gtest.h>

using CLI::Arguments;

namespace {
QStringList argv(std::initializer_list<const char *> rest)
{
    QStringList l{QStringLiteral("/opt/brindle/bin/brindle")};
    for (const char *a : rest)
        l << QString::fromLatin1(a);
    return l;
}
} // namespace

TEST(ProductArguments, TemplateAutoWordOrNoneMeansAutomatic)
{
    for (const char *t : {"-template=auto", "-t=mbr", "-nohidpi"}) {
        Arguments a(argv({t}));
        ASSERT_TRUE(a.commandLineError.isEmpty()) << t;
        EXPECT_EQ(Arguments::intValue("template", 34), 34) << t;
    }
    Arguments a(argv({"-t=2"}));
    EXPECT_EQ(Arguments::intValue("template", 34), 2);
}

TEST(ProductArguments, TemplateOffsetDefaultsToOffset)
{
    Arguments a(argv({"-d=0", "-o=1024"}));
    const uint64_t offset = Arguments::offsetValue("offset", 0);
    EXPECT_EQ(offset, 1024u);
    EXPECT_EQ(Arguments::offsetValue("templateoffset", offset), 1024u);
    Arguments b(argv({"-d=0", "-o=1024", "-to=512"}));
    EXPECT_EQ(Arguments::offsetValue("templateoffset", 1024), 512u);
}

TEST(ProductArguments, HexOffsetIsNoNumber)
{
    Arguments a(argv({"-d=0", "-offset=0x200"}));
    EXPECT_TRUE(a.commandLineError.isEmpty());
    EXPECT_EQ(Arguments::offsetValue("offset", 0), 0u);
    Arguments b(argv({"-d=0", "-offset=-5"}));
    EXPECT_EQ(Arguments::offsetValue("offset", 0), 0u);
    Arguments c(argv({"-d=0", "-offset=18446744073709551615"}));
    EXPECT_EQ(Arguments::offsetValue("offset", 0), UINT64_MAX);
    Arguments d(argv({"-d=0", "-offset=18446744073709551616"})); // one past the top
    EXPECT_EQ(Arguments::offsetValue("offset", 0), 0u);
}

TEST(ProductArguments, ValueAsSeparateWordGetsADash)
{
    Arguments a(argv({"-disk", "2"}));
    EXPECT_TRUE(a.commandLineError.isEmpty()) << a.commandLineError.toStdString();
    EXPECT_EQ(Arguments::intValue("disk", -1), -2);
    Arguments b(argv({"disk=2"}));
    EXPECT_EQ(Arguments::intValue("disk", -1), 2);
    Arguments c(argv({"--disk=3", "-dp=1"}));
    EXPECT_EQ(Arguments::intValue("disk", -1), 3);
    EXPECT_EQ(Arguments::intValue("diskprefix", 255), 1);
    Arguments d(argv({"-disk=x"}));
    EXPECT_EQ(Arguments::intValue("disk", -1), -1);
}

TEST(ProductArguments, HasRequest)
{
    EXPECT_TRUE(Arguments(argv({"-d=1"})).hasRequest());
    EXPECT_TRUE(Arguments(argv({"-file=/etc/hostname"})).hasRequest());
    EXPECT_TRUE(Arguments(argv({"-help"})).hasRequest());
    EXPECT_FALSE(Arguments(argv({"-o=5"})).hasRequest());
    EXPECT_FALSE(Arguments(argv({})).hasRequest());
}

TEST(ProductArguments, HelpPageIsFilledIn)
{
    Arguments a(argv({"-help"}));
    const QString page = a.helpPage();
    ASSERT_FALSE(page.isEmpty());
    EXPECT_FALSE(page.contains("@@")) << page.toStdString();
    EXPECT_TRUE(page.contains("brindle [options]"));
    EXPECT_TRUE(page.contains("brindle -d=2 -o=64 -template=2"));
    EXPECT_TRUE(page.contains("Orvane Brindle"));
    EXPECT_TRUE(page.contains("\"NTFS Boot Sector\""));
    EXPECT_TRUE(page.contains("Parameters -test and -help cannot be used with other parameters."));
    EXPECT_EQ(a.helpFooter(), "Use <b>brindle -help</b> or <b>brindle -?</b> to show this help pop-up");
}

TEST(ProductArguments, TemplateTable)
{
    const QString table = Arguments::templateTable().trimmed();
    EXPECT_TRUE(table.startsWith("<table border=\"0\">"));
    EXPECT_EQ(table.count("<tr>"), 17);
    EXPECT_EQ(table.count("<td>"), 34);
    EXPECT_TRUE(table.contains("<td>0 - None</td>"));
    EXPECT_TRUE(table.contains("<td>17 - HFS+ File Record</td>"));
    EXPECT_TRUE(table.contains("<td>33 - XFS AG Inode</td>"));
    // Row 2 pairs id 2 with id 19.
    EXPECT_TRUE(QRegularExpression("<td>2 - NTFS Boot Sector</td>\\s*<td>19 - UFS Superblock</td>")
                    .match(table)
                    .hasMatch());
}
