// The SMART pane: the hint while no disk is selected, the parameter rows and the attribute table of
// a disk from its provider (in id order, with the two row colours and the words of type, update
// mode and failure state), the "not supported" texts of a disk without data, Refresh, and a disk
// that goes away under the pane; the SMART texts by id and minor version.
#include "ClientFramework/Views/SmartPane.h"
#include "ClientFramework/NodeTree/NodeCore.h"

#include "smart/SmartText.h"

#include <QAction>
#include <QLabel>
#include <QTableWidget>
#include <QTest>
#include <QTreeWidget>
#include <gtest/gtest.h>

#include <memory>

namespace {

using Framework::SmartAttribute;
using Framework::SmartPane;
using Framework::SmartParameters;

class FakeNode : public NodeStatic
{
public:
    FakeNode(NodeKind kind, const QString &name) : m_kind(kind), m_name(name) {}
    NodeKind kind() const override { return m_kind; }

protected:
    QString name() const override { return m_name; }
    QString typeKey() const override { return QStringLiteral("fake"); }
    QString key() const override { return m_name; }

private:
    NodeKind m_kind;
    QString m_name;
};

// Answers with a parameter record and attributes given out of id order; counts the reads.
class FakeProvider : public Framework::ISmartProvider
{
public:
    bool readParameters(NodeCore *device, SmartParameters &out) override
    {
        ++parameterReads;
        asked = device;
        if (!withData)
            return false;
        out = parameters;
        return true;
    }
    bool readAttributes(NodeCore *, QList<SmartAttribute> &out) override
    {
        ++attributeReads;
        if (!withData)
            return false;
        out = attributes;
        return true;
    }

    bool withData = true;
    int parameterReads = 0;
    int attributeReads = 0;
    NodeCore *asked = nullptr;
    SmartParameters parameters;
    QList<SmartAttribute> attributes;
};

FakeProvider makeProvider()
{
    FakeProvider p;
    p.parameters.model = QStringLiteral("ST3500630AS");
    p.parameters.serial = QStringLiteral("9QG3NCKC");
    p.parameters.firmware = QStringLiteral("3.AAK");
    p.parameters.capacity = 500107862016ull;
    p.parameters.ataMajor = 7;
    p.parameters.ataMinor = 29;
    p.parameters.support = 1;
    p.parameters.offlineStatus = 130;
    p.parameters.selfTestStatus = 0;
    p.parameters.offlineSeconds = 430;
    p.parameters.offlineCapability = 91;
    p.parameters.smartCapability = 3;
    p.parameters.errorLogCapability = 1;
    p.parameters.shortTestMinutes = 1;
    p.parameters.extendedTestMinutes = 115;
    // Given out of order: 194, 1, 9, 5; 9 has failed in the past and 5 is failing now.
    p.attributes = {{194, 40, 52, 0, 1, 0, 0, 40},
                    {1, 117, 99, 6, 0, 0, 0, 0x0000DEADBEEFull},
                    {9, 100, 90, 95, 1, 0, 1, 27000},
                    {5, 36, 36, 36, 0, 0, 2, 1234}};
    return p;
}

QString cell(const QTableWidget *t, int row, int column)
{
    const QTableWidgetItem *item = t->item(row, column);
    return item ? item->text() : QString();
}

QString parameter(const QTreeWidget *tree, const QString &label)
{
    for (int i = 0; i < tree->topLevelItemCount(); ++i)
        if (tree->topLevelItem(i)->text(0) == label)
            return tree->topLevelItem(i)->text(1);
    return QStringLiteral("<missing>");
}

// A pane that asks the provider above for its disks' data.
class SmartPaneOverProvider : public ::testing::Test
{
protected:
    SmartPaneOverProvider() { pane.setProvider(&provider); }

    FakeProvider provider = makeProvider();
    SmartPane pane;
};

} // namespace

TEST(SmartPane, AsksForADiskUntilOneIsSelected)
{
    SmartPane pane;
    EXPECT_EQ(pane.viewId(), "smart");
    EXPECT_EQ(pane.title(), "SMART Info");
    EXPECT_EQ(pane.hintLabel()->text(), "Select a Physical Device (disk) to view S.M.A.R.T.");
    EXPECT_FALSE(pane.hintLabel()->isHidden());
    EXPECT_TRUE(pane.parameterTree()->parentWidget()->isHidden());
    EXPECT_FALSE(pane.refreshAction()->isEnabled());
    EXPECT_EQ(pane.refreshAction()->text(), "Refresh");

    // Partitions, volumes and folders are no disks: the pane keeps asking for one.
    FakeNode volume(NodeKind::Drive, "C:");
    FakeNode folder(NodeKind::Folder, "Windows");
    pane.showNodes({&volume, &folder});
    EXPECT_EQ(pane.device(), nullptr);
    EXPECT_FALSE(pane.hintLabel()->isHidden());

    // Of a mixed selection the first disk is shown.
    FakeNode disk(NodeKind::Device, "Disk 0");
    FakeNode other(NodeKind::Device, "Disk 1");
    pane.showNodes({&volume, &disk, &other});
    EXPECT_EQ(pane.device(), &disk);
    EXPECT_TRUE(pane.hintLabel()->isHidden());
    EXPECT_EQ(pane.deviceLabel()->text(), "Disk 0");
    EXPECT_TRUE(pane.refreshAction()->isEnabled());
    pane.showNodes({});
    EXPECT_EQ(pane.device(), nullptr);
    EXPECT_FALSE(pane.hintLabel()->isHidden());
}

