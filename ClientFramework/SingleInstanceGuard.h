// Refuses a second running instance through a named shared-memory segment held for the whole run.
// An instance is one per configuration folder: the settings file and the log an instance owns live
// there, so a run with a configuration folder of its own (a test's) does not meet the user's.
#pragma once

#include <QProcessEnvironment>
#include <QSharedMemory>
#include <QString>

namespace Framework {

class SingleInstanceGuard
{
public:
    static inline const QString DefaultKey = QStringLiteral("bd8f56ba-4ba8-4f89-ae32-af2eccddf9fd");
    static constexpr int SegmentSize = 1024;

    // The key of the instance of this configuration folder: XDG_CONFIG_HOME, else HOME's
    // ".config"; the base key alone when neither is known.
    static QString userKey(const QString &base = DefaultKey,
                           const QProcessEnvironment &environment = QProcessEnvironment::systemEnvironment());

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
