// The hardware-information report: an XML file describing the machine's storage for support
// analysis (application and kernel versions, platform, every device with its identity, geometry,
// ATA native sizes and two raw sectors, every partition with its volume). Element names and their
// order are fixed; every value is escaped, so labels and models may hold any character.
#pragma once

#include <QByteArray>
#include <QDateTime>
#include <QList>
#include <QString>
#include <QStringList>

#include <cstdint>

class CDevice;
class CRoot;
class cRoot;

namespace HardwareInfo {

// What the report says besides the devices.
struct Header
{
    QString application; // the application's own text
    QString platform;    // the platform text
    QString stylesheet;  // an XSL stylesheet reference, or empty for none
    QDateTime created;   // printed in the system locale's short format
    QStringList logLines;
};

// The whole report of `devices` as UTF-8 bytes, lines ended by CR LF.
QByteArray Build(const QList<CDevice *> &devices, const Header &header);

// Writes `document` to a new file at `target` through a platform file handle of `owner` (may be
// null). Any failed write deletes the file again; `error` then holds the file's system error.
bool WriteDocument(cRoot *owner, const QString &target, const QByteArray &document, std::uint32_t &error);

// The report of every device of `root`, written to `target`.
bool Write(CRoot &root, const QString &target, const QString &stylesheet, const QString &application,
           const QStringList &logLines, std::uint32_t &error);

// A byte count as the report prints it: "512 B", "1.50 KB", "465.76 GB" (binary units).
QString SizeText(std::uint64_t bytes);

} // namespace HardwareInfo