TEST(SmartPane, DiskWithoutDataSaysNotSupported)
{
    SmartPane pane; // its own provider until the kernel reads SMART data: none for any disk
    FakeNode disk(NodeKind::Device, "Disk 0");
    pane.showDevice(&disk);
    EXPECT_FALSE(pane.parametersMissingLabel()->isHidden());
    EXPECT_EQ(pane.parametersMissingLabel()->text(), "S.M.A.R.T. parameters are not supported");
    EXPECT_TRUE(pane.parameterTree()->isHidden());
    EXPECT_FALSE(pane.attributesMissingLabel()->isHidden());
    EXPECT_EQ(pane.attributesMissingLabel()->text(), "S.M.A.R.T. attributes are not supported");
    EXPECT_TRUE(pane.attributeTable()->isHidden());
    EXPECT_EQ(pane.attributeTable()->rowCount(), 0);
}

TEST_F(SmartPaneOverProvider, ShowsParametersAndAttributesInIdOrder)
{
    FakeNode disk(NodeKind::Device, "Disk 0");
    pane.showNodes({&disk});
    EXPECT_EQ(provider.asked, &disk);
    EXPECT_TRUE(pane.parametersMissingLabel()->isHidden());
    EXPECT_TRUE(pane.attributesMissingLabel()->isHidden());

    const QTreeWidget *p = pane.parameterTree();
    ASSERT_EQ(p->topLevelItemCount(), 15);
    const QStringList labels = {"Device Model:",
                                "Serial Number:",
                                "Firmware Version:",
                                "Capacity:",
                                "ATA Version:",
                                "ATA Standard:",
                                "SMART Support:",
                                "Off-line Data Collection Status:",
                                "Self-test Execution Status:",
                                "Time Off-line Data Collection, sec:",
                                "Off-line Data Collection Capabilities:",
                                "SMART Capabilities:",
                                "Error Logging Capabilities:",
                                "Short Self-test Time, min:",
                                "Extended Self-test Time, min:"};
    for (int i = 0; i < labels.size(); ++i)
        EXPECT_EQ(p->topLevelItem(i)->text(0), labels[i]);
    EXPECT_EQ(parameter(p, "Device Model:"), "ST3500630AS");
    EXPECT_EQ(parameter(p, "Serial Number:"), "9QG3NCKC");
    EXPECT_EQ(parameter(p, "Capacity:"), NodeCore::sizeText(500107862016ull) + " (500107862016)");
    EXPECT_EQ(parameter(p, "ATA Version:"), "7");
    EXPECT_EQ(parameter(p, "ATA Standard:"), "ATA/ATAPI-7 published, ANSI INCITS 397-2005");
    EXPECT_EQ(parameter(p, "Time Off-line Data Collection, sec:"), "430");
    EXPECT_EQ(parameter(p, "Off-line Data Collection Status:"), "130");
    EXPECT_EQ(parameter(p, "Extended Self-test Time, min:"), "115");

    const QTableWidget *t = pane.attributeTable();
    ASSERT_EQ(t->columnCount(), 9);
    const QStringList headers = {"ID",   "Name",    "Value",       "Worst",    "Threshold",
                                 "Type", "Updated", "When Failed", "Raw Value"};
    for (int c = 0; c < headers.size(); ++c)
        EXPECT_EQ(t->horizontalHeaderItem(c)->text(), headers[c]);
    ASSERT_EQ(t->rowCount(), 4);
    // The texts of a column, top to bottom, joined by "|".
    const auto column = [t](int c) {
        QStringList texts;
        for (int row = 0; row < t->rowCount(); ++row)
            texts << cell(t, row, c);
        return texts.join('|').toStdString();
    };
    EXPECT_EQ(column(0), "1|5|9|194");
    EXPECT_EQ(cell(t, 0, 1), "Read Error Rate");
    EXPECT_EQ(cell(t, 3, 1), "HDA Temperature Celsius");
    EXPECT_EQ(cell(t, 0, 8), QString::number(0xDEADBEEFull));
    // Pre-fail and always updated by default; type 1 is Old-age.
    EXPECT_EQ(column(5), "Pre-fail|Pre-fail|Old-age|Old-age");
    EXPECT_EQ(column(6), "Always|Always|Always|Always");
    EXPECT_EQ(column(7), "Never|Failing now|Failed in the past|Never");
    EXPECT_EQ(cell(t, 2, 2), "100");
    EXPECT_EQ(cell(t, 2, 3), "90");
    EXPECT_EQ(cell(t, 2, 4), "95");
    for (int row = 0; row < t->rowCount(); ++row)
        for (int c = 0; c < t->columnCount(); ++c)
            EXPECT_EQ(t->item(row, c)->background().color(), QColor(row % 2 == 0 ? "#FAFAFA" : "#F0F0F0"))
                << row << "," << c;
}

