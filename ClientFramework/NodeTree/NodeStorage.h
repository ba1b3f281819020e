// A node with sectors: a device, a partition or a volume.
#pragma once

#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/IStorageGeometry.h"
#include "ClientFramework/NodeTree/NodeCore.h"

class NodeStorage : public NodeStatic, public IStorageGeometry, public IKernelStorage
{
public:
    using NodeStatic::NodeStatic;

    // IStorageGeometry from kernelStorage() (first sector 0); partitions and volumes override.
    std::uint32_t sectorSize() const override;
    std::uint64_t firstSector() const override { return 0; }
    std::uint64_t sectorCount() const override;

    // Kernel objects along the parent chain.
    CDevice *kernelDevice() const override;

    // The commands that read data are disabled unless the node is ready.
    bool canReadData() const { return isReady(); }

protected:
    QString extraText(NodeAttr attr) const override;
};
