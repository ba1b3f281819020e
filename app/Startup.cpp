#include "app/Startup.h"

#include "app/CliArguments.h"
#include "app/Commander.h"
#include "app/KernelHost.h"
#include "app/KernelRecords.h"
#include "app/MainView.h"
#include "app/ProcessingAction.h"
#include "app/RequestHost.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Application.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/GenericError.h"
#include "ClientFramework/HighDpi.h"
#include "ClientFramework/Log/ApplicationLog.h"
#include "ClientFramework/Processing/ErrorHandling.h"
#include "ClientFramework/QuitOnSignal.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "ClientFramework/Views/RecentFiles.h"

#include "Kernel/Implementation/Common/KernelVersion.h"
#include "Kernel/Implementation/Root/Root.h"

#include <QApplication>
#include <QDateTime>
#include <QDir>
#include <QLibraryInfo>

#include <memory>
#include <optional>

namespace Solution {

using Framework::ApplicationLog;
using Framework::LogEntry;

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("Startup", text);
}

// The version line with its sub-entries.
void logVersion(const QString &kernelVersion)
{
    auto &log = ApplicationLog::instance();
    LogEntry *version = log.add(tr("Version: %1").arg(Framework::Identity::FileVersion));
    log.addChild(version,
                 tr("Edition: %1%2").arg(Framework::Identity::Version, Framework::Identity::PlatformSuffix));
    log.addChild(version, tr("File Version: %1").arg(Framework::Identity::FileVersion));
    log.addChild(version, tr("Internal Kernel Version: %1").arg(kernelVersion));
    log.addChild(version, tr("Qt Library: %1").arg(QLibraryInfo::version().toString()));
}

} // namespace

int Startup::run(int &argc, char **argv)
{
    QStringList arguments;
    for (int i = 0; i < argc; ++i)
        arguments << QString::fromLocal8Bit(argv[i]);
    return run(arguments, argc, argv);
}

