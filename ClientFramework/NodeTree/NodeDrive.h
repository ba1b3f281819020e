// A volume (logical drive). Its one child is the volume's root folder (NodeFolderRoot), which
// is populated on demand.
#pragma once

#include "ClientFramework/NodeTree/IFileContainer.h"
#include "ClientFramework/NodeTree/NodeStorage.h"

class CVolume;
class NodeFolderRoot;
class NodeMenu;

class NodeDrive : public NodeStorage, public IFileContainer
{
public:
    NodeDrive(CVolume *volume, NodeCore *parent = nullptr);
    ~NodeDrive() override;

    NodeKind kind() const override { return NodeKind::Drive; }
    CVolume *volume() const { return m_volume; }
    NodeFolderRoot *rootFolder() const { return m_rootFolder; }

    // IKernelStorage / IStorageGeometry
    cStorage *kernelStorage() const override;
    CPartition *kernelPartition() const override;
    CVolume *kernelVolume() const override { return m_volume; }
    CEntry *kernelEntry() const override;
    std::uint64_t firstSector() const override;

    // IFileContainer: the root folder's entries.
    std::uint32_t entryCount() const override;
    CEntry *entryAt(std::uint32_t index) const override;

    // The copies of the file table: names ("$MFT", "$MFT Mirror", "FAT 1", ...) and the one in
    // use; empty when the volume keeps no copies.
    QStringList fileTableCopies(int *current = nullptr) const;
    bool isDamaged() const;

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
    // Whether the device below is a disk image / RAID assembly / virtual device.
    bool onImage() const;
    bool onRaid() const;
    bool onVirtual() const;

private:
    CVolume *m_volume = nullptr;
    NodeFolderRoot *m_rootFolder = nullptr;
};

// A volume found by scanning rather than by the partition table.
class NodeDriveDetected : public NodeDrive
{
public:
    using NodeDrive::NodeDrive;

    QString statusText() const override;

protected:
    QString typeKey() const override { return QStringLiteral("drive-detected"); }
    QString kindText() const override;
};

// Adds the "Active Table" sub-menu of the drive's file-table copies: one checkable entry per copy
// that runs cmdPart_FT with the copy index as data. Nothing when the volume keeps no copies.
void addActiveTableMenu(NodeMenu &menu, const NodeDrive *drive, bool enabled);
