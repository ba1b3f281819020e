// The recently used disk-image files, newest first, kept in the settings element "recent-files".
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"

#include <QObject>
#include <QStringList>

namespace Framework {

class RecentFiles : public QObject, public IPersistenceXML
{
    Q_OBJECT
public:
    static inline const QString SettingsElement = QStringLiteral("recent-files");
    static constexpr int MaxFiles = 10;

    explicit RecentFiles(QObject *parent = nullptr) : QObject(parent) {}

    const QStringList &files() const { return m_files; }
    // Puts the file first (moving it when listed already; the oldest leaves beyond MaxFiles).
    void add(const QString &path);
    void remove(const QString &path);
    void clear();

    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

signals:
    void changed();

private:
    QStringList m_files;
};

} // namespace Framework
