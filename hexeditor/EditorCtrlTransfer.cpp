// Block transfers started by the editor control: save the selection to a file, insert a file at the
// caret, paste a block of another storage. They run on the transfer worker thread.
#include "hexeditor/EditorCtrl.h"

#include <QLocale>

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "hexeditor/BulkTransfer.h"

namespace HexEditor {

namespace {

// The end of a transfer for the user: every result goes to the log, a failure also in a box (a
// stop the user asked for needs no box).
void reportResult(const BulkTransfer::Thread &thread)
{
    using Framework::LogEntry;
    auto &log = Framework::ApplicationLog::instance();
    const QString result = thread.result();
    if (thread.succeeded()) {
        log.add(result, LogEntry::Successful);
    } else if (thread.cancelled()) {
        log.add(result);
    } else {
        log.add(result, LogEntry::Error);
        Framework::DialogSeam::current().message(QMessageBox::Critical, thread.title(), result,
                                                 QMessageBox::Ok, QMessageBox::Ok);
    }
}

} // namespace

bool EditorCtrl::isTransferRunning() const
{
    return m_transferRunning || (m_transfer && m_transfer->isRunning());
}

void EditorCtrl::onThreadStop()
{
    if (auto *thread = qobject_cast<BulkTransfer::Thread *>(m_transfer.data()))
        thread->cancel();
}

void EditorCtrl::stopTransfer()
{
    if (auto *thread = qobject_cast<BulkTransfer::Thread *>(m_transfer.data())) {
        thread->cancel();
        thread->wait();
    }
    m_transferRunning = false;
}

bool EditorCtrl::startTransfer(const BulkRequest &request)
{
    if (m_bulkStarter)
        return m_bulkStarter(request);
    if (isTransferRunning())
        return false;
    auto &dialogs = Framework::DialogSeam::current();
    const QString appName = Framework::Identity::FullName;

    BulkTransfer::Thread *thread = nullptr;
    switch (request.mode) {
    case FileRequest::SaveSelection:
        thread = request.copyBetweenStorages
                     ? BulkTransfer::Thread::copy(request.source, request.sourceArea, request.target,
                                                  request.targetOffset, this)
                     : BulkTransfer::Thread::saveToFile(request.source, request.sourceArea, request.fileName,
                                                        this);
        break;
    case FileRequest::InsertFile:
        thread = request.copyBetweenStorages
                     ? BulkTransfer::Thread::copy(request.source, request.sourceArea, request.target,
                                                  request.targetOffset, this)
                     : BulkTransfer::Thread::insertFromFile(request.fileName, request.target,
                                                            request.targetOffset, this);
        break;
    }
    if (!thread)
        return false;
    const QString refusal = thread->prepare();
    if (!refusal.isEmpty()) {
        dialogs.message(QMessageBox::Warning, thread->title(), refusal, QMessageBox::Ok, QMessageBox::Ok);
        delete thread;
        return false;
    }
    if (thread->mode() != BulkTransfer::Mode::SaveToFile && thread->exceedsRoom()) {
        const QLocale locale;
        const QString text = tr("The data holds %1 bytes but the target has room for only %2 bytes from this "
                                "position. Only what fits will be written.\nProceed?")
                                 .arg(locale.toString(qulonglong(thread->dataSize())),
                                      locale.toString(qulonglong(thread->room())));
        if (dialogs.message(QMessageBox::Question, appName, text, QMessageBox::Yes | QMessageBox::No,
                            QMessageBox::No) != QMessageBox::Yes) {
            delete thread;
            return false;
        }
    }
    if (thread->targetHasEdits()) {
        if (dialogs.message(QMessageBox::Question, appName,
                            tr("All changes to target storage must be saved to continue. </br>Proceed?"),
                            QMessageBox::Yes | QMessageBox::No, QMessageBox::No) != QMessageBox::Yes) {
            delete thread;
            return false;
        }
        // The target's unsaved edits reach the medium first (and leave this control's history
        // when the target is its own storage).
        const bool own = request.target == m_storage;
        const QList<SaveFailure> failures = own ? m_undo.save() : request.target->save();
        if (!failures.isEmpty()) {
            delete thread;
            return false;
        }
        if (own)
            emit commandStateChanged();
    }
    m_transfer = thread;
    // The request's lines so far, then the thread's as they come.
    auto logLine = [this](const QString &text) {
        Framework::ApplicationLog::instance().add(text);
        emit transferMessage(text);
    };
    for (const QString &line : thread->log())
        logLine(line);
    connect(thread, &BulkTransfer::Thread::progress, this, &EditorCtrl::progress);
    connect(thread, &BulkTransfer::Thread::message, this, logLine);
    connect(thread, &BulkTransfer::Thread::written, this, [this](const DiskArea &area) {
        emit dataChanged(area);
        viewport()->update();
    });
    connect(thread, &QThread::finished, this, [this, thread] {
        m_transferRunning = false;
        reportResult(*thread);
        emit transferFinished(thread->succeeded(), thread->result());
        caretChanged(true);
        viewport()->update();
        thread->deleteLater();
    });
    thread->start();
    emit progress(0);
    return true;
}

} // namespace HexEditor
