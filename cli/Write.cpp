#include "cli/Write.h"

#include <QFile>

#include <cctype>

#include "Kernel/Implementation/Common/SystemError.h"
#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/OptionReader.h"
#include "cli/Source.h"
#include "hexeditor/StorageSectorWrite.h"
#include "hexeditor/StorageWriteGuard.h"

namespace Cli {

namespace {

// The most a single write command takes (the editor's own limit for one edit is far lower).
constexpr qint64 MaxInput = qint64(1) << 30;

// Hexadecimal digit pairs; blanks, colons and dashes between pairs are allowed.
bool parseHex(const QString &text, QByteArray &bytes)
{
    QString digits;
    for (const QChar c : text) {
        if (c == QLatin1Char(' ') || c == QLatin1Char(':') || c == QLatin1Char('-'))
            continue;
        if (!isxdigit(c.toLatin1()) || c.unicode() > 0x7F)
            return false;
        digits += c;
    }
    if (digits.isEmpty() || digits.size() % 2)
        return false;
    bytes = QByteArray::fromHex(digits.toLatin1());
    return true;
}

int usage(Io &io, const QString &problem)
{
    io.err << "brindle-cli write: " << problem << "\n"
           << "usage: brindle-cli write SOURCE --offset N (--hex HEX | --file PATH) --yes\n";
    return Usage;
}

} // namespace

int runWrite(const QStringList &args, Io &io)
{
    CRoot root;
    return runWrite(args, io, root);
}

int runWrite(const QStringList &args, Io &io, CRoot &root)
{
    QString source, hex, file, problem;
    std::uint64_t offset = 0;
    bool haveOffset = false, haveHex = false, haveFile = false, yes = false;
    OptionReader options;
    options.flag(QStringLiteral("--yes"), yes);
    options.number(QStringLiteral("--offset"), offset, haveOffset,
                   QStringLiteral("'%1' is not a byte offset"));
    options.text(QStringLiteral("--hex"), hex, haveHex);
    options.text(QStringLiteral("--file"), file, haveFile);
    if (!options.read(args, source, problem))
        return usage(io, problem);
    if (source.isEmpty())
        return usage(io, QStringLiteral("no source given"));
    if (!haveOffset)
        return usage(io, QStringLiteral("--offset is required"));
    if (haveHex == haveFile)
        return usage(io, QStringLiteral("give exactly one of --hex and --file"));

    QByteArray bytes;
    if (haveHex && !parseHex(hex, bytes))
        return usage(io, QStringLiteral("'%1' is not a sequence of hexadecimal byte pairs").arg(hex));
    if (haveFile) {
        QFile in(file);
        if (!in.open(QIODevice::ReadOnly)) {
            io.err << "brindle-cli write: cannot read '" << file << "': " << in.errorString() << "\n";
            return Failed;
        }
        if (in.size() > MaxInput) {
            io.err << "brindle-cli write: '" << file << "' is larger than " << MaxInput << " bytes\n";
            return Failed;
        }
        bytes = in.readAll();
        if (bytes.isEmpty()) {
            io.err << "brindle-cli write: '" << file << "' is empty\n";
            return Failed;
        }
    }
    if (!yes) {
        io.err << "brindle-cli write: refusing to write " << bytes.size() << " bytes to " << source
               << " without --yes (this changes the medium and can damage its file systems)\n";
        return Failed;
    }

    QString error;
    CDevice *device = resolveSource(root, source, error);
    if (!device) {
        io.err << "brindle-cli write: " << error << "\n";
        return Failed;
    }
    const std::uint64_t size = device->GetSize();
    const std::uint64_t ss = device->GetBytesPerSector();
    if (!ss || offset >= size || std::uint64_t(bytes.size()) > size - offset) {
        io.err << "brindle-cli write: " << bytes.size() << " bytes at offset " << offset << " do not fit "
               << device->GetDisplayName() << " (" << size << " bytes)\n";
        return Failed;
    }
    const std::uint64_t first = offset / ss;
    const std::uint64_t last = (offset + std::uint64_t(bytes.size()) - 1) / ss;
    HexEditor::WriteGuard guard(device, first, last - first + 1);
    if (!guard.refusal().isEmpty()) {
        io.err << "brindle-cli write: " << guard.refusal() << "\n";
        return Failed;
    }
    const HexEditor::SectorWrite::Result r =
        HexEditor::SectorWrite::writeBytes(*device, offset, bytes.constData(), std::uint64_t(bytes.size()));
    // What was written counts once it is on the medium.
    std::uint32_t flushError = 0;
    const bool flushed = device->Flush(flushError);
    if (!r.ok()) {
        const bool refused = !r.readFailed && !r.written &&
                             (r.error == SystemError::AccessDenied || r.error == SystemError::WriteProtect);
        io.err << "brindle-cli write: " << device->GetDisplayName() << ": "
               << (refused ? QStringLiteral("cannot be opened for writing")
                           : QStringLiteral("%1 sector %2 failed")
                                 .arg(r.readFailed ? "reading" : "writing")
                                 .arg(r.failedSector))
               << " (system error " << r.error << ": " << systemErrorText(r.error) << "); " << r.written
               << " of " << bytes.size() << " bytes written\n";
        return Failed;
    }
    if (!flushed) {
        io.err << "brindle-cli write: " << device->GetDisplayName() << ": the written data did not reach the "
               << "medium (system error " << flushError << ": " << systemErrorText(flushError) << ")\n";
        return Failed;
    }
    io.out << "wrote " << bytes.size() << " bytes at offset " << offset << " to " << device->GetDisplayName()
           << " (" << (last - first + 1) << " sectors)\n";
    return Ok;
}

} // namespace Cli
