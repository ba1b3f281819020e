#include "TemplateType.h"

#include <QCoreApplication>

namespace HexEditor::Templates {

QString typeName(int id)
{
    // The id-to-name table, built once.
    static const char *const names[TypeCount] = {
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
    if (id < 0 || id >= TypeCount)
        return {};
    return QCoreApplication::translate("HexEditor::Templates", names[id]);
}

} // namespace HexEditor::Templates
