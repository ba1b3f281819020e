#include "ClientFramework/Log/NameTags.h"

#include "ClientFramework/AppIdentity.h"
#include "Kernel/Implementation/Common/KernelVersion.h"

#include <QCoreApplication>
#include <QDateTime>
#include <QMutex>
#include <QSysInfo>

namespace Framework::NameTags {

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NameTags", text);
}

const char UniqueAlphabet[] = "123456789ABCDEFGHJKLMNPQRSTUVWXYZ";
constexpr int UniqueAlphabetLength = sizeof(UniqueAlphabet) - 1;

} // namespace

const QList<Tag> &table()
{
    static const QList<Tag> tags = {
        {QStringLiteral("{AppName}"), tr("Application name"), {}},
        {QStringLiteral("{AppVersion}"), tr("Application full version"), {}},
        {QStringLiteral("{OS}"), tr("Operating system name"), QStringLiteral("Debian GNU/Linux 12")},
        {QStringLiteral("{UniqueID}"), tr("Generated unique ID"), QStringLiteral("X9DAR654")},
        {QStringLiteral("{KernelVersion}"), tr("Disk kernel version"), {}},
        {QStringLiteral("{Date(YYYYMMDD)}"), tr("Date"), QStringLiteral("20120824")},
        {QStringLiteral("{Date(YYYY-MM-DD)}"), tr("Date"), QStringLiteral("2012-08-24")},
        {QStringLiteral("{Date(YYMMDD)}"), tr("Date"), QStringLiteral("120824")},
        {QStringLiteral("{Date(YYYY)}"), tr("Year"), QStringLiteral("2012")},
        {QStringLiteral("{Date(YY)}"), tr("Year, two digits"), {}},
        {QStringLiteral("{Date(Month)}"), tr("Month name"), QStringLiteral("August")},
        {QStringLiteral("{Date(MM)}"), tr("Month"), {}},
        {QStringLiteral("{Date(DD)}"), tr("Day"), {}},
        {QStringLiteral("{Time(HHmmss)}"), tr("Time"), QStringLiteral("184503")},
        {QStringLiteral("{Time(HH-mm-ss)}"), tr("Time"), QStringLiteral("18-45-03")},
        {QStringLiteral("{Time(HH)}"), tr("Hours"), {}},
        {QStringLiteral("{Time(mm)}"), tr("Minutes"), {}},
        {QStringLiteral("{Time(ss)}"), tr("Seconds"), {}},
        {QStringLiteral("{SerialNumber}"), tr("Device serial number"), QStringLiteral("9QG3NCKC")},
        {QStringLiteral("{PlatformID}"), tr("Device platform name"), {}},
        {QStringLiteral("{ProductID}"), tr("Device model name"), QStringLiteral("ST3500630AS ATA Device")},
        {QStringLiteral("{Type}"), tr("Device type"), QStringLiteral("Fixed Disk")},
        {QStringLiteral("{Size}"), tr("Device size"), QStringLiteral("1.8Tb")},
        {QStringLiteral("{Sectors}"), tr("Device size in sectors"), QStringLiteral("976773168")},
        {QStringLiteral("{Status}"), tr("Overall process result"), QStringLiteral("Success")},
        {QStringLiteral("{DateStarted}"), tr("Process start date"), QStringLiteral("23/10/2019")},
        {QStringLiteral("{TimeStarted}"), tr("Process start time"), QStringLiteral("08:43:39")},
        {QStringLiteral("{TimeElapsed}"), tr("Process elapsed time"), QStringLiteral("01:51:27")},
        {QStringLiteral("{StatusCode}"), tr("Overall process result code"), {}},
        {QStringLiteral("{ProcessType}"), tr("Process type name"), QStringLiteral("Erase")},
        {QStringLiteral("{ProcessedAs}"), tr("Short name of a process"), QStringLiteral("Erased")},
        {QStringLiteral("{Range}"), tr("Processed disk range"), QStringLiteral("0-43379 sectors")},
        {QStringLiteral("{Sequence #}"), tr("Sequence number"), QStringLiteral("3")},
        {QStringLiteral("{Sequence 0#}"), tr("Sequence number, two digits"), QStringLiteral("03")},
        {QStringLiteral("{Sequence 00#}"), tr("Sequence number, three digits"), QStringLiteral("003")},
        {QStringLiteral("{Sequence 000#}"), tr("Sequence number, four digits"), QStringLiteral("0003")},
    };
    return tags;
}

