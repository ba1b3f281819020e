// The disk kernel's single root object: the ordered list of storage devices, the kernel-wide
// settings that lower layers read, and the storage events through which devices arrive and leave.
#pragma once

#include "Kernel/Implementation/Common/DeviceInfo.h"
#include "Kernel/Implementation/Common/cRoot.h"

#include <QList>
#include <QMutex>
#include <QString>
#include <QStringList>

#include <atomic>
#include <cstdint>
#include <functional>
#include <memory>

class CDevice;
struct DeviceLayout;
class Thread_Init;
class IEnumerationSource;

// Which kinds of device a refresh keeps and adds.
struct RefreshKinds
{
    bool floppy = true;        // media type 1
    bool fixed = true;         // media type 2
    bool removable = true;     // media type 3
    bool optical = true;       // media type 4
    bool unknown = true;       // media type 0
    bool volumeBacked = true;  // source 3
    bool removeImages = false; // image-backed devices are removed too
};

class CRoot : public cRoot
{
    Q_OBJECT
public:
    // A root over the platform's own back end and device enumeration.
    explicit CRoot(QObject *parent = nullptr);
    // A root over a chosen back end and enumeration source (tests); neither is owned, both must
    // outlive the root. A null source stands for the platform's enumeration.
    CRoot(IPlatformBackend *backend, IEnumerationSource *source, QObject *parent = nullptr);
    ~CRoot() override;

    IPlatformBackend &Backend() override;
    IEnumerationSource &EnumerationSource();

    // Attempts of a device or volume transfer: returns the old value, sets newValue unless it is 0.
    uint8_t RetryCount(uint8_t newValue = 0) override;

    // The ordered device list.
    virtual uint32_t GetDeviceCount();
    virtual CDevice *GetDevice(uint32_t index);
    // A copy of the list taken under the device-list mutex.
    QList<CDevice *> Devices();
    // The device of that identity, or null.
    CDevice *FindDevice(uint16_t number, EnumSource source, uint8_t sub);
    // The device whose platform path equals path (case-insensitively), or null.
    CDevice *FindDeviceByPath(const QString &path);

    // Identifies the device at path and adds it to the list (event 1). Accepts "\\.\X:",
    // "\\.\PhysicalDriveN", "\\.\CDRomN" and the platform's own device paths ("/dev/sdb",
    // "/dev/loop3"). Returns the device (owned by the root), or null when the path names a known
    // device, is refused, or has no sectors. Thread_Init::RequestAdd does the same asynchronously.
    virtual CDevice *AddDevice(const QString &path);

    // Takes ownership of a device built elsewhere (an image-backed device), inserts it in device
    // order and announces it. False (and nothing owned) for null or a device already listed.
    virtual bool AddImageDevice(CDevice *device);
    // Takes the device out of the list, announces its removal and destroys it once the
    // announcement has been delivered. False when it is not listed.
    virtual bool RemoveDevice(CDevice *device);

    // Storage event emission with the announced-flag and category rules.
    virtual void StorageEvent(CDevice *device, uint32_t code, uint8_t flag = 0);
    // Whether the device has been announced (event 1 went out and event 4 not yet).
    bool IsAnnounced(const CDevice *device);

    // Enumeration: starts a refresh on the enumeration thread unless one is running (false then).
    bool Refresh(bool full = false, const RefreshKinds &kinds = RefreshKinds());
    // Runs a refresh and waits for its end, delivering the queued events of this thread meanwhile.
    // Safe from the root's own thread without a running event loop (the command-line tool).
    bool RefreshAndWait(bool full = false, const RefreshKinds &kinds = RefreshKinds(),
                        unsigned long timeoutMs = 300000);
    // Waits for the enumeration thread to finish its work and delivers queued events.
    bool WaitForEnumeration(unsigned long timeoutMs = 300000);
    bool IsEnumerating();
    // True once a refresh pass has completed.
    bool HasRefreshed() const { return m_refreshed; }
    // Queues a path to be identified and added on the enumeration thread (started when idle).
    bool RequestAdd(const QString &path);
    // Queues a known device to be identified again on the enumeration thread: events 2 and 3
    // around it, and a device whose medium or geometry changed is replaced (events 4 and 1); the
    // same medium (or an image) keeps its device and has its partition tables read again.
    bool RequestDeviceRefresh(CDevice *device);

    // The number of the first assembled dynamic volume (physical drive numbers stay below it).
    static constexpr uint16_t DynamicVolumeFirstNumber = 0xE000;

    // The attribute bits that follow from a descriptor and the device's partition style.
    static uint32_t BaseAttributes(const DeviceInfo &info, PartStyle style);

