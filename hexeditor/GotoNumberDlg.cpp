#include "hexeditor/GotoNumberDlg.h"

#include "hexeditor/HexInt64Validator.h"

#include <QDialogButtonBox>
#include <QGridLayout>
#include <QLabel>
#include <QLineEdit>
#include <QVBoxLayout>

namespace HexEditor {

GotoNumberDlg::GotoNumberDlg(const QString &title, const QString &label, uint64_t count, QWidget *parent)
    : QDialog(parent), m_count(count)
{
    setWindowTitle(title);
    const int64_t last =
        count == 0
            ? 0
            : (count - 1 > static_cast<uint64_t>(INT64_MAX) ? INT64_MAX : static_cast<int64_t>(count - 1));
    auto *layout = new QVBoxLayout(this);
    auto *grid = new QGridLayout;
    grid->addWidget(new QLabel(label, this), 0, 0);
    m_edit = new QLineEdit(this);
    m_edit->setObjectName(QStringLiteral("edtNumber"));
    m_validator = new HexInt64Validator(0, last, m_edit);
    m_edit->setValidator(m_validator);
    grid->addWidget(m_edit, 0, 1);
    const QLocale loc = m_validator->locale();
    m_range = new QLabel(
        tr("(%1 - %2)").arg(loc.toString(qlonglong(0)), loc.toString(static_cast<qlonglong>(last))), this);
    grid->addWidget(m_range, 0, 2);
    layout->addLayout(grid);
    layout->addWidget(new QLabel(tr("Use 0x prefix for hexadecimal values"), this));
    auto *buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel, this);
    connect(buttons, &QDialogButtonBox::accepted, this, &QDialog::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    layout->addWidget(buttons);
    m_edit->setEnabled(count > 0);
}

QString GotoNumberDlg::rangeText() const
{
    return m_range->text();
}

std::optional<uint64_t> GotoNumberDlg::index() const
{
    if (m_count == 0)
        return std::nullopt;
    const std::optional<int64_t> v = m_validator->acceptedValue(m_edit->text());
    if (!v)
        return std::nullopt;
    return static_cast<uint64_t>(*v);
}

} // namespace HexEditor
