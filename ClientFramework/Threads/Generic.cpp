#include "ClientFramework/Threads/Generic.h"

namespace Threads {

Generic::Generic(QObject *parent) : QThread(parent) {}

Generic::~Generic()
{
    // A thread object is never destroyed under a running worker.
    m_tag.cancel();
    wait();
}

void Generic::run()
{
    m_tag.start();
    const bool ok = work();
    m_tag.finish();
    emit workDone(ok, m_tag.isCancelled());
}

} // namespace Threads
