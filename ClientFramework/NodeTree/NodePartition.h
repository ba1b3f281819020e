// A partition, an extended partition or unallocated space on a device. An extended partition's
// children are its logical partitions; any other partition's child is its volume (NodeDrive).
#pragma once

#include "ClientFramework/NodeTree/NodeStorage.h"

#include <memory>

class CVolume;

class NodePartition : public NodeStorage
{
public:
    // position: the partition's index among its siblings in the kernel's list.
    NodePartition(CPartition *partition, int position, NodeCore *parent = nullptr);
    ~NodePartition() override;

    NodeKind kind() const override { return NodeKind::Partition; }
    CPartition *partition() const { return m_partition; }
    int position() const { return m_position; }
    bool isUnallocated() const;
    bool isExtended() const;

    // IKernelStorage / IStorageGeometry
    cStorage *kernelStorage() const override;
    CPartition *kernelPartition() const override { return m_partition; }
    CVolume *kernelVolume() const override { return m_volume; }
    std::uint64_t firstSector() const override;

    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;
    QString defaultCommand() const override;

    // The kind text of a kernel partition ("Primary", "Logical", "Extended", ...).
    static QString partitionKindText(const CPartition *partition);

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("partition"); }
    QString key() const override;
    QString kindText() const override;
    QString sourceText() const override;
    QString extraText(NodeAttr attr) const override;

private:
    void build();

    CPartition *m_partition = nullptr;
    int m_position = 0;
    CVolume *m_volume = nullptr; // the partition's, owned by the kernel
};
