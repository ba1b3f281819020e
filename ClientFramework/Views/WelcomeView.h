// The welcome view: the "Getting Started" and "Support" commands as links, the rights the process has
// ("Administrator Rights"), and the "Show this view on startup" box kept in its settings element.
#pragma once

#include "ClientFramework/Views/GenericView.h"

#include <QStringList>

class QCheckBox;
class QLabel;

namespace Core {
class Commander;
}

namespace Framework {

class WelcomeView : public GenericView
{
    Q_OBJECT
public:
    static inline const QString ViewId = QStringLiteral("welcome");
    static inline const QString StartupAttribute = QStringLiteral("show-on-startup");

    WelcomeView(Core::Commander *commander, const QStringList &gettingStarted, const QStringList &support,
                QWidget *parent = nullptr);

    // The line "Administrator Rights: %1 <b>%2</b>; <br />" for this process.
    static QString rightsLine(bool administrator);
    // Whether the view opens at start: the stored box (on by default).
    static bool showOnStartup(const QDomElement &element);

    QCheckBox *startupBox() const { return m_startup; }
    QLabel *rightsLabel() const { return m_rights; }
    // The command ids listed in each group, in order.
    QStringList gettingStarted() const { return m_gettingStarted; }
    QStringList support() const { return m_support; }

    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

private:
    QWidget *commandGroup(const QString &title, const QStringList &ids);

    Core::Commander *m_commander;
    QStringList m_gettingStarted;
    QStringList m_support;
    QCheckBox *m_startup;
    QLabel *m_rights;
};

} // namespace Framework
