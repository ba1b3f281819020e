#include "ClientFramework/Views/LogView.h"

#include "ClientFramework/Log/ApplicationLog.h"

#include <QHeaderView>
#include <QTreeView>

namespace Framework {

LogView::LogView(QWidget *parent)
    : GenericView(ViewId, tr("Application Log"), parent), m_tree(new QTreeView(this))
{
    auto &log = ApplicationLog::instance();
    m_tree->setModel(&log);
    m_tree->setRootIsDecorated(true);
    m_tree->setUniformRowHeights(true);
    m_tree->setAlternatingRowColors(true);
    m_tree->setSelectionMode(QAbstractItemView::ExtendedSelection);
    m_tree->header()->setStretchLastSection(true);
    m_tree->setColumnWidth(ApplicationLog::EventColumn, 160);
    m_tree->expandAll();
    setCentralWidget(m_tree);
    connect(&log, &QAbstractItemModel::rowsInserted, m_tree, [this](const QModelIndex &parent) {
        if (parent.isValid())
            m_tree->expand(parent);
        m_tree->scrollToBottom();
    });
}

} // namespace Framework
