#include "hexeditor/BulkTransfer.h"

#include <QDir>
#include <QFile>
#include <QFileInfo>
#include <QLocale>
#include <QStorageInfo>

#include <algorithm>
#include <cstring>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Platform/PlatformFile.h"
#include "Kernel/Implementation/Platform/PlatformOps.h"
#include "hexeditor/StorageSectorWrite.h"
#include "hexeditor/StorageWriteGuard.h"

namespace HexEditor::BulkTransfer {

Thread::Thread(Mode mode, QObject *parent) : Threads::Generic(parent), m_mode(mode) {}

Thread::~Thread()
{
    cancel();
    wait();
}

Thread *Thread::saveToFile(Storage *source, const DiskArea &area, const QString &path, QObject *parent)
{
    auto *t = new Thread(Mode::SaveToFile, parent);
    t->m_source = source;
    t->m_area = area;
    t->m_path = path;
    return t;
}

Thread *Thread::insertFromFile(const QString &path, Storage *target, std::uint64_t offset, QObject *parent)
{
    auto *t = new Thread(Mode::InsertFromFile, parent);
    t->m_path = path;
    t->m_target = target;
    t->m_offset = offset;
    return t;
}

Thread *Thread::copy(Storage *source, const DiskArea &area, Storage *target, std::uint64_t offset,
                     QObject *parent)
{
    auto *t = new Thread(Mode::CopyBetweenStorages, parent);
    t->m_source = source;
    t->m_area = area;
    t->m_target = target;
    t->m_offset = offset;
    return t;
}

QString Thread::title() const
{
    switch (m_mode) {
    case Mode::SaveToFile:
        return tr("Save selection to file '%1'").arg(m_path);
    case Mode::InsertFromFile:
        return tr("Insert data from file '%1'").arg(m_path);
    default:
        return tr("Transfer data between storages");
    }
}

void Thread::say(const QString &text)
{
    {
        QMutexLocker lock(&m_logMutex);
        m_log << text;
    }
    emit message(text);
}

void Thread::conclude(const QString &text)
{
    QMutexLocker lock(&m_logMutex);
    m_log << text;
    m_result = text;
}

bool Thread::fail(const QString &text)
{
    conclude(text);
    return false;
}

QStringList Thread::log() const
{
    QMutexLocker lock(&m_logMutex);
    return m_log;
}

QString Thread::result() const
{
    QMutexLocker lock(&m_logMutex);
    return m_result;
}

bool Thread::targetHasEdits() const
{
    if (!m_target)
        return false;
    return m_target->isModified();
}

QString Thread::prepare()
{
    m_prepared = false;
    const QLocale locale;
    auto clipArea = [this]() {
        const std::uint64_t size = m_source->size();
        if (m_area.offset >= size)
            m_area.length = 0;
        else
            m_area.length = std::min(m_area.length, size - m_area.offset);
    };
    switch (m_mode) {
    case Mode::SaveToFile: {
        if (!m_source || !m_source->kernelObject())
            return tr("Invalid data source!");
        if (!m_area.length)
            return tr("No selection provided for source data storage!");
        clipArea();
        m_sourceObject = m_source->kernelObject();
        m_sourceName = m_source->name();
        say(tr("Source data storage: %1").arg(m_sourceName));
        say(tr("Selected: %1")
                .arg(tr("%1 bytes from offset %2")
                         .arg(locale.toString(qulonglong(m_area.length)),
                              locale.toString(qulonglong(m_area.offset)))));
        say(tr("Store to file: %1").arg(m_path));
        const QFileInfo info(m_path);
        const QStorageInfo where(info.absolutePath());
        if (m_path.isEmpty() || !info.absoluteDir().exists() || !where.isValid())
            return tr("Unrecognized target location.");
        // An existing file of the same name is replaced: its bytes count as room.
        const std::uint64_t available = std::uint64_t(std::max<qint64>(0, where.bytesAvailable())) +
                                        (info.exists() ? std::uint64_t(info.size()) : 0);
        if (available < m_area.length)
            return tr("Not enough space at destination '%1'. Only %2 out of %3 are available for required %4 "
                      "bytes "
                      "to save.")
                .arg(where.rootPath(), locale.toString(qulonglong(available)),
                     locale.toString(qulonglong(where.bytesTotal())),
                     locale.toString(qulonglong(m_area.length)));
        m_dataSize = m_room = m_area.length;
        m_sourceEdits = m_source->modifiedSectorData(m_area);
        break;
    }
    case Mode::InsertFromFile: {
        say(tr("Loading from file: %1").arg(m_path));
        if (!m_target || !m_target->kernelObject())
            return tr("Invalid target storage!");
        m_targetObject = m_target->kernelObject();
        m_targetName = m_target->name();
        say(tr("Target data storage: %1 %2")
                .arg(m_targetName, tr("at offset %1").arg(locale.toString(qulonglong(m_offset)))));
        const QFileInfo info(m_path);
        if (m_path.isEmpty() || !info.isFile() || !info.isReadable())
            return tr("Invalid source file");
        if (m_offset >= m_target->size())
            return tr("Invalid offset on target storage");
        m_dataSize = std::uint64_t(info.size());
        m_room = m_target->size() - m_offset;
        if (!m_dataSize)
            return tr("Invalid source file");
        break;
    }
    case Mode::CopyBetweenStorages: {
        if (!m_source || !m_source->kernelObject())
            return tr("Invalid data source!");
        if (!m_target || !m_target->kernelObject())
            return tr("Invalid target storage!");
        if (!m_area.length)
            return tr("No selection provided for source data storage!");
        clipArea();
        if (!m_area.length)
            return tr("No selection provided for source data storage!");
        if (m_offset >= m_target->size())
            return tr("Invalid offset on target storage");
        m_sourceObject = m_source->kernelObject();
        m_targetObject = m_target->kernelObject();
        m_sourceName = m_source->name();
        m_targetName = m_target->name();
        say(tr("Source data storage: %1").arg(m_sourceName));
        say(tr("Target data storage: %1 %2")
                .arg(m_targetName, tr("at offset %1").arg(locale.toString(qulonglong(m_offset)))));
        if (sameStorage())
            say(tr("Data transfer within same storage!"));
        m_dataSize = m_area.length;
        m_room = m_target->size() - m_offset;
        m_sourceEdits = m_source->modifiedSectorData(m_area);
        break;
    }
    }
    if (m_target) {
        Storage *target = m_target;
        connect(this, &Thread::written, target, [target](const DiskArea &area) { target->forget(area); });
    }
    m_prepared = true;
    return QString();
}

void Thread::step(std::uint64_t total)
{
    const std::uint64_t done = m_done.load();
    tag().setProgress(done, total);
    emit progress(total ? int(done * 100 / total) : 100);
}

bool Thread::readSource(std::uint64_t offset, std::uint64_t length, QByteArray &out)
{
    const std::uint64_t ss = m_sourceObject->GetBytesPerSector();
    const std::uint64_t first = offset / ss;
    const std::uint64_t last = (offset + length - 1) / ss;
    const std::uint64_t count = last - first + 1;
    QByteArray sectors(qsizetype(count * ss), '\0');
    std::uint32_t error = 0;
    if (!m_sourceObject->ReadSectors(first, std::uint32_t(count), sectors.data(), error)) {
        // Find the sector that failed, for the message; the rest may be read fine.
        for (std::uint64_t n = first; n <= last; ++n) {
            if (!m_sourceObject->ReadSectors(n, 1, sectors.data() + (n - first) * ss, error))
                return fail(tr("Failed to read sector %1 from %2. Error code %3.")
                                .arg(n)
                                .arg(m_sourceName)
                                .arg(error));
        }
    }
    for (auto it = m_sourceEdits.cbegin(); it != m_sourceEdits.cend(); ++it)
        if (it.key() >= first && it.key() <= last && std::uint64_t(it.value().size()) == ss)
            std::memcpy(sectors.data() + (it.key() - first) * ss, it.value().constData(), std::size_t(ss));
    out = sectors.mid(qsizetype(offset - first * ss), qsizetype(length));
    return true;
}

bool Thread::writeTarget(std::uint64_t offset, const QByteArray &bytes)
{
    const SectorWrite::Result r = SectorWrite::writeBytes(*m_targetObject, offset, bytes.constData(),
                                                          std::uint64_t(bytes.size()), SectorsPerStep);
    if (r.written)
        emit written(DiskArea{offset, r.written});
    if (!r.ok())
        return fail(r.readFailed ? tr("Failed to read sector %1 from %2. Error code %3.")
                                       .arg(r.failedSector)
                                       .arg(m_targetName)
                                       .arg(r.error)
                                 : tr("Failed to write sector %1 to %2. Error code %3.")
                                       .arg(r.failedSector)
                                       .arg(m_targetName)
                                       .arg(r.error));
    return true;
}

bool Thread::runSaveToFile()
{
    // The file is written under a name of its own next to the destination, flushed, and only then
    // put in the destination's place: it appears complete and on the medium, or not at all.
    const QString temp = m_path + QStringLiteral(".part");
    CPlatformFile file(nullptr, temp, PlatformKind::File);
    if (!file.Create())
        return fail(tr("Unable to create file '%1': %2").arg(m_path, systemErrorText(file.GetError())));
    auto abandon = [&file](bool result) {
        file.Close(true);
        return result;
    };
    const std::uint64_t block = std::uint64_t(SectorsPerStep) * m_sourceObject->GetBytesPerSector();
    const std::uint64_t total = m_area.length;
    for (std::uint64_t at = 0; at < total;) {
        if (cancelled())
            return abandon(fail(tr("%1 canceled by user").arg(title())));
        // Steps end on sector boundaries of the source.
        const std::uint64_t pos = m_area.offset + at;
        const std::uint64_t ss = m_sourceObject->GetBytesPerSector();
        const std::uint64_t n = std::min(total - at, block - pos % ss);
        QByteArray bytes;
        if (!readSource(pos, n, bytes))
            return abandon(false);
        if (!file.Write(at, std::uint32_t(bytes.size()), bytes.constData()))
            return abandon(
                fail(tr("Unable to write file '%1': %2").arg(m_path, systemErrorText(file.GetError()))));
        at += n;
        m_done = at;
        step(total);
    }
    std::uint32_t error = 0;
    if (!file.Flush(error))
        return abandon(fail(tr("Unable to write file '%1': %2").arg(m_path, systemErrorText(error))));
    if (!file.Close(false)) {
        error = file.GetError();
        PlatformDeleteFile(nullptr, temp);
        return fail(tr("Unable to write file '%1': %2").arg(m_path, systemErrorText(error)));
    }
    if (!PlatformMoveFile(nullptr, temp, m_path)) {
        PlatformDeleteFile(nullptr, temp);
        return fail(tr("Unable to write file '%1'").arg(m_path));
    }
    return true;
}

bool Thread::flushTarget()
{
    std::uint32_t error = 0;
    if (m_targetObject->Flush(error))
        return true;
    return fail(tr("The data did not reach %1 (Error [%2]: %3).")
                    .arg(m_targetName)
                    .arg(error)
                    .arg(systemErrorText(error)));
}

bool Thread::runInsertFromFile()
{
    QFile file(m_path);
    if (!file.open(QIODevice::ReadOnly))
        return fail(tr("Invalid source file"));
    const std::uint64_t total = std::min(m_dataSize, m_room);
    WriteGuard guard(m_targetObject, 0, m_targetObject->GetTotalSectors());
    if (!guard.refusal().isEmpty())
        return fail(guard.refusal());
    const std::uint64_t block = std::uint64_t(SectorsPerStep) * m_targetObject->GetBytesPerSector();
    for (std::uint64_t at = 0; at < total;) {
        if (cancelled()) {
            flushTarget();
            return fail(tr("%1 canceled by user").arg(title()));
        }
        const std::uint64_t pos = m_offset + at;
        const std::uint64_t ss = m_targetObject->GetBytesPerSector();
        const std::uint64_t n = std::min(total - at, block - pos % ss);
        const QByteArray bytes = file.read(qint64(n));
        if (std::uint64_t(bytes.size()) != n)
            return fail(tr("Unable to read file '%1': %2").arg(m_path, file.errorString()));
        if (!writeTarget(pos, bytes))
            return false;
        at += n;
        m_done = at;
        step(total);
    }
    return flushTarget();
}

bool Thread::runCopy()
{
    const std::uint64_t total = std::min(m_dataSize, m_room);
    WriteGuard guard(m_targetObject, 0, m_targetObject->GetTotalSectors());
    if (!guard.refusal().isEmpty())
        return fail(guard.refusal());
    const std::uint64_t block = std::uint64_t(SectorsPerStep) * std::max(m_sourceObject->GetBytesPerSector(),
                                                                         m_targetObject->GetBytesPerSector());
    // Within one storage a forward overlap is copied from the end, so no byte is read after it
    // was overwritten.
    const bool backwards =
        m_sourceObject == m_targetObject && m_offset > m_area.offset && m_offset < m_area.offset + total;
    for (std::uint64_t at = 0; at < total;) {
        if (cancelled()) {
            flushTarget();
            return fail(tr("%1 canceled by user").arg(title()));
        }
        const std::uint64_t n = std::min(total - at, block);
        const std::uint64_t rel = backwards ? total - at - n : at;
        QByteArray bytes;
        if (!readSource(m_area.offset + rel, n, bytes))
            return false;
        // Edits of the source laid over its bytes are now on the medium where the copy lands.
        if (!writeTarget(m_offset + rel, bytes))
            return false;
        at += n;
        m_done = at;
        step(total);
    }
    return flushTarget();
}

bool Thread::work()
{
    if (!m_prepared)
        return fail(tr("The transfer was not prepared."));
    bool ok = false;
    switch (m_mode) {
    case Mode::SaveToFile:
        ok = runSaveToFile();
        break;
    case Mode::InsertFromFile:
        ok = runInsertFromFile();
        break;
    case Mode::CopyBetweenStorages:
        ok = runCopy();
        break;
    }
    if (ok) {
        conclude(tr("%1 completed: %2 bytes").arg(title(), QLocale().toString(qulonglong(m_done.load()))));
    }
    m_succeeded = ok;
    return ok;
}

} // namespace HexEditor::BulkTransfer
