// One entry of the application log: time of creation, text, attribute bits and child entries.
#pragma once

#include <QList>
#include <QString>
#include <QTime>

#include <cstdint>

namespace Framework {

class LogEntry
{
public:
    enum Attribute : uint32_t {
        None = 0,
        Warning = 0x2,
        Error = 0x4,
        Query = 0x8,
        Successful = 0x10,
        Authentication = 0x100, // shown as both "Authentication" and "Hidden"
        Hidden = 0x100,
        Child = 0x40,
        Network = 0x800,
    };

    LogEntry(const QString &text, uint32_t attributes, LogEntry *parent = nullptr);
    ~LogEntry();
    LogEntry(const LogEntry &) = delete;
    LogEntry &operator=(const LogEntry &) = delete;

    const QTime &time() const { return m_time; }
    const QString &text() const { return m_text; }
    uint32_t attributes() const { return m_attributes; }
    LogEntry *parent() const { return m_parent; }
    const QList<LogEntry *> &children() const { return m_children; }

    // Long labels ("Query Error") and short codes ("QRY ERR") of the attribute bits.
    QString labels() const { return labels(m_attributes); }
    QString codes() const { return codes(m_attributes); }
    static QString labels(uint32_t attributes);
    static QString codes(uint32_t attributes);

    // The line written to the log file (without line break).
    QString line() const;

private:
    friend class ApplicationLog;
    void appendChild(LogEntry *child) { m_children.append(child); }

    QTime m_time;
    QString m_text;
    uint32_t m_attributes;
    LogEntry *m_parent;
    QList<LogEntry *> m_children;
    int m_shownChildren = 0; // children announced to the log's model (interface thread)
};

} // namespace Framework
