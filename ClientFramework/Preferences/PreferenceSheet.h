// The widget side every page of the preferences dialog shares: the page is the widget itself, named
// after the page; its fields stand in a form above a stretch, and it reads and writes one element
// of the settings document, found anew each time (the document may have been reloaded meanwhile).
#pragma once

#include "ClientFramework/Preferences/IPreferencePage.h"

#include <QDomElement>
#include <QWidget>

#include <functional>

class QFormLayout;
class QVBoxLayout;

namespace Framework {

class PreferenceSheet : public QWidget, public IPreferencePage
{
    Q_OBJECT
public:
    QWidget *pageWidget() override { return this; }

protected:
    // objectName: the page's name ("prefLog"); element: where its settings live.
    PreferenceSheet(const QString &objectName, std::function<QDomElement()> element, QWidget *parent);

    // The element the page reads and writes (null when there is none to write).
    QDomElement settings() const { return m_element(); }
    // The form of the fields; rows added to it stand above the stretch.
    QFormLayout *form() const { return m_form; }
    // Adds a widget below the form (a note on the fields).
    void addBelowForm(QWidget *widget);

private:
    std::function<QDomElement()> m_element;
    QVBoxLayout *m_layout;
    QFormLayout *m_form;
};

} // namespace Framework
