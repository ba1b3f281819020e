#include "SingleInstanceGuard.h"

namespace Framework {

SingleInstanceGuard::SingleInstanceGuard(const QString &key) : m_memory(key) {}

SingleInstanceGuard::~SingleInstanceGuard()
{
    release();
}

bool SingleInstanceGuard::acquire()
{
    if (m_memory.isAttached())
        return true;
    if (m_memory.create(SegmentSize, QSharedMemory::ReadWrite))
        return true;
    if (m_memory.error() != QSharedMemory::AlreadyExists)
        return true; // no segment can be made at all: do not keep the program from starting
    // A process that crashed leaves its segment behind with nobody attached. Attaching and detaching
    // removes such a segment (the last detach destroys it); one of a running instance stays.
    {
        QSharedMemory probe(m_memory.key());
        if (probe.attach())
            probe.detach();
    }
    return m_memory.create(SegmentSize, QSharedMemory::ReadWrite);
}

void SingleInstanceGuard::release()
{
    if (m_memory.isAttached())
        m_memory.detach();
}

} // namespace Framework