TEST_F(SmartPaneOverProvider, RefreshReadsAgainAndFollowsTheProvider)
{
    FakeNode disk(NodeKind::Device, "Disk 0");
    pane.showDevice(&disk);
    const int reads = provider.parameterReads;
    ASSERT_EQ(pane.attributeTable()->rowCount(), 4);

    // The same selection again reads nothing; Refresh does.
    pane.showNodes({&disk});
    EXPECT_EQ(provider.parameterReads, reads);
    provider.attributes.removeLast();
    provider.parameters.model = QStringLiteral("WDC WD5000AAKS");
    pane.refreshAction()->trigger();
    EXPECT_EQ(provider.parameterReads, reads + 1);
    EXPECT_EQ(pane.attributeTable()->rowCount(), 3);
    EXPECT_EQ(parameter(pane.parameterTree(), "Device Model:"), "WDC WD5000AAKS");

    // A disk that stops answering loses its rows.
    provider.withData = false;
    pane.refresh();
    EXPECT_EQ(pane.attributeTable()->rowCount(), 0);
    EXPECT_EQ(pane.parameterTree()->topLevelItemCount(), 0);
    EXPECT_FALSE(pane.parametersMissingLabel()->isHidden());
    EXPECT_FALSE(pane.attributesMissingLabel()->isHidden());
}

TEST_F(SmartPaneOverProvider, DiskThatGoesAwayLeavesTheHint)
{
    auto disk = std::make_unique<FakeNode>(NodeKind::Device, "Disk 0");
    pane.showNodes({disk.get()});
    ASSERT_EQ(pane.device(), disk.get());
    disk.reset();
    EXPECT_EQ(pane.device(), nullptr);
    EXPECT_FALSE(pane.hintLabel()->isHidden());
    // Refresh then asks nobody about the gone disk.
    const int reads = provider.parameterReads;
    pane.refresh();
    EXPECT_EQ(provider.parameterReads, reads);

    // The pane going first leaves the disk without a subscriber to call.
    auto second = std::make_unique<FakeNode>(NodeKind::Device, "Disk 1");
    {
        SmartPane shortLived;
        shortLived.showDevice(second.get());
    }
    second.reset();
}

TEST(SmartText, NamesByIdAndStandardsByMinorVersion)
{
    EXPECT_EQ(Smart::attributeName(1), "Read Error Rate");
    EXPECT_EQ(Smart::attributeName(254), "Free Fall Sensor");
    // Pairs that share a name.
    EXPECT_EQ(Smart::attributeName(13), Smart::attributeName(201));
    EXPECT_EQ(Smart::attributeName(191), Smart::attributeName(221));
    EXPECT_EQ(Smart::attributeName(193), Smart::attributeName(225));
    EXPECT_EQ(Smart::attributeName(108), "Unknown (108)");
    EXPECT_EQ(Smart::attributeName(99), "Unknown (99)");
    EXPECT_EQ(Smart::attributeName(0), "Unknown (0)");
    EXPECT_EQ(Smart::attributeName(255), "Unknown (255)");

    EXPECT_EQ(Smart::ataStandardText(1), "ATA-1 X3T9.2 781D prior to revision 4");
    EXPECT_EQ(Smart::ataStandardText(2), "ATA-1 published, ANSI X3.221-1994");
    EXPECT_EQ(Smart::ataStandardText(34), "ATA/ATAPI-6 published, ANSI INCITS 361-2002");
    for (int minor : {0, 35, 65535})
        EXPECT_EQ(Smart::ataStandardText(uint16_t(minor)), "Device does not report version") << minor;

    EXPECT_EQ(Smart::whenFailedText(0), "Never");
    EXPECT_EQ(Smart::whenFailedText(1), "Failed in the past");
    EXPECT_EQ(Smart::whenFailedText(2), "Failing now");
    EXPECT_EQ(Smart::attributeUpdatedText(1), "Offline");
    EXPECT_EQ(Smart::attributeUpdatedText(0), "Always");
}

TEST_F(SmartPaneOverProvider, Screenshot)
{
    const QString out = qEnvironmentVariable("BRINDLE_SCREENSHOT_DIR");
    if (out.isEmpty())
        GTEST_SKIP() << "set BRINDLE_SCREENSHOT_DIR to write the picture";
    FakeNode disk(NodeKind::Device, "Disk 0");
    pane.showDevice(&disk);
    pane.resize(760, 640);
    pane.show();
    QTest::qWait(200);
    EXPECT_TRUE(pane.grab().save(out + "/smart-pane.png"));
}
