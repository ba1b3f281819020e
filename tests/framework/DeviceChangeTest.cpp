// The postponed device update: notifications queue device nodes once, every arrival restarts the
// five-second timer, one refresh pass follows the last of them; the try-lock drops notifications
// that arrive while the handler is busy; block-device events map onto arrivals, removals and
// layout changes. The platform monitor is checked against a loop device the test attaches.
#include "ClientFramework/DeviceChange/DeviceChangeHandler.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "Kernel/Implementation/Platform/Linux/UdevMonitor.h"

#include "tests/common/TestUtil.h"

#include <QHash>
#include <QSignalSpy>
#include <QTemporaryDir>
#include <QTest>
#include <gtest/gtest.h>

using namespace Framework::DeviceChange;

namespace {

// A clock the test moves by hand; the timer fires when the clock passes its deadline.
class ManualTimer : public IPostponedTimer
{
public:
    void start(int intervalMs) override
    {
        m_deadline = m_now + intervalMs;
        m_active = true;
        ++starts;
    }
    void stop() override { m_active = false; }
    bool isActive() const override { return m_active; }
    int id() const override { return 7; }
    void advance(qint64 ms)
    {
        m_now += ms;
        if (m_active && m_now >= m_deadline) {
            m_active = false;
            if (timeout)
                timeout();
        }
    }
    int starts = 0;

private:
    qint64 m_now = 0;
    qint64 m_deadline = 0;
    bool m_active = false;
};

struct FakeNode
{
    QString name;
    QString path;
    bool busy = false;
    bool processing = false;
    bool alive = true;
};

class FakeSink : public IDeviceChangeSink
{
public:
    NodeCore *add(const QString &name, const QString &path)
    {
        nodes.append(new FakeNode{name, path});
        return asNode(nodes.last());
    }
    ~FakeSink() override { qDeleteAll(nodes); }
    static NodeCore *asNode(FakeNode *n) { return reinterpret_cast<NodeCore *>(n); }
    static FakeNode *fake(NodeCore *n) { return reinterpret_cast<FakeNode *>(n); }

    NodeCore *nodeForPath(const QString &path) override
    {
        for (FakeNode *n : nodes)
            if (n->alive && n->path == path)
                return asNode(n);
        return nullptr;
    }
    bool isAlive(NodeCore *node) override { return fake(node)->alive; }
    QString nodeName(NodeCore *node) override { return fake(node)->name; }
    bool isBusy(NodeCore *node) override { return fake(node)->busy; }
    bool isUnderProcessing(NodeCore *node) override { return fake(node)->processing; }
    bool isValidating() override { return validating; }
    void repopulate(NodeCore *node) override { repopulated << fake(node)->name; }
    void addDevice(const QString &path) override { added << path; }

    QList<FakeNode *> nodes;
    QStringList repopulated;
    QStringList added;
    bool validating = false;
};

// The texts logged while the object lives.
class LogCapture : public QObject
{
public:
    LogCapture()
    {
        connect(&Framework::ApplicationLog::instance(), &Framework::ApplicationLog::entryAdded, this,
                [this](const QString &text) { lines << text; });
    }
    QStringList lines;
};

struct Fixture
{
    FakeSink sink;
    ManualTimer *timer = new ManualTimer;
    Handler handler{sink, std::unique_ptr<IPostponedTimer>(timer)};
};

BlockDeviceEvent event(BlockDeviceEvent::Action action, const QString &path, bool medium,
                       BlockDeviceEvent::Type type = BlockDeviceEvent::Type::Disk, const QString &disk = {})
{
    BlockDeviceEvent e;
    e.action = action;
    e.type = type;
    e.devicePath = path;
    e.diskPath = disk.isEmpty() ? path : disk;
    e.mediumPresent = medium;
    return e;
}

} // namespace

