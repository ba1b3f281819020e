// The node tree over real disk images: keys, texts, nesting of partitions and volumes, status
// and colours, context menus, default commands, the device nodes following the kernel, and a
// volume's integrity in its status and the property pane.
#include "tests/common/MemoryVolume.h"
#include "tests/framework/NodeTestSupport.h"

#include "ClientFramework/NodeTree/NodeComputer.h"
#include "ClientFramework/NodeTree/NodeCoreList.h"
#include "ClientFramework/NodeTree/NodeDevice.h"
#include "ClientFramework/NodeTree/NodeDrive.h"
#include "ClientFramework/NodeTree/NodeFile.h"
#include "ClientFramework/NodeTree/NodeFolder.h"
#include "ClientFramework/NodeTree/NodePartition.h"
#include "ClientFramework/NodeTree/NodeRoot.h"
#include "ClientFramework/Themes/Theme.h"
#include "ClientFramework/Views/PropertyPane.h"

#include <QAction>
#include <QCoreApplication>
#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QMap>
#include <QMenu>
#include <QTreeWidget>

#include <gtest/gtest.h>

using namespace NodeTest;

namespace {

QStringList childTexts(const NodeCore *node, NodeAttr attr)
{
    QStringList out;
    for (const NodeCore *c : node->children())
        out << c->text(attr);
    return out;
}

// The menu as ids, "|" for separators and "<Title>" for a sub-menu.
QStringList menuIds(const QMenu &menu)
{
    QStringList out;
    for (QAction *a : menu.actions()) {
        if (a->isSeparator())
            out << "|";
        else if (a->menu())
            out << "<" + a->menu()->title() + ">";
        else
            out << a->objectName();
    }
    return out;
}

// The starts and sizes of the partitions sfdisk reads from the image.
QList<QPair<qint64, qint64>> sfdiskPartitions(const QString &image)
{
    QList<QPair<qint64, qint64>> out;
    const TestUtil::ToolResult r = TestUtil::run("sfdisk", {"-J", image});
    const QJsonArray parts =
        QJsonDocument::fromJson(r.out).object()["partitiontable"].toObject()["partitions"].toArray();
    for (const QJsonValue &p : parts)
        out.append({p.toObject()["start"].toInteger(), p.toObject()["size"].toInteger()});
    return out;
}

class NodeTreeImages : public ::testing::Test
{
protected:
    void SetUp() override
    {
        if (!haveImageTools())
            GTEST_SKIP() << "sfdisk, sgdisk, mkfs.vfat and mke2fs are needed";
        QDir d(dir.path());
        mbr = makeMbrImage(d);
        gpt = makeGptImage(d);
        bare = makeBareFat(d);
        ASSERT_FALSE(mbr.isEmpty());
        ASSERT_FALSE(gpt.isEmpty());
        ASSERT_FALSE(bare.isEmpty());
    }

    QTemporaryDir dir;
    QString mbr, gpt, bare;
};

} // namespace

TEST_F(NodeTreeImages, DeviceNodesCarryImageKeysAndTexts)
{
    CRoot root;
    CDevice *m = open(root, mbr);
    CDevice *g = open(root, gpt);
    ASSERT_NE(m, nullptr);
    ASSERT_NE(g, nullptr);
    NodeRoot tree(&root);

    EXPECT_EQ(tree.text(NodeAttr::Key), "root");
    EXPECT_EQ(tree.text(NodeAttr::Name), "Local System Root");
    ASSERT_EQ(tree.childCount(), 3);
    EXPECT_EQ(tree.child(0)->text(NodeAttr::Key), "LocalWorkstation");
    EXPECT_EQ(tree.child(0)->text(NodeAttr::Name), "My Computer");
    EXPECT_EQ(tree.child(0)->text(NodeAttr::TypeKey), "computer");

    NodeDevice *dm = tree.deviceNode(m);
    ASSERT_NE(dm, nullptr);
    EXPECT_EQ(tree.indexOf(dm), 1);
    EXPECT_EQ(dm->text(NodeAttr::Key), QString("di-%1").arg(m->GetDescriptor().number));
    EXPECT_NE(dm->text(NodeAttr::Key), tree.deviceNode(g)->text(NodeAttr::Key));
    EXPECT_EQ(dm->text(NodeAttr::TypeKey), "device");
    EXPECT_EQ(dm->text(NodeAttr::Source), "Loaded from " + mbr);
    EXPECT_EQ(dm->text(NodeAttr::Kind), "Basic");
    EXPECT_TRUE(dm->text(NodeAttr::Name).endsWith("(64.0 MB)")) << dm->text(NodeAttr::Name).toStdString();
    EXPECT_TRUE(dm->isReady());
    EXPECT_TRUE(dm->hasFlags(NodeState::Image));
    EXPECT_TRUE(dm->biosNumber().isEmpty()); // images have no BIOS drive number
    EXPECT_EQ(dm->text(NodeAttr::Location), dm->text(NodeAttr::Name));
    EXPECT_EQ(dm->kernelDevice(), m);
    EXPECT_EQ(dm->kernelStorage(), static_cast<cStorage *>(m));
    EXPECT_EQ(dm->sectorCount(), (64u << 20) / 512);
    EXPECT_EQ(dm->defaultCommand(), "cmdHex_NodeOpen");
}

