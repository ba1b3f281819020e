#include "ClientFramework/Processing/ErrorHandling.h"

#include "ClientFramework/CLI/Arguments.h"
#include "ClientFramework/Settings/SettingsDocument.h"

#include <algorithm>

namespace Framework::Processing {

namespace {

int number(const QDomElement &element, const QString &name, int fallback)
{
    bool ok = false;
    const int value = element.attribute(name).toInt(&ok);
    return ok ? value : fallback;
}

bool flag(const QDomElement &element, const QString &name)
{
    return element.attribute(name) == QLatin1String("true");
}

} // namespace

ErrorHandling ErrorHandling::stored(const QDomElement &settingsRoot)
{
    ErrorHandling h;
    const QDomElement errors = settingsRoot.firstChildElement(QStringLiteral("processing"))
                                   .firstChildElement(QStringLiteral("error-handling"));
    if (errors.isNull())
        return h;
    h.retries = number(errors, QStringLiteral("retries"), h.retries);
    h.limit = number(errors, QStringLiteral("limit"), h.limit);
    const QDomElement ignore = errors.firstChildElement(QStringLiteral("ignore"));
    h.ignoreLock = flag(ignore, QStringLiteral("lock"));
    h.ignoreRead = flag(ignore, QStringLiteral("read"));
    h.ignoreWrite = flag(ignore, QStringLiteral("write"));
    return h;
}

ErrorHandling ErrorHandling::forThisRun()
{
    ErrorHandling h = stored(SettingsDocument::instance().root());
    h.applyCommandLine();
    return h;
}

void ErrorHandling::applyCommandLine()
{
    using Framework::CLI::Arguments;
    if (Arguments::isOptionSet(QStringLiteral("retryattempts")))
        retries = Arguments::intValue(QStringLiteral("retryattempts"), 2);
    if (Arguments::isOptionSet(QStringLiteral("ignoreerrors")))
        ignoreLock = ignoreRead = ignoreWrite = true;
    if (Arguments::isOptionSet(QStringLiteral("stopaftererrors")))
        limit = Arguments::intValue(QStringLiteral("stopaftererrors"), 0);
}

std::uint8_t ErrorHandling::transferAttempts() const
{
    return std::uint8_t(std::clamp(retries, 1, 255));
}

} // namespace Framework::Processing
