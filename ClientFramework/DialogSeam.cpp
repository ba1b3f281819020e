#include "ClientFramework/DialogSeam.h"

#include "ClientFramework/Help/PopupDlg.h"

#include <atomic>

namespace Framework {

namespace {
std::atomic<DialogSeam *> installed{nullptr};
} // namespace

DialogSeam &DialogSeam::current()
{
    static WidgetDialogs widgets;
    DialogSeam *seam = installed.load();
    return seam ? *seam : widgets;
}

DialogSeam *DialogSeam::install(DialogSeam *seam)
{
    return installed.exchange(seam);
}

QMessageBox::StandardButton WidgetDialogs::message(QMessageBox::Icon icon, const QString &title,
                                                   const QString &text, QMessageBox::StandardButtons buttons,
                                                   QMessageBox::StandardButton defaultButton)
{
    QMessageBox box(icon, title, text, buttons);
    box.setDefaultButton(defaultButton);
    return static_cast<QMessageBox::StandardButton>(box.exec());
}

void WidgetDialogs::helpPopup(const QString &title, const QString &html, const QString &footer)
{
    Help::PopupDlg dlg(title, html, footer);
    dlg.exec();
}

} // namespace Framework
