// The application log: one process-wide list of entries, shown by the log view as an item model and
// written line by line to the log file.
#pragma once

#include "ClientFramework/Log/LogEntry.h"
#include "ClientFramework/Settings/PersistenceXML.h"

#include <QAbstractItemModel>
#include <QFile>
#include <QList>
#include <QRecursiveMutex>

namespace Framework {

class ApplicationLog : public QAbstractItemModel, public IPersistenceXML
{
    Q_OBJECT
public:
    // Options in the "attr" attribute of the "log" settings element.
    enum Option : uint32_t {
        DetailMaximum = 0x1, // without it hidden entries stay out of the file
        CreateNew = 0x20,    // truncate the file at start instead of appending
        UseNamePattern = 0x80,
    };
    static constexpr uint32_t DefaultOptions = DetailMaximum;
    static inline const QString DefaultPattern =
        QStringLiteral("AppLog-{Date(YYYY-MM-DD)}_{Time(HHmmss)}.log");

    enum Column { EventColumn = 0, MessageColumn = 1, ColumnCount = 2 };

    // Created on first use (which must be on the interface thread) and kept until exit.
    static ApplicationLog &instance();

    // Adds an entry (any thread). The returned entry stays valid until clear().
    LogEntry *add(const QString &text, uint32_t outcome = LogEntry::None, uint32_t attributes = 0);
    // Adds a child entry below parent (carries the child bit).
    LogEntry *addChild(LogEntry *parent, const QString &text, uint32_t outcome = LogEntry::None,
                       uint32_t attributes = 0);

    // The entries in memory as the file shows them, children after their parent (hidden entries
    // only at the maximum detail level).
    QStringList lines() const;

    // Removes every entry from memory (the file keeps what was written).
    void clear();

    // Closes the current file and continues in another (a full path); logs the change.
    void setFile(const QString &path);
    // Opens the file (when not yet open and a name is known) and writes the start banner.
    void start();
    // Writes the closing banner and closes the file.
    void close();
    // The full path the log writes to (empty before start()).
    QString filePath() const;
    bool isFileOpen() const;

    // Values of the command line for this run only: clear the file at start, or use another file.
    void overrideForRun(bool clearLog, const QString &logPath);

    // Number of error and warning entries since the process began.
    int errorCount() const;
    int warningCount() const;

    // The banner lines (without the leading empty line and the line break).
    static QString startBanner(const QString &dateTime);
    static QString closeBanner();

    // IPersistenceXML over the "log" element.
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

    uint32_t options() const { return m_options; }
    QString storedFileName() const { return m_fileName; }
    QString storedFolder() const { return m_folder; }

    // QAbstractItemModel
    QModelIndex index(int row, int column, const QModelIndex &parent = {}) const override;
    QModelIndex parent(const QModelIndex &child) const override;
    int rowCount(const QModelIndex &parent = {}) const override;
    int columnCount(const QModelIndex &parent = {}) const override;
    QVariant data(const QModelIndex &index, int role = Qt::DisplayRole) const override;
    QVariant headerData(int section, Qt::Orientation orientation, int role = Qt::DisplayRole) const override;

signals:
    void entryAdded(const QString &text, uint32_t attributes);

private:
    ApplicationLog();
    LogEntry *append(LogEntry *parent, const QString &text, uint32_t attributes);
    void writeEntry(const LogEntry *entry);
    void writeRaw(const QString &text);
    void publish();
    QString resolvedPath() const;

    mutable QRecursiveMutex m_mutex;
    QList<LogEntry *> m_entries;
    QList<LogEntry *> m_dirty; // parents whose new children the model has not announced (nullptr: top)
    bool m_publishQueued = false;
    int m_shownTop = 0;
    int m_errors = 0;
    int m_warnings = 0;

    QFile m_file;
    // Lines logged while no file is open, written when one opens (the first ones, up to a bound).
    static constexpr int MaxPendingLines = 4096;
    QStringList m_pendingLines;
    uint32_t m_options = DefaultOptions;
    QString m_fileName;
    QString m_folder;
    QString m_pattern = DefaultPattern;
    bool m_runClear = false;
    QString m_runPath;
};

} // namespace Framework
