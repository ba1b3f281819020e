#include "hexeditor/GotoOffsetDlg.h"

#include "hexeditor/HexInt64Validator.h"

#include <QButtonGroup>
#include <QDialogButtonBox>
#include <QGridLayout>
#include <QGroupBox>
#include <QLabel>
#include <QLineEdit>
#include <QRadioButton>
#include <QVBoxLayout>

#include <algorithm>

namespace HexEditor {

namespace {

GotoOffsetDlg::Mode s_lastMode = GotoOffsetDlg::FromBeginning;

int64_t clampToSigned(uint64_t v)
{
    return v > static_cast<uint64_t>(INT64_MAX) ? INT64_MAX : static_cast<int64_t>(v);
}

} // namespace

GotoOffsetDlg::GotoOffsetDlg(uint64_t size, uint64_t current, QWidget *parent)
    : QDialog(parent), m_size(size), m_current(std::min(current, size ? size - 1 : 0))
{
    setWindowTitle(tr("Go to Offset"));
    setObjectName(QStringLiteral("GotoOffsetDlg"));

    auto *layout = new QVBoxLayout(this);
    auto *grid = new QGridLayout;
    grid->addWidget(new QLabel(tr("Offset:"), this), 0, 0);
    m_edit = new QLineEdit(this);
    m_edit->setObjectName(QStringLiteral("edtOffset"));
    m_validator = new HexInt64Validator(0, 0, m_edit);
    m_edit->setValidator(m_validator);
    grid->addWidget(m_edit, 0, 1, 1, 2);
    m_min = new QLabel(this);
    m_min->setObjectName(QStringLiteral("lblMin"));
    m_max = new QLabel(this);
    m_max->setObjectName(QStringLiteral("lblMax"));
    grid->addWidget(m_min, 1, 1);
    grid->addWidget(m_max, 1, 2);
    layout->addLayout(grid);

    auto *box = new QGroupBox(this);
    auto *boxLayout = new QVBoxLayout(box);
    auto *group = new QButtonGroup(this);
    const QString names[3] = {tr("from beginning"), tr("from current position"), tr("from end")};
    for (int i = 0; i < 3; ++i) {
        m_modes[i] = new QRadioButton(names[i], box);
        group->addButton(m_modes[i], i);
        boxLayout->addWidget(m_modes[i]);
    }
    m_modes[1]->setObjectName(QStringLiteral("rbCurrent"));
    auto *backNote = new QLabel(tr("(use negative number to go back)"), box);
    boxLayout->addWidget(backNote);
    layout->addWidget(box);
    layout->addWidget(new QLabel(tr("use 0x prefix for hexadecimal values"), this));

    auto *buttons = new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel, this);
    connect(buttons, &QDialogButtonBox::accepted, this, &GotoOffsetDlg::accept);
    connect(buttons, &QDialogButtonBox::rejected, this, &GotoOffsetDlg::reject);
    layout->addWidget(buttons);

    m_modes[s_lastMode]->setChecked(true);
    connect(group, &QButtonGroup::idToggled, this, [this](int, bool checked) {
        if (checked)
            updateRange();
    });
    updateRange();
}

GotoOffsetDlg::Mode GotoOffsetDlg::mode() const
{
    for (int i = 0; i < 3; ++i)
        if (m_modes[i]->isChecked())
            return static_cast<Mode>(i);
    return FromBeginning;
}

void GotoOffsetDlg::setMode(Mode mode)
{
    m_modes[mode]->setChecked(true);
}

int64_t GotoOffsetDlg::minimum() const
{
    return m_validator->minimum();
}

int64_t GotoOffsetDlg::maximum() const
{
    return m_validator->maximum();
}

void GotoOffsetDlg::updateRange()
{
    const int64_t last = m_size ? clampToSigned(m_size - 1) : 0;
    int64_t min = 0;
    int64_t max = last;
    if (mode() == FromCurrent) {
        min = -clampToSigned(m_current);
        max = clampToSigned(m_size ? m_size - m_current - 1 : 0);
    }
    m_validator->setRange(min, max);
    const QLocale loc = m_validator->locale();
    m_min->setText(tr("Min: %1").arg(loc.toString(static_cast<qlonglong>(min))));
    m_max->setText(tr("Max: %1").arg(loc.toString(static_cast<qlonglong>(max))));
    // A value typed for the previous range is checked again.
    QString text = m_edit->text();
    int pos = static_cast<int>(text.size());
    if (!text.isEmpty() && m_validator->validate(text, pos) == QValidator::Invalid)
        m_edit->clear();
}

std::optional<uint64_t> GotoOffsetDlg::target() const
{
    const std::optional<int64_t> v = m_validator->acceptedValue(m_edit->text());
    if (!v || m_size == 0)
        return std::nullopt;
    switch (mode()) {
    case FromBeginning:
        return static_cast<uint64_t>(*v);
    case FromCurrent:
        return static_cast<uint64_t>(static_cast<int64_t>(m_current) + *v);
    case FromEnd:
        // The caret clamps an offset equal to the size to the last byte.
        return m_size - static_cast<uint64_t>(*v);
    }
    return std::nullopt;
}

GotoOffsetDlg::Mode GotoOffsetDlg::lastMode()
{
    return s_lastMode;
}

void GotoOffsetDlg::setLastMode(Mode mode)
{
    s_lastMode = mode;
}

void GotoOffsetDlg::accept()
{
    s_lastMode = mode();
    QDialog::accept();
}

} // namespace HexEditor