QString uniqueId()
{
    static QMutex mutex;
    static int counter = 0;
    QMutexLocker lock(&mutex);
    const QChar c = QLatin1Char(UniqueAlphabet[counter]);
    if (++counter >= UniqueAlphabetLength)
        counter = 0;
    return QDateTime::currentDateTime().toString(QStringLiteral("MD-hmm")) + c;
}

QString expand(const QString &pattern, const TagContext *context)
{
    if (!pattern.contains(QLatin1Char('{')))
        return pattern;
    const QDateTime now = QDateTime::currentDateTime();
    const QDate d = now.date();
    const QTime t = now.time();
    const TagContext none;
    const TagContext &c = context ? *context : none;
    auto seq = [&c](int width) {
        return c.sequence ? QStringLiteral("%1").arg(*c.sequence, width, 10, QLatin1Char('0')) : QString();
    };

    const QList<std::pair<QString, QString>> values = {
        {QStringLiteral("{AppName}"), Identity::ShortName},
        {QStringLiteral("{AppVersion}"), Identity::FileVersion},
        {QStringLiteral("{OS}"), QSysInfo::prettyProductName()},
        {QStringLiteral("{KernelVersion}"), Kernel::version()},
        {QStringLiteral("{Date(YYYYMMDD)}"), d.toString(QStringLiteral("yyyyMMdd"))},
        {QStringLiteral("{Date(YYYY-MM-DD)}"), d.toString(QStringLiteral("yyyy-MM-dd"))},
        {QStringLiteral("{Date(YYMMDD)}"), d.toString(QStringLiteral("yyMMdd"))},
        {QStringLiteral("{Date(YYYY)}"), d.toString(QStringLiteral("yyyy"))},
        {QStringLiteral("{Date(YY)}"), d.toString(QStringLiteral("yy"))},
        {QStringLiteral("{Date(Month)}"), d.toString(QStringLiteral("MMMM"))},
        {QStringLiteral("{Date(MM)}"), d.toString(QStringLiteral("MM"))},
        {QStringLiteral("{Date(DD)}"), d.toString(QStringLiteral("dd"))},
        {QStringLiteral("{Time(HHmmss)}"), t.toString(QStringLiteral("HHmmss"))},
        {QStringLiteral("{Time(HH-mm-ss)}"), t.toString(QStringLiteral("HH-mm-ss"))},
        {QStringLiteral("{Time(HH)}"), t.toString(QStringLiteral("HH"))},
        {QStringLiteral("{Time(mm)}"), t.toString(QStringLiteral("mm"))},
        {QStringLiteral("{Time(ss)}"), t.toString(QStringLiteral("ss"))},
        {QStringLiteral("{SerialNumber}"), c.serialNumber},
        {QStringLiteral("{PlatformID}"), c.platformId},
        {QStringLiteral("{ProductID}"), c.productId},
        {QStringLiteral("{Type}"), c.type},
        {QStringLiteral("{Size}"), c.size},
        {QStringLiteral("{Sectors}"), c.sectors},
        {QStringLiteral("{Status}"), c.status},
        {QStringLiteral("{DateStarted}"), c.dateStarted},
        {QStringLiteral("{TimeStarted}"), c.timeStarted},
        {QStringLiteral("{TimeElapsed}"), c.timeElapsed},
        {QStringLiteral("{StatusCode}"), c.statusCode},
        {QStringLiteral("{ProcessType}"), c.processType},
        {QStringLiteral("{ProcessedAs}"), c.processedAs},
        {QStringLiteral("{Range}"), c.range},
        {QStringLiteral("{Sequence #}"), seq(1)},
        {QStringLiteral("{Sequence 0#}"), seq(2)},
        {QStringLiteral("{Sequence 00#}"), seq(3)},
        {QStringLiteral("{Sequence 000#}"), seq(4)},
    };
    QString r = pattern;
    for (const auto &[tag, value] : values)
        r.replace(tag, value);
    // Each occurrence of the unique ID is a new one.
    const QString unique = QStringLiteral("{UniqueID}");
    for (qsizetype at = r.indexOf(unique); at >= 0; at = r.indexOf(unique, at)) {
        const QString id = uniqueId();
        r.replace(at, unique.size(), id);
        at += id.size();
    }
    return r;
}

} // namespace Framework::NameTags
