// "Fill Block": asks for the pattern a selected block is overwritten with, as Latin-1 text or as
// hexadecimal values (the two fields follow each other), 1 to 32 bytes.
#pragma once

#include <QByteArray>
#include <QDialog>

#include "hexeditor/DiskArea.h"

class QLabel;
class QLineEdit;
class QDialogButtonBox;

namespace HexEditor {

class FillBlockDlg : public QDialog
{
    Q_OBJECT

public:
    static constexpr int MaxPattern = 32;

    FillBlockDlg(const DiskArea &block, QWidget *parent = nullptr);

    QByteArray pattern() const { return m_pattern; }
    void setPattern(const QByteArray &pattern);

    // The block's bytes: the pattern repeated, then its first (length mod pattern length) bytes.
    static QByteArray fillBytes(const QByteArray &pattern, uint64_t length);

    QLineEdit *textEdit() const { return m_text; }
    QLineEdit *hexEdit() const { return m_hex; }
    QDialogButtonBox *buttons() const { return m_buttons; }

private:
    void onTextEdited(const QString &text);
    void onHexEdited(const QString &text);
    void update();

    QByteArray m_pattern;
    QLabel *m_range = nullptr;
    QLabel *m_size = nullptr;
    QLineEdit *m_text = nullptr;
    QLineEdit *m_hex = nullptr;
    QDialogButtonBox *m_buttons = nullptr;
};

} // namespace HexEditor
