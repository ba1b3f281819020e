#include "ClientFramework/Application.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/CLI/Arguments.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QApplication>

namespace Framework {

namespace {
Application *theApplication = nullptr;
}

Application::Application(int &argc, char **argv)
    : m_owned(std::make_unique<QApplication>(argc, argv)), m_app(m_owned.get())
{
    open();
}

Application::Application(QApplication *existing) : m_app(existing)
{
    open();
}

Application::~Application()
{
    ApplicationLog::instance().close();
    if (theApplication == this)
        theApplication = nullptr;
}

Application *Application::instance()
{
    return theApplication;
}

void Application::open()
{
    theApplication = this;
    auto &log = ApplicationLog::instance();
    m_errorsAtStart = log.errorCount();
    m_warningsAtStart = log.warningCount();
    QCoreApplication::setApplicationName(Identity::ShortName);
    QCoreApplication::setOrganizationName(Identity::OrganizationName);
    QCoreApplication::setApplicationVersion(Identity::FileVersion);

    auto &settings = SettingsDocument::instance();
    settings.open(SettingsDocument::defaultPath());
    registerComponent(QStringLiteral("log"), &log);
    // The command line overrides the stored log options for this run.
    log.overrideForRun(CLI::Arguments::flagValue(QStringLiteral("clearlog"), false),
                       CLI::Arguments::isOptionSet(QStringLiteral("logpath"))
                           ? CLI::Arguments::instance()->parser.value(QStringLiteral("logpath"))
                           : QString());
    log.start();
}

void Application::registerComponent(const QString &element, IPersistenceXML *component)
{
    m_components.append({element, component});
    component->load(SettingsDocument::instance().element(element));
}

void Application::saveState()
{
    auto &settings = SettingsDocument::instance();
    for (const auto &[name, component] : std::as_const(m_components)) {
        QDomElement e = settings.element(name);
        component->save(e, false);
    }
    settings.save();
}

void Application::initializationCompleted()
{
    ApplicationLog::instance().add(tr("Application initialization completed"));
    emit initialized();
}

int Application::exitCode() const
{
    const auto &log = ApplicationLog::instance();
    if (log.errorCount() > m_errorsAtStart)
        return 1;
    if (log.warningCount() - m_warningsAtStart > m_conditions)
        return 2;
    return 0;
}

void Application::logCondition(const QString &text)
{
    ++m_conditions;
    ApplicationLog::instance().add(text, LogEntry::Warning);
}

} // namespace Framework
