// Editing through the editor control: typed digits and characters, applied edits with undo and
// redo, revert, save with its confirmation, Delete, fill block, the clipboard, template changes and
// the questions before closing or switching a file's mode.
#include "hexeditor/EditorCtrl.h"

#include <QApplication>
#include <QClipboard>
#include <QDir>
#include <QFileDialog>
#include <QKeyEvent>
#include <QLocale>
#include <QMimeData>

#include <algorithm>

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/DialogSeam.h"
#include "hexeditor/Clipboard.h"
#include "hexeditor/FillBlockDlg.h"
#include "hexeditor/Storage.h"

namespace HexEditor {

namespace {

QMessageBox::StandardButton ask(QMessageBox::Icon icon, const QString &title, const QString &text,
                                QMessageBox::StandardButtons buttons, QMessageBox::StandardButton def)
{
    return Framework::DialogSeam::current().message(icon, title, text, buttons, def);
}

int hexDigit(QChar c)
{
    const char16_t u = c.unicode();
    if (u >= '0' && u <= '9')
        return u - '0';
    if (u >= 'a' && u <= 'f')
        return u - 'a' + 10;
    if (u >= 'A' && u <= 'F')
        return u - 'A' + 10;
    return -1;
}

} // namespace

// --- the edit history -------------------------------------------------------------------------------------

bool EditorCtrl::writeEdit(uint64_t offset, const QByteArray &bytes, bool moveCaret)
{
    if (!m_storage || bytes.isEmpty() || offset >= dataSize())
        return false;
    // The redo history goes, old bytes are kept, new bytes go into the cache with their marks.
    const DiskArea area = m_undo.apply(offset, bytes.left(qsizetype(MaxEdit)));
    if (area.length == 0)
        return false;
    if (moveCaret)
        placeCaret(area.end() - 1, m_caret.pane, 0);
    afterEdit(area);
    return true;
}

void EditorCtrl::afterEdit(const DiskArea &area)
{
    emit dataChanged(area);
    emit commandStateChanged();
    caretChanged();
    viewport()->update();
}

bool EditorCtrl::applyEdit(uint64_t offset, const QByteArray &bytes)
{
    if (!m_editable)
        return false;
    return writeEdit(offset, bytes, true);
}

void EditorCtrl::editByte(uint64_t offset, const QByteArray &bytes)
{
    writeEdit(offset, bytes, false);
}

void EditorCtrl::undo()
{
    const DiskArea area = m_undo.undo();
    if (area.length == 0)
        return;
    placeCaret(area.end() - 1, m_caret.pane, 0);
    afterEdit(area);
}

void EditorCtrl::redo()
{
    const DiskArea area = m_undo.redo();
    if (area.length == 0)
        return;
    placeCaret(area.end() - 1, m_caret.pane, 0);
    afterEdit(area);
}

void EditorCtrl::revert()
{
    if (!m_storage || m_undo.count() == 0)
        return;
    if (ask(QMessageBox::Question, Framework::Identity::FullName,
            tr("All changes not saved to the disk will be lost. Do you want to proceed?"),
            QMessageBox::Yes | QMessageBox::No, QMessageBox::No) != QMessageBox::Yes)
        return;
    for (const DiskArea &area : m_undo.revert())
        emit dataChanged(area);
    caretChanged();
    emit commandStateChanged();
    viewport()->update();
}

QString EditorCtrl::saveQuestion() const
{
    if (m_storage->isFileStorage())
        return tr("Are you sure you want to write changes to \n%1?").arg(m_storage->name());
    return tr("You are going to write data to %1. Please note that this operation can seriously damage file "
              "system. Proceed only if absolutely sure.\nDo you want to save your changes?")
        .arg(m_storage->name());
}

bool EditorCtrl::onSave()
{
    if (!m_storage || !hasAppliedEdits())
        return false;
    if (ask(QMessageBox::Warning, Framework::Identity::FullName, saveQuestion(),
            QMessageBox::Yes | QMessageBox::No, QMessageBox::No) != QMessageBox::Yes)
        return false;
    // After a failed sector write the history stays, so the edits can still be saved or reverted.
    const bool saved = saveEdits();
    caretChanged();
    emit commandStateChanged();
    viewport()->update();
    return saved;
}

bool EditorCtrl::saveEdits()
{
    const QList<SaveFailure> failures = m_undo.save();
    if (failures.isEmpty())
        return true;
    QStringList messages;
    for (const SaveFailure &f : failures)
        if (!messages.contains(f.message))
            messages << f.message;
    constexpr int Shown = 8;
    if (messages.size() > Shown) {
        const qsizetype more = messages.size() - Shown;
        messages = messages.mid(0, Shown);
        messages << tr("... and %1 more").arg(more);
    }
    ask(QMessageBox::Critical, Framework::Identity::FullName,
        tr("The changes to %1 were not saved.\n%2").arg(m_storage->name(), messages.join(QLatin1Char('\n'))),
        QMessageBox::Ok, QMessageBox::Ok);
    return false;
}

bool EditorCtrl::queryClose()
{
    if (isTransferRunning()) {
        if (ask(QMessageBox::Question, Framework::Identity::FullName,
                tr("This view cannot be closed while data transfer is in progress.\nStop process and close "
                   "the "
                   "view?"),
                QMessageBox::Yes | QMessageBox::No, QMessageBox::No) != QMessageBox::Yes)
            return false;
        stopTransfer();
    }
    if (!m_storage || !hasAppliedEdits())
        return true;
    const QString text =
        m_storage->isFileStorage()
            ? tr("File %1 has been modified.\nDo you want to save your changes?").arg(m_storage->name())
            : tr("Content of %1 has been modified.\nDo you want to save your changes?\nPlease note that this "
                 "operation can seriously damage file system. Proceed only if absolutely sure.")
                  .arg(m_storage->name());
    const auto answer = ask(QMessageBox::Warning, Framework::Identity::FullName, text,
                            QMessageBox::Yes | QMessageBox::No | QMessageBox::Cancel, QMessageBox::Cancel);
    if (answer == QMessageBox::Cancel)
        return false;
    if (answer == QMessageBox::No)
        return true;
    // Yes: the view closes only when every sector was written.
    if (!saveEdits())
        return false;
    m_undo.clear();
    emit commandStateChanged();
    return true;
}

bool EditorCtrl::queryModeChange()
{
    if (!m_storage || !hasAppliedEdits())
        return true;
    QString text =
        tr("Data have been modified. They must be saved before proceeding.\nDo you want to save your "
           "changes?");
    if (!m_storage->isFileStorage())
        text += tr(
            "\nPlease note that this operation can seriously damage file system. Proceed only if absolutely "
            "sure.");
    const auto answer = ask(QMessageBox::Warning, Framework::Identity::FullName, text,
                            QMessageBox::Yes | QMessageBox::No | QMessageBox::Cancel, QMessageBox::Cancel);
    if (answer == QMessageBox::Cancel)
        return false;
    if (answer == QMessageBox::Yes && !saveEdits())
        return false;
    // The mode change clears the cache: the history no longer applies.
    m_undo.clear();
    emit commandStateChanged();
    return true;
}

// --- typing
// -------------------------------------------------------------------------------------------------

bool EditorCtrl::typeKey(QKeyEvent *event)
{
    if (!m_editable || !m_storage || dataSize() == 0)
        return false;
    if (event->modifiers() & (Qt::ControlModifier | Qt::AltModifier | Qt::MetaModifier))
        return false;
    const uint64_t offset = caretOffset();
    if (event->key() == Qt::Key_Backspace) {
        if (offset == 0 && (m_caret.pane != PaneHex || m_caret.nibble == 0))
            return true; // nothing left of the caret
        moveLeft();
        const uint64_t at = caretOffset();
        if (m_caret.pane == PaneHex) {
            const QByteArray one = m_storage->read({at, 1}, true);
            const uint8_t b = one.isEmpty() ? 0 : uint8_t(one[0]);
            const uint8_t nb = m_caret.nibble ? uint8_t(b & 0xF0) : uint8_t(b & 0x0F);
            editByte(at, QByteArray(1, char(nb)));
        } else if (m_caret.pane == PaneUnicode) {
            editByte(at, QByteArray(std::min<uint64_t>(2, dataSize() - at), '\0'));
        } else {
            editByte(at, QByteArray(1, '\0'));
        }
        return true;
    }
    const QString text = event->text();
    if (text.isEmpty())
        return false;
    const QChar ch = text.at(0);
    switch (m_caret.pane) {
    case PaneHex: {
        const int digit = hexDigit(ch);
        if (digit < 0)
            return false;
        const QByteArray one = m_storage->read({offset, 1}, true);
        const uint8_t b = one.isEmpty() ? 0 : uint8_t(one[0]);
        const uint8_t nb = m_caret.nibble ? uint8_t((b & 0xF0) | digit) : uint8_t((b & 0x0F) | (digit << 4));
        editByte(offset, QByteArray(1, char(nb)));
        moveRight();
        return true;
    }
    case PaneAscii: {
        if (ch.unicode() > 0xFF || ch.unicode() == 0)
            return false;
        editByte(offset, QByteArray(1, char(ch.unicode())));
        moveRight();
        return true;
    }
    case PaneUnicode: {
        const char16_t unit = ch.unicode();
        if (unit == 0)
            return false;
        QByteArray two;
        two.append(char(unit & 0xFF));
        two.append(char(unit >> 8));
        editByte(offset, two.left(qsizetype(std::min<uint64_t>(2, dataSize() - offset))));
        moveRight();
        return true;
    }
    default:
        return false;
    }
}

// --- Delete and fill
// ------------------------------------------------------------------------------------------

bool EditorCtrl::refuseTooBig(uint64_t length, const QString &title)
{
    if (length <= MaxEdit)
        return false;
    ask(QMessageBox::Warning, title,
        tr("Selection block size is too big to be supported by Undo buffer. Please select less than %1 bytes")
            .arg(QLocale().toString(qulonglong(MaxEdit))),
        QMessageBox::Ok, QMessageBox::Ok);
    return true;
}

bool EditorCtrl::deleteSelection()
{
    const DiskArea sel = selection();
    if (!m_editable || !m_storage || sel.length == 0)
        return false;
    if (refuseTooBig(sel.length, tr("Selection is too big")))
        return false;
    if (!applyEdit(sel.offset, QByteArray(qsizetype(sel.length), '\0')))
        return false;
    clearSelection();
    return true;
}

bool EditorCtrl::fillBlock(const QByteArray &patternGiven)
{
    const DiskArea sel = selection();
    if (!m_editable || !m_storage || sel.length == 0)
        return false;
    if (refuseTooBig(sel.length, tr("Selection is too big")))
        return false;
    QByteArray pattern = patternGiven.left(FillBlockDlg::MaxPattern);
    if (pattern.isEmpty()) {
        FillBlockDlg dlg(sel, this);
        if (dlg.exec() != QDialog::Accepted)
            return false;
        pattern = dlg.pattern();
    }
    if (pattern.isEmpty())
        return false;
    return applyEdit(sel.offset, FillBlockDlg::fillBytes(pattern, sel.length));
}

// --- clipboard
// ---------------------------------------------------------------------------------------------------

void EditorCtrl::onCopy()
{
    const DiskArea sel = selection();
    if (!m_storage || sel.length == 0)
        return;
    if (sel.length > Clipboard::MaxBytes) {
        ask(QMessageBox::Warning, tr("Selection is too big to copy"),
            tr("Selection block size is too big to be copied to the clipboard."), QMessageBox::Ok,
            QMessageBox::Ok);
        return;
    }
    const QByteArray bytes = m_storage->read(sel, false);
    const Pane pane = m_caret.pane == PaneAscii || m_caret.pane == PaneUnicode ? Pane(m_caret.pane) : PaneHex;
    QApplication::clipboard()->setMimeData(
        Clipboard::copyData(bytes, Clipboard::copyText(bytes, pane, sel.offset)));
}

void EditorCtrl::onCopyFormatted()
{
    const DiskArea sel = selection();
    if (!m_storage || sel.length == 0)
        return;
    if (sel.length > Clipboard::MaxBytes) {
        ask(QMessageBox::Warning, tr("Selection is too big"),
            tr("Selection block size is too big to be copied to the clipboard."), QMessageBox::Ok,
            QMessageBox::Ok);
        return;
    }
    const QByteArray bytes = m_storage->read(sel, false);
    QApplication::clipboard()->setText(
        Clipboard::formattedText(bytes, sel.offset, bytesPerLine(), hexOffset(), offsetDigits()));
}

void EditorCtrl::onPaste()
{
    if (!m_editable || !m_storage)
        return;
    const QMimeData *data = QApplication::clipboard()->mimeData();
    if (!data)
        return;
    Clipboard::BulkReference ref;
    if (Clipboard::bulkReference(data, ref)) {
        BulkRequest request;
        request.copyBetweenStorages = true;
        request.source = ref.storage;
        request.sourceArea = ref.area;
        request.target = m_storage;
        request.targetOffset = caretOffset();
        startTransfer(request);
        return;
    }
    const QByteArray bytes = Clipboard::pasteBytes(data);
    if (!bytes.isEmpty())
        applyEdit(caretOffset(), bytes);
}

// --- bulk transfers
// -------------------------------------------------------------------------------------------------

void EditorCtrl::onSaveData()
{
    const DiskArea sel = selection();
    if (!m_storage || sel.length == 0)
        return;
    const QString title = tr("Save disk image");
    const QString filter = tr("Raw data (*.bin)");
    const QString initial = QDir::homePath() + QStringLiteral("/binary.bin");
    const QString file = m_fileNames ? m_fileNames(FileRequest::SaveSelection, title, filter, initial)
                                     : QFileDialog::getSaveFileName(this, title, initial, filter);
    if (file.isEmpty())
        return;
    BulkRequest request;
    request.mode = FileRequest::SaveSelection;
    request.fileName = file;
    request.source = m_storage;
    request.sourceArea = sel;
    startTransfer(request);
}

void EditorCtrl::onInsertData()
{
    if (!m_editable || !m_storage)
        return;
    const QString title = tr("Import data from file");
    const QString filter = tr("Raw data (*.bin);;All Files (*.*)");
    const QString file = m_fileNames ? m_fileNames(FileRequest::InsertFile, title, filter, QDir::homePath())
                                     : QFileDialog::getOpenFileName(this, title, QDir::homePath(), filter);
    if (file.isEmpty())
        return;
    BulkRequest request;
    request.mode = FileRequest::InsertFile;
    request.fileName = file;
    request.target = m_storage;
    request.targetOffset = caretOffset();
    startTransfer(request);
}

// --- template changes
// ------------------------------------------------------------------------------------------------

void EditorCtrl::onTemplateModified(const QVariantList &changes)
{
    for (qsizetype i = 0; i + 1 < changes.size(); i += 2) {
        bool ok = false;
        const quint64 offset = changes[i].toULongLong(&ok);
        if (!ok)
            continue;
        applyEdit(offset, changes[i + 1].toByteArray());
    }
}

} // namespace HexEditor
