#include "ClientFramework/Preferences/PreferencesDlg.h"

#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QDialogButtonBox>
#include <QFrame>
#include <QHBoxLayout>
#include <QLabel>
#include <QListWidget>
#include <QPushButton>
#include <QStackedWidget>
#include <QVBoxLayout>

namespace Framework {

namespace {
PreferencesDlg::Runner &runner()
{
    static PreferencesDlg::Runner r;
    return r;
}
} // namespace

PreferencesDlg::PreferencesDlg(QWidget *parent)
    : QDialog(parent), m_list(new QListWidget(this)), m_stack(new QStackedWidget(this)),
      m_icon(new QLabel(this)), m_title(new QLabel(this)), m_description(new QLabel(this)),
      m_buttons(new QDialogButtonBox(QDialogButtonBox::Ok | QDialogButtonBox::Cancel |
                                         QDialogButtonBox::Apply | QDialogButtonBox::RestoreDefaults,
                                     this))
{
    setObjectName(QStringLiteral("PreferencesDlg"));
    setWindowTitle(tr("Preferences"));

    m_list->setObjectName(QStringLiteral("pageList"));
    m_list->setIconSize(QSize(32, 32));
    m_list->setSpacing(2);
    m_list->setUniformItemSizes(true);
    m_list->setMinimumWidth(150);
    m_list->setMaximumWidth(200);

    QFont titleFont = m_title->font();
    titleFont.setBold(true);
    titleFont.setPointSizeF(titleFont.pointSizeF() * 1.25);
    m_title->setFont(titleFont);
    m_title->setObjectName(QStringLiteral("pageTitle"));
    m_description->setObjectName(QStringLiteral("pageDescription"));
    m_description->setWordWrap(true);
    m_icon->setFixedSize(32, 32);

    auto *header = new QHBoxLayout;
    auto *texts = new QVBoxLayout;
    texts->addWidget(m_title);
    texts->addWidget(m_description);
    header->addLayout(texts, 1);
    header->addWidget(m_icon, 0, Qt::AlignTop);
    auto *line = new QFrame(this);
    line->setFrameShape(QFrame::HLine);
    line->setFrameShadow(QFrame::Sunken);

    auto *right = new QVBoxLayout;
    right->addLayout(header);
    right->addWidget(line);
    right->addWidget(m_stack, 1);

    auto *body = new QHBoxLayout;
    body->addWidget(m_list);
    body->addLayout(right, 1);

    auto *layout = new QVBoxLayout(this);
    layout->addLayout(body, 1);
    layout->addWidget(m_buttons);

    connect(m_list, &QListWidget::currentRowChanged, this, &PreferencesDlg::showPage);
    connect(m_buttons, &QDialogButtonBox::accepted, this, &PreferencesDlg::accept);
    connect(m_buttons, &QDialogButtonBox::rejected, this, &PreferencesDlg::reject);
    connect(m_buttons->button(QDialogButtonBox::Apply), &QPushButton::clicked, this, &PreferencesDlg::apply);
    connect(m_buttons->button(QDialogButtonBox::RestoreDefaults), &QPushButton::clicked, this,
            &PreferencesDlg::restoreDefaults);
    resize(640, 440);
}

PreferencesDlg::~PreferencesDlg() = default;

void PreferencesDlg::addPage(IPreferencePage *page)
{
    if (!page || !page->pageWidget() || m_pages.contains(page))
        return;
    m_pages.append(page);
    page->loadSettings();
    m_stack->addWidget(page->pageWidget());
    auto *item = new QListWidgetItem(page->pageIcon(), page->pageTitle(), m_list);
    item->setData(Qt::UserRole, page->pageWidget()->objectName());
    if (m_pages.size() == 1)
        m_list->setCurrentRow(0);
}

IPreferencePage *PreferencesDlg::page(const QString &objectName) const
{
    for (IPreferencePage *p : m_pages)
        if (p->pageWidget()->objectName() == objectName)
            return p;
    return nullptr;
}

int PreferencesDlg::currentPage() const
{
    return m_list->currentRow();
}

void PreferencesDlg::setCurrentPage(int index)
{
    if (index >= 0 && index < m_pages.size())
        m_list->setCurrentRow(index);
}

void PreferencesDlg::showPage(int index)
{
    IPreferencePage *p = page(index);
    if (!p) {
        m_title->clear();
        m_description->clear();
        m_icon->clear();
        return;
    }
    m_stack->setCurrentWidget(p->pageWidget());
    m_title->setText(p->pageTitle());
    m_description->setText(p->pageDescription());
    m_icon->setPixmap(p->pageIcon().pixmap(32, 32));
}

bool PreferencesDlg::apply()
{
    if (!m_applying.tryAcquire())
        return false;
    for (IPreferencePage *p : std::as_const(m_pages))
        p->saveSettings();
    const bool written = SettingsDocument::instance().save();
    if (!written)
        ApplicationLog::instance().add(
            tr("Unable to write the settings file '%1'").arg(SettingsDocument::instance().path()),
            LogEntry::Warning);
    m_applying.release();
    return written;
}

void PreferencesDlg::restoreDefaults()
{
    if (IPreferencePage *p = page(currentPage()))
        p->restoreDefaults();
}

void PreferencesDlg::accept()
{
    apply();
    QDialog::accept();
}

PreferencesDlg::Runner PreferencesDlg::setRunner(Runner r)
{
    Runner previous = std::move(runner());
    runner() = std::move(r);
    return previous;
}

int PreferencesDlg::run()
{
    if (runner())
        return runner()(*this);
    return exec();
}

} // namespace Framework