TEST(DeviceChange, SeveralArrivalsGiveOneRefreshAfterTheLast)
{
    Fixture f;
    LogCapture log;
    NodeCore *sdb = f.sink.add("Disk B", "/dev/sdb");
    NodeCore *sdc = f.sink.add("Disk C", "/dev/sdc");
    f.handler.handleEvent(sdb, Handler::HandleEvent::LayoutChanged);
    f.timer->advance(3000);
    f.handler.mediumArrived("/dev/sdc");
    f.timer->advance(3000);
    f.handler.handleEvent(sdb, Handler::HandleEvent::VolumeMount); // already pending: not twice
    EXPECT_EQ(f.handler.pending().size(), 2);
    f.timer->advance(4999);
    EXPECT_TRUE(f.sink.repopulated.isEmpty()); // still within five seconds of the last one
    f.timer->advance(1);
    // One pass, newest first.
    EXPECT_EQ(f.sink.repopulated, QStringList({"Disk C", "Disk B"}));
    EXPECT_TRUE(f.handler.pending().isEmpty());
    EXPECT_FALSE(f.handler.isTimerActive());
    EXPECT_EQ(f.timer->starts, 3);
    f.timer->advance(10000);
    EXPECT_EQ(f.sink.repopulated.size(), 2);

    EXPECT_TRUE(log.lines.contains("Device change signaled: Disk B - Disk layout changed"));
    EXPECT_TRUE(log.lines.contains("Device change signaled: Disk B - Disk volume mount"));
    EXPECT_TRUE(log.lines.contains("On postponed update timer 7"));
    EXPECT_TRUE(log.lines.contains("On postponed update for: Disk C"));
    // The remembered message is the last one, logged when the timer fires.
    const int timerLine = int(log.lines.indexOf("On postponed update timer 7"));
    ASSERT_GE(timerLine, 0);
    EXPECT_EQ(log.lines.value(timerLine + 1), "Device change signaled: Disk B - Disk volume mount");
    Q_UNUSED(sdc);
}

TEST(DeviceChange, MessagesOfTheCases)
{
    Fixture f;
    LogCapture log;
    NodeCore *sdb = f.sink.add("Disk B", "/dev/sdb");
    f.handler.notice(Handler::Notice::QueryRemove);
    f.handler.devicesChanged();
    f.sink.validating = true;
    f.handler.devicesChanged();
    f.handler.handleEvent(nullptr, Handler::HandleEvent::Other, "{1234}");
    f.handler.mediumRemoved("/dev/sdz"); // no node: logged, nothing queued
    EXPECT_TRUE(f.handler.pending().isEmpty());
    EXPECT_FALSE(f.handler.isTimerActive());
    f.handler.mediumRemoved("/dev/sdb");
    EXPECT_EQ(f.handler.pending(), QList<NodeCore *>({sdb}));
    EXPECT_EQ(log.lines,
              QStringList({
                  "Permission is requested to remove a device or piece of media. Any application can "
                  "deny this request and cancel the removal",
                  "A device state has been changed",
                  "Device update request",
                  "A device state has been changed",
                  "Device change through validation",
                  "Unknown device change signaled - GUID: {1234}",
                  "A device or piece of media has been removed: /dev/sdz",
              }));
    f.timer->advance(5000);
    EXPECT_EQ(log.lines.mid(7), QStringList({"On postponed update timer 7",
                                             "A device or piece of media has been removed: /dev/sdb",
                                             "On postponed update for: Disk B"}));
    EXPECT_EQ(Handler::noticeText(Handler::Notice::ConfigChangeCancelled),
              "A request to change the current configuration (dock or undock) has been canceled");
}

TEST(DeviceChange, BusyProcessingAndVanishedNodesAreSkipped)
{
    Fixture f;
    NodeCore *busy = f.sink.add("Busy", "/dev/sdb");
    NodeCore *worked = f.sink.add("Worked", "/dev/sdc");
    NodeCore *gone = f.sink.add("Gone", "/dev/sdd");
    FakeSink::fake(busy)->busy = true;
    f.handler.handleEvent(busy, Handler::HandleEvent::LayoutChanged);
    EXPECT_TRUE(f.handler.pending().isEmpty()); // a busy node is not queued
    f.handler.handleEvent(worked, Handler::HandleEvent::LayoutChanged);
    f.handler.handleEvent(gone, Handler::HandleEvent::LayoutChanged);
    ASSERT_EQ(f.handler.pending().size(), 2);
    FakeSink::fake(worked)->processing = true; // a process took it meanwhile
    FakeSink::fake(gone)->alive = false;       // its device left meanwhile
    f.timer->advance(5000);
    EXPECT_TRUE(f.sink.repopulated.isEmpty());
    EXPECT_TRUE(f.handler.pending().isEmpty());
}

TEST(DeviceChange, NotificationsWhileTheMutexIsHeldAreDropped)
{
    Fixture f;
    f.sink.add("Disk B", "/dev/sdb");
    f.handler.deviceMutex().lock();
    f.handler.mediumArrived("/dev/sdb");
    f.handler.blockEvent(event(BlockDeviceEvent::Action::Change, "/dev/loop3", true));
    EXPECT_EQ(f.handler.dropped(), 2);
    EXPECT_TRUE(f.handler.pending().isEmpty());
    EXPECT_TRUE(f.handler.pendingArrivals().isEmpty());
    f.handler.deviceMutex().unlock();
    // A timer that fires while the mutex is held tries again later instead of waiting.
    f.handler.mediumArrived("/dev/sdb");
    f.handler.deviceMutex().lock();
    f.timer->advance(5000);
    EXPECT_TRUE(f.sink.repopulated.isEmpty());
    EXPECT_TRUE(f.handler.isTimerActive());
    f.handler.deviceMutex().unlock();
    f.timer->advance(5000);
    EXPECT_EQ(f.sink.repopulated, QStringList({"Disk B"}));
}

