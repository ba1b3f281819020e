#include "ClientFramework/Settings/SettingsDocument.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Log/ApplicationLog.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QSaveFile>
#include <QStandardPaths>
#include <QXmlStreamWriter>

namespace Framework {

namespace {
const QString RootName = QStringLiteral("settings");
}

SettingsDocument &SettingsDocument::instance()
{
    static SettingsDocument doc;
    return doc;
}

QString SettingsDocument::defaultPath()
{
    return QDir(QStandardPaths::writableLocation(QStandardPaths::AppConfigLocation))
        .filePath(Identity::SettingsFileName);
}

bool SettingsDocument::open(const QString &path)
{
    m_path = path;
    m_doc = QDomDocument();
    if (parse(true))
        return true;
    if (!create()) {
        m_doc = QDomDocument();
        m_doc.appendChild(m_doc.createElement(RootName));
        return false;
    }
    if (parse(false))
        return true;
    m_doc = QDomDocument();
    m_doc.appendChild(m_doc.createElement(RootName));
    return false;
}

bool SettingsDocument::parse(bool logSuccess)
{
    QFile file(m_path);
    if (!file.open(QIODevice::ReadOnly | QIODevice::Text))
        return false;
    QString message;
    int line = 0;
    int column = 0;
    QDomDocument doc;
    if (!doc.setContent(&file, &message, &line, &column)) {
        ApplicationLog::instance().add(QObject::tr("Error parsing settings file '%1' (Line: %2, column: %3)")
                                           .arg(m_path)
                                           .arg(line)
                                           .arg(column),
                                       LogEntry::Error);
        file.close();
        // Keep the damaged file for the user instead of losing it to the new empty one.
        const QString bad = m_path + QStringLiteral(".bad");
        QFile::remove(bad);
        QFile::copy(m_path, bad);
        return false;
    }
    if (doc.documentElement().isNull()) {
        // Well-formed but empty: treat as damaged so a root is written.
        return false;
    }
    m_doc = doc;
    if (logSuccess)
        ApplicationLog::instance().add(QObject::tr("Application settings file accessed: '%1'").arg(m_path));
    return true;
}

bool SettingsDocument::create()
{
    QDir().mkpath(QFileInfo(m_path).absolutePath());
    QSaveFile file(m_path);
    if (!file.open(QIODevice::WriteOnly | QIODevice::Text))
        return false;
    QXmlStreamWriter xml(&file);
    xml.setAutoFormatting(true);
    xml.writeStartDocument();
    xml.writeEmptyElement(RootName);
    xml.writeEndDocument();
    if (xml.hasError() || !file.commit())
        return false;
    ApplicationLog::instance().add(QObject::tr("Application settings file created: '%1'").arg(m_path));
    return true;
}

QDomElement SettingsDocument::root()
{
    QDomElement r = m_doc.documentElement();
    if (r.isNull()) {
        r = m_doc.createElement(RootName);
        m_doc.appendChild(r);
    }
    return r;
}

QDomElement SettingsDocument::element(const QString &name)
{
    return child(root(), name);
}

QDomElement SettingsDocument::child(QDomElement parent, const QString &name)
{
    QDomElement e = parent.firstChildElement(name);
    if (e.isNull()) {
        e = parent.ownerDocument().createElement(name);
        parent.appendChild(e);
    }
    return e;
}

bool SettingsDocument::save()
{
    if (!m_saving.tryAcquire())
        return false;
    bool ok = false;
    if (!m_path.isEmpty()) {
        QDir().mkpath(QFileInfo(m_path).absolutePath());
        QSaveFile file(m_path);
        if (file.open(QIODevice::WriteOnly | QIODevice::Text)) {
            file.write(m_doc.toByteArray(2));
            ok = file.commit();
        }
    }
    m_saving.release();
    return ok;
}

} // namespace Framework
