// A multi-selection of nodes: the commands common to a selection and its summary text.
#pragma once

#include "ClientFramework/NodeTree/IProperty.h"
#include "ClientFramework/NodeTree/NodeCore.h"

#include <QList>

class QMenu;

class NodeCoreList : public QList<NodeCore *>, public IProperty
{
public:
    using QList<NodeCore *>::QList;

    // "<b>%1</b> item(s)", or "Invalid item(s)" when a node of the list is invalid or null.
    QString summary() const;
    QList<PropertyGroup> properties() const override;
    // cmdHex_NodeOpen | cmdNode_Stop ("Stop") | cmdRefresh, cmdNode_StopAll | cmdProperties.
    void contextMenu(QMenu *menu) const;
};
