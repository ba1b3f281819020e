// Tag expansion of file-name patterns and the unique ID.
#include "ClientFramework/Log/NameTags.h"

#include <QDate>
#include <QRegularExpression>
#include <QSet>
#include <gtest/gtest.h>

using namespace Framework;

TEST(NameTags, PatternWithoutTagsIsUnchanged)
{
    EXPECT_EQ(NameTags::expand("brindle.log"), "brindle.log");
    EXPECT_EQ(NameTags::expand("{not a tag}.log"), "{not a tag}.log");
}

TEST(NameTags, DateAndTimeTags)
{
    const QString r = NameTags::expand("AppLog-{Date(YYYY-MM-DD)}_{Time(HHmmss)}.log");
    EXPECT_TRUE(QRegularExpression("^AppLog-\\d{4}-\\d\\d-\\d\\d_\\d{6}\\.log$").match(r).hasMatch())
        << r.toStdString();
    const QString y = NameTags::expand("{Date(YYYY)}|{Date(YY)}|{Date(MM)}|{Date(DD)}|{Date(YYMMDD)}");
    const QStringList parts = y.split('|');
    ASSERT_EQ(parts.size(), 5);
    EXPECT_EQ(parts[1], parts[0].right(2));
    EXPECT_EQ(parts[4], parts[1] + parts[2] + parts[3]);
    EXPECT_EQ(NameTags::expand("{Date(Month)}").isEmpty(), false);
    EXPECT_TRUE(
        QRegularExpression("^\\d\\d-\\d\\d-\\d\\d$").match(NameTags::expand("{Time(HH-mm-ss)}")).hasMatch());
}

TEST(NameTags, ApplicationTags)
{
    EXPECT_EQ(NameTags::expand("{AppName}-{AppVersion}"), "Brindle-24.0.25");
    EXPECT_FALSE(NameTags::expand("{OS}").contains('{'));
    EXPECT_FALSE(NameTags::expand("{KernelVersion}").isEmpty());
}

TEST(NameTags, ContextTagsAreEmptyWithoutContext)
{
    EXPECT_EQ(NameTags::expand("[{SerialNumber}{ProductID}{Status}{Range}{Sequence 000#}]"), "[]");
    TagContext c;
    c.serialNumber = "9QG3NCKC";
    c.productId = "ST3500630AS ATA Device";
    c.type = "Fixed Disk";
    c.sequence = 3;
    EXPECT_EQ(NameTags::expand("{SerialNumber}_{ProductID}_{Type}", &c),
              "9QG3NCKC_ST3500630AS ATA Device_Fixed Disk");
    EXPECT_EQ(NameTags::expand("{Sequence #}|{Sequence 0#}|{Sequence 00#}|{Sequence 000#}", &c),
              "3|03|003|0003");
}

TEST(NameTags, EveryTagOfTheTableExpands)
{
    TagContext c;
    c.serialNumber = c.platformId = c.productId = c.type = c.size = c.sectors = "v";
    c.status = c.dateStarted = c.timeStarted = c.timeElapsed = c.statusCode = "v";
    c.processType = c.processedAs = c.range = "v";
    c.sequence = 1;
    EXPECT_EQ(NameTags::table().size(), 36);
    for (const auto &tag : NameTags::table()) {
        const QString r = NameTags::expand(tag.tag, &c);
        EXPECT_FALSE(r.contains('{')) << tag.tag.toStdString();
        EXPECT_FALSE(r.isEmpty()) << tag.tag.toStdString();
    }
}

TEST(NameTags, UniqueIdCyclesThroughThirtyThreeCharacters)
{
    const QString alphabet = "123456789ABCDEFGHJKLMNPQRSTUVWXYZ";
    QStringList ids;
    for (int i = 0; i < 34; ++i)
        ids << NameTags::uniqueId();
    QSet<QChar> finals;
    for (int i = 0; i < 33; ++i) {
        EXPECT_TRUE(alphabet.contains(ids[i].back()));
        finals.insert(ids[i].back());
    }
    EXPECT_EQ(finals.size(), 33);
    EXPECT_EQ(ids[33].back(), ids[0].back());
    // Consecutive characters follow the alphabet.
    const int first = alphabet.indexOf(ids[0].back());
    for (int i = 0; i < 34; ++i)
        EXPECT_EQ(ids[i].back(), alphabet[(first + i) % 33]);
    // Date and time part in "MD-hmm" form.
    EXPECT_TRUE(QRegularExpression("^\\d{1,2}D-\\d{1,2}\\d\\d.$").match(ids[0]).hasMatch())
        << ids[0].toStdString();
}

TEST(NameTags, EachUniqueIdTagIsNew)
{
    const QString r = NameTags::expand("{UniqueID}|{UniqueID}");
    const QStringList p = r.split('|');
    ASSERT_EQ(p.size(), 2);
    EXPECT_NE(p[0], p[1]);
}
