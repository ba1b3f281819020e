// Block-device notifications of the platform: a disk or partition added, removed or changed
// (a medium inserted or ejected, a partition table re-read, a loop device attached or detached).
// On Linux they come from a libudev monitor of the block subsystem, read on the thread that owns the
// monitor through its event loop. The interface keeps libudev out of every other file.
#pragma once

#include <QHash>
#include <QMetaType>
#include <QObject>
#include <QString>

#include <memory>

struct BlockDeviceEvent
{
    enum class Action { Add, Remove, Change };
    enum class Type { Disk, Partition };

    Action action = Action::Change;
    Type type = Type::Disk;
    QString devicePath;         // "/dev/sdb", "/dev/sdb1", "/dev/loop3"
    QString diskPath;           // the whole disk: the device itself, or the disk that holds the partition
    bool mediumPresent = false; // the device reports sectors
    bool mediaChange = false;   // the kernel announced a media change (DISK_MEDIA_CHANGE)

    static QString actionName(Action action);
};
Q_DECLARE_METATYPE(BlockDeviceEvent)

class IBlockDeviceMonitor : public QObject
{
    Q_OBJECT
public:
    using QObject::QObject;
    ~IBlockDeviceMonitor() override = default;
    // Whether notifications are being received.
    virtual bool isActive() const = 0;

signals:
    void blockEvent(const BlockDeviceEvent &event);
};

// The platform's monitor (the libudev one on Linux). Reads events from udevd when it runs, else the
// kernel's own announcements; isActive() is false when neither can be opened.
std::unique_ptr<IBlockDeviceMonitor> CreateBlockDeviceMonitor(QObject *parent = nullptr);

class UdevMonitor : public IBlockDeviceMonitor
{
    Q_OBJECT
public:
    explicit UdevMonitor(QObject *parent = nullptr);
    ~UdevMonitor() override;
    bool isActive() const override { return m_monitor != nullptr; }
    // "udev" or "kernel": the source read.
    QString source() const { return m_source; }

    // Loop devices detached while this process holds them open stay attached until the last close;
    // the kernel announces nothing then. A poll of their auto-clear flag reports them as a medium
    // that left.
    static constexpr int LoopPollMs = 2000;
    void pollLoopDevices();

private:
    void receive();

    struct udev *m_udev = nullptr;
    struct udev_monitor *m_monitor = nullptr;
    class QSocketNotifier *m_notifier = nullptr;
    QString m_source;
    class QTimer *m_loopPoll = nullptr;
    QHash<QString, bool> m_autoClear; // loop device path -> auto-clear flag last seen
};
