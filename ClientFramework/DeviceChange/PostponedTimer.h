// The single-shot timer of the postponed device update, behind an interface so tests drive it with
// a clock of their own.
#pragma once

#include <functional>
#include <memory>

class QTimer;

namespace Framework::DeviceChange {

class IPostponedTimer
{
public:
    virtual ~IPostponedTimer() = default;
    // (Re)starts the timer: it fires once, interval milliseconds from now.
    virtual void start(int intervalMs) = 0;
    virtual void stop() = 0;
    virtual bool isActive() const = 0;
    // A number naming the timer in the log.
    virtual int id() const = 0;

    // Called when the timer fires.
    std::function<void()> timeout;
};

// The timer of the interface thread's event loop.
class QtPostponedTimer : public IPostponedTimer
{
public:
    QtPostponedTimer();
    ~QtPostponedTimer() override;
    void start(int intervalMs) override;
    void stop() override;
    bool isActive() const override;
    int id() const override;

private:
    std::unique_ptr<QTimer> m_timer;
    int m_id = 0; // the id of the last start (the timer has none once it fired)
};

} // namespace Framework::DeviceChange
