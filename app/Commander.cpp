#include "app/Commander.h"

#include <QHash>

// The icons are compiled into the application library.
static void initCommandIcons()
{
    Q_INIT_RESOURCE(brindle);
}

namespace Solution {

namespace {

Core::CommandRecord withIcon(Core::CommandRecord record)
{
    const QString name = Commander::iconName(record.id);
    if (!name.isEmpty()) {
        record.icon16 = QStringLiteral(":/app/%1").arg(name);
        record.icon32 = QStringLiteral(":/app/32/%1").arg(name);
    }
    return record;
}

} // namespace

Commander::Commander(QObject *parent) : Core::Commander(parent)
{
    initCommandIcons();
    // The framework's records again with their icons, then the product's (which replace some).
    for (const Core::CommandRecord &r : frameworkCommands())
        if (!iconName(r.id).isEmpty())
            registerCommand(withIcon(r));
    for (const Core::CommandRecord &r : productCommands())
        registerCommand(withIcon(r));
}

QString Commander::iconName(const QString &id)
{
    static const QHash<QString, QString> icons = {
        {QStringLiteral("cmdOpen_Explorer"), QStringLiteral("open_disk")},
        {QStringLiteral("cmdDI_Mount"), QStringLiteral("image_mount")},
        {QStringLiteral("cmdRefresh"), QStringLiteral("refresh")},
        {QStringLiteral("cmdUpdate"), QStringLiteral("update")},
        {QStringLiteral("cmdHex_File"), QStringLiteral("hex_file")},
        {QStringLiteral("cmdProperties"), QStringLiteral("properties")},
        {QStringLiteral("cmdSmartInfo"), QStringLiteral("smart")},
        {QStringLiteral("cmdNode_Stop"), QStringLiteral("stop")},
        {QStringLiteral("cmdNode_StopAll"), QStringLiteral("stop_all")},
    };
    return icons.value(id);
}

const QList<Core::CommandRecord> &Commander::productCommands()
{
    auto rec = [](const char *id, const char *shortcut, const char *text, const char *tip) {
        return Core::CommandRecord{
            QString::fromLatin1(id), {}, {}, {}, QString::fromLatin1(shortcut), QString::fromLatin1(text),
            QString::fromLatin1(tip)};
    };
    static const QList<Core::CommandRecord> records = {
        rec("cmdOpen_Explorer", "Ctrl+E", "Open Disk", "Open physical disk, Partition or Volume in %1."),
        rec("cmdOpen_Browser", "", "File Browser",
            "Browse Local Computer and open Files or File Records in %1."),
        rec("cmdHex_File", "", "Open File...", "Open File in %1."),
        rec("cmdDI_Mount", "", "Open Disk Image...", "Open Disk Image file as virtual disk."),
    };
    return records;
}

} // namespace Solution
