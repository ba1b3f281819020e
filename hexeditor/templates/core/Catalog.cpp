#include "hexeditor/templates/core/Catalog.h"

#include "Kernel/Implementation/Common/cStorage.h"
#include "hexeditor/templates/core/GptBuilder.h"
#include "hexeditor/templates/core/LdmBuilders.h"
#include "hexeditor/templates/core/MbrBuilder.h"

namespace HexEditor::Templates {

std::unique_ptr<Builder> createBuilder(int type)
{
    switch (type) {
    case MasterBootRecord:
        return std::make_unique<MbrBuilder>();
    case GuidPartitionTable:
        return std::make_unique<GptBuilder>();
    case LdmPrivateHeader:
        return std::make_unique<LdmPrivHeadBuilder>();
    case LdmTocBlock:
        return std::make_unique<LdmTocBuilder>();
    case LdmVmdbBlock:
        return std::make_unique<LdmVmdbBuilder>();
    case LdmKLogBlock:
        return std::make_unique<LdmKlogBuilder>();
    case LdmVblkBlock:
        return std::make_unique<LdmVblkBuilder>();
    default:
        return nullptr;
    }
}

QList<Type> availableTypes()
{
    QList<Type> out;
    for (int id = 1; id < TypeCount; ++id)
        if (createBuilder(id))
            out.append(Type(id));
    return out;
}

Type kindOfFileSystem(std::uint32_t code, bool automatic)
{
    switch (code) {
    case 1:
        return automatic ? MasterBootRecord : None;
    case 7:
        return FatBootSector;
    case 8:
        return Fat32BootSector;
    case 9:
        return ExFatBootSector;
    case 10:
        return NtfsBootSector;
    case 13:
        return HfsPlusVolumeHeader;
    case 14:
    case 15:
    case 16:
        return ExtSuperBlock;
    case 17:
        return UfsSuperblock;
    case 18:
        return RefsBootSector;
    case 20:
        return automatic ? BtrFsSuperblock : None;
    case 21:
        return XfsVolumeSuperblock;
    case 22:
        return JfsVolumeSuperblock;
    case 23:
        return ApfsVolumeSuperblock;
    default:
        return None;
    }
}

Placement automaticChoice(StorageKind kind, std::uint32_t fileSystemKind, std::uint32_t partitionStyle,
                          std::uint32_t sectorSize)
{
    Placement p;
    if (kind == StorageKind::Device) {
        if (partitionStyle == 2)
            p.type = MasterBootRecord;
        else if (partitionStyle == 3) {
            p.type = GuidPartitionTable;
            p.offset = sectorSize;
        }
        return p;
    }
    p.type = kindOfFileSystem(fileSystemKind, true);
    // The volume header and the superblocks lie at fixed byte offsets, whatever the sector size.
    switch (fileSystemKind) {
    case 13:
    case 14:
    case 15:
    case 16:
        p.offset = 1024;
        break;
    case 17:
        p.offset = 65536;
        break;
    case 20:
        p.offset = 65536;
        break;
    case 22:
        p.offset = 32768;
        break;
    default:
        break;
    }
    if (p.type == None)
        p.offset = 0;
    return p;
}

} // namespace HexEditor::Templates
