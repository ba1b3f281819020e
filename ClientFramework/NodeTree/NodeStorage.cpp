#include "ClientFramework/NodeTree/NodeStorage.h"

#include "Kernel/Implementation/Common/cStorage.h"

uint32_t NodeStorage::sectorSize() const
{
    const cStorage *s = kernelStorage();
    return s ? s->GetBytesPerSector() : 512;
}

uint64_t NodeStorage::sectorCount() const
{
    const cStorage *s = kernelStorage();
    return s ? s->GetTotalSectors() : 0;
}

CDevice *NodeStorage::kernelDevice() const
{
    for (const NodeCore *n = parent(); n; n = n->parent())
        if (auto *k = dynamic_cast<const IKernelStorage *>(n))
            return k->kernelDevice();
    return nullptr;
}

QString NodeStorage::extraText(NodeAttr attr) const
{
    const cStorage *s = kernelStorage();
    switch (attr) {
    case NodeAttr::Size:
        return s ? sizeText(s->GetSize()) : QString();
    case NodeAttr::FirstSector:
        return QString::number(firstSector());
    case NodeAttr::SectorCount:
        return QString::number(sectorCount());
    case NodeAttr::SectorSize:
        return QString::number(sectorSize());
    default:
        return QString();
    }
}