TEST(DeviceChange, BlockEventsMapOntoArrivalsRemovalsAndLayoutChanges)
{
    using A = BlockDeviceEvent::Action;
    Fixture f;
    LogCapture log;
    NodeCore *sdb = f.sink.add("Disk B", "/dev/sdb");
    // A loop device attached: it had no node and now has sectors.
    f.handler.blockEvent(event(A::Change, "/dev/loop4", true));
    f.handler.blockEvent(event(A::Change, "/dev/loop4", true));
    f.handler.blockEvent(event(A::Change, "/dev/loop5", false)); // an idle loop device: nothing
    EXPECT_EQ(f.handler.pendingArrivals(), QStringList({"/dev/loop4"}));
    // A partition of a known disk changed: the disk's layout changed.
    f.handler.blockEvent(event(A::Add, "/dev/sdb1", true, BlockDeviceEvent::Type::Partition, "/dev/sdb"));
    EXPECT_EQ(f.handler.pending(), QList<NodeCore *>({sdb}));
    f.timer->advance(5000);
    EXPECT_EQ(f.sink.added, QStringList({"/dev/loop4"}));
    EXPECT_EQ(f.sink.repopulated, QStringList({"Disk B"}));
    EXPECT_TRUE(log.lines.contains("On postponed update for: /dev/loop4"));

    // The medium of a known disk left (a loop device detached), a disk unplugged.
    NodeCore *loop = f.sink.add("Loop", "/dev/loop4");
    f.handler.blockEvent(event(A::Change, "/dev/loop4", false));
    f.handler.blockEvent(event(A::Remove, "/dev/sdb", false));
    EXPECT_EQ(f.handler.pending(), QList<NodeCore *>({loop, sdb}));
    EXPECT_TRUE(log.lines.contains("A device state has been changed"));
    // A new disk plugged in: the device list changed and the disk is added.
    f.handler.blockEvent(event(A::Add, "/dev/sdx", true));
    EXPECT_EQ(f.handler.pendingArrivals(), QStringList({"/dev/sdx"}));
    f.timer->advance(5000);
    EXPECT_EQ(f.sink.repopulated, QStringList({"Disk B", "Disk B", "Loop"}));
    EXPECT_EQ(f.sink.added, QStringList({"/dev/loop4", "/dev/sdx"}));
}

TEST(BlockDeviceMonitor, ReportsALoopDeviceAttachedAndDetached)
{
    if (!TestUtil::canAttachLoop())
        GTEST_SKIP() << "attaching loop devices needs root and /dev/loop-control";
    auto monitor = CreateBlockDeviceMonitor();
    ASSERT_TRUE(monitor->isActive());
    QList<BlockDeviceEvent> events;
    QObject::connect(monitor.get(), &IBlockDeviceMonitor::blockEvent,
                     [&](const BlockDeviceEvent &e) { events << e; });
    QTemporaryDir dir;
    const QString image = dir.filePath("disk.img");
    ASSERT_TRUE(TestUtil::writeFile(image, QByteArray(4 * 1024 * 1024, '\0')));
    QString device;
    {
        TestUtil::LoopDevice loop(image);
        ASSERT_FALSE(loop.Device().isEmpty());
        device = loop.Device();
        auto attached = [&] {
            for (const BlockDeviceEvent &e : events)
                if (e.devicePath == device && e.mediumPresent && e.type == BlockDeviceEvent::Type::Disk)
                    return true;
            return false;
        };
        EXPECT_TRUE(QTest::qWaitFor(attached, 5000)) << "no event with a medium for " << device.toStdString();
    }
    auto detached = [&] {
        for (const BlockDeviceEvent &e : events)
            if (e.devicePath == device && !e.mediumPresent)
                return true;
        return false;
    };
    EXPECT_TRUE(QTest::qWaitFor(detached, 5000)) << "no event without a medium for " << device.toStdString();
    for (const BlockDeviceEvent &e : events) {
        if (e.devicePath == device) {
            EXPECT_EQ(e.diskPath, device);
        }
    }
}
