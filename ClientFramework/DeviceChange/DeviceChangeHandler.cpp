#include "ClientFramework/DeviceChange/DeviceChangeHandler.h"

#include "ClientFramework/Log/ApplicationLog.h"

#include <utility>

namespace Framework::DeviceChange {

namespace {

// Holds the device mutex for one entry point, or notes that the notification is dropped.
class TryLock
{
public:
    explicit TryLock(QMutex &mutex) : m_mutex(mutex), m_locked(mutex.tryLock()) {}
    ~TryLock()
    {
        if (m_locked)
            m_mutex.unlock();
    }
    explicit operator bool() const { return m_locked; }

private:
    QMutex &m_mutex;
    bool m_locked;
};

} // namespace

Handler::Handler(IDeviceChangeSink &sink, std::unique_ptr<IPostponedTimer> timer, QObject *parent)
    : QObject(parent), m_sink(sink), m_timer(timer ? std::move(timer) : std::make_unique<QtPostponedTimer>())
{
    m_timer->timeout = [this] { onPostponedUpdate(); };
}

Handler::~Handler()
{
    m_timer->timeout = nullptr;
    m_timer->stop();
}

void Handler::log(const QString &text)
{
    ApplicationLog::instance().add(text);
}

QString Handler::noticeText(Notice notice)
{
    switch (notice) {
    case Notice::RemoveCancelled:
        return tr("A request to remove a device or piece of media has been canceled");
    case Notice::RemovePending:
        return tr("A device or piece of media is about to be removed. Cannot be denied");
    case Notice::DeviceSpecific:
        return tr("A device-specific event has occurred");
    case Notice::QueryRemove:
        return tr("Permission is requested to remove a device or piece of media. Any application can deny "
                  "this request and cancel the removal");
    case Notice::QueryConfigChange:
        return tr("Permission is requested to change the current configuration (dock or undock)");
    case Notice::ConfigChanged:
        return tr("The current configuration has changed, due to a dock or undock");
    case Notice::ConfigChangeCancelled:
        break;
    }
    return tr("A request to change the current configuration (dock or undock) has been canceled");
}

void Handler::notice(Notice n)
{
    TryLock lock(m_mutex);
    if (!lock) {
        ++m_dropped;
        return;
    }
    log(noticeText(n));
}

void Handler::deviceListChanged()
{
    log(tr("A device state has been changed"));
    log(m_sink.isValidating() ? tr("Device change through validation") : tr("Device update request"));
}

void Handler::devicesChanged()
{
    TryLock lock(m_mutex);
    if (!lock) {
        ++m_dropped;
        return;
    }
    deviceListChanged();
}

void Handler::mediumArrived(const QString &devicePath)
{
    TryLock lock(m_mutex);
    if (!lock) {
        ++m_dropped;
        return;
    }
    const QString message =
        tr("A device or piece of media has been inserted and is now available - %1").arg(devicePath);
    if (NodeCore *node = m_sink.nodeForPath(devicePath))
        queue(node, message);
    else
        log(message);
}

void Handler::mediumRemoved(const QString &devicePath)
{
    TryLock lock(m_mutex);
    if (!lock) {
        ++m_dropped;
        return;
    }
    const QString message = tr("A device or piece of media has been removed: %1").arg(devicePath);
    if (NodeCore *node = m_sink.nodeForPath(devicePath))
        queue(node, message);
    else
        log(message);
}

void Handler::handleEvent(NodeCore *node, HandleEvent event, const QString &guid)
{
    TryLock lock(m_mutex);
    if (!lock) {
        ++m_dropped;
        return;
    }
    const QString what = event == HandleEvent::LayoutChanged ? tr("Disk layout changed")
                         : event == HandleEvent::VolumeMount ? tr("Disk volume mount")
                                                             : tr("GUID: %1").arg(guid);
    const QString who = node ? tr("Device change signaled: %1").arg(m_sink.nodeName(node))
                             : tr("Unknown device change signaled");
    const QString message = tr("%1 - %2").arg(who, what);
    log(message);
    if (!node || m_sink.isBusy(node))
        return;
    queue(node, message);
}

void Handler::blockEvent(const BlockDeviceEvent &e)
{
    using Action = BlockDeviceEvent::Action;
    if (e.type == BlockDeviceEvent::Type::Partition) {
        // A partition came, went or changed: the layout of its disk changed.
        handleEvent(m_sink.nodeForPath(e.diskPath), HandleEvent::LayoutChanged);
        return;
    }
    NodeCore *node = m_sink.nodeForPath(e.devicePath);
    if (e.action == Action::Add || e.action == Action::Remove) {
        TryLock lock(m_mutex);
        if (!lock) {
            ++m_dropped;
            return;
        }
        deviceListChanged();
        if (node)
            queue(node, tr("A device or piece of media has been removed: %1").arg(e.devicePath));
        else if (e.action == Action::Add && e.mediumPresent)
            queueArrival(e.devicePath,
                         tr("A device or piece of media has been inserted and is now available - %1")
                             .arg(e.devicePath));
        return;
    }
    if (!node) {
        // A device without a node got sectors: a medium inserted, a loop device attached.
        if (e.mediumPresent) {
            TryLock lock(m_mutex);
            if (!lock) {
                ++m_dropped;
                return;
            }
            queueArrival(e.devicePath,
                         tr("A device or piece of media has been inserted and is now available - %1")
                             .arg(e.devicePath));
        }
        return;
    }
    if (!e.mediumPresent)
        mediumRemoved(e.devicePath);
    else if (e.mediaChange)
        mediumArrived(e.devicePath);
    else
        handleEvent(node, HandleEvent::LayoutChanged);
}

void Handler::queue(NodeCore *node, const QString &message)
{
    if (node && !m_pending.contains(node) && !m_sink.isUnderProcessing(node))
        m_pending.append(node);
    restartTimer(message);
}

void Handler::queueArrival(const QString &devicePath, const QString &message)
{
    if (!m_arrivals.contains(devicePath))
        m_arrivals.append(devicePath);
    restartTimer(message);
}

void Handler::restartTimer(const QString &message)
{
    m_lastMessage = message;
    m_timer->stop();
    m_timer->start(PostponeMs);
}

void Handler::onPostponedUpdate()
{
    log(tr("On postponed update timer %1").arg(m_timer->id()));
    TryLock lock(m_mutex);
    if (!lock) {
        // The window is inside another notification: try again after the next quiet period.
        m_timer->start(PostponeMs);
        return;
    }
    if (!m_lastMessage.isEmpty())
        log(std::exchange(m_lastMessage, QString()));
    m_timer->stop();
    int nodes = 0;
    while (!m_pending.isEmpty()) {
        NodeCore *node = m_pending.takeLast();
        // A node may have left the tree since it was queued (its device was removed meanwhile).
        if (!m_sink.isAlive(node) || m_sink.isUnderProcessing(node))
            continue;
        log(tr("On postponed update for: %1").arg(m_sink.nodeName(node)));
        m_sink.repopulate(node);
        ++nodes;
    }
    const QStringList arrivals = std::exchange(m_arrivals, {});
    for (const QString &path : arrivals) {
        log(tr("On postponed update for: %1").arg(path));
        m_sink.addDevice(path);
    }
    emit updated(nodes, int(arrivals.size()));
}

} // namespace Framework::DeviceChange
