#include "Kernel/Implementation/Platform/Linux/UdevMonitor.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSocketNotifier>
#include <QTimer>

#include <libudev.h>

QString BlockDeviceEvent::actionName(Action action)
{
    switch (action) {
    case Action::Add:
        return QStringLiteral("add");
    case Action::Remove:
        return QStringLiteral("remove");
    case Action::Change:
        break;
    }
    return QStringLiteral("change");
}

std::unique_ptr<IBlockDeviceMonitor> CreateBlockDeviceMonitor(QObject *parent)
{
    return std::make_unique<UdevMonitor>(parent);
}

UdevMonitor::UdevMonitor(QObject *parent) : IBlockDeviceMonitor(parent)
{
    qRegisterMetaType<BlockDeviceEvent>();
    m_udev = udev_new();
    if (!m_udev)
        return;
    // Without udevd its socket never speaks: read the kernel's announcements directly then.
    m_source = QFileInfo::exists(QStringLiteral("/run/udev/control")) ? QStringLiteral("udev")
                                                                      : QStringLiteral("kernel");
    m_monitor = udev_monitor_new_from_netlink(m_udev, m_source.toLatin1().constData());
    if (m_monitor && (udev_monitor_filter_add_match_subsystem_devtype(m_monitor, "block", nullptr) < 0 ||
                      udev_monitor_enable_receiving(m_monitor) < 0)) {
        udev_monitor_unref(m_monitor);
        m_monitor = nullptr;
    }
    if (!m_monitor)
        return;
    m_notifier = new QSocketNotifier(udev_monitor_get_fd(m_monitor), QSocketNotifier::Read, this);
    connect(m_notifier, &QSocketNotifier::activated, this, &UdevMonitor::receive);
    pollLoopDevices(); // the flags as they are now: only a later change counts
    m_loopPoll = new QTimer(this);
    connect(m_loopPoll, &QTimer::timeout, this, &UdevMonitor::pollLoopDevices);
    m_loopPoll->start(LoopPollMs);
}

void UdevMonitor::pollLoopDevices()
{
    const QStringList names =
        QDir(QStringLiteral("/sys/block"))
            .entryList({QStringLiteral("loop*")}, QDir::Dirs | QDir::NoDotAndDotDot | QDir::System);
    QHash<QString, bool> now;
    for (const QString &name : names) {
        QFile flag(QStringLiteral("/sys/block/%1/loop/autoclear").arg(name));
        if (!flag.open(QIODevice::ReadOnly))
            continue; // not attached
        now.insert(QStringLiteral("/dev/") + name, flag.readAll().trimmed() == "1");
    }
    const bool first = m_autoClear.isEmpty() && !m_loopPoll;
    for (auto it = now.cbegin(); it != now.cend(); ++it) {
        if (first || !it.value() || m_autoClear.value(it.key(), true))
            continue;
        BlockDeviceEvent e;
        e.action = BlockDeviceEvent::Action::Change;
        e.devicePath = e.diskPath = it.key();
        e.mediumPresent = false;
        emit blockEvent(e);
    }
    m_autoClear = now;
}

UdevMonitor::~UdevMonitor()
{
    delete m_notifier;
    if (m_monitor)
        udev_monitor_unref(m_monitor);
    if (m_udev)
        udev_unref(m_udev);
}

namespace {

QString text(const char *s)
{
    return s ? QString::fromLocal8Bit(s) : QString();
}

} // namespace

void UdevMonitor::receive()
{
    // The socket is non-blocking: take every queued event, then wait for the next wake-up.
    for (int guard = 0; guard < 256; ++guard) {
        udev_device *dev = udev_monitor_receive_device(m_monitor);
        if (!dev)
            return;
        const QString action = text(udev_device_get_action(dev));
        const QString devtype = text(udev_device_get_devtype(dev));
        const QString node = text(udev_device_get_devnode(dev));
        BlockDeviceEvent e;
        bool known = !node.isEmpty();
        if (action == QLatin1String("add"))
            e.action = BlockDeviceEvent::Action::Add;
        else if (action == QLatin1String("remove"))
            e.action = BlockDeviceEvent::Action::Remove;
        else if (action == QLatin1String("change"))
            e.action = BlockDeviceEvent::Action::Change;
        else
            known = false;
        if (devtype == QLatin1String("disk"))
            e.type = BlockDeviceEvent::Type::Disk;
        else if (devtype == QLatin1String("partition"))
            e.type = BlockDeviceEvent::Type::Partition;
        else
            known = false;
        if (known) {
            e.devicePath = node;
            e.diskPath = node;
            if (e.type == BlockDeviceEvent::Type::Partition) {
                udev_device *disk = udev_device_get_parent_with_subsystem_devtype(dev, "block", "disk");
                if (disk) // owned by dev
                    e.diskPath = text(udev_device_get_devnode(disk));
            }
            if (e.action != BlockDeviceEvent::Action::Remove) {
                bool ok = false;
                const qulonglong sectors =
                    text(udev_device_get_sysattr_value(dev, "size")).trimmed().toULongLong(&ok);
                e.mediumPresent = ok && sectors > 0;
            }
            e.mediaChange =
                text(udev_device_get_property_value(dev, "DISK_MEDIA_CHANGE")) == QLatin1String("1") ||
                text(udev_device_get_property_value(dev, "DISK_EJECT_REQUEST")) == QLatin1String("1");
        }
        udev_device_unref(dev);
        if (known && !e.diskPath.isEmpty())
            emit blockEvent(e);
    }
}