TEST_F(NodeTreeImages, MbrPartitionsGapsAndLogicalsNestAsTheTableSays)
{
    CRoot root;
    CDevice *m = open(root, mbr);
    ASSERT_NE(m, nullptr);
    NodeRoot tree(&root);
    NodeDevice *dev = tree.deviceNode(m);
    ASSERT_NE(dev, nullptr);

    // Every partition sfdisk reads stands somewhere below the device, at the same sectors.
    QList<QPair<qint64, qint64>> seen;
    std::function<void(NodeCore *)> collect = [&](NodeCore *n) {
        for (NodeCore *c : n->children())
            if (auto *p = dynamic_cast<NodePartition *>(c)) {
                if (!p->isUnallocated())
                    seen.append({qint64(p->firstSector()), qint64(p->sectorCount())});
                collect(p);
            }
    };
    collect(dev);
    for (const auto &expected : sfdiskPartitions(mbr))
        EXPECT_TRUE(seen.contains(expected)) << expected.first << "+" << expected.second;

    QStringList kinds = childTexts(dev, NodeAttr::Kind);
    EXPECT_TRUE(kinds.contains("Primary")) << kinds.join(",").toStdString();
    EXPECT_TRUE(kinds.contains("Extended Root")) << kinds.join(",").toStdString();
    EXPECT_TRUE(kinds.contains("Unallocated")) << kinds.join(",").toStdString();

    NodePartition *primary = nullptr;
    NodePartition *extended = nullptr;
    for (NodeCore *c : dev->children()) {
        auto *p = static_cast<NodePartition *>(c);
        EXPECT_EQ(p->text(NodeAttr::Key), QString("part-%1-%2").arg(p->partition()->GetKind()).arg(p->firstSector()));
        if (p->isUnallocated()) {
            EXPECT_EQ(p->text(NodeAttr::Name), "Unallocated Space");
            EXPECT_EQ(p->childCount(), 0);
            EXPECT_EQ(p->kernelVolume(), nullptr);
        }
        if (p->firstSector() == 2048)
            primary = p;
        if (p->isExtended())
            extended = p;
    }
    ASSERT_NE(primary, nullptr);
    ASSERT_NE(extended, nullptr);
    EXPECT_EQ(extended->text(NodeAttr::Name), "Extended Partition");
    EXPECT_EQ(primary->text(NodeAttr::Name), "NODEFAT");
    EXPECT_EQ(primary->text(NodeAttr::Location), dev->text(NodeAttr::Name) + " > NODEFAT");

    // The logical partition inside the extended one, with its ext2 volume.
    NodePartition *logical = nullptr;
    for (NodeCore *c : extended->children())
        if (static_cast<NodePartition *>(c)->firstSector() == 22528)
            logical = static_cast<NodePartition *>(c);
    ASSERT_NE(logical, nullptr);
    EXPECT_EQ(logical->text(NodeAttr::Kind), "Logical");
    ASSERT_EQ(logical->childCount(), 1);
    auto *extDrive = dynamic_cast<NodeDrive *>(logical->child(0));
    ASSERT_NE(extDrive, nullptr);
    EXPECT_EQ(extDrive->volume()->GetLabel(), "nodeext");

    // The FAT volume of the primary partition.
    ASSERT_EQ(primary->childCount(), 1);
    auto *drive = dynamic_cast<NodeDrive *>(primary->child(0));
    ASSERT_NE(drive, nullptr);
    EXPECT_EQ(drive->text(NodeAttr::Kind), "Disk Image");
    EXPECT_EQ(drive->text(NodeAttr::TypeKey), "drive-virtual");
    EXPECT_EQ(drive->text(NodeAttr::Source), "Disk Image Volume");
    EXPECT_TRUE(drive->text(NodeAttr::Name).startsWith("NODEFAT"))
        << drive->text(NodeAttr::Name).toStdString();
    EXPECT_EQ(drive->text(NodeAttr::Status), "Ready");
    EXPECT_EQ(drive->kernelPartition(), primary->partition());
    EXPECT_EQ(drive->kernelDevice(), m);
    EXPECT_EQ(drive->firstSector(), 2048u);
    EXPECT_EQ(primary->kernelVolume(), drive->volume());
    // The root folder stands below the drive where the file system gives a root entry.
    if (drive->volume()->GetRootEntry()) {
        ASSERT_NE(drive->rootFolder(), nullptr);
        EXPECT_EQ(drive->rootFolder()->text(NodeAttr::Key), "folder-root");
        EXPECT_EQ(drive->rootFolder()->text(NodeAttr::TypeKey), "folder-root");
    } else {
        EXPECT_EQ(drive->childCount(), 0);
    }
    // The base volume keeps no file-table copies.
    EXPECT_TRUE(drive->fileTableCopies().isEmpty());
}

