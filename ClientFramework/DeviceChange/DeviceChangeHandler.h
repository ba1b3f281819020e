// Turns the platform's device-change notifications, after a quiet period, into refreshes of the
// affected nodes. Notifications that only inform are logged. A medium arriving or leaving and a
// changed disk layout queue the device's node in the pending list (once) and restart the postponed
// timer; when it fires, the pending nodes are re-populated from the kernel, newest first, skipping
// nodes a process works on. Every entry point runs under a try-lock of the device mutex: a
// notification that arrives while the mutex is held is dropped.
#pragma once

#include "ClientFramework/DeviceChange/DeviceChangeSink.h"
#include "ClientFramework/DeviceChange/PostponedTimer.h"
#include "Kernel/Implementation/Platform/Linux/UdevMonitor.h"

#include <QList>
#include <QMutex>
#include <QObject>
#include <QStringList>

#include <memory>

namespace Framework::DeviceChange {

class Handler : public QObject
{
    Q_OBJECT
public:
    static constexpr int PostponeMs = 5000;

    // Notifications that only inform.
    enum class Notice {
        RemoveCancelled,
        RemovePending,
        DeviceSpecific,
        QueryRemove,
        QueryConfigChange,
        ConfigChanged,
        ConfigChangeCancelled,
    };
    // Events of a registered device handle.
    enum class HandleEvent { LayoutChanged, VolumeMount, Other };

    // The timer defaults to the event loop's.
    explicit Handler(IDeviceChangeSink &sink, std::unique_ptr<IPostponedTimer> timer = nullptr,
                     QObject *parent = nullptr);
    ~Handler() override;

    static QString noticeText(Notice notice);

    // Informational notification: logged, nothing else.
    void notice(Notice notice);
    // The platform's device list changed.
    void devicesChanged();
    // A medium arrived at or left a device (the drive letter's device on other platforms).
    void mediumArrived(const QString &devicePath);
    void mediumRemoved(const QString &devicePath);
    // An event on a device handle the window registered: its node, or nullptr when unknown.
    void handleEvent(NodeCore *node, HandleEvent event, const QString &guid = QString());
    // A block-device notification of the platform monitor, mapped onto the cases above: a disk added
    // or removed changes the device list (and the disk is added or its node re-populated); a disk
    // whose medium came or went is an arrival or removal; a disk or partition that changed
    // otherwise is a layout change of its disk.
    void blockEvent(const BlockDeviceEvent &event);

    // The timer's work (public for tests that drive it directly).
    void onPostponedUpdate();

    const QList<NodeCore *> &pending() const { return m_pending; }
    const QStringList &pendingArrivals() const { return m_arrivals; }
    bool isTimerActive() const { return m_timer->isActive(); }
    QMutex &deviceMutex() { return m_mutex; }
    // Notifications dropped because the mutex was held.
    int dropped() const { return m_dropped; }

signals:
    // A refresh pass ran (tests and the status bar).
    void updated(int nodes, int arrivals);

private:
    void log(const QString &text);
    void queue(NodeCore *node, const QString &message);
    void queueArrival(const QString &devicePath, const QString &message);
    void restartTimer(const QString &message);
    void deviceListChanged();

    IDeviceChangeSink &m_sink;
    std::unique_ptr<IPostponedTimer> m_timer;
    QMutex m_mutex;
    QList<NodeCore *> m_pending;
    QStringList m_arrivals;
    QString m_lastMessage;
    int m_dropped = 0;
};

} // namespace Framework::DeviceChange
