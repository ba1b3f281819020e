#include "ClientFramework/DeviceChange/PostponedTimer.h"

#include <QTimer>

namespace Framework::DeviceChange {

QtPostponedTimer::QtPostponedTimer() : m_timer(std::make_unique<QTimer>())
{
    m_timer->setSingleShot(true);
    QObject::connect(m_timer.get(), &QTimer::timeout, [this] {
        if (timeout)
            timeout();
    });
}

QtPostponedTimer::~QtPostponedTimer() = default;

void QtPostponedTimer::start(int intervalMs)
{
    m_timer->stop();
    m_timer->start(intervalMs);
    m_id = m_timer->timerId();
}

void QtPostponedTimer::stop()
{
    m_timer->stop();
}

bool QtPostponedTimer::isActive() const
{
    return m_timer->isActive();
}

int QtPostponedTimer::id() const
{
    return m_id;
}

} // namespace Framework::DeviceChange
