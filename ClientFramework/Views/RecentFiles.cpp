#include "ClientFramework/Views/RecentFiles.h"

#include "ClientFramework/Settings/SettingsDocument.h"

#include <QDir>

namespace Framework {

namespace {
const QString FileTag = QStringLiteral("file");

bool samePath(const QString &a, const QString &b)
{
    return QDir::cleanPath(a) == QDir::cleanPath(b);
}
} // namespace

void RecentFiles::add(const QString &path)
{
    if (path.isEmpty())
        return;
    const QString clean = QDir::cleanPath(path);
    m_files.removeIf([&](const QString &f) { return samePath(f, clean); });
    m_files.prepend(clean);
    while (m_files.size() > MaxFiles)
        m_files.removeLast();
    emit changed();
}

void RecentFiles::remove(const QString &path)
{
    if (m_files.removeIf([&](const QString &f) { return samePath(f, path); }) > 0)
        emit changed();
}

void RecentFiles::clear()
{
    if (m_files.isEmpty())
        return;
    m_files.clear();
    emit changed();
}

void RecentFiles::save(QDomElement &element, bool flush)
{
    while (!element.firstChildElement(FileTag).isNull())
        element.removeChild(element.firstChildElement(FileTag));
    QDomDocument doc = element.ownerDocument();
    for (const QString &f : std::as_const(m_files)) {
        QDomElement e = doc.createElement(FileTag);
        e.appendChild(doc.createTextNode(f));
        element.appendChild(e);
    }
    if (flush)
        SettingsDocument::instance().save();
}

void RecentFiles::load(const QDomElement &element)
{
    QStringList files;
    for (QDomElement e = element.firstChildElement(FileTag); !e.isNull(); e = e.nextSiblingElement(FileTag)) {
        const QString f = e.text().trimmed();
        if (!f.isEmpty() && files.size() < MaxFiles &&
            std::none_of(files.cbegin(), files.cend(), [&](const QString &g) { return samePath(f, g); }))
            files << QDir::cleanPath(f);
    }
    m_files = files;
    emit changed();
}

} // namespace Framework
