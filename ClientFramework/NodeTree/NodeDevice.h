// A physical disk, virtual disk, RAID assembly or mounted disk image. Its children are one
// NodePartition per partition or gap of the kernel's partition list, or a NodeDrive when the
// whole device is one volume.
#pragma once

#include "ClientFramework/NodeTree/NodeStorage.h"

#include <memory>

class CVolume;

class NodeDevice : public NodeStorage
{
public:
    NodeDevice(CDevice *device, NodeCore *parent = nullptr);
    ~NodeDevice() override;

    NodeKind kind() const override { return NodeKind::Device; }
    CDevice *device() const { return m_device; }

    // IKernelStorage
    cStorage *kernelStorage() const override;
    CDevice *kernelDevice() const override { return m_device; }

    // Builds the partition and volume nodes again from the kernel (interface thread).
    void rebuild();
    // Reads the state word again from the device (ready, image, removable, ...).
    void refreshState();

    // The BIOS drive number text ("80h" for device 0), empty for images and non-physical disks.
    QString biosNumber() const;
    // The text shown to the user when devices cannot be read ("Reading disks needs root or
    // membership of the disk group."), empty when the device is ready.
    QString notReadyTip() const;
    static QString permissionTip();

    QString statusText() const override;
    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;
    QString defaultCommand() const override;

protected:
    QString name() const override;
    QString typeKey() const override;
    QString key() const override;
    QString kindText() const override;
    QString sourceText() const override;
    QString extraText(NodeAttr attr) const override;

private:
    CDevice *m_device = nullptr;
};
