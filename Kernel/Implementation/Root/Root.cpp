#include "Kernel/Implementation/Root/Root.h"

#include "Kernel/Implementation/Common/RootEnumSource.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Devices/LdmAssembly.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/PlatformOps.h"
#include "Kernel/Implementation/Root/RootEnumerate.h"
#include "Kernel/Implementation/Root/ThreadInit.h"

#include <QCoreApplication>
#include <QMutexLocker>
#include <QThread>

CRoot::CRoot(QObject *parent) : CRoot(nullptr, nullptr, parent) {}

CRoot::CRoot(IPlatformBackend *backend, IEnumerationSource *source, QObject *parent)
    : cRoot(parent), m_backend(backend ? backend : &DefaultPlatformBackend()), m_source(source)
{
    if (!m_source) {
        m_ownSource = MakePlatformEnumerationSource();
        m_source = m_ownSource.get();
    }
    m_platformText = SystemVersionText(this);
}

CRoot::~CRoot()
{
    {
        QMutexLocker guard(&m_threadMutex);
        if (m_thread) {
            m_thread->wait();
            m_thread.reset();
        }
    }
    DestroyRetired();
    QList<CDevice *> devices;
    {
        QMutexLocker guard(&m_listMutex);
        devices.swap(m_devices);
    }
    // Last first, so devices assembled from others go before their members.
    for (qsizetype i = devices.size() - 1; i >= 0; --i)
        delete devices[i];
}

IPlatformBackend &CRoot::Backend()
{
    return *m_backend;
}

IEnumerationSource &CRoot::EnumerationSource()
{
    return *m_source;
}

uint8_t CRoot::RetryCount(uint8_t newValue)
{
    uint8_t old = m_retryCount;
    if (newValue != 0)
        m_retryCount = newValue;
    return old;
}

uint32_t CRoot::GetDeviceCount()
{
    QMutexLocker guard(&m_listMutex);
    return uint32_t(m_devices.size());
}

CDevice *CRoot::GetDevice(uint32_t index)
{
    QMutexLocker guard(&m_listMutex);
    return index < uint32_t(m_devices.size()) ? m_devices[index] : nullptr;
}

QList<CDevice *> CRoot::Devices()
{
    QMutexLocker guard(&m_listMutex);
    return m_devices;
}

CDevice *CRoot::FindDevice(uint16_t number, EnumSource source, uint8_t sub)
{
    QMutexLocker guard(&m_listMutex);
    for (CDevice *d : std::as_const(m_devices)) {
        const DeviceInfo &info = d->GetDescriptor();
        if (info.number == number && info.source == source && info.sub == sub)
            return d;
    }
    return nullptr;
}

QString CRoot::DevicePath(const CDevice *device)
{
    if (!device)
        return {};
    CPlatformFile *handle = device->GetHandle();
    return handle ? handle->GetName() : QString();
}

CDevice *CRoot::FindDeviceByPath(const QString &path)
{
    if (path.isEmpty())
        return nullptr;
    QMutexLocker guard(&m_listMutex);
    for (CDevice *d : std::as_const(m_devices)) {
        if (DevicePath(d).compare(path, Qt::CaseInsensitive) == 0)
            return d;
        uint8_t source = 0;
        uint16_t number = 0;
        QStringList files;
        if (d->GetImageIdentity(source, number, files)) {
            for (const QString &f : std::as_const(files)) {
                if (f.compare(path, Qt::CaseInsensitive) == 0)
                    return d;
            }
        }
    }
    return nullptr;
}

