// The base of worker threads that do generic long work (the hex editor's block transfers and
// searches): a QThread with a progress tag. Subclasses implement work(); the tag is started
// before and finished after it, and finished() is emitted by QThread as usual. A subclass
// whose work() uses its own members stops and waits for the worker in its own destructor.
#pragma once

#include "ClientFramework/Threads/Tag.h"

#include <QThread>

namespace Threads {

class Generic : public QThread
{
    Q_OBJECT
public:
    explicit Generic(QObject *parent = nullptr);
    ~Generic() override;

    Tag &tag() { return m_tag; }
    const Tag &tag() const { return m_tag; }

    // Requests the work to stop; work() polls cancelled().
    void cancel() { m_tag.cancel(); }
    bool cancelled() const { return m_tag.isCancelled(); }

signals:
    // Emitted from the worker after work() returned; success is work()'s result.
    void workDone(bool success, bool cancelled);

protected:
    // The work itself, on the worker thread. Returns success.
    virtual bool work() = 0;
    void run() override;

private:
    Tag m_tag;
};

} // namespace Threads
