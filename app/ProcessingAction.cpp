#include "app/ProcessingAction.h"

#include "app/RequestHost.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/Application.h"
#include "ClientFramework/CLI/Arguments.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/GenericError.h"
#include "ClientFramework/Settings/SettingsDocument.h"
#include "hexeditor/templates/TemplateType.h"

#include <QCoreApplication>
#include <QHash>
#include <QTimer>

namespace CLI {

using Args = Framework::CLI::Arguments;

ProcessingAction::ProcessingAction(IRequestHost &host, QObject *parent)
    : Framework::ActionState(
          QCoreApplication::translate("CLI::ProcessingAction", "Execute %1 with command line arguments")
              .arg(Framework::Identity::ShortName),
          parent),
      m_host(host)
{
}

void ProcessingAction::runAfterInitialization(Framework::Application *application)
{
    connect(application, &Framework::Application::initialized, this,
            [this] { QTimer::singleShot(1000, this, &ProcessingAction::run); });
}

void ProcessingAction::run()
{
    ++m_runs;
    Framework::DialogSeam::current().closeSplash();
    Args *args = Args::instance();
    if (!args) {
        complete(NothingToDo);
        return;
    }
    if (!args->commandLineError.isEmpty() || Args::isOptionSet(QStringLiteral("help"))) {
        const bool error = !args->commandLineError.isEmpty();
        args->showHelp();
        complete(error ? Failed : HelpShown);
        emit quitRequested();
        return;
    }
    if (Args::isOptionSet(QStringLiteral("test"))) {
        m_host.saveHardwareInfo(args->parser.value(QStringLiteral("test")));
        complete(ReportSaved);
        emit quitRequested();
        return;
    }
    if (!args->hasRequest()) {
        complete(NothingToDo);
        return;
    }
    try {
        if (Args::isOptionSet(QStringLiteral("file")) && m_runs == 1) {
            bool ready = true;
            if (NodeCore *node = m_host.findFileNode(args->parser.value(QStringLiteral("file")), &ready);
                node && !ready) {
                // Finish on the second run, once the node is prepared.
                m_host.prepareNode(node, [this] { run(); });
                return;
            }
        }
        NodeCore *context = resolveContext();
        if (!context)
            throw GenericError(tr("No context object found!"), GenericError::Silent);
        const uint64_t offset = Args::offsetValue(QStringLiteral("offset"), 0);
        const int type = Args::intValue(QStringLiteral("template"), HexEditor::Templates::Automatic);
        const uint64_t offsetTmpl = Args::offsetValue(QStringLiteral("templateoffset"), offset);
        m_host.openInHexEditor(context, offset, true, type, offsetTmpl);
        complete(Success);
    } catch (const GenericError &e) {
        e.report();
        complete(Failed);
    }
}

NodeCore *ProcessingAction::resolveContext()
{
    Args *args = Args::instance();
    if (Args::isOptionSet(QStringLiteral("file")))
        return m_host.openFileNode(args->parser.value(QStringLiteral("file")));

    NodeCore *device = nullptr;
    const QList<ContextDevice> devices = m_host.devices();
    if (Args::isOptionSet(QStringLiteral("mountdi"))) {
        const QString image = args->parser.value(QStringLiteral("mountdi"));
        for (const ContextDevice &d : devices)
            if (d.prefix == 3 && d.imagePath.compare(image, Qt::CaseInsensitive) == 0) {
                device = d.node;
                break;
            }
    }
    const int disk = Args::intValue(QStringLiteral("disk"), -1);
    if (disk >= 0) {
        const int i = selectDevice(devices, disk, Args::intValue(QStringLiteral("diskprefix"), 255));
        if (i >= 0)
            device = devices[i].node;
    }
    if (!device)
        throw GenericError(tr("No context device found!"), GenericError::Silent);
    if (!Args::isOptionSet(QStringLiteral("volumeoffset")))
        return device;
    constexpr uint64_t none = UINT64_MAX; // a value that is no number matches no volume
    const uint64_t at = Args::offsetValue(QStringLiteral("volumeoffset"), none);
    return at == none ? nullptr : m_host.volumeAt(device, at);
}

int ProcessingAction::selectDevice(const QList<ContextDevice> &devices, int disk, int prefix)
{
    if (disk < 0)
        return -1;
    QHash<int, int> numbers; // next number within each prefix
    for (int i = 0; i < devices.size(); ++i) {
        const int number = numbers[devices[i].prefix]++;
        if (number == disk && (prefix == 255 || prefix == devices[i].prefix))
            return i;
    }
    return -1;
}

void ProcessingAction::complete(uint32_t result)
{
    // The stored final action, or "save the log and shut down" when the command line asks for it.
    int action = Framework::SettingsDocument::instance()
                     .root()
                     .firstChildElement(QStringLiteral("general"))
                     .firstChildElement(QStringLiteral("triggers"))
                     .attribute(QStringLiteral("final-action"), QStringLiteral("0"))
                     .toInt();
    if (!isCancelled() && Args::flagValue(QStringLiteral("shutdown"), false))
        action = 3;
    finish(result);
    emit finalActionChosen(action);
}

} // namespace CLI
