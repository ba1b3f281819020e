// brindle-cli devices and the SOURCE resolver against loop devices attached here, compared with
// blockdev; and the listing of a device the user has no rights to.
#include <gtest/gtest.h>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/Devices.h"
#include "cli/Source.h"
#include "tests/common/TestUtil.h"

#include <QJsonArray>
#include <QJsonDocument>
#include <QJsonObject>
#include <QTemporaryDir>

namespace {

QJsonObject EntryFor(const QJsonArray &list, const QString &path)
{
    for (const QJsonValue &v : list) {
        if (v.toObject().value("path").toString() == path)
            return v.toObject();
    }
    return {};
}

} // namespace

TEST(CliDevices, JsonMatchesBlockdevForLoopDevices)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    QTemporaryDir dir;
    ASSERT_TRUE(dir.isValid());
    const QString image = dir.filePath("disk.img");
    ASSERT_EQ(TestUtil::run("truncate", {"-s", "24M", image}).exitCode, 0);
    TestUtil::LoopDevice plain(image, {});
    TestUtil::LoopDevice big(image, {"-b", "4096"});
    ASSERT_FALSE(plain.Device().isEmpty());
    ASSERT_FALSE(big.Device().isEmpty());

    TestUtil::ToolResult r = TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"devices", "--json"});
    ASSERT_EQ(r.exitCode, 0) << r.err.toStdString();
    QJsonParseError error;
    QJsonDocument doc = QJsonDocument::fromJson(r.out, &error);
    ASSERT_EQ(error.error, QJsonParseError::NoError) << r.out.toStdString();
    const QJsonArray list = doc.array();
    for (const TestUtil::LoopDevice *loop : {&plain, &big}) {
        SCOPED_TRACE(loop->Device().toStdString());
        QJsonObject o = EntryFor(list, loop->Device());
        ASSERT_FALSE(o.isEmpty()) << r.out.toStdString();
        const QStringList keys = {"number",       "source",     "name",       "path",
                                  "mediaType",    "partStyle",  "sectorSize", "physicalSectorSize",
                                  "totalSectors", "model",      "firmware",   "serial",
                                  "rotation",     "attributes", "kind",       "kindDetail",
                                  "members",      "holders"};
        EXPECT_EQ(o.keys().size(), keys.size());
        for (const QString &k : keys)
            EXPECT_TRUE(o.contains(k)) << k.toStdString();
        const qint64 sectorSize = o.value("sectorSize").toInteger();
        EXPECT_EQ(sectorSize, TestUtil::blockdev("--getss", loop->Device()));
        EXPECT_EQ(o.value("physicalSectorSize").toInteger(), TestUtil::blockdev("--getpbsz", loop->Device()));
        EXPECT_EQ(o.value("totalSectors").toInteger() * sectorSize, TestUtil::blockdev("--getsize64", loop->Device()));
        EXPECT_EQ(o.value("source").toInt(), 3);
        EXPECT_EQ(o.value("mediaType").toString(), "Fixed Disk");
        EXPECT_EQ(o.value("partStyle").toString(), "Raw (not partitioned)");
        EXPECT_TRUE(o.value("attributes").toArray().contains(QJsonValue("Virtual")));
        EXPECT_EQ(o.value("kind").toString(), "Loop Device");
    }
    EXPECT_EQ(EntryFor(list, big.Device()).value("sectorSize").toInt(), 4096);

    // Text output: one block per device, numbered in kernel order.
    TestUtil::ToolResult text = TestUtil::run(TestUtil::builtProgram("brindle-cli"), {"devices"});
    ASSERT_EQ(text.exitCode, 0);
    EXPECT_TRUE(text.out.contains("disk:0  "));
    EXPECT_TRUE(text.out.contains(plain.Device().toUtf8()));
    EXPECT_TRUE(text.out.contains("image file: " + image.toUtf8()));

    // Without rights the devices are still listed, as not ready, with the reason.
    if (TestUtil::haveTool("setpriv")) {
        TestUtil::ToolResult nobody =
            TestUtil::run("setpriv", {"--reuid=65534", "--regid=65534", "--clear-groups",
                                      TestUtil::builtProgram("brindle-cli"), "devices", "--json"});
        if (nobody.exitCode == 0) {
            QJsonObject o = EntryFor(QJsonDocument::fromJson(nobody.out).array(), plain.Device());
            ASSERT_FALSE(o.isEmpty()) << nobody.out.toStdString();
            EXPECT_TRUE(o.value("attributes").toArray().contains(QJsonValue("Not Ready")));
            EXPECT_EQ(o.value("totalSectors").toInteger() * o.value("sectorSize").toInteger(),
                      TestUtil::blockdev("--getsize64", plain.Device()));
            TestUtil::ToolResult why =
                TestUtil::run("setpriv", {"--reuid=65534", "--regid=65534", "--clear-groups",
                                          TestUtil::builtProgram("brindle-cli"), "devices"});
            EXPECT_TRUE(why.out.contains("not ready: Error [5]")) << why.out.toStdString();
        }
    }
}

