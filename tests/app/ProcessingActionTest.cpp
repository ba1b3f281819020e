// The command-line action: device numbering, the context it opens and what it reports.
#include "app/ProcessingAction.h"
#include "app/CliArguments.h"
#include "app/RequestHost.h"
#include "tests/common/LogTestUtil.h"
#include "tests/common/RecordingDialogs.h"

#include <QtTest/QSignalSpy>
#include <gtest/gtest.h>

using CLI::ContextDevice;
using CLI::ProcessingAction;

namespace {

NodeCore *fakeNode(int i)
{
    return reinterpret_cast<NodeCore *>(static_cast<uintptr_t>(0x1000 + 16 * i));
}

class FakeHost : public CLI::IRequestHost
{
public:
    bool saveHardwareInfo(const QString &name) override
    {
        reportName = name;
        return true;
    }
    NodeCore *findFileNode(const QString &path, bool *ready) override
    {
        *ready = fileReady;
        return path == filePath ? fakeNode(100) : nullptr;
    }
    void prepareNode(NodeCore *, std::function<void()> done) override { prepared = std::move(done); }
    NodeCore *openFileNode(const QString &path) override
    {
        return path == filePath ? fakeNode(100) : nullptr;
    }
    QList<ContextDevice> devices() override { return list; }
    NodeCore *volumeAt(NodeCore *device, uint64_t offset) override
    {
        return device == fakeNode(1) && offset == 1048576 ? fakeNode(50) : nullptr;
    }
    void openInHexEditor(NodeCore *node, uint64_t offset, bool readOnly, int type,
                         uint64_t offsetTmpl) override
    {
        opened = {node, offset, readOnly, type, offsetTmpl};
        ++openCount;
    }

    struct Opened
    {
        NodeCore *node = nullptr;
        uint64_t offset = 0;
        bool readOnly = false;
        int type = -1;
        uint64_t offsetTmpl = 0;
    } opened;
    int openCount = 0;
    QString reportName;
    QString filePath = "/data/file.bin";
    bool fileReady = true;
    std::function<void()> prepared;
    // physical 0, cd 0, physical 1, virtual 0, physical 2
    QList<ContextDevice> list = {{1, fakeNode(0), {}},
                                 {2, fakeNode(10), {}},
                                 {1, fakeNode(1), {}},
                                 {3, fakeNode(30), "/images/Disk.IMG"},
                                 {1, fakeNode(2), {}}};
};

QStringList argv(std::initializer_list<const char *> rest)
{
    QStringList l{QStringLiteral("brindle")};
    for (const char *a : rest)
        l << QString::fromLatin1(a);
    return l;
}

} // namespace

TEST(ProcessingAction, DeviceNumbersCountWithinEachPrefix)
{
    FakeHost h;
    // Without a prefix, number 1 is the second device of whichever prefix reaches 1 first.
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 1, 255), 2);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 1, 1), 2);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 0, 2), 1);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 0, 255), 0);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 2, 1), 4);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 1, 2), -1);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, 5, 255), -1);
    EXPECT_EQ(ProcessingAction::selectDevice(h.list, -1, 255), -1);
    EXPECT_EQ(ProcessingAction::selectDevice({}, 0, 255), -1);
}

TEST(ProcessingAction, DiskWithoutKernelEndsWithNoContextDevice)
{
    CLI::Arguments args(argv({"-disk=0"}));
    CLI::NoKernelHost host;
    ProcessingAction action(host);
    LogWatch watch;
    action.run();
    EXPECT_EQ(action.resultCode(), ProcessingAction::Failed);
    EXPECT_EQ(watch.texts(), QStringList{"No context device found!"});
    EXPECT_EQ(watch.newErrors(), 1);
    EXPECT_EQ(action.title(), "Execute Brindle with command line arguments");
}

TEST(ProcessingAction, OpensDiskWithDefaults)
{
    CLI::Arguments args(argv({"-d=1", "-dp=1", "-o=4096"}));
    FakeHost host;
    ProcessingAction action(host);
    action.run();
    EXPECT_EQ(action.resultCode(), ProcessingAction::Success);
    EXPECT_EQ(host.opened.node, fakeNode(1));
    EXPECT_EQ(host.opened.offset, 4096u);
    EXPECT_TRUE(host.opened.readOnly);
    EXPECT_EQ(host.opened.type, 34);
    EXPECT_EQ(host.opened.offsetTmpl, 4096u);
}

