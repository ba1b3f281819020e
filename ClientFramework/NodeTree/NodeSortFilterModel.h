// The explorer's sort and filter proxy: switches for the kinds of node shown, kept in the
// settings under "bmfMyComp", "bmfSysDvc", "bmfDevices", "bmfRemovable", "bmfNotReady",
// "bmfVirtDvc", "bmfPartitions", "bmfUnalloc", "bmfNetwork" and "bmfSysEntries".
#pragma once

#include "ClientFramework/Settings/PersistenceXML.h"

#include <QHash>
#include <QSortFilterProxyModel>
#include <QString>
#include <QStringList>

class NodeCore;

class NodeSortFilterModel : public QSortFilterProxyModel, public IPersistenceXML
{
    Q_OBJECT
public:
    enum Filter : quint32 {
        MyComputer = 0x1,      // "bmfMyComp": the computer node
        SystemDevices = 0x2,   // "bmfSysDvc": "Show System Devices"
        Devices = 0x4,         // "bmfDevices": device nodes at all
        Removable = 0x8,       // "bmfRemovable": "Show Removable Devices"
        NotReady = 0x10,       // "bmfNotReady": "Show Not Ready Devices"
        VirtualDevices = 0x20, // "bmfVirtDvc": "Show Virtual Devices"
        Partitions = 0x40,     // "bmfPartitions": "Show partitions"
        Unallocated = 0x80,    // "bmfUnalloc": unallocated space
        Network = 0x100,       // "bmfNetwork": network nodes
        SystemEntries = 0x200, // "bmfSysEntries": system entries of a volume
        All = 0x3FF,
    };

    explicit NodeSortFilterModel(QObject *parent = nullptr);

    quint32 filters() const { return m_filters; }
    void setFilters(quint32 filters);
    bool filter(Filter f) const { return (m_filters & f) != 0; }
    void setFilter(Filter f, bool on);

    // The settings key and the menu text of a switch.
    static QString filterKey(Filter f);
    static QString filterText(Filter f);
    static QList<Filter> allFilters();

    // IPersistenceXML: one attribute per switch ("1"/"0").
    void save(QDomElement &element, bool flush = false) override;
    void load(const QDomElement &element) override;

protected:
    bool filterAcceptsRow(int sourceRow, const QModelIndex &sourceParent) const override;
    bool lessThan(const QModelIndex &left, const QModelIndex &right) const override;

private:
    bool accepts(const NodeCore *node) const;

    quint32 m_filters = All;
};
