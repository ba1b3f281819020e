#include "ClientFramework/CLI/Arguments.h"

#include "ClientFramework/AppIdentity.h"
#include "ClientFramework/DialogSeam.h"
#include "ClientFramework/Settings/PathMacros.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <QCoreApplication>
#include <QDir>
#include <QFileInfo>

#include <algorithm>

namespace Framework::CLI {

namespace {
Arguments *theArguments = nullptr;

QString tr(const char *text)
{
    return QCoreApplication::translate("CLI::Arguments", text);
}
} // namespace

Arguments::Arguments(const QStringList &args, bool completeNow) : arguments(args)
{
    theArguments = this;
    parser.setSingleDashWordOptionMode(QCommandLineParser::ParseAsLongOptions);
    parser.setApplicationDescription(Identity::ShortName);
    addOption({QStringLiteral("?"), QStringLiteral("h"), QStringLiteral("help")},
              tr("Display descriptions of command line parameters."));
    addOption({QStringLiteral("v"), QStringLiteral("version")},
              tr("Display application version and edition information."));
    addOption({QStringLiteral("test")}, tr("Save Hardware Info."), QStringLiteral("filename"));
    addOption({QStringLiteral("nohidpi")}, tr("Disable High DPI scaling."));
    addOption({QStringLiteral("nowelcome")}, tr("Skip Welcome Screen."));
    addOption({QStringLiteral("preserve")}, tr("Preserve command line arguments in application settings. "
                                               "Thats affects application GUI behavior."));
    addOption({QStringLiteral("ra"), QStringLiteral("retryattempts")}, tr("Number of retry attempts."),
              QStringLiteral("attempts"));
    addOption({QStringLiteral("ie"), QStringLiteral("ignoreerrors")}, tr("Ignore errors."));
    addOption({QStringLiteral("er"), QStringLiteral("stopaftererrors")}, tr("Stop after error count."),
              QStringLiteral("errors"));
    addOption({QStringLiteral("sd"), QStringLiteral("shutdown")},
              tr("Save log and shutdown after completion."));
    addOption({QStringLiteral("cl"), QStringLiteral("clearlog")}, tr("Clear log before start."));
    addOption({QStringLiteral("lp"), QStringLiteral("logpath")}, tr("Log file path."),
              QStringLiteral("path"));
    addOption({QStringLiteral("mdi"), QStringLiteral("mountdi")}, tr("Mount Disk Image."),
              QStringLiteral("mountdi"));
    if (completeNow)
        complete();
}

Arguments::~Arguments()
{
    if (theArguments == this)
        theArguments = nullptr;
}

void Arguments::addOption(const QStringList &names, const QString &description, const QString &valueName,
                          const QString &defaultValue)
{
    QCommandLineOption option(names, description, valueName, defaultValue);
    m_options.append(option);
    parser.addOption(option);
}

void Arguments::complete()
{
    for (qsizetype i = 1; i < arguments.size(); ++i) {
        if (!arguments[i].startsWith(QLatin1Char('-')))
            arguments[i].prepend(QLatin1Char('-'));
    }
    if (arguments.size() > 1)
        parseAndValidate();
}

bool Arguments::parseAndValidate()
{
    commandLineError.clear();
    m_parsed = true;
    if (!parser.parse(arguments)) {
        commandLineError = parser.errorText();
        return false;
    }
    if (parser.optionNames().isEmpty()) {
        commandLineError = tr("No valid (empty) parameters list");
        return false;
    }
    int given = 0;
    for (const QCommandLineOption &o : m_options)
        given += parser.isSet(o) ? 1 : 0;
    if ((isSet(QStringLiteral("test")) || isSet(QStringLiteral("help"))) && given > 1) {
        commandLineError = tr("Parameters -test and -help cannot be used with other parameters.");
        return false;
    }
    const int retries = integer(QStringLiteral("retryattempts"), 2);
    if (retries < 0 || retries > 100) {
        commandLineError = tr("Wrong number of retry attempts: %1").arg(retries);
        return false;
    }
    const int limit = integer(QStringLiteral("stopaftererrors"), 0);
    if (limit < 0) {
        commandLineError = tr("Wrong number of error count: %1").arg(limit);
        return false;
    }
    return true;
}

void Arguments::save()
{
    QDomElement root = SettingsDocument::instance().root();
    save(root, false);
}

void Arguments::save(QDomElement &root, bool flush)
{
    auto child = &SettingsDocument::child;
    // Clearing the log is one bit of the log's option word; it follows the command line either way.
    {
        QDomElement log = child(root, QStringLiteral("log"));
        bool ok = false;
        uint32_t attr = log.attribute(QStringLiteral("attr")).toUInt(&ok);
        if (!ok)
            attr = 1;
        if (isSet(QStringLiteral("clearlog")))
            attr |= 0x20;
        else
            attr &= ~0x20u;
        log.setAttribute(QStringLiteral("attr"), attr);
    }
    if (isSet(QStringLiteral("logpath"))) {
        const QString path = parser.value(QStringLiteral("logpath"));
        const QFileInfo info(path);
        QString name = info.fileName();
        QString folder = path.contains(QLatin1Char('/')) || path.contains(QLatin1Char('\\'))
                             ? QDir::toNativeSeparators(info.path())
                             : QString();
        QDomElement log = child(root, QStringLiteral("log"));
        log.setAttribute(QStringLiteral("file"), name.isEmpty() ? Identity::LogFileName : name);
        log.setAttribute(QStringLiteral("path"), folder.isEmpty() ? PathMacros::DefaultLogFolder : folder);
    }
    if (isSet(QStringLiteral("shutdown")))
        child(child(root, QStringLiteral("general")), QStringLiteral("triggers"))
            .setAttribute(QStringLiteral("final-action"), 3);
    QDomElement errors = child(child(root, QStringLiteral("processing")), QStringLiteral("error-handling"));
    if (isSet(QStringLiteral("retryattempts")))
        errors.setAttribute(QStringLiteral("retries"), integer(QStringLiteral("retryattempts"), 2));
    if (isSet(QStringLiteral("ignoreerrors"))) {
        QDomElement ignore = child(errors, QStringLiteral("ignore"));
        for (const char *key : {"lock", "read", "write"})
            ignore.setAttribute(QString::fromLatin1(key), QStringLiteral("true"));
    }
    if (isSet(QStringLiteral("stopaftererrors"))) {
        const int limit = integer(QStringLiteral("stopaftererrors"), 0);
        errors.setAttribute(QStringLiteral("limit"), limit);
        if (limit == 0)
            errors.setAttribute(QStringLiteral("abort"), 2);
    }
    if (flush)
        SettingsDocument::instance().save();
}

void Arguments::load() {}

void Arguments::load(const QDomElement &) {}

void Arguments::showHelp()
{
    DialogSeam::current().closeSplash();
    DialogSeam::current().message(QMessageBox::Information, Identity::ShortName, parser.helpText(),
                                  QMessageBox::Ok, QMessageBox::Ok);
}

void Arguments::showVersion()
{
    DialogSeam::current().closeSplash();
    const QString text = tr("<h2>%1</h2><p>Version: <b>%2 (%3)</b></p>")
                             .arg(Identity::FullName, Identity::Version, Identity::FileVersion) +
                         tr("<p>Edition: %1%2</p>").arg(Identity::Version, Identity::PlatformSuffix) +
                         tr("<p>Built with Qt %1, running on Qt %2.</p>")
                             .arg(QStringLiteral(QT_VERSION_STR), QString::fromLatin1(qVersion()));
    DialogSeam::current().message(QMessageBox::Information, Identity::FullName, text, QMessageBox::Ok,
                                  QMessageBox::Ok);
}

bool Arguments::hasRequest() const
{
    for (const char *name : {"test", "help", "version", "mountdi"})
        if (isSet(QString::fromLatin1(name)))
            return true;
    return false;
}

Arguments *Arguments::instance()
{
    return theArguments;
}

bool Arguments::isSet(const QString &name) const
{
    // The parser warns about names it does not know and before parsing; ask only what it can answer.
    if (!m_parsed)
        return false;
    for (const QCommandLineOption &o : m_options)
        if (o.names().contains(name))
            return parser.isSet(name);
    return false;
}

bool Arguments::flag(const QString &name, bool defaultValue) const
{
    if (!isSet(name))
        return defaultValue;
    const QString v = parser.value(name);
    if (v.isEmpty())
        return true;
    bool ok = false;
    const int n = v.toInt(&ok, 10);
    if (ok)
        return n != 0;
    return v.compare(QStringLiteral("true"), Qt::CaseInsensitive) == 0;
}

int Arguments::integer(const QString &name, int defaultValue) const
{
    if (!isSet(name))
        return defaultValue;
    bool ok = false;
    const int n = parser.value(name).toInt(&ok, 10);
    return ok ? n : defaultValue;
}

uint64_t Arguments::offset(const QString &name, uint64_t defaultValue) const
{
    if (!isSet(name))
        return defaultValue;
    const QString v = parser.value(name);
    // Only plain decimal digits: no sign, no "0x".
    if (v.isEmpty() || !std::all_of(v.begin(), v.end(), [](QChar c) { return c >= u'0' && c <= u'9'; }))
        return defaultValue;
    bool ok = false;
    const qulonglong n = v.toULongLong(&ok, 10);
    return ok ? n : defaultValue;
}

bool Arguments::isOptionSet(const QString &name)
{
    return theArguments ? theArguments->isSet(name) : false;
}

bool Arguments::flagValue(const QString &name, bool defaultValue)
{
    return theArguments ? theArguments->flag(name, defaultValue) : defaultValue;
}

int Arguments::intValue(const QString &name, int defaultValue)
{
    return theArguments ? theArguments->integer(name, defaultValue) : defaultValue;
}

uint64_t Arguments::offsetValue(const QString &name, uint64_t defaultValue)
{
    return theArguments ? theArguments->offset(name, defaultValue) : defaultValue;
}

} // namespace Framework::CLI