TEST_F(NodeTreeImages, GptEntriesAndWholeDeviceVolumes)
{
    CRoot root;
    CDevice *g = open(root, gpt);
    CDevice *b = open(root, bare);
    ASSERT_NE(g, nullptr);
    ASSERT_NE(b, nullptr);
    NodeRoot tree(&root);

    NodeDevice *gd = tree.deviceNode(g);
    NodePartition *data = nullptr;
    for (NodeCore *c : gd->children())
        if (static_cast<NodePartition *>(c)->firstSector() == 2048)
            data = static_cast<NodePartition *>(c);
    ASSERT_NE(data, nullptr);
    EXPECT_EQ(data->text(NodeAttr::Kind), "Partition");
    EXPECT_EQ(data->text(NodeAttr::Name), "GPTFAT");
    EXPECT_EQ(data->sectorCount(), 16384u);

    // A device without a table is one volume (through the whole-device partition the kernel's
    // scan makes for it, or directly).
    NodeDevice *bd = tree.deviceNode(b);
    ASSERT_EQ(bd->childCount(), 1);
    NodeCore *below = bd->child(0);
    if (below->kind() == NodeKind::Partition) {
        EXPECT_EQ(static_cast<NodePartition *>(below)->sectorCount(), b->GetTotalSectors());
        ASSERT_EQ(below->childCount(), 1);
        below = below->child(0);
    }
    auto *drive = dynamic_cast<NodeDrive *>(below);
    ASSERT_NE(drive, nullptr);
    EXPECT_EQ(drive->volume()->GetLabel(), "BAREFAT");
    EXPECT_EQ(drive->firstSector(), 0u);
    EXPECT_EQ(drive->kernelDevice(), b);
}

TEST_F(NodeTreeImages, DeviceNodesFollowTheKernelWithoutDuplicates)
{
    CRoot root;
    NodeRoot tree(&root);
    QList<_event_storage> events;
    QObject::connect(&root, &cRoot::kernelStorage, [&](const _event_storage &e) { events.append(e); });
    CDevice *m = open(root, mbr);
    ASSERT_NE(m, nullptr);
    QCoreApplication::processEvents();
    // The scan announces the device once per partition, and the root once more: one node.
    EXPECT_GE(events.size(), 1);
    ASSERT_EQ(tree.deviceNodes().size(), 1);
    EXPECT_EQ(tree.deviceNodes().first()->device(), m);
    // Repeated announcements change nothing.
    tree.onKernelStorage(_event_storage{m, _event_storage::DeviceAdded, 0});
    EXPECT_EQ(tree.deviceNodes().size(), 1);

    // An announcement of a device that is not listed (a scan of a device still being built) is
    // not taken up.
    tree.onKernelStorage(_event_storage{reinterpret_cast<CDevice *>(0x1234), _event_storage::DeviceAdded, 0});
    EXPECT_EQ(tree.deviceNodes().size(), 1);

    ASSERT_TRUE(root.RemoveDevice(m));
    QCoreApplication::processEvents();
    EXPECT_TRUE(tree.deviceNodes().isEmpty());
    EXPECT_EQ(tree.childCount(), 1); // the computer stays
}

