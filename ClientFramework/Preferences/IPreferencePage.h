// A page of the preferences dialog. Feature modules contribute pages through IPreferencePageSource
// (their feature commander implements it); the framework may add its own. The page is a widget whose
// object name identifies it ("prefHexEditor"); the dialog takes it over and deletes it with itself.
#pragma once

#include <QIcon>
#include <QList>
#include <QString>

class QWidget;

namespace Framework {

class IPreferencePage
{
public:
    virtual ~IPreferencePage() = default;

    // The page itself, shown right of the page list.
    virtual QWidget *pageWidget() = 0;
    // Shown in the page list and above the page.
    virtual QString pageTitle() const = 0;
    // One line below the title.
    virtual QString pageDescription() const = 0;
    virtual QIcon pageIcon() const = 0;

    // Fills the fields from the settings document.
    virtual void loadSettings() = 0;
    // Writes the fields into the settings document and applies them to whatever they govern at
    // once. The dialog writes the settings file afterwards.
    virtual void saveSettings() = 0;
    // Puts the default values into the fields (nothing is written until saveSettings).
    virtual void restoreDefaults() = 0;
};

// Something that brings pages (a feature commander, or the framework itself).
class IPreferencePageSource
{
public:
    virtual ~IPreferencePageSource() = default;

    // New pages for one dialog, in the order they are listed. Their widgets have no parent yet.
    virtual QList<IPreferencePage *> createPreferencePages() = 0;
};

} // namespace Framework
