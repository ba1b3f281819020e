// The device map of the Disk Explorer: one row per disk with its partitions (and the gaps between
// them) drawn to scale, each labelled with its file-system name and size. Clicking a segment
// selects its node.
#pragma once

#include <QList>
#include <QRect>
#include <QWidget>

class NodeCore;
class QAbstractItemModel;

namespace Framework {

class DeviceMap : public QWidget
{
    Q_OBJECT
public:
    // One drawn piece of a disk row.
    struct Segment
    {
        NodeCore *node = nullptr;
        QRect rect;
        QString label;
        bool extended = false;
    };

    explicit DeviceMap(QWidget *parent = nullptr);

    // The root whose device nodes are drawn; the model's changes trigger a new layout.
    void setRoot(NodeCore *root, QAbstractItemModel *changes);
    void setSelectedNode(NodeCore *node);

    // The segments of the current layout (disk rows first, then their partitions).
    const QList<Segment> &segments() const { return m_segments; }
    NodeCore *nodeAt(const QPoint &pos) const;

    // The devices drawn (kind Device among the root's children).
    static QList<NodeCore *> devices(NodeCore *root);
    // The partitions of a device in disk order, logical partitions in place of their extended one.
    static QList<NodeCore *> partitions(NodeCore *device);
    // The label of a segment: the file-system name (or the partition kind) and the size.
    static QString label(NodeCore *node);

    QSize sizeHint() const override;
    QSize minimumSizeHint() const override;

signals:
    void nodeClicked(NodeCore *node);
    void nodeActivated(NodeCore *node);

protected:
    void paintEvent(QPaintEvent *event) override;
    void resizeEvent(QResizeEvent *event) override;
    void mousePressEvent(QMouseEvent *event) override;
    void mouseDoubleClickEvent(QMouseEvent *event) override;

private:
    void relayout();
    void scheduleRelayout();

    NodeCore *m_root = nullptr;
    NodeCore *m_selected = nullptr;
    QList<Segment> m_segments;
    bool m_relayoutQueued = false;
};

} // namespace Framework
