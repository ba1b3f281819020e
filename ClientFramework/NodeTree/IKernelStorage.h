// Access from a node to the kernel objects it stands for. Every pointer is non-owning and may be
// null (unallocated space has no volume, a device node has no partition).
#pragma once

class cStorage;
class CDevice;
class CPartition;
class CVolume;
class CEntry;

class IKernelStorage
{
public:
    virtual ~IKernelStorage() = default;

    // The sectors the node stands for: the device, partition, volume or entry.
    virtual cStorage *kernelStorage() const = 0;
    // The device that holds it.
    virtual CDevice *kernelDevice() const = 0;
    virtual CPartition *kernelPartition() const { return nullptr; }
    virtual CVolume *kernelVolume() const { return nullptr; }
    virtual CEntry *kernelEntry() const { return nullptr; }
};