CDevice *CRoot::AddDevice(const QString &path)
{
    if (FindDeviceByPath(path))
        return nullptr;
    EnumCandidate candidate;
    if (!m_source->Resolve(path, candidate))
        return nullptr;
    // One device at a time: the enumeration thread adds under the same mutex.
    QMutexLocker serial(&m_secondMutex);
    if (FindDevice(candidate.number, candidate.source, 0) || FindDeviceByPath(candidate.path))
        return nullptr;
    CEnumerator enumerator(this, *m_source);
    DeviceInfo info;
    if (!enumerator.IdentifyWithVolumes(candidate, info))
        return nullptr;
    if (info.totalSectors == 0) {
        delete info.handle;
        return nullptr;
    }
    CDevice *device = MakeDevice(info);
    if (!device)
        return nullptr;
    InsertDevice(device);
    return device;
}

bool CRoot::AddImageDevice(CDevice *device)
{
    if (!device)
        return false;
    {
        QMutexLocker guard(&m_listMutex);
        if (m_devices.contains(device))
            return false;
    }
    InsertDevice(device);
    return true;
}

bool CRoot::RemoveDevice(CDevice *device)
{
    return TakeDevice(device);
}

uint64_t CRoot::SortKey(uint16_t number, EnumSource source, uint8_t sub, uint32_t mediaType, uint32_t rank)
{
    uint64_t high = (uint64_t(mediaType) + rank) & 0xFFFFFFFFull;
    return uint64_t(number) | (uint64_t(static_cast<uint8_t>(source)) << 16) | (uint64_t(sub) << 24) |
           (high << 32);
}

uint64_t CRoot::SortKey(const CDevice *device)
{
    const DeviceInfo &info = device->GetDescriptor();
    uint32_t rank = 0;
    if (info.partStyle == PartStyle::VirtualManager)
        rank = 3;
    else if (device->GetRaidIdentity())
        rank = 2;
    else if (info.sub != 0)
        rank = 1;
    return SortKey(info.number, info.source, info.sub, static_cast<uint32_t>(info.mediaType), rank);
}

void CRoot::InsertDevice(CDevice *device)
{
    {
        QMutexLocker guard(&m_listMutex);
        uint64_t key = SortKey(device);
        qsizetype at = m_devices.size();
        for (qsizetype i = 0; i < m_devices.size(); ++i) {
            if (SortKey(m_devices[i]) > key) {
                at = i;
                break;
            }
        }
        m_devices.insert(at, device);
    }
    StorageEvent(device, _event_storage::DeviceAdded);
}

bool CRoot::TakeDevice(CDevice *device)
{
    QList<CDevice *> assembled;
    {
        QMutexLocker guard(&m_listMutex);
        if (!m_devices.contains(device))
            return false;
        for (CDevice *d : std::as_const(m_devices))
            if (d != device && d->Members().contains(device))
                assembled.append(d);
    }
    // Retired in this order, destroyed in this order: the assembled devices before their member.
    for (CDevice *d : std::as_const(assembled))
        TakeDevice(d);
    {
        QMutexLocker guard(&m_listMutex);
        if (!m_devices.removeOne(device))
            return false;
    }
    StorageEvent(device, _event_storage::DeviceRemoved);
    // The device is destroyed on the root's thread after its removal has been delivered there:
    // queued after that delivery, and destroying this device only (a device taken out later may
    // still have its removal waiting in the queue).
    {
        QMutexLocker guard(&m_eventMutex);
        m_retired.append(device);
    }
    QMetaObject::invokeMethod(
        this,
        [this, device] {
            bool retired = false;
            {
                QMutexLocker guard(&m_eventMutex);
                retired = m_retired.removeOne(device);
            }
            if (retired)
                delete device;
        },
        Qt::QueuedConnection);
    return true;
}

void CRoot::DestroyRetired()
{
    QList<CDevice *> retired;
    {
        QMutexLocker guard(&m_eventMutex);
        retired.swap(m_retired);
    }
    for (CDevice *d : std::as_const(retired))
        delete d;
}

