// A file of a volume.
#pragma once

#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/IStorageGeometry.h"
#include "ClientFramework/NodeTree/NodeCore.h"

class NodeFile : public NodeCore, public IStorageGeometry, public IKernelStorage
{
public:
    NodeFile(CEntry *entry, NodeCore *parent = nullptr);
    ~NodeFile() override;

    NodeKind kind() const override { return NodeKind::File; }
    CEntry *entry() const { return m_entry; }
    std::uint64_t size() const;

    // IStorageGeometry: the volume's.
    std::uint32_t sectorSize() const override;
    std::uint64_t firstSector() const override;
    std::uint64_t sectorCount() const override;

    // IKernelStorage
    cStorage *kernelStorage() const override;
    CDevice *kernelDevice() const override;
    CPartition *kernelPartition() const override;
    CVolume *kernelVolume() const override;
    CEntry *kernelEntry() const override { return m_entry; }

    QString statusText() const override;
    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;
    // cmdHex_NodeOpen when the file has data, else cmdHex_FileRecord.
    QString defaultCommand() const override;

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("file"); }
    QString key() const override;
    QString kindText() const override;
    QString extraText(NodeAttr attr) const override;

private:
    CEntry *m_entry = nullptr;
};
