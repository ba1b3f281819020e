// The hex editor's status bar: caret position, selection, offset format and editing mode, and the
// progress and stop button of a running search or transfer.
#pragma once

#include "hexeditor/DiskArea.h"

#include <QWidget>

#include <cstdint>

class QLabel;
class QProgressBar;
class QToolButton;

namespace HexEditor {

class StatusCtrl : public QWidget
{
    Q_OBJECT
public:
    // Selection colours: a selection on sector boundaries and any other.
    static inline const QString AlignedColor = QStringLiteral("#008800");
    static inline const QString UnalignedColor = QStringLiteral("#C67000");

    explicit StatusCtrl(QWidget *parent = nullptr);

    QLabel *label(const QString &objectName) const;
    QToolButton *stopButton() const { return m_stop; }
    QProgressBar *progressBar() const { return m_progress; }

    // The caret: its byte offset, sector, line and column.
    void setCaret(uint64_t offset, uint64_t sector, uint64_t line, uint32_t column);

public slots:
    void onSelectionChanged(const HexEditor::DiskArea &area, uint bytesPerSector);
    void onStateChanged(bool isHexOffset, bool isReadOnly, bool isBigEndian);
    void onThreadProgress(int percent);
    void onThreadFinished(int result, const QString &note);

signals:
    void stopProcess();

private:
    void showSelection();

    QToolButton *m_stop;
    QProgressBar *m_progress;
    QLabel *m_selection;
    QLabel *m_sector;
    QLabel *m_offset;
    QLabel *m_line;
    QLabel *m_col;
    QLabel *m_format;
    QLabel *m_editable;
    DiskArea m_area;
    uint m_bytesPerSector = 512;
    bool m_hex = false;
};

} // namespace HexEditor