TEST(NodeStatus, TextByPrecedence)
{
    NodeComputer n;
    n.setState(0);
    EXPECT_EQ(n.text(NodeAttr::Status), "Not Ready");
    n.setFlags(NodeState::Ready);
    EXPECT_EQ(n.text(NodeAttr::Status), "Ready");
    n.setFlags(NodeState::ReadOnly);
    EXPECT_EQ(n.text(NodeAttr::Status), "Read only");
    n.setFlags(NodeState::Waiting);
    EXPECT_EQ(n.text(NodeAttr::Status), "Waiting");
    n.setFlags(NodeState::Busy);
    EXPECT_EQ(n.text(NodeAttr::Status), "Busy");
}

TEST(NodeStatus, ColourByFirstMatchingRule)
{
    ASSERT_TRUE(Framework::Theme::setActive("light"));
    NodeComputer n;
    const auto colour = [&](std::uint32_t state) {
        n.setState(state);
        return n.data(NodeAttr::Status, Qt::ForegroundRole).value<QColor>();
    };
    EXPECT_EQ(colour(NodeState::Ready), QColor("#008800"));
    EXPECT_EQ(colour(0), QColor("#000000"));
    EXPECT_EQ(colour(NodeState::Ready | NodeState::System), QColor("#A22"));
    EXPECT_EQ(colour(NodeState::Ready | NodeState::System | NodeState::Virtual), QColor("#0066BB"));
    EXPECT_EQ(colour(NodeState::Virtual | NodeState::Busy), QColor("#C8C8C8"));
    EXPECT_EQ(colour(NodeState::Waiting), QColor("#C8C8C8"));
    EXPECT_EQ(colour(NodeState::Busy | NodeState::Critical), QColor("#F33"));
    EXPECT_EQ(colour(NodeState::Critical | NodeState::Warning), QColor("#C67000"));
    EXPECT_EQ(colour(NodeState::Invalid | NodeState::Warning), QColor("#808080"));
    // Two of the three invalid bits are not invalid.
    EXPECT_EQ(colour(NodeState::Ready | NodeState::InvalidHigh | NodeState::InvalidMid), QColor("#008800"));
    // Display role is the text; other attributes have no colour.
    EXPECT_EQ(n.data(NodeAttr::Status, Qt::DisplayRole).toString(), n.text(NodeAttr::Status));
    EXPECT_FALSE(n.data(NodeAttr::Name, Qt::ForegroundRole).isValid());
}

TEST(NodeStatus, DeviceThatCannotBeOpenedIsNotReady)
{
    CRoot root;
    DeviceInfo info;
    info.number = 7;
    info.source = EnumSource::PhysicalDrive;
    info.mediaType = MediaType::Fixed;
    info.ready = 0;
    info.model = "Locked Disk";
    info.notReadyReason = "Permission denied";
    auto *device = new CDevice(&root, info);
    ASSERT_TRUE(root.AddImageDevice(device));
    NodeRoot tree(&root);
    NodeDevice *n = tree.deviceNode(device);
    ASSERT_NE(n, nullptr);
    EXPECT_FALSE(n->isReady());
    EXPECT_EQ(n->text(NodeAttr::Status), "Not Ready");
    EXPECT_EQ(n->text(NodeAttr::Key), "device-7");
    EXPECT_EQ(n->biosNumber(), "87h");
    EXPECT_EQ(n->notReadyTip(), "Reading disks needs root or membership of the disk group.");
    EXPECT_TRUE(tree.anyNotReady());
    EXPECT_EQ(n->childCount(), 0);

    Core::Commander commander;
    registerNodeCommands(commander, {"cmdHex_NodeOpen", "cmdPart_Table"});
    NodeCore::setCommander(&commander);
    QMenu menu;
    n->contextMenu(&menu);
    NodeCore::setCommander(nullptr);
    bool sawOpen = false;
    for (QAction *a : menu.actions()) {
        if (a->objectName() == "cmdHex_NodeOpen" || a->objectName() == "cmdNode_Browse" ||
            a->objectName() == "cmdPart_Table") {
            EXPECT_FALSE(a->isEnabled()) << a->objectName().toStdString();
            sawOpen = true;
        }
        if (a->objectName() == "cmdProperties") {
            EXPECT_TRUE(a->isEnabled());
        }
    }
    EXPECT_TRUE(sawOpen);
    // The registry's own action is left enabled.
    EXPECT_TRUE(commander.action("cmdHex_NodeOpen")->isEnabled());
}

