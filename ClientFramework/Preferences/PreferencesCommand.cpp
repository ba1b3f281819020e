#include "ClientFramework/Preferences/PreferencesCommand.h"

#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Preferences/IPreferencePage.h"
#include "ClientFramework/Preferences/LogSheet.h"
#include "ClientFramework/Preferences/PreferencesDlg.h"

#include <QPointer>

namespace Framework::Preferences {

PreferencesDlg *createDialog(const Core::Commander &commander, QWidget *parent,
                             const QList<IPreferencePageSource *> &extraSources)
{
    auto *dialog = new PreferencesDlg(parent);
    QList<IPreferencePageSource *> sources;
    for (IFeatureCommander *feature : commander.features())
        if (auto *source = dynamic_cast<IPreferencePageSource *>(feature))
            sources.append(source);
    sources.append(extraSources);
    for (IPreferencePageSource *source : std::as_const(sources))
        if (source)
            for (IPreferencePage *page : source->createPreferencePages())
                dialog->addPage(page);
    return dialog;
}

void installCommand(Core::Commander &commander, QWidget *parent,
                    const QList<IPreferencePageSource *> &extraSources)
{
    QPointer<QWidget> owner(parent);
    // The framework's own pages come after those of the features.
    QList<IPreferencePageSource *> sources = extraSources;
    sources.append(&frameworkPreferencePages());
    commander.setHandler(QStringLiteral("cmdSettings"), [&commander, owner, sources] {
        // The window may go while the dialog runs; the dialog then went with it.
        QPointer<PreferencesDlg> dialog = createDialog(commander, owner.data(), sources);
        dialog->run();
        delete dialog.data();
    });
}

} // namespace Framework::Preferences
