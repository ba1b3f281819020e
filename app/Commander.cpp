#include "Commander.h"

namespace Solution {

Commander::Commander(QObject *parent) : Core::Commander(parent)
{
    for (const Core::CommandRecord &r : productCommands())
        registerCommand(r);
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
