#include "hexeditor/EditorCtrl.h"

#include <QHelpEvent>
#include <QMenu>
#include <QPainter>
#include <QScrollBar>
#include <QToolTip>

#include <algorithm>

#include "hexeditor/Clipboard.h"
#include "hexeditor/Paint.h"
#include "hexeditor/Storage.h"
#include "hexeditor/StorageFile.h"

namespace HexEditor {

namespace {

// Keeps the caret's byte box inside the viewport: while the caret fits beside the line's start the
// view shows the start (with the offsets), unless `stay` (a caret placed under the mouse pointer,
// which must not move the bytes under it); further right it scrolls just enough.
void followCaretHorizontally(EditorCtrl &ctrl, bool stay)
{
    QScrollBar *h = ctrl.horizontalScrollBar();
    const int width = ctrl.viewport()->width();
    const Metrics::Caret &caret = ctrl.caret();
    const auto pane = Metrics::Pane(caret.pane);
    if (width <= 0 || !ctrl.isShown(pane) || pane == Metrics::PaneOffset)
        return;
    const int left = std::max(0, ctrl.byteLeft(pane, caret.column));
    const int right = ctrl.byteRight(pane, caret.column);
    int value = h->value();
    if (right <= width && !stay)
        value = 0;
    else if (left < value)
        value = left;
    else if (right > value + width)
        value = right - width > left ? left : right - width;
    if (value != h->value())
        h->setValue(std::clamp(value, h->minimum(), h->maximum()));
}

} // namespace

EditorCtrl::EditorCtrl(Storage *storage, bool readOnly, QWidget *parent)
    : QAbstractScrollArea(parent), m_painter(std::make_unique<Painter>()), m_editable(!readOnly),
      m_palette(PaintPalette::current())
{
    static const int registered = [] {
        qRegisterMetaType<DiskArea>("HexEditor::DiskArea");
        return 0;
    }();
    Q_UNUSED(registered);
    setFocusPolicy(Qt::StrongFocus);
    setAttribute(Qt::WA_KeyCompression, false);
    viewport()->setAttribute(Qt::WA_OpaquePaintEvent, true);
    viewport()->setMouseTracking(false);
    setHorizontalScrollBarPolicy(Qt::ScrollBarAsNeeded);
    setVerticalScrollBarPolicy(Qt::ScrollBarAlwaysOn);
    connect(verticalScrollBar(), &QScrollBar::valueChanged, this, [this](int value) {
        if (m_syncingScroll)
            return;
        if (setTopLine(topLineForScrollValue(value))) {
            m_painter->invalidate();
            viewport()->update();
        }
    });
    setStorage(storage);
    emit stateChanged(hexOffset(), !m_editable, m_bigEndian);
}

EditorCtrl::~EditorCtrl()
{
    // A running block transfer ends (its written steps stay) before its owner goes.
    stopTransfer();
    if (m_storage)
        Clipboard::unregisterStorage(m_storage);
}

void EditorCtrl::setStorage(Storage *storage)
{
    if (m_storage) {
        disconnect(m_storage, nullptr, this, nullptr);
        Clipboard::unregisterStorage(m_storage);
    }
    m_storage = storage;
    m_undo.setStorage(storage);
    m_anchor = NoAnchor;
    m_reportedValid = false;
    m_jumpTracked = false;
    if (m_storage) {
        Clipboard::registerStorage(m_storage);
        m_bigEndian = m_storage->isHfsVolume();
        connect(m_storage, &Storage::selectionChanged, this,
                [this](const DiskArea &area) { emit selectionChanged(area, sectorSize()); });
        connect(m_storage, &QObject::destroyed, this, [this] {
            Clipboard::unregisterStorage(m_storage);
            m_storage = nullptr;
            m_undo.setStorage(nullptr);
            refreshStorageMetrics();
            viewport()->update();
        });
        connect(m_storage, &Storage::dataChanged, this, [this] { viewport()->update(); });
    }
    refreshStorageMetrics();
    m_caret = caretAt(0, PaneHex);
    if (m_storage)
        caretChanged(true);
    viewport()->update();
    emit commandStateChanged();
}

void EditorCtrl::refreshStorageMetrics()
{
    if (m_storage)
        setDataSize(m_storage->size(), m_storage->sectorSize());
    else
        setDataSize(0, 512);
    syncScrollBars();
}

uint64_t EditorCtrl::lastOffset() const
{
    return dataSize() ? dataSize() - 1 : 0;
}

// --- caret ---------------------------------------------------------------------------------------

void EditorCtrl::setCaretOffset(uint64_t offset)
{
    if (!m_storage)
        return;
    offset = std::min(offset, lastOffset());
    placeCaret(offset, m_caret.pane == PaneOffset ? PaneHex : m_caret.pane, 0);
}

void EditorCtrl::onGoToOffset(quint64 offset)
{
    setCaretOffset(offset);
}

void EditorCtrl::setCaretPane(Pane pane)
{
    if (pane == PaneOffset || !isShown(pane))
        pane = PaneHex;
    placeCaret(caretOffset(), pane, pane == PaneHex ? m_caret.nibble : 0);
}

void EditorCtrl::placeCaret(uint64_t offset, int32_t pane, int32_t nibble)
{
    offset = std::min(offset, lastOffset());
    m_caret = caretAt(offset, pane, nibble);
    if (scrollIntoView(m_caret.line))
        m_painter->invalidate();
    syncScrollBars();
    followCaretHorizontally(*this, m_mouseSelecting);
    caretChanged();
    viewport()->update();
}

void EditorCtrl::caretChanged(bool force)
{
    m_caret.bytesPerLine = bytesPerLine();
    m_caret.sectorSize = sectorSize();
    const uint64_t offset = m_caret.offset();
    m_caret.snapshot = m_storage ? m_storage->read({offset, 8}, false) : QByteArray();
    const bool hadReport = m_reportedValid;
    const uint64_t previous = m_reported.offset();
    if (force || !m_reportedValid || !m_caret.sameAs(m_reported)) {
        m_reported = m_caret;
        m_reportedValid = true;
        emit cursorMoved(m_caret);
    }
    if (m_storage) {
        const uint64_t distance = !hadReport ? 0 : offset > previous ? offset - previous : previous - offset;
        if (!m_jumpTracked || distance >= JumpDistance) {
            m_jumpTracked = true;
            emit jumpRecorded(offset, m_templateType && m_templateOffset == offset ? m_templateType : 0);
        }
    }
    emit commandStateChanged();
}

// --- selection -------------------------------------------------------------------------------------

DiskArea EditorCtrl::selection() const
{
    return m_storage ? m_storage->selection() : DiskArea{};
}

void EditorCtrl::setSelection(const DiskArea &area)
{
    if (!m_storage)
        return;
    DiskArea a = area;
    if (a.offset >= dataSize())
        a = {};
    else if (a.length > dataSize() - a.offset)
        a.length = dataSize() - a.offset;
    if (a == m_storage->selection())
        return;
    m_storage->setSelection(a);
    viewport()->update();
    emit commandStateChanged();
}

void EditorCtrl::clearSelection()
{
    m_anchor = NoAnchor;
    setSelection({});
}

void EditorCtrl::selectAll()
{
    setSelection({0, dataSize()});
}

void EditorCtrl::setBlockBegin()
{
    const DiskArea sel = selection();
    const uint64_t begin = caretOffset();
    const uint64_t last = sel.length && sel.end() - 1 >= begin ? sel.end() - 1 : begin;
    setSelection({begin, last - begin + 1});
}

void EditorCtrl::setBlockEnd()
{
    const DiskArea sel = selection();
    const uint64_t end = caretOffset();
    const uint64_t first = sel.length && sel.offset <= end ? sel.offset : end;
    setSelection({first, end - first + 1});
}

void EditorCtrl::extendSelectionTo(uint64_t offset)
{
    if (m_anchor == NoAnchor)
        return;
    const uint64_t lo = std::min(m_anchor, offset);
    uint64_t hi = std::max(m_anchor, offset);
    if (m_caret.pane == PaneUnicode)
        hi = std::min(hi + 1, lastOffset());
    setSelection({lo, hi - lo + 1});
}

// --- view settings ----------------------------------------------------------------------------------

void EditorCtrl::setEditorFont(const QString &family, int pointSize)
{
    setMetricsFont(family, pointSize);
}

void EditorCtrl::setColumns(uint32_t mask)
{
    setMetricsColumns(mask);
    if (!isShown(Pane(m_caret.pane)) || m_caret.pane == PaneOffset)
        placeCaret(caretOffset(), PaneHex, 0);
}

void EditorCtrl::setBytesPerLine(uint32_t n)
{
    const uint64_t offset = caretOffset();
    setMetricsBytesPerLine(n);
    placeCaret(offset, m_caret.pane, m_caret.nibble);
}

void EditorCtrl::setGrouping(uint32_t n)
{
    setMetricsGroup(n);
}

void EditorCtrl::setHexOffset(bool on)
{
    if (on == hexOffset())
        return;
    setMetricsHexOffset(on);
    viewport()->update();
    emit stateChanged(hexOffset(), !m_editable, m_bigEndian);
}

void EditorCtrl::setBigEndian(bool on)
{
    if (on == m_bigEndian)
        return;
    m_bigEndian = on;
    viewport()->update();
    emit stateChanged(hexOffset(), !m_editable, m_bigEndian);
}

void EditorCtrl::setEditable(bool on)
{
    if (on == m_editable)
        return;
    m_editable = on;
    emit stateChanged(hexOffset(), !m_editable, m_bigEndian);
    emit commandStateChanged();
}

void EditorCtrl::setPaintPalette(const PaintPalette &palette)
{
    m_palette = palette;
    viewport()->update();
}

void EditorCtrl::layoutChanged()
{
    if (m_painter)
        m_painter->invalidate();
    syncScrollBars();
    if (viewport())
        viewport()->update();
}

// --- layers -------------------------------------------------------------------------------------------

void EditorCtrl::setBookmarks(const QList<BookmarkMark> &marks)
{
    m_bookmarks = marks;
    viewport()->update();
}

void EditorCtrl::setSearchHits(const QList<DiskArea> &hits)
{
    m_searchHits = hits;
    viewport()->update();
}

void EditorCtrl::setTemplateColoring(const QList<TemplateArea> &areas)
{
    m_coloring = areas;
    viewport()->update();
}

void EditorCtrl::setTemplateColoringEnabled(bool on)
{
    m_coloringOn = on;
    viewport()->update();
}

void EditorCtrl::setTemplateOutline(const DiskArea &area)
{
    m_outline = area;
    viewport()->update();
}

void EditorCtrl::setCurrentTemplate(int type, uint64_t offset)
{
    m_templateType = type;
    m_templateOffset = offset;
}

void EditorCtrl::onTemplateOffsetChanged(quint64 offset, bool isPrimary)
{
    Q_UNUSED(isPrimary);
    m_templateOffset = offset;
    setCaretOffset(offset);
}

void EditorCtrl::onFileViewModeChanged(int mode)
{
    auto *file = qobject_cast<StorageFile *>(m_storage);
    if (!file || file->mode() == mode || !queryModeChange())
        return;
    if (!file->setMode(mode))
        return;
    m_undo.clear();
    refreshStorageMetrics();
    m_painter->invalidate();
    setSelection({});
    setCaretOffset(file->fileStartOffset());
    emit commandStateChanged();
    viewport()->update();
}

void EditorCtrl::onTemplateNodeActivated(quint64 address)
{
    setCaretOffset(address);
}

// --- scrolling and painting -----------------------------------------------------------------------------

void EditorCtrl::syncScrollBars()
{
    if (!viewport())
        return;
    m_syncingScroll = true;
    QScrollBar *v = verticalScrollBar();
    v->setRange(0, scrollMaximum());
    const double scale = scrollScale();
    v->setPageStep(std::max(1, int(double(fullyVisibleLines()) / scale)));
    v->setSingleStep(1);
    v->setValue(scrollValue());
    QScrollBar *h = horizontalScrollBar();
    h->setRange(0, std::max(0, totalWidth() - viewport()->width()));
    h->setPageStep(std::max(1, viewport()->width()));
    h->setSingleStep(cellWidth());
    m_syncingScroll = false;
}

void EditorCtrl::scrollContentsBy(int dx, int dy)
{
    Q_UNUSED(dx);
    Q_UNUSED(dy);
    viewport()->update();
}

void EditorCtrl::resizeEvent(QResizeEvent *event)
{
    QAbstractScrollArea::resizeEvent(event);
    setViewportHeight(viewport()->height());
    setTopLine(topLine());
    m_painter->invalidate();
    syncScrollBars();
    followCaretHorizontally(*this, false);
}

void EditorCtrl::paintEvent(QPaintEvent *event)
{
    Q_UNUSED(event);
    QPainter p(viewport());
    PaintInput in;
    in.metrics = this;
    in.storage = m_storage;
    in.palette = isEnabled() ? m_palette : m_palette.greyed();
    in.caret = m_caret;
    in.selection = selection();
    in.bookmarks = m_bookmarks;
    in.searchHits = m_searchHits;
    in.coloring = m_coloring;
    in.coloringOn = m_coloringOn;
    in.outline = m_outline;
    in.width = viewport()->width();
    in.height = viewport()->height();
    if (auto *file = qobject_cast<StorageFile *>(m_storage); file && file->mode() != StorageFile::FileMode)
        in.isFileSector = [file](uint64_t s) { return file->isFileSector(s); };
    p.translate(-horizontalScrollBar()->value(), 0);
    m_painter->paint(p, in);
}

bool EditorCtrl::event(QEvent *event)
{
    if (event->type() == QEvent::ToolTip) {
        auto *help = static_cast<QHelpEvent *>(event);
        const QPoint pos = viewport()->mapFrom(this, help->pos());
        const Hit hit = hitAt(pos);
        if (hit.valid && hit.pane != PaneOffset) {
            const uint64_t offset = hitOffset(hit);
            for (const BookmarkMark &b : m_bookmarks) {
                if (b.area.offset == offset) {
                    QToolTip::showText(
                        help->globalPos(),
                        QStringLiteral("<span><b>%1</b> [%2]</span>")
                            .arg(b.name.toHtmlEscaped(), b.enabled ? tr("Enabled") : tr("Disabled")),
                        this);
                    return true;
                }
            }
        }
        QToolTip::hideText();
        event->ignore();
        return true;
    }
    return QAbstractScrollArea::event(event);
}

// --- context menu and navigation points ---------------------------------------------------------------

QMenu *EditorCtrl::createContextMenu(QWidget *parent)
{
    auto *menu = new QMenu(parent);
    for (QAction *a : m_contextActions)
        menu->addAction(a);
    if (!m_contextActions.isEmpty())
        menu->addSeparator();
    QMenu *navigate = menu->addMenu(QIcon(QStringLiteral(":/tools/find")), tr("Navigate "));
    for (QAction *a : m_navigateActions)
        navigate->addAction(a);
    fillNavigateMenu(navigate);
    return menu;
}

void EditorCtrl::fillNavigateMenu(QMenu *menu)
{
    if (!m_storage)
        return;
    const QList<NavigationPoint> &points = m_storage->navigationPoints();
    if (points.isEmpty())
        return;
    if (!menu->isEmpty())
        menu->addSeparator();
    std::function<void(QMenu *, const QList<NavigationPoint> &)> add =
        [&](QMenu *into, const QList<NavigationPoint> &list) {
            for (const NavigationPoint &point : list) {
                if (!point.children.isEmpty()) {
                    add(into->addMenu(point.title), point.children);
                } else if (point.kind == NavigationPoint::Separator) {
                    into->addSeparator();
                } else {
                    QAction *a = into->addAction(point.title);
                    connect(a, &QAction::triggered, this, [this, point] { activateNavigationPoint(point); });
                }
            }
        };
    add(menu, points);
}

void EditorCtrl::activateNavigationPoint(const NavigationPoint &point)
{
    switch (point.kind) {
    case NavigationPoint::AskMftRecord:
        emit mftRecordRequested();
        return;
    case NavigationPoint::AskCatalogNode:
        emit catalogNodeRequested();
        return;
    case NavigationPoint::Jump:
        if (point.templateType != Templates::None) {
            emit templateOffsetChanged(point.offset, point.primary != 0);
            emit templateRequest(int(point.templateType));
        } else {
            setCaretOffset(point.offset);
        }
        return;
    default:
        return;
    }
}

void EditorCtrl::contextMenuEvent(QContextMenuEvent *event)
{
    std::unique_ptr<QMenu> menu(createContextMenu(this));
    menu->exec(event->globalPos());
}

} // namespace HexEditor