uint32_t CRoot::BaseAttributes(const DeviceInfo &info, PartStyle style)
{
    using namespace DeviceAttribute;
    uint32_t flags = 0;
    switch (info.mediaType) {
    case MediaType::Floppy:
        flags |= Floppy;
        break;
    case MediaType::CdRom:
        flags |= CdDvd;
        break;
    case MediaType::Removable:
        flags |= Removable;
        break;
    case MediaType::Fixed:
        flags |= Fixed;
        break;
    default:
        break;
    }
    if (info.source == EnumSource::VolumeBacked)
        flags |= Virtual;
    if (info.sub != 0)
        flags |= DiskImage;
    if (info.rotation == Rotation::SolidState)
        flags |= Ssd;
    if (!info.ready)
        flags |= NotReady;
    else if (style == PartStyle::Raw && info.sub == 0)
        flags |= NotInitialized;
    for (const VolumeInfo &v : info.volumes) {
        if (v.mountPoint == QLatin1String("/"))
            flags |= System;
    }
    return flags;
}

CDevice *CRoot::MakeDevice(const DeviceInfo &info)
{
    CDevice *device = new CDevice(this, info);
    device->SetAttributes(device->GetAttributes() | BaseAttributes(info, device->GetPartStyle()));
    return device;
}

void CRoot::AssembleDynamicVolumes()
{
    QList<CDevice *> disks;
    for (CDevice *d : Devices())
        if (d->GetPartStyle() != PartStyle::VirtualManager)
            disks.append(d);
    const QList<CDevice *> made = LdmAssembly::AssembleDevices(
        this, disks, DynamicVolumeFirstNumber, [this](const QString &text) { EmitInternal(text); },
        [this](uint16_t number) { return FindDevice(number, EnumSource::PhysicalDrive, 0) != nullptr; });
    for (CDevice *d : made)
        InsertDevice(d);
}

bool CRoot::IsAnnounced(const CDevice *device)
{
    QMutexLocker guard(&m_eventMutex);
    return device && device->GetAnnounced();
}

void CRoot::StorageEvent(CDevice *device, uint32_t code, uint8_t flag)
{
    // Every device of this kernel is local storage (category 0).
    const int category = 0;
    if (device) {
        QMutexLocker guard(&m_eventMutex);
        uint8_t announced = device->GetAnnounced();
        switch (code) {
        case _event_storage::DeviceAdded:
            if (announced)
                return;
            device->SetAnnounced(1);
            break;
        case _event_storage::ChangeStarted:
        case _event_storage::ChangeCompleted:
            if (!announced)
                return;
            break;
        case _event_storage::DeviceRemoved:
            if (!announced)
                return;
            device->SetAnnounced(0);
            break;
        default:
            break;
        }
    }
    if (!(m_categoryMask & (1u << category)))
        return;
    const _event_storage event{device, code, flag};
    // The device's volumes arrive right after it and leave right before it, in one delivery.
    QList<_event_volume> volumes;
    if (device && (code == _event_storage::DeviceAdded || code == _event_storage::DeviceRemoved))
        device->ForEachVolume([&volumes, device, code](CPartition *partition, CVolume *volume) {
            volumes.append(_event_volume{device, partition, volume, code});
        });
    auto deliver = [this, event, volumes] {
        if (event.code == _event_storage::DeviceRemoved)
            for (const _event_volume &v : volumes)
                emit kernelVolume(v);
        emit kernelStorage(event);
        if (event.code == _event_storage::DeviceAdded)
            for (const _event_volume &v : volumes)
                emit kernelVolume(v);
    };
    if (QThread::currentThread() == thread())
        deliver();
    else
        QMetaObject::invokeMethod(this, deliver, Qt::QueuedConnection);
}

Thread_Init *CRoot::EnsureThread(bool full, const RefreshKinds &kinds)
{
    // Called with m_threadMutex held: a thread that is running is kept, a finished one replaced.
    if (m_thread && !m_thread->isFinished() && m_thread->isRunning())
        return nullptr;
    if (m_thread)
        m_thread->wait();
    // A waiter may still hold the old thread; it goes when the last holder lets go.
    m_thread = std::make_shared<Thread_Init>(this, full, kinds);
    return m_thread.get();
}

