// Reads what the application log recorded after a point in a test.
#pragma once

#include "ClientFramework/Log/ApplicationLog.h"

#include <QStringList>

// Texts of the entries added to the log after construction (top-level entries only).
class LogWatch
{
public:
    LogWatch()
    {
        m_start = Framework::ApplicationLog::instance().rowCount();
        m_errors = Framework::ApplicationLog::instance().errorCount();
    }
    QStringList texts() const
    {
        auto &log = Framework::ApplicationLog::instance();
        QStringList r;
        for (int i = m_start; i < log.rowCount(); ++i)
            r << log.index(i, Framework::ApplicationLog::MessageColumn).data().toString();
        return r;
    }
    int newErrors() const { return Framework::ApplicationLog::instance().errorCount() - m_errors; }

private:
    int m_start;
    int m_errors;
};
