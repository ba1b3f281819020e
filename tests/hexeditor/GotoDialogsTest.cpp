// The go-to dialogs: their ranges, the values typed and the positions they give.
#include "hexeditor/GotoCatalogNodeDlg.h"
#include "hexeditor/GotoMftDlg.h"
#include "hexeditor/GotoOffsetDlg.h"
#include "hexeditor/GotoSectorDlg.h"

#include <QLineEdit>
#include <QLocale>
#include <QTest>
#include <gtest/gtest.h>

using namespace HexEditor;

namespace {

struct EnglishLocale
{
    QLocale previous;
    EnglishLocale() { QLocale::setDefault(QLocale(QLocale::English, QLocale::UnitedStates)); }
    ~EnglishLocale() { QLocale::setDefault(previous); }
};

void typeInto(QLineEdit *edit, const QString &text)
{
    edit->clear();
    QTest::keyClicks(edit, text);
}

} // namespace

TEST(GotoOffset, FromCurrentPositionAcceptsGoingBackToZeroButNotFurther)
{
    EnglishLocale english;
    GotoOffsetDlg::setLastMode(GotoOffsetDlg::FromBeginning);
    GotoOffsetDlg dlg(10000, 100);
    dlg.setMode(GotoOffsetDlg::FromCurrent);
    EXPECT_EQ(dlg.minimum(), -100);
    EXPECT_EQ(dlg.maximum(), 10000 - 100 - 1);
    typeInto(dlg.offsetEdit(), "-100");
    EXPECT_EQ(dlg.offsetEdit()->text(), "-100");
    EXPECT_EQ(dlg.target(), 0u);
    typeInto(dlg.offsetEdit(), "-101");
    EXPECT_EQ(dlg.offsetEdit()->text(), "-10") << "the last digit is refused as typed";
    EXPECT_EQ(dlg.target(), 90u);
    typeInto(dlg.offsetEdit(), "0x10");
    EXPECT_EQ(dlg.target(), 116u);
}

TEST(GotoOffset, FromBeginningAndFromEndGiveTheirTargets)
{
    EnglishLocale english;
    GotoOffsetDlg dlg(1'048'576, 0);
    dlg.setMode(GotoOffsetDlg::FromBeginning);
    EXPECT_EQ(dlg.maximum(), 1'048'575);
    typeInto(dlg.offsetEdit(), "12345");
    EXPECT_EQ(dlg.offsetEdit()->text(), "12,345");
    EXPECT_EQ(dlg.target(), 12345u);
    typeInto(dlg.offsetEdit(), "1048576");
    EXPECT_EQ(dlg.offsetEdit()->text(), "104,857") << "past the last byte is refused";

    dlg.setMode(GotoOffsetDlg::FromEnd);
    typeInto(dlg.offsetEdit(), "0x200");
    EXPECT_EQ(dlg.target(), 1'048'576u - 512);
    typeInto(dlg.offsetEdit(), "0");
    EXPECT_EQ(dlg.target(), 1'048'576u) << "the caret clamps this to the last byte";
    dlg.offsetEdit()->clear();
    EXPECT_FALSE(dlg.target().has_value()) << "an empty field goes nowhere";
}

TEST(GotoOffset, TheChosenModeIsPreselectedInTheNextDialog)
{
    GotoOffsetDlg::setLastMode(GotoOffsetDlg::FromBeginning);
    {
        GotoOffsetDlg first(4096, 0);
        EXPECT_EQ(first.mode(), GotoOffsetDlg::FromBeginning);
        first.setMode(GotoOffsetDlg::FromEnd);
        first.accept();
    }
    GotoOffsetDlg second(4096, 0);
    EXPECT_EQ(second.mode(), GotoOffsetDlg::FromEnd);
    {
        GotoOffsetDlg cancelled(4096, 0);
        cancelled.setMode(GotoOffsetDlg::FromCurrent);
        cancelled.reject();
    }
    GotoOffsetDlg third(4096, 0);
    EXPECT_EQ(third.mode(), GotoOffsetDlg::FromEnd) << "a cancelled dialog does not change the choice";
    GotoOffsetDlg::setLastMode(GotoOffsetDlg::FromBeginning);
}

TEST(GotoSector, WithoutClustersOnlyTheSectorFieldWorks)
{
    EnglishLocale english;
    GotoSectorDlg dlg(2048, 512, std::nullopt);
    EXPECT_EQ(dlg.windowTitle(), "Go to Sector");
    EXPECT_EQ(dlg.sectorRangeText(), "(0 - 2,047)");
    EXPECT_FALSE(dlg.clusterEdit()->isEnabled());
    typeInto(dlg.sectorEdit(), "2047");
    EXPECT_EQ(dlg.target(), 2047u * 512);
    typeInto(dlg.sectorEdit(), "2048");
    EXPECT_EQ(dlg.sectorEdit()->text(), "204");
    dlg.sectorEdit()->clear();
    EXPECT_FALSE(dlg.target().has_value());
}

TEST(GotoSector, SectorAndClusterFollowEachOtherInTheBaseTyped)
{
    EnglishLocale english;
    // Clusters of 8 sectors, cluster 2 at sector 100, clusters 2 to 1001.
    GotoSectorDlg::Clusters clusters{2, 1001,
                                     [](uint64_t s) { return s < 100 ? UINT64_MAX : 2 + (s - 100) / 8; },
                                     [](uint64_t c) { return 100 + (c - 2) * 8; }};
    GotoSectorDlg dlg(100 + 1000 * 8, 4096, clusters);
    EXPECT_EQ(dlg.clusterRangeText(), "(2 - 1,001)");
    typeInto(dlg.clusterEdit(), "10");
    EXPECT_EQ(dlg.sectorEdit()->text(), "164");
    EXPECT_EQ(dlg.target(), 164u * 4096);
    typeInto(dlg.clusterEdit(), "0x10");
    EXPECT_EQ(dlg.sectorEdit()->text(), "0xD4");
    typeInto(dlg.sectorEdit(), "1000");
    EXPECT_EQ(dlg.clusterEdit()->text(), "114");
    typeInto(dlg.sectorEdit(), "0x64");
    EXPECT_EQ(dlg.clusterEdit()->text(), "0x2");
    typeInto(dlg.sectorEdit(), "50");
    EXPECT_TRUE(dlg.clusterEdit()->text().isEmpty()) << "a sector before the first cluster has no cluster";
}

TEST(GotoRecord, MftAndCatalogNodeRangesAndIndexes)
{
    EnglishLocale english;
    GotoMftDlg mft(1500);
    EXPECT_EQ(mft.windowTitle(), "Go to MFT Record");
    EXPECT_EQ(mft.rangeText(), "(0 - 1,499)");
    typeInto(mft.numberEdit(), "1499");
    EXPECT_EQ(mft.index(), 1499u);
    typeInto(mft.numberEdit(), "1500");
    EXPECT_EQ(mft.index(), 150u);

    GotoCatalogNodeDlg nodes(16);
    EXPECT_EQ(nodes.windowTitle(), "Go to Catalog Node");
    typeInto(nodes.numberEdit(), "0xF");
    EXPECT_EQ(nodes.index(), 15u);
    typeInto(nodes.numberEdit(), "0x10");
    EXPECT_EQ(nodes.index(), 1u) << "the last digit is refused";

    GotoMftDlg none(0);
    EXPECT_FALSE(none.numberEdit()->isEnabled());
    EXPECT_FALSE(none.index().has_value());
}