TEST(NodeStatus, DeviceKeysByKind)
{
    CRoot root;
    const auto keyOf = [&](DeviceInfo info, std::uint32_t attributes = 0) {
        auto *d = new CDevice(&root, info);
        d->SetAttributes(attributes);
        NodeDevice n(d);
        const QString k = n.text(NodeAttr::Key);
        delete d;
        return k;
    };
    DeviceInfo plain;
    plain.number = 2;
    plain.mediaType = MediaType::Fixed;
    EXPECT_EQ(keyOf(plain), "device-2");
    DeviceInfo serial = plain;
    serial.model = "FastDisk";
    serial.firmware = "1.0";
    serial.serialIdentify = "SN42";
    const QString withSerial = keyOf(serial);
    EXPECT_TRUE(withSerial == "disk-FastDisk-1.0-SN42" || withSerial == "device-2")
        << withSerial.toStdString();
    DeviceInfo virt = plain;
    virt.mediaType = MediaType::VirtualDevice;
    EXPECT_EQ(keyOf(virt), "virtual-2");
    DeviceInfo raid = plain;
    raid.mediaType = MediaType::RaidAssembly;
    EXPECT_EQ(keyOf(raid), "raid-2");
}

TEST(NodeStatus, AssembledDeviceShowsWhatItIsBuiltFrom)
{
    CRoot root;
    DeviceInfo info;
    info.number = 0x8000;
    info.source = EnumSource::VolumeBacked;
    info.mediaType = MediaType::Fixed;
    info.kernelName = "md0";
    info.stack = {
        BackingKind::SoftwareRaid, "raid1", "", {"/dev/sdd1", "/dev/sde1"}, {"/dev/mapper/vg-data"}};
    CDevice device(&root, info);
    NodeDevice n(&device);
    EXPECT_EQ(n.text(NodeAttr::Source), "Software RAID (raid1)");
    QMap<QString, QString> items;
    for (const PropertyGroup &g : n.properties())
        for (const PropertyItem &i : g.items)
            items.insert(i.label, i.value);
    EXPECT_EQ(items.value("Members"), "/dev/sdd1, /dev/sde1");
    EXPECT_EQ(items.value("Holders"), "/dev/mapper/vg-data");
}

