#include "ClientFramework/Commands/FeatureCommander.h"

IFeatureCommander *FeatureCommanderList::find(const QString &featureId) const
{
    for (IFeatureCommander *f : *this)
        if (f && f->featureId() == featureId)
            return f;
    return nullptr;
}

bool FeatureCommanderList::execute(const QString &id, const QList<NodeCore *> &nodes) const
{
    for (IFeatureCommander *f : *this)
        if (f && f->execute(id, nodes))
            return true;
    return false;
}

QStringList FeatureCommanderList::contextCommands(const QList<NodeCore *> &nodes) const
{
    QStringList ids;
    for (IFeatureCommander *f : *this) {
        if (!f)
            continue;
        const QStringList own = f->contextCommands(nodes);
        if (own.isEmpty())
            continue;
        if (!ids.isEmpty())
            ids << QString();
        ids << own;
    }
    return ids;
}

void FeatureCommanderList::updateCommands(const QList<NodeCore *> &selection) const
{
    for (IFeatureCommander *f : *this)
        if (f)
            f->updateCommands(selection);
}