int Startup::run(const QStringList &argumentList, int &argc, char **argv)
{
    auto &log = ApplicationLog::instance();
    // Destroyed in reverse: the main window, the instance segment, the application, the arguments.
    std::unique_ptr<CLI::Arguments> arguments;
    std::unique_ptr<CLI::KernelHost> host;
    std::unique_ptr<Framework::Application> application;
    std::unique_ptr<Framework::SingleInstanceGuard> guard;
    std::unique_ptr<CRoot> root;
    std::unique_ptr<Solution::Commander> commander;
    std::unique_ptr<MainView> mainView;
    try {
        arguments = std::make_unique<CLI::Arguments>(argumentList);
        log.add(tr("Initializing..."));
        if (arguments->arguments.size() > 1)
            log.add(tr("Command line attributes: %1").arg(arguments->arguments.join(QLatin1Char(' '))));

        if (!m_options.application) {
            const bool scaling = Framework::decideHighDpi(
                Framework::primaryScreenDpi(), CLI::Arguments::flagValue(QStringLiteral("nohidpi"), false));
            Framework::applyHighDpi(scaling);
            application = std::make_unique<Framework::Application>(argc, argv);
        } else {
            application = std::make_unique<Framework::Application>(m_options.application);
        }

        guard = std::make_unique<Framework::SingleInstanceGuard>(
            Framework::SingleInstanceGuard::userKey(m_options.instanceKey));
        if (!guard->acquire())
            throw GenericError(tr("%1 is already running").arg(Framework::Identity::FullName),
                               GenericError::Warning);

        if (!arguments->commandLineError.isEmpty()) {
            const QString text =
                tr("<p>%1<p>Command line:<br>'%2'")
                    .arg(arguments->commandLineError, arguments->arguments.join(QLatin1Char(' ')));
            const auto answer = Framework::DialogSeam::current().message(
                QMessageBox::Critical, tr("Command line processing error"), text,
                QMessageBox::Abort | QMessageBox::Ignore | QMessageBox::Help, QMessageBox::Abort);
            if (answer == QMessageBox::Ignore) {
                arguments->commandLineError.clear();
                arguments->arguments.clear();
            } else {
                if (answer == QMessageBox::Help)
                    arguments->showHelp();
                throw GenericError(tr("Done!"), GenericError::Information);
            }
        } else if (CLI::Arguments::isOptionSet(QStringLiteral("help"))) {
            arguments->showHelp();
            throw GenericError(tr("Done!"), GenericError::Information);
        } else if (CLI::Arguments::isOptionSet(QStringLiteral("version"))) {
            arguments->showVersion();
            throw GenericError(tr("Done!"), GenericError::Information);
        }

        if (arguments->commandLineError.isEmpty() &&
            CLI::Arguments::flagValue(QStringLiteral("preserve"), false)) {
            QDomElement root = Framework::SettingsDocument::instance().root();
            arguments->save(root, true);
        }

        // The disk kernel root: its records reach the log (a disk this process may not open is
        // a normal condition, not a failure of the run); devices are enumerated on request.
        root = std::make_unique<CRoot>();
        KernelRecords::connect(root.get(), application.get());
        // A failing sector is tried as often as the stored error handling, or the command line, asks.
        root->RetryCount(Framework::Processing::ErrorHandling::forThisRun().transferAttempts());
        if (m_options.kernelReady)
            m_options.kernelReady(*root);

        commander = std::make_unique<Solution::Commander>();
        mainView = std::make_unique<MainView>(commander.get());
        mainView->setKernel(root.get());

        host = std::make_unique<CLI::KernelHost>(*root);
        // "-mountdi" may be given more than once: every image opens as a virtual disk.
        if (arguments->isOptionSet(QStringLiteral("mountdi")))
            for (const QString &image : arguments->parser.values(QStringLiteral("mountdi")))
                host->mountImage(image);
        auto *action = new CLI::ProcessingAction(*host, application.get());
        action->runAfterInitialization(application.get());
        QObject::connect(action, &CLI::ProcessingAction::quitRequested, application.get(),
                         [] { QCoreApplication::quit(); });
        QObject::connect(action, &CLI::ProcessingAction::finalActionChosen, application.get(),
                         &Framework::Application::setFinalAction);

        mainView->setHooks({[&host](const QString &path) { return host->mountImage(path); },
                            [&host](const QString &path) { return host->saveHardwareInfo(path); }});
        mainView->build();
        application->registerComponent(Framework::RecentFiles::SettingsElement, mainView->recentFiles());
        application->registerComponent(Framework::MainView::SettingsElement, mainView.get());
        // This machine's disks are listed before the window shows and before any request of the
        // command line runs (a request enumerates again when it needs a fresh list).
        root->RefreshAndWait(false, RefreshKinds(), 30000);
        mainView->show();
        // A terminate request from here on ends the run in order (it is served once the loop runs).
        std::optional<Framework::QuitOnSignal> quitOnSignal;
        if (m_options.runEventLoop)
            quitOnSignal.emplace();
        application->initializationCompleted();

        log.add(
            tr("Default working location set to '%1'").arg(QDir::toNativeSeparators(QDir::currentPath())));
        const QString kernelVersion = Kernel::version();
        logVersion(!root ? tr("pending...") : kernelVersion.isEmpty() ? tr("Undefined") : kernelVersion);

        int code = 0;
        if (m_options.runEventLoop)
            QApplication::exec();
        code = application->exitCode();
        if (code != 0)
            log.add(tr("Exiting with error code: %1").arg(code));

        log.add(tr("Application closed at (%1)")
                    .arg(QDateTime::currentDateTime().toString(QStringLiteral("dd/MM/yyyy hh:mm:ss"))));
        application->saveState();
        return code;
    } catch (const GenericError &e) {
        e.report();
    } catch (const std::exception &e) {
        GenericError::report(QString::fromLocal8Bit(e.what()), GenericError::Critical);
    }
    return 1;
}

} // namespace Solution
