// A minimal kernel root for tests: it records every debug, internal, platform and storage signal
// it emits, has a settable retry count and may hand out another platform back end (a scripted one).
#pragma once

#include "Kernel/Implementation/Common/cRoot.h"
#include "Kernel/Implementation/Platform/PlatformBackend.h"

#include <QList>
#include <QObject>

class TestRoot : public cRoot
{
public:
    explicit TestRoot(IPlatformBackend *backend = nullptr) : m_backend(backend)
    {
        QObject::connect(this, &cRoot::kernelDebug, this, [this](const _event_debug &e) { debug.append(e); });
        QObject::connect(this, &cRoot::kernelInternal, this,
                         [this](const _event_internal &e) { internal.append(e); });
        QObject::connect(this, &cRoot::kernelPlatform, this,
                         [this](const _event_platform &e) { platform.append(e); });
        QObject::connect(this, &cRoot::kernelStorage, this,
                         [this](const _event_storage &e) { storage.append(e); });
    }

    uint8_t RetryCount(uint8_t newValue = 0) override
    {
        const uint8_t old = retries;
        if (newValue)
            retries = newValue;
        return old;
    }

    IPlatformBackend &Backend() override { return m_backend ? *m_backend : cRoot::Backend(); }
    void SetBackend(IPlatformBackend *backend) { m_backend = backend; }

    void ClearRecords()
    {
        debug.clear();
        internal.clear();
        platform.clear();
        storage.clear();
    }

    // The texts of the internal messages, in order.
    QStringList InternalTexts() const
    {
        QStringList texts;
        for (const auto &e : internal)
            texts << e.text;
        return texts;
    }

    uint8_t retries = 2;
    QList<_event_debug> debug;
    QList<_event_internal> internal;
    QList<_event_platform> platform;
    QList<_event_storage> storage;

private:
    IPlatformBackend *m_backend = nullptr;
};
