#include "ClientFramework/SingleInstanceGuard.h"

#include <QCryptographicHash>
#include <QDir>

namespace Framework {

QString SingleInstanceGuard::userKey(const QString &base, const QProcessEnvironment &environment)
{
    QString folder = environment.value(QStringLiteral("XDG_CONFIG_HOME"));
    if (folder.isEmpty() && !environment.value(QStringLiteral("HOME")).isEmpty())
        folder = environment.value(QStringLiteral("HOME")) + QStringLiteral("/.config");
    if (folder.isEmpty())
        return base;
    const QByteArray hash = QCryptographicHash::hash(QDir::cleanPath(QDir(folder).absolutePath()).toUtf8(),
                                                     QCryptographicHash::Sha1);
    return base + QLatin1Char('-') + QString::fromLatin1(hash.toHex().left(16));
}

SingleInstanceGuard::SingleInstanceGuard(const QString &key) : m_memory(key) {}

SingleInstanceGuard::~SingleInstanceGuard()
{
    release();
}

bool SingleInstanceGuard::acquire()
{
    if (m_memory.isAttached())
        return true;
    if (m_memory.create(SegmentSize, QSharedMemory::ReadWrite))
        return true;
    if (m_memory.error() != QSharedMemory::AlreadyExists)
        return true; // no segment can be made at all: do not keep the program from starting
    // A process that crashed leaves its segment behind with nobody attached. Attaching and detaching
    // removes such a segment (the last detach destroys it); one of a running instance stays.
    {
        QSharedMemory probe(m_memory.key());
        if (probe.attach())
            probe.detach();
    }
    return m_memory.create(SegmentSize, QSharedMemory::ReadWrite);
}

void SingleInstanceGuard::release()
{
    if (m_memory.isAttached())
        m_memory.detach();
}

} // namespace Framework
