// "Go to Offset": an offset from the beginning, from the caret or from the end of the storage.
#pragma once

#include <QDialog>

#include <cstdint>
#include <optional>

class QLabel;
class QLineEdit;
class QRadioButton;
class QDialogButtonBox;

namespace HexEditor {

class HexInt64Validator;

class GotoOffsetDlg : public QDialog
{
    Q_OBJECT
public:
    enum Mode { FromBeginning = 0, FromCurrent = 1, FromEnd = 2 };

    // size: the storage's size in bytes; current: the caret offset.
    GotoOffsetDlg(uint64_t size, uint64_t current, QWidget *parent = nullptr);

    Mode mode() const;
    void setMode(Mode mode);
    QLineEdit *offsetEdit() const { return m_edit; }
    int64_t minimum() const;
    int64_t maximum() const;

    // The byte offset to go to; none when the field is empty or its value is out of range.
    std::optional<uint64_t> target() const;

    // The mode the next dialog starts with (the last one chosen while the program runs).
    static Mode lastMode();
    static void setLastMode(Mode mode);

    void accept() override;

private:
    void updateRange();

    uint64_t m_size;
    uint64_t m_current;
    QLineEdit *m_edit;
    HexInt64Validator *m_validator;
    QRadioButton *m_modes[3];
    QLabel *m_min;
    QLabel *m_max;
};

} // namespace HexEditor
