// A dialog seam for tests: records every box and pop-up and answers with scripted buttons.
#pragma once

#include "ClientFramework/DialogSeam.h"

#include <QList>

struct RecordedDialog
{
    QMessageBox::Icon icon = QMessageBox::NoIcon;
    QString title;
    QString text;
    QMessageBox::StandardButtons buttons;
    QMessageBox::StandardButton defaultButton = QMessageBox::NoButton;
    bool help = false;
    QString footer;
};

class RecordingDialogs : public Framework::DialogSeam
{
public:
    RecordingDialogs() { m_previous = install(this); }
    ~RecordingDialogs() override { install(m_previous); }

    QMessageBox::StandardButton message(QMessageBox::Icon icon, const QString &title, const QString &text,
                                        QMessageBox::StandardButtons buttons,
                                        QMessageBox::StandardButton defaultButton) override
    {
        calls.append({icon, title, text, buttons, defaultButton, false, {}});
        return answers.isEmpty() ? defaultButton : answers.takeFirst();
    }
    void helpPopup(const QString &title, const QString &html, const QString &footer) override
    {
        calls.append({QMessageBox::NoIcon, title, html, {}, QMessageBox::NoButton, true, footer});
    }

    QList<QMessageBox::StandardButton> answers;
    QList<RecordedDialog> calls;

private:
    DialogSeam *m_previous = nullptr;
};