TEST_F(NodeTreeImages, ContextMenusByNodeKind)
{
    CRoot root;
    CDevice *m = open(root, mbr);
    ASSERT_NE(m, nullptr);
    NodeRoot tree(&root);
    Core::Commander commander;
    // The framework's commands plus some node commands; the others are not registered and are
    // left out of the menus.
    registerNodeCommands(commander, {"cmdHex_NodeOpen", "cmdHex_FileRecord", "cmdPart_Create", "cmdPart_Boot",
                                     "cmdPart_Delete", "cmdPart_Format", "cmdRollback", "cmdPart_FT"});
    NodeCore::setCommander(&commander);

    const auto menuOf = [](const NodeCore *n) {
        QMenu menu;
        n->contextMenu(&menu);
        return menuIds(menu);
    };
    EXPECT_EQ(menuOf(tree.computer()), QStringList({"cmdHddInfo", "cmdLogSave", "|", "cmdRefresh",
                                                    "cmdRollback", "|", "cmdProperties"}));
    NodeDevice *dev = tree.deviceNode(m);
    EXPECT_EQ(menuOf(dev),
              QStringList({"cmdHex_NodeOpen", "cmdNode_Browse", "|", "cmdPart_Create", "|", "cmdDI_Verify",
                           "cmdDI_Create", "|", "cmdRemove", "|", "cmdSmartInfo", "cmdProperties"}));
    NodePartition *primary = nullptr;
    for (NodeCore *c : dev->children())
        if (static_cast<NodePartition *>(c)->firstSector() == 2048)
            primary = static_cast<NodePartition *>(c);
    ASSERT_NE(primary, nullptr);
    // No "Active Table" sub-menu: the volume keeps no copies of its file table.
    EXPECT_EQ(menuOf(primary), QStringList({"cmdHex_NodeOpen", "cmdNode_Browse", "|", "cmdPart_Boot", "|",
                                            "cmdPart_Create", "cmdPart_Format", "|", "cmdPart_Delete", "|",
                                            "cmdDI_Create", "cmdOpenInOSBrowser", "|", "cmdProperties"}));
    auto *drive = static_cast<NodeDrive *>(primary->child(0));
    EXPECT_EQ(menuOf(drive), QStringList({"cmdHex_NodeOpen", "cmdNode_Browse", "|", "cmdPart_Boot", "|",
                                          "cmdPart_Format", "|", "cmdPart_Delete", "|", "cmdDI_Create",
                                          "cmdOpenInOSBrowser", "|", "cmdProperties"}));

    // A running process adds "Stop" to the device's menu.
    dev->setFlags(NodeState::Busy);
    QMenu busy;
    dev->contextMenu(&busy);
    bool stop = false;
    for (QAction *a : busy.actions())
        if (a->objectName() == "cmdNode_Stop") {
            stop = true;
            EXPECT_EQ(a->text(), "Stop");
        }
    EXPECT_TRUE(stop);
    dev->setFlags(NodeState::Busy, false);

    // The feature hook fills the placeholder.
    NodeCore::setFeatureHook([](const NodeCore &, QMenu *menu) {
        auto *a = new QAction("Feature", menu);
        a->setObjectName("feature");
        menu->addAction(a);
    });
    EXPECT_EQ(menuOf(tree.computer()), QStringList({"cmdHddInfo", "cmdLogSave", "|", "cmdRefresh", "feature",
                                                    "cmdRollback", "|", "cmdProperties"}));
    NodeCore::setFeatureHook({});

    // Selections.
    NodeCoreList list{dev, primary};
    QMenu multi;
    list.contextMenu(&multi);
    EXPECT_EQ(menuIds(multi), QStringList({"cmdHex_NodeOpen", "|", "cmdNode_Stop", "|", "cmdRefresh",
                                           "cmdNode_StopAll", "|", "cmdProperties"}));
    EXPECT_EQ(list.summary(), "<b>2</b> item(s)");
    list.append(nullptr);
    EXPECT_EQ(list.summary(), "Invalid item(s)");

    // Without a registry the menus stay empty.
    NodeCore::setCommander(nullptr);
    EXPECT_TRUE(menuOf(dev).isEmpty());
}

TEST(NodeMenus, ActiveTableListsTheCopiesWithTheOneInUseChecked)
{
    MemoryStorage medium(2048);
    TreeVolume withCopies(&medium, 1, 1, 2);
    TreeVolume without(&medium, 1, 1, 0);
    NodeDrive a(&withCopies);
    NodeDrive b(&without);
    Core::Commander commander;
    registerNodeCommands(commander, {"cmdHex_NodeOpen", "cmdPart_FT"});
    NodeCore::setCommander(&commander);

    QMenu menu;
    a.contextMenu(&menu);
    QMenu *sub = nullptr;
    for (QAction *act : menu.actions())
        if (act->menu())
            sub = act->menu();
    ASSERT_NE(sub, nullptr);
    EXPECT_EQ(sub->title(), "Active Table");
    ASSERT_EQ(sub->actions().size(), 2);
    EXPECT_EQ(sub->actions()[0]->text(), "FAT 1");
    EXPECT_EQ(sub->actions()[1]->text(), "FAT 2");
    EXPECT_FALSE(sub->actions()[0]->isChecked());
    EXPECT_TRUE(sub->actions()[1]->isChecked());
    // Choosing a copy runs cmdPart_FT with the copy's index as data.
    int triggered = -1;
    QObject::connect(commander.action("cmdPart_FT"), &QAction::triggered,
                     [&] { triggered = commander.action("cmdPart_FT")->data().toInt(); });
    sub->actions()[0]->trigger();
    EXPECT_EQ(triggered, 0);

    QMenu plain;
    b.contextMenu(&plain);
    for (QAction *act : plain.actions())
        EXPECT_EQ(act->menu(), nullptr);
    NodeCore::setCommander(nullptr);
}

