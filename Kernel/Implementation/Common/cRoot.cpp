#include "Kernel/Implementation/Common/cRoot.h"

cRoot::cRoot(QObject *parent) : QObject(parent)
{
    RegisterMetaTypes();
}

cRoot::~cRoot() = default;

void cRoot::EmitDebug(const QString &file, uint32_t line, uint32_t level, const QString &text)
{
    emit kernelDebug(_event_debug{file, line, level, text});
}

void cRoot::EmitInternal(const QString &text)
{
    emit kernelInternal(_event_internal{text});
}

void cRoot::EmitPlatform(uint32_t operation, const QString &name, uint64_t position, uint64_t block,
                         uint32_t error)
{
    emit kernelPlatform(_event_platform{operation, name, position, block, error});
}

void cRoot::EmitStorage(CDevice *device, uint32_t code, uint8_t flag)
{
    emit kernelStorage(_event_storage{device, code, flag});
}

void cRoot::EmitProgress(const _event_progress &progress)
{
    emit kernelProgress(progress);
}

void cRoot::RegisterMetaTypes()
{
    qRegisterMetaType<_event_debug>();
    qRegisterMetaType<_event_internal>();
    qRegisterMetaType<_event_platform>();
    qRegisterMetaType<_event_storage>();
    qRegisterMetaType<_event_volume>();
    qRegisterMetaType<_event_volumelocking>();
    qRegisterMetaType<_event_action>();
    qRegisterMetaType<_event_string>();
    qRegisterMetaType<_event_progress>();
    qRegisterMetaType<_event_finddata>();
    qRegisterMetaType<_event_scanvolume>();
    qRegisterMetaType<_event_erasedevice>();
    qRegisterMetaType<_event_erasefreespace>();
    qRegisterMetaType<_event_recoverentries>();
    qRegisterMetaType<_event_recoverpartitions>();
    qRegisterMetaType<_event_searchentry>();
    qRegisterMetaType<_event_createimage>();
    qRegisterMetaType<_event_checkimage>();
    qRegisterMetaType<_event_scandevice>();
    qRegisterMetaType<_event_resizevolume>();
    qRegisterMetaType<_event_checkreadable>();
}