TEST(ProcessingAction, VolumeOffsetSelectsVolume)
{
    {
        CLI::Arguments args(argv({"-d=1", "-dp=1", "-vo=1048576", "-t=2", "-to=3"}));
        FakeHost host;
        ProcessingAction action(host);
        action.run();
        EXPECT_EQ(host.opened.node, fakeNode(50));
        EXPECT_EQ(host.opened.type, 2);
        EXPECT_EQ(host.opened.offsetTmpl, 3u);
    }
    {
        CLI::Arguments args(argv({"-d=1", "-dp=1", "-vo=0x100000"}));
        FakeHost host;
        ProcessingAction action(host);
        LogWatch watch;
        action.run();
        EXPECT_EQ(host.openCount, 0);
        EXPECT_EQ(watch.texts(), QStringList{"No context object found!"});
    }
}

TEST(ProcessingAction, MountedImageMatchesIgnoringCase)
{
    CLI::Arguments args(argv({"-mdi=/images/disk.img"}));
    FakeHost host;
    ProcessingAction action(host);
    action.run();
    EXPECT_EQ(host.opened.node, fakeNode(30));
}

TEST(ProcessingAction, FileNotReadyRunsAgainWhenPrepared)
{
    CLI::Arguments args(argv({"-file=/data/file.bin", "-o=7"}));
    FakeHost host;
    host.fileReady = false;
    ProcessingAction action(host);
    action.run();
    EXPECT_FALSE(action.isFinished());
    ASSERT_TRUE(host.prepared);
    host.prepared();
    EXPECT_EQ(action.runs(), 2);
    EXPECT_TRUE(action.isFinished());
    EXPECT_EQ(host.opened.node, fakeNode(100));
    EXPECT_EQ(host.opened.offset, 7u);
}

TEST(ProcessingAction, NothingToDoAndHardwareReport)
{
    {
        CLI::Arguments args(argv({"-nohidpi"}));
        FakeHost host;
        ProcessingAction action(host);
        action.run();
        EXPECT_EQ(action.resultCode(), ProcessingAction::NothingToDo);
    }
    {
        CLI::Arguments args(argv({"-test=hw.xml"}));
        FakeHost host;
        ProcessingAction action(host);
        QSignalSpy quit(&action, &ProcessingAction::quitRequested);
        action.run();
        EXPECT_EQ(host.reportName, "hw.xml");
        EXPECT_EQ(action.resultCode(), 1u);
        EXPECT_EQ(quit.size(), 1);
    }
}

TEST(ProcessingAction, ErrorShowsHelpAndQuits)
{
    RecordingDialogs dialogs;
    CLI::Arguments args(argv({"-ra=500"}));
    FakeHost host;
    ProcessingAction action(host);
    QSignalSpy quit(&action, &ProcessingAction::quitRequested);
    action.run();
    EXPECT_EQ(action.resultCode(), ProcessingAction::Failed);
    ASSERT_EQ(dialogs.calls.size(), 1);
    EXPECT_TRUE(dialogs.calls[0].help);
    EXPECT_EQ(quit.size(), 1);
}

TEST(ProcessingAction, ShutdownChoosesFinalActionUnlessCancelled)
{
    CLI::Arguments args(argv({"-d=0", "-sd"}));
    FakeHost host;
    {
        ProcessingAction action(host);
        QSignalSpy final(&action, &ProcessingAction::finalActionChosen);
        action.run();
        ASSERT_EQ(final.size(), 1);
        EXPECT_EQ(final[0][0].toInt(), 3);
    }
    {
        ProcessingAction action(host);
        action.cancel();
        QSignalSpy final(&action, &ProcessingAction::finalActionChosen);
        action.run();
        ASSERT_EQ(final.size(), 1);
        EXPECT_EQ(final[0][0].toInt(), 0);
    }
}