TEST(NodeFiles, ZeroSizeFileOpensItsRecord)
{
    MemoryStorage medium(2048);
    TreeVolume volume(&medium, 1, 2);
    NodeDrive drive(&volume);
    NodeFolderRoot *root = drive.rootFolder();
    ASSERT_NE(root, nullptr);
    ASSERT_TRUE(root->populateNow());
    // dir0 and empty.txt
    ASSERT_EQ(root->childCount(), 2);
    auto *empty = dynamic_cast<NodeFile *>(root->child(1));
    ASSERT_NE(empty, nullptr);
    EXPECT_EQ(empty->size(), 0u);
    EXPECT_EQ(empty->defaultCommand(), "cmdHex_FileRecord");
    auto *dir0 = dynamic_cast<NodeFolder *>(root->child(0));
    ASSERT_NE(dir0, nullptr);
    ASSERT_TRUE(dir0->populateNow());
    auto *full = dynamic_cast<NodeFile *>(dir0->child(1));
    ASSERT_NE(full, nullptr);
    EXPECT_EQ(full->defaultCommand(), "cmdHex_NodeOpen");
    EXPECT_EQ(full->text(NodeAttr::Key), QString("file1.bin[%1]").arg(full->entry()->GetIndex()));
    EXPECT_EQ(full->text(NodeAttr::Kind), "File");
    EXPECT_EQ(full->text(NodeAttr::Status), "Healthy");
    EXPECT_EQ(dir0->text(NodeAttr::Kind), "File Folder");
    EXPECT_EQ(full->kernelVolume(), &volume);
    EXPECT_EQ(full->sectorSize(), 512u);

    // The file's property groups.
    const QList<PropertyGroup> groups = full->properties();
    ASSERT_EQ(groups.size(), 3);
    EXPECT_EQ(groups[0].title, "General Information");
    EXPECT_EQ(groups[1].title, "Attributes");
    EXPECT_EQ(groups[2].title, "Advanced Properties");
    QStringList labels;
    for (const PropertyItem &i : groups[2].items)
        labels << i.label;
    EXPECT_EQ(labels,
              QStringList({"First Sector", "First Cluster", "Cluster Chain Size", "File Entry Position",
                           "File Entry Length", "File Entry Type", "Named Streams"}));
    EXPECT_EQ(groups[2].items[3].tip, "File table entry position on volume in bytes");
    EXPECT_EQ(groups[2].items[4].tip, "File table entry length in bytes");
    EXPECT_EQ(groups[2].items[3].value, QString::number(full->entry()->GetPosition()));

    Core::Commander commander;
    registerNodeCommands(commander, {"cmdHex_NodeOpen", "cmdHex_FileRecord"});
    NodeCore::setCommander(&commander);
    QMenu menu;
    empty->contextMenu(&menu);
    EXPECT_EQ(menuIds(menu),
              QStringList({"cmdPreview", "cmdHex_NodeOpen", "cmdHex_FileRecord", "|", "cmdProperties"}));
    // An empty file has no data to open or preview.
    EXPECT_FALSE(menu.actions()[0]->isEnabled());
    EXPECT_FALSE(menu.actions()[1]->isEnabled());
    EXPECT_TRUE(menu.actions()[2]->isEnabled());
    QMenu folderMenu;
    dir0->contextMenu(&folderMenu);
    EXPECT_EQ(menuIds(folderMenu),
              QStringList({"cmdHex_FileRecord", "cmdOpenInOSBrowser", "|", "cmdProperties"}));
    NodeCore::setCommander(nullptr);
}