    // The 64-bit order key of a device: number, source, sub, then media type and rank.
    static uint64_t SortKey(const CDevice *device);
    static uint64_t SortKey(uint16_t number, EnumSource source, uint8_t sub, uint32_t mediaType,
                            uint32_t rank);

    // Kernel-wide settings.
    uint16_t CategoryMask() const { return m_categoryMask; }
    void SetCategoryMask(uint16_t mask) { m_categoryMask = mask; }
    void SetTuning(uint16_t first, uint16_t second, uint16_t third);
    uint16_t Tuning(int index) const; // index 0..2
    QString PlatformText() const { return m_platformText; }
    void SetLimits(uint32_t first, uint32_t second);
    uint32_t Limit(int index) const; // index 0..1
    // Returns the old value; sets newValue unless it is 0.
    uint64_t Value64(uint64_t newValue = 0);
    // Returns the old value; sets newValue only when it is printable (0x20..0x7E).
    uint8_t FillCharacter(uint8_t newValue);
    uint8_t Flag(int index) const; // index 0..1
    void SetFlag(int index, uint8_t value);

    QMutex &DeviceListMutex() { return m_listMutex; }
    QMutex &SecondMutex() { return m_secondMutex; }

protected:
    friend class Thread_Init;

    // Inserts in device order under the device-list mutex, then announces (event 1).
    void InsertDevice(CDevice *device);
    // Takes out under the device-list mutex, announces (event 4) and retires the device. A device
    // assembled from it (a dynamic volume listing it among its members) is taken out first, so no
    // assembled device outlives a member it reads through.
    bool TakeDevice(CDevice *device);
    // Assembles the dynamic volumes of the listed disks of every logical-disk-manager disk group as
    // virtual devices (partition style 6, media type 7) numbered from DynamicVolumeFirstNumber and
    // adds those not yet listed (same number, source and sub).
    void AssembleDynamicVolumes();
    // One refresh pass (run by the enumeration thread): close all handles, enumerate, remove what
    // vanished or is excluded, add what appeared; events 0 and 5 around it.
    void RunRefresh(bool full, const RefreshKinds &kinds);
    // Identifies a known device again; one whose medium or geometry changed is replaced. The same
    // medium keeps its device; its partition tables are read again and a changed layout replaces
    // the partitions and volumes in place (ReplaceLayout).
    void RunDeviceRefresh(CDevice *device);
    // Reads the device's tables again with the platform facts of `fresh`; a layout other than the
    // one it holds replaces it (ReplaceLayout), otherwise event 3 alone goes out.
    void RefreshLayout(CDevice *device, const DeviceInfo &fresh);
    // On the root's thread, in one delivery: the device's volumes leave (code 4), the layout is
    // swapped in, event 3 with flag 1 goes out, the new volumes arrive (code 1), and the previous
    // partitions and volumes are destroyed after every listener has let go of them.
    void ReplaceLayout(CDevice *device, std::unique_ptr<DeviceLayout> layout);
    // Whether a refresh with these kinds keeps a device (kept) or adds a descriptor (!kept).
    static bool IsIncluded(const DeviceInfo &info, bool full, const RefreshKinds &kinds, bool kept);
    // Whether a fresh descriptor describes the same medium as a known device.
    static bool SameMedium(const DeviceInfo &known, const DeviceInfo &fresh);
    // Builds a device object from a descriptor (virtual so tests can build light ones).
    virtual CDevice *MakeDevice(const DeviceInfo &info);
    // The platform path a device was opened on.
    static QString DevicePath(const CDevice *device);

private:
    void DestroyRetired();
    Thread_Init *EnsureThread(bool full, const RefreshKinds &kinds);
    bool QueueRequest(const std::function<bool(Thread_Init *)> &enqueue);

    IPlatformBackend *m_backend = nullptr;
    IEnumerationSource *m_source = nullptr;
    std::unique_ptr<IEnumerationSource> m_ownSource;

    uint16_t m_categoryMask = 1;
    uint16_t m_tuning[3] = {100, 5, 100};
    QString m_platformText;
    uint8_t m_retryCount = 2;
    uint32_t m_limits[2] = {0xFFFFFFFF, 0};
    uint64_t m_value64 = 2048;
    uint8_t m_fillCharacter = '~';
    uint8_t m_flags[2] = {0, 1};

    QList<CDevice *> m_devices;
    std::shared_ptr<Thread_Init> m_thread;
    QMutex m_threadMutex; // guards m_thread
    std::atomic<bool> m_refreshed{false};
    QMutex m_listMutex;
    QMutex m_secondMutex;

    QMutex m_eventMutex;        // the announced flags of the devices and the retired list
    QList<CDevice *> m_retired; // removed devices awaiting destruction
};
