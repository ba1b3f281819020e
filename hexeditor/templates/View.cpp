#include "hexeditor/templates/View.h"

#include <QAction>
#include <QApplication>
#include <QClipboard>
#include <QDomElement>
#include <QHeaderView>
#include <QMenu>
#include <QToolBar>
#include <QVBoxLayout>

#include <functional>

#include "ClientFramework/Settings/SettingsDocument.h"
#include "Kernel/Implementation/Common/cDevice.h"
#include "hexeditor/EditorCtrl.h"
#include "hexeditor/Storage.h"
#include "hexeditor/templates/Model.h"
#include "hexeditor/templates/OffsetEditCtrl.h"
#include "hexeditor/templates/TemplateTreeCtrl.h"
#include "hexeditor/templates/core/Catalog.h"
#include "hexeditor/templates/core/TreeText.h"

// The pane's own icons live in a static library: register them before first use.
static void initTemplateResources()
{
    Q_INIT_RESOURCE(templates);
}

namespace HexEditor::Templates {

namespace {

QString offsetTip(const QString &head)
{
    return QStringLiteral("<html>%1<span style=\"font-weight:bold\">sector:offset</span>)</html>").arg(head);
}

// The storage's partition style when it is a whole device (0 otherwise).
std::uint32_t partitionStyle(Storage *storage)
{
    if (!storage || storage->kind() != StorageKind::Device)
        return 0;
    auto *device = dynamic_cast<cDevice *>(storage->kernelObject());
    return device ? std::uint32_t(device->GetPartStyle()) : 0;
}

} // namespace

View::View(EditorCtrl *editor, Storage *storage, QWidget *parent) : QWidget(parent), m_editor(editor)
{
    initTemplateResources();
    setObjectName(ViewId);
    setWindowTitle(tr("Templates"));
    m_selector = new SelectorCtrl(this);
    m_tree = new TemplateTreeCtrl(this);
    buildToolBar();

    auto *layout = new QVBoxLayout(this);
    layout->setContentsMargins(0, 0, 0, 0);
    layout->setSpacing(2);
    layout->addWidget(m_selector);
    layout->addWidget(m_toolBar);
    layout->addWidget(m_tree, 1);

    connect(m_selector, &SelectorCtrl::templateSelected, this, &View::onTemplateSelected);
    connect(m_selector, &SelectorCtrl::templateModified, this, &View::templateModified);
    connect(m_tree, &TemplateTreeCtrl::nodeSelected, this, &View::onTemplateNodeSelected);
    connect(m_tree, &QTreeView::clicked, this, &View::onClickItem);
    connect(m_tree, &QTreeView::activated, this, &View::onActivateItem);
    connect(m_tree, &QWidget::customContextMenuRequested, this, &View::onContextMenu);
    connect(m_tree->header(), &QHeaderView::sectionResized, this, &View::onSaveColumnSizes);

    loadSettings();
    connectEditor();
    setStorage(storage);
}

View::~View()
{
    // The children go after this object stops being a View: no more calls into it.
    m_tree->header()->disconnect(this);
    m_tree->disconnect(this);
    m_selector->disconnect(this);
    if (m_tree->selectionModel())
        m_tree->selectionModel()->disconnect(this);
}

void View::buildToolBar()
{
    m_toolBar = new QToolBar(this);
    m_toolBar->setIconSize(QSize(16, 16));
    auto make = [this](Action id, const char *icon, const QString &text, const QString &tip) {
        auto *a = new QAction(QIcon(QLatin1String(icon)), text, this);
        a->setToolTip(tip);
        m_actions[id] = a;
        return a;
    };
    QAction *coloring = make(Coloring, ":/hexeditor/coloring", tr("Template coloring"),
                             tr("Toggle template fields coloring"));
    coloring->setCheckable(true);
    coloring->setChecked(true);
    make(CopyValue, ":/edit/copy", tr("Copy Value"), tr("Copy selected value to the clipboard"));
    make(CopyField, ":/edit/code/line", tr("Copy Field"),
         tr("Copy selected field (as it shown) to the clipboard"));
    make(CopyAll, ":/edit/code/all", tr("Copy All"), tr("Copy all data from view to the clipboard"));
    make(MoveUp, ":/navigate/up", tr("Move up"), tr("Move template offset up one record"));
    make(MoveDown, ":/navigate/down", tr("Move down"), tr("Move template offset down one record"));
    make(SetPrimary, ":/navigate/pin/green", tr("Set template position"),
         tr("Set primary template start position at current cursor position"));
    make(SetCopy, ":/navigate/pin/orange", tr("Set template position"),
         tr("Set copy template start position at current cursor position"));

    m_primaryEdit = new OffsetEditCtrl(this);
    m_primaryEdit->setToolTip(offsetTip(tr("Template Offset (")));
    m_copyEdit = new OffsetEditCtrl(this);
    m_copyEdit->setToolTip(offsetTip(tr("Template Copy Offset (")));

    for (Action a : {Coloring, CopyValue, CopyField, CopyAll, MoveUp, MoveDown})
        m_toolBar->addAction(m_actions[a]);
    m_toolBar->addWidget(m_primaryEdit);
    m_toolBar->addAction(m_actions[SetPrimary]);
    m_toolBar->addWidget(m_copyEdit);
    m_toolBar->addAction(m_actions[SetCopy]);

    connect(coloring, &QAction::toggled, this, [this](bool on) {
        storeSettings();
        emit coloringChanged(on);
        pushColoring();
    });
    connect(m_actions[CopyValue], &QAction::triggered, this, &View::onCopy);
    connect(m_actions[CopyField], &QAction::triggered, this, [this] {
        const Node *n = Model::nodeOf(m_tree->currentIndex());
        if (n)
            QApplication::clipboard()->setText(fieldText(n));
    });
    connect(m_actions[CopyAll], &QAction::triggered, this,
            [this] { QApplication::clipboard()->setText(fieldText(nullptr)); });
    connect(m_actions[MoveUp], &QAction::triggered, this, [this] {
        if (m_model && m_model->primaryOffset() >= m_model->recordSize())
            setOffset(m_model->primaryOffset() - m_model->recordSize(), true);
    });
    connect(m_actions[MoveDown], &QAction::triggered, this, [this] {
        if (m_model)
            setOffset(m_model->primaryOffset() + m_model->recordSize(), true);
    });
    connect(m_actions[SetPrimary], &QAction::triggered, this, [this] { setOffset(m_cursorOffset, true); });
    connect(m_actions[SetCopy], &QAction::triggered, this, [this] { setOffset(m_cursorOffset, false); });
    connect(m_primaryEdit, &OffsetEditCtrl::offsetEdited, this, [this](quint64 o) { setOffset(o, true); });
    connect(m_copyEdit, &OffsetEditCtrl::offsetEdited, this, [this](quint64 o) { setOffset(o, false); });
}

void View::connectEditor()
{
    if (!m_editor)
        return;
    // From the editor: its state, caret, data changes and template requests.
    connect(m_editor, &EditorCtrl::stateChanged, this, &View::onEditorStateChanged);
    connect(m_editor, &EditorCtrl::cursorMoved, this, &View::onEditorCursorMoved);
    // Queued: an edit made through the tree rebuilds after the delegate has finished with its index.
    connect(m_editor, &EditorCtrl::dataChanged, this, &View::onDataChanged, Qt::QueuedConnection);
    connect(m_editor, &EditorCtrl::templateOffsetChanged, this, &View::onTemplateOffsetChanged);
    connect(m_editor, &EditorCtrl::templateRequest, this, &View::onTemplateRequest);
    connect(m_editor, &EditorCtrl::templateFieldClicked, this,
            [this](int field, quint64) { selectField(field); });
    // To the editor: edits, jumps, colouring and the selected field's outline.
    connect(this, &View::templateModified, m_editor, &EditorCtrl::onTemplateModified);
    connect(this, &View::nodeActivated, m_editor, &EditorCtrl::onTemplateNodeActivated);
    connect(this, &View::coloringChanged, m_editor, &EditorCtrl::onColoringChanged);
    m_cursorOffset = m_editor->caret().offset();
    onEditorStateChanged(m_editor->hexOffset(), m_editor->isReadOnly(), false);
}

void View::setStorage(Storage *storage)
{
    m_storage = storage;
    m_model = nullptr;
    m_tree->setModel(nullptr);
    m_selector->setStorage(storage);
    const std::uint32_t bps = storage && storage->sectorSize() ? storage->sectorSize() : 512;
    m_primaryEdit->setSectorSize(bps);
    m_copyEdit->setSectorSize(bps);
    for (const SelectorCtrl::Template &t : m_selector->templates()) {
        t.model->setHexOffsets(m_hexOffsets);
        t.model->setLinkColor(m_editor ? m_editor->paintPalette().link : QColor(0, 0, 238));
        if (m_editor)
            t.model->setEditable(!m_editor->isReadOnly());
    }
    Placement p;
    if (storage && m_autoload)
        p = automaticChoice(storage->kind(), storage->fileSystemKind(), partitionStyle(storage),
                            storage->sectorSize());
    if (!m_selector->selectTemplate(p.type)) {
        m_selector->selectTemplate(None);
        p.offset = 0;
    }
    setOffset(p.offset, true);
    setOffset(m_model && m_model->hasCopyColumn() ? p.offset : 0, false);
}

bool View::coloringOn() const
{
    return m_actions[Coloring]->isChecked();
}

void View::setOffset(std::uint64_t offset, bool isPrimary)
{
    if (!m_offsetGuard.tryAcquire())
        return;
    for (const SelectorCtrl::Template &t : m_selector->templates())
        t.model->setTemplateOffset(offset, isPrimary);
    expandDefaultRows();
    (isPrimary ? m_primaryEdit : m_copyEdit)->setOffset(offset);
    if (m_editor && m_model)
        m_editor->setCurrentTemplate(int(m_model->type()), m_model->primaryOffset());
    emit templateOffsetChanged(offset, isPrimary);
    updateActions();
    pushColoring();
    m_offsetGuard.release();
}

void View::expandDefaultRows()
{
    if (!m_model)
        return;
    for (const auto &rc : m_model->expandRows())
        m_tree->expand(m_model->index(rc.first, rc.second));
}

void View::updateActions()
{
    const bool real = m_storage && m_model && m_model->isTemplate();
    const std::uint64_t size = m_storage ? m_storage->size() : 0;
    const std::uint64_t record = m_model ? m_model->recordSize() : 0;
    const std::uint64_t at = m_model ? m_model->primaryOffset() : 0;
    m_actions[MoveUp]->setEnabled(real && record && at >= record);
    m_actions[MoveDown]->setEnabled(real && record && size >= record && at <= size - record &&
                                    at + record <= size - record);
    const bool current = m_tree->currentIndex().isValid();
    m_actions[CopyValue]->setEnabled(current);
    m_actions[CopyField]->setEnabled(current);
    m_actions[CopyAll]->setEnabled(real && m_model->rootNode());
    const bool copy = real && m_model->hasCopyColumn();
    m_primaryEdit->setEnabled(real);
    m_actions[SetPrimary]->setEnabled(real);
    m_copyEdit->setEnabled(copy);
    m_actions[SetCopy]->setEnabled(copy);
}

void View::restoreColumns()
{
    if (!m_model)
        return;
    m_restoringColumns = true;
    const int columns = m_model->columnCount();
    const int first = columns == 4 ? 3 : 0;
    for (int c = 0; c < columns && c < 4; ++c)
        m_tree->setColumnWidth(c, m_columns.value(first + c, 80));
    m_restoringColumns = false;
}

void View::pushColoring()
{
    if (!m_editor)
        return;
    QList<EditorCtrl::TemplateArea> areas;
    if (m_model && m_model->isTemplate() && m_model->rootNode()) {
        int color = 0;
        // Every field with bytes of its own (leaves, not captions or bits), in each record read.
        std::function<void(const Node &, std::uint64_t)> walk = [&](const Node &n, std::uint64_t base) {
            if (n.children.empty()) {
                if (n.parent && n.format != Caption && n.format != Bit && n.size) {
                    EditorCtrl::TemplateArea a;
                    a.area = DiskArea{base + n.offset, n.size};
                    a.colorIndex = color++;
                    a.field = int(n.id);
                    a.link = n.isLink;
                    areas.append(a);
                }
                return;
            }
            for (const auto &c : n.children)
                walk(*c, base);
        };
        if (!m_model->record().buffer(false).isEmpty())
            walk(*m_model->rootNode(), m_model->primaryOffset());
        if (m_model->hasCopyColumn() && !m_model->record().buffer(true).isEmpty()) {
            color = 0;
            walk(*m_model->rootNode(), m_model->copyOffset());
        }
    }
    m_editor->setTemplateColoring(areas);
    m_editor->setTemplateColoringEnabled(coloringOn());
}

QString View::fieldText(const Node *node) const
{
    if (!m_model)
        return {};
    return treeText(m_model->record(), node, m_selector->current().name, m_model->hexOffsets());
}

void View::selectField(int id)
{
    if (!m_model || !m_model->rootNode())
        return;
    std::function<const Node *(const Node &)> find = [&](const Node &n) -> const Node * {
        if (int(n.id) == id)
            return &n;
        for (const auto &c : n.children)
            if (const Node *f = find(*c))
                return f;
        return nullptr;
    };
    const Node *n = find(*m_model->rootNode());
    if (!n || !n->parent)
        return;
    const QModelIndex i = m_model->indexOf(n, 0);
    m_tree->scrollTo(i);
    m_tree->setCurrentIndex(i);
}

void View::onEditorStateChanged(bool isHexOffset, bool isReadOnly, bool)
{
    m_hexOffsets = isHexOffset;
    for (const SelectorCtrl::Template &t : m_selector->templates()) {
        t.model->setHexOffsets(isHexOffset);
        t.model->setEditable(!isReadOnly);
    }
    m_primaryEdit->setHexOffsets(isHexOffset);
    m_copyEdit->setHexOffsets(isHexOffset);
}

void View::onEditorCursorMoved(const HexEditor::Metrics::Caret &caret)
{
    m_cursorOffset = caret.offset();
}

void View::onDataChanged(const HexEditor::DiskArea &area)
{
    // Every model, so a kind chosen later shows the bytes as they are now.
    for (const SelectorCtrl::Template &t : m_selector->templates())
        t.model->onDataChanged(area);
    expandDefaultRows();
    updateActions();
    pushColoring();
}

void View::onTemplateRequest(int type)
{
    m_selector->selectTemplate(type);
}

void View::onTemplateOffsetChanged(quint64 offset, bool isPrimary)
{
    setOffset(offset, isPrimary);
}

void View::onTemplateNodeSelected(HexEditor::Templates::Node *const node,
                                  HexEditor::Templates::Context context)
{
    updateActions();
    if (m_editor) {
        DiskArea area;
        if (node && m_model) {
            const std::uint64_t base =
                context == ContextCopy ? m_model->copyOffset() : m_model->primaryOffset();
            area = DiskArea{base + node->offset, node->size};
        }
        m_editor->setTemplateOutline(area);
    }
    emit nodeSelected(node, context);
}

void View::onTemplateSelected(const HexEditor::Templates::SelectorCtrl::Template &tmpl)
{
    m_model = tmpl.model;
    if (m_tree->model() != m_model) {
        QItemSelectionModel *old = m_tree->selectionModel();
        m_tree->setModel(m_model);
        delete old;
    }
    expandDefaultRows();
    restoreColumns();
    if (m_editor && m_model)
        m_editor->setCurrentTemplate(int(m_model->type()), m_model->primaryOffset());
    updateActions();
    emit templateSelected(m_model);
    emit coloringChanged(coloringOn());
    pushColoring();
}

void View::onSaveColumnSizes()
{
    if (m_restoringColumns || !m_model)
        return;
    const int columns = m_model->columnCount();
    const int first = columns == 4 ? 3 : 0;
    for (int c = 0; c < columns && c < 4; ++c)
        m_columns[first + c] = m_tree->columnWidth(c);
    storeSettings();
}

void View::onActivateItem(const QModelIndex &index)
{
    const Node *n = Model::nodeOf(index);
    if (!n || !m_model)
        return;
    const std::uint64_t base = index.column() == 3 ? m_model->copyOffset() : m_model->primaryOffset();
    emit nodeActivated(base + n->offset);
}

void View::onClickItem(const QModelIndex &index)
{
    updateActions();
    const Node *n = Model::nodeOf(index);
    if (!n || !n->isLink || !(m_tree->pressModifiers() & Qt::ControlModifier))
        return;
    if (index.column() != 2 && index.column() != 3)
        return;
    const bool primary = index.column() == 2;
    const std::uint64_t target = primary ? n->linkOffset : n->linkCopyOffset;
    const Type kind = n->linkTemplate;
    if (kind != None && m_selector->selectTemplate(kind)) {
        setOffset(target, primary);
        emit nodeActivated(target); // the caret goes along to the structure shown
        return;
    }
    emit nodeActivated(target);
}

void View::onCopy()
{
    const QModelIndex i = m_tree->currentIndex();
    if (!i.isValid() || !m_model)
        return;
    QApplication::clipboard()->setText(m_model->index(i.row(), 2, i.parent()).data().toString());
}

void View::onContextMenu(const QPoint &pos)
{
    QMenu menu(this);
    menu.addAction(m_actions[CopyValue]);
    menu.addAction(m_actions[CopyField]);
    menu.addAction(m_actions[CopyAll]);
    menu.exec(m_tree->viewport()->mapToGlobal(pos));
}

void View::loadSettings()
{
    QDomElement hex = Framework::SettingsDocument::instance().element(QStringLiteral("hex-editor"));
    load(hex);
}

void View::storeSettings()
{
    QDomElement hex = Framework::SettingsDocument::instance().element(QStringLiteral("hex-editor"));
    save(hex, false);
}

void View::save(QDomElement &element, bool flush)
{
    if (element.isNull())
        return;
    QDomElement t = Framework::SettingsDocument::child(element, QStringLiteral("templates"));
    QStringList widths;
    for (int w : m_columns)
        widths.append(QString::number(w));
    t.setAttribute(QStringLiteral("columns"), widths.join(QLatin1Char(' ')));
    t.setAttribute(QStringLiteral("colors"), coloringOn() ? QStringLiteral("true") : QStringLiteral("false"));
    t.setAttribute(QStringLiteral("autoload"), m_autoload ? QStringLiteral("true") : QStringLiteral("false"));
    if (flush)
        Framework::SettingsDocument::instance().save();
}

void View::load(const QDomElement &element)
{
    const QDomElement t = element.firstChildElement(QStringLiteral("templates"));
    if (t.isNull())
        return;
    const QStringList widths =
        t.attribute(QStringLiteral("columns")).split(QLatin1Char(' '), Qt::SkipEmptyParts);
    if (widths.size() == 7) {
        QList<int> parsed;
        for (const QString &w : widths) {
            bool ok = false;
            const int v = w.toInt(&ok);
            if (!ok || v < 10 || v > 4000)
                break;
            parsed.append(v);
        }
        if (parsed.size() == 7)
            m_columns = parsed;
    }
    auto flag = [&](const QString &name, bool fallback) {
        const QString v = t.attribute(name);
        return v.isEmpty() ? fallback : v == QLatin1String("true") || v == QLatin1String("1");
    };
    {
        const QSignalBlocker block(m_actions[Coloring]);
        m_actions[Coloring]->setChecked(flag(QStringLiteral("colors"), true));
    }
    m_autoload = flag(QStringLiteral("autoload"), true);
}

} // namespace HexEditor::Templates
