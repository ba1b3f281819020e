// The progress tag of a worker thread: a progress text and a state, both guarded by the tag's
// mutex, a done/total pair for progress bars, and a cancel request the worker polls.
#pragma once

#include <QMutex>
#include <QString>

#include <atomic>
#include <cstdint>

namespace Threads {

class Tag
{
public:
    enum class State : int {
        Idle = 0,     // not started
        Running = 1,  // the worker runs
        Finished = 2, // the worker ended normally
        Cancelled = 3 // the worker ended after a cancel request
    };

    Tag() = default;
    virtual ~Tag() = default;
    Tag(const Tag &) = delete;
    Tag &operator=(const Tag &) = delete;

    // The tag's mutex: the text and the state are only read and written under it.
    QMutex &mutex() const { return m_mutex; }

    QString text() const;
    void setText(const QString &text);

    State state() const;
    // -> Running (a cancel requested before the start stays in force).
    void start();
    // -> Idle with the cancel request cleared, for a tag used again.
    void reset();
    // Running -> Finished, or Cancelled when a cancel was requested meanwhile.
    void finish();
    // Requests the worker to stop; it sees the request through isCancelled().
    void cancel() { m_cancel.store(true, std::memory_order_relaxed); }
    bool isCancelled() const { return m_cancel.load(std::memory_order_relaxed); }
    bool isRunning() const { return state() == State::Running; }
    bool isDone() const
    {
        const State s = state();
        return s == State::Finished || s == State::Cancelled;
    }

    // Progress counters (any unit the worker chooses).
    void setProgress(std::uint64_t done, std::uint64_t total);
    std::uint64_t done() const { return m_done.load(std::memory_order_relaxed); }
    std::uint64_t total() const { return m_total.load(std::memory_order_relaxed); }

private:
    mutable QMutex m_mutex;
    QString m_text;
    State m_state = State::Idle;
    std::atomic<bool> m_cancel{false};
    std::atomic<std::uint64_t> m_done{0};
    std::atomic<std::uint64_t> m_total{0};
};

} // namespace Threads
