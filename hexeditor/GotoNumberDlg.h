// The common form of "Go to MFT Record" and "Go to Catalog Node": one number field within
// 0 .. count - 1, whose accepted value is a record index.
#pragma once

#include <QDialog>

#include <cstdint>
#include <optional>

class QLabel;
class QLineEdit;

namespace HexEditor {

class HexInt64Validator;

class GotoNumberDlg : public QDialog
{
    Q_OBJECT
public:
    QLineEdit *numberEdit() const { return m_edit; }
    QString rangeText() const;
    // The index in the field; none when it is empty or out of range.
    std::optional<uint64_t> index() const;

protected:
    GotoNumberDlg(const QString &title, const QString &label, uint64_t count, QWidget *parent);

private:
    uint64_t m_count;
    QLineEdit *m_edit;
    QLabel *m_range;
    HexInt64Validator *m_validator;
};

} // namespace HexEditor
