// A modal pop-up that shows one HTML help page with a footer line and a Close button.
#pragma once

#include <QDialog>

class QTextBrowser;
class QLabel;

namespace Framework::Help {

class PopupDlg : public QDialog
{
    Q_OBJECT
public:
    PopupDlg(const QString &title, const QString &html, const QString &footer, QWidget *parent = nullptr);

    QString html() const;
    QString footer() const;

private:
    QTextBrowser *m_browser;
    QLabel *m_footer;
};

} // namespace Framework::Help
