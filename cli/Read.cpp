#include "cli/Read.h"

#include <QIODevice>
#include <vector>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Report/HexDump.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/OptionReader.h"
#include "cli/Source.h"

namespace Cli {

namespace {

// Bytes fetched per kernel request; the output follows each piece.
constexpr std::uint64_t Piece = 1 << 20;

int usage(Io &io, const QString &problem)
{
    io.err << "brindle-cli read: " << problem << "\n"
           << "usage: brindle-cli read SOURCE --offset N --length N [--raw]\n";
    return Usage;
}

} // namespace

int runRead(const QStringList &args, Io &io)
{
    QString source, problem;
    std::uint64_t offset = 0, length = 0;
    bool haveOffset = false, haveLength = false, raw = false;
    OptionReader options;
    options.flag(QStringLiteral("--raw"), raw);
    options.number(QStringLiteral("--offset"), offset, haveOffset,
                   QStringLiteral("'%1' is not a byte count"));
    options.number(QStringLiteral("--length"), length, haveLength,
                   QStringLiteral("'%1' is not a byte count"));
    if (!options.read(args, source, problem))
        return usage(io, problem);
    if (source.isEmpty())
        return usage(io, QStringLiteral("no source given"));
    if (!haveOffset || !haveLength)
        return usage(io, QStringLiteral("--offset and --length are required"));

    CRoot root;
    QString error;
    CDevice *device = resolveSource(root, source, error);
    if (!device) {
        io.err << "brindle-cli read: " << error << "\n";
        return Failed;
    }

    const std::uint64_t size = device->GetSize();
    const std::uint64_t existing = offset >= size ? 0 : std::min(length, size - offset);
    std::vector<std::uint8_t> buffer(std::size_t(std::min(existing, Piece)));
    std::uint64_t done = 0;
    while (done < existing) {
        const std::uint64_t n = std::min(existing - done, Piece);
        std::uint32_t code = 0;
        if (!device->ReadBytes(offset + done, n, buffer.data(), code)) {
            io.out.flush();
            io.err << "brindle-cli read: " << device->GetDisplayName() << ": read failed at offset "
                   << (offset + done) << " (system error " << code << ")\n";
            return Failed;
        }
        if (raw) {
            io.out.flush();
            io.rawOut.write(reinterpret_cast<const char *>(buffer.data()), qint64(n));
        } else {
            for (std::uint64_t at = 0; at < n; at += HexDump::BytesPerLine) {
                const std::size_t count = std::size_t(std::min<std::uint64_t>(HexDump::BytesPerLine, n - at));
                io.out << HexDump::Line(offset + done + at, buffer.data() + at, count) << "\n";
            }
        }
        done += n;
    }
    if (existing < length) {
        io.out.flush();
        io.err << "brindle-cli read: the range runs past the end of " << device->GetDisplayName() << " ("
               << size << " bytes); " << existing << " of " << length << " bytes read\n";
        return Failed;
    }
    return Ok;
}

} // namespace Cli
