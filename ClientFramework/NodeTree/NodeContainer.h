// A "File Group": a flat collection of file nodes (search results, recovered entries). The
// container owns its file nodes; NodeFileContainer also answers for the entries it lists.
#pragma once

#include "ClientFramework/NodeTree/IFileContainer.h"
#include "ClientFramework/NodeTree/IKernelStorage.h"
#include "ClientFramework/NodeTree/NodeCore.h"

#include <QList>

class NodeContainer : public NodeCore
{
public:
    explicit NodeContainer(const QString &title, NodeCore *parent = nullptr);

    NodeKind kind() const override { return NodeKind::Container; }
    void setTitle(const QString &title) { m_title = title; }
    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;

protected:
    QString name() const override { return m_title; }
    QString typeKey() const override { return QStringLiteral("folder-container"); }
    QString key() const override { return QStringLiteral("folder-container"); }
    QString kindText() const override;

private:
    QString m_title;
};

class NodeFileContainer : public NodeContainer, public IFileContainer, public IKernelStorage
{
public:
    using NodeContainer::NodeContainer;

    // Adds a file node for the entry (the entry must outlive the container).
    void addEntry(CEntry *entry);

    std::uint32_t entryCount() const override;
    CEntry *entryAt(std::uint32_t index) const override;

    // The volume of the first entry.
    cStorage *kernelStorage() const override;
    CDevice *kernelDevice() const override;
    CVolume *kernelVolume() const override;

private:
    QList<CEntry *> m_entries;
};