namespace {

// A volume in memory whose integrity masks the test sets.
class AssessedVolume : public TestVolumes::MemoryVolume
{
public:
    AssessedVolume(std::uint64_t valid, std::uint64_t checked)
    {
        m_validItems = valid;
        m_checkedItems = checked;
    }
};

// The rows of one group of the property pane, label to value.
QList<QPair<QString, QString>> paneRows(const Framework::PropertyPane &pane, const QString &group)
{
    QList<QPair<QString, QString>> rows;
    for (int i = 0; i < pane.tree()->topLevelItemCount(); ++i) {
        const QTreeWidgetItem *top = pane.tree()->topLevelItem(i);
        if (top->text(0) != group)
            continue;
        for (int r = 0; r < top->childCount(); ++r)
            rows.append({top->child(r)->text(0), top->child(r)->text(1)});
    }
    return rows;
}

} // namespace

TEST(NodeDriveIntegrity, DamagedWhenAnExpectedItemIsNotValid)
{
    constexpr std::uint64_t All = CVolume::AllItems;
    const struct
    {
        std::uint64_t valid, checked;
        bool damaged;
    } cases[] = {
        {All, All, false},    // not assessed
        {0x3, 0x3, false},    // every expected item valid
        {0x7, 0x3, false},    // an item valid that was not expected ("Yes")
        {All, 0x3, false},    // everything valid
        {0x1, 0x3, true},     // the copy is missing
        {0x101, 0x3, true},   // the copy is missing, though the mask is the larger number
        {0x10000, 0x3, true}, // none of the expected items valid
        {0x0, 0x10000, true}, // nothing valid
    };
    for (const auto &c : cases) {
        AssessedVolume volume(c.valid, c.checked);
        NodeDrive drive(&volume);
        EXPECT_EQ(drive.isDamaged(), c.damaged)
            << std::hex << "valid 0x" << c.valid << " checked 0x" << c.checked;
        EXPECT_EQ(drive.text(NodeAttr::Status), c.damaged ? "Damaged" : "Ready");
    }
}

TEST(NodeDriveIntegrity, PropertyPaneShowsTheGradeAndTheItemsOfAVolume)
{
    if (!TestUtil::haveTool("mkudffs"))
        GTEST_SKIP() << "mkudffs is needed";
    QTemporaryDir dir;
    const QString whole = dir.filePath("udf.img");
    ASSERT_TRUE(makeSparse(whole, 8 << 20));
    ASSERT_EQ(TestUtil::run("mkudffs", {"--label=ULBL", whole}).exitCode, 0);
    // The same volume without the copies of its anchor at the end of the medium.
    const QString cut = dir.filePath("cut.img");
    QByteArray bytes = TestUtil::readFile(whole);
    bytes.replace(bytes.size() - (2 << 20), 2 << 20, QByteArray(2 << 20, '\0'));
    ASSERT_TRUE(TestUtil::writeFile(cut, bytes));

    using Rows = QList<QPair<QString, QString>>;
    const struct
    {
        QString image;
        QString status;
        Rows rows;
    } cases[] = {
        {whole,
         "Ready",
         {{"Overall Integrity Status", "Excellent"},
          {"Primary Boot Sector", "Valid"},
          {"Copy of Boot Sector", "Valid"},
          {"Primary Boot Sector matches a Copy", "Valid"}}},
        {cut,
         "Damaged",
         {{"Overall Integrity Status", "Invalid"},
          {"Primary Boot Sector", "Valid"},
          {"Copy of Boot Sector", "Invalid"},
          {"Primary Boot Sector matches a Copy", "Invalid"}}},
    };
    for (const auto &c : cases) {
        CRoot root;
        CDevice *device = open(root, c.image);
        ASSERT_NE(device, nullptr);
        NodeRoot tree(&root);
        NodeCore *drive = tree.deviceNode(device);
        while (drive && drive->kind() != NodeKind::Drive)
            drive = drive->childCount() ? drive->child(0) : nullptr;
        ASSERT_NE(drive, nullptr);
        EXPECT_EQ(drive->text(NodeAttr::Status), c.status);
        Framework::PropertyPane pane;
        pane.showNodes({drive});
        EXPECT_EQ(paneRows(pane, "Volume Integrity Info"), c.rows) << c.image.toStdString();
        // The partition that holds the volume shows it too.
        if (drive->parent()->kind() == NodeKind::Partition) {
            pane.showNodes({drive->parent()});
            EXPECT_EQ(paneRows(pane, "Volume Integrity Info"), c.rows);
        }
    }
}
