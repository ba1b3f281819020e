#include "Kernel/Implementation/Root/ThreadInit.h"

#include "Kernel/Implementation/Devices/Device.h"

#include <QMutexLocker>

Thread_Init::Thread_Init(CRoot *root, bool fullRefresh, const RefreshKinds &kinds)
    : m_root(root), m_full(fullRefresh), m_kinds(kinds)
{
}

bool Thread_Init::RequestAdd(const QString &path)
{
    QMutexLocker guard(&m_mutex);
    if (m_closed)
        return false;
    if (!m_addQueue.contains(path))
        m_addQueue.append(path);
    m_hadRequests = true;
    return true;
}

bool Thread_Init::RequestRefresh(CDevice *device)
{
    QMutexLocker guard(&m_mutex);
    if (m_closed || !device)
        return false;
    if (!m_refreshQueue.contains(device))
        m_refreshQueue.append(device);
    m_hadRequests = true;
    return true;
}

bool Thread_Init::HasRequests()
{
    QMutexLocker guard(&m_mutex);
    return !m_addQueue.isEmpty() || !m_refreshQueue.isEmpty();
}

void Thread_Init::run()
{
    bool requests = false;
    {
        QMutexLocker guard(&m_mutex);
        requests = m_hadRequests;
    }
    // Queued requests are served instead of a refresh; those that arrive during a refresh after it.
    if (!requests)
        m_root->RunRefresh(m_full, m_kinds);
    ServeRequests();
}

void Thread_Init::ServeRequests()
{
    for (;;) {
        QString path;
        CDevice *device = nullptr;
        {
            QMutexLocker guard(&m_mutex);
            if (!m_addQueue.isEmpty()) {
                path = m_addQueue.takeFirst();
            } else if (!m_refreshQueue.isEmpty()) {
                device = m_refreshQueue.takeFirst();
            } else {
                // Nothing left: close the queues under the same lock, so no request is stranded.
                m_closed = true;
                return;
            }
        }
        if (!path.isEmpty())
            m_root->AddDevice(path);
        else
            m_root->RunDeviceRefresh(device);
    }
}
