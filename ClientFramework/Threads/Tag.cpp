#include "ClientFramework/Threads/Tag.h"

#include <QMutexLocker>

namespace Threads {

QString Tag::text() const
{
    QMutexLocker lock(&m_mutex);
    return m_text;
}

void Tag::setText(const QString &text)
{
    QMutexLocker lock(&m_mutex);
    m_text = text;
}

Tag::State Tag::state() const
{
    QMutexLocker lock(&m_mutex);
    return m_state;
}

void Tag::start()
{
    QMutexLocker lock(&m_mutex);
    m_state = State::Running;
}

void Tag::reset()
{
    QMutexLocker lock(&m_mutex);
    m_cancel.store(false, std::memory_order_relaxed);
    m_state = State::Idle;
    m_done.store(0, std::memory_order_relaxed);
    m_total.store(0, std::memory_order_relaxed);
}

void Tag::finish()
{
    QMutexLocker lock(&m_mutex);
    m_state = isCancelled() ? State::Cancelled : State::Finished;
}

void Tag::setProgress(std::uint64_t done, std::uint64_t total)
{
    m_total.store(total, std::memory_order_relaxed);
    m_done.store(done, std::memory_order_relaxed);
}

} // namespace Threads
