#include "ClientFramework/Log/ApplicationLog.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Log/NameTags.h"
#include "ClientFramework/Settings/PathMacros.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QBrush>
#include <QCoreApplication>
#include <QDateTime>
#include <QDir>
#include <QFileInfo>
#include <QLocale>
#include <QThread>

namespace Framework {

ApplicationLog &ApplicationLog::instance()
{
    static ApplicationLog *log = new ApplicationLog; // never destroyed before exit
    return *log;
}

ApplicationLog::ApplicationLog() : m_fileName(Identity::LogFileName), m_folder(PathMacros::DefaultLogFolder)
{
}

LogEntry *ApplicationLog::add(const QString &text, uint32_t outcome, uint32_t attributes)
{
    return append(nullptr, text, outcome | attributes);
}

LogEntry *ApplicationLog::addChild(LogEntry *parent, const QString &text, uint32_t outcome,
                                   uint32_t attributes)
{
    return append(parent, text, outcome | attributes | LogEntry::Child);
}

LogEntry *ApplicationLog::append(LogEntry *parent, const QString &text, uint32_t attributes)
{
    QMutexLocker lock(&m_mutex);
    auto *entry = new LogEntry(text, attributes, parent);
    if (parent)
        parent->appendChild(entry);
    else
        m_entries.append(entry);
    if (!(attributes & LogEntry::Successful)) {
        if (attributes & LogEntry::Error)
            ++m_errors;
        else if (attributes & LogEntry::Warning)
            ++m_warnings;
    }
    writeEntry(entry);
    if (!m_dirty.contains(parent))
        m_dirty.append(parent);
    const bool here = QThread::currentThread() == thread();
    if (here) {
        publish();
    } else if (!m_publishQueued) {
        m_publishQueued = true;
        QMetaObject::invokeMethod(this, &ApplicationLog::publish, Qt::QueuedConnection);
    }
    lock.unlock();
    emit entryAdded(text, attributes);
    return entry;
}

void ApplicationLog::publish()
{
    QMutexLocker lock(&m_mutex);
    m_publishQueued = false;
    // Top-level rows first: a parent is always announced before its children.
    const QList<LogEntry *> dirty = std::exchange(m_dirty, {});
    if (dirty.contains(nullptr) && m_entries.size() > m_shownTop) {
        beginInsertRows({}, m_shownTop, int(m_entries.size()) - 1);
        m_shownTop = int(m_entries.size());
        endInsertRows();
    }
    for (LogEntry *p : dirty) {
        if (!p || p->m_children.size() <= p->m_shownChildren)
            continue;
        const QList<LogEntry *> &siblings = p->m_parent ? p->m_parent->m_children : m_entries;
        const int row = int(siblings.indexOf(p));
        const int shown = p->m_parent ? p->m_parent->m_shownChildren : m_shownTop;
        if (row < 0 || row >= shown) {
            m_dirty.append(p); // the parent itself is announced later; its children follow it
            continue;
        }
        beginInsertRows(createIndex(row, 0, p), p->m_shownChildren, int(p->m_children.size()) - 1);
        p->m_shownChildren = int(p->m_children.size());
        endInsertRows();
    }
}

void ApplicationLog::clear()
{
    if (QThread::currentThread() != thread()) {
        QMetaObject::invokeMethod(this, &ApplicationLog::clear, Qt::BlockingQueuedConnection);
        return;
    }
    QMutexLocker lock(&m_mutex);
    beginResetModel();
    qDeleteAll(m_entries);
    m_entries.clear();
    m_dirty.clear();
    m_shownTop = 0;
    endResetModel();
}

QString ApplicationLog::startBanner(const QString &dateTime)
{
    return QStringLiteral("  Application Log Started ").rightJustified(100, QLatin1Char('-')) + dateTime;
}

QString ApplicationLog::closeBanner()
{
    return QStringLiteral("  Application Log Closed").rightJustified(100, QLatin1Char('-'));
}

QString ApplicationLog::resolvedPath() const
{
    if (!m_runPath.isEmpty())
        return QDir::toNativeSeparators(m_runPath);
    const QString name = (m_options & UseNamePattern) ? NameTags::expand(m_pattern) : m_fileName;
    if (name.isEmpty())
        return {};
    return QDir::toNativeSeparators(QDir(PathMacros::resolve(m_folder)).filePath(name));
}

void ApplicationLog::start()
{
    QMutexLocker lock(&m_mutex);
    if (m_file.isOpen())
        return;
    const QString path = resolvedPath();
    if (path.isEmpty())
        return;
    m_file.setFileName(path);
    QDir().mkpath(QFileInfo(path).absolutePath());
    const bool createNew = (m_options & CreateNew) || m_runClear;
    QIODevice::OpenMode mode = QIODevice::WriteOnly | QIODevice::Text;
    mode |= (QFileInfo::exists(path) && !createNew) ? QIODevice::Append : QIODevice::Truncate;
    if (!m_file.open(mode))
        return; // the log stays in memory only
    const QStringList pending = std::exchange(m_pendingLines, {});
    writeRaw(QStringLiteral("\n") +
             startBanner(QLocale::system().toString(QDateTime::currentDateTime(), QLocale::LongFormat)) +
             QLatin1Char('\n'));
    for (const QString &line : pending)
        writeRaw(line + QLatin1Char('\n'));
}

void ApplicationLog::close()
{
    QMutexLocker lock(&m_mutex);
    if (!m_file.isOpen())
        return;
    writeRaw(QStringLiteral("\n") + closeBanner() + QLatin1Char('\n'));
    m_file.close();
}

void ApplicationLog::setFile(const QString &path)
{
    {
        QMutexLocker lock(&m_mutex);
        close();
        m_runPath = path;
        m_runClear = false;
        start();
    }
    add(tr("Log file has been set to '%1'").arg(QDir::toNativeSeparators(path)));
}

QString ApplicationLog::filePath() const
{
    QMutexLocker lock(&m_mutex);
    return m_file.fileName();
}

bool ApplicationLog::isFileOpen() const
{
    QMutexLocker lock(&m_mutex);
    return m_file.isOpen();
}

void ApplicationLog::overrideForRun(bool clearLog, const QString &logPath)
{
    QMutexLocker lock(&m_mutex);
    m_runClear = clearLog;
    if (!logPath.isEmpty())
        m_runPath = logPath;
}

int ApplicationLog::errorCount() const
{
    QMutexLocker lock(&m_mutex);
    return m_errors;
}

int ApplicationLog::warningCount() const
{
    QMutexLocker lock(&m_mutex);
    return m_warnings;
}

QStringList ApplicationLog::lines() const
{
    QMutexLocker lock(&m_mutex);
    QStringList out;
    // Depth first: an entry's children follow it, as they do in the file.
    QList<const LogEntry *> pending(m_entries.crbegin(), m_entries.crend());
    while (!pending.isEmpty()) {
        const LogEntry *entry = pending.takeLast();
        if ((m_options & DetailMaximum) || !(entry->attributes() & LogEntry::Hidden))
            out << entry->line();
        for (auto it = entry->children().crbegin(); it != entry->children().crend(); ++it)
            pending.append(*it);
    }
    return out;
}

void ApplicationLog::writeEntry(const LogEntry *entry)
{
    if (!(m_options & DetailMaximum) && (entry->attributes() & LogEntry::Hidden))
        return;
    if (m_file.isOpen())
        writeRaw(entry->line() + QLatin1Char('\n'));
    else if (m_pendingLines.size() < MaxPendingLines)
        m_pendingLines.append(entry->line());
}

void ApplicationLog::writeRaw(const QString &text)
{
    m_file.write(text.toUtf8());
    m_file.flush();
}

void ApplicationLog::save(QDomElement &element, bool flush)
{
    QMutexLocker lock(&m_mutex);
    element.setAttribute(QStringLiteral("attr"), m_options);
    element.setAttribute(QStringLiteral("file"), m_fileName);
    element.setAttribute(QStringLiteral("path"), m_folder);
    element.setAttribute(QStringLiteral("pattern"), m_pattern);
    lock.unlock();
    if (flush)
        SettingsDocument::instance().save();
}

void ApplicationLog::load(const QDomElement &element)
{
    QMutexLocker lock(&m_mutex);
    bool ok = false;
    const uint32_t attr = element.attribute(QStringLiteral("attr")).toUInt(&ok);
    m_options = ok ? attr : DefaultOptions;
    m_fileName = element.attribute(QStringLiteral("file"), Identity::LogFileName);
    m_folder = element.attribute(QStringLiteral("path"), PathMacros::DefaultLogFolder);
    m_pattern = element.attribute(QStringLiteral("pattern"), DefaultPattern);
}

QModelIndex ApplicationLog::index(int row, int column, const QModelIndex &parent) const
{
    QMutexLocker lock(&m_mutex);
    if (column < 0 || column >= ColumnCount || row < 0)
        return {};
    if (!parent.isValid())
        return row < m_shownTop ? createIndex(row, column, m_entries.at(row)) : QModelIndex();
    auto *p = static_cast<LogEntry *>(parent.internalPointer());
    return row < p->m_shownChildren ? createIndex(row, column, p->m_children.at(row)) : QModelIndex();
}

QModelIndex ApplicationLog::parent(const QModelIndex &child) const
{
    QMutexLocker lock(&m_mutex);
    if (!child.isValid())
        return {};
    LogEntry *p = static_cast<LogEntry *>(child.internalPointer())->parent();
    if (!p)
        return {};
    const QList<LogEntry *> &siblings = p->parent() ? p->parent()->m_children : m_entries;
    return createIndex(int(siblings.indexOf(p)), 0, p);
}

int ApplicationLog::rowCount(const QModelIndex &parent) const
{
    QMutexLocker lock(&m_mutex);
    if (!parent.isValid())
        return m_shownTop;
    if (parent.column() != 0)
        return 0;
    return static_cast<LogEntry *>(parent.internalPointer())->m_shownChildren;
}

int ApplicationLog::columnCount(const QModelIndex &) const
{
    return ColumnCount;
}

QVariant ApplicationLog::data(const QModelIndex &index, int role) const
{
    QMutexLocker lock(&m_mutex);
    if (!index.isValid())
        return {};
    const auto *e = static_cast<const LogEntry *>(index.internalPointer());
    switch (role) {
    case Qt::DisplayRole:
        if (index.column() == EventColumn) {
            const QString labels = e->labels().trimmed();
            const QString time = e->time().toString(QStringLiteral("hh:mm:ss"));
            return labels.isEmpty() ? time : time + QLatin1Char(' ') + labels;
        }
        return e->text();
    case Qt::ToolTipRole:
        return e->text();
    case Qt::ForegroundRole:
        if (e->attributes() & LogEntry::Successful)
            return QBrush(Qt::darkGreen);
        if (e->attributes() & LogEntry::Error)
            return QBrush(Qt::red);
        if (e->attributes() & LogEntry::Warning)
            return QBrush(QColor(0xb0, 0x70, 0x00));
        return {};
    default:
        return {};
    }
}

QVariant ApplicationLog::headerData(int section, Qt::Orientation orientation, int role) const
{
    if (orientation != Qt::Horizontal || role != Qt::DisplayRole)
        return {};
    switch (section) {
    case EventColumn:
        return tr("Event");
    case MessageColumn:
        return tr("Message");
    default:
        return {};
    }
}

} // namespace Framework
