// The settings file: one XML document with a `settings` root and one child element per component,
// parsed whole at start-up and kept for the whole run.
#pragma once

#include <QDomDocument>
#include <QSemaphore>
#include <QString>

namespace Framework {

class SettingsDocument
{
public:
    // The process-wide document.
    static SettingsDocument &instance();

    // The per-user location: the configuration folder and "settings-brindle.xml".
    static QString defaultPath();

    // Opens and parses the file; a file that is missing, unreadable or not well-formed is replaced
    // by a new one with an empty root (a damaged file is kept beside it with ".bad" appended).
    // Logs what happened. Returns false only when no file could be written either (the run then
    // goes on with an empty document in memory).
    bool open(const QString &path);

    QString path() const { return m_path; }
    QDomDocument &document() { return m_doc; }
    QDomElement root();

    // The element of a component below the root, created when missing.
    QDomElement element(const QString &name);
    // A child element of any element, created when missing.
    static QDomElement child(QDomElement parent, const QString &name);

    // Writes the document to its file. Returns false when it could not be written or when a save
    // is already running.
    bool save();

private:
    bool parse(bool logSuccess);
    bool create();

    QString m_path;
    QDomDocument m_doc;
    QSemaphore m_saving{1};
};

} // namespace Framework
