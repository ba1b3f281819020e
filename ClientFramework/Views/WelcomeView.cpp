#include "ClientFramework/Views/WelcomeView.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Commands/Commander.h"
#include "ClientFramework/Privileges.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QAction>
#include <QCheckBox>
#include <QCommandLinkButton>
#include <QGroupBox>
#include <QLabel>
#include <QScrollArea>
#include <QVBoxLayout>

#include <pwd.h>
#include <unistd.h>

namespace Framework {

WelcomeView::WelcomeView(Core::Commander *commander, const QStringList &gettingStarted,
                         const QStringList &support, QWidget *parent)
    : GenericView(ViewId, tr("Welcome"), parent), m_commander(commander), m_gettingStarted(gettingStarted),
      m_support(support), m_startup(new QCheckBox(tr("Show this view on startup"))), m_rights(new QLabel)
{
    auto *page = new QWidget;
    auto *layout = new QVBoxLayout(page);
    auto *heading =
        new QLabel(tr("<h2>%1</h2><p>Version %2</p>").arg(Identity::FullName, Identity::FileVersion));
    layout->addWidget(heading);
    auto *groups = new QHBoxLayout;
    groups->addWidget(commandGroup(tr("Getting Started"), gettingStarted), 1);
    groups->addWidget(commandGroup(tr("Support"), support), 1);
    layout->addLayout(groups);
    m_rights->setObjectName(QStringLiteral("rights"));
    m_rights->setTextFormat(Qt::RichText);
    m_rights->setText(rightsLine(hasAdministratorRights()));
    if (!hasAdministratorRights())
        m_rights->setToolTip(tr("Reading disks needs root or membership of the disk group."));
    layout->addWidget(m_rights);
    layout->addStretch(1);
    m_startup->setObjectName(QStringLiteral("showOnStartup"));
    m_startup->setChecked(true);
    layout->addWidget(m_startup);
    auto *scroll = new QScrollArea;
    scroll->setWidgetResizable(true);
    scroll->setFrameShape(QFrame::NoFrame);
    scroll->setWidget(page);
    setCentralWidget(scroll);
    // The box takes effect at the next start even when the view is closed before the window saves.
    connect(m_startup, &QCheckBox::toggled, this, [this] {
        QDomElement views = SettingsDocument::child(
            SettingsDocument::instance().element(QStringLiteral("main-view")), QStringLiteral("views"));
        QDomElement own = SettingsDocument::child(views, ViewId);
        save(own, false);
    });
}

QWidget *WelcomeView::commandGroup(const QString &title, const QStringList &ids)
{
    auto *box = new QGroupBox(title);
    box->setObjectName(title);
    auto *layout = new QVBoxLayout(box);
    for (const QString &id : ids) {
        QAction *a = m_commander ? m_commander->action(id) : nullptr;
        if (!a)
            continue;
        auto *button = new QCommandLinkButton(a->text().remove(QLatin1Char('&')), a->statusTip());
        button->setObjectName(id);
        button->setIcon(a->icon());
        button->setEnabled(a->isEnabled());
        connect(a, &QAction::changed, button, [button, a] { button->setEnabled(a->isEnabled()); });
        connect(button, &QCommandLinkButton::clicked, a, &QAction::trigger);
        layout->addWidget(button);
    }
    layout->addStretch(1);
    return box;
}

QString WelcomeView::rightsLine(bool administrator)
{
    const passwd *pw = getpwuid(geteuid());
    const QString account = pw ? QString::fromLocal8Bit(pw->pw_name) : QString::number(geteuid());
    return tr("Administrator Rights: %1 <b>%2</b>; <br />")
        .arg(account.toHtmlEscaped(), administrator ? tr("Yes") : tr("No"));
}

bool WelcomeView::showOnStartup(const QDomElement &element)
{
    return element.attribute(StartupAttribute, QStringLiteral("1")) != QLatin1String("0");
}

void WelcomeView::save(QDomElement &element, bool)
{
    element.setAttribute(StartupAttribute, m_startup->isChecked() ? 1 : 0);
}

void WelcomeView::load(const QDomElement &element)
{
    const QSignalBlocker block(m_startup);
    m_startup->setChecked(showOnStartup(element));
}

} // namespace Framework
