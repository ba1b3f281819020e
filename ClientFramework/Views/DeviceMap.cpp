#include "ClientFramework/Views/DeviceMap.h"

#include "ClientFramework/NodeTree/IStorageGeometry.h"
#include "ClientFramework/NodeTree/NodeCore.h"
#include "ClientFramework/NodeTree/NodePartition.h"

#include <QAbstractItemModel>
#include <QMouseEvent>
#include <QPainter>
#include <QTimer>

namespace Framework {

namespace {

constexpr int RowHeight = 46;
constexpr int RowGap = 8;
constexpr int LabelWidth = 190;
constexpr int Margin = 6;
constexpr int MinSegment = 6;

uint64_t sectorsOf(NodeCore *node)
{
    auto *g = dynamic_cast<IStorageGeometry *>(node);
    return g ? g->sectorCount() : 0;
}

uint64_t firstOf(NodeCore *node)
{
    auto *g = dynamic_cast<IStorageGeometry *>(node);
    return g ? g->firstSector() : 0;
}

// A fill colour per file-system family, unallocated space light grey.
QColor fillFor(NodeCore *node)
{
    auto *p = dynamic_cast<NodePartition *>(node);
    if (p && p->isUnallocated())
        return QColor(0xE8, 0xE8, 0xE8);
    const QString fs = node->text(NodeAttr::FileSystem).toLower();
    const QString kind = node->text(NodeAttr::Kind).toLower();
    if (fs.contains(QLatin1String("ntfs")))
        return QColor(0x9F, 0xC5, 0xF8);
    if (fs.contains(QLatin1String("fat")))
        return QColor(0xB6, 0xE3, 0xA5);
    if (fs.contains(QLatin1String("ext")) || fs.contains(QLatin1String("xfs")) ||
        fs.contains(QLatin1String("btrfs")))
        return QColor(0xF7, 0xD0, 0x8A);
    if (fs.contains(QLatin1String("hfs")) || fs.contains(QLatin1String("apfs")))
        return QColor(0xD7, 0xB8, 0xF0);
    if (kind.contains(QLatin1String("extended")))
        return QColor(0xCC, 0xDD, 0xEE);
    return QColor(0xC9, 0xD6, 0xE3);
}

NodeCore *volumeOf(NodeCore *partition)
{
    for (NodeCore *c : partition->children())
        if (c->kind() == NodeKind::Drive)
            return c;
    return nullptr;
}

} // namespace

DeviceMap::DeviceMap(QWidget *parent) : QWidget(parent)
{
    setObjectName(QStringLiteral("DeviceMap"));
    setMouseTracking(true);
    setBackgroundRole(QPalette::Base);
    setAutoFillBackground(true);
}

void DeviceMap::setRoot(NodeCore *root, QAbstractItemModel *changes)
{
    m_root = root;
    if (changes) {
        for (auto sig : {&QAbstractItemModel::rowsInserted, &QAbstractItemModel::rowsRemoved})
            connect(changes, sig, this, &DeviceMap::scheduleRelayout);
        connect(changes, &QAbstractItemModel::modelReset, this, &DeviceMap::scheduleRelayout);
        connect(changes, &QAbstractItemModel::dataChanged, this, &DeviceMap::scheduleRelayout);
        // Rows are about to go: forget the nodes now, the pointers may not outlive the removal.
        connect(changes, &QAbstractItemModel::rowsAboutToBeRemoved, this, [this] {
            m_segments.clear();
            m_selected = nullptr;
            scheduleRelayout();
        });
    }
    relayout();
}

void DeviceMap::setSelectedNode(NodeCore *node)
{
    m_selected = node;
    update();
}

QList<NodeCore *> DeviceMap::devices(NodeCore *root)
{
    QList<NodeCore *> list;
    if (!root)
        return list;
    for (NodeCore *c : root->children())
        if (c->kind() == NodeKind::Device)
            list << c;
    return list;
}

QList<NodeCore *> DeviceMap::partitions(NodeCore *device)
{
    QList<NodeCore *> list;
    for (NodeCore *c : device->children()) {
        auto *p = dynamic_cast<NodePartition *>(c);
        if (p && p->isExtended()) {
            bool logical = false;
            for (NodeCore *l : c->children())
                if (l->kind() == NodeKind::Partition) {
                    list << l;
                    logical = true;
                }
            if (!logical)
                list << c;
        } else if (c->kind() == NodeKind::Partition || c->kind() == NodeKind::Drive) {
            list << c;
        }
    }
    return list;
}

QString DeviceMap::label(NodeCore *node)
{
    QString name;
    auto *p = dynamic_cast<NodePartition *>(node);
    if (p && p->isUnallocated()) {
        name = node->text(NodeAttr::Name);
    } else {
        NodeCore *volume = node->kind() == NodeKind::Drive ? node : volumeOf(node);
        name = volume ? volume->text(NodeAttr::FileSystem) : QString();
        if (name.isEmpty())
            name = node->text(NodeAttr::FileSystem);
        if (name.isEmpty())
            name = node->text(NodeAttr::Kind);
    }
    const uint64_t sectors = sectorsOf(node);
    auto *g = dynamic_cast<IStorageGeometry *>(node);
    const QString size = g ? NodeCore::sizeText(sectors * g->sectorSize()) : QString();
    return size.isEmpty() ? name : QStringLiteral("%1\n%2").arg(name, size);
}

void DeviceMap::scheduleRelayout()
{
    if (m_relayoutQueued)
        return;
    m_relayoutQueued = true;
    QTimer::singleShot(0, this, [this] {
        m_relayoutQueued = false;
        relayout();
    });
}

void DeviceMap::relayout()
{
    m_segments.clear();
    const QList<NodeCore *> disks = devices(m_root);
    const int barLeft = Margin + LabelWidth;
    const int barWidth = qMax(40, width() - barLeft - Margin);
    int y = Margin;
    for (NodeCore *disk : disks) {
        m_segments.append(
            {disk, QRect(Margin, y, LabelWidth - Margin, RowHeight), disk->text(NodeAttr::Name), false});
        const uint64_t total = sectorsOf(disk);
        const QList<NodeCore *> parts = partitions(disk);
        if (total > 0 && !parts.isEmpty()) {
            // Partition edges by position on the disk; tiny partitions keep a visible minimum.
            int x = barLeft;
            for (int i = 0; i < parts.size(); ++i) {
                NodeCore *p = parts[i];
                const uint64_t end = qMin<uint64_t>(total, firstOf(p) + sectorsOf(p));
                int right = i + 1 == parts.size() ? barLeft + barWidth
                                                  : barLeft + int(double(end) / double(total) * barWidth);
                // Tiny partitions keep a visible minimum unless the bar has no room left for it.
                right = qMin(qMax(right, x + MinSegment), barLeft + barWidth);
                right = qMax(right, x);
                m_segments.append({p, QRect(x, y, right - x, RowHeight), label(p), false});
                x = right;
            }
        } else {
            m_segments.append({disk, QRect(barLeft, y, barWidth, RowHeight),
                               disk->isReady() ? tr("No partitions") : tr("Not Ready"), false});
        }
        y += RowHeight + RowGap;
    }
    setMinimumHeight(qMax(RowHeight, y));
    update();
}

NodeCore *DeviceMap::nodeAt(const QPoint &pos) const
{
    for (auto it = m_segments.crbegin(); it != m_segments.crend(); ++it)
        if (it->rect.contains(pos))
            return it->node;
    return nullptr;
}

QSize DeviceMap::sizeHint() const
{
    return QSize(640, qMax(RowHeight + 2 * Margin, minimumHeight()));
}

QSize DeviceMap::minimumSizeHint() const
{
    return QSize(LabelWidth + 80, RowHeight + 2 * Margin);
}

void DeviceMap::paintEvent(QPaintEvent *)
{
    QPainter painter(this);
    painter.setRenderHint(QPainter::Antialiasing, false);
    const QColor frame = palette().color(QPalette::Mid);
    for (const Segment &s : std::as_const(m_segments)) {
        const bool isDiskLabel = s.rect.left() == Margin;
        if (isDiskLabel) {
            painter.setPen(palette().color(QPalette::Text));
            QFont f = font();
            f.setBold(true);
            painter.setFont(f);
            painter.drawText(s.rect.adjusted(2, 0, -4, 0),
                             Qt::AlignVCenter | Qt::AlignLeft | Qt::TextWordWrap, s.label);
            painter.setFont(font());
            continue;
        }
        painter.fillRect(s.rect.adjusted(1, 1, -1, -1), fillFor(s.node));
        painter.setPen(s.node == m_selected ? QPen(palette().color(QPalette::Highlight), 2) : QPen(frame));
        painter.drawRect(s.rect.adjusted(0, 0, -1, -1));
        painter.setPen(QColor(0x20, 0x20, 0x20));
        // A label that does not fit stays in the tool tip of the tree; a narrow piece shows none.
        const QRect inner = s.rect.adjusted(3, 2, -3, -2);
        const QRect needed = painter.fontMetrics().boundingRect(QRect(0, 0, inner.width(), 1000),
                                                                Qt::AlignCenter | Qt::TextWordWrap, s.label);
        if (needed.width() <= inner.width() && needed.height() <= inner.height())
            painter.drawText(inner, Qt::AlignCenter | Qt::TextWordWrap, s.label);
    }
    if (m_segments.isEmpty()) {
        painter.setPen(palette().color(QPalette::PlaceholderText));
        painter.drawText(rect(), Qt::AlignCenter, tr("No disks"));
    }
}

void DeviceMap::resizeEvent(QResizeEvent *event)
{
    QWidget::resizeEvent(event);
    relayout();
}

void DeviceMap::mousePressEvent(QMouseEvent *event)
{
    if (NodeCore *n = nodeAt(event->position().toPoint()))
        emit nodeClicked(n);
    QWidget::mousePressEvent(event);
}

void DeviceMap::mouseDoubleClickEvent(QMouseEvent *event)
{
    if (NodeCore *n = nodeAt(event->position().toPoint()))
        emit nodeActivated(n);
    QWidget::mouseDoubleClickEvent(event);
}

} // namespace Framework
