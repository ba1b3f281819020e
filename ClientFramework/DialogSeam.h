// Every message box and dialog of start-up goes through this seam, so another implementation can
// answer them (a test records the call and returns a scripted button).
#pragma once

#include <QMessageBox>
#include <QString>

namespace Framework {

class DialogSeam
{
public:
    virtual ~DialogSeam() = default;

    // A message box; returns the button the user chose.
    virtual QMessageBox::StandardButton message(QMessageBox::Icon icon, const QString &title,
                                                const QString &text, QMessageBox::StandardButtons buttons,
                                                QMessageBox::StandardButton defaultButton) = 0;

    // A modal help pop-up showing an HTML page with a footer line.
    virtual void helpPopup(const QString &title, const QString &html, const QString &footer) = 0;

    // Closes the splash window if one is showing.
    virtual void closeSplash() {}

    // The seam in use: the widget implementation unless another was installed.
    static DialogSeam &current();
    // Installs another seam (not owned); nullptr restores the widget implementation. Returns the previous.
    static DialogSeam *install(DialogSeam *seam);
};

// The production seam: real message boxes and the help pop-up dialog.
class WidgetDialogs : public DialogSeam
{
public:
    QMessageBox::StandardButton message(QMessageBox::Icon icon, const QString &title, const QString &text,
                                        QMessageBox::StandardButtons buttons,
                                        QMessageBox::StandardButton defaultButton) override;
    void helpPopup(const QString &title, const QString &html, const QString &footer) override;
};

} // namespace Framework
