#include "hexeditor/templates/SelectorCtrl.h"

#include <QHeaderView>
#include <QStandardItemModel>
#include <QTreeView>

#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/core/Catalog.h"

namespace HexEditor::Templates {

namespace {

constexpr int IdRole = Qt::UserRole + 1;

struct GroupRow
{
    const char *name;
    QList<Type> kinds;
};

const QList<GroupRow> &groups()
{
    static const QList<GroupRow> table = {
        {"Partition Records", {MasterBootRecord, GuidPartitionTable}},
        {"NTFS templates", {NtfsBootSector, NtfsMftFileRecord}},
        {"FAT/FAT32 Templates", {FatBootSector, Fat32BootSector, FatDirectoryEntry}},
        {"Microsoft (exFAT) templates", {ExFatBootSector, ExFatDirectoryEntry}},
        {"Microsoft (ReFS) templates", {RefsBootSector, RefsEntry}},
        {"Apple (HFS+) templates", {HfsPlusVolumeHeader, HfsPlusCatalogNode, HfsPlusFileRecord}},
        {"Apple (ApFS) templates", {ApfsVolumeSuperblock, ApfsFileSystem, ApfsInode}},
        {"Linux (Ext) templates", {ExtSuperBlock, ExtInode}},
        {"Linux (BtrFS) templates", {BtrFsSuperblock}},
        {"Linux/Unix (JFS) templates", {JfsVolumeSuperblock, JfsInode}},
        {"Linux/Unix (XFS) templates",
         {XfsVolumeSuperblock, XfsAgFreeSpaceBlock, XfsAgInodesBlock, XfsAgInode}},
        {"Unix (UFS) templates", {UfsSuperblock, UfsInode}},
        {"Logical Disk Manager (LDM) templates",
         {LdmPrivateHeader, LdmTocBlock, LdmVmdbBlock, LdmKLogBlock, LdmVblkBlock}},
    };
    return table;
}

QModelIndex findId(const QStandardItemModel *items, int id, const QModelIndex &parent = {})
{
    for (int r = 0; r < items->rowCount(parent); ++r) {
        const QModelIndex i = items->index(r, 0, parent);
        if (i.flags() & Qt::ItemIsSelectable && i.data(IdRole).toInt() == id)
            return i;
        const QModelIndex below = findId(items, id, i);
        if (below.isValid())
            return below;
    }
    return {};
}

} // namespace

SelectorCtrl::SelectorCtrl(QWidget *parent)
    : QComboBox(parent), m_items(new QStandardItemModel(this)), m_tree(new QTreeView(this))
{
    m_tree->header()->hide();
    m_tree->setRootIsDecorated(true);
    // Qt rejects a rule without a selector; the bare declaration gives the popup
    // its plain background.
    m_tree->setStyleSheet(QStringLiteral("background: none;"));
    setModel(m_items);
    setView(m_tree);
    setSizeAdjustPolicy(QComboBox::AdjustToContents);
    setMinimumContentsLength(24);
    rebuildItems();
}

SelectorCtrl::~SelectorCtrl() = default;

void SelectorCtrl::setStorage(Storage *storage)
{
    m_templates.clear();
    m_models.clear();
    m_models.push_back(std::make_unique<Model>(storage));
    m_templates.append({None, tr("No template"), m_models.back().get()});
    if (storage) {
        for (Type t : availableTypes()) {
            auto model = Model::create(storage, t);
            if (!model)
                continue;
            connect(model.get(), &Model::templateModified, this, &SelectorCtrl::templateModified);
            m_templates.append({t, typeName(t), model.get()});
            m_models.push_back(std::move(model));
        }
    }
    m_current = None;
    rebuildItems();
}

void SelectorCtrl::rebuildItems()
{
    m_items->clear();
    auto *none = new QStandardItem(tr("No template"));
    none->setData(int(None), IdRole);
    m_items->appendRow(none);
    for (const GroupRow &g : groups()) {
        QList<QStandardItem *> kinds;
        for (Type t : g.kinds) {
            if (find(t).model == nullptr)
                continue; // a kind without a template is not offered
            auto *item = new QStandardItem(typeName(t));
            item->setData(int(t), IdRole);
            kinds.append(item);
        }
        if (kinds.isEmpty())
            continue;
        auto *group = new QStandardItem(tr(g.name));
        group->setData(-1, IdRole);
        group->setFlags(Qt::ItemIsEnabled);
        for (QStandardItem *k : kinds)
            group->appendRow(k);
        m_items->appendRow(group);
    }
    showEntry(m_current);
}

SelectorCtrl::Template SelectorCtrl::find(int id) const
{
    for (const Template &t : m_templates)
        if (int(t.id) == id)
            return t;
    return {};
}

SelectorCtrl::Template SelectorCtrl::current() const
{
    Template t = find(m_current);
    if (!t.model && !m_templates.isEmpty())
        return m_templates.first();
    return t;
}

void SelectorCtrl::showEntry(int id)
{
    const QModelIndex i = findId(m_items, id);
    if (!i.isValid())
        return;
    const QSignalBlocker block(this);
    setRootModelIndex(i.parent());
    setCurrentIndex(i.row());
    m_tree->setCurrentIndex(i);
}

bool SelectorCtrl::selectTemplate(int id)
{
    const Template t = find(id);
    if (!t.model)
        return false;
    m_current = id;
    showEntry(id);
    emit templateSelected(t);
    return true;
}

void SelectorCtrl::showPopup()
{
    {
        const QSignalBlocker block(this);
        setRootModelIndex(QModelIndex());
    }
    m_tree->expandAll();
    QComboBox::showPopup();
    const QModelIndex i = findId(m_items, m_current);
    if (i.isValid())
        m_tree->setCurrentIndex(i);
    // Below the combo box, as wide as it and at most 100 pixels wider, 400 pixels high.
    if (QWidget *popup = m_tree->window(); popup && popup != window()) {
        const QPoint below = mapToGlobal(QPoint(0, height()));
        popup->setGeometry(below.x(), below.y(), std::min(popup->width(), width() + 100), 400);
        if (popup->width() < width())
            popup->resize(width(), 400);
    }
}

void SelectorCtrl::hidePopup()
{
    const QModelIndex chosen = m_tree->currentIndex();
    QComboBox::hidePopup();
    const int id =
        chosen.isValid() && (chosen.flags() & Qt::ItemIsSelectable) ? chosen.data(IdRole).toInt() : -1;
    if (id >= 0 && id != m_current)
        selectTemplate(id);
    else
        showEntry(m_current);
}

} // namespace HexEditor::Templates