TEST(CliDevices, SourceResolver)
{
    CRoot root;
    QString error;
    EXPECT_EQ(Cli::resolveSource(root, "disk:x", error), nullptr);
    EXPECT_TRUE(error.contains("not a number")) << error.toStdString();
    EXPECT_EQ(Cli::resolveSource(root, "disk:65000", error), nullptr);
    EXPECT_TRUE(error.contains("there is no device 65000")) << error.toStdString();
    EXPECT_EQ(Cli::resolveSource(root, "/no/such/thing", error), nullptr);
    EXPECT_FALSE(error.isEmpty());
    if (!Cli::imageOpener()) {
        EXPECT_TRUE(error.contains("no such device or file")) << error.toStdString();
    }
    QTemporaryDir dir;
    const QString file = dir.filePath("plain.bin");
    ASSERT_TRUE(TestUtil::writeFile(file, QByteArray(4096, 'x')));
    if (!Cli::imageOpener()) {
        EXPECT_EQ(Cli::resolveSource(root, file, error), nullptr);
        EXPECT_TRUE(error.contains("not a storage device")) << error.toStdString();
    }

    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "loop devices cannot be attached here (needs root and /dev/loop-control)";
    TestUtil::LoopDevice loop(file, {});
    ASSERT_FALSE(loop.Device().isEmpty());
    // A device path is identified and added once; disk:N names the same object afterwards.
    CDevice *d = Cli::resolveSource(root, loop.Device(), error);
    ASSERT_NE(d, nullptr) << error.toStdString();
    EXPECT_EQ(d->GetSize(), 4096u);
    EXPECT_EQ(Cli::resolveSource(root, loop.Device(), error), d);
    CDevice *viaNumber = nullptr;
    for (uint32_t i = 0; i < 256 && !viaNumber; ++i) {
        CDevice *c = Cli::resolveSource(root, QStringLiteral("disk:%1").arg(i), error);
        if (!c)
            break;
        if (c->GetHandle() && c->GetHandle()->GetName() == loop.Device())
            viaNumber = c;
    }
    EXPECT_EQ(viaNumber, d);
}

TEST(CliDevices, WhatADeviceIsBuiltFromShowsInTextAndJson)
{
    struct Row
    {
        BlockStack stack;
        QString kernelName;
        QString name;      // expected display name
        QStringList lines; // expected lines of the text block
    };
    const QList<Row> rows = {
        {{BackingKind::EncryptedVolume, "LUKS2", "luks-3f2a", {"/dev/mapper/vg-root"}, {}},
         "dm-1",
         "Disk luks-3f2a",
         {"    kind: Encrypted Volume (LUKS2)", "    members: /dev/mapper/vg-root"}},
        // A disk of its own shows only what is built on it.
        {{BackingKind::None, "", "", {}, {"/dev/mapper/mpatha"}},
         "sdb",
         "Disk sdb",
         {"    holders: /dev/mapper/mpatha"}},
    };
    CRoot root;
    for (const Row &r : rows) {
        SCOPED_TRACE(r.name.toStdString());
        DeviceInfo info;
        info.source =
            r.stack.kind == BackingKind::None ? EnumSource::PhysicalDrive : EnumSource::VolumeBacked;
        info.mediaType = MediaType::Fixed;
        info.kernelName = r.kernelName;
        info.stack = r.stack;
        CDevice device(&root, info);
        EXPECT_EQ(device.GetDisplayName(), r.name);

        QString text;
        QTextStream out(&text);
        Cli::PrintDevice(out, 0, &device);
        out.flush();
        for (const QString &line : r.lines)
            EXPECT_TRUE(text.split('\n').contains(line)) << text.toStdString();
        EXPECT_EQ(text.contains("kind:"), r.stack.kind != BackingKind::None);
        EXPECT_EQ(text.contains("members:"), !r.stack.members.isEmpty());

        const QJsonObject o = Cli::DeviceJson(&device);
        EXPECT_EQ(o.value("kind").toString(), BackingKindName(r.stack.kind));
        EXPECT_EQ(o.value("kindDetail").toString(), r.stack.detail);
        EXPECT_EQ(o.value("members").toVariant().toStringList(), r.stack.members);
        EXPECT_EQ(o.value("holders").toVariant().toStringList(), r.stack.holders);
    }
}
