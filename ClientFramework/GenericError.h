// The exception that ends a user action on the interface side; its severity decides how it is shown.
#pragma once

#include <QString>

#include <exception>
#include <string>

class GenericError : public std::exception
{
public:
    // How the error is reported: 0 an "Error" box, 2 and 4 a "Warning" box, 3 a log entry only
    // (as an error), 5 a log entry only (informational). 1 is shown like 0.
    enum Severity : int {
        Critical = 0,
        Error = 1,
        Warning = 2,
        Silent = 3,
        Notice = 4,
        Information = 5,
    };

    explicit GenericError(const QString &message, int severity = Critical);

    const QString &message() const { return m_message; }
    int severity() const { return m_severity; }
    const char *what() const noexcept override { return m_utf8.c_str(); }

    // Shows and logs the error as its severity says (through the dialog seam and the application log).
    void report() const;
    static void report(const QString &message, int severity);

private:
    QString m_message;
    int m_severity;
    std::string m_utf8;
};
