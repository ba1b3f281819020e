// The kernel root's abstract interface: the kernel's signals and what lower layers read from the root.
#pragma once

#include "Kernel/Implementation/Common/KernelEvents.h"

#include <QObject>
#include <QString>

#include <cstdint>

class IPlatformBackend;

class cRoot : public QObject
{
    Q_OBJECT
public:
    explicit cRoot(QObject *parent = nullptr);
    ~cRoot() override;

    // Attempts of a device or volume transfer. Returns the old value; sets newValue unless it is 0.
    virtual uint8_t RetryCount(uint8_t newValue = 0) = 0;

    // The platform back end used by the handles of this root.
    virtual IPlatformBackend &Backend();

    // Helper emitters of the three record signals.
    void EmitDebug(const QString &file, uint32_t line, uint32_t level, const QString &text);
    void EmitInternal(const QString &text);
    void EmitPlatform(uint32_t operation, const QString &name, uint64_t position, uint64_t block,
                      uint32_t error);
    void EmitStorage(CDevice *device, uint32_t code, uint8_t flag = 0);
    void EmitProgress(const _event_progress &progress);

    // Registers every payload type with the meta-type system (done by the constructor; idempotent).
    static void RegisterMetaTypes();

signals:
    void kernelDebug(const _event_debug &event);
    void kernelInternal(const _event_internal &event);
    void kernelPlatform(const _event_platform &event);
    void kernelStorage(const _event_storage &event);
    // Volumes of announced devices arriving and leaving (see `_event_volume`).
    void kernelVolume(const _event_volume &event);
    void kernelVolumeLocking(const _event_volumelocking &event);
    void kernelAction(_event_action &event);
    void kernelString(_event_string &event);
    void kernelProgress(const _event_progress &event);
    void kernelFindData(_event_finddata &event);
    void kernelScanVolume(const _event_scanvolume &event);
    void kernelEraseDevice(const _event_erasedevice &event);
    void kernelEraseFreeSpace(const _event_erasefreespace &event);
    void kernelRecoverEntries(const _event_recoverentries &event);
    void kernelRecoverPartitions(const _event_recoverpartitions &event);
    void kernelSearchEntry(const _event_searchentry &event);
    void kernelCreateImage(const _event_createimage &event);
    void kernelCheckImage(const _event_checkimage &event);
    void kernelScanDevice(const _event_scandevice &event);
    void kernelResizeVolume(const _event_resizevolume &event);
    void kernelCheckReadable(const _event_checkreadable &event);
};

// Trace from kernel code: KERNEL_DEBUG(root, level, text) records the source file and line.
#define KERNEL_DEBUG(root, level, text)                                                                      \
    do {                                                                                                     \
        if (root)                                                                                            \
            (root)->EmitDebug(QStringLiteral(__FILE__), __LINE__, (level), (text));                          \
    } while (0)