bool CRoot::Refresh(bool full, const RefreshKinds &kinds)
{
    QMutexLocker guard(&m_threadMutex);
    Thread_Init *thread = EnsureThread(full, kinds);
    if (!thread)
        return false;
    thread->start(QThread::InheritPriority);
    return true;
}

bool CRoot::QueueRequest(const std::function<bool(Thread_Init *)> &enqueue)
{
    QMutexLocker guard(&m_threadMutex);
    if (m_thread && m_thread->isRunning() && enqueue(m_thread.get()))
        return true;
    // No thread, a finished one, or one on its way out: a new thread serves the request.
    if (m_thread)
        m_thread->wait();
    m_thread = std::make_shared<Thread_Init>(this, false, RefreshKinds());
    if (!enqueue(m_thread.get()))
        return false;
    m_thread->start(QThread::InheritPriority);
    return true;
}

bool CRoot::RequestAdd(const QString &path)
{
    return QueueRequest([&path](Thread_Init *t) { return t->RequestAdd(path); });
}

bool CRoot::RequestDeviceRefresh(CDevice *device)
{
    if (!device)
        return false;
    return QueueRequest([device](Thread_Init *t) { return t->RequestRefresh(device); });
}

bool CRoot::IsEnumerating()
{
    QMutexLocker guard(&m_threadMutex);
    return m_thread && m_thread->isRunning();
}

bool CRoot::WaitForEnumeration(unsigned long timeoutMs)
{
    std::shared_ptr<Thread_Init> thread;
    {
        QMutexLocker guard(&m_threadMutex);
        thread = m_thread;
    }
    bool finished = true;
    if (thread) {
        const bool ownThread = QThread::currentThread() == this->thread() && QCoreApplication::instance();
        unsigned long waited = 0;
        finished = false;
        while (waited <= timeoutMs) {
            if (thread->wait(20)) {
                finished = true;
                break;
            }
            waited += 20;
            // Queued events of the worker reach this thread while it waits.
            if (ownThread)
                QCoreApplication::processEvents();
        }
    }
    if (QThread::currentThread() == this->thread() && QCoreApplication::instance())
        QCoreApplication::sendPostedEvents(this);
    return finished;
}

bool CRoot::RefreshAndWait(bool full, const RefreshKinds &kinds, unsigned long timeoutMs)
{
    // A refresh already running counts as this one once it has finished.
    if (!Refresh(full, kinds)) {
        if (!WaitForEnumeration(timeoutMs))
            return false;
        if (!Refresh(full, kinds))
            return false;
    }
    return WaitForEnumeration(timeoutMs);
}

void CRoot::SetTuning(uint16_t first, uint16_t second, uint16_t third)
{
    m_tuning[0] = first;
    m_tuning[1] = second;
    m_tuning[2] = third;
}

uint16_t CRoot::Tuning(int index) const
{
    return index >= 0 && index < 3 ? m_tuning[index] : 0;
}

void CRoot::SetLimits(uint32_t first, uint32_t second)
{
    m_limits[0] = first;
    m_limits[1] = second;
}

uint32_t CRoot::Limit(int index) const
{
    return index >= 0 && index < 2 ? m_limits[index] : 0;
}

uint64_t CRoot::Value64(uint64_t newValue)
{
    uint64_t old = m_value64;
    if (newValue != 0)
        m_value64 = newValue;
    return old;
}

uint8_t CRoot::FillCharacter(uint8_t newValue)
{
    uint8_t old = m_fillCharacter;
    if (newValue >= 0x20 && newValue <= 0x7E)
        m_fillCharacter = newValue;
    return old;
}

uint8_t CRoot::Flag(int index) const
{
    return index >= 0 && index < 2 ? m_flags[index] : 0;
}

void CRoot::SetFlag(int index, uint8_t value)
{
    if (index >= 0 && index < 2)
        m_flags[index] = value;
}
