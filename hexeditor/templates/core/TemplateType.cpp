#include "hexeditor/templates/core/TemplateType.h"

#include <QCoreApplication>

namespace HexEditor::Templates {

namespace {

// The id-to-name table, built once.
const char *const names[TypeCount] = {
    "None",
    "Master Boot Record",
    "NTFS Boot Sector",
    "FAT Boot Sector",
    "FAT32 Boot Sector",
    "exFAT Boot Sector",
    "HFS+ Volume Header",
    "Ext2/3/4 SuperBlock",
    "NTFS MFT File Record",
    "FAT Directory Entry",
    "exFAT Directory Entry",
    "LDM Private Header",
    "LDM TOC Block",
    "LDM VMDB Block",
    "LDM KLog Block",
    "LDM VBLK Block",
    "HFS+ Catalog Node",
    "HFS+ File Record",
    "GUID Partition Table",
    "UFS Superblock",
    "UFS Inode",
    "Ext2/3/4 Inode",
    "BtrFS Superblock",
    "ReFS Boot Sector",
    "ReFS Entry",
    "ApFS Volume Superblock",
    "ApFS File System",
    "ApFS Inode",
    "JFS Volume Superblock",
    "JFS Inode",
    "XFS Volume Superblock",
    "XFS AG Free Space Block",
    "XFS AG Inodes Block",
    "XFS AG Inode",
};

} // namespace

QString typeName(int id)
{
    if (id < 0 || id >= TypeCount)
        return {};
    return QCoreApplication::translate("HexEditor::Templates", names[id]);
}

int typeFromText(const QString &text)
{
    const QString t = text.trimmed();
    bool ok = false;
    const int id = t.toInt(&ok);
    if (ok)
        return id >= 0 && id <= Automatic ? id : -1;
    if (t.compare(QLatin1String("auto"), Qt::CaseInsensitive) == 0 ||
        t.compare(QLatin1String("automatic"), Qt::CaseInsensitive) == 0)
        return Automatic;
    for (int i = 0; i < TypeCount; ++i)
        if (t.compare(QLatin1String(names[i]), Qt::CaseInsensitive) == 0)
            return i;
    return -1;
}

} // namespace HexEditor::Templates
