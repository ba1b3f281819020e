// Long block transfers of the hex editor on a worker thread: save a selection to a file, insert a
// file at an offset, copy an area between storages (or within one). Data moves 1024 sectors per
// step, read straight from the source's kernel object (with the source's unsaved edits laid over
// it) and written straight to the target's medium; the target's cached copies of the written
// sectors are dropped as each step lands. A transfer is done when its data is on the medium (the
// target is flushed). Stopping leaves the steps already written in place.
//
// Use: make a thread with one of the three constructors' helpers, call prepare() on the interface
// thread (refusals, the room check and the log lines), ask the user what the answers call for
// (targetHasEdits(), exceedsRoom()), then start() it. The result text is result() after finished().
#pragma once

#include <QHash>
#include <QPointer>
#include <QString>
#include <QStringList>

#include <atomic>
#include <cstdint>

#include "ClientFramework/Threads/Generic.h"
#include "hexeditor/DiskArea.h"
#include "hexeditor/Storage.h"

namespace HexEditor::BulkTransfer {

enum class Mode { SaveToFile, InsertFromFile, CopyBetweenStorages };

class Thread : public Threads::Generic
{
    Q_OBJECT

public:
    static constexpr std::uint32_t SectorsPerStep = 1024;

    static Thread *saveToFile(Storage *source, const DiskArea &area, const QString &path,
                              QObject *parent = nullptr);
    static Thread *insertFromFile(const QString &path, Storage *target, std::uint64_t offset,
                                  QObject *parent = nullptr);
    static Thread *copy(Storage *source, const DiskArea &area, Storage *target, std::uint64_t offset,
                        QObject *parent = nullptr);
    ~Thread() override;

    Mode mode() const { return m_mode; }
    // "Save selection to file '%1'", "Insert data from file '%1'" or "Transfer data between storages".
    QString title() const;

    // Checks the request on the interface thread and writes the log lines. Returns the refusal
    // ("Invalid source file", "Unrecognized target location.", ...), empty when it may start.
    QString prepare();
    // The target has unsaved edits: they must be saved before the thread starts.
    bool targetHasEdits() const;
    // The data is larger than the room from the offset to the target's end (then only what fits
    // is written).
    bool exceedsRoom() const { return m_dataSize > m_room; }
    std::uint64_t dataSize() const { return m_dataSize; }
    std::uint64_t room() const { return m_room; }
    bool sameStorage() const { return m_source && m_source == m_target; }

    // Log lines so far, the result last once there is one (the lines before it are also sent
    // through message()).
    QStringList log() const;
    // After the end: the result ("%1 canceled by user", an error, or the completion line). It is
    // not sent through message(): the owner reports it with the outcome.
    QString result() const;
    bool succeeded() const { return m_succeeded; }
    std::uint64_t bytesDone() const { return m_done.load(); }

signals:
    void message(const QString &text);
    void progress(int percent);
    // A step reached the target's medium (emitted from the worker).
    void written(const HexEditor::DiskArea &area);

protected:
    bool work() override;

private:
    Thread(Mode mode, QObject *parent);
    void say(const QString &text);
    // Records the result line.
    void conclude(const QString &text);
    bool fail(const QString &text);
    bool runSaveToFile();
    bool runInsertFromFile();
    bool runCopy();
    // Reads `length` bytes at `offset` of the source (edits laid over); false with the message.
    bool readSource(std::uint64_t offset, std::uint64_t length, QByteArray &out);
    // Writes bytes to the target's medium; false with the message.
    bool writeTarget(std::uint64_t offset, const QByteArray &bytes);
    // Waits until what was written to the target is on its medium; false with the message.
    bool flushTarget();
    void step(std::uint64_t total);

    Mode m_mode;
    QPointer<Storage> m_source;
    QPointer<Storage> m_target;
    cStorage *m_sourceObject = nullptr;
    cStorage *m_targetObject = nullptr;
    QString m_sourceName, m_targetName;
    DiskArea m_area;
    QString m_path;
    std::uint64_t m_offset = 0;
    std::uint64_t m_dataSize = 0;
    std::uint64_t m_room = 0;
    QHash<std::uint64_t, QByteArray> m_sourceEdits; // modified sectors of the source
    std::atomic<std::uint64_t> m_done{0};
    mutable QMutex m_logMutex;
    QStringList m_log;
    QString m_result;
    bool m_succeeded = false;
    bool m_prepared = false;
};

} // namespace HexEditor::BulkTransfer
