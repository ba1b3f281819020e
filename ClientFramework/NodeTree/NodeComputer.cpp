#include "ClientFramework/NodeTree/NodeComputer.h"

#include "ClientFramework/NodeTree/NodeMenu.h"

#include <QCoreApplication>
#include <QSysInfo>

namespace {

QString tr(const char *text)
{
    return QCoreApplication::translate("NodeCore", text);
}

} // namespace

QString NodeComputer::name() const
{
    return tr("My Computer");
}

QString NodeComputer::kindText() const
{
    return tr("Computer");
}

QString NodeComputer::sourceText() const
{
    return QSysInfo::machineHostName();
}

QString NodeComputer::statusText() const
{
    return NodeStatic::statusText();
}

QList<PropertyGroup> NodeComputer::properties() const
{
    QList<PropertyGroup> groups = NodeStatic::properties();
    PropertyGroup system{tr("System"), {}};
    system.items.append({tr("Host Name"), QSysInfo::machineHostName(), QString()});
    system.items.append({tr("Operating System"), QSysInfo::prettyProductName(), QString()});
    system.items.append(
        {tr("Kernel"), QSysInfo::kernelType() + QLatin1Char(' ') + QSysInfo::kernelVersion(), QString()});
    system.items.append({tr("Architecture"), QSysInfo::currentCpuArchitecture(), QString()});
    groups.append(system);
    return groups;
}

void NodeComputer::contextMenu(QMenu *menu) const
{
    NodeMenu m(menu, this);
    m.addAll({QStringLiteral("cmdHddInfo"), QStringLiteral("cmdLogSave"), NodeMenu::Separator,
              QStringLiteral("cmdRefresh"), NodeMenu::Placeholder, QStringLiteral("cmdRollback"),
              NodeMenu::Separator, QStringLiteral("cmdProperties")});
    m.finish();
}

QString NodeComputer::defaultCommand() const
{
    return QStringLiteral("cmdProperties");
}
