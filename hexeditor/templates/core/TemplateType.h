// Template kinds: ids used by the command line, the template chooser and link fields.
#pragma once

#include <QString>

#include <cstdint>

namespace HexEditor::Templates {

enum Type : int32_t {
    None = 0,
    MasterBootRecord = 1,
    NtfsBootSector = 2,
    FatBootSector = 3,
    Fat32BootSector = 4,
    ExFatBootSector = 5,
    HfsPlusVolumeHeader = 6,
    ExtSuperBlock = 7,
    NtfsMftFileRecord = 8,
    FatDirectoryEntry = 9,
    ExFatDirectoryEntry = 10,
    LdmPrivateHeader = 11,
    LdmTocBlock = 12,
    LdmVmdbBlock = 13,
    LdmKLogBlock = 14,
    LdmVblkBlock = 15,
    HfsPlusCatalogNode = 16,
    HfsPlusFileRecord = 17,
    GuidPartitionTable = 18,
    UfsSuperblock = 19,
    UfsInode = 20,
    ExtInode = 21,
    BtrFsSuperblock = 22,
    RefsBootSector = 23,
    RefsEntry = 24,
    ApfsVolumeSuperblock = 25,
    ApfsFileSystem = 26,
    ApfsInode = 27,
    JfsVolumeSuperblock = 28,
    JfsInode = 29,
    XfsVolumeSuperblock = 30,
    XfsAgFreeSpaceBlock = 31,
    XfsAgInodesBlock = 32,
    XfsAgInode = 33,
    // The template pane picks kind and position from the storage.
    Automatic = 34,
};

// Number of concrete kinds (ids 0 to 33).
inline constexpr int TypeCount = 34;

// The display name of an id ("None" for 0); empty for an id that is no kind.
QString typeName(int id);

// The id of a kind given by number ("18") or by its untranslated name, compared without regard to
// case ("GUID Partition Table"); "auto" gives Automatic. -1 when nothing matches.
int typeFromText(const QString &text);

} // namespace HexEditor::Templates
