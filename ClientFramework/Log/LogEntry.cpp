#include "ClientFramework/Log/LogEntry.h"

#include <QCoreApplication>

namespace Framework {

LogEntry::LogEntry(const QString &text, uint32_t attributes, LogEntry *parent)
    : m_time(QTime::currentTime()), m_text(text), m_attributes(attributes), m_parent(parent)
{
}

LogEntry::~LogEntry()
{
    qDeleteAll(m_children);
}

namespace {

struct Label
{
    const char *longText;
    const char *code;
};

// The labels of the set bits in the order Query, Network, Authentication, Hidden, child blank, then the
// single outcome (Successful before Error before Warning); the final character is dropped.
QString build(uint32_t a, bool longForm)
{
    auto pick = [longForm](const Label &l) { return QString::fromLatin1(longForm ? l.longText : l.code); };
    QString s;
    if (a & LogEntry::Query)
        s += pick({"Query ", "QRY "});
    if (a & LogEntry::Network)
        s += pick({"Network ", "NET "});
    if (a & LogEntry::Authentication) {
        s += pick({"Authentication ", "AUTH "});
        s += pick({"Hidden ", "H "});
    }
    if (a & LogEntry::Child)
        s += QLatin1Char(' ');
    if (a & LogEntry::Successful)
        s += pick({"Successful ", "OK "});
    else if (a & LogEntry::Error)
        s += pick({"Error ", "ERR "});
    else if (a & LogEntry::Warning)
        s += pick({"Warning ", "WRN "});
    s.chop(1);
    return s;
}

} // namespace

QString LogEntry::labels(uint32_t attributes)
{
    return build(attributes, true);
}

QString LogEntry::codes(uint32_t attributes)
{
    return build(attributes, false);
}

QString LogEntry::line() const
{
    if (m_parent && (m_attributes & Child))
        return QString(15, QLatin1Char(' ')) + QLatin1Char(' ') + m_text;
    return m_time.toString(QStringLiteral("hh:mm:ss")).leftJustified(8) + QLatin1Char(' ') +
           codes().leftJustified(6) + QLatin1Char(' ') + m_text;
}

} // namespace Framework
