// "Preferences..." (cmdSettings): the preferences dialog with the pages of every feature commander
// that brings some (IPreferencePageSource) and of any other sources added here.
#pragma once

#include <QList>

class QWidget;

namespace Core {
class Commander;
}

namespace Framework {

class IPreferencePageSource;
class PreferencesDlg;

namespace Preferences {

// Makes a dialog with the pages of the commander's features and of the extra sources, in that order.
PreferencesDlg *createDialog(const Core::Commander &commander, QWidget *parent,
                             const QList<IPreferencePageSource *> &extraSources = {});

// Connects cmdSettings to a dialog made by createDialog and shown through PreferencesDlg::run: the
// pages of the features, of the extra sources, then the framework's own (the application log).
void installCommand(Core::Commander &commander, QWidget *parent,
                    const QList<IPreferencePageSource *> &extraSources = {});

} // namespace Preferences
} // namespace Framework
