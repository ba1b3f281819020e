#include "ClientFramework/GenericError.h"

#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/Log/ApplicationLog.h"

#include <QCoreApplication>
#include <QMessageBox>

GenericError::GenericError(const QString &message, int severity)
    : m_message(message), m_severity(severity), m_utf8(message.toStdString())
{
}

void GenericError::report() const
{
    report(m_message, m_severity);
}

void GenericError::report(const QString &message, int severity)
{
    using Framework::LogEntry;
    auto &log = Framework::ApplicationLog::instance();
    switch (severity) {
    case Information:
        log.add(message);
        break;
    case Silent:
        log.add(message, LogEntry::Error);
        break;
    case Warning:
    case Notice:
        log.add(message, LogEntry::Warning);
        Framework::DialogSeam::current().message(QMessageBox::Warning,
                                                 QCoreApplication::translate("GenericError", "Warning"),
                                                 message, QMessageBox::Ok, QMessageBox::Ok);
        break;
    default:
        log.add(message, LogEntry::Error);
        Framework::DialogSeam::current().message(QMessageBox::Critical,
                                                 QCoreApplication::translate("GenericError", "Error"),
                                                 message, QMessageBox::Ok, QMessageBox::Ok);
        break;
    }
}
