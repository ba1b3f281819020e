#include "cli/Template.h"

#include <QJsonDocument>

#include "Kernel/Implementation/Devices/Device.h"
#include "Kernel/Implementation/Root/Root.h"
#include "cli/OptionReader.h"
#include "cli/Source.h"
#include "cli/TemplateSource.h"
#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/Record.h"
#include "hexeditor/templates/core/TreeText.h"

namespace Cli {

namespace {

namespace T = HexEditor::Templates;

int usage(Io &io, const QString &problem)
{
    io.err << "brindle-cli template: " << problem << "\n"
           << "usage: brindle-cli template SOURCE --type ID|NAME --offset N [--copy-offset N] [--json]\n"
           << "       brindle-cli template SOURCE --auto [--json]\n";
    return Usage;
}

QString kindList()
{
    QStringList names;
    for (T::Type t : T::availableTypes())
        names.append(QStringLiteral("%1 (%2)").arg(int(t)).arg(T::typeName(t)));
    return names.join(QStringLiteral(", "));
}

} // namespace

int runTemplate(const QStringList &args, Io &io)
{
    QString source, problem;
    int type = -1;
    std::uint64_t offset = 0, copyOffset = 0;
    bool haveOffset = false, haveCopy = false, json = false;
    OptionReader options;
    options.flag(QStringLiteral("--json"), json);
    options.flag(QStringLiteral("--auto"), [&type] { type = T::Automatic; });
    options.value(
        QStringLiteral("--type"),
        [&type](const QString &v) {
            type = T::typeFromText(v);
            return type >= 0;
        },
        QStringLiteral("'%1' is no template kind"));
    const QString notOffset = QStringLiteral("'%1' is not a byte offset");
    options.number(QStringLiteral("--offset"), offset, haveOffset, notOffset);
    options.number(QStringLiteral("--copy-offset"), copyOffset, haveCopy, notOffset);
    if (!options.read(args, source, problem))
        return usage(io, problem);
    if (source.isEmpty())
        return usage(io, QStringLiteral("no source given"));
    if (type < 0)
        return usage(io, QStringLiteral("--type or --auto is required"));
    if (type != T::Automatic && !haveOffset)
        return usage(io, QStringLiteral("--offset is required with --type"));

    CRoot root;
    QString error;
    CDevice *device = resolveSource(root, source, error);
    if (!device) {
        io.err << "brindle-cli template: " << error << "\n";
        return Failed;
    }
    TemplateSource bytes(*device);

    if (type == T::Automatic) {
        const T::Placement p = T::automaticChoice(StorageKind::Device, 0xFFFFFFFF,
                                                  std::uint32_t(device->GetPartStyle()), bytes.sectorSize());
        type = p.type;
        offset = p.offset;
        if (!haveCopy)
            copyOffset = p.offset;
        if (type == T::None) {
            io.err << "brindle-cli template: no template fits " << device->GetDisplayName() << "\n";
            return Failed;
        }
    } else if (!haveCopy) {
        copyOffset = offset;
    }

    auto builder = T::createBuilder(type);
    if (!builder) {
        io.err << "brindle-cli template: no template for kind " << type << " (" << T::typeName(type)
               << "); available: " << kindList() << "\n";
        return Failed;
    }
    T::Record record(&bytes, std::move(builder), QLocale::c());
    record.setOffset(copyOffset, false);
    record.setOffset(offset, true);
    if (json)
        io.out << QJsonDocument(T::listingJson(record)).toJson(QJsonDocument::Indented);
    else
        io.out << T::listingText(record);
    if (!record.root()) {
        io.err << "brindle-cli template: the record at offset " << offset << " does not fit on "
               << device->GetDisplayName() << "\n";
        return Failed;
    }
    return Ok;
}

} // namespace Cli
