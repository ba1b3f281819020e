// The enumeration worker: a refresh of the root's device list, or the requests queued on it
// (paths to add, devices to look at again).
#pragma once

#include "Kernel/Implementation/Root/Root.h"

#include <QMutex>
#include <QStringList>
#include <QThread>

class CDevice;
class CRoot;

class Thread_Init : public QThread
{
    Q_OBJECT
public:
    Thread_Init(CRoot *root, bool fullRefresh, const RefreshKinds &kinds);

    // Queues a path to identify and add. False when the thread has finished its work and takes no
    // more requests (a new thread must serve them).
    bool RequestAdd(const QString &path);
    // Queues a known device to be identified again; a changed device is replaced. False as above.
    bool RequestRefresh(CDevice *device);
    // True while requests are waiting.
    bool HasRequests();

    bool FullRefresh() const { return m_full; }
    const RefreshKinds &Kinds() const { return m_kinds; }

protected:
    void run() override;

private:
    void RunRefresh();
    void ServeRequests();

    CRoot *m_root;
    bool m_full;
    RefreshKinds m_kinds;
    QMutex m_mutex;
    QStringList m_addQueue;
    QList<CDevice *> m_refreshQueue;
    bool m_hadRequests = false; // requests were queued before the run began
    bool m_closed = false;      // the run is over: no more requests
};
