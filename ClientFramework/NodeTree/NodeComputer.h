// The local computer ("My Computer").
#pragma once

#include "ClientFramework/NodeTree/NodeCore.h"

class NodeComputer : public NodeStatic
{
public:
    using NodeStatic::NodeStatic;

    NodeKind kind() const override { return NodeKind::Computer; }
    QString statusText() const override;
    QList<PropertyGroup> properties() const override;
    void contextMenu(QMenu *menu) const override;
    QString defaultCommand() const override;

protected:
    QString name() const override;
    QString typeKey() const override { return QStringLiteral("computer"); }
    QString key() const override { return QStringLiteral("LocalWorkstation"); }
    QString kindText() const override;
    QString sourceText() const override;
};
