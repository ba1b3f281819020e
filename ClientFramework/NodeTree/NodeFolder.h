// A folder of a volume, and the volume's root folder. Folders are populated on demand.
#pragma once

#include "ClientFramework/NodeTree/IFileContainer.h"
#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/NodeCore.h"

#include <QList>

class NodeFolder : public NodeStatic, public IFileContainer, public IKernelStorage
{
public:
    NodeFolder(CEntry *entry, NodeCore *parent = nullptr);
    ~NodeFolder() override;

    NodeKind kind() const override { return NodeKind::Folder; }
    CEntry *entry() const { return m_entry; }

    // IKernelStorage
    cStorage *kernelStorage() const override;
    CDevice *kernelDevice() const override;
    CPartition *kernelPartition() const override;
    CVolume *kernelVolume() const override;
    CEntry *kernelEntry() const override { return m_entry; }

    // IFileContainer
    std::uint32_t entryCount() const override;
    CEntry *entryAt(std::uint32_t index) const override;

    // Population: "Populating %1"; a cancelled population leaves the folder unpopulated.
    bool canPopulate() const override { return m_entry != nullptr; }
    bool populate(Threads::NodeTag *tag) override;
    void applyPopulation() override;
    // Whether a population would do anything (not populated, or the child count changed).
    bool needsPopulation() const;

    QString statusText() const override;
    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;
    QString defaultCommand() const override;

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("folder"); }
    QString key() const override;
    QString kindText() const override;
    QString extraText(NodeAttr attr) const override;

private:
    CEntry *m_entry = nullptr;
    // Prepared by populate(), handed over by applyPopulation().
    bool m_prepared = false;
    bool m_cancelled = false;
    QList<NodeCore *> m_pending;
    Counters m_pendingCounters;
};

class NodeFolderRoot : public NodeFolder
{
public:
    using NodeFolder::NodeFolder;

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("folder-root"); }
    QString key() const override { return QStringLiteral("folder-root"); }
};
