// Worker threads and their tags: state changes, cancellation seen by the worker, progress text
// written by the worker while the interface thread reads it.
#include "ClientFramework/Threads/Generic.h"
#include "ClientFramework/Threads/Tag.h"

#include <QCoreApplication>
#include <QSignalSpy>

#include <gtest/gtest.h>

#include <atomic>

namespace {

// Counts until cancelled or until `limit`, writing its progress text on the way.
class Counter : public Threads::Generic
{
public:
    explicit Counter(std::uint64_t limit) : m_limit(limit) {}
    ~Counter() override
    {
        cancel();
        wait();
    }
    std::atomic<std::uint64_t> reached{0};
    std::atomic<bool> running{false};

protected:
    bool work() override
    {
        running = true;
        for (std::uint64_t i = 0; i < m_limit; ++i) {
            if (cancelled())
                return false;
            if (i % 1000 == 0)
                tag().setText(QStringLiteral("Step %1").arg(i));
            tag().setProgress(i + 1, m_limit);
            reached = i + 1;
        }
        return true;
    }

private:
    std::uint64_t m_limit;
};

} // namespace

TEST(ThreadTag, StatesAndCancel)
{
    Threads::Tag tag;
    EXPECT_EQ(tag.state(), Threads::Tag::State::Idle);
    tag.start();
    EXPECT_TRUE(tag.isRunning());
    tag.finish();
    EXPECT_EQ(tag.state(), Threads::Tag::State::Finished);
    EXPECT_TRUE(tag.isDone());
    // A cancel requested before the start stays in force.
    tag.reset();
    tag.cancel();
    tag.start();
    EXPECT_TRUE(tag.isCancelled());
    tag.finish();
    EXPECT_EQ(tag.state(), Threads::Tag::State::Cancelled);
    tag.reset();
    EXPECT_FALSE(tag.isCancelled());
    EXPECT_EQ(tag.done(), 0u);
}

TEST(ThreadTag, GenericWorkRunsToItsEnd)
{
    Counter counter(20000);
    QSignalSpy done(&counter, &Threads::Generic::workDone);
    counter.start();
    // The interface thread reads the text while the worker writes it.
    while (!counter.isFinished()) {
        const QString text = counter.tag().text();
        EXPECT_TRUE(text.isEmpty() || text.startsWith("Step ")) << text.toStdString();
        QThread::yieldCurrentThread();
    }
    ASSERT_TRUE(counter.wait(30000));
    EXPECT_EQ(counter.reached.load(), 20000u);
    EXPECT_EQ(counter.tag().state(), Threads::Tag::State::Finished);
    EXPECT_EQ(counter.tag().done(), counter.tag().total());
    ASSERT_EQ(done.size(), 1);
    EXPECT_TRUE(done[0][0].toBool());
    EXPECT_FALSE(done[0][1].toBool());
}

TEST(ThreadTag, CancelStopsTheWork)
{
    Counter counter(std::uint64_t(1) << 40);
    QSignalSpy done(&counter, &Threads::Generic::workDone);
    counter.start();
    while (!counter.running)
        QThread::yieldCurrentThread();
    counter.cancel();
    ASSERT_TRUE(counter.wait(30000));
    EXPECT_LT(counter.reached.load(), std::uint64_t(1) << 40);
    EXPECT_EQ(counter.tag().state(), Threads::Tag::State::Cancelled);
    ASSERT_EQ(done.size(), 1);
    EXPECT_FALSE(done[0][0].toBool());
    EXPECT_TRUE(done[0][1].toBool());
}
