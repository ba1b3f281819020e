// Refuses a second running instance through a named shared-memory segment held for the whole run.
#pragma once

#include <QSharedMemory>
#include <QString>

namespace Framework {

class SingleInstanceGuard
{
public:
    static inline const QString DefaultKey = QStringLiteral("bd8f56ba-4ba8-4f89-ae32-af2eccddf9fd");
    static constexpr int SegmentSize = 1024;

    explicit SingleInstanceGuard(const QString &key = DefaultKey);
    ~SingleInstanceGuard();
    SingleInstanceGuard(const SingleInstanceGuard &) = delete;
    SingleInstanceGuard &operator=(const SingleInstanceGuard &) = delete;

    // Creates the segment. False when it exists already: another instance is running.
    bool acquire();
    bool isHeld() const { return m_memory.isAttached(); }
    void release();

private:
    QSharedMemory m_memory;
};

} // namespace Framework
