#include "ClientFramework/Help/PopupDlg.h"

#include <QDialogButtonBox>
#include <QLabel>
#include <QTextBrowser>
#include <QVBoxLayout>

namespace Framework::Help {

PopupDlg::PopupDlg(const QString &title, const QString &html, const QString &footer, QWidget *parent)
    : QDialog(parent), m_browser(new QTextBrowser(this)), m_footer(new QLabel(footer, this))
{
    setWindowTitle(title);
    m_browser->setOpenExternalLinks(true);
    m_browser->setHtml(html);
    m_footer->setTextFormat(Qt::RichText);
    auto *buttons = new QDialogButtonBox(QDialogButtonBox::Close, this);
    connect(buttons, &QDialogButtonBox::rejected, this, &QDialog::reject);
    auto *layout = new QVBoxLayout(this);
    layout->addWidget(m_browser, 1);
    auto *bottom = new QHBoxLayout;
    bottom->addWidget(m_footer, 1);
    bottom->addWidget(buttons);
    layout->addLayout(bottom);
    resize(720, 560);
}

QString PopupDlg::html() const
{
    return m_browser->toHtml();
}

QString PopupDlg::footer() const
{
    return m_footer->text();
}

} // namespace Framework::Help
